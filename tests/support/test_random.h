#pragma once

#include <cstdint>
#include <iterator>
#include <utility>
#include <vector>

namespace testing_support {

/// Random numbers that a seed makes the same on every platform and compiler: splitmix64,
/// with distributions of its own (the standard library's differ between implementations).
class Random {
 public:
  explicit Random(std::uint64_t seed) : m_state(seed) {}

  std::uint64_t next() {
    std::uint64_t z = (m_state += 0x9E3779B97F4A7C15ull);
    z = (z ^ (z >> 30)) * 0xBF58476D1CE4E5B9ull;
    z = (z ^ (z >> 27)) * 0x94D049BB133111EBull;
    return z ^ (z >> 31);
  }
  /// A number in [0, n); 0 when n is 0.
  std::uint64_t below(std::uint64_t n) { return n == 0 ? 0 : next() % n; }
  /// A number in [low, high].
  std::int64_t between(std::int64_t low, std::int64_t high) {
    return low + static_cast<std::int64_t>(below(static_cast<std::uint64_t>(high - low) + 1));
  }
  /// True `percent` times in a hundred.
  bool chance(unsigned percent) { return below(100) < percent; }
  /// A number in [0, 1) with 53 random bits.
  double unit() { return static_cast<double>(next() >> 11) * 0x1.0p-53; }

  template <class T>
  const T& pick(const std::vector<T>& values) {
    return values[below(values.size())];
  }
  template <class It>
  void shuffle(It first, It last) {
    for (auto n = std::distance(first, last); n > 1; --n) {
      std::iter_swap(first + (n - 1), first + static_cast<std::ptrdiff_t>(below(static_cast<std::uint64_t>(n))));
    }
  }

 private:
  std::uint64_t m_state;
};

}  // namespace testing_support
