#pragma once

#include "ply_parser.h"
#include "test_streams.h"

#include <fmt/format.h>
#include <gtest/gtest.h>

#include <functional>
#include <string>
#include <vector>

namespace testing_support {

/// A body receiver that writes down what it is given: one entry per element ("vertex:"),
/// and one line per delivered instance with its values ("1 2.5 {0 1 2}").
struct PlyRecorder {
  std::vector<std::string> elements;
  std::vector<std::string> instances;
  std::function<bool(const ply::Element&)> accept = [](const ply::Element&) { return true; };

  bool plyElement(const ply::Element& element) {
    expectedIndex = 0;
    elements.push_back(std::string(ply::displayName(element)));
    return accept(element);
  }
  void beginInstance(std::uint32_t index) {
    EXPECT_EQ(index, expectedIndex) << "instances are numbered from 0 within their element";
    ++expectedIndex;
    instances.emplace_back();
  }
  void plyProperty(const ply::Element&, const ply::Property& property, const ply::ValueArray& values) {
    std::string& line = instances.back();
    if (!line.empty()) line += ' ';
    if (!property.isList) {
      line += text(values[0], property.type);
      return;
    }
    line += '{';
    for (std::size_t i = 0; i < values.size(); ++i) {
      if (i) line += ' ';
      line += text(values[i], property.type);
    }
    line += '}';
  }

  static std::string text(const ply::Value& value, ply::DataType type) {
    switch (type) {
      case ply::DataType::int8:
      case ply::DataType::int16:
      case ply::DataType::int32:
        return fmt::format("{}", value.i);
      case ply::DataType::float32:
        return fmt::format("{}", value.f);
      case ply::DataType::float64:
        return fmt::format("{}", value.d);
      case ply::DataType::uint8:
      case ply::DataType::uint16:
      case ply::DataType::uint32:
        return fmt::format("{}", value.u);
      case ply::DataType::none:
        break;
    }
    return "none";
  }

  std::uint32_t expectedIndex = 0;
};

/// Reads `text` as a PLY file from the kind of stream `source` names.
inline ply::ReadResult readPly(const std::string& text, PlyRecorder& recorder, ply::Header& header,
                               Source source = Source::memory) {
  base::Stream stream = sourceStream(text, source);
  return ply::readFile(header, stream, recorder);
}

}  // namespace testing_support
