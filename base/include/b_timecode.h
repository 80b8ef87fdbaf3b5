#pragma once

#include "b_components.h"
#include "b_type_traits.h"

#include <compare>
#include <cstdint>
#include <tuple>

namespace base {

/// A point in time as a count of ticks. Its text and JSON forms are the count itself.
/// An aggregate, trivially copyable, zero when default-initialised.
struct TimeCode {
  std::int64_t ticks{};

  /// The one component, the tick count (see b_components.h).
  constexpr auto components() noexcept { return std::tie(ticks); }
  /// The one component, the tick count (see b_components.h).
  constexpr auto components() const noexcept { return std::tie(ticks); }
  /// Times order by their tick counts.
  friend constexpr auto operator<=>(const TimeCode&, const TimeCode&) = default;
};

BASE_TYPE_NAMES(TimeCode, "timecode");

}  // namespace base
