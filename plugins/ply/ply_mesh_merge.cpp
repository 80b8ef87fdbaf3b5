// Several meshes as one, for an export to a single file: their vertex lists end to end, their
// primitives one after the other with the indices moved past the vertices before them. Only
// meshes of one vertex layout merge (the same lists and sets, per vertex); per-face data
// would have to follow faces that each mesh ordered on its own, so such meshes do not merge.

#include "b_attrib_array.h"
#include "b_exception.h"
#include "b_log.h"
#include "b_normal.h"
#include "b_vec.h"
#include "ply_columns.h"
#include "ply_kept_properties.h"
#include "ply_mesh_layout.h"
#include "scene_index_delta.h"
#include "scene_mesh.h"
#include "scene_schema.h"

#include <fmt/format.h>

namespace ply {
namespace {

using scene::mesh_schema;
using scene::meshColorSet_schema;
using scene::meshPrimitive_schema;
using scene::meshUVSet_schema;

[[noreturn]] void refuse(const std::string& why) {
  base::raise<base::exception>("ply::mergedMesh", fmt::format("the meshes cannot go into one file: {}", why));
}

// The list `name` of every map end to end into `target`; a map without it refuses the merge.
template <class T>
void concatenate(base::AttribMap& target, base::name_id name, const std::vector<const base::AttribMap*>& maps) {
  base::vector<T> joined;
  for (const base::AttribMap* map : maps) {
    const base::vector<T>* list = map->findVecAttribute<T>(name);
    if (!list) refuse(fmt::format("'{}' is not in every one", base::text(name)));
    joined.insert(joined.end(), list->begin(), list->end());
  }
  target.attribute<base::vector<T>>(name, joined);
}

// A list member of the same name and type in every map, joined; absent from all, left out.
template <class T>
void concatenateWhereAll(base::AttribMap& target, base::name_id name, const std::vector<const base::AttribMap*>& maps) {
  if (maps.front()->findVecAttribute<T>(name)) concatenate<T>(target, name, maps);
}

// The k-th set of every mesh, as a list of maps; every mesh must have as many sets.
std::vector<std::vector<const base::AttribMap*>> setsByIndex(const std::vector<const base::AttribMap*>& meshes,
                                                             base::name_id name) {
  std::vector<std::vector<const base::AttribMap*>> sets;
  for (const base::AttribMap* mesh : meshes) {
    const base::AttribArray* array = scene::findArrayMember(*mesh, name);
    const std::uint32_t count = array ? array->size() : 0;
    if (mesh != meshes.front() && count != sets.size()) refuse(fmt::format("they have different {}", base::text(name)));
    sets.resize(count);
    for (std::uint32_t k = 0; k < count; ++k) {
      const base::AttribMap* set = scene::mapAt(*array, k);
      if (!set || set->findMember(meshUVSet_schema::indices()))
        refuse("a mesh has per-face texture coordinates or colours");
      sets[k].push_back(set);
    }
  }
  return sets;
}

void mergeSets(base::AttribMap& merged, const std::vector<const base::AttribMap*>& meshes) {
  for (const auto& sets : setsByIndex(meshes, mesh_schema::uvSets())) {
    concatenate<base::base_vec2<float>>(scene::appendMap(scene::arrayMember(merged, mesh_schema::uvSets())),
                                        meshUVSet_schema::UV(), sets);
  }
  for (const auto& sets : setsByIndex(meshes, mesh_schema::colorSets())) {
    base::AttribMap& set = scene::appendMap(scene::arrayMember(merged, mesh_schema::colorSets()));
    concatenateWhereAll<base::base_vec3<float>>(set, meshColorSet_schema::RGB(), sets);
    concatenateWhereAll<base::base_vec4<float>>(set, meshColorSet_schema::RGBA(), sets);
    concatenateWhereAll<float>(set, meshColorSet_schema::A(), sets);
  }
}

// The kept per-vertex lists; a kept per-face list refuses the merge.
void mergeKept(base::AttribMap& merged, const std::vector<const base::AttribMap*>& meshes) {
  for (const KeptProperty& property : keptPropertiesOf(*meshes.front())) {
    if (property.primitive != KeptProperty::vertexElement) {
      refuse(fmt::format("a mesh has kept per-face properties ({})", base::clipped(property.name)));
    }
    addKeptProperty(merged, property);
  }
  for (const auto& [name, member] : meshes.front()->members()) {
    if (!base::text(name).starts_with("ply:")) continue;
    const auto* positions = meshes.front()->findVecAttribute<base::base_vec3<float>>(mesh_schema::positions());
    if (!positions || member->size() != positions->size()) {
      refuse(fmt::format("{} is no per-vertex list", base::text(name)));
    }
    const base::name_id list = name;  // a lambda may not name a structured binding in every compiler
    detail::forType<Conversion::native>(keptListType(member->type()), [&]<DataType T, Conversion>() {
      concatenate<detail::NativeType<T>>(merged, list, meshes);
      return true;
    });
  }
}

// Every mesh's primitives, with its decoded indices moved past the vertices before it.
void mergePrimitives(base::AttribMap& merged, const std::vector<const base::AttribMap*>& meshes) {
  base::vector<std::uint32_t> indices;
  base::AttribArray& primitives = scene::arrayMember(merged, mesh_schema::primitives());
  std::uint32_t vertexBase = 0;
  for (const base::AttribMap* mesh : meshes) {
    const std::uint32_t indexBase = static_cast<std::uint32_t>(indices.size());
    for (const std::uint32_t index : scene::decodedIndices(*mesh)) indices.push_back(index + vertexBase);
    const base::AttribArray* own = scene::findArrayMember(*mesh, mesh_schema::primitives());
    for (std::uint32_t k = 0; own && k < own->size(); ++k) {
      const base::AttribMap* primitive = scene::mapAt(*own, k);
      if (!primitive) continue;
      auto* copy = static_cast<base::AttribMap*>(primitive->clone());
      const std::uint32_t start =
          scene::valueOf<std::uint32_t>(*primitive, meshPrimitive_schema::indexStart()).value_or(0);
      copy->attribute<std::uint32_t>(meshPrimitive_schema::indexStart(), start + indexBase);
      primitives.append(copy);
    }
    const auto* positions = mesh->findVecAttribute<base::base_vec3<float>>(mesh_schema::positions());
    vertexBase += positions ? static_cast<std::uint32_t>(positions->size()) : 0;
  }
  merged.attribute<base::vector<std::uint32_t>>(mesh_schema::indices(), indices);
}

}  // namespace

std::unique_ptr<base::AttribMap> mergedMesh(const std::vector<const base::AttribMap*>& meshes) {
  auto merged = std::make_unique<base::AttribMap>();
  concatenate<base::base_vec3<float>>(*merged, mesh_schema::positions(), meshes);
  concatenateWhereAll<base::normal>(*merged, mesh_schema::normals(), meshes);
  mergeSets(*merged, meshes);
  mergeKept(*merged, meshes);
  mergePrimitives(*merged, meshes);
  return merged;
}

}  // namespace ply
