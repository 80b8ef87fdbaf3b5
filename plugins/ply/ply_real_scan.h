#pragma once

// The fast reading of the common forms of real numbers in ASCII words.

#include <bit>
#include <cstdint>
#include <type_traits>

namespace ply::detail {

/// Reads [sign] digits [. digits] [e|E [sign] digits] at `at` with a mantissa below 2^53 and
/// a power of ten up to 22: the mantissa and the power are exact doubles, so one
/// multiplication or division gives the correctly rounded double. For a double that is the
/// answer; a float is rounded from it, which is right unless the double lies exactly
/// halfway between two floats. Gives the end of the number, or null to leave the word to
/// an exact reader (from_chars).
///
/// The fraction's digits are counted by their span once the fraction ends, not digit by
/// digit: a fraction of zeros keeps the mantissa at 0 however long it is, and its length
/// then fits any pointer difference, where a counter of its own could overflow.
template <class T>
const char* scanRealFast(const char* at, const char* const end, T& result) {
  static constexpr double powers[] = {1e0,  1e1,  1e2,  1e3,  1e4,  1e5,  1e6,  1e7,  1e8,  1e9,  1e10, 1e11,
                                      1e12, 1e13, 1e14, 1e15, 1e16, 1e17, 1e18, 1e19, 1e20, 1e21, 1e22};
  constexpr std::uint64_t mantissaLimit = (std::uint64_t(1) << 53) / 10 - 1;
  const bool negative = at != end && *at == '-';
  if (at != end && (*at == '-' || *at == '+')) ++at;
  std::uint64_t mantissa = 0;
  const char* const first = at;
  for (; at != end && *at >= '0' && *at <= '9'; ++at) {
    if (mantissa > mantissaLimit) return nullptr;
    mantissa = mantissa * 10 + static_cast<std::uint64_t>(*at - '0');
  }
  bool digits = at != first;
  std::ptrdiff_t fraction = 0;
  if (at != end && *at == '.') {
    const char* const fractionStart = ++at;
    for (; at != end && *at >= '0' && *at <= '9'; ++at) {
      if (mantissa > mantissaLimit) return nullptr;
      mantissa = mantissa * 10 + static_cast<std::uint64_t>(*at - '0');
    }
    fraction = at - fractionStart;
    digits = digits || fraction > 0;
  }
  if (!digits) return nullptr;
  int written = 0;  // the exponent as written, at most 9999
  if (at != end && (*at == 'e' || *at == 'E')) {
    ++at;
    const bool negativeExponent = at != end && *at == '-';
    if (at != end && (*at == '-' || *at == '+')) ++at;
    if (at == end) return nullptr;
    for (; at != end && *at >= '0' && *at <= '9' && written < 1000; ++at) written = written * 10 + (*at - '0');
    if (negativeExponent) written = -written;
  }
  const std::int64_t exponent = std::int64_t(written) - std::int64_t(fraction);
  if (exponent < -22 || exponent > 22) return nullptr;
  double magnitude = static_cast<double>(mantissa);
  magnitude = exponent < 0 ? magnitude / powers[-exponent] : magnitude * powers[exponent];
  if constexpr (std::is_same_v<T, float>) {
    // The magnitude lies in the normal float range (1e-22 to 9e37), where a double halfway
    // between two floats has exactly the 29 bits below float precision at 1000...0.
    if ((std::bit_cast<std::uint64_t>(magnitude) & 0x1FFFFFFFu) == 0x10000000u) return nullptr;
    const auto nearest = static_cast<float>(magnitude);
    result = negative ? -nearest : nearest;
  } else {
    result = negative ? -magnitude : magnitude;
  }
  return at;
}

}  // namespace ply::detail
