#include "ply_value.h"

#include "b_exception.h"

#include <bit>
#include <cstdint>

namespace ply {
namespace {

// Truncation toward zero that stays defined for NaN (0) and out-of-range values (clamped).
std::int64_t truncate(double value) {
  if (!(value == value)) return 0;
  if (value >= 9223372036854775807.0) return INT64_MAX;
  if (value <= -9223372036854775808.0) return INT64_MIN;
  return static_cast<std::int64_t>(value);
}

}  // namespace

std::int64_t Value::toInteger(DataType type) const {
  switch (type) {
    case DataType::int8:
    case DataType::int16:
    case DataType::int32:
      return static_cast<std::uint32_t>(i);
    case DataType::uint8:
    case DataType::uint16:
    case DataType::uint32:
      return u;
    case DataType::float32:
      return truncate(f);
    case DataType::float64:
      return truncate(d);
    case DataType::none:
      break;
  }
  base::raise<base::switch_exception>("ply::Value::convertTo");
}

float Value::toFloat(DataType type) const {
  switch (type) {
    case DataType::int8:
    case DataType::int16:
    case DataType::int32:
      return static_cast<float>(i);
    case DataType::uint8:
    case DataType::uint16:
    case DataType::uint32:
      return static_cast<float>(u);
    case DataType::float32:
      return f;
    case DataType::float64:
      return static_cast<float>(d);
    case DataType::none:
      break;
  }
  base::raise<base::switch_exception>("ply::Value::convertTo");
}

float toFP(const Value& value, const Property& property) {
  // Single-precision factors of 1/127, 1/255, 1/32767, 1/65535, 1/2147483647, 1/4294967295.
  static constexpr std::uint32_t factorBits[] = {0x3C010204, 0x3B808081, 0x38000100,
                                                 0x37800080, 0x30000000, 0x2F800000};
  switch (property.type) {
    case DataType::int8:
    case DataType::uint8:
    case DataType::int16:
    case DataType::uint16:
    case DataType::int32:
    case DataType::uint32:
      return value.toFloat(property.type) * std::bit_cast<float>(factorBits[static_cast<int>(property.type)]);
    case DataType::float32:
    case DataType::float64:
      return value.toFloat(property.type);
    case DataType::none:
      break;
  }
  base::raise<base::switch_exception>("ply::toFP");
}

}  // namespace ply
