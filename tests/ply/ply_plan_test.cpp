// Plans against the per-property path: a receiver that stores values by a fixed rule either
// through a plan (the reader moves columns) or by itself from plyProperty calls must end
// with the same columns, indices, delivered values and log, for every file and source.

#include "log_capture.h"
#include "plan_values.h"
#include "ply_parser.h"
#include "test_streams.h"

#include <fmt/format.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <map>
#include <sstream>

namespace {

using testing_support::storedBits;

using namespace std::string_literals;
using testing_support::allSources;
using testing_support::LogCapture;
using testing_support::Source;
using testing_support::sourceName;
using Kind = ply::PropertyPlan::Kind;

struct Result {
  ply::ReadResult result{};
  std::map<std::string, std::vector<std::uint32_t>> columns;  // "element/property": stored bits
  std::vector<std::uint32_t> indices;                         // shared by every index list
  std::map<std::string, std::vector<std::uint32_t>> items;    // "element/property": list items
  std::map<std::string, std::vector<std::uint32_t>> counts;   // per element: list or run counts
  std::vector<std::string> delivered;
  std::vector<std::string> log;

  bool operator==(const Result&) const = default;
};

// The rule: vertex index lists to the index sink (strips with restart markers, faces with
// their counts, at most 65535 items); other lists at an odd position to a sink of their own
// as floats, at an even one, when they have 3 items, to a column; the first property of an
// unknown element skipped; from the seventeenth property on, scalars in their own type (in
// a record of two words); before it every fourth scalar delivered, the others stored by a
// conversion that depends on their position.
ply::PropertyPlan planFor(const ply::Element& element, std::size_t p) {
  const ply::Property& property = element.properties[p];
  ply::PropertyPlan plan;
  if (property.isList) {
    plan.kind = property.semantic == ply::PropertySemantic::vertexIndex ? Kind::indices
                : p % 2 == 1                                            ? Kind::itemList
                                                                        : Kind::valueList;
    plan.length = 3;
    plan.sink = plan.kind == Kind::itemList ? static_cast<std::uint32_t>(1 + p) : 0;
  } else if (p == 0 && element.semantic == ply::ElementSemantic::unknown) {
    plan.kind = Kind::skip;
  } else if (p >= 16) {
    plan.kind = Kind::scalar;
    plan.conversion = ply::Conversion::native;
  } else if (p % 4 == 3) {
    plan.kind = Kind::deliver;
  } else {
    plan.kind = Kind::scalar;
    plan.conversion = static_cast<ply::Conversion>(p % 3);
  }
  return plan;
}

std::string valuesText(const ply::ValueArray& values, const ply::Property& property) {
  std::string text;
  for (const ply::Value& value : values) text += fmt::format(" {}", value.convertTo<std::int64_t>(property.type));
  return text;
}

class RuleReceiver {
 public:
  RuleReceiver(Result& result, bool plans) : m_result(result), m_plans(plans) {}

  bool plyElement(const ply::Element& element) {
    finishElement();
    m_current = &element;
    m_element = std::string(ply::displayName(element));
    if (element.semantic == ply::ElementSemantic::vertex && m_vertexCount == ply::ListSink::noRangeCheck) {
      m_vertexCount = element.count;
    }
    return true;
  }

  bool plyPlan(const ply::Element& element, ply::ElementPlan& plan) {
    if (!m_plans) return false;
    base::append(plan.sinks, sink(element));
    for (std::size_t p = 0; p < element.properties.size(); ++p) base::append(plan.sinks, itemSink(p));
    for (std::size_t p = 0; p < element.properties.size(); ++p) {
      ply::PropertyPlan property = planFor(element, p);
      if (property.kind == Kind::scalar || property.kind == Kind::valueList) {
        property.array = static_cast<std::uint32_t>(plan.arrays.size());
        std::vector<std::uint32_t>* target = &column(p);
        const std::size_t words = width(property);
        base::append(plan.arrays, ply::RecordArray{[target, words](std::size_t records) {
                                                     target->resize(records * words);
                                                     return reinterpret_cast<std::byte*>(target->data());
                                                   },
                                                   static_cast<std::uint32_t>(4 * words)});
      }
      base::append(plan.properties, property);
    }
    return true;
  }

  void beginInstance(std::uint32_t index) { m_instance = index; }

  void plyProperty(const ply::Element& element, const ply::Property& property, const ply::ValueArray& values) {
    const std::size_t p = static_cast<std::size_t>(&property - element.properties.data());
    const ply::PropertyPlan plan = planFor(element, p);
    const ply::ListSink indexSink = sink(element);
    if (!m_plans && plan.kind == Kind::scalar && plan.conversion == ply::Conversion::native) {
      const std::uint64_t bits = testing_support::nativeBits(values[0], property);
      cell(p, 2, 0) = static_cast<std::uint32_t>(bits);
      cell(p, 2, 1) = static_cast<std::uint32_t>(bits >> 32);
    } else if (!m_plans && plan.kind == Kind::scalar) {
      cell(p, 1, 0) = storedBits(values[0], property, plan.conversion);
    } else if (!m_plans && plan.kind == Kind::indices && values.size() <= indexSink.maxLength) {
      storeIndices(indexSink, values, property);
    } else if (!m_plans && plan.kind == Kind::itemList && values.size() <= itemSink(p).maxLength) {
      const ply::ListSink items = itemSink(p);
      for (const ply::Value& value : values) items.items->push_back(storedBits(value, property, plan.conversion));
      items.listCounts->push_back(static_cast<std::uint16_t>(values.size()));
    } else if (!m_plans && plan.kind == Kind::valueList && values.size() == plan.length) {
      for (std::size_t k = 0; k < values.size(); ++k) {
        cell(p, 3, k) = storedBits(values[k], property, plan.conversion);
      }
    } else if (plan.kind != Kind::skip) {
      m_result.delivered.push_back(fmt::format("{} {} {}:{}", m_element, p, m_instance, valuesText(values, property)));
    }
  }

  /// Columns without their trailing zeros: a plan over a stream without a size stops
  /// growing them where the data stopped, while a size lets them take the count at once.
  void finish() {
    finishElement();
    for (auto it = m_result.columns.begin(); it != m_result.columns.end();) {
      while (!it->second.empty() && it->second.back() == 0) it->second.pop_back();
      it = it->second.empty() ? m_result.columns.erase(it) : std::next(it);
    }
  }

 private:
  void finishElement() {
    if (m_current) m_report.finish(*m_current);
  }

  static std::size_t width(const ply::PropertyPlan& plan) {
    if (plan.kind == Kind::valueList) return plan.length;
    return plan.conversion == ply::Conversion::native ? 2 : 1;
  }

  std::vector<std::uint32_t>& column(std::size_t p) { return m_result.columns[fmt::format("{}/{}", m_element, p)]; }

  // Word k of the current instance's record of `words` words, grown as instances arrive.
  std::uint32_t& cell(std::size_t p, std::size_t words, std::size_t k) {
    std::vector<std::uint32_t>& target = column(p);
    if (target.size() < (m_instance + 1) * words) target.resize((m_instance + 1) * words);
    return target[m_instance * words + k];
  }

  ply::ListSink sink(const ply::Element& element) {
    ply::ListSink sink;
    sink.items = &m_indices;
    sink.vertexCount = m_vertexCount;
    if (element.semantic == ply::ElementSemantic::tristrips) {
      sink.runCounts = &m_runCounts[m_element];
    } else {
      sink.maxLength = 65535;
      if (element.semantic == ply::ElementSemantic::face) sink.listCounts = &m_listCounts[m_element];
    }
    return sink;
  }

  // Property p's lists of values at most 65535 long, with their counts.
  ply::ListSink itemSink(std::size_t p) {
    const std::string name = fmt::format("{}/{}", m_element, p);
    ply::ListSink sink;
    sink.items = &m_items[name];
    sink.listCounts = &m_itemCounts[name];
    sink.maxLength = 65535;
    return sink;
  }

  // The same rules as the reader's index sink, written out per list.
  void storeIndices(const ply::ListSink& sink, const ply::ValueArray& values, const ply::Property& property) {
    std::uint32_t run = 0;
    for (const ply::Value& value : values) {
      std::uint32_t index = static_cast<std::uint32_t>(value.convertTo<std::int64_t>(property.type));
      if (sink.runCounts && index == 0xFFFFFFFFu) {
        if (run > 0) sink.runCounts->push_back(std::exchange(run, 0u));
        continue;
      }
      if (sink.vertexCount != ply::ListSink::noRangeCheck && index >= sink.vertexCount) {
        m_report.note(index, sink.vertexCount);
        index = 0;
      }
      m_indices.push_back(index);
      ++run;
    }
    if (sink.runCounts) sink.runCounts->push_back(run);
    if (sink.listCounts) sink.listCounts->push_back(static_cast<std::uint16_t>(values.size()));
  }

  Result& m_result;
  bool m_plans;
  const ply::Element* m_current = nullptr;
  std::string m_element;
  std::uint32_t m_instance = 0;
  std::uint32_t m_vertexCount = ply::ListSink::noRangeCheck;
  ply::BadIndexReport m_report;

 public:
  base::vector<std::uint32_t> m_indices;
  std::map<std::string, base::vector<std::uint32_t>> m_items;
  std::map<std::string, base::vector<std::uint16_t>> m_itemCounts;
  std::map<std::string, base::vector<std::uint16_t>> m_listCounts;
  std::map<std::string, base::vector<std::uint32_t>> m_runCounts;
};

Result readWithRule(const std::string& text, Source source, bool plans) {
  Result result;
  LogCapture capture(base::logWarning);
  RuleReceiver receiver(result, plans);
  ply::Header header;
  base::Stream stream = testing_support::sourceStream(text, source);
  result.result = ply::readFile(header, stream, receiver);
  receiver.finish();
  result.indices.assign(receiver.m_indices.begin(), receiver.m_indices.end());
  for (const auto& [name, items] : receiver.m_items) {
    if (!items.empty()) result.items[name].assign(items.begin(), items.end());
  }
  for (const auto& [name, counts] : receiver.m_itemCounts) {
    if (!counts.empty()) result.counts[name + " items"].assign(counts.begin(), counts.end());
  }
  // A plan names its sink's lists before any list arrives: only lists that got counts count.
  for (const auto& [name, counts] : receiver.m_listCounts) {
    if (!counts.empty()) result.counts[name].assign(counts.begin(), counts.end());
  }
  for (const auto& [name, counts] : receiver.m_runCounts) {
    if (!counts.empty()) result.counts[name].assign(counts.begin(), counts.end());
  }
  result.log = capture.texts();
  return result;
}

void expectPathsAgree(const std::string& text) {
  for (Source source : allSources) {
    SCOPED_TRACE(sourceName(source));
    const Result reference = readWithRule(text, source, /*plans=*/false);
    const Result planned = readWithRule(text, source, /*plans=*/true);
    EXPECT_EQ(planned.result, reference.result);
    EXPECT_EQ(planned.columns, reference.columns);
    EXPECT_EQ(planned.indices, reference.indices);
    EXPECT_EQ(planned.items, reference.items);
    EXPECT_EQ(planned.counts, reference.counts);
    EXPECT_EQ(planned.delivered, reference.delivered);
    EXPECT_EQ(planned.log, reference.log);
  }
}

std::vector<std::filesystem::path> dataFiles() {
  std::vector<std::filesystem::path> files;
  for (const char* folder : {"valid", "invalid"}) {
    for (const auto& entry :
         std::filesystem::directory_iterator(std::filesystem::path(MESHPORT_TEST_DATA) / "ply" / folder)) {
      if (entry.path().extension() == ".ply") files.push_back(entry.path());
    }
  }
  const std::filesystem::path corpus = std::filesystem::path(MESHPORT_CORPUS) / "files";
  if (std::filesystem::exists(corpus)) {
    for (const auto& entry : std::filesystem::directory_iterator(corpus)) files.push_back(entry.path());
  }
  std::sort(files.begin(), files.end());
  return files;
}

class DataFile : public ::testing::TestWithParam<std::filesystem::path> {};

TEST_P(DataFile, PlanAndPerPropertyPathsAgree) {
  std::ifstream file(GetParam(), std::ios::binary);
  std::stringstream content;
  content << file.rdbuf();
  expectPathsAgree(content.str());
}

INSTANTIATE_TEST_SUITE_P(Files, DataFile, ::testing::ValuesIn(dataFiles()),
                         [](const ::testing::TestParamInfo<std::filesystem::path>& info) {
                           std::string name =
                               info.param.parent_path().filename().string() + "_" + info.param.stem().string();
                           for (char& c : name) {
                             if (!std::isalnum(static_cast<unsigned char>(c))) c = '_';
                           }
                           return name;
                         });

// Binary bodies built value by value, in either byte order.
class Body {
 public:
  explicit Body(bool big) : m_big(big) {}
  template <class T>
  Body& put(T value) {
    char bytes[sizeof(T)];
    std::memcpy(bytes, &value, sizeof(T));
    if (m_big) std::reverse(bytes, bytes + sizeof(T));
    m_text.append(bytes, sizeof(T));
    return *this;
  }
  const std::string& text() const { return m_text; }

 private:
  bool m_big;
  std::string m_text;
};

std::string binaryFile(bool big, const std::string& elements, const std::string& body) {
  return "ply\nformat "s + (big ? "binary_big_endian" : "binary_little_endian") + " 1.0\n" + elements + "end_header\n" +
         body;
}

TEST(PlyPlan, EveryTypeAndConversionInBothByteOrders) {
  for (bool big : {false, true}) {
    Body body(big);
    for (int i = 0; i < 300; ++i) {
      // Three times every type: the third time each is stored in its own type.
      for (int copy = 0; copy < 3; ++copy) {
        body.put<std::int8_t>(static_cast<std::int8_t>(i - 128)).put<std::uint8_t>(static_cast<std::uint8_t>(i));
        body.put<std::int16_t>(static_cast<std::int16_t>(-i * 100))
            .put<std::uint16_t>(static_cast<std::uint16_t>(i * 200));
        body.put<std::int32_t>(-i * 70000).put<std::uint32_t>(4000000000u + i);
        body.put<float>(i * -0.37f).put<double>(i * 1e300);
      }
    }
    std::string elements = "element vertex 300\n";
    for (int copy = 0; copy < 3; ++copy) {
      elements +=
          "property char a\nproperty uchar b\nproperty short c\nproperty ushort d\n"
          "property int e\nproperty uint f\nproperty float g\nproperty double h\n";
    }
    expectPathsAgree(binaryFile(big, elements, body.text()));
  }
}

TEST(PlyPlan, UniformAndMixedListsWithIndexChecks) {
  for (bool big : {false, true}) {
    Body body(big);
    for (int i = 0; i < 6; ++i) body.put<float>(static_cast<float>(i));
    // Triangles, then a quad, an index out of range, triangles again, an empty list.
    for (int f = 0; f < 5000; ++f) {
      const int corners = f == 2500 ? 4 : (f == 4999 ? 0 : 3);
      body.put<std::uint8_t>(static_cast<std::uint8_t>(corners)).put<float>(f * 0.5f);
      for (int k = 0; k < corners; ++k) body.put<std::int32_t>(f == 1234 && k == 1 ? 6 : (f + k) % 6);
      body.put<std::uint16_t>(static_cast<std::uint16_t>(f));
    }
    const std::string elements =
        "element vertex 6\nproperty float x\nelement face 5000\nproperty list uchar int vertex_indices\n"
        "property float quality\nproperty ushort tag\n";
    expectPathsAgree(binaryFile(big, elements, body.text()));
  }
}

TEST(PlyPlan, SeveralListsRunTogetherUntilAnyLengthChanges) {
  for (bool big : {false, true}) {
    Body body(big);
    for (int i = 0; i < 6; ++i) body.put<float>(static_cast<float>(i));
    // Triangles with six values each; a run where only the values' length changes; quads.
    for (int f = 0; f < 3000; ++f) {
      const int corners = f >= 2000 ? 4 : 3;
      const int values = f >= 1000 && f < 1500 ? 4 : 2 * corners;
      body.put<std::uint8_t>(static_cast<std::uint8_t>(corners));
      for (int k = 0; k < corners; ++k) body.put<std::int32_t>((f + k) % 6);
      body.put<std::uint8_t>(static_cast<std::uint8_t>(values));
      for (int k = 0; k < values; ++k) body.put<float>(static_cast<float>(f) + 0.25f * static_cast<float>(k));
      body.put<std::uint16_t>(static_cast<std::uint16_t>(f));
      body.put<std::uint8_t>(3)
          .put<std::int16_t>(static_cast<std::int16_t>(f))
          .put<std::int16_t>(-1)
          .put<std::int16_t>(7);
    }
    const std::string elements =
        "element vertex 6\nproperty float x\nelement face 3000\nproperty list uchar int vertex_indices\n"
        "property list uchar float texcoord\nproperty ushort tag\nproperty list uchar short three\n";
    expectPathsAgree(binaryFile(big, elements, body.text()));
  }
}

TEST(PlyPlan, TwoIndexListsOfOneElementKeepEachInstanceTogether) {
  for (bool big : {false, true}) {
    Body body(big);
    for (int i = 0; i < 4; ++i) body.put<float>(static_cast<float>(i));
    for (int f = 0; f < 2000; ++f) {
      for (int list = 0; list < 2; ++list) {
        body.put<std::uint8_t>(3);
        for (int k = 0; k < 3; ++k) body.put<std::int32_t>((f + k + list) % 4);
      }
    }
    const std::string elements =
        "element vertex 4\nproperty float x\nelement face 2000\nproperty list uchar int vertex_indices\n"
        "property list uchar int vertex_indices\n";
    expectPathsAgree(binaryFile(big, elements, body.text()));
  }
}

TEST(PlyPlan, StripsWithRestartMarkersAndManyBadIndices) {
  Body body(false);
  body.put<float>(0.5f).put<float>(1.5f).put<float>(2.5f);
  body.put<std::uint32_t>(8);
  for (std::int32_t index : {0, 1, -1, -1, 2, 7, -1, 0}) body.put<std::int32_t>(index);
  body.put<std::uint32_t>(0);
  // 30 indices beyond the three vertices: the first few are listed, then one line counts them.
  body.put<std::uint32_t>(30);
  for (int k = 0; k < 30; ++k) body.put<std::int32_t>(5);
  const std::string file = binaryFile(false,
                                      "element vertex 3\nproperty float x\nelement tristrips 3\n"
                                      "property list uint int vertex_indices\n",
                                      body.text());
  expectPathsAgree(file);
  const Result planned = readWithRule(file, Source::memory, true);
  EXPECT_EQ(planned.counts.at("tristrips"), (std::vector<std::uint32_t>{2, 2, 1, 0, 30}));
  ASSERT_EQ(planned.log.size(), ply::BadIndexReport::linesPerElement + 1);
  EXPECT_EQ(planned.log.front(), "Invalid vertex index detected 7, max 3!");
  EXPECT_EQ(planned.log.back(),
            "Element 'tristrips': 31 invalid vertex indices were stored as 0 (the first 10 are listed above)");
}

TEST(PlyPlan, ListsLongerThanTheSinkTakesGoToTheReceiver) {
  Body body(false);
  body.put<std::uint32_t>(70000);
  for (int k = 0; k < 70000; ++k) body.put<std::int32_t>(k % 7);
  body.put<std::uint32_t>(3).put<std::int32_t>(0).put<std::int32_t>(1).put<std::int32_t>(2);
  const std::string file = binaryFile(false, "element face 2\nproperty list uint int vertex_indices\n", body.text());
  expectPathsAgree(file);
  const Result planned = readWithRule(file, Source::memory, true);
  ASSERT_EQ(planned.delivered.size(), 1u);
  EXPECT_EQ(planned.indices, (std::vector<std::uint32_t>{0, 1, 2}));
}

TEST(PlyPlan, AsciiElementsWithCommentsBadWordsAndAnEarlyEnd) {
  const std::string file =
      "ply\nformat ascii 1.0\nelement vertex 4\nproperty float x\nproperty uchar red\nproperty int i\n"
      "property short s\nelement face 3\nproperty list uchar int vertex_indices\nproperty list uchar float uv\n"
      "end_header\n"
      "1.5 255 -3 7\ncomment here\n-.5e1 128 4 -8\n1 # 2 3\n+7 300 2147483648 -40000\n"
      "3 0 1 2 3 0.25 0.5 1\n4 0 1 2 9 2 1 2\n3 0 1";
  expectPathsAgree(file);
}

TEST(PlyPlan, APlanThatCannotBeFollowedIsRefused) {
  struct Misplanned {
    bool plyElement(const ply::Element&) { return true; }
    void beginInstance(std::uint32_t) {}
    void plyProperty(const ply::Element&, const ply::Property&, const ply::ValueArray&) {}
    bool plyPlan(const ply::Element&, ply::ElementPlan& plan) {
      base::append(plan.arrays, ply::RecordArray{[this](std::size_t records) {
                                                   floats.resize(records);
                                                   return reinterpret_cast<std::byte*>(floats.data());
                                                 },
                                                 4});
      base::append(plan.sinks, ply::ListSink{&items});
      for (const ply::PropertyPlan& property : properties) base::append(plan.properties, property);
      return true;
    }
    std::vector<ply::PropertyPlan> properties;
    std::vector<float> floats;
    base::vector<std::uint32_t> items;
  };
  const ply::PropertyPlan outside{Kind::scalar, ply::Conversion::toFloat, 0, 4};
  const ply::PropertyPlan doubleInFourBytes{Kind::scalar, ply::Conversion::native, 0, 0};
  const ply::PropertyPlan floats{Kind::itemList, ply::Conversion::toFloat};
  const ply::PropertyPlan indicesAsItems{Kind::itemList, ply::Conversion::toIndex};
  for (const auto& properties : std::vector<std::vector<ply::PropertyPlan>>{
           {outside, floats, {}}, {doubleInFourBytes, floats, {}}, {{}, indicesAsItems, {}}}) {
    Misplanned receiver;
    receiver.properties = properties;
    const std::string file =
        "ply\nformat ascii 1.0\nelement vertex 1\nproperty double x\nproperty list uchar float a\n"
        "property list uchar float b\nend_header\n1 1 1 1 1\n";
    base::Stream stream = testing_support::sourceStream(file, Source::memory);
    ply::Header header;
    EXPECT_THROW(ply::readFile(header, stream, receiver), base::invalid_argument);
  }
}

TEST(PlyPlan, HostileCountOverAPipeAllocatesOnlyWhatArrives) {
  // Nothing bounds the count without a size: the columns grow with the data, not the header.
  const std::string file =
      "ply\nformat binary_little_endian 1.0\nelement vertex 4000000000\nproperty float x\n"
      "end_header\n" +
      std::string(400, '\0');
  Result result;
  LogCapture capture(base::logWarning);
  RuleReceiver receiver(result, true);
  ply::Header header;
  base::Stream stream = testing_support::sourceStream(file, Source::pipe);
  EXPECT_EQ(ply::readFile(header, stream, receiver), ply::ReadResult::bodyEndedEarly);
  EXPECT_LE(result.columns.at("vertex/0").size(), 4096u);
}

}  // namespace
