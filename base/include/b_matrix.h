#pragma once

#include "b_components.h"
#include "b_type_traits.h"
#include "b_vec.h"

#include <tuple>
#include <type_traits>

namespace base {

/// A 2x2 matrix, m[row][column]. An aggregate, trivially copyable, zero (not the identity)
/// when default-initialised.
template <class T>
struct base_mat22 {
  T m[2][2]{};

  /// The elements row by row (see b_components.h).
  constexpr auto components() noexcept { return detail::tieRows(m); }
  /// The elements row by row (see b_components.h).
  constexpr auto components() const noexcept { return detail::tieRows(m); }
  /// Element-wise equality.
  friend constexpr bool operator==(const base_mat22&, const base_mat22&) = default;
};

/// A 3x3 matrix, m[row][column]. An aggregate, trivially copyable, zero (not the identity)
/// when default-initialised.
template <class T>
struct base_mat33 {
  T m[3][3]{};

  /// The elements row by row (see b_components.h).
  constexpr auto components() noexcept { return detail::tieRows(m); }
  /// The elements row by row (see b_components.h).
  constexpr auto components() const noexcept { return detail::tieRows(m); }
  /// Element-wise equality.
  friend constexpr bool operator==(const base_mat33&, const base_mat33&) = default;
};

/// A rigid transform: a rotation part M whose elements are of type R, then a translation
/// of type T. The translation may be wider than the rotation (float rotation, double
/// translation) so that large world positions keep their precision.
template <class R, class T, class M>
struct base_mat43 {
  static_assert(std::is_same_v<component_t<M, 0>, R>, "the rotation part's elements must be of type R");

  M rotation{};
  base_vec3<T> translation{};

  /// The rotation's elements row by row, then the translation x, y, z (see b_components.h).
  constexpr auto components() noexcept {
    return std::tuple_cat(base::components(rotation), base::components(translation));
  }
  /// The rotation's elements row by row, then the translation x, y, z (see b_components.h).
  constexpr auto components() const noexcept {
    return std::tuple_cat(base::components(rotation), base::components(translation));
  }
  /// Element-wise equality.
  friend constexpr bool operator==(const base_mat43&, const base_mat43&) = default;
};

namespace detail {
// The macro takes one argument per comma, so the three-argument type goes by an alias.
using mat43f_type = base_mat43<float, double, base_mat33<float>>;
}  // namespace detail

BASE_TYPE_NAMES(base_mat22<float>, "mat22f");
BASE_TYPE_NAMES(base_mat22<double>, "mat22d");
BASE_TYPE_NAMES(base_mat33<float>, "mat33f");
BASE_TYPE_NAMES(detail::mat43f_type, "mat43f");

}  // namespace base
