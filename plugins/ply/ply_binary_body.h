#pragma once

// The binary body reader: per property instance through the receiver, or, where the receiver
// answers an element with a plan, whole columns at a time.

#include "ply_body.h"

#include <algorithm>
#include <cstdint>
#include <optional>

namespace ply::detail {

template <bool Swap>
class BinaryBody {
 public:
  explicit BinaryBody(ByteWindow& window) : m_window(window) {}

  template <class R>
  bool read(const Header& header, R& receiver) {
    for (const Element& element : header.elements) {
      const bool deliver = receiver.plyElement(element);
      if (element.count == 0 || element.properties.empty()) continue;
      const BinaryPlan layout(element);
      bool complete;
      if (!deliver) {
        complete = skipElement(element, layout);
      } else if (askPlan(receiver, element, m_plan)) {
        complete = readPlanned(element, layout, receiver);
        m_report.finish(element);
      } else {
        complete = readElement(element, layout, receiver);
      }
      if (!complete) return false;
    }
    return true;
  }

 private:
  // ---- Per property instance.

  template <class R>
  bool readElement(const Element& element, const BinaryPlan& layout, R& receiver) {
    if (layout.recordSize > 0) return readRecords(element, layout, receiver);
    for (std::uint32_t i = 0; i < element.count; ++i) {
      receiver.beginInstance(i);
      for (const Property& property : element.properties) {
        if (!deliverProperty(element, property, receiver)) {
          dropInstance(receiver, i);
          return failed("Unable to parse property instance.", element, i);
        }
      }
    }
    return true;
  }

  // Elements of scalars only: fixed-size records read straight out of the window.
  template <class R>
  bool readRecords(const Element& element, const BinaryPlan& layout, R& receiver) {
    m_values.resize(1);
    const std::size_t propertyCount = element.properties.size();
    for (std::uint32_t i = 0; i < element.count; ++i) {
      const std::uint8_t* record = m_window.require(layout.recordSize);
      if (!record) return failed("Unable to parse property instance.", element, i);
      receiver.beginInstance(i);
      for (std::size_t p = 0; p < propertyCount; ++p) {
        const Property& property = element.properties[p];
        m_values[0] = decodeBinary<Swap>(record + layout.offsets[p], property.type);
        receiver.plyProperty(element, property, m_values);
      }
      m_window.advance(layout.recordSize);
    }
    return true;
  }

  template <class R>
  bool deliverProperty(const Element& element, const Property& property, R& receiver) {
    if (!property.isList) {
      const std::uint32_t size = dataTypeSize(property.type);
      const std::uint8_t* bytes = m_window.require(size);
      if (!bytes) return false;
      m_values.resize(1);
      m_values[0] = decodeBinary<Swap>(bytes, property.type);
      m_window.advance(size);
    } else {
      std::uint32_t count = 0;
      if (!readCount(property, count) || !readItems(property, count)) return false;
    }
    receiver.plyProperty(element, property, m_values);
    return true;
  }

  // Items come in batches that fit the window, so the array grows only as far as the data
  // really goes, whatever the count says.
  bool readItems(const Property& property, std::uint32_t count) {
    m_values.clear();
    return readBatches(property, count, [&](const std::uint8_t* bytes, std::size_t done, std::size_t batch) {
      m_values.resize(done + batch);
      const std::uint32_t itemSize = dataTypeSize(property.type);
      for (std::size_t k = 0; k < batch; ++k)
        m_values[done + k] = decodeBinary<Swap>(bytes + k * itemSize, property.type);
    });
  }

  // Hands `count` items of the property to `take(bytes, done, batch)` in window-sized batches.
  template <class Take>
  bool readBatches(const Property& property, std::uint32_t count, Take take) {
    const std::uint32_t itemSize = dataTypeSize(property.type);
    const std::size_t batchLimit = m_window.capacity() / itemSize;
    for (std::size_t done = 0; done < count;) {
      const std::size_t batch = std::min<std::size_t>(count - done, batchLimit);
      const std::uint8_t* bytes = m_window.require(batch * itemSize);
      if (!bytes) return false;
      take(bytes, done, batch);
      m_window.advance(batch * itemSize);
      done += batch;
    }
    return true;
  }

  bool readCount(const Property& property, std::uint32_t& count) {
    const std::uint32_t size = dataTypeSize(property.countType);
    const std::uint8_t* bytes = m_window.require(size);
    if (!bytes) return false;
    count = listCount(decodeBinary<Swap>(bytes, property.countType), property.countType);
    m_window.advance(size);
    return true;
  }

  bool skipElement(const Element& element, const BinaryPlan& layout) {
    if (layout.recordSize > 0) {
      const std::uint64_t start = m_window.position();
      if (m_window.skip(std::uint64_t(layout.recordSize) * element.count)) return true;
      return failed("Unable to skip property instance.", element, (m_window.position() - start) / layout.recordSize);
    }
    for (std::uint32_t i = 0; i < element.count; ++i) {
      for (const Property& property : element.properties) {
        if (!skipProperty(property)) return failed("Unable to skip property instance.", element, i);
      }
    }
    return true;
  }

  bool skipProperty(const Property& property) {
    std::uint32_t count = 1;
    if (property.isList && !readCount(property, count)) return false;
    return m_window.skip(std::uint64_t(count) * dataTypeSize(property.type));
  }

  bool failed(std::string_view message, const Element& element, std::uint64_t read) {
    base::log().message(base::logScene, base::logError, message);
    warnEndedEarly(element, read);
    return false;
  }

  // ---- Through a plan.

  // What is decided once per planned property: sizes and the conversion loop.
  struct Step {
    const Property* property;
    const PropertyPlan* plan;
    std::uint32_t size;      ///< a scalar's size, or a list item's
    ColumnFunction convert;  ///< scalar or list item to its target; null when not stored
  };

  void prepareSteps(const Element& element) {
    m_steps.clear();
    for (std::size_t p = 0; p < element.properties.size(); ++p) {
      const Property& property = element.properties[p];
      const PropertyPlan& plan = m_plan.properties[p];
      base::append(m_steps, Step{&property, &plan, dataTypeSize(property.type),
                                 columnFunction<Swap>(property.type, plan.storedAs())});
    }
  }

  template <class R>
  bool readPlanned(const Element& element, const BinaryPlan& layout, R& receiver) {
    prepareSteps(element);
    m_elementCount = element.count;
    PlanTargets targets(m_plan, element.count, m_window.remaining().has_value());
    const bool delivers = m_plan.delivers();
    if (layout.recordSize > 0) return readPlannedRecords(element, layout, targets, delivers, receiver);
    // Runs of equal lists go in bulk when the plan stores or skips everything and no two
    // lists share a sink.
    m_runCounts.assign(m_steps.size(), 0);
    const bool uniform = !m_plan.sharesSinks() &&
                         std::any_of(element.properties.begin(), element.properties.end(),
                                     [](const Property& property) { return property.isList; }) &&
                         std::none_of(m_plan.properties.begin(), m_plan.properties.end(), [](const PropertyPlan& plan) {
                           return plan.kind == PropertyPlan::Kind::deliver;
                         });
    for (std::uint64_t i = 0; i < element.count;) {
      const std::uint64_t run = uniform ? uniformRun(element, i, targets) : 0;
      if (run > 0) {
        i += run;
        continue;
      }
      if (!readPlannedInstance(element, i, targets, delivers, receiver)) {
        if (delivers || DropsInstances<R>) dropInstance(receiver, static_cast<std::uint32_t>(i));
        return failed("Unable to parse property instance.", element, i);
      }
      ++i;
    }
    return true;
  }

  // Fixed-size records: each planned column is converted for every record the window holds
  // in one loop; delivered properties then go out record by record.
  template <class R>
  bool readPlannedRecords(const Element& element, const BinaryPlan& layout, PlanTargets& targets, bool delivers,
                          R& receiver) {
    const std::uint32_t size = layout.recordSize;
    for (std::uint64_t i = 0; i < element.count;) {
      const std::uint8_t* records = m_window.require(size);
      if (!records) return failed("Unable to parse property instance.", element, i);
      const std::uint64_t run =
          std::min<std::uint64_t>(element.count - i, static_cast<std::uint64_t>(m_window.end() - records) / size);
      targets.reach(i + run);
      for (std::size_t p = 0; p < m_steps.size(); ++p) {
        const Step& step = m_steps[p];
        if (step.plan->kind != PropertyPlan::Kind::scalar) continue;
        step.convert(records + layout.offsets[p], size, run, targets.at(step.plan->array, i, step.plan->offset),
                     targets.stride(step.plan->array));
      }
      if (delivers) deliverRecords(element, layout, records, i, run, receiver);
      m_window.advance(run * size);
      i += run;
    }
    return true;
  }

  template <class R>
  void deliverRecords(const Element& element, const BinaryPlan& layout, const std::uint8_t* records,
                      std::uint64_t first, std::uint64_t run, R& receiver) {
    m_values.resize(1);
    for (std::uint64_t r = 0; r < run; ++r) {
      receiver.beginInstance(static_cast<std::uint32_t>(first + r));
      for (std::size_t p = 0; p < m_steps.size(); ++p) {
        if (m_steps[p].plan->kind != PropertyPlan::Kind::deliver) continue;
        m_values[0] =
            decodeBinary<Swap>(records + r * layout.recordSize + layout.offsets[p], m_steps[p].property->type);
        receiver.plyProperty(element, *m_steps[p].property, m_values);
      }
    }
  }

  // Whether a list of `count` items can go straight to its target in a run of records.
  bool bulkList(const Step& step, std::uint32_t count) const {
    if (count == 0) return false;
    switch (step.plan->kind) {
      case PropertyPlan::Kind::skip:
        return true;
      case PropertyPlan::Kind::indices:
      case PropertyPlan::Kind::itemList: {
        const ListSink& sink = m_plan.sinks[step.plan->sink];
        return !sink.runCounts && count <= sink.maxLength;
      }
      case PropertyPlan::Kind::valueList:
        return count == step.plan->length;
      default:
        return false;
    }
  }

  // An element whose lists have the same lengths from instance to instance (a triangle mesh's
  // faces, with their texture coordinates) is a run of fixed-size records: this reads as many
  // as the window holds at once. 0 when the next instance does not start such a run; it then
  // goes the general way.
  std::uint64_t uniformRun(const Element& element, std::uint64_t first, PlanTargets& targets) {
    std::uint64_t size = 0;
    for (const Step& step : m_steps) {
      if (!step.property->isList) {
        size += step.size;
        continue;
      }
      const std::uint32_t countSize = dataTypeSize(step.property->countType);
      const std::uint8_t* head = size + countSize <= m_window.capacity() ? m_window.require(size + countSize) : nullptr;
      if (!head) return 0;
      const std::uint32_t count =
          listCount(decodeBinary<Swap>(head + size, step.property->countType), step.property->countType);
      if (!bulkList(step, count)) return 0;
      m_runCounts[&step - m_steps.data()] = count;
      size += countSize + std::uint64_t(count) * step.size;
    }
    const std::uint8_t* records = size <= m_window.capacity() ? m_window.require(size) : nullptr;
    if (!records) return 0;
    std::uint64_t run =
        std::min<std::uint64_t>(element.count - first, static_cast<std::uint64_t>(m_window.end() - records) / size);
    std::uint64_t offset = 0;
    for (std::size_t p = 0; p < m_steps.size(); ++p) {
      if (!m_steps[p].property->isList) {
        offset += m_steps[p].size;
        continue;
      }
      const std::uint32_t countSize = dataTypeSize(m_steps[p].property->countType);
      run = equalCounts(records + offset, size, run, countSize);
      offset += countSize + std::uint64_t(m_runCounts[p]) * m_steps[p].size;
    }
    targets.reach(first + run);
    storeUniformRun(records, size, first, run, targets);
    m_window.advance(run * size);
    return run;
  }

  // How many of the `limit` records from `counts` on have the first one's count bytes.
  static std::uint64_t equalCounts(const std::uint8_t* counts, std::uint64_t size, std::uint64_t limit,
                                   std::uint32_t countSize) {
    const auto same = [&]<std::uint32_t Bytes>() {
      std::uint64_t run = 1;
      while (run < limit && std::memcmp(counts + run * size, counts, Bytes) == 0) ++run;
      return run;
    };
    switch (countSize) {
      case 1:
        return same.template operator()<1>();
      case 2:
        return same.template operator()<2>();
      case 4:
        return same.template operator()<4>();
      default:
        return same.template operator()<8>();
    }
  }

  void storeUniformRun(const std::uint8_t* records, std::uint64_t size, std::uint64_t first, std::uint64_t run,
                       PlanTargets& targets) {
    std::uint64_t offset = 0;
    for (std::size_t p = 0; p < m_steps.size(); ++p) {
      const Step& step = m_steps[p];
      const PropertyPlan& plan = *step.plan;
      if (step.property->isList) {
        offset += dataTypeSize(step.property->countType);
        storeListColumns(records + offset, size, first, run, step, m_runCounts[p], targets);
        offset += std::uint64_t(m_runCounts[p]) * step.size;
        continue;
      }
      if (plan.kind == PropertyPlan::Kind::scalar) {
        step.convert(records + offset, size, run, targets.at(plan.array, first, plan.offset),
                     targets.stride(plan.array));
      }
      offset += step.size;
    }
  }

  void storeListColumns(const std::uint8_t* items, std::uint64_t size, std::uint64_t first, std::uint64_t run,
                        const Step& step, std::uint32_t count, PlanTargets& targets) {
    const PropertyPlan& plan = *step.plan;
    if (plan.kind == PropertyPlan::Kind::valueList) {
      for (std::uint32_t k = 0; k < count; ++k) {
        step.convert(items + k * step.size, size, run, targets.at(plan.array, first, plan.offset + 4 * k),
                     targets.stride(plan.array));
      }
    } else if (plan.toSink()) {
      const ListSink& sink = m_plan.sinks[plan.sink];
      base::vector<std::uint32_t>& indices = *sink.items;
      const std::size_t start = indices.size();
      if (indices.capacity() < start + run * count) {
        reserveAhead(sink, m_window.remaining(), m_elementCount - first, count, step.size);
      }
      base::reserveForAppend(indices, run * count);
      indices.resize(start + run * count);
      auto* target = reinterpret_cast<std::byte*>(indices.data() + start);
      for (std::uint32_t k = 0; k < count; ++k)
        step.convert(items + k * step.size, size, run, target + 4 * k, 4 * count);
      checkIndices(indices.data() + start, run * count, sink.vertexCount, m_report);
      if (sink.listCounts) {
        base::reserveForAppend(*sink.listCounts, run);
        sink.listCounts->insert(sink.listCounts->end(), run, static_cast<std::uint16_t>(count));
      }
    }
  }

  template <class R>
  bool readPlannedInstance(const Element& element, std::uint64_t i, PlanTargets& targets, bool delivers, R& receiver) {
    targets.reach(i + 1);
    if (delivers || DropsInstances<R>) receiver.beginInstance(static_cast<std::uint32_t>(i));
    for (const Step& step : m_steps) {
      if (!readPlannedProperty(element, step, i, targets, receiver)) return false;
    }
    return true;
  }

  template <class R>
  bool readPlannedProperty(const Element& element, const Step& step, std::uint64_t i, PlanTargets& targets,
                           R& receiver) {
    const PropertyPlan& plan = *step.plan;
    switch (plan.kind) {
      case PropertyPlan::Kind::skip:
        return skipProperty(*step.property);
      case PropertyPlan::Kind::deliver:
        return deliverProperty(element, *step.property, receiver);
      case PropertyPlan::Kind::scalar: {
        const std::uint8_t* bytes = m_window.require(step.size);
        if (!bytes) return false;
        step.convert(bytes, 0, 1, targets.at(plan.array, i, plan.offset), 0);
        m_window.advance(step.size);
        return true;
      }
      case PropertyPlan::Kind::indices:
      case PropertyPlan::Kind::itemList:
      case PropertyPlan::Kind::valueList:
        break;
    }
    std::uint32_t count = 0;
    if (!readCount(*step.property, count)) return false;
    if (plan.toSink() && count <= m_plan.sinks[plan.sink].maxLength) {
      if (!readIndexItems(step, count)) return false;
      storeList(m_plan.sinks[plan.sink], m_items.data(), count, m_report);
      return true;
    }
    if (plan.kind == PropertyPlan::Kind::valueList && count == plan.length &&
        std::uint64_t(count) * step.size <= m_window.capacity()) {
      // Stored only once every item is there, like a delivered list.
      const std::uint8_t* bytes = m_window.require(std::uint64_t(count) * step.size);
      if (!bytes) return false;
      step.convert(bytes, step.size, count, targets.at(plan.array, i, plan.offset), 4);
      m_window.advance(std::uint64_t(count) * step.size);
      return true;
    }
    // Any other length is the receiver's to judge.
    if (!readItems(*step.property, count)) return false;
    receiver.plyProperty(element, *step.property, m_values);
    return true;
  }

  bool readIndexItems(const Step& step, std::uint32_t count) {
    m_items.clear();
    return readBatches(*step.property, count, [&](const std::uint8_t* bytes, std::size_t done, std::size_t batch) {
      m_items.resize(done + batch);
      step.convert(bytes, step.size, batch, reinterpret_cast<std::byte*>(m_items.data() + done), 4);
    });
  }

  ByteWindow& m_window;
  ValueArray m_values;
  ElementPlan m_plan;
  base::vector<Step> m_steps;
  base::vector<std::uint32_t> m_items;
  base::vector<std::uint32_t> m_runCounts;  ///< each list's length in the current uniform run
  BadIndexReport m_report;
  std::uint64_t m_elementCount = 0;
};

}  // namespace ply::detail
