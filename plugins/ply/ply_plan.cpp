#include "ply_plan.h"

#include "b_log.h"
#include "ply_columns.h"

#include <fmt/format.h>

#include <algorithm>

namespace ply {

bool ElementPlan::sharesSinks() const {
  base::vector<bool> taken(sinks.size(), false);
  for (const PropertyPlan& property : properties) {
    if (!property.toSink()) continue;
    if (taken[property.sink]) return true;
    taken[property.sink] = true;
  }
  return false;
}

bool ElementPlan::delivers() const {
  return std::any_of(properties.begin(), properties.end(), [](const PropertyPlan& property) {
    return property.kind != PropertyPlan::Kind::scalar && property.kind != PropertyPlan::Kind::skip;
  });
}

namespace {

// Bytes that one stored value takes.
std::uint64_t storedSize(const Property& property, const PropertyPlan& plan) {
  return plan.conversion == Conversion::native ? dataTypeSize(property.type) : 4;
}

bool fitsOne(const ElementPlan& plan, const Property& property, const PropertyPlan& target) {
  switch (target.kind) {
    case PropertyPlan::Kind::scalar:
    case PropertyPlan::Kind::valueList: {
      if (target.kind == PropertyPlan::Kind::valueList && target.conversion == Conversion::native) return false;
      const std::uint64_t values = target.kind == PropertyPlan::Kind::scalar ? 1 : target.length;
      return target.array < plan.arrays.size() && plan.arrays[target.array].resize &&
             std::uint64_t(target.offset) + storedSize(property, target) * values <= plan.arrays[target.array].stride;
    }
    case PropertyPlan::Kind::itemList:
      if (target.conversion == Conversion::native || target.conversion == Conversion::toIndex) return false;
      [[fallthrough]];
    case PropertyPlan::Kind::indices:
      return target.sink < plan.sinks.size() && plan.sinks[target.sink].items;
    case PropertyPlan::Kind::deliver:
    case PropertyPlan::Kind::skip:
      return true;
  }
  return false;
}

}  // namespace

bool ElementPlan::fits(const Element& element) const {
  if (properties.size() != element.properties.size()) return false;
  for (std::size_t p = 0; p < properties.size(); ++p) {
    if (!fitsOne(*this, element.properties[p], properties[p])) return false;
  }
  return true;
}

void BadIndexReport::note(std::uint32_t index, std::uint32_t vertexCount) {
  if (++m_count <= linesPerElement) {
    base::log().message(base::logScene, base::logError, "Invalid vertex index detected {}, max {}!", index,
                        vertexCount);
  }
}

void BadIndexReport::finish(const Element& element) {
  if (m_count > 0) {
    base::log().message(base::logScene, base::logError, "Element '{}': {} invalid vertex {} stored as 0{}",
                        base::clipped(displayName(element)), m_count, m_count == 1 ? "index was" : "indices were",
                        m_count > linesPerElement ? fmt::format(" (the first {} are listed above)", linesPerElement)
                                                  : std::string());
  }
  m_count = 0;
}

namespace detail {

PlanTargets::PlanTargets(ElementPlan& plan, std::uint32_t count, bool sized)
    : m_plan(plan), m_count(count), m_sized(sized), m_bases(plan.arrays.size(), nullptr) {
  if (sized) grow(count);
}

PlanTargets::~PlanTargets() {
  // Room made ahead of data that never came is given back; it only shrinks the arrays.
  if (m_sized || m_capacity == m_reached) return;
  for (const RecordArray& array : m_plan.arrays) array.resize(m_reached);
}

void PlanTargets::grow(std::uint64_t records) {
  // Doubling keeps the steps few; the count caps them, and the data that arrived (at least
  // half of the new room) bounds what a hostile count can make us allocate.
  constexpr std::uint64_t firstStep = 4096;
  const std::uint64_t target = std::min(m_count, std::max({records, m_capacity * 2, firstStep}));
  for (std::size_t k = 0; k < m_bases.size(); ++k) m_bases[k] = m_plan.arrays[k].resize(target);
  m_capacity = target;
}

void checkIndices(std::uint32_t* indices, std::size_t count, std::uint32_t vertexCount, BadIndexReport& report) {
  if (vertexCount == ListSink::noRangeCheck) return;
  for (std::size_t k = 0; k < count; ++k) {
    // Rare: the branch is taken only for bad files.
    if (indices[k] >= vertexCount) [[unlikely]] {
      report.note(indices[k], vertexCount);
      indices[k] = 0;
    }
  }
}

void reserveAhead(const ListSink& sink, std::optional<std::uint64_t> bytesLeft, std::uint64_t instancesLeft,
                  std::uint32_t count, std::uint32_t itemBytes) {
  if (!bytesLeft) return;
  const std::uint64_t items = std::min(instancesLeft * count, *bytesLeft / itemBytes + count);
  if (sink.items->capacity() < sink.items->size() + items) sink.items->reserve(sink.items->size() + items);
  const std::uint64_t lists = std::min(instancesLeft, *bytesLeft / itemBytes + 1);
  if (sink.listCounts && sink.listCounts->capacity() < sink.listCounts->size() + lists) {
    sink.listCounts->reserve(sink.listCounts->size() + lists);
  }
}

void storeList(const ListSink& sink, const std::uint32_t* items, std::size_t count, BadIndexReport& report) {
  base::vector<std::uint32_t>& indices = *sink.items;
  if (!sink.runCounts) {
    base::reserveForAppend(indices, count);
    const std::size_t first = indices.size();
    indices.insert(indices.end(), items, items + count);
    checkIndices(indices.data() + first, count, sink.vertexCount, report);
    if (sink.listCounts) base::append(*sink.listCounts, static_cast<std::uint16_t>(count));
    return;
  }
  std::uint32_t run = 0;
  for (std::size_t k = 0; k < count; ++k) {
    std::uint32_t index = items[k];
    if (index == 0xFFFFFFFFu) {
      if (run > 0) base::append(*sink.runCounts, std::exchange(run, 0u));
      continue;
    }
    checkIndices(&index, 1, sink.vertexCount, report);
    base::append(indices, index);
    ++run;
  }
  base::append(*sink.runCounts, run);
}

}  // namespace detail
}  // namespace ply
