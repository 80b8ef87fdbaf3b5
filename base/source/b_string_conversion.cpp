#include "b_string_conversion.h"

#include <charconv>
#include <cmath>
#include <cstdint>
#include <limits>

namespace base {
namespace {

bool isDigit(char c) { return c >= '0' && c <= '9'; }

/// True when a number may end at `pos`: the end of the text or a blank.
bool endsNumber(std::string_view text, std::size_t pos) {
  return pos == text.size() || text[pos] == ' ' || text[pos] == '\t' || text[pos] == '\n' || text[pos] == '\r';
}

/// Reads a run of decimal digits into `value`; returns false when there is none or the
/// number exceeds `max`.
bool readDigits(std::string_view text, std::size_t& pos, std::uint64_t max, std::uint64_t& value) {
  if (pos == text.size() || !isDigit(text[pos])) return false;
  std::uint64_t number = 0;
  for (; pos < text.size() && isDigit(text[pos]); ++pos) {
    const unsigned digit = static_cast<unsigned>(text[pos] - '0');
    if (number > (max - digit) / 10) return false;
    number = number * 10 + digit;
  }
  value = number;
  return true;
}

// The digit-by-digit arithmetic in T's own precision is the conversion's defined result;
// it is not the correctly rounded nearest value for long mantissas.
template <class T>
bool parseRealText(std::string_view text, T& out) {
  std::size_t pos = 0;
  const bool negative = pos < text.size() && text[pos] == '-';
  if (pos < text.size() && (text[pos] == '+' || text[pos] == '-')) ++pos;

  bool hasDigits = false;
  std::uint64_t integer = 0;
  for (; pos < text.size() && isDigit(text[pos]); ++pos) {
    hasDigits = true;
    const unsigned digit = static_cast<unsigned>(text[pos] - '0');
    // A digit that would wrap the 64-bit sum is dropped; the sum keeps its previous value.
    if (integer <= (std::numeric_limits<std::uint64_t>::max() - digit) / 10) integer = integer * 10 + digit;
  }
  T value = static_cast<T>(integer);
  if (pos < text.size() && text[pos] == '.') {
    T weight = T(0.1);
    for (++pos; pos < text.size() && isDigit(text[pos]); ++pos) {
      hasDigits = true;
      value += static_cast<T>(text[pos] - '0') * weight;
      weight *= T(0.1);
    }
  }
  if (!hasDigits) return false;  // "", "-", "." and "e5" are no numbers

  if (pos < text.size() && (text[pos] == 'e' || text[pos] == 'E')) {
    ++pos;
    const bool negativeExponent = pos < text.size() && text[pos] == '-';
    if (pos < text.size() && (text[pos] == '+' || text[pos] == '-')) ++pos;
    if (pos == text.size() || !isDigit(text[pos])) return false;
    int exponent = 0;
    for (; pos < text.size() && isDigit(text[pos]); ++pos) {
      // Beyond any finite power of ten; the cap keeps a long exponent from overflowing int.
      if (exponent < 100000) exponent = exponent * 10 + (text[pos] - '0');
    }
    // A zero mantissa stays zero: 0 times an overflowing power would be NaN.
    if (value != 0) value *= std::pow(T(10), static_cast<T>(negativeExponent ? -exponent : exponent));
  }
  if (!endsNumber(text, pos)) return false;
  out = negative ? -value : value;
  return true;
}

template <class T>
base::string realText(T value) {
  char buffer[152];
  // Compared in double, so a float just above 1e30 (1e30f itself) takes the short form.
  const double wide = value;
  if (wide >= -1e30 && wide <= 1e30) {
    const auto result = std::to_chars(buffer, buffer + sizeof buffer, value, std::chars_format::fixed, 6);
    char* end = result.ptr;
    while (end[-1] == '0') --end;  // stops at the '.' that the fixed form always has
    if (end[-1] == '.') --end;
    return base::string(buffer, end);
  }
  const auto result = std::to_chars(buffer, buffer + sizeof buffer, value, std::chars_format::general, 3);
  return base::string(buffer, result.ptr);
}

template <class T>
void realFromString(std::string_view text, T& value) {
  if (!parseRealText(text, value))
    raise<string_conversion_exception>("base::from_string", "Can't convert string to float!");
}

}  // namespace

base::string asciiLower(std::string_view text) {
  base::string result(text);
  for (char& c : result) {
    if (c >= 'A' && c <= 'Z') c = static_cast<char>(c - 'A' + 'a');
  }
  return result;
}

base::string toText(float value) { return realText(value); }
base::string toText(double value) { return realText(value); }

void from_string(std::string_view text, float& value) { realFromString(text, value); }
void from_string(std::string_view text, double& value) { realFromString(text, value); }

void from_string(std::string_view text, bool& value) {
  if (!detail::parseBool(text, value)) {
    raise<string_conversion_exception>("base::from_string", "Can't convert string to boolean!");
  }
}

namespace detail {

bool parseReal(std::string_view text, float& value) noexcept { return parseRealText(text, value); }
bool parseReal(std::string_view text, double& value) noexcept { return parseRealText(text, value); }

bool parseUnsigned(std::string_view text, std::uint64_t max, std::uint64_t& value) noexcept {
  std::size_t pos = 0;
  std::uint64_t number;
  if (!readDigits(text, pos, max, number) || !endsNumber(text, pos)) return false;
  value = number;
  return true;
}

bool parseSigned(std::string_view text, std::int64_t min, std::int64_t max, std::int64_t& value) noexcept {
  std::size_t pos = 0;
  const bool negative = pos < text.size() && text[pos] == '-';
  if (pos < text.size() && (text[pos] == '+' || text[pos] == '-')) ++pos;
  // The magnitude of min computed without negating it, which would overflow for INT64_MIN.
  const std::uint64_t limit = negative ? std::uint64_t(-(min + 1)) + 1 : std::uint64_t(max);
  std::uint64_t magnitude;
  if (!readDigits(text, pos, limit, magnitude) || !endsNumber(text, pos)) return false;
  // Modular unsigned negation, then the conversion of C++20: exact for INT64_MIN too.
  value = static_cast<std::int64_t>(negative ? 0 - magnitude : magnitude);
  return true;
}

bool parseBool(std::string_view text, bool& value) noexcept {
  for (const auto& [word, meaning] :
       {std::pair{std::string_view("true"), true}, std::pair{std::string_view("false"), false},
        std::pair{std::string_view("1"), true}, std::pair{std::string_view("0"), false}}) {
    if (text.starts_with(word) && endsNumber(text, word.size())) {
      value = meaning;
      return true;
    }
  }
  return false;
}

}  // namespace detail
}  // namespace base
