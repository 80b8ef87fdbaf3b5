#include "ply_parser.h"

#include "b_log.h"
#include "ply_text.h"

#include <algorithm>
#include <bit>
#include <cctype>

namespace ply {
namespace {

template <class... Args>
bool fail(fmt::format_string<Args...> format, Args&&... args) {
  base::log().message(base::logScene, base::logError, format, std::forward<Args>(args)...);
  return false;
}

bool fail(std::string_view message) {
  base::log().message(base::logScene, base::logError, message);
  return false;
}

std::string lowerCase(std::string_view word) {
  std::string lower(word);
  for (char& c : lower) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
  return lower;
}

// The tag's halves: low the data's byte order, high the machine's (0 little, 1 big).
std::uint64_t byteOrderTag(std::uint32_t dataOrder) {
  const std::uint64_t machineOrder = std::endian::native == std::endian::big ? 1 : 0;
  return dataOrder | (machineOrder << 32);
}

bool parseFormatLine(Header& header, ByteWindow& window, WordReader& words, base::Stream& stream) {
  if (lowerCase(words.read(window)) != "ply") return fail("Invalid .ply file: Magic number 'ply' is not there.");
  if (words.read(window) != "format") return fail("Invalid .ply file: Missing format specification");
  const std::string_view format = words.read(window);
  if (format == "ascii") {
    header.encoding = Encoding::ascii;
  } else if (format == "binary_little_endian") {
    header.encoding = Encoding::binaryLittleEndian;
    stream.tag = byteOrderTag(0);
  } else if (format == "binary_big_endian") {
    header.encoding = Encoding::binaryBigEndian;
    stream.tag = byteOrderTag(1);
  } else {
    return fail("Invalid .ply file: Unknown file format {}", format);
  }
  // The version number after the encoding is not checked.
  skipLine(window);
  return true;
}

bool parseElement(Header& header, ByteWindow& window, WordReader& words) {
  Element element;
  const std::string_view name = words.read(window);
  element.semantic = elementSemanticFromName(name);
  if (element.semantic == ElementSemantic::unknown) element.name = name;
  // Leading digits only: "8abc" counts 8, "-5" counts 0.
  const std::string_view count = words.read(window);
  std::uint64_t value = 0;
  for (char c : count) {
    if (c < '0' || c > '9') break;
    value = value * 10 + static_cast<std::uint64_t>(c - '0');
    if (value > UINT32_MAX) {
      return fail("Invalid .ply file: the count {} of element '{}' does not fit in 32 bits", count,
                  displayName(element));
    }
  }
  element.count = static_cast<std::uint32_t>(value);
  base::append(header.elements, std::move(element));
  return true;
}

bool parseProperty(Header& header, ByteWindow& window, WordReader& words) {
  if (header.elements.empty()) return fail("Invalid .ply file: property declared before any element");
  Property property;
  std::string_view word = words.read(window);
  if (word == "list") {
    property.isList = true;
    property.countType = dataTypeFromWord(words.read(window));
    // The values of a property of unknown type would shift every later value: give up.
    if (property.countType == DataType::none) return false;
    word = words.read(window);
  }
  property.type = dataTypeFromWord(word);
  if (property.type == DataType::none) return false;
  const std::string_view name = words.read(window);
  property.semantic = propertySemanticFromName(name);
  if (property.semantic == PropertySemantic::unknown) {
    property.name = name;
    skipLine(window);
  }
  base::append(header.elements.back().properties, std::move(property));
  return true;
}

// After end_header: blanks and tabs, then exactly one line break, so that a binary body
// starting with a blank or line-break byte keeps it.
void skipEndOfHeaderLine(ByteWindow& window) {
  for (int c = window.peek(); c == ' ' || c == '\t'; c = window.peek()) window.advance(1);
  const int c = window.get();
  if (c == '\r') {
    if (window.peek() == '\n') window.advance(1);
  } else if (c != '\n' && c >= 0) {
    window.unget();
  }
}

// The smallest number of bytes one instance can take: binary, the scalars' sizes and the
// list counts' sizes; ASCII, a digit and a separator per property.
std::uint64_t smallestInstance(const Element& element, Encoding encoding) {
  std::uint64_t bytes = 0;
  for (const Property& property : element.properties) {
    if (encoding == Encoding::ascii) {
      bytes += 2;
    } else {
      bytes += dataTypeSize(property.isList ? property.countType : property.type);
    }
  }
  return bytes;
}

// Counts from the file are trusted only as far as the bytes that follow can hold them.
bool bodyCanHoldCounts(const Header& header, std::uint64_t available) {
  // The last ASCII value needs no separator after it.
  if (header.encoding == Encoding::ascii) ++available;
  std::uint64_t needed = 0;
  for (const Element& element : header.elements) {
    const std::uint64_t instance = smallestInstance(element, header.encoding);
    needed += instance * element.count;
    if (needed > available) {
      return fail(
          "Invalid .ply file: element '{}' declares {} instances of at least {} bytes each; the elements up to it need "
          "at least {} bytes, but only {} bytes follow the header",
          displayName(element), element.count, instance, needed - (header.encoding == Encoding::ascii),
          available - (header.encoding == Encoding::ascii));
    }
  }
  return true;
}

}  // namespace

namespace detail {

bool parseHeader(Header& header, ByteWindow& window, base::Stream& stream) {
  base::log().message(base::logScene, base::logDebug, "Begin parsing the ply header.");
  WordReader words;
  if (!parseFormatLine(header, window, words, stream)) return false;
  for (;;) {
    const std::string_view keyword = words.read(window);
    if (keyword == "comment") {
      skipLine(window);
    } else if (keyword == "element") {
      if (!parseElement(header, window, words)) return false;
    } else if (keyword == "property") {
      if (!parseProperty(header, window, words)) return false;
    } else if (keyword == "end_header") {
      skipEndOfHeaderLine(window);
      if (auto available = window.remaining(); available && !bodyCanHoldCounts(header, *available)) return false;
      base::log().message(base::logScene, base::logDebug, "End parsing the ply header.");
      return true;
    } else if (keyword.empty()) {
      return fail("Error reading ply header.");
    } else {
      const std::string word(keyword);
      skipLine(window);
      base::log().message(base::logScene, base::logWarning, "Skipped unknown header element {}!", word);
    }
  }
}

}  // namespace detail

bool parseHeader(Header& header, base::Stream& stream) {
  ByteWindow window(stream);
  return detail::parseHeader(header, window, stream);
}

}  // namespace ply
