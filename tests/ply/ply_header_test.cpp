#include "log_capture.h"
#include "ply_parser.h"
#include "test_streams.h"

#include <gtest/gtest.h>

#include <string>

namespace {

using namespace std::string_literals;
using testing_support::LogCapture;
using testing_support::Source;

struct Parsed {
  bool ok;
  ply::Header header;
  std::vector<std::string> log;
  std::uint64_t tag;
  std::int64_t position;
};

Parsed parse(const std::string& text) {
  LogCapture capture(base::logWarning);
  base::Stream stream = base::memStream(text.data(), static_cast<std::int64_t>(text.size()));
  Parsed result{};
  result.ok = ply::parseHeader(result.header, stream);
  result.log = capture.texts();
  result.tag = stream.tag;
  result.position = stream.getPosition();
  return result;
}

std::string lastMessage(const Parsed& parsed) { return parsed.log.empty() ? "" : parsed.log.back(); }

TEST(PlyHeader, MagicWordInAnyCaseAfterBlanks) {
  EXPECT_TRUE(parse("PLY\nformat ascii 1.0\nend_header\n").ok);
  EXPECT_TRUE(parse("\n  Ply\nformat ascii 1.0\nend_header\n").ok);
}

// Each rejected header, with the message that says why as the last one logged.
TEST(PlyHeader, RejectedHeadersSayWhy) {
  const std::pair<std::string, std::string> cases[] = {
      {"plyx\nformat ascii 1.0\nend_header\n", "Invalid .ply file: Magic number 'ply' is not there."},
      {"", "Invalid .ply file: Magic number 'ply' is not there."},
      {"format ascii 1.0\n", "Invalid .ply file: Magic number 'ply' is not there."},
      {"ply\ncomment made by hand\nformat ascii 1.0\nend_header\n", "Invalid .ply file: Missing format specification"},
      {"ply\nformat binary 1.0\nend_header\n", "Invalid .ply file: Unknown file format binary"},
      {"ply\nformat ascii 1.0\nelement vertex 4294967296\nend_header\n",
       "Invalid .ply file: the count 4294967296 of element 'vertex' does not fit in 32 bits"},
      {"ply\nformat ascii 1.0\nelement vertex 1\nproperty bool flag\nend_header\n1\n",
       "Found unknown data type in PLY file: bool!"},
      {"ply\nformat ascii 1.0\nelement face 1\nproperty list byte int vertex_indices\nend_header\n",
       "Found unknown data type in PLY file: byte!"},
      {"ply\nformat ascii 1.0\nproperty float x\nelement vertex 0\nend_header\n",
       "Invalid .ply file: property declared before any element"},
      {"ply\nformat ascii 1.0\nelement vertex 0\nEND_HEADER\n", "Error reading ply header."},
      // A declaration takes its words from its own line, whatever ends the line.
      {"ply\nformat ascii 1.0\nelement vertex 1\nproperty float\nelement face 1\nend_header\n",
       "Invalid .ply file: line 4 ends before the property's name"},
      {"ply\nformat ascii 1.0\nelement vertex\nproperty float x\nend_header\n",
       "Invalid .ply file: line 3 ends before the count of element 'vertex'"},
      {"ply\r\nformat ascii 1.0\r\ncomment a\r\n\r\nobj_info b\r\nelement \t\r\n",
       "Invalid .ply file: line 6 ends before the element's name"},
      {"ply\rformat ascii 1.0\relement face 1\rproperty list uchar\rint vertex_indices\r",
       "Invalid .ply file: line 4 ends before the list's item type"},
      {"ply\nformat ascii 1.0\nelement face 1\nproperty list\n",
       "Invalid .ply file: line 4 ends before the list's count type"},
      {"ply\nformat ascii 1.0\nelement face 1\nproperty", "Invalid .ply file: line 4 ends before the property's type"},
      {"ply\nformat\nascii 1.0\nend_header\n", "Invalid .ply file: line 2 ends before the format's encoding"},
  };
  for (const auto& [text, message] : cases) {
    const Parsed parsed = parse(text);
    EXPECT_FALSE(parsed.ok) << text;
    EXPECT_EQ(lastMessage(parsed), message) << text;
  }
}

TEST(PlyHeader, FormatLine) {
  // The version is neither read nor checked.
  EXPECT_TRUE(parse("ply\nformat ascii 7.5\nend_header\n").ok);
  EXPECT_TRUE(parse("ply\nformat ascii\nend_header\n").ok);
  const Parsed big = parse("ply\nformat binary_big_endian 1.0\nend_header\n");
  EXPECT_EQ(big.header.encoding, ply::Encoding::binaryBigEndian);
  EXPECT_EQ(big.tag, 1u);
  const Parsed little = parse("ply\nformat binary_little_endian 1.0\nend_header\n");
  EXPECT_EQ(little.header.encoding, ply::Encoding::binaryLittleEndian);
  EXPECT_EQ(little.tag, 0u);
}

TEST(PlyHeader, ElementsAndPropertiesWithTheirSemantics) {
  const Parsed parsed = parse(
      "ply\nformat ascii 1.0\nelement vertex 8\nproperty float x\nproperty uchar red\nproperty float tx\n"
      "property float32 quality\nelement face 2\nproperty list uchar int vertex_indices\n"
      "element weird 0\nproperty int8 w\nend_header\n" +
      std::string(80, '1'));
  ASSERT_TRUE(parsed.ok);
  ASSERT_EQ(parsed.header.elements.size(), 3u);
  const ply::Element& vertex = parsed.header.elements[0];
  EXPECT_EQ(vertex.semantic, ply::ElementSemantic::vertex);
  EXPECT_EQ(vertex.name, "");
  EXPECT_EQ(vertex.count, 8u);
  ASSERT_EQ(vertex.properties.size(), 4u);
  EXPECT_EQ(vertex.properties[0].type, ply::DataType::float32);
  EXPECT_EQ(vertex.properties[0].semantic, ply::PropertySemantic::x);
  EXPECT_EQ(vertex.properties[1].type, ply::DataType::uint8);
  EXPECT_EQ(vertex.properties[1].semantic, ply::PropertySemantic::red);
  EXPECT_EQ(vertex.properties[2].semantic, ply::PropertySemantic::u);
  EXPECT_EQ(vertex.properties[2].name, "");
  EXPECT_EQ(vertex.properties[3].semantic, ply::PropertySemantic::unknown);
  EXPECT_EQ(vertex.properties[3].name, "quality");
  // The header's own spelling stays beside the semantic, so that "tx" and "u" keep apart.
  EXPECT_EQ(vertex.properties[2].word, "tx");
  EXPECT_EQ(vertex.properties[3].word, "quality");
  const ply::Property& indices = parsed.header.elements[1].properties.at(0);
  EXPECT_TRUE(indices.isList);
  EXPECT_EQ(indices.countType, ply::DataType::uint8);
  EXPECT_EQ(indices.type, ply::DataType::int32);
  EXPECT_EQ(indices.semantic, ply::PropertySemantic::vertexIndex);
  EXPECT_EQ(parsed.header.elements[2].semantic, ply::ElementSemantic::unknown);
  EXPECT_EQ(parsed.header.elements[2].name, "weird");
  EXPECT_EQ(parsed.log, (std::vector<std::string>{"Found unknown property semantic in PLY file: quality!",
                                                  "Found unknown element semantic in PLY file: weird!",
                                                  "Found unknown property semantic in PLY file: w!"}));
}

TEST(PlyHeader, ANameIsEveryByteUpToTheNextBlankTabOrLineEnd) {
  // Type words and counts keep the word rule; names take any byte, in any encoding.
  const Parsed parsed = parse(
      "ply\nformat ascii 1.0\nelement donn\xC3\xA9"
      "es 1\nproperty float \xC3\xA9t\xC3\xA9\nproperty int a,b#c\t\n"
      "property list uchar int \xFF\xFE\r\nelement vertex 0\nproperty float x\nend_header\n1 2 0\n");
  ASSERT_TRUE(parsed.ok) << lastMessage(parsed);
  const ply::Element& element = parsed.header.elements.at(0);
  EXPECT_EQ(element.name,
            "donn\xC3\xA9"
            "es");
  EXPECT_EQ(element.word,
            "donn\xC3\xA9"
            "es");
  ASSERT_EQ(element.properties.size(), 3u);
  EXPECT_EQ(element.properties[0].name, "\xC3\xA9t\xC3\xA9");
  EXPECT_EQ(element.properties[1].name, "a,b#c");
  EXPECT_EQ(element.properties[2].name, "\xFF\xFE");
  EXPECT_EQ(parsed.header.elements.at(1).word, "vertex");
  EXPECT_EQ(parsed.header.elements.at(1).properties.at(0).word, "x");
}

TEST(PlyHeader, KeywordsAreCaseSensitiveAndUnknownLinesAreSkipped) {
  const Parsed parsed =
      parse("ply\nformat ascii 1.0\nobj_info made here\nELEMENT vertex 1\ncomment quiet\nend_header\n");
  EXPECT_TRUE(parsed.ok);
  EXPECT_TRUE(parsed.header.elements.empty());
  EXPECT_EQ(parsed.log, (std::vector<std::string>{"Skipped unknown header element obj_info!",
                                                  "Skipped unknown header element ELEMENT!"}));
}

TEST(PlyHeader, WordsLeftAfterADeclarationAreKeywords) {
  const Parsed parsed = parse(
      "ply format ascii 1.0\nelement vertex 1 property float x\n\n  property float y extra\n"
      "end_header\n1 2\n");
  ASSERT_TRUE(parsed.ok);
  ASSERT_EQ(parsed.header.elements.at(0).properties.size(), 2u);
  EXPECT_EQ(parsed.log, std::vector<std::string>{"Skipped unknown header element extra!"});
}

TEST(PlyHeader, WordsFromTheFileAreCutInMessages) {
  const std::string huge(1'000'000, 'k');
  const Parsed parsed = parse("ply\nformat ascii 1.0\n" + huge + "\nelement " + huge + " 0\nend_header\n");
  ASSERT_TRUE(parsed.ok);
  const std::string clipped = std::string(80, 'k') + "...";
  EXPECT_EQ(parsed.log, (std::vector<std::string>{"Skipped unknown header element " + clipped + "!",
                                                  "Found unknown element semantic in PLY file: " + clipped + "!"}));
}

// The body is read later from the same stream: parseHeader must leave it at the first body
// byte even where the stream cannot go back far (before, a pipe behind a read buffer
// aborted the process when the header's read-ahead was given back).
TEST(PlyHeader, LeavesEveryKindOfStreamAtTheFirstBodyByte) {
  const std::string head = "ply\nformat binary_little_endian 1.0\nelement vertex 2\nproperty uchar x\nend_header\n";
  const std::string body = "\x0a\x20" + std::string(100000, 'b');
  for (Source source : testing_support::allSources) {
    SCOPED_TRACE(testing_support::sourceName(source));
    LogCapture capture(base::logWarning);
    base::Stream stream = testing_support::sourceStream(head + body, source);
    ply::Header header;
    ASSERT_TRUE(ply::parseHeader(header, stream));
    EXPECT_EQ(testing_support::readAll(stream), body);
    EXPECT_TRUE(capture.entries.empty());
  }
}

TEST(PlyHeader, APipeThatCannotTakeBackAPeekedByteFailsTheHeader) {
  // A lone CR ends the header line: the byte after it is peeked for an LF.
  LogCapture capture(base::logWarning);
  base::Stream pipe = testing_support::sourceStream("ply\rformat ascii 1.0\rend_header\r7", Source::pipe);
  ply::Header header;
  EXPECT_FALSE(ply::parseHeader(header, pipe));
  EXPECT_EQ(capture.texts(),
            std::vector<std::string>{"stream 'file-like': the 1 bytes read past the header cannot be given back"});
}

TEST(PlyHeader, CountWordsTakeTheirLeadingDigits) {
  EXPECT_EQ(parse("ply\nformat ascii 1.0\nelement vertex 8abc\nend_header\n" + std::string(20, '1'))
                .header.elements.at(0)
                .count,
            8u);
  EXPECT_EQ(parse("ply\nformat ascii 1.0\nelement vertex -5\nend_header\n").header.elements.at(0).count, 0u);
}

TEST(PlyHeader, OnlyOneLineBreakEndsTheHeader) {
  // Each body starts with a byte that is also white space; it must stay in the body.
  for (const std::string breakAndBody : {"\n\n\x01", "\r\n\r\x01", "\r\r\x01", "\r \x01", "\n\t\x01"}) {
    const std::string head =
        "ply\r\nformat binary_little_endian 1.0\r\nelement vertex 1\r\nproperty uchar a\r\n"
        "property uchar b\r\nend_header \t";
    const Parsed parsed = parse(head + breakAndBody);
    ASSERT_TRUE(parsed.ok);
    const std::size_t lineBreak = breakAndBody[0] == '\r' && breakAndBody[1] == '\n' ? 2 : 1;
    EXPECT_EQ(parsed.position, static_cast<std::int64_t>(head.size() + lineBreak));
  }
}

TEST(PlyHeader, CountsMustFitInTheBytesThatFollow) {
  const Parsed binary = parse(
      "ply\nformat binary_little_endian 1.0\nelement vertex 1000000000\nproperty float x\nproperty float y\n"
      "end_header\n0123456789");
  EXPECT_FALSE(binary.ok);
  EXPECT_EQ(lastMessage(binary),
            "Invalid .ply file: element 'vertex' declares 1000000000 instances of at least 8 bytes each; the elements "
            "up to it need at least 8000000000 bytes, but only 10 bytes follow the header");
  // ASCII: two bytes a value, but the last one needs no separator.
  EXPECT_TRUE(parse("ply\nformat ascii 1.0\nelement vertex 2\nproperty uchar a\nend_header\n1 2").ok);
  EXPECT_FALSE(parse("ply\nformat ascii 1.0\nelement vertex 3\nproperty uchar a\nend_header\n1 2").ok);
  // Lists count at their count's size; an element without properties holds no data.
  EXPECT_TRUE(parse("ply\nformat binary_little_endian 1.0\nelement face 4\nproperty list uchar int i\n"
                    "element nothing 4000000000\nend_header\n\0\0\0\0"s)
                  .ok);
}

}  // namespace
