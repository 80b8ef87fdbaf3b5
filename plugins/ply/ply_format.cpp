#include "ply_format.h"

#include "b_log.h"

#include <array>
#include <utility>

namespace ply {
namespace {

struct TypeWord {
  std::string_view word;
  DataType type;
};

constexpr std::array<TypeWord, 17> typeWords{{
    {"char", DataType::int8},
    {"int8", DataType::int8},
    {"uchar", DataType::uint8},
    {"uint8", DataType::uint8},
    {"short", DataType::int16},
    {"int16", DataType::int16},
    {"ushort", DataType::uint16},
    {"uint16", DataType::uint16},
    {"int32", DataType::int32},
    {"int", DataType::int32},
    {"uint32", DataType::uint32},
    {"uint", DataType::uint32},
    {"float", DataType::float32},
    {"float32", DataType::float32},
    {"double64", DataType::float64},
    {"double", DataType::float64},
    {"float64", DataType::float64},
}};

constexpr std::array<std::string_view, 5> elementNames{"vertex", "face", "tristrips", "edge", "material"};

using P = PropertySemantic;
struct PropertyName {
  std::string_view name;
  PropertySemantic semantic;
};

// Tested in this order; the first match wins.
constexpr std::array<PropertyName, 43> propertyNames{{
    {"red", P::red},
    {"green", P::green},
    {"blue", P::blue},
    {"alpha", P::alpha},
    {"vertex_index", P::vertexIndex},
    {"vertex_indices", P::vertexIndex},
    {"material_index", P::materialIndex},
    {"ambient_red", P::ambientRed},
    {"ambient_green", P::ambientGreen},
    {"ambient_blue", P::ambientBlue},
    {"ambient_alpha", P::ambientAlpha},
    {"ambient_coeff", P::ambientAlpha},
    {"diffuse_red", P::diffuseRed},
    {"diffuse_green", P::diffuseGreen},
    {"diffuse_blue", P::diffuseBlue},
    {"diffuse_alpha", P::diffuseAlpha},
    {"diffuse_coeff", P::diffuseAlpha},
    {"specular_red", P::specularRed},
    {"specular_green", P::specularGreen},
    {"specular_blue", P::specularBlue},
    {"specular_alpha", P::specularAlpha},
    {"specular_coeff", P::specularAlpha},
    {"opacity", P::opacity},
    {"specular_power", P::specularPower},
    {"r", P::red},
    {"g", P::green},
    {"b", P::blue},
    {"u", P::u},
    {"s", P::u},
    {"tx", P::u},
    {"v", P::v},
    {"t", P::v},
    {"ty", P::v},
    {"x", P::x},
    {"y", P::y},
    {"z", P::z},
    {"nx", P::nx},
    {"ny", P::ny},
    {"nz", P::nz},
    {"tz", P::tz},
    {"bx", P::bx},
    {"by", P::by},
    {"bz", P::bz},
}};

}  // namespace

std::uint32_t dataTypeSize(DataType type) {
  static constexpr std::uint32_t sizes[] = {1, 1, 2, 2, 4, 4, 4, 8, 0};
  return sizes[std::min(static_cast<std::uint32_t>(type), 8u)];
}

DataType dataTypeFromWord(std::string_view word) {
  for (const TypeWord& entry : typeWords) {
    if (entry.word == word) return entry.type;
  }
  base::log().message(base::logScene, base::logError, "Found unknown data type in PLY file: {}!", base::clipped(word));
  return DataType::none;
}

ElementSemantic elementSemanticFromName(std::string_view name) {
  for (std::size_t i = 0; i < elementNames.size(); ++i) {
    if (elementNames[i] == name) return static_cast<ElementSemantic>(i);
  }
  base::log().message(base::logScene, base::logWarning, "Found unknown element semantic in PLY file: {}!",
                      base::clipped(name));
  return ElementSemantic::unknown;
}

PropertySemantic propertySemanticFromName(std::string_view name) {
  for (const PropertyName& entry : propertyNames) {
    if (entry.name == name) return entry.semantic;
  }
  base::log().message(base::logScene, base::logWarning, "Found unknown property semantic in PLY file: {}!",
                      base::clipped(name));
  return PropertySemantic::unknown;
}

std::string_view dataTypeWord(DataType type) {
  static constexpr std::string_view words[] = {"char", "uchar", "short",  "ushort", "int",
                                               "uint", "float", "double", "none"};
  return words[std::min(static_cast<std::uint32_t>(type), 8u)];
}

std::string_view encodingWord(Encoding encoding) {
  switch (encoding) {
    case Encoding::ascii:
      return "ascii";
    case Encoding::binaryLittleEndian:
      return "binary_little_endian";
    case Encoding::binaryBigEndian:
      return "binary_big_endian";
  }
  return "unknown";
}

std::string_view displayName(const Element& element) {
  if (element.semantic == ElementSemantic::unknown) return element.name;
  return elementNames[static_cast<std::size_t>(element.semantic)];
}

std::string_view displayName(const Property& property) {
  if (property.semantic == PropertySemantic::unknown) return property.name;
  for (const PropertyName& entry : propertyNames) {
    if (entry.semantic == property.semantic) return entry.name;
  }
  return property.name;
}

}  // namespace ply
