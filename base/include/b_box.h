#pragma once

#include "b_components.h"
#include "b_type_traits.h"
#include "b_vec.h"

#include <tuple>

namespace base {

/// An axis-aligned box between two corners, V being base_vec2<T> or base_vec3<T>. An
/// aggregate, trivially copyable, zero when default-initialised; nothing enforces
/// min <= max, so an empty or inverted box is representable.
template <class V>
struct base_box {
  V min{};
  V max{};

  /// The components of min, then those of max (see b_components.h).
  constexpr auto components() noexcept { return std::tuple_cat(base::components(min), base::components(max)); }
  /// The components of min, then those of max (see b_components.h).
  constexpr auto components() const noexcept { return std::tuple_cat(base::components(min), base::components(max)); }
  /// Corner-wise equality.
  friend constexpr bool operator==(const base_box&, const base_box&) = default;
};

/// Names "box2i" ... "box3d": the suffix gives the component type.
#define BASE_BOX_TYPE_NAMES(Vec, Prefix)                    \
  BASE_TYPE_NAMES(base_box<Vec<int>>, Prefix "i");          \
  BASE_TYPE_NAMES(base_box<Vec<unsigned int>>, Prefix "u"); \
  BASE_TYPE_NAMES(base_box<Vec<float>>, Prefix "f");        \
  BASE_TYPE_NAMES(base_box<Vec<double>>, Prefix "d")

BASE_BOX_TYPE_NAMES(base_vec2, "box2");
BASE_BOX_TYPE_NAMES(base_vec3, "box3");

#undef BASE_BOX_TYPE_NAMES

}  // namespace base
