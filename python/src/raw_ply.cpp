#include "raw_ply.h"

#include "ply_columns.h"
#include "ply_parser.h"

#include <algorithm>
#include <bit>
#include <cstring>
#include <limits>

namespace pymeshport {
namespace {

using ply::DataType;

// A repeated lengths marker in a list's 16-bit length column: that list's length is the next
// entry of the long lengths, as are lengths the 16 bits cannot hold.
constexpr std::uint16_t longList = 0xFFFF;

bool isNarrowInteger(DataType type) { return type != DataType::none && ply::dataTypeSize(type) < 4; }

bool isSigned(DataType type) { return type == DataType::int8 || type == DataType::int16 || type == DataType::int32; }

DataType wide(DataType type) { return isSigned(type) ? DataType::int32 : DataType::uint32; }

template <class V>
ValueBlock blockOf(V&& values, DataType type, std::size_t rows, std::optional<std::size_t> width = std::nullopt) {
  auto owner = std::make_shared<std::decay_t<V>>(std::forward<V>(values));
  const void* data = owner->data();
  return ValueBlock{type, std::move(owner), data, rows, width};
}

// Whether every 32-bit pattern in `held` is a value of `type` (read as `type`'s 32-bit kind).
bool fitsIn(const std::uint32_t* held, std::size_t count, DataType type) {
  return ply::detail::forType<ply::Conversion::native>(type, [&]<DataType T, ply::Conversion>() {
    using Native = ply::detail::NativeType<T>;
    using Held = ply::detail::Held<T>;
    return std::all_of(held, held + count, [](std::uint32_t pattern) {
      const auto value = static_cast<Held>(pattern);
      return value >= Held(std::numeric_limits<Native>::min()) && value <= Held(std::numeric_limits<Native>::max());
    });
  });
}

// 32-bit patterns as `type`: narrowed when every value fits (always so for binary data),
// else kept in the 32-bit type of the same signedness; no copy for 32-bit types.
ValueBlock heldBlock(base::vector<std::uint32_t>&& held, DataType type, std::size_t rows,
                     std::optional<std::size_t> width) {
  if (!isNarrowInteger(type)) return blockOf(std::move(held), type, rows, width);
  if (!fitsIn(held.data(), held.size(), type)) return blockOf(std::move(held), wide(type), rows, width);
  return ply::detail::forType<ply::Conversion::native>(type, [&]<DataType T, ply::Conversion>() {
    base::vector<ply::detail::NativeType<T>> narrowed(held.begin(), held.end());
    return blockOf(std::move(narrowed), type, rows, width);
  });
}

// One property being read; its storage is reached from the plan, so it never moves.
struct Column {
  const ply::Property* property = nullptr;
  base::vector<std::byte> bytes;        // scalars in their stored type; a double list's items
  base::vector<std::uint32_t> items;    // items of the other lists, as 32-bit patterns
  base::vector<std::uint16_t> lengths;  // each list's length, or longList
  base::vector<std::uint32_t> longLengths;
  DataType stored = DataType::none;  // the type `bytes` holds scalars in
};

// Collects each element as the reader finishes it: the reader announces the next element
// (or ends) only once the previous one is complete.
class RawReader {
 public:
  explicit RawReader(const ply::Header& header) : m_header(header) {}

  bool plyElement(const ply::Element& element) {
    finishCurrent();
    m_columns.clear();
    m_columns.resize(element.properties.size());
    m_lists.clear();
    m_begun = 0;
    for (std::size_t p = 0; p < element.properties.size(); ++p) {
      m_columns[p].property = &element.properties[p];
      m_columns[p].stored = element.properties[p].type;  // an element without instances gets no plan
      if (element.properties[p].isList) base::append(m_lists, &m_columns[p]);
    }
    m_current = &element;
    return true;
  }

  bool plyPlan(const ply::Element& element, ply::ElementPlan& plan) {
    for (Column& column : m_columns) base::append(plan.properties, planFor(column, plan));
    return plan.fits(element);
  }

  // An ASCII instance that could not be read leaves its lists out: an empty list keeps the
  // rows in step with the instances.
  void beginInstance(std::uint32_t index) {
    for (Column* column : m_lists) padLists(*column, index);
    m_begun = std::size_t(index) + 1;
  }

  // Only lists arrive here: double lists, and lists too long for the plan's length column.
  void plyProperty(const ply::Element&, const ply::Property& property, const ply::ValueArray& values) {
    Column& column = m_columns[static_cast<std::size_t>(&property - m_current->properties.data())];
    base::append(column.lengths, longList);
    base::append(column.longLengths, static_cast<std::uint32_t>(values.size()));
    if (property.type == DataType::float64) {
      for (const ply::Value& value : values) appendBytes(column.bytes, value.d);
    } else {
      base::reserveForAppend(column.items, values.size());
      for (const ply::Value& value : values) base::append(column.items, heldPattern(value, property.type));
    }
  }

  /// Every element read.
  base::vector<RawElement> take() {
    finishCurrent();
    return std::move(m_elements);
  }

 private:
  static void padLists(Column& column, std::size_t instances) {
    if (column.lengths.size() < instances) column.lengths.resize(instances, 0);
  }
  static std::uint32_t heldPattern(const ply::Value& value, DataType type) {
    return type == DataType::float32 ? std::bit_cast<std::uint32_t>(value.f)
                                     : static_cast<std::uint32_t>(value.toInteger(type));
  }
  template <class T>
  static void appendBytes(base::vector<std::byte>& bytes, T value) {
    const auto* first = reinterpret_cast<const std::byte*>(&value);
    bytes.insert(bytes.end(), first, first + sizeof value);
  }

  ply::PropertyPlan planFor(Column& column, ply::ElementPlan& plan);
  RawProperty finishScalar(Column& column);
  RawProperty finishList(Column& column);
  void finishCurrent();

  const ply::Header& m_header;
  const ply::Element* m_current = nullptr;
  base::vector<Column> m_columns;
  base::vector<Column*> m_lists;  // the columns of list properties
  std::size_t m_begun = 0;        // instances begun one by one (not those read in bulk)
  base::vector<RawElement> m_elements;
};

ply::PropertyPlan RawReader::planFor(Column& column, ply::ElementPlan& plan) {
  using Kind = ply::PropertyPlan::Kind;
  const ply::Property& property = *column.property;
  ply::PropertyPlan step;
  if (!property.isList) {
    // ASCII words may leave a narrow type's range: such columns are read in 32 bits first.
    const bool held = m_header.encoding == ply::Encoding::ascii && isNarrowInteger(property.type);
    column.stored = held ? wide(property.type) : property.type;
    const std::uint32_t size = ply::dataTypeSize(column.stored);
    step = {Kind::scalar, held ? ply::Conversion::toIndex : ply::Conversion::native,
            static_cast<std::uint32_t>(plan.arrays.size())};
    base::append(plan.arrays, ply::RecordArray{[&bytes = column.bytes, size](std::size_t records) {
                                                 bytes.resize(records * size);
                                                 return bytes.data();
                                               },
                                               size});
    return step;
  }
  if (property.type == DataType::float64) return step;  // delivered: no 32-bit sink holds it
  step.kind = property.type == DataType::float32 ? Kind::itemList : Kind::indices;
  step.sink = static_cast<std::uint32_t>(plan.sinks.size());
  ply::ListSink sink;
  sink.items = &column.items;
  sink.listCounts = &column.lengths;
  sink.maxLength = longList - 1;
  base::append(plan.sinks, sink);
  return step;
}

RawProperty RawReader::finishScalar(Column& column) {
  RawProperty result{std::string(column.property->word), {}, std::nullopt};
  // The column holds the instances reached: all of them, unless the data ended early.
  const std::size_t rows = column.bytes.size() / ply::dataTypeSize(column.stored);
  if (column.stored == column.property->type) {
    result.values = blockOf(std::move(column.bytes), column.stored, rows);
  } else {
    base::vector<std::uint32_t> held(rows);
    std::memcpy(held.data(), column.bytes.data(), rows * 4);
    result.values = heldBlock(std::move(held), column.property->type, rows, std::nullopt);
  }
  return result;
}

RawProperty RawReader::finishList(Column& column) {
  padLists(column, m_begun);
  RawProperty result{std::string(column.property->word), {}, std::nullopt};
  base::vector<std::uint32_t> lengths;
  lengths.reserve(column.lengths.size());
  auto longLength = column.longLengths.begin();
  for (const std::uint16_t length : column.lengths) base::append(lengths, length == longList ? *longLength++ : length);
  const bool uniform = !lengths.empty() && std::all_of(lengths.begin(), lengths.end(),
                                                       [&](std::uint32_t length) { return length == lengths[0]; });
  const std::optional<std::size_t> width = uniform ? std::optional<std::size_t>(lengths[0]) : std::nullopt;
  const std::size_t rows = uniform ? lengths.size() : 0;
  const DataType type = column.property->type;
  if (type == DataType::float64) {
    const std::size_t items = column.bytes.size() / 8;
    result.values = blockOf(std::move(column.bytes), type, uniform ? rows : items, width);
  } else {
    const std::size_t items = column.items.size();
    result.values = heldBlock(std::move(column.items), type, uniform ? rows : items, width);
  }
  if (!uniform) result.counts = blockOf(std::move(lengths), DataType::uint32, column.lengths.size());
  return result;
}

void RawReader::finishCurrent() {
  if (!m_current) return;
  RawElement element{std::string(ply::displayName(*m_current)), m_current->count, {}};
  for (Column& column : m_columns) {
    base::append(element.properties, column.property->isList ? finishList(column) : finishScalar(column));
  }
  base::append(m_elements, std::move(element));
  m_current = nullptr;
}

}  // namespace

base::vector<RawElement> readRawPly(base::Stream& stream) {
  ply::Header header;
  RawReader reader(header);
  const ply::ReadResult result = ply::readFile(header, stream, reader);
  if (result == ply::ReadResult::headerFailed) throw ReadError("not a readable PLY header");
  if (result == ply::ReadResult::bodyEndedEarly)
    throw ReadError("the body ends before the header's counts are reached");
  return reader.take();
}

}  // namespace pymeshport
