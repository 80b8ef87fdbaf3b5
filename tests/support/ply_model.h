#pragma once

// A PLY file as the tests make it: its elements, properties and every value, written in any
// of the three encodings. Values are held exactly (every value of the eight types fits a
// double), so that a reader gives them back bit for bit.

#include "ply_format.h"

#include <string>
#include <vector>

namespace testing_support {

struct ModelProperty {
  std::string name;  ///< as written: any bytes but blanks, tabs and line ends
  ply::DataType type = ply::DataType::float32;
  bool isList = false;
  ply::DataType countType = ply::DataType::uint8;
};

struct ModelElement {
  std::string name;
  std::vector<ModelProperty> properties;
  /// values[i][p]: instance i's value of property p (one), or its list's items.
  std::vector<std::vector<std::vector<double>>> values;
};

struct PlyModel {
  std::vector<ModelElement> elements;
};

/// The file: the header, then the body in `encoding`. An ASCII body has one line per
/// instance (none for an element without properties); floats and doubles are written in the
/// shortest form that reads back to the same value.
std::string writeModel(const PlyModel& model, ply::Encoding encoding);

/// Where the body starts in a file that writeModel made.
std::size_t bodyOffset(const std::string& file);

/// The smallest and the largest value of `type` (for the real types, the largest finite one).
double lowestOf(ply::DataType type);
double highestOf(ply::DataType type);

}  // namespace testing_support
