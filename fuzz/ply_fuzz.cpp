// Feeds arbitrary bytes to the PLY reader from memory, from a pipe (no position, no size: the
// header cannot bound the counts) and from a read buffer over a pipe (it cannot go back far).
// Each source is read twice, once with a column plan for every element and once with every
// value delivered to the receiver; both must read the same values, or the target aborts.

#include "plan_values.h"
#include "ply_parser.h"
#include "ply_plan.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <vector>

namespace {

using testing_support::storedBits;

constexpr std::uint32_t longestPlannedList = 65535;

// What one element read: every scalar as the 32-bit pattern its conversion gives (a record
// of one slot per property), index lists and their lengths, lists of three floats per list
// property at an even position, and at an odd one all its lists' floats with their lengths.
// Lists the plan leaves to the receiver are kept with their instance.
struct ElementValues {
  std::vector<std::uint32_t> scalars;
  base::vector<std::uint32_t> indices;
  base::vector<std::uint16_t> counts;
  std::vector<std::vector<std::uint32_t>> triples;  // float bit patterns: NaN equals itself
  std::vector<base::vector<std::uint32_t>> items;
  std::vector<base::vector<std::uint16_t>> itemCounts;
  std::vector<std::vector<std::uint32_t>> delivered;

  bool operator==(const ElementValues&) const = default;

  // Records that no value reached read as zero on both paths, but a plan may have made room
  // for all of them before the data ran out: compare up to the last value that is not zero.
  void trim() {
    trimZeros(scalars);
    for (std::vector<std::uint32_t>& column : triples) trimZeros(column);
  }

 private:
  static void trimZeros(std::vector<std::uint32_t>& values) {
    const auto last = std::find_if(values.rbegin(), values.rend(), [](std::uint32_t value) { return value != 0; });
    values.erase(last.base(), values.end());
  }
};

// The conversion a scalar gets depends on its position, so that each is exercised; a value
// in its own type must fit the 4-byte slot.
ply::Conversion conversionOf(std::size_t p, const ply::Property& property) {
  if (p % 5 == 4 && ply::dataTypeSize(property.type) <= 4) return ply::Conversion::native;
  return static_cast<ply::Conversion>(p % 3);
}

bool isItemList(std::size_t p, const ply::Property& property) {
  return property.isList && property.semantic != ply::PropertySemantic::vertexIndex && p % 2 == 1;
}

// Receives every value one by one and stores it where the plan below would.
struct Delivered {
  std::vector<ElementValues> elements;
  std::uint32_t instance = 0;

  bool plyElement(const ply::Element& element) {
    ElementValues& values = elements.emplace_back();
    values.triples.resize(element.properties.size());
    values.items.resize(element.properties.size());
    values.itemCounts.resize(element.properties.size());
    return true;
  }
  void beginInstance(std::uint32_t index) { instance = index; }
  void plyProperty(const ply::Element& element, const ply::Property& property, const ply::ValueArray& values) {
    const auto p = static_cast<std::size_t>(&property - element.properties.data());
    ElementValues& target = elements.back();
    if (!property.isList) {
      store(target, element, p, storedBits(values[0], property, conversionOf(p, property)));
    } else if (isItemList(p, property) && values.size() <= longestPlannedList) {
      for (const ply::Value& value : values)
        base::append(target.items[p], storedBits(value, property, ply::Conversion::toFloat));
      base::append(target.itemCounts[p], static_cast<std::uint16_t>(values.size()));
    } else if (property.semantic == ply::PropertySemantic::vertexIndex && values.size() <= longestPlannedList) {
      for (const ply::Value& value : values)
        base::append(target.indices, storedBits(value, property, ply::Conversion::toIndex));
      base::append(target.counts, static_cast<std::uint16_t>(values.size()));
    } else if (property.semantic != ply::PropertySemantic::vertexIndex && values.size() == 3) {
      std::vector<std::uint32_t>& triples = target.triples[p];
      triples.resize(std::max<std::size_t>(triples.size(), (std::size_t(instance) + 1) * 3));
      for (std::size_t k = 0; k < 3; ++k) {
        triples[std::size_t(instance) * 3 + k] = storedBits(values[k], property, ply::Conversion::toFloat);
      }
    } else {
      deliver(target, p, property, values);
    }
  }

  void deliver(ElementValues& target, std::size_t p, const ply::Property& property, const ply::ValueArray& values) {
    std::vector<std::uint32_t> list{instance, static_cast<std::uint32_t>(p)};
    for (const ply::Value& value : values) list.push_back(storedBits(value, property, ply::Conversion::toIndex));
    target.delivered.push_back(std::move(list));
  }

 private:
  void store(ElementValues& target, const ply::Element& element, std::size_t p, std::uint32_t value) const {
    const std::size_t width = element.properties.size();
    target.scalars.resize(std::max(target.scalars.size(), (std::size_t(instance) + 1) * width));
    target.scalars[std::size_t(instance) * width + p] = value;
  }
};

// Plans every property: scalars to one record, index lists to a sink, other lists to a sink
// of their own or, of three, to an array of their own; the rest comes through plyProperty as
// above.
struct Planned : Delivered {
  bool plyPlan(const ply::Element& element, ply::ElementPlan& plan) {
    const auto width = static_cast<std::uint32_t>(element.properties.size());
    ElementValues& target = elements.back();
    base::append(plan.arrays, ply::RecordArray{[&target, width](std::size_t records) {
                                                 target.scalars.resize(records * width);
                                                 return reinterpret_cast<std::byte*>(target.scalars.data());
                                               },
                                               4 * width});
    base::append(plan.sinks, ply::ListSink{&target.indices, ply::ListSink::noRangeCheck, &target.counts, nullptr,
                                           longestPlannedList});
    for (std::uint32_t p = 0; p < width; ++p) {
      base::append(plan.sinks, ply::ListSink{&target.items[p], ply::ListSink::noRangeCheck, &target.itemCounts[p],
                                             nullptr, longestPlannedList});
    }
    for (std::uint32_t p = 0; p < width; ++p) base::append(plan.properties, planOf(element, p, target, plan));
    return true;
  }

 private:
  static ply::PropertyPlan planOf(const ply::Element& element, std::uint32_t p, ElementValues& target,
                                  ply::ElementPlan& plan) {
    const ply::Property& property = element.properties[p];
    ply::PropertyPlan result;
    if (!property.isList) {
      result = {ply::PropertyPlan::Kind::scalar, conversionOf(p, property), 0, 4 * p};
    } else if (property.semantic == ply::PropertySemantic::vertexIndex) {
      result.kind = ply::PropertyPlan::Kind::indices;
    } else if (isItemList(p, property)) {
      result = {ply::PropertyPlan::Kind::itemList, ply::Conversion::toFloat};
      result.sink = 1 + p;
    } else {
      std::vector<std::uint32_t>& triples = target.triples[p];
      result = {ply::PropertyPlan::Kind::valueList, ply::Conversion::toFloat,
                static_cast<std::uint32_t>(plan.arrays.size()), 0, 3};
      base::append(plan.arrays, ply::RecordArray{[&triples](std::size_t records) {
                                                   triples.resize(records * 3);
                                                   return reinterpret_cast<std::byte*>(triples.data());
                                                 },
                                                 12});
    }
    return result;
  }
};

// A source without memory access, so that the reader's own buffering is exercised. Without
// position and size it is a pipe.
class Pipe final : public base::StreamWorker {
 public:
  Pipe(const std::uint8_t* data, std::size_t size) : StreamWorker(base::capRead, "fuzz"), m_data(data), m_size(size) {}
  std::uint32_t read(void* buffer, std::uint32_t count) override {
    const std::size_t n = std::min<std::size_t>(count, m_size - m_position);
    if (n) std::memcpy(buffer, m_data + m_position, n);
    m_position += n;
    return static_cast<std::uint32_t>(n);
  }
  std::int64_t setPosition(std::int64_t, std::uint32_t) override { return getPosition(); }
  std::int64_t getPosition() override { return static_cast<std::int64_t>(m_position); }
  std::int64_t getSize() override { return -1; }

 private:
  const std::uint8_t* m_data;
  std::size_t m_size;
  std::size_t m_position = 0;
};

enum class Source { memory, pipe, bufferedPipe };

base::Stream open(const std::uint8_t* data, std::size_t size, Source source) {
  switch (source) {
    case Source::memory:
      return base::memStream(data, static_cast<std::int64_t>(size), "fuzz");
    case Source::pipe:
      return base::Stream::adopt(new Pipe(data, size));
    case Source::bufferedPipe:
      return base::bufReadStream(base::Stream::adopt(new Pipe(data, size)), 0, 4096);
  }
  return {};
}

template <class R>
ply::ReadResult read(const std::uint8_t* data, std::size_t size, Source source, R& receiver) {
  base::Stream stream = open(data, size, source);
  ply::Header header;
  return ply::readFile(header, stream, receiver);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  base::log().setLevel(0);
  for (Source source : {Source::memory, Source::pipe, Source::bufferedPipe}) {
    Delivered delivered;
    Planned planned;
    const ply::ReadResult one = read(data, size, source, delivered);
    const ply::ReadResult other = read(data, size, source, planned);
    for (auto* receiver : {static_cast<Delivered*>(&delivered), static_cast<Delivered*>(&planned)}) {
      for (ElementValues& element : receiver->elements) element.trim();
    }
    if (one != other || delivered.elements != planned.elements) {
      std::fprintf(stderr, "the planned and the delivered read differ (source %d)\n", static_cast<int>(source));
      std::abort();
    }
  }
  return 0;
}
