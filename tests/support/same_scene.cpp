#include "same_scene.h"

#include "b_normal.h"
#include "b_plugin_attribute.h"
#include "b_vec.h"
#include "scene_mesh.h"
#include "scene_schema.h"

#include <gtest/gtest.h>

#include <fmt/format.h>

#include <algorithm>
#include <vector>

namespace testing_support {
namespace {

using scene::mesh_schema;
using scene::meshColorSet_schema;
using scene::meshUVSet_schema;

// The mesh's sets of `name` that hold a value per vertex (no index channel of their own).
std::vector<const base::AttribMap*> vertexSets(const base::AttribMap& mesh, base::name_id name) {
  std::vector<const base::AttribMap*> found;
  const base::AttribArray* array = scene::findArrayMember(mesh, name);
  for (std::uint32_t k = 0; array && k < array->size(); ++k) {
    const base::AttribMap* set = scene::mapAt(*array, k);
    if (set && !set->findMember(meshUVSet_schema::indices())) found.push_back(set);
  }
  return found;
}

// The list `name` of `map`; empty when there is none.
template <class T>
const base::vector<T>& list(const base::AttribMap& map, base::name_id name) {
  static const base::vector<T> none;
  const base::vector<T>* found = map.findVecAttribute<T>(name);
  return found ? *found : none;
}

}  // namespace

std::string vertexListsOf(const base::AttribMap& mesh) {
  std::string text;
  for (const base::normal& n : list<base::normal>(mesh, mesh_schema::normals())) {
    text += fmt::format("n {} {} {}\n", n.x, n.y, n.z);
  }
  for (const base::AttribMap* set : vertexSets(mesh, mesh_schema::uvSets())) {
    text += "uv";
    for (const auto& uv : list<base::base_vec2<float>>(*set, meshUVSet_schema::UV())) {
      text += fmt::format(" {} {}", uv.x, uv.y);
    }
    text += "\n";
  }
  std::vector<std::string> colours;
  for (const base::AttribMap* set : vertexSets(mesh, mesh_schema::colorSets())) {
    std::string entries = "colours";
    for (const auto& c : list<base::base_vec3<float>>(*set, meshColorSet_schema::RGB())) {
      entries += fmt::format(" {} {} {} 1", c.x, c.y, c.z);
    }
    for (const auto& c : list<base::base_vec4<float>>(*set, meshColorSet_schema::RGBA())) {
      entries += fmt::format(" {} {} {} {}", c.x, c.y, c.z, c.w);
    }
    for (const float a : list<float>(*set, meshColorSet_schema::A())) entries += fmt::format(" {}", a);
    colours.push_back(entries);
  }
  std::sort(colours.begin(), colours.end());
  for (const std::string& entries : colours) text += entries + "\n";
  return text;
}

std::string materialsOf(const base::AttribMap& mesh) {
  using scene::principalMaterial_schema;
  const base::AttribArray* primitives = scene::findArrayMember(mesh, mesh_schema::primitives());
  const base::AttribMap* first = primitives ? scene::mapAt(*primitives, 0) : nullptr;
  std::string text;
  for (const auto& material : first ? list<base::ref<base::IPlugin>>(*first, scene::meshPrimitive_schema::materials())
                                    : base::vector<base::ref<base::IPlugin>>{}) {
    text += "material";
    for (const base::name_id name : {principalMaterial_schema::color(), principalMaterial_schema::roughness(),
                                     principalMaterial_schema::visibilityMap()}) {
      if (const base::Attribute* member = material ? material->findMember(name) : nullptr) {
        text += fmt::format(" {}={}", base::text(name), member->toString());
      }
    }
    // A reflection comes back through a grey specular colour whose mean gives it, to within
    // a float's step where no grey gives it exactly.
    if (const float* reflection =
            material ? material->findAttribute<float>(principalMaterial_schema::reflectionAmount()) : nullptr) {
      text += fmt::format(" reflectionAmount={:.5g}", *reflection);
    }
    text += "\n";
  }
  return text;
}

void expectSameScene(const base::AttribMap& before, const base::AttribMap& after, const std::string& what) {
  EXPECT_EQ(firstDifference(digestOf(before), digestOf(after)), "") << what;
  EXPECT_EQ(vertexListsOf(before), vertexListsOf(after)) << what;
  EXPECT_EQ(materialsOf(before), materialsOf(after)) << what;
}

}  // namespace testing_support
