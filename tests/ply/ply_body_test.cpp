#include "log_capture.h"
#include "ply_parser.h"
#include "ply_recorder.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <bit>
#include <clocale>
#include <cmath>
#include <cstring>
#include <limits>
#include <string>

namespace {

using namespace std::string_literals;
using testing_support::allSources;
using testing_support::LogCapture;
using testing_support::PlyRecorder;
using testing_support::readPly;
using testing_support::Source;
using testing_support::sourceName;

struct Read {
  ply::ReadResult result;
  PlyRecorder recorder;
  std::vector<std::string> log;
};

Read read(const std::string& text, Source source = Source::memory,
          std::function<bool(const ply::Element&)> accept = {}) {
  LogCapture capture(base::logWarning);
  Read read{};
  if (accept) read.recorder.accept = accept;
  ply::Header header;
  read.result = readPly(text, read.recorder, header, source);
  read.log = capture.texts();
  return read;
}

std::string asciiFile(const std::string& properties, std::size_t count, const std::string& body) {
  return "ply\nformat ascii 1.0\nelement vertex " + std::to_string(count) + "\n" + properties + "end_header\n" + body;
}

TEST(PlyAscii, FloatWords) {
  const Read r = read(asciiFile("property float x\n", 9, "1.5e2 -.5 +7 7abc abc 1.5e+02 -0 .25E-1 1e-50\n"));
  EXPECT_EQ(r.result, ply::ReadResult::complete);
  EXPECT_EQ(r.recorder.instances, (std::vector<std::string>{"150", "-0.5", "7", "7", "0", "150", "-0", "0.025", "0"}));
}

TEST(PlyAscii, NotANumberAndInfinitiesAreKept) {
  const Read r =
      read(asciiFile("property float x\nproperty double y\n", 3, "nan -INF\nInfinity +inf\ninformation NaN\n"));
  EXPECT_EQ(r.recorder.instances, (std::vector<std::string>{"nan -inf", "inf inf", "0 nan"}));
}

TEST(PlyAscii, FloatsAreRoundedOnceToTheNearestFloat) {
  // Parsing as double and narrowing rounds twice: 1.00000005960464477539 is exactly halfway
  // between two floats once rounded to double, and the tie goes the wrong way.
  const std::string halfway = "1.000000059604644775390625000001";
  const Read r = read(asciiFile("property float x\nproperty double y\n", 3,
                                halfway + " 0.1\n3.4028235677973366e38 2.2250738585072011e-308\n1e39 1e-400\n"));
  ASSERT_EQ(r.recorder.instances.size(), 3u);
  EXPECT_EQ(r.recorder.instances[0], fmt::format("{} 0.1", std::nextafter(1.0f, 2.0f)));
  EXPECT_EQ(r.recorder.instances[1], fmt::format("{} {}", std::numeric_limits<float>::max(), 2.2250738585072011e-308));
  EXPECT_EQ(r.recorder.instances[2], "inf 0");
}

TEST(PlyAscii, LongWordsReadTheSameWhereverTheyLie) {
  const std::string word = std::string(1100, '0') + "7";
  std::string body;
  // Enough words before the last one that it crosses the window's first refill.
  while (body.size() < 0x40000 - 500) body += word + "\n";
  const std::size_t count = body.size() / (word.size() + 1) + 1;
  const std::string file = asciiFile("property int x\n", count, body + word);
  for (Source source : allSources) {
    SCOPED_TRACE(sourceName(source));
    const Read r = read(file, source);
    ASSERT_EQ(r.result, ply::ReadResult::complete);
    EXPECT_TRUE(std::all_of(r.recorder.instances.begin(), r.recorder.instances.end(),
                            [](const std::string& value) { return value == "7"; }));
  }
}

TEST(PlyAscii, ListCountsOfRealTypesStayBounded) {
  const Read r = read(
      "ply\nformat ascii 1.0\nelement face 4\nproperty list float int vertex_indices\nend_header\n"
      "nan 1\n-inf 2\n2.9 3 4\n1e30 5 6\n");
  // NaN and -inf count as 0 (their words then read as the next counts); 1e30 asks for more
  // items than there are.
  EXPECT_EQ(r.result, ply::ReadResult::bodyEndedEarly);
  EXPECT_EQ(r.recorder.instances.front(), "{}");
}

TEST(PlyAscii, IntegerWords) {
  const Read r = read(asciiFile("property uchar a\nproperty char b\nproperty char c\nproperty uint d\nproperty int e\n",
                                1, "-1 -1 300 +5 +5\n"));
  EXPECT_EQ(r.recorder.instances, (std::vector<std::string>{"0 -1 300 5 5"}));
}

TEST(PlyAscii, NumbersIgnoreTheLocale) {
  const char* previous = std::setlocale(LC_NUMERIC, nullptr);
  const std::string saved = previous ? previous : "C";
  if (!std::setlocale(LC_NUMERIC, "de_DE.UTF-8")) GTEST_SKIP() << "de_DE.UTF-8 locale not installed";
  const Read r = read(asciiFile("property float x\nproperty double y\n", 1, "1.5 2.25\n"));
  std::setlocale(LC_NUMERIC, saved.c_str());
  EXPECT_EQ(r.recorder.instances, (std::vector<std::string>{"1.5 2.25"}));
}

TEST(PlyAscii, ListsCommentsAndEmptyLists) {
  const std::string file =
      "ply\nformat ascii 1.0\nelement face 4\nproperty list float int vertex_indices\nend_header\n"
      "3.7 1 2 3\ncomment a note where a value belongs\n0\n2 4 5\n0\n";
  const Read r = read(file);
  EXPECT_EQ(r.result, ply::ReadResult::complete);
  EXPECT_EQ(r.recorder.instances, (std::vector<std::string>{"{1 2 3}", "{}", "{4 5}", "{}"}));
}

TEST(PlyAscii, AByteThatStartsNoValueSkipsTheRestOfItsLine) {
  const Read r = read(asciiFile("property int x\nproperty int y\n", 3, "1 2\n3 # 4\n5 6\n"));
  EXPECT_EQ(r.result, ply::ReadResult::complete);
  // The broken instance delivered its first value; the next instance starts on the next line.
  EXPECT_EQ(r.recorder.instances, (std::vector<std::string>{"1 2", "3", "5 6"}));
  EXPECT_EQ(r.log, (std::vector<std::string>{
                       "Unable to parse property instance. Skipping this element instance",
                       "Element 'vertex': 1 of 3 instances could not be parsed; their lines were skipped"}));
}

// A recorder that also hears of the instances that could not be read whole.
struct DroppingRecorder : PlyRecorder {
  void dropInstance(std::uint32_t index) {
    EXPECT_EQ(index + 1, expectedIndex) << "only the instance begun last is dropped";
    instances.back() = "dropped " + instances.back();
  }
};

TEST(PlyBody, InstancesNotReadWholeAreDroppedWithTheReceiverThatAsks) {
  const std::string ascii =
      asciiFile("property int x\nproperty list uchar int i\n", 5, "1 2 0 1\n2 2 0 # 1\n3 1 5\n4 x\n5 3 0 1");
  const std::string binary =
      "ply\nformat binary_little_endian 1.0\nelement vertex 2\nproperty uchar x\nproperty "
      "list uchar uchar i\nend_header\n\x01\x01\x07\x02\x03\x01"s;
  const std::pair<std::string, std::vector<std::string>> cases[] = {
      // A malformed line drops its instance and the next one starts on the next line; a
      // letter word reads 0 and breaks nothing; the end of the data drops the instance it cuts.
      {ascii, {"1 {0 1}", "dropped 2", "3 {5}", "4 {}", "dropped 5"}},
      {binary, {"1 {7}", "dropped 2"}}};
  for (const auto& [file, expected] : cases) {
    for (const Source source : allSources) {
      DroppingRecorder recorder;
      ply::Header header;
      LogCapture quiet;
      base::Stream stream = testing_support::sourceStream(file, source);
      ply::readFile(header, stream, recorder);
      EXPECT_EQ(recorder.instances, expected) << sourceName(source);
    }
  }
}

TEST(PlyAscii, ManySkippedLinesAreCountedNotListed) {
  std::string body;
  for (int k = 0; k < 25; ++k) body += "1 # 2\n";
  const Read r = read(asciiFile("property int x\nproperty int y\n", 25, body));
  EXPECT_EQ(r.log.size(), ply::detail::SkippedLineReport::linesPerElement + 1);
  EXPECT_EQ(r.log.back(), "Element 'vertex': 25 of 25 instances could not be parsed; their lines were skipped");
}

TEST(PlyAscii, BodyEndingEarlyDeliversNothingPastTheEnd) {
  const std::string file =
      "ply\nformat ascii 1.0\nelement vertex 4\nproperty int x\nproperty int y\nelement face 2\n"
      "property list uchar int vertex_indices\nend_header\n100000 200000\n300000 400000\n500000";
  const Read r = read(file);
  EXPECT_EQ(r.result, ply::ReadResult::bodyEndedEarly);
  EXPECT_EQ(r.recorder.elements, (std::vector<std::string>{"vertex", "face"}));
  EXPECT_EQ(r.recorder.instances, (std::vector<std::string>{"100000 200000", "300000 400000", "500000"}));
  EXPECT_EQ(r.log, (std::vector<std::string>{"The data ends early in element 'vertex': 2 of 4 instances read",
                                             "The data ends early in element 'face': 0 of 2 instances read"}));
}

TEST(PlyAscii, HostileListCountReadsOnlyWhatIsThere) {
  const Read r =
      read("ply\nformat ascii 1.0\nelement face 1\nproperty list uint int i\nend_header\n4294967295 1 2 3\n");
  EXPECT_EQ(r.result, ply::ReadResult::bodyEndedEarly);
  EXPECT_TRUE(r.recorder.instances.size() <= 1);
}

std::string binaryFile(const std::string& format, const std::string& properties, std::size_t count,
                       const std::string& body) {
  return "ply\nformat " + format + " 1.0\nelement vertex " + std::to_string(count) + "\n" + properties +
         "end_header\n" + body;
}

TEST(PlyBinary, ByteOrderFollowsTheFormatLine) {
  const std::string bytes = "\x3F\x80\x00\x00\x01\x02\xFF\xFE"s;
  const std::string properties = "property float x\nproperty ushort a\nproperty short b\n";
  const Read big = read(binaryFile("binary_big_endian", properties, 1, bytes));
  EXPECT_EQ(big.recorder.instances, (std::vector<std::string>{"1 258 -2"}));
  const Read little = read(binaryFile("binary_little_endian", properties, 1, bytes));
  EXPECT_EQ(little.recorder.instances,
            (std::vector<std::string>{fmt::format("{} 513 -257", std::bit_cast<float>(0x0000803Fu))}));
}

TEST(PlyBinary, EveryTypeInBothByteOrders) {
  const std::string properties =
      "property char a\nproperty uchar b\nproperty int16 c\nproperty uint16 d\nproperty int e\nproperty uint f\n"
      "property double g\n";
  const std::string little =
      "\xFF\xFF\xFE\xFF\xFE\xFF\xFD\xFF\xFF\xFF\xFD\xFF\xFF\xFF\x00\x00\x00\x00\x00\x00\xF8\x3F"s;
  std::string big = "\xFF\xFF\xFF\xFE\xFF\xFE\xFF\xFF\xFF\xFD\xFF\xFF\xFF\xFD\x3F\xF8\x00\x00\x00\x00\x00\x00"s;
  const std::string expected = "-1 255 -2 65534 -3 4294967293 1.5";
  EXPECT_EQ(read(binaryFile("binary_little_endian", properties, 1, little)).recorder.instances.at(0), expected);
  EXPECT_EQ(read(binaryFile("binary_big_endian", properties, 1, big)).recorder.instances.at(0), expected);
}

TEST(PlyBinary, TruncatedBodyKeepsCompleteInstancesAndFails) {
  const std::string lists =
      "ply\nformat binary_little_endian 1.0\nelement face 3\nproperty list uchar uchar vertex_indices\n"
      "end_header\n\x02\x01\x02\x02\x03\x04\x02\x05"s;
  const Read cut = read(lists);
  EXPECT_EQ(cut.result, ply::ReadResult::bodyEndedEarly);
  EXPECT_EQ(cut.recorder.instances, (std::vector<std::string>{"{1 2}", "{3 4}", ""}));
  EXPECT_EQ(cut.log, (std::vector<std::string>{"Unable to parse property instance.",
                                               "The data ends early in element 'face': 2 of 3 instances read"}));
}

TEST(PlyBinary, HostileListCountFailsThatInstanceCleanly) {
  std::string file = "ply\nformat binary_little_endian 1.0\nelement face 1\nproperty list uint int i\nend_header\n"s +
                     "\xFF\xFF\xFF\xFF"s + std::string(80, '\x01');
  for (Source source : allSources) {
    SCOPED_TRACE(sourceName(source));
    const Read r = read(file, source);
    EXPECT_EQ(r.result, ply::ReadResult::bodyEndedEarly);
    EXPECT_EQ(r.log.back(), "The data ends early in element 'face': 0 of 1 instances read");
  }
}

TEST(PlyBinary, DeclinedElementsAreReadPastInBothEncodings) {
  const std::string head =
      "element skipme 2\nproperty list uchar short l\nproperty int k\nelement vertex 1\n"
      "property uchar x\nend_header\n";
  const auto declineSkipme = [](const ply::Element& element) {
    return element.semantic != ply::ElementSemantic::unknown;
  };
  const std::string binary =
      "ply\nformat binary_big_endian 1.0\n" + head + "\x02\x00\x01\x00\x02\x00\x00\x00\x09\x00\x00\x00\x00\x07\x2A"s;
  const Read b = read(binary, Source::memory, declineSkipme);
  EXPECT_EQ(b.result, ply::ReadResult::complete);
  EXPECT_EQ(b.recorder.instances, (std::vector<std::string>{"42"}));
  const Read a = read("ply\nformat ascii 1.0\n" + head + "2 1 2 9\n0 7\n42\n", Source::memory, declineSkipme);
  EXPECT_EQ(a.recorder.instances, (std::vector<std::string>{"42"}));
}

TEST(PlyBinary, LargeDeclinedElementIsPassedOverInBothSources) {
  const std::string file =
      "ply\nformat binary_little_endian 1.0\nelement skipme 100000\nproperty double d\n"
      "element vertex 1\nproperty uchar x\nend_header\n"s +
      std::string(800000, '\x55') + "\x2A"s;
  for (Source source : allSources) {
    SCOPED_TRACE(sourceName(source));
    const Read r = read(file, source, [](const ply::Element& e) { return e.semantic == ply::ElementSemantic::vertex; });
    EXPECT_EQ(r.result, ply::ReadResult::complete);
    EXPECT_EQ(r.recorder.instances, (std::vector<std::string>{"42"}));
  }
}

TEST(PlyBinary, DeclinedElementRunningPastTheEndFailsLikeARead) {
  const std::string file =
      "ply\nformat binary_little_endian 1.0\nelement skipme 2\nproperty list uchar int l\n"
      "end_header\n\x01\x00\x00\x00\x00\x05\x00"s;
  for (Source source : allSources) {
    SCOPED_TRACE(sourceName(source));
    const Read r = read(file, source, [](const ply::Element&) { return false; });
    EXPECT_EQ(r.result, ply::ReadResult::bodyEndedEarly);
    EXPECT_NE(std::find(r.log.begin(), r.log.end(), "Unable to skip property instance."), r.log.end());
  }
}

TEST(PlyBody, EmptyElementsStillGetTheirCall) {
  const Read r = read("ply\nformat ascii 1.0\nelement vertex 0\nproperty float x\nelement face 0\nend_header\n");
  EXPECT_EQ(r.result, ply::ReadResult::complete);
  EXPECT_EQ(r.recorder.elements, (std::vector<std::string>{"vertex", "face"}));
  EXPECT_TRUE(r.recorder.instances.empty());
}

TEST(PlyBody, ReceiverExceptionsPropagate) {
  struct Throwing {
    bool plyElement(const ply::Element&) { return true; }
    void beginInstance(std::uint32_t) {}
    void plyProperty(const ply::Element&, const ply::Property&, const ply::ValueArray&) {
      base::raise<base::invalid_argument>("test", "value");
    }
  } receiver;
  // Over a buffered pipe the window cannot give back what it read ahead while the exception
  // unwinds: that is logged, and the receiver's exception still arrives.
  const std::string text = asciiFile("property float x\n", 1, "1\n" + std::string(10000, ' '));
  for (Source source : allSources) {
    SCOPED_TRACE(sourceName(source));
    LogCapture capture(base::logWarning);
    base::Stream stream = testing_support::sourceStream(text, source);
    ply::Header header;
    EXPECT_THROW(ply::parseFile(header, stream, receiver), base::invalid_argument);
  }
}

// Bodies larger than the 256 KiB window, read through a stream that is not in memory, so
// that refills happen inside values, words and lists.
TEST(PlyBody, LargeBodiesReadTheSameFromMemoryAndFromAStream) {
  std::string ascii =
      "ply\nformat ascii 1.0\nelement vertex 40000\nproperty float x\nproperty int y\n"
      "element face 20000\nproperty list uchar int vertex_indices\nend_header\n";
  std::string binary =
      "ply\nformat binary_big_endian 1.0\nelement vertex 40000\nproperty float x\nproperty int y\n"
      "element face 20000\nproperty list uchar int vertex_indices\nend_header\n";
  auto putBig = [&binary](std::uint32_t bits) {
    for (int shift = 24; shift >= 0; shift -= 8) binary += static_cast<char>(bits >> shift);
  };
  for (int i = 0; i < 40000; ++i) {
    const float x = static_cast<float>(i) * 0.37f - 5000.0f;
    ascii += fmt::format("{} {}\n", x, -i);
    putBig(std::bit_cast<std::uint32_t>(x));
    putBig(static_cast<std::uint32_t>(-i));
  }
  for (int i = 0; i < 20000; ++i) {
    ascii += fmt::format("3 {} {} {}\n", i, i + 1, i + 2);
    binary += '\x03';
    for (int k = 0; k < 3; ++k) putBig(static_cast<std::uint32_t>(i + k));
  }
  ASSERT_GT(ascii.size(), 0x40000u);
  ASSERT_GT(binary.size(), 0x40000u);
  const Read reference = read(ascii);
  ASSERT_EQ(reference.result, ply::ReadResult::complete);
  ASSERT_EQ(reference.recorder.instances.size(), 60000u);
  EXPECT_EQ(reference.recorder.instances[39999], fmt::format("{} -39999", 39999 * 0.37f - 5000.0f));
  EXPECT_EQ(reference.recorder.instances[59999], "{19999 20000 20001}");
  for (const std::string* file : {&ascii, &binary}) {
    for (Source source : allSources) {
      SCOPED_TRACE(sourceName(source));
      EXPECT_EQ(read(*file, source).recorder.instances, reference.recorder.instances);
    }
  }
}

TEST(PlyBody, HeaderFailureDeliversNothing) {
  const Read r = read("ply\nformat ascii 1.0\nelement vertex 1\nproperty bool b\nend_header\n1\n");
  EXPECT_EQ(r.result, ply::ReadResult::headerFailed);
  EXPECT_TRUE(r.recorder.elements.empty());
}

}  // namespace
