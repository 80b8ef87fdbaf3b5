#pragma once

#include <cstddef>
#include <tuple>
#include <type_traits>
#include <utility>

namespace base {

/// A value whose components generic code (printing, parsing, comparing, hashing, JSON) can
/// visit: an arithmetic scalar, which is its own single component, or a value type with a
/// member `components()` that returns a std::tuple of references to its components in order.
template <class T>
concept ComponentValue = std::is_arithmetic_v<std::remove_const_t<T>> || requires(T& value) {
  value.components();
};

/// A std::tuple of references to the components of `value`, in order; const references for
/// a const value. The tuple refers into `value` and must not outlive it. Each element keeps
/// its own type, so mixed values (a matrix of float rotation and double translation) visit
/// every component with its exact type.
template <ComponentValue T>
constexpr auto components(T& value) noexcept {
  if constexpr (std::is_arithmetic_v<std::remove_const_t<T>>) {
    return std::tie(value);
  } else {
    return value.components();
  }
}

/// The number of components of T.
template <ComponentValue T>
inline constexpr std::size_t componentCount = std::tuple_size_v<decltype(components(std::declval<T&>()))>;

/// Component `K` of `value` (0 is the first), by reference.
template <std::size_t K, ComponentValue T>
constexpr auto& component(T& value) noexcept {
  return std::get<K>(components(value));
}

/// The type of component `K` of T, without reference and const.
template <ComponentValue T, std::size_t K>
using component_t = std::remove_cvref_t<decltype(component<K>(std::declval<T&>()))>;

/// Calls `visit(c)` for every component `c` of `value` in order. `c` is a reference of the
/// component's own type, const when `value` is const.
template <ComponentValue T, class F>
constexpr void forEachComponent(T& value, F&& visit) {
  std::apply([&visit](auto&... each) { (visit(each), ...); }, components(value));
}

/// Calls `visit(a_k, b_k)` for the components of two values of one type, pairwise in order.
template <ComponentValue T, ComponentValue U, class F>
requires std::is_same_v<std::remove_const_t<T>, std::remove_const_t<U>>
constexpr void forEachComponent(T& a, U& b, F&& visit) {
  auto left = components(a);
  auto right = components(b);
  [&]<std::size_t... K>(std::index_sequence<K...>) { (visit(std::get<K>(left), std::get<K>(right)), ...); }
  (std::make_index_sequence<std::tuple_size_v<decltype(left)>>{});
}

namespace detail {
/// References to the elements of a row-major array, row after row.
template <class E, std::size_t Rows, std::size_t Columns>
constexpr auto tieRows(E (&rows)[Rows][Columns]) noexcept {
  return [&rows]<std::size_t... I>(std::index_sequence<I...>) { return std::tie(rows[I / Columns][I % Columns]...); }
  (std::make_index_sequence<Rows * Columns>{});
}
}  // namespace detail

}  // namespace base
