#pragma once

// What a column plan stores for one value, worked out the slow way through ply::Value: the
// reference that the plans' own conversion loops are held against.

#include "ply_plan.h"
#include "ply_value.h"

#include <bit>
#include <cstdint>

namespace testing_support {

/// The bytes of `value` in the property's own type, as a little number (an int8 of -1 is 0xFF).
inline std::uint64_t nativeBits(const ply::Value& value, const ply::Property& property) {
  std::uint64_t bits = 0;  // the machine is little-endian where the tests run
  ply::storeNative(value, property.type, &bits);
  return bits;
}

/// The 32-bit pattern (the low 32 bits for a native double) that `conversion` stores for `value` of `property`.
inline std::uint32_t storedBits(const ply::Value& value, const ply::Property& property, ply::Conversion conversion) {
  switch (conversion) {
    case ply::Conversion::toFloat:
      return std::bit_cast<std::uint32_t>(value.convertTo<float>(property.type));
    case ply::Conversion::normalised:
      return std::bit_cast<std::uint32_t>(ply::toFP(value, property));
    case ply::Conversion::native:
      return static_cast<std::uint32_t>(nativeBits(value, property));
    case ply::Conversion::toIndex:
      break;
  }
  return static_cast<std::uint32_t>(value.convertTo<std::int64_t>(property.type));
}

}  // namespace testing_support
