#pragma once

#include "b_components.h"
#include "b_type_traits.h"

#include <tuple>

namespace base {

/// A surface normal of three floats; its own type so that attributes can tell normals from
/// positions. An aggregate, trivially copyable, zero when default-initialised.
struct normal {
  float x{};
  float y{};
  float z{};

  /// Components in order x, y, z (see b_components.h).
  constexpr auto components() noexcept { return std::tie(x, y, z); }
  /// Components in order x, y, z (see b_components.h).
  constexpr auto components() const noexcept { return std::tie(x, y, z); }
  /// Component-wise equality (so NaN components compare unequal).
  friend constexpr bool operator==(const normal&, const normal&) = default;
};

BASE_TYPE_NAMES(normal, "normal");

}  // namespace base
