#pragma once

// What the body readers behind ply::parseFile share. They are templates over the receiver;
// what can be decided once per element (sizes, offsets, byte swapping, a receiver's plan) is
// decided before the instance loop, so that the loop does only the per-value work.

#include "b_exception.h"
#include "b_log.h"
#include "ply_columns.h"
#include "ply_format.h"
#include "ply_plan.h"
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

/// Whether a receiver wants to hear of instances that could not be read whole.
template <class R>
concept DropsInstances = requires(R& receiver, std::uint32_t index) {
  receiver.dropInstance(index);
};

/// Tells a receiver that wants to hear of it that instance `index`, begun with
/// beginInstance, could not be read whole.
template <class R>
void dropInstance(R& receiver, std::uint32_t index) {
  if constexpr (DropsInstances<R>) receiver.dropInstance(index);
}

/// Reports ASCII instances whose line could not be parsed and was skipped: the first few
/// with their own line, then, when the element ends, one line with the element's name and
/// the counts, so that a file of many bad lines neither floods the log nor hides how many.
class SkippedLineReport {
 public:
  static constexpr std::uint64_t linesPerElement = 10;

  void note();
  /// Logs the total, if any, and starts over.
  void finish(const Element& element);

 private:
  std::uint64_t m_count = 0;
};

/// One binary value of `type` at `bytes`, byte-swapped when `Swap`; the member written is
/// the one the type reads from.
template <bool Swap>
inline Value decodeBinary(const std::uint8_t* bytes, DataType type) {
  Value value;
  switch (type) {
    case DataType::int8:
      value.i = loadAs<std::int8_t, Swap>(bytes);
      break;
    case DataType::uint8:
      value.u = loadAs<std::uint8_t, Swap>(bytes);
      break;
    case DataType::int16:
      value.i = loadAs<std::int16_t, Swap>(bytes);
      break;
    case DataType::uint16:
      value.u = loadAs<std::uint16_t, Swap>(bytes);
      break;
    case DataType::int32:
      value.i = loadAs<std::int32_t, Swap>(bytes);
      break;
    case DataType::uint32:
      value.u = loadAs<std::uint32_t, Swap>(bytes);
      break;
    case DataType::float32:
      value.f = loadAs<float, Swap>(bytes);
      break;
    case DataType::float64:
      value.d = loadAs<double, Swap>(bytes);
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

/// Asks a receiver that makes plans for the plan of `element`; false when it has none or
/// makes none. A plan that does not cover every property, or names targets outside its
/// arrays, is the receiver's fault and throws base::invalid_argument.
template <class R>
bool askPlan(R& receiver, const Element& element, ElementPlan& plan) {
  if constexpr (requires { receiver.plyPlan(element, plan); }) {
    plan.clear();
    if (!receiver.plyPlan(element, plan)) return false;
    if (!plan.fits(element)) {
      base::raise<base::invalid_argument>("ply::readFile", "plan");
    }
    return true;
  } else {
    return false;
  }
}

/// How a binary element's instances are laid out.
struct BinaryPlan {
  /// Bytes of one instance when no property is a list; 0 otherwise.
  std::uint32_t recordSize = 0;
  /// Offset of each scalar property within the record.
  base::vector<std::uint32_t> offsets;

  explicit BinaryPlan(const Element& element);
};

}  // namespace ply::detail
