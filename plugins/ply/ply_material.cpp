// Material elements: their values are collected while the body is read and become
// principalMaterial objects of the scene afterwards.

#include "b_exception.h"
#include "b_log.h"
#include "b_plugin_attribute.h"
#include "ply_loader.h"
#include "scene_mesh.h"
#include "scene_schema.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <bit>
#include <unordered_map>

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

std::uint32_t bitsOf(float value) { return std::bit_cast<std::uint32_t>(value); }

bool sameBits(const base::base_vec3<float>& a, const base::base_vec3<float>& b) {
  return bitsOf(a.x) == bitsOf(b.x) && bitsOf(a.y) == bitsOf(b.y) && bitsOf(a.z) == bitsOf(b.z);
}

struct MaterialHash {
  std::size_t operator()(const MaterialValues& values) const {
    std::uint64_t hash = values.present;
    const float words[] = {values.visibility.x, values.visibility.y, values.visibility.z, values.colour.x,
                           values.colour.y,     values.colour.z,     values.reflection,   values.roughness};
    for (const float word : words) hash = (hash ^ bitsOf(word)) * 0x100000001B3ull;
    return static_cast<std::size_t>(hash);
  }
};

using MaterialTable = std::unordered_map<MaterialValues, std::uint32_t, MaterialHash>;

}  // namespace

// Bit for bit, so that NaN entries read the same way share too.
bool MaterialValues::operator==(const MaterialValues& other) const {
  return present == other.present && sameBits(visibility, other.visibility) && sameBits(colour, other.colour) &&
         bitsOf(reflection) == bitsOf(other.reflection) && bitsOf(roughness) == bitsOf(other.roughness);
}

void PLYImporter::prepareMaterials(const Element& element) {
  const std::uint32_t count = initialCount(element);
  // The fewest bytes an instance takes in either encoding (a binary value's size, an ASCII
  // digit and its separator) bound what the element may cost.
  std::uint64_t smallest = 0;
  for (const Property& property : element.properties) {
    smallest += std::min<std::uint32_t>(dataTypeSize(property.isList ? property.countType : property.type), 2);
  }
  m_materialBytesPerEntry = std::max<std::uint64_t>(1, std::min(m_materialBytesPerEntry, smallest));
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
  // Entry j becomes distinct material which[j]; the values of each distinct one, in order.
  base::vector<std::uint32_t> which(n);
  base::vector<MaterialValues> distinct;
  const std::size_t limit = materialLimit(n);
  MaterialTable table;
  for (std::size_t j = 0; j < n; ++j) {
    const MaterialValues values = materialValues(j);
    const auto [at, added] = table.try_emplace(values, static_cast<std::uint32_t>(distinct.size()));
    if (added) {
      if (distinct.size() == limit) refuseMaterials(n, limit);
      distinct.push_back(values);
    }
    which[j] = at->second;
  }
  base::release(table);
  base::release(m_materialDiffuse);
  base::release(m_materialAmbient);
  base::release(m_materialSpecular);
  base::release(m_materialSpecularPower);
  base::release(m_materialOpacity);
  base::vector<base::ref<base::IPlugin>> made;
  for (const MaterialValues& values : distinct) made.push_back(createMaterial(factory, values));
  const base::AttribArray* primitives = scene::findArrayMember(*m_currentMesh, scene::mesh_schema::primitives());
  base::AttribMap* first = primitives ? scene::mapAt(*primitives, 0) : nullptr;
  if (!first) return;
  // A reference per entry, so that every index into the list means what it did; the list
  // moves into the attribute, as a copy would double the largest list of the import.
  base::vector<base::ref<base::IPlugin>> materials(n);
  for (std::size_t j = 0; j < n; ++j) materials[j] = made[which[j]];
  base::release(which);
  auto* list = new base::PluginVectorAttribute;
  list->assign(std::move(materials));
  first->attribute(scene::meshPrimitive_schema::materials(), list);
}

MaterialValues PLYImporter::materialValues(std::size_t j) const {
  MaterialValues values;
  if (j < m_materialOpacity.size()) {
    const base::base_vec3<float>& opacity = m_materialOpacity[j];
    if (!isOpaque(opacity.x) || !isOpaque(opacity.y) || !isOpaque(opacity.z)) {
      values.present |= MaterialValues::hasVisibility;
      values.visibility = opacity;
    }
  }
  if (j < m_materialDiffuse.size()) {
    values.present |= MaterialValues::hasColour;
    values.colour = m_materialDiffuse[j];
  }
  if (j < m_materialSpecular.size()) {
    const base::base_vec3<float>& specular = m_materialSpecular[j];
    values.present |= MaterialValues::hasReflection;
    values.reflection = (specular.y + specular.x + specular.z) * 0.33333f;
  }
  if (j < m_materialSpecularPower.size()) {
    const float power = m_materialSpecularPower[j];
    values.present |= MaterialValues::hasRoughness;
    values.roughness = power >= 0.0f ? std::min(power, 128.0f) * 0.0078125f : 0.0f;
  }
  return values;
}

base::ref<base::IPlugin> PLYImporter::createMaterial(base::PluginFactory& factory, const MaterialValues& values) {
  base::ref<base::IPlugin> material = createRequired(factory, principalMaterial_schema::typeName());
  if (values.present & MaterialValues::hasVisibility) {
    material->attribute(principalMaterial_schema::visibilityMap(), values.visibility);
  }
  if (values.present & MaterialValues::hasColour) material->attribute(principalMaterial_schema::color(), values.colour);
  if (values.present & MaterialValues::hasReflection) {
    material->attribute(principalMaterial_schema::reflectionAmount(), values.reflection);
  }
  if (values.present & MaterialValues::hasRoughness) {
    material->attribute(principalMaterial_schema::roughness(), values.roughness);
  }
  return material;
}

std::size_t PLYImporter::materialLimit(std::size_t entries) const {
  // A material object with its attributes takes up to 1 KiB; the import of a file may take
  // 16 times its size plus 16 MiB, of which the materials get 16 times their own bytes and
  // half the fixed part.
  constexpr std::uint64_t materialBytes = 1024;
  constexpr std::uint64_t fixedBytes = 8u << 20;
  const std::uint64_t bytes = std::uint64_t(entries) * std::min<std::uint64_t>(m_materialBytesPerEntry, 1u << 20);
  return static_cast<std::size_t>((16 * bytes + fixedBytes) / materialBytes);
}

void PLYImporter::refuseMaterials(std::size_t entries, std::size_t limit) const {
  base::raise<base::exception>(
      "ply::PLYImporter::importScene",
      fmt::format("element 'material': its {} instances hold more than {} distinct materials, more than an import of "
                  "its size may make (16 times its bytes plus 8 MiB, at 1 KiB a material)",
                  entries, limit));
}

}  // namespace ply
