#include "ply_text.h"

#include "ply_real_scan.h"

#include <algorithm>
#include <charconv>
#include <cstring>
#include <limits>
#include <type_traits>

namespace ply {
namespace {

std::uint32_t leadingDigits(std::string_view text) {
  std::uint32_t value = 0;
  for (char c : text) {
    if (c < '0' || c > '9') break;
    value = value * 10u + static_cast<std::uint32_t>(c - '0');  // wraps, as counts in the format do
  }
  return value;
}

bool equalsIgnoringCase(std::string_view text, std::string_view lower) {
  return std::equal(text.begin(), text.end(), lower.begin(), lower.end(),
                    [](char a, char b) { return (a >= 'A' && a <= 'Z' ? static_cast<char>(a - 'A' + 'a') : a) == b; });
}

// For a number out of the type's range: whether it is too large (rather than too small),
// from the decimal exponent of its first significant digit.
bool tooLarge(std::string_view number) {
  const std::size_t exponentAt = number.find_first_of("eE");
  const std::string_view mantissa = number.substr(0, exponentAt);
  const std::size_t point = std::min(mantissa.find('.'), mantissa.size());
  const std::size_t first = mantissa.find_first_of("123456789");
  long long magnitude = 0;
  if (first == std::string_view::npos) return false;
  magnitude = first < point ? static_cast<long long>(point - first) : -static_cast<long long>(first - point - 1);
  if (exponentAt != std::string_view::npos) {
    std::string_view exponent = number.substr(exponentAt + 1);
    const bool negative = !exponent.empty() && exponent.front() == '-';
    if (!exponent.empty() && (exponent.front() == '-' || exponent.front() == '+')) exponent.remove_prefix(1);
    long long digits = 0;
    for (char c : exponent) {
      if (c < '0' || c > '9') break;
      digits = std::min(digits * 10 + (c - '0'), 1000000000LL);
    }
    magnitude += negative ? -digits : digits;
  }
  return magnitude > 0;
}

// The forms of scanRealFast that fill the whole word.
template <class T>
bool parseRealFast(std::string_view word, T& result) {
  return detail::scanRealFast(word.data(), word.data() + word.size(), result) == word.data() + word.size();
}

// An optional sign (only '+' for unsigned types) and decimal digits, wrapping at 32 bits.
template <class T>
const char* scanIntegerFast(const char* at, const char* const end, T& result) {
  const bool negative = std::is_signed_v<T> && at != end && *at == '-';
  if (at != end && (*at == '+' || negative)) ++at;
  if (at == end || *at < '0' || *at > '9') return nullptr;
  std::uint32_t value = 0;
  for (; at != end && *at >= '0' && *at <= '9'; ++at) value = value * 10u + static_cast<std::uint32_t>(*at - '0');
  result = static_cast<T>(negative ? 0u - value : value);
  return at;
}

template <class T>
T parseReal(std::string_view word) {
  if (T fast; parseRealFast(word, fast)) return fast;
  const bool negative = !word.empty() && word.front() == '-';
  if (!word.empty() && (word.front() == '-' || word.front() == '+')) word.remove_prefix(1);
  if (word.empty()) return T(0);
  T value = 0;
  if ((word.front() >= '0' && word.front() <= '9') || word.front() == '.') {
    // from_chars reads only the longest number prefix, is locale-independent and rounds
    // correctly for the type itself. Out-of-range values still give the nearest: infinity
    // or zero.
    const auto [end, error] = std::from_chars(word.data(), word.data() + word.size(), value);
    if (error == std::errc::result_out_of_range) {
      value = tooLarge(word) ? std::numeric_limits<T>::infinity() : T(0);
    } else if (error != std::errc()) {
      value = 0;
    }
    (void)end;
  } else if (equalsIgnoringCase(word, "nan")) {
    value = std::numeric_limits<T>::quiet_NaN();
  } else if (equalsIgnoringCase(word, "inf") || equalsIgnoringCase(word, "infinity")) {
    value = std::numeric_limits<T>::infinity();
  }
  return negative ? -value : value;
}

}  // namespace

void skipBlanks(ByteWindow& window) {
  for (int c = window.peek(); c >= 0 && isBlank(c); c = window.peek()) window.advance(1);
}

void skipLine(ByteWindow& window) {
  for (int c = window.get(); c >= 0; c = window.get()) {
    if (c == '\n' || c == '\r' || c == 0) break;
  }
  for (int c = window.peek(); c == '\n' || c == '\r' || c == 0; c = window.peek()) window.advance(1);
}

std::string_view WordReader::read(ByteWindow& window, const std::array<bool, 256>& bytes) {
  skipBlanks(window);
  // Most words lie whole inside the window: hand them out in place.
  const std::uint8_t* begin = window.cursor();
  const std::uint8_t* end = window.end();
  const std::uint8_t* stop = begin;
  while (stop != end && bytes[*stop]) ++stop;
  if (stop != end) {
    window.advance(static_cast<std::size_t>(stop - begin));
    return {reinterpret_cast<const char*>(begin), static_cast<std::size_t>(stop - begin)};
  }
  // The word may go on past the window: copy it out while refilling.
  m_copy.clear();
  for (int c = window.peek(); c >= 0 && bytes[static_cast<std::size_t>(c)]; c = window.peek()) {
    m_copy.push_back(static_cast<char>(c));
    window.advance(1);
  }
  return m_copy;
}

template <DataType T>
detail::Held<T> parseAsciiHeld(std::string_view word) {
  using H = detail::Held<T>;
  if constexpr (std::is_floating_point_v<H>) {
    return parseReal<H>(word);
  } else if constexpr (std::is_signed_v<H>) {
    const bool negative = !word.empty() && word.front() == '-';
    if (!word.empty() && (word.front() == '-' || word.front() == '+')) word.remove_prefix(1);
    const std::uint32_t digits = leadingDigits(word);
    return static_cast<std::int32_t>(negative ? 0u - digits : digits);
  } else {
    // "+3" is 3 (read as 0 it would also shift every later value after a list count);
    // a minus sign still gives 0.
    if (!word.empty() && word.front() == '+') word.remove_prefix(1);
    return leadingDigits(word);
  }
}

template <DataType T>
const char* parseAsciiFast(const char* at, const char* end, detail::Held<T>& value) {
  const char* stop = nullptr;
  if constexpr (std::is_floating_point_v<detail::Held<T>>) {
    stop = detail::scanRealFast(at, end, value);
  } else {
    stop = scanIntegerFast(at, end, value);
  }
  return stop && stop != end && isBlank(*stop) ? stop : nullptr;
}

template const char* parseAsciiFast<DataType::int8>(const char*, const char*, detail::Held<DataType::int8>&);
template const char* parseAsciiFast<DataType::uint8>(const char*, const char*, detail::Held<DataType::uint8>&);
template const char* parseAsciiFast<DataType::int16>(const char*, const char*, detail::Held<DataType::int16>&);
template const char* parseAsciiFast<DataType::uint16>(const char*, const char*, detail::Held<DataType::uint16>&);
template const char* parseAsciiFast<DataType::int32>(const char*, const char*, detail::Held<DataType::int32>&);
template const char* parseAsciiFast<DataType::uint32>(const char*, const char*, detail::Held<DataType::uint32>&);
template const char* parseAsciiFast<DataType::float32>(const char*, const char*, detail::Held<DataType::float32>&);
template const char* parseAsciiFast<DataType::float64>(const char*, const char*, detail::Held<DataType::float64>&);

template detail::Held<DataType::int8> parseAsciiHeld<DataType::int8>(std::string_view);
template detail::Held<DataType::uint8> parseAsciiHeld<DataType::uint8>(std::string_view);
template detail::Held<DataType::int16> parseAsciiHeld<DataType::int16>(std::string_view);
template detail::Held<DataType::uint16> parseAsciiHeld<DataType::uint16>(std::string_view);
template detail::Held<DataType::int32> parseAsciiHeld<DataType::int32>(std::string_view);
template detail::Held<DataType::uint32> parseAsciiHeld<DataType::uint32>(std::string_view);
template detail::Held<DataType::float32> parseAsciiHeld<DataType::float32>(std::string_view);
template detail::Held<DataType::float64> parseAsciiHeld<DataType::float64>(std::string_view);

Value parseAsciiValue(std::string_view word, DataType type) {
  Value value;
  switch (type) {
    case DataType::int8:
    case DataType::int16:
    case DataType::int32:
      value.i = parseAsciiHeld<DataType::int32>(word);
      break;
    case DataType::uint8:
    case DataType::uint16:
    case DataType::uint32:
      value.u = parseAsciiHeld<DataType::uint32>(word);
      break;
    case DataType::float32:
      value.f = parseAsciiHeld<DataType::float32>(word);
      break;
    case DataType::float64:
      value.d = parseAsciiHeld<DataType::float64>(word);
      break;
    case DataType::none:
      value.d = 0;
      break;
  }
  return value;
}

}  // namespace ply
