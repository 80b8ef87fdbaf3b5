#include "ply_plan.h"

#include "b_log.h"
#include "ply_columns.h"

#include <algorithm>

namespace ply {

bool ElementPlan::delivers() const {
  return std::any_of(properties.begin(), properties.end(), [](const PropertyPlan& property) {
    return property.kind != PropertyPlan::Kind::scalar && property.kind != PropertyPlan::Kind::skip;
  });
}

bool ElementPlan::fits() const {
  return std::all_of(properties.begin(), properties.end(), [this](const PropertyPlan& property) {
    switch (property.kind) {
      case PropertyPlan::Kind::scalar:
      case PropertyPlan::Kind::valueList: {
        const std::uint64_t words = property.kind == PropertyPlan::Kind::scalar ? 1 : property.length;
        return property.array < arrays.size() && arrays[property.array].resize &&
               std::uint64_t(property.offset) + 4 * words <= arrays[property.array].stride;
      }
      case PropertyPlan::Kind::indices:
        return property.sink < sinks.size() && sinks[property.sink].indices;
      case PropertyPlan::Kind::deliver:
      case PropertyPlan::Kind::skip:
        return true;
    }
    return false;
  });
}

void BadIndexReport::note(std::uint32_t index, std::uint32_t vertexCount) {
  if (++m_count <= linesPerElement) {
    base::log().message(base::logScene, base::logError, "Invalid vertex index detected {}, max {}!", index,
                        vertexCount);
  }
}

void BadIndexReport::finish(const Element& element) {
  if (m_count > linesPerElement) {
    base::log().message(base::logScene, base::logError,
                        "{} invalid vertex indices in element '{}' were stored as 0 (the first {} are listed above)",
                        m_count, base::clipped(displayName(element)), linesPerElement);
  }
  m_count = 0;
}

namespace detail {

PlanTargets::PlanTargets(ElementPlan& plan, std::uint32_t count, bool sized)
    : m_plan(plan), m_count(count), m_bases(plan.arrays.size(), nullptr) {
  if (sized) grow(count);
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
  if (vertexCount == IndexSink::noRangeCheck) return;
  for (std::size_t k = 0; k < count; ++k) {
    // Rare: the branch is taken only for bad files.
    if (indices[k] >= vertexCount) [[unlikely]] {
      report.note(indices[k], vertexCount);
      indices[k] = 0;
    }
  }
}

void reserveAhead(const IndexSink& sink, std::optional<std::uint64_t> bytesLeft, std::uint64_t instancesLeft,
                  std::uint32_t count, std::uint32_t itemBytes) {
  if (!bytesLeft) return;
  const std::uint64_t items = std::min(instancesLeft * count, *bytesLeft / itemBytes + count);
  if (sink.indices->capacity() < sink.indices->size() + items) sink.indices->reserve(sink.indices->size() + items);
  const std::uint64_t lists = std::min(instancesLeft, *bytesLeft / itemBytes + 1);
  if (sink.listCounts && sink.listCounts->capacity() < sink.listCounts->size() + lists) {
    sink.listCounts->reserve(sink.listCounts->size() + lists);
  }
}

void storeIndexList(const IndexSink& sink, const std::uint32_t* items, std::size_t count, BadIndexReport& report) {
  base::vector<std::uint32_t>& indices = *sink.indices;
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
