#pragma once

#include "b_alloc.h"

#include <cstddef>
#include <map>
#include <string>
#include <vector>

namespace base {

/// Strings and containers over the host allocator. A string keeps up to 15 characters inline.
using string = std::basic_string<char, std::char_traits<char>, Allocator<char>>;
template <class T>
using vector = std::vector<T, Allocator<T>>;
template <class K, class V, class Less = std::less<K>>
using map = std::map<K, V, Less, Allocator<std::pair<const K, V>>>;

/// The capacity that a full array of `capacity` elements of `elementSize` bytes grows to:
/// an empty array gets one element; up to 1 MiB of payload the capacity doubles, up to
/// 512 MiB it grows by half, up to 0x41800000 bytes by a third, beyond that by a quarter.
/// The result is at least `needed`.
BASE1_API std::size_t grownCapacity(std::size_t capacity, std::size_t elementSize, std::size_t needed);

/// Makes room for `extra` more elements at the end by the growth rule above, so that
/// appends reallocate as the rule says rather than as the standard library chooses.
template <class Container>
void reserveForAppend(Container& container, std::size_t extra) {
  const std::size_t needed = container.size() + extra;
  if (needed > container.capacity()) {
    container.reserve(grownCapacity(container.capacity(), sizeof(typename Container::value_type), needed));
  }
}

/// Frees the container's storage. (`container = {}` keeps it: that assigns an empty
/// initializer list, which clears without giving the room back.)
template <class Container>
void release(Container& container) {
  Container().swap(container);
}

/// Appends one element by the growth rule.
template <class Container, class Value>
void append(Container& container, Value&& value) {
  reserveForAppend(container, 1);
  container.push_back(std::forward<Value>(value));
}

}  // namespace base
