#include "ply_value.h"

#include "b_exception.h"

#include <cstdint>
#include <limits>

namespace ply {
namespace {

// Truncation toward zero that stays defined for NaN (0) and out-of-range values (clamped).
std::int64_t truncate(double value) {
  if (!(value == value)) return 0;
  if (value >= 9223372036854775807.0) return INT64_MAX;
  if (value <= -9223372036854775808.0) return INT64_MIN;
  return static_cast<std::int64_t>(value);
}

// One over the type's largest value, in single precision: uchar gives 1/255.
template <class T>
constexpr float unitFactor = 1.0f / static_cast<float>(std::numeric_limits<T>::max());

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
  static constexpr float factors[] = {unitFactor<std::int8_t>,   unitFactor<std::uint8_t>, unitFactor<std::int16_t>,
                                      unitFactor<std::uint16_t>, unitFactor<std::int32_t>, unitFactor<std::uint32_t>};
  switch (property.type) {
    case DataType::int8:
    case DataType::uint8:
    case DataType::int16:
    case DataType::uint16:
    case DataType::int32:
    case DataType::uint32:
      return value.toFloat(property.type) * factors[static_cast<int>(property.type)];
    case DataType::float32:
    case DataType::float64:
      return value.toFloat(property.type);
    case DataType::none:
      break;
  }
  base::raise<base::switch_exception>("ply::toFP");
}

}  // namespace ply
