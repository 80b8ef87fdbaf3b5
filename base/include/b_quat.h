#pragma once

#include "b_components.h"
#include "b_type_traits.h"

#include <tuple>

namespace base {

/// A quaternion x, y, z, w (w is the real part). An aggregate, trivially copyable, and
/// zero (not the identity) when default-initialised, like the other value types.
template <class T>
struct base_quat {
  T x{};
  T y{};
  T z{};
  T w{};

  /// Components in order x, y, z, w (see b_components.h).
  constexpr auto components() noexcept { return std::tie(x, y, z, w); }
  /// Components in order x, y, z, w (see b_components.h).
  constexpr auto components() const noexcept { return std::tie(x, y, z, w); }
  /// Component-wise equality (so NaN components compare unequal).
  friend constexpr bool operator==(const base_quat&, const base_quat&) = default;
};

BASE_TYPE_NAMES(base_quat<float>, "quatf");
BASE_TYPE_NAMES(base_quat<double>, "quatd");

}  // namespace base
