#pragma once

#include "b_attrib_array.h"
#include "b_attribute_map.h"
#include "b_type_traits.h"

#include <cstdint>
#include <optional>

namespace scene {

// Access to the nested records of a scene object: the mesh's `primitives`, `uvSets` and
// `colorSets` are arrays of attribute maps.

/// The array member `name` of `map`, created (replacing a member of another type) when it
/// is not an array.
base::AttribArray& arrayMember(base::AttribMap& map, base::name_id name);
/// The array member `name` of `map`, or null.
const base::AttribArray* findArrayMember(const base::AttribMap& map, base::name_id name);
/// Appends an empty map to `array` and returns it.
base::AttribMap& appendMap(base::AttribArray& array);
/// Element `index` of `array` as a map; null when there is none or it is no map.
base::AttribMap* mapAt(const base::AttribArray& array, std::uint32_t index);

/// A primitive's face vertex counts: one count for every face, or a count per face.
struct FaceCounts {
  std::optional<std::uint16_t> uniform;
  const base::vector<std::uint16_t>* perFace = nullptr;
  /// Whether the counts are the primitive's own member rather than reached through a link:
  /// only its own list may be changed in place.
  bool own = false;

  bool present() const { return uniform || perFace; }
};
/// The `vcounts` of a primitive in either form, links followed; none when absent or of
/// another type (logged as the map's typed lookups log it).
FaceCounts faceCountsOf(const base::AttribMap& primitive);

/// Member `name` of `map` through the map's typed lookup (links followed, a member of
/// another type logged); none when it is absent or of another type.
template <class T>
std::optional<T> valueOf(const base::AttribMap& map, base::name_id name) {
  const T* value = map.findAttribute<T>(name);
  return value ? std::optional<T>(*value) : std::nullopt;
}

// The stored-member reads below see only what `map` itself holds: for data that a caller
// changes in place, or lays out as it is stored. Readers use the typed lookups.

/// Member `name` of `map` as stored there (no links followed, no base map asked) when it is
/// a T; none when it is absent or of another type.
template <class T>
std::optional<T> scalarMember(const base::AttribMap& map, base::name_id name) {
  const base::Attribute* member = map.findMember(name);
  if (!member || member->type() != base::TypeTraits<T>::n_name) return std::nullopt;
  return *static_cast<const T*>(const_cast<base::Attribute*>(member)->data());
}

/// The list member `name` of `map` as stored there when it is a list of T, else null.
template <class T>
const base::vector<T>* listMember(const base::AttribMap& map, base::name_id name) {
  const base::Attribute* member = map.findMember(name);
  if (!member || member->type() != base::TypeTraits<T>::n_array_name) return nullptr;
  return static_cast<const base::vector<T>*>(const_cast<base::Attribute*>(member)->data());
}

}  // namespace scene
