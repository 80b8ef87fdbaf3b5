#include "ply_value.h"

#include "b_exception.h"
#include "ply_columns.h"

#include <cstdint>
#include <cstring>
#include <limits>

namespace ply {
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
      return detail::truncateToInteger(f);
    case DataType::float64:
      return detail::truncateToInteger(d);
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
  static constexpr float factors[] = {detail::unitFactor<std::int8_t>,  detail::unitFactor<std::uint8_t>,
                                      detail::unitFactor<std::int16_t>, detail::unitFactor<std::uint16_t>,
                                      detail::unitFactor<std::int32_t>, detail::unitFactor<std::uint32_t>};
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

void storeNative(const Value& value, DataType type, void* target) {
  const auto store = [target](auto native) { std::memcpy(target, &native, sizeof native); };
  switch (type) {
    case DataType::int8:
      return store(static_cast<std::int8_t>(value.i));
    case DataType::uint8:
      return store(static_cast<std::uint8_t>(value.u));
    case DataType::int16:
      return store(static_cast<std::int16_t>(value.i));
    case DataType::uint16:
      return store(static_cast<std::uint16_t>(value.u));
    case DataType::int32:
      return store(value.i);
    case DataType::uint32:
      return store(value.u);
    case DataType::float32:
      return store(value.f);
    case DataType::float64:
      return store(value.d);
    case DataType::none:
      break;
  }
}

}  // namespace ply
