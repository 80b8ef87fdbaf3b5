#include "scene_mesh.h"

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
  FaceCounts counts;
  counts.uniform = scalarMember<std::uint16_t>(primitive, meshPrimitive_schema::vcounts());
  counts.perFace = listMember<std::uint16_t>(primitive, meshPrimitive_schema::vcounts());
  return counts;
}

}  // namespace scene
