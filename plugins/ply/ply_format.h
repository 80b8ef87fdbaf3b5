#pragma once

#include "b_containers.h"

#include <cstdint>
#include <string_view>

namespace ply {

/// Value types of the format. `none` stands for a word that names no type.
enum class DataType : std::uint32_t { int8 = 0, uint8, int16, uint16, int32, uint32, float32, float64, none };

/// What an element holds, from its name.
enum class ElementSemantic : std::uint32_t { vertex = 0, face, tristrips, edge, material, unknown };

/// What a property holds, from its name. 12, 13, 19 and 20 are reserved: no name gives them.
enum class PropertySemantic : std::uint32_t {
  x = 0,
  y,
  z,
  nx,
  ny,
  nz,
  u,
  v,
  red,
  green,
  blue,
  alpha,
  tz = 14,
  bx,
  by,
  bz,
  vertexIndex,
  materialIndex = 21,
  ambientRed,
  ambientGreen,
  ambientBlue,
  ambientAlpha,
  diffuseRed,
  diffuseGreen,
  diffuseBlue,
  diffuseAlpha,
  specularRed,
  specularGreen,
  specularBlue,
  specularAlpha,
  specularPower,
  opacity,
  unknown
};

/// How the body is stored.
enum class Encoding : std::uint32_t { ascii = 0, binaryLittleEndian, binaryBigEndian };

/// One property of an element: a value, or a list of values with a count before them.
struct Property {
  DataType type = DataType::none;  ///< the value's type, or each list item's
  PropertySemantic semantic = PropertySemantic::unknown;
  base::string name;  ///< kept only when the semantic is unknown
  base::string word;  ///< the name as the header spells it, whatever the semantic ("s", "tx"): every
                      ///< byte up to the next blank, tab or line end
  bool isList = false;
  DataType countType = DataType::none;  ///< the list count's type; only for lists
};

/// One element: `count` instances, each with one value or list per property, in order.
struct Element {
  base::vector<Property> properties;
  ElementSemantic semantic = ElementSemantic::unknown;
  base::string name;  ///< kept only when the semantic is unknown
  base::string word;  ///< the name as the header spells it, whatever the semantic
  std::uint32_t count = 0;
};

/// The header: the body's encoding and its elements in file order.
struct Header {
  Encoding encoding = Encoding::ascii;
  base::vector<Element> elements;
};

/// Bytes of one binary value of `type` (1, 1, 2, 2, 4, 4, 4, 8); 0 for `none`.
std::uint32_t dataTypeSize(DataType type);

/// The type that `word` names ("uchar" and "uint8" both give uint8); `none` for any other
/// word, logged once as an unknown data type.
DataType dataTypeFromWord(std::string_view word);
/// The semantic of an element name; unknown names are logged at level 3.
ElementSemantic elementSemanticFromName(std::string_view name);
/// The semantic of a property name, testing the names in their fixed order; unknown names
/// are logged at level 3.
PropertySemantic propertySemanticFromName(std::string_view name);

/// The usual type word of `type` ("char", "uchar", ..., "double"); "none" for none.
std::string_view dataTypeWord(DataType type);
/// The encoding's word on the format line.
std::string_view encodingWord(Encoding encoding);
/// A name to show for the element: its own, or the name its semantic stands for.
std::string_view displayName(const Element& element);
/// A name to show for the property: its own, or the first name its semantic stands for.
std::string_view displayName(const Property& property);

}  // namespace ply
