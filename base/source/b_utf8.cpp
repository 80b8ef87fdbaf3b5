#include "b_utf8.h"

#include <cstdint>

namespace base {
namespace {

// The length of the well-formed sequence at `at`, or 0 when it is ill-formed there; `bad`
// then says how many bytes make up the maximal ill-formed subpart (at least 1).
std::size_t sequenceAt(std::string_view bytes, std::size_t at, std::size_t& bad) {
  const auto byte = [&](std::size_t k) { return static_cast<std::uint8_t>(bytes[at + k]); };
  const std::uint8_t lead = byte(0);
  bad = 1;
  if (lead < 0x80) return 1;
  std::size_t length = 0;
  std::uint8_t low = 0x80, high = 0xBF;  // the range of the second byte
  if (lead >= 0xC2 && lead <= 0xDF) {
    length = 2;
  } else if (lead >= 0xE0 && lead <= 0xEF) {
    length = 3;
    if (lead == 0xE0) low = 0xA0;   // overlong
    if (lead == 0xED) high = 0x9F;  // surrogates
  } else if (lead >= 0xF0 && lead <= 0xF4) {
    length = 4;
    if (lead == 0xF0) low = 0x90;   // overlong
    if (lead == 0xF4) high = 0x8F;  // above U+10FFFF
  } else {
    return 0;
  }
  for (std::size_t k = 1; k < length; ++k) {
    const bool fits = at + k < bytes.size() && byte(k) >= (k == 1 ? low : 0x80) && byte(k) <= (k == 1 ? high : 0xBF);
    if (!fits) {
      bad = k;
      return 0;
    }
  }
  return length;
}

}  // namespace

bool isUtf8(std::string_view bytes) {
  std::size_t bad = 0;
  for (std::size_t at = 0; at < bytes.size();) {
    const std::size_t length = sequenceAt(bytes, at, bad);
    if (length == 0) return false;
    at += length;
  }
  return true;
}

std::string utf8Text(std::string_view bytes) {
  if (isUtf8(bytes)) return std::string(bytes);
  std::string text;
  text.reserve(bytes.size() + 8);
  std::size_t bad = 0;
  for (std::size_t at = 0; at < bytes.size();) {
    const std::size_t length = sequenceAt(bytes, at, bad);
    if (length == 0) {
      text += "\xEF\xBF\xBD";
      at += bad;
      continue;
    }
    text.append(bytes.substr(at, length));
    at += length;
  }
  return text;
}

}  // namespace base
