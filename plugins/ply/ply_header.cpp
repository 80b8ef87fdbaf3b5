#include "ply_parser.h"

#include "b_log.h"
#include "b_string_conversion.h"
#include "ply_text.h"

#include <algorithm>
#include <bit>
#include <optional>

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

// The tag's halves: low the data's byte order, high the machine's (0 little, 1 big).
std::uint64_t byteOrderTag(std::uint32_t dataOrder) {
  const std::uint64_t machineOrder = std::endian::native == std::endian::big ? 1 : 0;
  return dataOrder | (machineOrder << 32);
}

// Reads the header's words and knows which line it is on. A keyword may stand anywhere
// after the previous declaration; a declaration's own words come from its own line.
class HeaderWords {
 public:
  explicit HeaderWords(ByteWindow& window) : m_window(window) {}

  /// The next word, wherever it stands; empty at the end of the data or before a byte that
  /// starts no word.
  std::string_view keyword() {
    for (int c = m_window.peek();; c = m_window.peek()) {
      if (c == ' ' || c == '\t') {
        m_window.advance(1);
      } else if (c == '\n' || c == '\r') {
        m_window.advance(1);
        if (c == '\r' && m_window.peek() == '\n') m_window.advance(1);
        ++m_line;
      } else {
        return m_words.read(m_window);
      }
    }
  }

  /// The next word of the current line; nothing when the line or the data ends first.
  std::optional<std::string_view> argument() { return onThisLine(wordBytes); }

  /// The next name of the current line: every byte up to the next blank, tab or line end;
  /// nothing when the line or the data ends first.
  std::optional<std::string_view> name() { return onThisLine(nameBytes); }

  /// Consumes the rest of the line: up to and including the first NUL, LF or CR, then any
  /// further CR, LF and NUL bytes.
  void skipRestOfLine() {
    int c = m_window.get();
    while (c >= 0 && c != '\n' && c != '\r' && c != 0) c = m_window.get();
    for (int previous = -1; c == '\n' || c == '\r' || c == 0; previous = c, c = m_window.get()) {
      if (c != '\n' || previous != '\r') ++m_line;
    }
    if (c >= 0) m_window.unget();
  }

  /// The current line, counted from 1.
  unsigned line() const { return m_line; }

 private:
  std::optional<std::string_view> onThisLine(const std::array<bool, 256>& bytes) {
    for (int c = m_window.peek(); c == ' ' || c == '\t'; c = m_window.peek()) m_window.advance(1);
    const int c = m_window.peek();
    if (c < 0 || c == '\n' || c == '\r') return std::nullopt;
    return m_words.read(m_window, bytes);
  }

  ByteWindow& m_window;
  WordReader m_words;
  unsigned m_line = 1;
};

bool lineEnded(const HeaderWords& words, std::string_view what) {
  return fail("Invalid .ply file: line {} ends before {}", words.line(), what);
}

bool parseFormatLine(Header& header, HeaderWords& words, base::Stream& stream) {
  if (base::asciiLower(words.keyword()) != "ply") return fail("Invalid .ply file: Magic number 'ply' is not there.");
  if (words.keyword() != "format") return fail("Invalid .ply file: Missing format specification");
  const std::optional<std::string_view> format = words.argument();
  if (!format) return lineEnded(words, "the format's encoding");
  if (*format == "ascii") {
    header.encoding = Encoding::ascii;
  } else if (*format == "binary_little_endian") {
    header.encoding = Encoding::binaryLittleEndian;
    stream.tag = byteOrderTag(0);
  } else if (*format == "binary_big_endian") {
    header.encoding = Encoding::binaryBigEndian;
    stream.tag = byteOrderTag(1);
  } else {
    return fail("Invalid .ply file: Unknown file format {}", base::clipped(*format));
  }
  // The version number after the encoding is not checked.
  words.skipRestOfLine();
  return true;
}

bool parseElement(Header& header, HeaderWords& words) {
  Element element;
  const std::optional<std::string_view> name = words.name();
  if (!name) return lineEnded(words, "the element's name");
  element.semantic = elementSemanticFromName(*name);
  element.word = *name;
  if (element.semantic == ElementSemantic::unknown) element.name = *name;
  const std::optional<std::string_view> count = words.argument();
  if (!count) return lineEnded(words, fmt::format("the count of element '{}'", base::clipped(displayName(element))));
  // Leading digits only: "8abc" counts 8, "-5" counts 0.
  std::uint64_t value = 0;
  for (char c : *count) {
    if (c < '0' || c > '9') break;
    value = value * 10 + static_cast<std::uint64_t>(c - '0');
    if (value > UINT32_MAX) {
      return fail("Invalid .ply file: the count {} of element '{}' does not fit in 32 bits", base::clipped(*count),
                  base::clipped(displayName(element)));
    }
  }
  element.count = static_cast<std::uint32_t>(value);
  base::append(header.elements, std::move(element));
  return true;
}

// The type word of a property line; nothing when the line ends first. A word that names no
// type has been logged by the lookup, and the header fails: the property's values would
// shift every later value.
std::optional<DataType> propertyType(HeaderWords& words, std::string_view what) {
  const std::optional<std::string_view> word = words.argument();
  if (!word) {
    lineEnded(words, what);
    return std::nullopt;
  }
  const DataType type = dataTypeFromWord(*word);
  if (type == DataType::none) return std::nullopt;
  return type;
}

bool parseProperty(Header& header, HeaderWords& words) {
  if (header.elements.empty()) return fail("Invalid .ply file: property declared before any element");
  Property property;
  std::optional<std::string_view> word = words.argument();
  if (!word) return lineEnded(words, "the property's type");
  if (*word == "list") {
    property.isList = true;
    const std::optional<DataType> countType = propertyType(words, "the list's count type");
    if (!countType) return false;
    property.countType = *countType;
    word = words.argument();
    if (!word) return lineEnded(words, "the list's item type");
  }
  property.type = dataTypeFromWord(*word);
  if (property.type == DataType::none) return false;
  const std::optional<std::string_view> name = words.name();
  if (!name) return lineEnded(words, "the property's name");
  property.semantic = propertySemanticFromName(*name);
  property.word = *name;
  if (property.semantic == PropertySemantic::unknown) {
    property.name = *name;
    words.skipRestOfLine();
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
          base::clipped(displayName(element)), element.count, instance, needed - (header.encoding == Encoding::ascii),
          available - (header.encoding == Encoding::ascii));
    }
  }
  return true;
}

}  // namespace

namespace detail {

bool parseHeader(Header& header, ByteWindow& window, base::Stream& stream) {
  base::log().message(base::logScene, base::logDebug, "Begin parsing the ply header.");
  HeaderWords words(window);
  if (!parseFormatLine(header, words, stream)) return false;
  for (;;) {
    const std::string_view keyword = words.keyword();
    if (keyword == "comment") {
      words.skipRestOfLine();
    } else if (keyword == "element") {
      if (!parseElement(header, words)) return false;
    } else if (keyword == "property") {
      if (!parseProperty(header, words)) return false;
    } else if (keyword == "end_header") {
      skipEndOfHeaderLine(window);
      // A stream that cannot tell its size (a pipe) gives no bound here; the body reader
      // then trusts the counts only as far as the data that really arrives.
      if (auto available = window.remaining(); available && !bodyCanHoldCounts(header, *available)) return false;
      base::log().message(base::logScene, base::logDebug, "End parsing the ply header.");
      return true;
    } else if (keyword.empty()) {
      return fail("Error reading ply header.");
    } else {
      const std::string word = base::clipped(keyword);
      words.skipRestOfLine();
      base::log().message(base::logScene, base::logWarning, "Skipped unknown header element {}!", word);
    }
  }
}

}  // namespace detail

bool parseHeader(Header& header, base::Stream& stream) {
  // The body is read later through the stream itself, which may not be able to go back
  // (a pipe, or a buffer over one): unless the data lies in memory, the header is read byte
  // by byte, so that at most one peeked byte has to be given back.
  ByteWindow window(stream, stream.has(base::capInMemory) ? ByteWindow::defaultCapacity : 1);
  if (!detail::parseHeader(header, window, stream)) return false;
  const std::uint64_t ahead = window.readAhead();
  if (window.giveBack()) return true;
  return fail("stream '{}': the {} bytes read past the header cannot be given back", base::clipped(stream.name()),
              ahead);
}

}  // namespace ply
