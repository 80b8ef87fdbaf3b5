#pragma once

#include "b_api.h"
#include "b_components.h"
#include "b_containers.h"
#include "b_exception.h"

#include <charconv>
#include <cstdint>
#include <limits>
#include <string_view>
#include <type_traits>

namespace base {

/// The text of a float: values within [-1e30, 1e30] in fixed notation with six decimals,
/// trailing zeros and then a bare '.' removed ("2", "0.5", "-0.0001"); anything else (NaN
/// and the infinities too) in "%.3g" form ("2e+30", "nan", "-inf"). Independent of the locale.
BASE1_API base::string toText(float value);
/// The text of a double, by the rule of toText(float).
BASE1_API base::string toText(double value);
/// `text` with the ASCII letters A to Z made lower case; other bytes stay (UTF-8 is kept).
BASE1_API base::string asciiLower(std::string_view text);

/// Reads a float: an optional sign, integer digits, an optional '.' with fraction digits and
/// an optional exponent ('e' or 'E', optional sign, digits), computed digit by digit in
/// float precision (integer digits that would overflow 64 bits are ignored). The number
/// needs a digit before or after the '.' and, with an exponent mark, an exponent digit.
/// What follows it must be the end of `text` or a space, tab, '\n' or '\r' (the rest is
/// not looked at). Throws string_conversion_exception "Can't convert string to float!"
/// otherwise, leaving `value` unchanged. Independent of the locale.
BASE1_API void from_string(std::string_view text, float& value);
/// Reads a double by the rule of from_string(text, float&), in double precision.
BASE1_API void from_string(std::string_view text, double& value);
/// Reads "true", "false", "1" or "0" (followed by the end or a blank as for numbers).
/// Throws string_conversion_exception "Can't convert string to boolean!" otherwise,
/// leaving `value` unchanged.
BASE1_API void from_string(std::string_view text, bool& value);

namespace detail {
/// The non-throwing parsers behind from_string: true and `value` set on success, false and
/// `value` untouched on failure. Numbers end at the end of `text` or at a blank (space,
/// tab, '\n', '\r').
BASE1_API bool parseReal(std::string_view text, float& value) noexcept;
/// See parseReal(std::string_view, float&).
BASE1_API bool parseReal(std::string_view text, double& value) noexcept;
/// Decimal digits only; false when the number exceeds `max`.
BASE1_API bool parseUnsigned(std::string_view text, std::uint64_t max, std::uint64_t& value) noexcept;
/// An optional sign, then decimal digits; false outside [min, max].
BASE1_API bool parseSigned(std::string_view text, std::int64_t min, std::int64_t max, std::int64_t& value) noexcept;
/// "true", "false", "1", "0".
BASE1_API bool parseBool(std::string_view text, bool& value) noexcept;

/// base::string converts as itself, not by components.
template <class T>
inline constexpr bool isText = std::is_same_v<T, base::string>;

/// The message from_string throws for a text that is no T.
template <class T>
constexpr const char* conversionFailure() {
  if constexpr (isText<T>) {
    return "";  // never fails
  } else if constexpr (std::is_same_v<T, bool>) {
    return "Can't convert string to boolean!";
  } else if constexpr (std::is_floating_point_v<T>) {
    return "Can't convert string to float!";
  } else if constexpr (std::is_unsigned_v<T>) {
    return "Can't convert string to unsigned integer!";
  } else if constexpr (std::is_integral_v<T>) {
    return "Can't convert string to integer!";
  } else if constexpr (componentCount<T> == 1) {
    return conversionFailure<component_t<T, 0>>();  // a wrapped scalar such as TimeCode
  } else {
    return "";  // a value type whose text does not match its pattern
  }
}

/// Appends the decimal text of an integer.
template <class T>
void appendInteger(base::string& out, T value) {
  char buffer[24];  // 20 digits of a 64-bit number and a sign
  const auto result = std::to_chars(buffer, buffer + sizeof buffer, value);
  out.append(buffer, result.ptr);
}

/// Appends the text of one scalar component.
template <class T>
void appendScalar(base::string& out, T value) {
  if constexpr (std::is_same_v<T, bool>) {
    out += value ? "true" : "false";
  } else if constexpr (std::is_floating_point_v<T>) {
    out += toText(value);
  } else {
    // Through a 64-bit type so that 8-bit components print as numbers, not characters.
    appendInteger(out, static_cast<std::conditional_t<std::is_signed_v<T>, std::int64_t, std::uint64_t>>(value));
  }
}

/// Reads one scalar component without throwing.
template <class T>
bool parseScalar(std::string_view text, T& value) noexcept {
  if constexpr (std::is_same_v<T, bool>) {
    return parseBool(text, value);
  } else if constexpr (std::is_floating_point_v<T>) {
    static_assert(!std::is_same_v<T, long double>, "long double has no text conversion");
    return parseReal(text, value);
  } else if constexpr (std::is_unsigned_v<T>) {
    std::uint64_t wide;
    if (!parseUnsigned(text, std::numeric_limits<T>::max(), wide)) return false;
    value = static_cast<T>(wide);
    return true;
  } else {
    std::int64_t wide;
    if (!parseSigned(text, std::numeric_limits<T>::min(), std::numeric_limits<T>::max(), wide)) return false;
    value = static_cast<T>(wide);
    return true;
  }
}

/// Reads the components of a value type from `text`, split at ','; a component may have
/// blanks before it (after it, the number rule already allows them).
template <class T>
bool parseComponents(std::string_view text, T& value) noexcept {
  T parsed = value;
  bool ok = true;
  std::size_t index = 0;
  forEachComponent(parsed, [&](auto& each) {
    if (!ok) return;
    const bool last = ++index == componentCount<T>;
    const std::size_t comma = text.find(',');
    if (last != (comma == std::string_view::npos)) {
      ok = false;  // too few or too many components
      return;
    }
    std::string_view piece = text.substr(0, comma);
    while (!piece.empty() && (piece.front() == ' ' || piece.front() == '\t')) piece.remove_prefix(1);
    ok = parseScalar(piece, each);
    if (!last) text.remove_prefix(comma + 1);
  });
  if (ok) value = parsed;
  return ok;
}
}  // namespace detail

/// Reads `text` into `value` without throwing a conversion error: true on success; false,
/// with `value` unchanged, when the text is no T. T is a scalar, base::string (taken as is;
/// the only case that allocates) or a value type with components ("1,2.5,0" for a
/// base_vec3<float>, components in the order that toText writes them, each read as its own
/// type).
template <class T>
bool tryFromString(std::string_view text, T& value) {
  if constexpr (detail::isText<T>) {
    value.assign(text.begin(), text.end());
    return true;
  } else if constexpr (std::is_arithmetic_v<T>) {
    return detail::parseScalar(text, value);
  } else {
    return detail::parseComponents(text, value);
  }
}

/// The text of `value`: scalars as described above (integers in decimal, bool as "true" or
/// "false"), base::string as is, value types their components in order joined by ','
/// without spaces ("1,2.5,0"), a TimeCode its tick count.
template <class T>
base::string toText(const T& value) {
  if constexpr (detail::isText<T>) {
    return value;
  } else {
    base::string out;
    bool first = true;
    forEachComponent(value, [&](const auto& each) {
      if (!first) out += ',';
      first = false;
      detail::appendScalar(out, each);
    });
    return out;
  }
}

/// Reads `text` into `value` like tryFromString, but throws string_conversion_exception
/// on failure ("Can't convert string to float!", "... unsigned integer!", "... integer!",
/// "... boolean!" for scalars and the scalar that a TimeCode wraps; an empty message for
/// other value types), leaving `value` unchanged.
template <class T>
void from_string(std::string_view text, T& value) {
  if (!tryFromString(text, value)) {
    raise<string_conversion_exception>("base::from_string", detail::conversionFailure<T>());
  }
}

}  // namespace base
