#pragma once

#include "b_components.h"
#include "b_type_traits.h"

#include <tuple>

namespace base {

/// A colour with alpha. An aggregate, trivially copyable, all zero (alpha too) when
/// default-initialised.
template <class T>
struct base_color4 {
  T r{};
  T g{};
  T b{};
  T a{};

  /// Components in order r, g, b, a (see b_components.h).
  constexpr auto components() noexcept { return std::tie(r, g, b, a); }
  /// Components in order r, g, b, a (see b_components.h).
  constexpr auto components() const noexcept { return std::tie(r, g, b, a); }
  /// Component-wise equality (so NaN components compare unequal).
  friend constexpr bool operator==(const base_color4&, const base_color4&) = default;
};

BASE_TYPE_NAMES(base_color4<float>, "color4f");

}  // namespace base
