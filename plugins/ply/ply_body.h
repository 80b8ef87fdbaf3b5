#pragma once

// The body readers behind ply::parseFile. They are templates over the receiver; what can be
// decided once per element (sizes, offsets, byte swapping) is decided before the instance
// loop, so that the loop does only the per-value work.

#include "b_exception.h"
#include "b_log.h"
#include "ply_format.h"
#include "ply_text.h"
#include "ply_value.h"
#include "ply_window.h"

#include <bit>
#include <cstdint>
#include <cstring>

namespace ply::detail {

bool parseHeader(Header& header, ByteWindow& window, base::Stream& stream);

/// Logs that the data ended inside `element` after `read` complete instances.
void warnEndedEarly(const Element& element, std::uint64_t read);

inline std::uint16_t swapBytes(std::uint16_t value) { return __builtin_bswap16(value); }
inline std::uint32_t swapBytes(std::uint32_t value) { return __builtin_bswap32(value); }
inline std::uint64_t swapBytes(std::uint64_t value) { return __builtin_bswap64(value); }

/// The unsigned integer of sizeof(T) bytes at `bytes`, byte-swapped when `Swap`.
template <class T, bool Swap>
inline T load(const std::uint8_t* bytes) {
  T raw;
  std::memcpy(&raw, bytes, sizeof raw);
  if constexpr (Swap) raw = swapBytes(raw);
  return raw;
}

/// One binary value of `type` at `bytes`, byte-swapped when `Swap`; the member written is
/// the one the type reads from.
template <bool Swap>
inline Value decodeBinary(const std::uint8_t* bytes, DataType type) {
  Value value;
  switch (type) {
    case DataType::int8:
      value.i = static_cast<std::int8_t>(bytes[0]);
      break;
    case DataType::uint8:
      value.u = bytes[0];
      break;
    case DataType::int16:
      value.i = std::bit_cast<std::int16_t>(load<std::uint16_t, Swap>(bytes));
      break;
    case DataType::uint16:
      value.u = load<std::uint16_t, Swap>(bytes);
      break;
    case DataType::int32:
      value.i = std::bit_cast<std::int32_t>(load<std::uint32_t, Swap>(bytes));
      break;
    case DataType::uint32:
      value.u = load<std::uint32_t, Swap>(bytes);
      break;
    case DataType::float32:
      value.f = std::bit_cast<float>(load<std::uint32_t, Swap>(bytes));
      break;
    case DataType::float64:
      value.d = std::bit_cast<double>(load<std::uint64_t, Swap>(bytes));
      break;
    default:
      base::raise<base::switch_exception>("ply::PropertyInstance::parseValue");
  }
  return value;
}

/// The low 32 bits of a list count, as the format's readers take them.
inline std::uint32_t listCount(const Value& count, DataType type) {
  return static_cast<std::uint32_t>(count.convertTo<std::int64_t>(type));
}

/// The per-element reading plan of a binary body.
struct BinaryPlan {
  /// Bytes of one instance when no property is a list; 0 otherwise.
  std::uint32_t recordSize = 0;
  /// Offset of each scalar property within the record.
  base::vector<std::uint32_t> offsets;

  explicit BinaryPlan(const Element& element);
};

template <bool Swap>
class BinaryBody {
 public:
  explicit BinaryBody(ByteWindow& window) : m_window(window) {}

  template <class R>
  bool read(const Header& header, R& receiver) {
    for (const Element& element : header.elements) {
      const bool deliver = receiver.plyElement(element);
      if (element.count == 0 || element.properties.empty()) continue;
      const BinaryPlan plan(element);
      const bool complete = deliver ? readElement(element, plan, receiver) : skipElement(element, plan);
      if (!complete) return false;
    }
    return true;
  }

 private:
  template <class R>
  bool readElement(const Element& element, const BinaryPlan& plan, R& receiver) {
    if (plan.recordSize > 0) return readRecords(element, plan, receiver);
    for (std::uint32_t i = 0; i < element.count; ++i) {
      receiver.beginInstance(i);
      for (const Property& property : element.properties) {
        if (!readProperty(element, property, receiver)) return failed("Unable to parse property instance.", element, i);
      }
    }
    return true;
  }

  // Elements of scalars only: fixed-size records read straight out of the window. This is
  // the hot loop for vertices.
  template <class R>
  bool readRecords(const Element& element, const BinaryPlan& plan, R& receiver) {
    m_values.resize(1);
    const std::size_t propertyCount = element.properties.size();
    for (std::uint32_t i = 0; i < element.count; ++i) {
      const std::uint8_t* record = m_window.require(plan.recordSize);
      if (!record) return failed("Unable to parse property instance.", element, i);
      receiver.beginInstance(i);
      for (std::size_t p = 0; p < propertyCount; ++p) {
        const Property& property = element.properties[p];
        m_values[0] = decodeBinary<Swap>(record + plan.offsets[p], property.type);
        receiver.plyProperty(element, property, m_values);
      }
      m_window.advance(plan.recordSize);
    }
    return true;
  }

  template <class R>
  bool readProperty(const Element& element, const Property& property, R& receiver) {
    if (!property.isList) {
      const std::uint32_t size = dataTypeSize(property.type);
      const std::uint8_t* bytes = m_window.require(size);
      if (!bytes) return false;
      m_values.resize(1);
      m_values[0] = decodeBinary<Swap>(bytes, property.type);
      m_window.advance(size);
    } else if (!readList(property)) {
      return false;
    }
    receiver.plyProperty(element, property, m_values);
    return true;
  }

  // Items come in batches that fit the window, so the array grows only as far as the data
  // really goes, whatever the count says.
  bool readList(const Property& property) {
    std::uint32_t count = 0;
    if (!readCount(property, count)) return false;
    const std::uint32_t itemSize = dataTypeSize(property.type);
    const std::size_t batchLimit = m_window.capacity() / itemSize;
    m_values.clear();
    for (std::size_t done = 0; done < count;) {
      const std::size_t batch = std::min<std::size_t>(count - done, batchLimit);
      const std::uint8_t* bytes = m_window.require(batch * itemSize);
      if (!bytes) return false;
      m_values.resize(done + batch);
      for (std::size_t k = 0; k < batch; ++k)
        m_values[done + k] = decodeBinary<Swap>(bytes + k * itemSize, property.type);
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

  bool skipElement(const Element& element, const BinaryPlan& plan) {
    if (plan.recordSize > 0) {
      const std::uint64_t start = m_window.position();
      if (m_window.skip(std::uint64_t(plan.recordSize) * element.count)) return true;
      return failed("Unable to skip property instance.", element, (m_window.position() - start) / plan.recordSize);
    }
    for (std::uint32_t i = 0; i < element.count; ++i) {
      for (const Property& property : element.properties) {
        std::uint32_t count = 1;
        if (property.isList && !readCount(property, count))
          return failed("Unable to skip property instance.", element, i);
        if (!m_window.skip(std::uint64_t(count) * dataTypeSize(property.type))) {
          return failed("Unable to skip property instance.", element, i);
        }
      }
    }
    return true;
  }

  bool failed(std::string_view message, const Element& element, std::uint64_t read) {
    base::log().message(base::logScene, base::logError, message);
    warnEndedEarly(element, read);
    return false;
  }

  ByteWindow& m_window;
  ValueArray m_values;
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
      readElement(element, deliver, receiver);
    }
    return !m_ended;
  }

 private:
  enum class Status { ok, invalid, ended };

  template <class R>
  void readElement(const Element& element, bool deliver, R& receiver) {
    for (std::uint32_t i = 0; i < element.count; ++i) {
      if (deliver) receiver.beginInstance(i);
      const Status status = readInstance(element, deliver, receiver);
      if (status == Status::ended) {
        m_ended = true;
        warnEndedEarly(element, i);
        return;
      }
      if (status == Status::invalid) {
        base::log().message(base::logScene, base::logWarning,
                            "Unable to parse property instance. Skipping this element instance");
        skipLine(m_window);
      }
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
      } else if (const Status status = readList(property, word, deliver); status != Status::ok) {
        return status;
      }
      if (deliver) receiver.plyProperty(element, property, m_values);
    }
    return Status::ok;
  }

  // The items are appended as their words arrive, so a count from the file never sizes the
  // array on its own.
  Status readList(const Property& property, std::string_view countWord, bool deliver) {
    const std::uint32_t count = listCount(parseAsciiValue(countWord, property.countType), property.countType);
    m_values.clear();
    for (std::uint32_t k = 0; k < count; ++k) {
      std::string_view word;
      if (const Status status = nextWord(word); status != Status::ok) return status;
      if (deliver) base::append(m_values, parseAsciiValue(word, property.type));
    }
    return Status::ok;
  }

  // A value's word; a "comment" line where a value is expected is skipped once.
  Status nextWord(std::string_view& word) {
    word = m_words.read(m_window);
    if (word == "comment") {
      skipLine(m_window);
      word = m_words.read(m_window);
    }
    if (!word.empty()) return Status::ok;
    return m_window.peek() < 0 ? Status::ended : Status::invalid;
  }

  ByteWindow& m_window;
  WordReader m_words;
  ValueArray m_values;
  bool m_ended = false;
};

}  // namespace ply::detail
