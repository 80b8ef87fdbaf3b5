#pragma once

#include "b_containers.h"
#include "ply_format.h"

#include <cstdint>

namespace ply {

/// One value as read. Which member holds it follows from the property's data type: the
/// signed types sign-extended in `i`, the unsigned ones zero-extended in `u`, float in `f`,
/// double in `d`.
union Value {
  std::int32_t i;
  std::uint32_t u;
  float f;
  double d;

  /// To an integer: the integer types give their 32-bit pattern read as unsigned (a negative
  /// value becomes a large number); float and double are truncated toward zero.
  std::int64_t toInteger(DataType type) const;
  /// To a float: signed types from the signed value, unsigned from the unsigned, float as
  /// is, double rounded.
  float toFloat(DataType type) const;

  /// `convertTo<std::int64_t>` and `convertTo<float>`: the two conversions above.
  template <class T>
  T convertTo(DataType type) const {
    if constexpr (std::is_same_v<T, float>) {
      return toFloat(type);
    } else {
      static_assert(std::is_same_v<T, std::int64_t>, "ply::Value converts to std::int64_t or float");
      return toInteger(type);
    }
  }
};
static_assert(sizeof(Value) == 8);

/// The values of one property instance: one for a scalar, the list's items for a list.
using ValueArray = base::vector<Value>;

/// Writes the value in the bytes of its own type (dataTypeSize(type) of them, in the
/// machine's order): an integer keeps its low bits, as a cast does.
void storeNative(const Value& value, DataType type, void* target);

/// The float conversion, with integer types normalised by one over the type's largest value
/// (uchar 255 gives 1.0); floats and doubles unchanged.
float toFP(const Value& value, const Property& property);

}  // namespace ply
