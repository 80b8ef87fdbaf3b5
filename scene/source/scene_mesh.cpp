#include "scene_mesh.h"

#include "b_type_traits.h"

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
  static const base::name_id vcounts = base::intern("vcounts");
  FaceCounts counts;
  const base::Attribute* member = primitive.findMember(vcounts);
  if (!member) return counts;
  auto* value = const_cast<base::Attribute*>(member);
  if (member->type() == base::TypeTraits<std::uint16_t>::n_name) {
    counts.uniform = *static_cast<const std::uint16_t*>(value->data());
  } else if (member->type() == base::TypeTraits<std::uint16_t>::n_array_name) {
    counts.perFace = static_cast<const base::vector<std::uint16_t>*>(value->data());
  }
  return counts;
}

std::optional<std::uint32_t> uint32Member(const base::AttribMap& map, base::name_id name) {
  const base::Attribute* member = map.findMember(name);
  if (!member || member->type() != base::TypeTraits<std::uint32_t>::n_name) return std::nullopt;
  return *static_cast<const std::uint32_t*>(const_cast<base::Attribute*>(member)->data());
}

}  // namespace scene
