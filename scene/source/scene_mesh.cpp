#include "scene_mesh.h"

#include "b_log.h"
#include "scene_schema.h"

namespace scene {

base::AttribArray& arrayMember(base::AttribMap& map, base::name_id name) {
  if (const base::AttribArray* found = findArrayMember(map, name)) return const_cast<base::AttribArray&>(*found);
  map.attribute(name, new base::AttribArray(map.factory()));
  return *(*map.findAttributeMutable(name))->asArray();
}

const base::AttribArray* findArrayMember(const base::AttribMap& map, base::name_id name) {
  const base::Attribute* member = map.findMember(name);
  return member ? const_cast<base::Attribute*>(member)->asArray() : nullptr;
}

base::AttribMap& appendMap(base::AttribArray& array) {
  auto* map = new base::AttribMap;
  array.append(map);
  return *map;
}

base::AttribMap* mapAt(const base::AttribArray& array, std::uint32_t index) {
  if (index >= array.elements().size() || !array.elements()[index]) return nullptr;
  return array.elements()[index]->asMap();
}

FaceCounts faceCountsOf(const base::AttribMap& primitive) {
  using Traits = base::TypeTraits<std::uint16_t>;
  const base::name_id name = meshPrimitive_schema::vcounts();
  FaceCounts counts;
  // Either form is right, so the member is resolved without a type and then taken as it is.
  const base::Attribute* found = primitive.findResolved(name);
  if (!found) return counts;
  if (found->type() == Traits::n_name) {
    counts.uniform = *static_cast<const std::uint16_t*>(found->data());
  } else if (found->type() == Traits::n_array_name) {
    counts.perFace = static_cast<const base::vector<std::uint16_t>*>(found->data());
  } else {
    base::log().message(base::logSystem, base::logError,
                        "map attribute| Detected invalid access to attribute '{}'. Expected type '{}' or '{}', actual "
                        "attribute type - '{}'!",
                        base::text(name), base::text(Traits::n_name), base::text(Traits::n_array_name),
                        base::text(found->type()));
    return counts;
  }
  counts.own = found == primitive.findMember(name);
  return counts;
}

}  // namespace scene
