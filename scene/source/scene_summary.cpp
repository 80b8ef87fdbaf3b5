#include "scene_summary.h"

#include "b_box.h"
#include "b_normal.h"
#include "b_utf8.h"
#include "b_vec.h"
#include "scene_mesh.h"
#include "scene_schema.h"
#include "scene_validation.h"

#include <fmt/format.h>
#include <fmt/ranges.h>

#include <algorithm>
#include <string>
#include <vector>

namespace scene {
namespace {

std::string plural(std::size_t count, const char* one, const char* many) {
  return fmt::format("{} {}", count, count == 1 ? one : many);
}

std::size_t arraySize(const base::AttribMap& map, base::name_id name) {
  const base::AttribArray* array = findArrayMember(map, name);
  return array ? array->size() : 0;
}

std::string meshDetails(const base::AttribMap& mesh) {
  const auto* positions = mesh.findVecAttribute<base::base_vec3<float>>(mesh_schema::positions());
  std::string text =
      fmt::format("{}, {}, {}, {}, {}, {}", plural(positions ? positions->size() : 0, "vertex", "vertices"),
                  plural(getFaceCount(mesh), "face", "faces"), plural(getTriangleCount(mesh), "triangle", "triangles"),
                  plural(arraySize(mesh, mesh_schema::primitives()), "primitive", "primitives"),
                  plural(arraySize(mesh, mesh_schema::colorSets()), "colour set", "colour sets"),
                  plural(arraySize(mesh, mesh_schema::uvSets()), "UV set", "UV sets"));
  if (mesh.findVecAttribute<base::normal>(mesh_schema::normals())) text += ", normals";
  if (const auto* bounds = mesh.findAttribute<base::base_box<base::base_vec3<double>>>(mesh_schema::bounds())) {
    text += fmt::format(", bounds ({}, {}, {}) to ({}, {}, {})", bounds->min.x, bounds->min.y, bounds->min.z,
                        bounds->max.x, bounds->max.y, bounds->max.z);
  }
  return text;
}

// The properties the importer kept beside the mesh's own data ("ply:NAME" lists), with
// their types; empty when there are none.
std::string keptProperties(const base::AttribMap& mesh) {
  std::vector<std::string> kept;
  for (const auto& [name, attribute] : mesh.members()) {
    if (base::text(name).starts_with("ply:")) {
      kept.push_back(fmt::format("{} ({})", base::utf8Text(base::text(name)), base::text(attribute->type())));
    }
  }
  std::sort(kept.begin(), kept.end());
  return kept.empty() ? std::string() : fmt::format("  kept properties: {}\n", fmt::join(kept, ", "));
}

}  // namespace

std::string sceneSummary(const base::PluginFactory& factory) {
  std::string summary;
  for (const base::ref<base::IPlugin>& object : factory.objects()) {
    if (!object) continue;
    const base::string name = object->toString();
    const std::string label = fmt::format("object {}: {}{}", object->index(), base::text(object->mapType()),
                                          name.empty() ? std::string() : fmt::format(" '{}'", name));
    if (object->mapType() == mesh_schema::typeName()) {
      summary += fmt::format("{}: {}\n{}", label, meshDetails(*object), keptProperties(*object));
    } else {
      summary += fmt::format("{} ({})\n", label, plural(object->size(), "attribute", "attributes"));
    }
  }
  return summary;
}

}  // namespace scene
