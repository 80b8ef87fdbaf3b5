// Material elements: their values are collected while the body is read and become
// principalMaterial objects of the scene afterwards.

#include "b_exception.h"
#include "b_plugin_attribute.h"
#include "ply_loader.h"
#include "scene_mesh.h"
#include "scene_schema.h"

#include <algorithm>

namespace ply {
namespace {

using scene::principalMaterial_schema;

// A list is sized by the red property of its group only; entries keep what an earlier
// material element put there, new ones read as zero.
template <class T>
void sizeFor(const Element& element, PropertySemantic semantic, base::vector<T>& list) {
  const bool present = std::any_of(element.properties.begin(), element.properties.end(),
                                   [semantic](const Property& p) { return p.semantic == semantic; });
  if (present) list.resize(element.count);
}

void setComponent(base::vector<base::base_vec3<float>>& list, std::uint32_t i, std::uint32_t component, float value) {
  if (i >= list.size()) return;
  (component == 0 ? list[i].x : component == 1 ? list[i].y : list[i].z) = value;
}

// A component that is not a number counts as opaque.
bool isOpaque(float component) { return component != component || component == 1.0f; }

}  // namespace

void PLYImporter::prepareMaterials(const Element& element) {
  sizeFor(element, PropertySemantic::diffuseRed, m_materialDiffuse);
  sizeFor(element, PropertySemantic::ambientRed, m_materialAmbient);
  sizeFor(element, PropertySemantic::specularRed, m_materialSpecular);
  sizeFor(element, PropertySemantic::specularPower, m_materialSpecularPower);
  sizeFor(element, PropertySemantic::opacity, m_materialOpacity);
  for (Route& route : m_routes) route.kind = Route::Kind::material;
}

void PLYImporter::storeMaterialValue(const Property& property, float value) {
  const std::uint32_t i = m_instanceIndex;
  const auto first = static_cast<std::uint32_t>(PropertySemantic::ambientRed);
  const auto semantic = static_cast<std::uint32_t>(property.semantic);
  base::vector<base::base_vec3<float>>* groups[] = {&m_materialAmbient, &m_materialDiffuse, &m_materialSpecular};
  if (semantic >= first && semantic < first + 12 && (semantic - first) % 4 != 3) {
    setComponent(*groups[(semantic - first) / 4], i, (semantic - first) % 4, value);
  } else if (property.semantic == PropertySemantic::specularPower && i < m_materialSpecularPower.size()) {
    m_materialSpecularPower[i] = value;
  } else if (property.semantic == PropertySemantic::opacity && i < m_materialOpacity.size()) {
    m_materialOpacity[i] = {value, value, value};
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
