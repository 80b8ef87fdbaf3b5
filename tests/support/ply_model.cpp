#include "ply_model.h"

#include <fmt/format.h>

#include <algorithm>
#include <bit>
#include <cstdint>
#include <cstring>
#include <limits>
#include <stdexcept>

namespace testing_support {
namespace {

template <class T>
void putBinary(std::string& out, double value, bool bigEndian) {
  const T held = static_cast<T>(value);
  char bytes[sizeof(T)];
  std::memcpy(bytes, &held, sizeof(T));
  if (bigEndian != (std::endian::native == std::endian::big)) std::reverse(bytes, bytes + sizeof(T));
  out.append(bytes, sizeof(T));
}

void putValue(std::string& out, double value, ply::DataType type, ply::Encoding encoding) {
  const bool big = encoding == ply::Encoding::binaryBigEndian;
  if (encoding == ply::Encoding::ascii) {
    if (type == ply::DataType::float32) {
      fmt::format_to(std::back_inserter(out), "{}", static_cast<float>(value));
    } else if (type == ply::DataType::float64) {
      fmt::format_to(std::back_inserter(out), "{}", value);
    } else {
      fmt::format_to(std::back_inserter(out), "{}", static_cast<std::int64_t>(value));
    }
    return;
  }
  switch (type) {
    case ply::DataType::int8:
      return putBinary<std::int8_t>(out, value, big);
    case ply::DataType::uint8:
      return putBinary<std::uint8_t>(out, value, big);
    case ply::DataType::int16:
      return putBinary<std::int16_t>(out, value, big);
    case ply::DataType::uint16:
      return putBinary<std::uint16_t>(out, value, big);
    case ply::DataType::int32:
      return putBinary<std::int32_t>(out, value, big);
    case ply::DataType::uint32:
      return putBinary<std::uint32_t>(out, value, big);
    case ply::DataType::float32:
      return putBinary<float>(out, value, big);
    case ply::DataType::float64:
      return putBinary<double>(out, value, big);
    case ply::DataType::none:
      break;
  }
  throw std::invalid_argument("a model value of no type");
}

std::string headerOf(const PlyModel& model, ply::Encoding encoding) {
  std::string text =
      fmt::format("ply\nformat {} 1.0\ncomment made by the random file generator\n", ply::encodingWord(encoding));
  for (const ModelElement& element : model.elements) {
    text += fmt::format("element {} {}\n", element.name, element.values.size());
    for (const ModelProperty& property : element.properties) {
      if (property.isList) {
        text += fmt::format("property list {} {} {}\n", ply::dataTypeWord(property.countType),
                            ply::dataTypeWord(property.type), property.name);
      } else {
        text += fmt::format("property {} {}\n", ply::dataTypeWord(property.type), property.name);
      }
    }
  }
  return text + "end_header\n";
}

}  // namespace

std::string writeModel(const PlyModel& model, ply::Encoding encoding) {
  std::string out = headerOf(model, encoding);
  const bool ascii = encoding == ply::Encoding::ascii;
  for (const ModelElement& element : model.elements) {
    if (element.properties.empty()) continue;
    for (const auto& instance : element.values) {
      for (std::size_t p = 0; p < element.properties.size(); ++p) {
        const ModelProperty& property = element.properties[p];
        if (ascii && p > 0) out += ' ';
        if (property.isList) {
          putValue(out, static_cast<double>(instance[p].size()), property.countType, encoding);
          for (const double item : instance[p]) {
            if (ascii) out += ' ';
            putValue(out, item, property.type, encoding);
          }
        } else {
          putValue(out, instance[p].at(0), property.type, encoding);
        }
      }
      if (ascii) out += '\n';
    }
  }
  return out;
}

// The line that is exactly "end_header": a name may end in those words, never begin a line.
std::size_t bodyOffset(const std::string& file) { return file.find("\nend_header\n") + 12; }

double lowestOf(ply::DataType type) {
  switch (type) {
    case ply::DataType::int8:
      return -128;
    case ply::DataType::int16:
      return -32768;
    case ply::DataType::int32:
      return -2147483648.0;
    case ply::DataType::float32:
      return -std::numeric_limits<float>::max();
    case ply::DataType::float64:
      return -std::numeric_limits<double>::max();
    default:
      return 0;
  }
}

double highestOf(ply::DataType type) {
  switch (type) {
    case ply::DataType::int8:
      return 127;
    case ply::DataType::uint8:
      return 255;
    case ply::DataType::int16:
      return 32767;
    case ply::DataType::uint16:
      return 65535;
    case ply::DataType::int32:
      return 2147483647.0;
    case ply::DataType::uint32:
      return 4294967295.0;
    case ply::DataType::float32:
      return std::numeric_limits<float>::max();
    case ply::DataType::float64:
      return std::numeric_limits<double>::max();
    case ply::DataType::none:
      break;
  }
  return 0;
}

}  // namespace testing_support
