#pragma once

#include "b_components.h"
#include "b_type_traits.h"

#include <tuple>

namespace base {

/// A two-component vector. An aggregate, trivially copyable, zero when default-initialised.
template <class T>
struct base_vec2 {
  T x{};
  T y{};

  /// Components in order x, y (see b_components.h).
  constexpr auto components() noexcept { return std::tie(x, y); }
  /// Components in order x, y (see b_components.h).
  constexpr auto components() const noexcept { return std::tie(x, y); }
  /// Component-wise equality (so NaN components compare unequal).
  friend constexpr bool operator==(const base_vec2&, const base_vec2&) = default;
};

/// A three-component vector. An aggregate, trivially copyable, zero when default-initialised.
template <class T>
struct base_vec3 {
  T x{};
  T y{};
  T z{};

  /// Components in order x, y, z (see b_components.h).
  constexpr auto components() noexcept { return std::tie(x, y, z); }
  /// Components in order x, y, z (see b_components.h).
  constexpr auto components() const noexcept { return std::tie(x, y, z); }
  /// Component-wise equality (so NaN components compare unequal).
  friend constexpr bool operator==(const base_vec3&, const base_vec3&) = default;
};

/// A four-component vector. An aggregate, trivially copyable, zero when default-initialised.
template <class T>
struct base_vec4 {
  T x{};
  T y{};
  T z{};
  T w{};

  /// Components in order x, y, z, w (see b_components.h).
  constexpr auto components() noexcept { return std::tie(x, y, z, w); }
  /// Components in order x, y, z, w (see b_components.h).
  constexpr auto components() const noexcept { return std::tie(x, y, z, w); }
  /// Component-wise equality (so NaN components compare unequal).
  friend constexpr bool operator==(const base_vec4&, const base_vec4&) = default;
};

/// Names "vec2b" ... "vec4d": the suffix gives the component type.
#define BASE_VEC_TYPE_NAMES(Vec, Prefix)             \
  BASE_TYPE_NAMES(Vec<signed char>, Prefix "b");     \
  BASE_TYPE_NAMES(Vec<unsigned char>, Prefix "ub");  \
  BASE_TYPE_NAMES(Vec<short>, Prefix "s");           \
  BASE_TYPE_NAMES(Vec<unsigned short>, Prefix "us"); \
  BASE_TYPE_NAMES(Vec<int>, Prefix "i");             \
  BASE_TYPE_NAMES(Vec<unsigned int>, Prefix "u");    \
  BASE_TYPE_NAMES(Vec<float>, Prefix "f");           \
  BASE_TYPE_NAMES(Vec<double>, Prefix "d")

BASE_VEC_TYPE_NAMES(base_vec2, "vec2");
BASE_VEC_TYPE_NAMES(base_vec3, "vec3");
BASE_VEC_TYPE_NAMES(base_vec4, "vec4");

#undef BASE_VEC_TYPE_NAMES

}  // namespace base
