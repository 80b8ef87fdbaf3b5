// Material elements: their values are collected while the body is read and become
// principalMaterial objects of the scene afterwards.

#include "b_exception.h"
#include "b_plugin_attribute.h"
#include "ply_loader.h"
#include "scene_mesh.h"
#include "scene_schema.h"

#include <algorithm>
#include <array>

namespace ply {
namespace {

using scene::principalMaterial_schema;

// A list is sized by the red property of its group only (to `count`: 0 when it grows with
// the data); entries keep what an earlier material element put there, new ones read as zero.
// `present` says which lists take values from this element.
template <class T>
void sizeFor(const Element& element, PropertySemantic semantic, std::uint32_t count, base::vector<T>& list,
             std::array<bool, 5>& present, std::size_t slot) {
  present[slot] = std::any_of(element.properties.begin(), element.properties.end(),
                              [semantic](const Property& p) { return p.semantic == semantic; });
  if (present[slot]) list.resize(count);
}

// Entry i of a list: a list that the element sizes grows to it (when it grows with the
// data); another one has it only when an earlier element made it. Null otherwise.
template <class T>
T* entry(base::vector<T>& list, bool present, std::uint32_t i) {
  if (i >= list.size()) {
    if (!present) return nullptr;
    list.resize(std::size_t(i) + 1);
  }
  return &list[i];
}

// A component that is not a number counts as opaque.
bool isOpaque(float component) { return component != component || component == 1.0f; }

}  // namespace

void PLYImporter::prepareMaterials(const Element& element) {
  const std::uint32_t count = initialCount(element);
  sizeFor(element, PropertySemantic::ambientRed, count, m_materialAmbient, m_materialPresent, 0);
  sizeFor(element, PropertySemantic::diffuseRed, count, m_materialDiffuse, m_materialPresent, 1);
  sizeFor(element, PropertySemantic::specularRed, count, m_materialSpecular, m_materialPresent, 2);
  sizeFor(element, PropertySemantic::specularPower, count, m_materialSpecularPower, m_materialPresent, 3);
  sizeFor(element, PropertySemantic::opacity, count, m_materialOpacity, m_materialPresent, 4);
  for (Route& route : m_routes) route.kind = Route::Kind::material;
}

void PLYImporter::storeMaterialValue(const Property& property, float value) {
  const std::uint32_t i = m_instanceIndex;
  const auto first = static_cast<std::uint32_t>(PropertySemantic::ambientRed);
  const auto semantic = static_cast<std::uint32_t>(property.semantic);
  base::vector<base::base_vec3<float>>* groups[] = {&m_materialAmbient, &m_materialDiffuse, &m_materialSpecular};
  if (semantic >= first && semantic < first + 12 && (semantic - first) % 4 != 3) {
    const std::uint32_t group = (semantic - first) / 4;
    if (base::base_vec3<float>* colour = entry(*groups[group], m_materialPresent[group], i)) {
      const std::uint32_t component = (semantic - first) % 4;
      (component == 0 ? colour->x : component == 1 ? colour->y : colour->z) = value;
    }
  } else if (property.semantic == PropertySemantic::specularPower) {
    if (float* power = entry(m_materialSpecularPower, m_materialPresent[3], i)) *power = value;
  } else if (property.semantic == PropertySemantic::opacity) {
    if (auto* opacity = entry(m_materialOpacity, m_materialPresent[4], i)) *opacity = {value, value, value};
  }
}

void PLYImporter::createMaterials(base::PluginFactory& factory) {
  const std::size_t n = std::max({m_materialDiffuse.size(), m_materialAmbient.size(), m_materialSpecular.size()});
  if (n == 0) return;
  base::vector<base::ref<base::IPlugin>> materials;
  for (std::size_t j = 0; j < n; ++j) {
    base::ref<base::IPlugin> material = createRequired(factory, principalMaterial_schema::typeName());
    if (j < m_materialOpacity.size()) {
      const base::base_vec3<float>& opacity = m_materialOpacity[j];
      if (!isOpaque(opacity.x) || !isOpaque(opacity.y) || !isOpaque(opacity.z)) {
        material->attribute(principalMaterial_schema::visibilityMap(), opacity);
      }
    }
    if (j < m_materialDiffuse.size()) material->attribute(principalMaterial_schema::color(), m_materialDiffuse[j]);
    if (j < m_materialSpecular.size()) {
      const base::base_vec3<float>& specular = m_materialSpecular[j];
      material->attribute(principalMaterial_schema::reflectionAmount(),
                          (specular.y + specular.x + specular.z) * 0.33333f);
    }
    if (j < m_materialSpecularPower.size()) {
      const float power = m_materialSpecularPower[j];
      material->attribute(principalMaterial_schema::roughness(),
                          power >= 0.0f ? std::min(power, 128.0f) * 0.0078125f : 0.0f);
    }
    materials.push_back(material);
  }
  const base::AttribArray* primitives = scene::findArrayMember(*m_currentMesh, scene::mesh_schema::primitives());
  if (base::AttribMap* first = primitives ? scene::mapAt(*primitives, 0) : nullptr) {
    first->attribute(scene::meshPrimitive_schema::materials(), materials);
  }
}

}  // namespace ply
