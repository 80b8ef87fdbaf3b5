// Feeds arbitrary bytes to the PLY reader from every kind of source: memory, a file-like
// stream, a pipe (no size: the header cannot bound the counts) and a read buffer over a pipe
// (it cannot go back far), with a receiver that touches every delivered value.

#include "ply_parser.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>

namespace {

struct Touch {
  std::uint64_t sum = 0;
  bool plyElement(const ply::Element&) { return true; }
  void beginInstance(std::uint32_t index) { sum += index; }
  void plyProperty(const ply::Element&, const ply::Property& property, const ply::ValueArray& values) {
    for (const ply::Value& value : values)
      sum += static_cast<std::uint64_t>(value.convertTo<std::int64_t>(property.type));
  }
};

// Plans every element: scalars side by side in one record, by a conversion that depends on
// their position; index lists to a sink with a range check; other lists of three to a
// second array. What no plan covers is touched as above.
struct Planner : Touch {
  std::vector<float> scalars;
  std::vector<float> triples;
  base::vector<std::uint32_t> indices;
  base::vector<std::uint16_t> counts;
  std::uint32_t vertexCount = ply::IndexSink::noRangeCheck;

  bool plyElement(const ply::Element& element) {
    if (element.semantic == ply::ElementSemantic::vertex) vertexCount = element.count;
    return true;
  }
  bool plyPlan(const ply::Element& element, ply::ElementPlan& plan) {
    const auto width = static_cast<std::uint32_t>(element.properties.size());
    base::append(plan.arrays, ply::RecordArray{[this, width](std::size_t records) {
                                                 scalars.resize(records * width);
                                                 return reinterpret_cast<std::byte*>(scalars.data());
                                               },
                                               4 * width});
    base::append(plan.arrays, ply::RecordArray{[this](std::size_t records) {
                                                 triples.resize(records * 3);
                                                 return reinterpret_cast<std::byte*>(triples.data());
                                               },
                                               12});
    base::append(plan.sinks, ply::IndexSink{&indices, vertexCount, &counts, nullptr, 65535});
    for (std::uint32_t p = 0; p < width; ++p) {
      ply::PropertyPlan target;
      if (!element.properties[p].isList) {
        target = {ply::PropertyPlan::Kind::scalar, static_cast<ply::Conversion>(p % 3), 0, 4 * p};
      } else if (element.properties[p].semantic == ply::PropertySemantic::vertexIndex) {
        target.kind = ply::PropertyPlan::Kind::indices;
      } else {
        target = {ply::PropertyPlan::Kind::valueList, ply::Conversion::toFloat, 1, 0, 3};
      }
      base::append(plan.properties, target);
    }
    return true;
  }
};

// A source without memory access, so that the reader's own buffering is exercised; without
// position and size it is a pipe.
class Cold final : public base::StreamWorker {
 public:
  Cold(const std::uint8_t* data, std::size_t size, std::uint32_t capabilities)
      : StreamWorker(capabilities, "fuzz"), m_data(data), m_size(size) {}
  std::uint32_t read(void* buffer, std::uint32_t count) override {
    const std::size_t n = std::min<std::size_t>(count, m_size - m_position);
    std::memcpy(buffer, m_data + m_position, n);
    m_position += n;
    return static_cast<std::uint32_t>(n);
  }
  std::int64_t setPosition(std::int64_t offset, std::uint32_t) override {
    m_position = static_cast<std::size_t>(std::clamp<std::int64_t>(offset, 0, static_cast<std::int64_t>(m_size)));
    return getPosition();
  }
  std::int64_t getPosition() override { return static_cast<std::int64_t>(m_position); }
  std::int64_t getSize() override { return static_cast<std::int64_t>(m_size); }

 private:
  const std::uint8_t* m_data;
  std::size_t m_size;
  std::size_t m_position = 0;
};

enum class Source { memory, file, pipe, bufferedPipe };

base::Stream open(const std::uint8_t* data, std::size_t size, Source source) {
  constexpr std::uint32_t file = base::capRead | base::capPosition | base::capSize;
  switch (source) {
    case Source::memory:
      return base::memStream(data, static_cast<std::int64_t>(size), "fuzz");
    case Source::file:
      return base::Stream::adopt(new Cold(data, size, file));
    case Source::pipe:
      return base::Stream::adopt(new Cold(data, size, base::capRead));
    case Source::bufferedPipe:
      return base::bufReadStream(base::Stream::adopt(new Cold(data, size, base::capRead)), 0, 4096);
  }
  return {};
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  base::log().setLevel(0);
  for (Source source : {Source::memory, Source::file, Source::pipe, Source::bufferedPipe}) {
    base::Stream stream = open(data, size, source);
    ply::Header header;
    Touch touch;
    ply::readFile(header, stream, touch);
    base::Stream planned = open(data, size, source);
    ply::Header plannedHeader;
    Planner planner;
    ply::readFile(plannedHeader, planned, planner);
    // The header alone must leave any source readable at its body.
    base::Stream again = open(data, size, source);
    ply::Header alone;
    std::uint8_t rest[64];
    if (ply::parseHeader(alone, again)) again.read(rest, sizeof rest);
  }
  return 0;
}
