// The material element of an export: the import's conversion (diffuse colour to `color`,
// the specular colour's mean to `reflectionAmount`, the specular power over 128 to
// `roughness`, opacity to `visibilityMap`) turned around where it can be. What cannot come
// back: ambient colours (the import keeps none), the specular colour's hue (a grey one is
// written whose mean gives the same reflectionAmount), a roughness outside 0 to 1 (the
// import clamps), and a visibilityMap whose three components differ (opacity is one value:
// the first component is written).

#include "b_vec.h"
#include "ply_mesh_layout.h"
#include "scene_mesh.h"
#include "scene_schema.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <optional>

namespace ply {
namespace {

using scene::principalMaterial_schema;

// The import's reflectionAmount of a grey specular colour s: (s + s + s) times 0.33333,
// in single precision, summed in the import's order.
float reflectionOf(float grey) { return (grey + grey + grey) * 0.33333f; }

// The grey specular value that the import turns into `amount`; the nearest one when no
// float gives it exactly.
float greyFor(float amount) {
  const float estimate = amount / (3.0f * 0.33333f);
  float best = estimate;
  float candidate = estimate;
  for (int step = 0; step < 8 && reflectionOf(best) != amount; ++step) {
    candidate = std::nextafter(candidate, reflectionOf(candidate) < amount ? INFINITY : -INFINITY);
    if (std::fabs(reflectionOf(candidate) - amount) < std::fabs(reflectionOf(best) - amount)) best = candidate;
  }
  return best;
}

template <class T>
std::optional<T> memberOf(const base::IPlugin& material, base::name_id name) {
  return scene::scalarMember<T>(material, name);
}

// A float column of the element: `count` values, written as uchar when every one is k/255.
void addColumn(WriteElement& element, const char* name, const std::vector<float>& values, std::uint32_t channels,
               KeptStorage& storage) {
  std::vector<std::byte>& bytes = storage.emplace_back().bytes;
  bytes.resize(values.size() * sizeof(float));
  if (!values.empty()) std::memcpy(bytes.data(), values.data(), bytes.size());
  const auto* floats = reinterpret_cast<const float*>(bytes.data());
  const bool uchar = fitsUchar(floats, values.size());
  for (std::uint32_t c = 0; c < channels; ++c) {
    WriteProperty property;
    property.name = channels == 1 ? std::string(name)
                                  : std::string(name) + "_" +
                                        std::string(c == 0   ? "red"
                                                    : c == 1 ? "green"
                                                             : "blue");
    property.type = uchar ? DataType::uint8 : DataType::float32;
    property.normalised = uchar;
    property.values = reinterpret_cast<const std::byte*>(floats + c);
    property.stride = channels * sizeof(float);
    element.properties.push_back(property);
  }
}

}  // namespace

WriteElement materialElement(const std::vector<const base::IPlugin*>& materials, KeptStorage& storage) {
  std::vector<float> diffuse, specular, power, opacity;
  bool hasColour = false, hasReflection = false, hasRoughness = false, hasVisibility = false;
  for (const base::IPlugin* material : materials) {
    const auto colour = memberOf<base::base_vec3<float>>(*material, principalMaterial_schema::color());
    const auto reflection = memberOf<float>(*material, principalMaterial_schema::reflectionAmount());
    const auto roughness = memberOf<float>(*material, principalMaterial_schema::roughness());
    const auto visibility = memberOf<base::base_vec3<float>>(*material, principalMaterial_schema::visibilityMap());
    hasColour |= colour.has_value();
    hasReflection |= reflection.has_value();
    hasRoughness |= roughness.has_value();
    hasVisibility |= visibility.has_value();
    // What a material lacks is written as what reads back as the lack, where one does:
    // white, no reflection, opaque.
    const base::base_vec3<float> c = colour.value_or(base::base_vec3<float>{1.0f, 1.0f, 1.0f});
    diffuse.insert(diffuse.end(), {c.x, c.y, c.z});
    const float grey = greyFor(reflection.value_or(0.0f));
    specular.insert(specular.end(), {grey, grey, grey});
    power.push_back(std::clamp(roughness.value_or(0.0f), 0.0f, 1.0f) * 128.0f);
    opacity.push_back(visibility ? visibility->x : 1.0f);
  }
  WriteElement element{"material", materials.size(), {}};
  // The import makes materials only from diffuse, ambient or specular colours: one of them
  // is always written, so that no material is lost. Ambient colours reach no material, so
  // materials without colour and reflection come back without them.
  if (hasColour) addColumn(element, "diffuse", diffuse, 3, storage);
  if (hasReflection) addColumn(element, "specular", specular, 3, storage);
  if (!hasColour && !hasReflection) {
    addColumn(element, "ambient", std::vector<float>(diffuse.size(), 0.0f), 3, storage);
  }
  if (hasRoughness) addColumn(element, "specular_power", power, 1, storage);
  if (hasVisibility) addColumn(element, "opacity", opacity, 1, storage);
  return element;
}

}  // namespace ply
