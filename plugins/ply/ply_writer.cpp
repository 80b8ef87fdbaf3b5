#include "ply_writer.h"

#include "b_exception.h"
#include "b_log.h"
#include "ply_columns.h"

#include <fmt/format.h>

#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstring>

namespace ply {
namespace {

using detail::NativeType;

// Bytes gathered before they go to the stream.
constexpr std::size_t chunkBytes = 256 * 1024;
// Room for any one formatted value and its separator.
constexpr std::size_t wordRoom = 40;

// Stores `count` values, `sourceStride` bytes apart, as file values `targetStride` bytes apart.
using StoreFunction = void (*)(const std::byte* source, std::size_t sourceStride, std::size_t count, std::byte* target,
                               std::size_t targetStride);
// Formats the value at `source` into `out` and returns the end.
using FormatFunction = char* (*)(const std::byte* source, char* out);
// Stores a list's count in the file's type and byte order.
using CountFunction = void (*)(std::uint32_t count, std::byte* target);

template <class T>
T loadValue(const std::byte* source) {
  T value;
  std::memcpy(&value, source, sizeof value);
  return value;
}

template <class T, bool Swap>
void storeValue(T value, std::byte* target) {
  auto raw = std::bit_cast<detail::UnsignedOfSize<sizeof(T)>>(value);
  if constexpr (Swap) raw = detail::swapBytes(raw);
  std::memcpy(target, &raw, sizeof raw);
}

// The inverse of toFP: a float scaled by the type's largest value, rounded and clamped.
// Rounded half up by hand: nearbyint honours the rounding mode through a library call, which
// made this the slowest column of an export.
template <class T>
T unnormalised(float value) {
  constexpr float largest = static_cast<float>(std::numeric_limits<T>::max());
  const float scaled = value * largest;
  if (!(scaled > 0.0f)) return T(0);
  return scaled >= largest ? std::numeric_limits<T>::max() : static_cast<T>(scaled + 0.5f);
}

template <DataType W, bool Normalised>
NativeType<W> valueAt(const std::byte* source) {
  if constexpr (Normalised) {
    return unnormalised<NativeType<W>>(loadValue<float>(source));
  } else {
    return loadValue<NativeType<W>>(source);
  }
}

template <DataType W, bool Swap, bool Normalised>
void storeColumn(const std::byte* source, std::size_t sourceStride, std::size_t count, std::byte* target,
                 std::size_t targetStride) {
  for (std::size_t k = 0; k < count; ++k) {
    storeValue<NativeType<W>, Swap>(valueAt<W, Normalised>(source + k * sourceStride), target + k * targetStride);
  }
}

// An integer's digits. fmt's formatter rather than std::to_chars, whose integer templates a
// build without inlining would export from the plug-in. A char is a number here, not a
// character.
char* integerText(std::int64_t value, char* out) {
  const fmt::format_int text(value);
  std::memcpy(out, text.data(), text.size());
  return out + text.size();
}

template <DataType W, bool Normalised>
char* formatValue(const std::byte* source, char* out) {
  const auto value = valueAt<W, Normalised>(source);
  if constexpr (std::is_floating_point_v<decltype(value)>) {
    // to_chars gives the shortest form that reads back to the same bits, "nan" and "inf"
    // included; the reader takes both.
    return std::to_chars(out, out + wordRoom, value).ptr;
  } else {
    return integerText(static_cast<std::int64_t>(value), out);
  }
}

template <DataType W, bool Swap>
void storeCount(std::uint32_t count, std::byte* target) {
  storeValue<NativeType<W>, Swap>(static_cast<NativeType<W>>(count), target);
}

template <bool Swap>
StoreFunction storeFunction(const WriteProperty& property) {
  return detail::forType<Conversion::native>(property.type, [&]<DataType W, Conversion>() -> StoreFunction {
    if constexpr (std::is_integral_v<NativeType<W>>) {
      if (property.normalised) return storeColumn<W, Swap, true>;
    }
    return storeColumn<W, Swap, false>;
  });
}

FormatFunction formatFunction(const WriteProperty& property) {
  return detail::forType<Conversion::native>(property.type, [&]<DataType W, Conversion>() -> FormatFunction {
    if constexpr (std::is_integral_v<NativeType<W>>) {
      if (property.normalised) return formatValue<W, true>;
    }
    return formatValue<W, false>;
  });
}

template <bool Swap>
CountFunction countFunction(DataType type) {
  return detail::forType<Conversion::native>(
      type, []<DataType W, Conversion>() -> CountFunction { return storeCount<W, Swap>; });
}

// Gathers the body's bytes and hands them to the stream a chunk at a time.
class Output {
 public:
  explicit Output(base::Stream& stream) : m_stream(stream) { m_bytes.reserve(chunkBytes + wordRoom); }
  ~Output() = default;

  /// Room for `size` more bytes at the end; what is there already may go out first.
  std::byte* room(std::size_t size) {
    if (m_bytes.size() + size > chunkBytes) flush();
    const std::size_t at = m_bytes.size();
    m_bytes.resize(at + size);
    return m_bytes.data() + at;
  }
  /// Gives back the part of the last room that was not used.
  void shrink(std::size_t unused) { m_bytes.resize(m_bytes.size() - unused); }
  void flush() {
    if (!m_bytes.empty()) m_stream.write(m_bytes.data(), static_cast<std::uint32_t>(m_bytes.size()));
    m_bytes.clear();
  }

 private:
  base::Stream& m_stream;
  std::vector<std::byte> m_bytes;
};

// What is decided once per property of an element.
struct Step {
  const WriteProperty* property;
  std::uint32_t size;  // bytes of a written value or item
  std::uint32_t countSize;
  StoreFunction store;
  FormatFunction format;
  CountFunction count;
};

template <bool Swap>
std::vector<Step> stepsOf(const WriteElement& element) {
  std::vector<Step> steps;
  for (const WriteProperty& property : element.properties) {
    steps.push_back(Step{&property, dataTypeSize(property.type), property.isList ? dataTypeSize(property.countType) : 0,
                         storeFunction<Swap>(property), formatFunction(property),
                         property.isList ? countFunction<Swap>(property.countType) : nullptr});
  }
  return steps;
}

std::uint32_t lengthOf(const WriteProperty& property, std::uint64_t instance) {
  return property.counts ? property.counts[instance] : property.length;
}

// An element whose lists all have one length is a run of fixed-size records: each column
// goes into a block of records in one loop.
template <bool Swap>
void writeRecords(Output& output, const WriteElement& element, const std::vector<Step>& steps) {
  std::size_t recordSize = 0;
  for (const Step& step : steps) {
    recordSize += step.property->isList ? step.countSize + std::size_t(step.size) * step.property->length : step.size;
  }
  if (recordSize == 0) return;
  const std::uint64_t perBlock = std::max<std::uint64_t>(1, chunkBytes / recordSize);
  for (std::uint64_t first = 0; first < element.count; first += perBlock) {
    const std::size_t records = static_cast<std::size_t>(std::min(perBlock, element.count - first));
    std::byte* block = output.room(records * recordSize);
    std::size_t offset = 0;
    for (const Step& step : steps) {
      const WriteProperty& property = *step.property;
      if (!property.isList) {
        step.store(property.values + first * property.stride, property.stride, records, block + offset, recordSize);
        offset += step.size;
        continue;
      }
      for (std::size_t r = 0; r < records; ++r) step.count(property.length, block + offset + r * recordSize);
      offset += step.countSize;
      const std::size_t listStride = std::size_t(property.length) * property.stride;
      for (std::uint32_t k = 0; k < property.length; ++k) {
        step.store(property.values + first * listStride + k * property.stride, listStride, records,
                   block + offset + std::size_t(k) * step.size, recordSize);
      }
      offset += std::size_t(step.size) * property.length;
    }
  }
}

// Lists of different lengths: instance by instance, each list in one call.
template <bool Swap>
void writeInstances(Output& output, const WriteElement& element, const std::vector<Step>& steps) {
  std::vector<std::uint64_t> itemAt(steps.size(), 0);
  for (std::uint64_t i = 0; i < element.count; ++i) {
    for (std::size_t p = 0; p < steps.size(); ++p) {
      const Step& step = steps[p];
      const WriteProperty& property = *step.property;
      if (!property.isList) {
        step.store(property.values + i * property.stride, property.stride, 1, output.room(step.size), step.size);
        continue;
      }
      const std::uint32_t length = lengthOf(property, i);
      std::byte* target = output.room(step.countSize + std::size_t(length) * step.size);
      step.count(length, target);
      step.store(property.values + itemAt[p] * property.stride, property.stride, length, target + step.countSize,
                 step.size);
      itemAt[p] += length;
    }
  }
}

template <bool Swap>
void writeBinary(Output& output, const WriteElement& element) {
  const std::vector<Step> steps = stepsOf<Swap>(element);
  const bool fixed = std::none_of(element.properties.begin(), element.properties.end(),
                                  [](const WriteProperty& property) { return property.counts != nullptr; });
  fixed ? writeRecords<Swap>(output, element, steps) : writeInstances<Swap>(output, element, steps);
}

char* separated(char* out, bool& first) {
  if (!first) *out++ = ' ';
  first = false;
  return out;
}

void writeAscii(Output& output, const WriteElement& element) {
  const std::vector<Step> steps = stepsOf<false>(element);
  std::vector<std::uint64_t> itemAt(steps.size(), 0);
  for (std::uint64_t i = 0; i < element.count; ++i) {
    bool first = true;
    for (std::size_t p = 0; p < steps.size(); ++p) {
      const WriteProperty& property = *steps[p].property;
      if (!property.isList) {
        char* out = reinterpret_cast<char*>(output.room(wordRoom));
        char* end = steps[p].format(property.values + i * property.stride, separated(out, first));
        output.shrink(wordRoom - static_cast<std::size_t>(end - out));
        continue;
      }
      const std::uint32_t length = lengthOf(property, i);
      const std::size_t room = wordRoom * (std::size_t(length) + 1);
      char* out = reinterpret_cast<char*>(output.room(room));
      char* end = integerText(length, separated(out, first));
      const std::byte* item = property.values + itemAt[p] * property.stride;
      for (std::uint32_t k = 0; k < length; ++k, item += property.stride) {
        *end++ = ' ';
        end = steps[p].format(item, end);
      }
      output.shrink(room - static_cast<std::size_t>(end - out));
      itemAt[p] += length;
    }
    *reinterpret_cast<char*>(output.room(1)) = '\n';
  }
}

// A name the reader would read back whole: not empty, and none of the bytes that end a name.
void checkName(std::string_view name, std::string_view what) {
  const char* why = name.empty() ? "is empty"
                    : name.find_first_of(std::string_view(" \t\r\n\0", 5)) != std::string_view::npos
                        ? "holds white space, a line break or NUL"
                        : nullptr;
  if (why) {
    base::raise<base::exception>("ply::writePly",
                                 fmt::format("the name of {} {}: a PLY header cannot hold it", what, why));
  }
}

std::string headerText(Encoding encoding, const std::vector<WriteElement>& elements,
                       std::span<const std::string> comments) {
  std::string text = fmt::format("ply\nformat {} 1.0\n", encodingWord(encoding));
  for (const std::string& comment : comments) {
    if (comment.find_first_of("\r\n") != std::string::npos) {
      base::raise<base::exception>("ply::writePly", "a comment holds a line break: a PLY header cannot hold it");
    }
    text += fmt::format("comment {}\n", comment);
  }
  for (const WriteElement& element : elements) {
    checkName(element.name, fmt::format("element '{}'", base::clipped(element.name)));
    text += fmt::format("element {} {}\n", element.name, element.count);
    for (const WriteProperty& property : element.properties) {
      checkName(property.name, fmt::format("property '{}' of element '{}'", base::clipped(property.name),
                                           base::clipped(element.name)));
      if (property.isList) {
        text += fmt::format("property list {} {} {}\n", dataTypeWord(property.countType), dataTypeWord(property.type),
                            property.name);
      } else {
        text += fmt::format("property {} {}\n", dataTypeWord(property.type), property.name);
      }
    }
  }
  return text + "end_header\n";
}

}  // namespace

DataType countTypeFor(std::uint32_t longest) {
  if (longest <= 0xFF) return DataType::uint8;
  return longest <= 0xFFFF ? DataType::uint16 : DataType::uint32;
}

void writePly(base::Stream& stream, Encoding encoding, const std::vector<WriteElement>& elements,
              std::span<const std::string> comments) {
  const std::string header = headerText(encoding, elements, comments);
  stream.write(header.data(), static_cast<std::uint32_t>(header.size()));
  Output output(stream);
  const bool swap = (encoding == Encoding::binaryBigEndian) != (std::endian::native == std::endian::big);
  for (const WriteElement& element : elements) {
    if (encoding == Encoding::ascii) {
      writeAscii(output, element);
    } else {
      swap ? writeBinary<true>(output, element) : writeBinary<false>(output, element);
    }
  }
  output.flush();
}

}  // namespace ply
