#pragma once

#include "ply_columns.h"
#include "ply_value.h"
#include "ply_window.h"

#include <array>
#include <cstdint>
#include <string_view>

namespace ply {

/// Bytes that make up words: - . / 0-9 A-Z \ _ a-z, and + so that "+7" and "1.5e+02" read.
inline constexpr std::array<bool, 256> wordBytes = [] {
  std::array<bool, 256> table{};
  for (int c = '0'; c <= '9'; ++c) table[c] = true;
  for (int c = 'A'; c <= 'Z'; ++c) table[c] = true;
  for (int c = 'a'; c <= 'z'; ++c) table[c] = true;
  for (char c : std::string_view("-./\\_+")) table[static_cast<unsigned char>(c)] = true;
  return table;
}();

/// Bytes that make up element and property names in a header: every byte but the blank,
/// the tab, the line ends and NUL, so that a name in any language and any encoding is kept.
inline constexpr std::array<bool, 256> nameBytes = [] {
  std::array<bool, 256> table{};
  table.fill(true);
  for (char c : std::string_view(" \t\r\n\0", 5)) table[static_cast<unsigned char>(c)] = false;
  return table;
}();

/// Space, tab, CR and LF.
inline bool isBlank(int c) { return c == ' ' || c == '\t' || c == '\r' || c == '\n'; }

/// Consumes blanks; stops quietly at the end of the data.
void skipBlanks(ByteWindow& window);

/// Consumes the rest of the line: up to and including the first NUL, LF or CR, then any
/// further CR, LF and NUL bytes.
void skipLine(ByteWindow& window);

/// Reads words. A word's text stays valid until the next call.
class WordReader {
 public:
  /// Skips blanks, then takes the bytes that `bytes` marks (word bytes unless told
  /// otherwise). Empty when the next byte is no such byte or the data ends. A word is always
  /// returned whole, wherever it lies in the data.
  std::string_view read(ByteWindow& window, const std::array<bool, 256>& bytes = wordBytes);

 private:
  base::string m_copy;
};

/// The value of an ASCII word read as type T, held as ply::Value holds it; see
/// parseAsciiValue.
template <DataType T>
detail::Held<T> parseAsciiHeld(std::string_view word);

/// The value of type T at `at` when the word there has a common form (an optional sign,
/// digits, for reals a point and an exponent) and ends in a blank before `end`: the end of
/// the number, with `value` as parseAsciiHeld gives it. Null leaves the word to
/// parseAsciiHeld (other forms, words that run to `end`, "comment").
template <DataType T>
const char* parseAsciiFast(const char* at, const char* end, detail::Held<T>& value);

/// The value of an ASCII word read as `type`: integers from their leading digits after an
/// optional sign (a minus sign gives 0 for the unsigned types), floats as the
/// correctly rounded nearest value, "nan" and "inf"/"infinity" in any case as NaN and
/// infinities; bytes after the number are ignored and a word without a number gives 0.
Value parseAsciiValue(std::string_view word, DataType type);

}  // namespace ply
