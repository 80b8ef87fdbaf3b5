#pragma once

// The ASCII body reader: per property instance through the receiver, or, where the receiver
// answers an element with a plan, each word parsed straight into its target.

#include "ply_body.h"

#include <cstdint>
#include <cstring>

namespace ply::detail {

/// Parses a word as a value of one type and stores it by one conversion.
using WordFunction = void (*)(std::string_view word, std::byte* target);

template <DataType T, Conversion C>
void storeWord(std::string_view word, std::byte* target) {
  const auto stored = convertHeld<T, C>(parseAsciiHeld<T>(word));
  std::memcpy(target, &stored, sizeof stored);
}

/// Parses the value at `at` in the window and stores it, for the common forms of words;
/// null when the word must be read as a word instead (see parseAsciiFast).
using FastFunction = const char* (*)(const char* at, const char* end, std::byte* target);

template <DataType T, Conversion C>
const char* storeFast(const char* at, const char* end, std::byte* target) {
  Held<T> value{};
  const char* stop = parseAsciiFast<T>(at, end, value);
  if (stop) {
    const auto stored = convertHeld<T, C>(value);
    std::memcpy(target, &stored, sizeof stored);
  }
  return stop;
}

/// How one planned property's words are stored: straight from the window when they allow
/// it, else word by word.
struct WordStore {
  FastFunction fast;
  WordFunction word;

  WordStore(DataType type, Conversion conversion)
      : fast(forTypeAndConversion(type, conversion,
                                  []<DataType T, Conversion C>() -> FastFunction { return storeFast<T, C>; })),
        word(forTypeAndConversion(type, conversion,
                                  []<DataType T, Conversion C>() -> WordFunction { return storeWord<T, C>; })) {}
};

class AsciiBody {
 public:
  explicit AsciiBody(ByteWindow& window) : m_window(window) {}

  /// Reads every element; false when the data ended early. After the end, later elements
  /// are still announced to the receiver and reported as empty.
  template <class R>
  bool read(const Header& header, R& receiver) {
    for (const Element& element : header.elements) {
      const bool deliver = receiver.plyElement(element);
      if (element.count == 0 || element.properties.empty()) continue;
      if (m_ended) {
        warnEndedEarly(element, 0);
        continue;
      }
      if (deliver && askPlan(receiver, element, m_plan)) {
        readPlanned(element, receiver);
        m_report.finish(element);
      } else {
        readInstances(element, receiver, deliver,
                      [&](std::uint32_t) { return readInstance(element, deliver, receiver); });
      }
      m_skipped.finish(element);
    }
    return !m_ended;
  }

 private:
  enum class Status { ok, invalid, ended };

  // An instance that cannot be read has its line skipped; the end of the data ends the body.
  // Each instance is begun with the receiver when `begins`, and a begun instance that could
  // not be read whole is dropped with it.
  template <class R, class ReadOne>
  void readInstances(const Element& element, R& receiver, bool begins, ReadOne readOne) {
    for (std::uint32_t i = 0; i < element.count; ++i) {
      if (begins) receiver.beginInstance(i);
      const Status status = readOne(i);
      if (status == Status::ok) continue;
      if (begins) dropInstance(receiver, i);
      if (status == Status::ended) {
        m_ended = true;
        warnEndedEarly(element, i);
        return;
      }
      m_skipped.note();
      skipLine(m_window);
    }
  }

  template <class R>
  Status readInstance(const Element& element, bool deliver, R& receiver) {
    for (const Property& property : element.properties) {
      std::string_view word;
      if (const Status status = nextWord(word); status != Status::ok) return status;
      if (!property.isList) {
        if (!deliver) continue;
        m_values.resize(1);
        m_values[0] = parseAsciiValue(word, property.type);
      } else if (const Status status = readList(property, countOf(word, property), deliver); status != Status::ok) {
        return status;
      }
      if (deliver) receiver.plyProperty(element, property, m_values);
    }
    return Status::ok;
  }

  // The items are appended as their words arrive, so a count from the file never sizes the
  // array on its own.
  Status readList(const Property& property, std::uint32_t count, bool deliver) {
    m_values.clear();
    for (std::uint32_t k = 0; k < count; ++k) {
      std::string_view word;
      if (const Status status = nextWord(word); status != Status::ok) return status;
      if (deliver) base::append(m_values, parseAsciiValue(word, property.type));
    }
    return Status::ok;
  }

  static std::uint32_t countOf(std::string_view word, const Property& property) {
    return listCount(parseAsciiValue(word, property.countType), property.countType);
  }

  // A value's word; a "comment" line where a value is expected is skipped once. The first
  // byte decides before the whole word is compared, as numbers never start with 'c'.
  Status nextWord(std::string_view& word) {
    word = m_words.read(m_window);
    if (!word.empty() && word.front() == 'c' && word == "comment") {
      skipLine(m_window);
      word = m_words.read(m_window);
    }
    if (!word.empty()) return Status::ok;
    return m_window.peek() < 0 ? Status::ended : Status::invalid;
  }

  // ---- Through a plan.

  // The next value, stored straight from the window when its word allows, else read as a
  // word; "comment" lines and bytes that start no word take the word path.
  Status storeNext(const WordStore& store, std::byte* target) {
    const auto* cursor = reinterpret_cast<const char*>(m_window.cursor());
    const auto* end = reinterpret_cast<const char*>(m_window.end());
    const char* at = cursor;
    while (at != end && isBlank(*at)) ++at;
    if (const char* stop = store.fast(at, end, target)) {
      m_window.advance(static_cast<std::size_t>(stop - cursor));
      return Status::ok;
    }
    std::string_view word;
    if (const Status status = nextWord(word); status != Status::ok) return status;
    store.word(word, target);
    return Status::ok;
  }

  template <class R>
  void readPlanned(const Element& element, R& receiver) {
    m_store.clear();
    m_counts.clear();
    for (std::size_t p = 0; p < element.properties.size(); ++p) {
      const PropertyPlan& plan = m_plan.properties[p];
      base::append(m_store, WordStore(element.properties[p].type, plan.storedAs()));
      base::append(m_counts, WordStore(element.properties[p].countType, Conversion::toIndex));
    }
    PlanTargets targets(m_plan, element.count, m_window.remaining().has_value());
    m_count = element.count;
    readInstances(element, receiver, m_plan.delivers() || DropsInstances<R>, [&](std::uint32_t i) {
      targets.reach(std::uint64_t(i) + 1);
      return readPlannedInstance(element, i, targets, receiver);
    });
  }

  template <class R>
  Status readPlannedInstance(const Element& element, std::uint32_t i, PlanTargets& targets, R& receiver) {
    for (std::size_t p = 0; p < element.properties.size(); ++p) {
      const Property& property = element.properties[p];
      const PropertyPlan& plan = m_plan.properties[p];
      if (plan.kind == PropertyPlan::Kind::scalar) {
        if (const Status status = storeNext(m_store[p], targets.at(plan.array, i, plan.offset)); status != Status::ok) {
          return status;
        }
        continue;
      }
      const Status status = property.isList ? readPlannedList(element, property, plan, p, i, targets, receiver)
                                            : deliverScalar(element, property, plan, receiver);
      if (status != Status::ok) return status;
    }
    return Status::ok;
  }

  template <class R>
  Status deliverScalar(const Element& element, const Property& property, const PropertyPlan& plan, R& receiver) {
    std::string_view word;
    if (const Status status = nextWord(word); status != Status::ok) return status;
    if (plan.kind != PropertyPlan::Kind::deliver) return Status::ok;
    m_values.resize(1);
    m_values[0] = parseAsciiValue(word, property.type);
    receiver.plyProperty(element, property, m_values);
    return Status::ok;
  }

  template <class R>
  Status readPlannedList(const Element& element, const Property& property, const PropertyPlan& plan, std::size_t p,
                         std::uint32_t i, PlanTargets& targets, R& receiver) {
    // A list count is the low 32 bits of its integer, as the index conversion stores it.
    std::uint32_t count = 0;
    if (const Status status = storeNext(m_counts[p], reinterpret_cast<std::byte*>(&count)); status != Status::ok) {
      return status;
    }
    const bool toSink = plan.toSink() && count <= m_plan.sinks[plan.sink].maxLength;
    const bool values = plan.kind == PropertyPlan::Kind::valueList && count == plan.length;
    if (!toSink && !values) {
      const bool deliver = plan.kind != PropertyPlan::Kind::skip;
      if (const Status status = readList(property, count, deliver); status != Status::ok) return status;
      if (deliver) receiver.plyProperty(element, property, m_values);
      return Status::ok;
    }
    // Kept aside until the list is complete, as a delivered list would be; grown as the
    // words arrive.
    m_items.clear();
    for (std::uint32_t k = 0; k < count; ++k) {
      base::reserveForAppend(m_items, 1);
      m_items.emplace_back();
      if (const Status status = storeNext(m_store[p], reinterpret_cast<std::byte*>(&m_items.back()));
          status != Status::ok) {
        return status;
      }
    }
    if (toSink) {
      const ListSink& sink = m_plan.sinks[plan.sink];
      // An ASCII item takes at least two bytes: a digit and a blank.
      if (sink.items->capacity() < sink.items->size() + count) {
        reserveAhead(sink, m_window.remaining(), std::uint64_t(m_count) - i, count, 2);
      }
      storeList(sink, m_items.data(), count, m_report);
    } else {
      std::memcpy(targets.at(plan.array, i, plan.offset), m_items.data(), std::size_t(count) * 4);
    }
    return Status::ok;
  }

  ByteWindow& m_window;
  WordReader m_words;
  ValueArray m_values;
  bool m_ended = false;
  ElementPlan m_plan;
  base::vector<WordStore> m_store;
  base::vector<WordStore> m_counts;
  std::uint32_t m_count = 0;  ///< instances of the planned element
  base::vector<std::uint32_t> m_items;
  BadIndexReport m_report;
  SkippedLineReport m_skipped;
};

}  // namespace ply::detail
