#include "b_json.h"

#include "b_exception.h"
#include "b_utf8.h"

#include <fmt/format.h>
#include <rapidjson/document.h>
#include <rapidjson/encodedstream.h>
#include <rapidjson/error/en.h>
#include <rapidjson/memorystream.h>
#include <rapidjson/reader.h>
#include <rapidjson/stringbuffer.h>
#include <rapidjson/writer.h>

#include <charconv>
#include <cmath>
#include <cstdint>
#include <limits>
#include <vector>

namespace base {

StructuredWriter::~StructuredWriter() = default;
StructuredReader::~StructuredReader() = default;

struct JsonWriter::Impl {
  rapidjson::StringBuffer buffer;
  rapidjson::Writer<rapidjson::StringBuffer> writer{buffer};

  template <class T>
  void real(T number) {
    if (std::isnan(number)) {
      writer.String("NaN");
    } else if (std::isinf(number)) {
      writer.String(number > 0 ? "Infinity" : "-Infinity");
    } else if (number == 0 && std::signbit(number)) {
      writer.RawValue("-0.0", 4, rapidjson::kNumberType);  // "-0" would read back as the integer 0
    } else {
      // The shortest text that reads back to the same value of the type itself.
      const std::string text = fmt::format("{}", number);
      writer.RawValue(text.data(), text.size(), rapidjson::kNumberType);
    }
  }
};

JsonWriter::JsonWriter() : m_impl(std::make_unique<Impl>()) {}
JsonWriter::~JsonWriter() = default;

std::string_view JsonWriter::text() const { return {m_impl->buffer.GetString(), m_impl->buffer.GetSize()}; }
void JsonWriter::beginObject() { m_impl->writer.StartObject(); }
// Keys and strings come from files too (names as written): what is not UTF-8 is shown as
// U+FFFD, so that the output is always valid JSON.
void JsonWriter::key(std::string_view name) {
  const std::string text = utf8Text(name);
  m_impl->writer.Key(text.data(), static_cast<rapidjson::SizeType>(text.size()), true);
}
void JsonWriter::endObject() { m_impl->writer.EndObject(); }
void JsonWriter::beginArray() { m_impl->writer.StartArray(); }
void JsonWriter::endArray() { m_impl->writer.EndArray(); }
void JsonWriter::null() { m_impl->writer.Null(); }
void JsonWriter::value(bool value) { m_impl->writer.Bool(value); }
void JsonWriter::value(std::int64_t value) { m_impl->writer.Int64(value); }
void JsonWriter::value(std::uint64_t value) { m_impl->writer.Uint64(value); }
void JsonWriter::value(float value) { m_impl->real(value); }
void JsonWriter::value(double value) { m_impl->real(value); }
void JsonWriter::value(std::string_view bytes) {
  const std::string text = utf8Text(bytes);
  m_impl->writer.String(text.data(), static_cast<rapidjson::SizeType>(text.size()), true);
}

// A cursor over the parsed document: the value to be read next is the root, the next element
// of the innermost array, or the value of the innermost object's current member.
struct JsonReader::Impl {
  struct Frame {
    const rapidjson::Value* container;
    rapidjson::SizeType index = 0;
    const rapidjson::Value* member = nullptr;  ///< objects: the value after key()
  };

  rapidjson::Document document;
  std::vector<Frame> frames;
  bool rootTaken = false;

  const rapidjson::Value* current() const {
    if (frames.empty()) return rootTaken ? nullptr : &document;
    const Frame& top = frames.back();
    if (top.container->IsArray()) {
      return top.index < top.container->Size() ? &(*top.container)[top.index] : nullptr;
    }
    return top.member;
  }

  void consume() {
    if (frames.empty()) {
      rootTaken = true;
    } else if (frames.back().container->IsArray()) {
      ++frames.back().index;
    } else {
      frames.back().member = nullptr;
    }
  }

  template <class Test>
  const rapidjson::Value* take(Test test) {
    const rapidjson::Value* next = current();
    if (!next || !test(*next)) return nullptr;
    consume();
    return next;
  }

  bool enter(bool array, std::size_t& size) {
    if (frames.size() >= deepest) return false;
    const rapidjson::Value* next =
        take([array](const rapidjson::Value& v) { return array ? v.IsArray() : v.IsObject(); });
    if (!next) return false;
    size = array ? next->Size() : next->MemberCount();
    frames.push_back({next});
    return true;
  }
};

namespace {

// Builds a document from rapidjson's reader with every number converted by std::from_chars,
// which is exact and bounded: rapidjson's own full-precision conversion (Debian's 1.1.0)
// reads outside its tables on some long numbers. Integers keep their integer kind; those
// beyond 64 bits become doubles, as rapidjson makes them.
class ExactNumbers {
 public:
  explicit ExactNumbers(std::string_view text) : m_text(text) {}

  template <class Document>
  bool operator()(Document& document) {
    Forward<Document> handler{document, m_outOfRange};
    rapidjson::MemoryStream memory(m_text.data(), m_text.size());
    rapidjson::EncodedInputStream<rapidjson::UTF8<>, rapidjson::MemoryStream> input(memory);
    rapidjson::Reader reader;
    m_result = reader.Parse<rapidjson::kParseNumbersAsStringsFlag | rapidjson::kParseIterativeFlag>(input, handler);
    return !m_result.IsError();
  }

  /// The failure's text, or empty when the text was read.
  std::string error() const {
    if (!m_result.IsError()) return {};
    const char* cause = m_outOfRange ? "number out of range" : rapidjson::GetParseError_En(m_result.Code());
    return fmt::format("JSON parse error at byte {}: {}", m_result.Offset(), cause);
  }

 private:
  template <class Document>
  struct Forward {
    Document& document;
    bool& outOfRange;

    bool Null() { return document.Null(); }
    bool Bool(bool value) { return document.Bool(value); }
    bool Int(int value) { return document.Int(value); }
    bool Uint(unsigned value) { return document.Uint(value); }
    bool Int64(std::int64_t value) { return document.Int64(value); }
    bool Uint64(std::uint64_t value) { return document.Uint64(value); }
    bool Double(double value) { return document.Double(value); }
    bool String(const char* text, rapidjson::SizeType length, bool copy) { return document.String(text, length, copy); }
    bool Key(const char* text, rapidjson::SizeType length, bool copy) { return document.Key(text, length, copy); }
    bool StartObject() { return document.StartObject(); }
    bool EndObject(rapidjson::SizeType members) { return document.EndObject(members); }
    bool StartArray() { return document.StartArray(); }
    bool EndArray(rapidjson::SizeType elements) { return document.EndArray(elements); }
    bool RawNumber(const char* text, rapidjson::SizeType length, bool) {
      const std::string_view number(text, length);
      const bool integer = number.find_first_of(".eE") == std::string_view::npos;
      if (integer && number.front() == '-') {
        if (std::int64_t value = 0; parsed(number, value)) return document.Int64(value);
      } else if (integer) {
        if (std::uint64_t value = 0; parsed(number, value)) return document.Uint64(value);
      }
      double value = 0;
      if (parsed(number, value)) return document.Double(value);
      // Beyond a double: a number too close to zero reads as zero, a too large one is refused.
      if (underflows(number)) return document.Double(number.front() == '-' ? -0.0 : 0.0);
      outOfRange = true;
      return false;
    }
  };

  // Whether a number that no double holds lies below 1 in magnitude: its first significant
  // digit's power of ten (counted from the digits around the point, plus the exponent) is
  // negative.
  static bool underflows(std::string_view number) {
    const std::size_t exponentAt = std::min(number.find_first_of("eE"), number.size());
    const std::string_view digits = number.substr(0, exponentAt);
    const std::size_t point = std::min(digits.find('.'), digits.size());
    const std::size_t first = digits.find_first_of("123456789");
    std::int64_t power = first < point ? std::int64_t(point - first) - 1 : -std::int64_t(first - point);
    if (exponentAt < number.size()) {
      std::string_view written = number.substr(exponentAt + 1);
      const bool negative = written.front() == '-';
      if (written.front() == '-' || written.front() == '+') written.remove_prefix(1);
      std::int64_t exponent = 0;
      // An exponent beyond 64 bits is as good as infinite.
      if (!parsed(written, exponent)) exponent = std::numeric_limits<std::int64_t>::max() / 2;
      power += negative ? -exponent : std::min(exponent, std::numeric_limits<std::int64_t>::max() / 2);
    }
    return power < 0;
  }

  template <class T>
  static bool parsed(std::string_view number, T& value) {
    const auto [end, error] = std::from_chars(number.data(), number.data() + number.size(), value);
    return error == std::errc() && end == number.data() + number.size();
  }

  std::string_view m_text;
  rapidjson::ParseResult m_result;
  bool m_outOfRange = false;
};

}  // namespace

JsonReader::JsonReader(std::string_view text) : m_impl(std::make_unique<Impl>()) {
  ExactNumbers parse(text);
  m_impl->document.Populate(parse);
  if (const std::string error = parse.error(); !error.empty()) raise<exception>("base::JsonReader::JsonReader", error);
}

JsonReader::~JsonReader() = default;

bool JsonReader::beginObject(std::size_t& size) { return m_impl->enter(/*array=*/false, size); }

bool JsonReader::key(base::string& name) {
  if (m_impl->frames.empty() || !m_impl->frames.back().container->IsObject()) return false;
  Impl::Frame& top = m_impl->frames.back();
  if (top.index >= top.container->MemberCount()) return false;
  const auto& member = top.container->MemberBegin()[top.index++];
  name.assign(member.name.GetString(), member.name.GetStringLength());
  top.member = &member.value;
  return true;
}

void JsonReader::endObject() {
  if (!m_impl->frames.empty()) m_impl->frames.pop_back();
}
bool JsonReader::beginArray(std::size_t& size) { return m_impl->enter(/*array=*/true, size); }
void JsonReader::endArray() {
  if (!m_impl->frames.empty()) m_impl->frames.pop_back();
}
bool JsonReader::null() {
  return m_impl->take([](const rapidjson::Value& v) { return v.IsNull(); }) != nullptr;
}

bool JsonReader::value(bool& value) {
  const auto* next = m_impl->take([](const rapidjson::Value& v) { return v.IsBool(); });
  if (next) value = next->GetBool();
  return next != nullptr;
}

bool JsonReader::value(std::int64_t& value) {
  const auto* next = m_impl->take([](const rapidjson::Value& v) { return v.IsInt64(); });
  if (next) value = next->GetInt64();
  return next != nullptr;
}

bool JsonReader::value(std::uint64_t& value) {
  const auto* next = m_impl->take([](const rapidjson::Value& v) { return v.IsUint64(); });
  if (next) value = next->GetUint64();
  return next != nullptr;
}

bool JsonReader::value(double& value) {
  const auto special = [](const rapidjson::Value& v, double& number) {
    const std::string_view text(v.GetString(), v.GetStringLength());
    if (text == "NaN")
      number = std::numeric_limits<double>::quiet_NaN();
    else if (text == "Infinity")
      number = std::numeric_limits<double>::infinity();
    else if (text == "-Infinity")
      number = -std::numeric_limits<double>::infinity();
    else
      return false;
    return true;
  };
  double number = 0;
  const auto* next = m_impl->take([&](const rapidjson::Value& v) {
    if (v.IsNumber()) {
      number = v.GetDouble();
      return true;
    }
    return v.IsString() && special(v, number);
  });
  if (next) value = number;
  return next != nullptr;
}

bool JsonReader::value(base::string& text) {
  const auto* next = m_impl->take([](const rapidjson::Value& v) { return v.IsString(); });
  if (next) text.assign(next->GetString(), next->GetStringLength());
  return next != nullptr;
}

bool JsonReader::nextHasKey(std::string_view name) const {
  const rapidjson::Value* next = m_impl->current();
  return next && next->IsObject() &&
         next->FindMember(rapidjson::Value(rapidjson::StringRef(name.data(), name.size()))) != next->MemberEnd();
}

bool JsonReader::find(std::string_view name) {
  if (m_impl->frames.empty() || !m_impl->frames.back().container->IsObject()) return false;
  Impl::Frame& top = m_impl->frames.back();
  const auto found = top.container->FindMember(rapidjson::Value(rapidjson::StringRef(name.data(), name.size())));
  if (found == top.container->MemberEnd()) return false;
  top.member = &found->value;
  return true;
}

void JsonReader::skip() {
  if (m_impl->current()) m_impl->consume();
}

}  // namespace base
