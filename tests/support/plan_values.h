#pragma once

// What a column plan stores for one value, worked out the slow way through ply::Value: the
// reference that the plans' own conversion loops are held against.

#include "ply_plan.h"
#include "ply_value.h"

#include <bit>
#include <cstdint>

namespace testing_support {

/// The 32-bit pattern that `conversion` stores for `value` of `property`.
inline std::uint32_t storedBits(const ply::Value& value, const ply::Property& property, ply::Conversion conversion) {
  switch (conversion) {
    case ply::Conversion::toFloat:
      return std::bit_cast<std::uint32_t>(value.convertTo<float>(property.type));
    case ply::Conversion::normalised:
      return std::bit_cast<std::uint32_t>(ply::toFP(value, property));
    case ply::Conversion::toIndex:
      break;
  }
  return static_cast<std::uint32_t>(value.convertTo<std::int64_t>(property.type));
}

}  // namespace testing_support
