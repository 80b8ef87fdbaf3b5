// The PLY writer against the reader: every type in every encoding reads back as written,
// ASCII numbers in their shortest exact form, lists of any length with a count type that
// holds them.

#include "ply_writer.h"
#include "b_exception.h"
#include "log_capture.h"
#include "ply_recorder.h"

#include <gtest/gtest.h>

#include <bit>
#include <cmath>
#include <cstring>
#include <limits>
#include <random>

namespace {

using namespace std::string_literals;
using ply::DataType;
using ply::Encoding;
using testing_support::PlyRecorder;

constexpr Encoding allEncodings[] = {Encoding::ascii, Encoding::binaryLittleEndian, Encoding::binaryBigEndian};

std::string written(const std::vector<ply::WriteElement>& elements, Encoding encoding) {
  base::vector<std::uint8_t> bytes;
  base::Stream stream = base::vectorStream(bytes);
  ply::writePly(stream, encoding, elements);
  return std::string(bytes.begin(), bytes.end());
}

PlyRecorder readBack(const std::string& file) {
  PlyRecorder recorder;
  ply::Header header;
  EXPECT_EQ(testing_support::readPly(file, recorder, header), ply::ReadResult::complete);
  return recorder;
}

template <class T>
ply::WriteProperty column(std::string name, DataType type, const std::vector<T>& values) {
  ply::WriteProperty property;
  property.name = std::move(name);
  property.type = type;
  property.values = reinterpret_cast<const std::byte*>(values.data());
  property.stride = sizeof(T);
  return property;
}

// The values of every type at their ends and between, one instance each.
struct TypedColumns {
  std::vector<std::int8_t> c{-128, 127, 0};
  std::vector<std::uint8_t> uc{0, 255, 7};
  std::vector<std::int16_t> s{-32768, 32767, -1};
  std::vector<std::uint16_t> us{0, 65535, 300};
  std::vector<std::int32_t> i{std::numeric_limits<std::int32_t>::min(), std::numeric_limits<std::int32_t>::max(), 5};
  std::vector<std::uint32_t> ui{0, 4294967295u, 70000};
  std::vector<float> f{-0.0f, std::numeric_limits<float>::denorm_min(), 0.1f};
  std::vector<double> d{1e308, -5e-324, 0.1};

  ply::WriteElement element() const {
    return {"vertex",
            3,
            {column("c", DataType::int8, c), column("uc", DataType::uint8, uc), column("s", DataType::int16, s),
             column("us", DataType::uint16, us), column("i", DataType::int32, i), column("ui", DataType::uint32, ui),
             column("f", DataType::float32, f), column("d", DataType::float64, d)}};
  }
};

TEST(PlyWriter, EveryTypeReadsBackAsWrittenInEveryEncoding) {
  const TypedColumns columns;
  const std::vector<std::string> expected{"-128 0 -32768 0 -2147483648 0 -0 1e+308",
                                          "127 255 32767 65535 2147483647 4294967295 1e-45 -5e-324",
                                          "0 7 -1 300 5 70000 0.1 0.1"};
  for (const Encoding encoding : allEncodings) {
    EXPECT_EQ(readBack(written({columns.element()}, encoding)).instances, expected) << ply::encodingWord(encoding);
  }
}

TEST(PlyWriter, AsciiNumbersAreShortAndExact) {
  const std::vector<float> floats{0.1f, 1.0f, -2.5f, 16777216.0f};
  const std::string file =
      written({{"vertex", floats.size(), {column("x", DataType::float32, floats)}}}, Encoding::ascii);
  EXPECT_NE(file.find("end_header\n0.1\n1\n-2.5\n16777216\n"), std::string::npos) << file;

  // Random bit patterns, denormals and infinities included, come back bit for bit.
  std::mt19937 random(11);
  std::vector<float> values;
  while (values.size() < 20000) {
    const float value = std::bit_cast<float>(static_cast<std::uint32_t>(random()));
    if (!std::isnan(value)) values.push_back(value);
  }
  values.push_back(std::numeric_limits<float>::infinity());
  const PlyRecorder recorder =
      readBack(written({{"vertex", values.size(), {column("x", DataType::float32, values)}}}, Encoding::ascii));
  ASSERT_EQ(recorder.instances.size(), values.size());
  for (std::size_t k = 0; k < values.size(); k += 97) {
    EXPECT_EQ(recorder.instances[k], fmt::format("{}", values[k])) << k;
  }
}

TEST(PlyWriter, NormalisedFloatsBecomeTheIntegersThatReadBackAsThem) {
  const std::vector<float> colours{0.0f, 1.0f, 128.0f / 255.0f, 2.0f, -1.0f};
  ply::WriteProperty red = column("red", DataType::uint8, colours);
  red.normalised = true;
  for (const Encoding encoding : allEncodings) {
    const PlyRecorder recorder = readBack(written({{"vertex", colours.size(), {red}}}, encoding));
    EXPECT_EQ(recorder.instances, (std::vector<std::string>{"0", "255", "128", "255", "0"}));
  }
}

TEST(PlyWriter, ListsOfOneLengthAndOfManyWithACountTypeThatHoldsThem) {
  std::vector<std::int32_t> items(3 * 4);
  for (std::size_t k = 0; k < items.size(); ++k) items[k] = static_cast<std::int32_t>(k);
  ply::WriteProperty triangles = column("vertex_indices", DataType::int32, items);
  triangles.isList = true;
  triangles.length = 3;
  const std::vector<std::uint32_t> lengths{2, 0, 300, 1};
  std::vector<double> values(303);
  for (std::size_t k = 0; k < values.size(); ++k) values[k] = 0.5 * double(k);
  ply::WriteProperty ragged = column("weights", DataType::float64, values);
  ragged.isList = true;
  ragged.counts = lengths.data();
  ragged.countType = ply::countTypeFor(300);
  EXPECT_EQ(ragged.countType, DataType::uint16);
  EXPECT_EQ(ply::countTypeFor(255), DataType::uint8);
  EXPECT_EQ(ply::countTypeFor(65536), DataType::uint32);
  for (const Encoding encoding : allEncodings) {
    const std::string file = written({{"face", 4, {triangles}}, {"weighted", 4, {ragged}}}, encoding);
    EXPECT_NE(file.find("property list ushort double weights\n"), std::string::npos);
    const PlyRecorder recorder = readBack(file);
    ASSERT_EQ(recorder.instances.size(), 8u);
    EXPECT_EQ(recorder.instances[3], "{9 10 11}");
    EXPECT_EQ(recorder.instances[4], "{0 0.5}");
    EXPECT_EQ(recorder.instances[5], "{}");
    EXPECT_EQ(recorder.instances[6].substr(0, 12), "{1 1.5 2 2.5");
    EXPECT_EQ(recorder.instances[7], "{151}");
  }
}

TEST(PlyWriter, NamesAReaderCannotReadBackAreRefused) {
  const std::vector<float> values{1.0f};
  for (const std::string& name : {""s, "two words"s, "tab\tbed"s, "line\nbreak"s, "nul\0byte"s}) {
    for (const bool ofElement : {false, true}) {
      std::vector<ply::WriteElement> elements{{"vertex", 1, {column("\xC3\xA9t\xC3\xA9", DataType::float32, values)}}};
      (ofElement ? elements[0].name : elements[0].properties[0].name) = name;
      base::vector<std::uint8_t> bytes;
      base::Stream stream = base::vectorStream(bytes);
      try {
        ply::writePly(stream, Encoding::ascii, elements);
        ADD_FAILURE() << "written: " << name;
      } catch (const base::exception& error) {
        EXPECT_NE(std::string(error.what()).find(ofElement ? "the name of element" : "the name of property"),
                  std::string::npos)
            << error.what();
      }
      EXPECT_TRUE(bytes.empty()) << "nothing is written before the header is known to be good";
    }
  }
  // Any other byte is a name's, and reads back as written.
  const std::vector<ply::WriteElement> elements{
      {"donn\xC3\xA9"
       "es",
       1,
       {column("\xFF,#", DataType::float32, values)}}};
  const std::string file = written(elements, Encoding::binaryLittleEndian);
  base::Stream in = base::memStream(file.data(), static_cast<std::int64_t>(file.size()));
  ply::Header header;
  testing_support::LogCapture quiet;
  ASSERT_TRUE(ply::parseHeader(header, in));
  EXPECT_EQ(header.elements.at(0).name,
            "donn\xC3\xA9"
            "es");
  EXPECT_EQ(header.elements.at(0).properties.at(0).name, "\xFF,#");
}

}  // namespace
