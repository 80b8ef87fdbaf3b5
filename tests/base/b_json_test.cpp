// The structured form in JSON: the shapes scripts read, values that read back to the same
// bits, and inputs that do not fit.

#include "b_json.h"
#include "b_attrib_array.h"
#include "b_attrib_link.h"
#include "b_attribute_map.h"
#include "b_box.h"
#include "b_timecode.h"
#include "b_typed_attribute.h"
#include "b_vec.h"
#include "log_capture.h"

#include <gtest/gtest.h>

#include <bit>
#include <cmath>
#include <limits>
#include <memory>

namespace {

using testing_support::LogCapture;

base::name_id operator""_n(const char* text, std::size_t length) { return base::intern({text, length}); }

std::string json(const base::Attribute& attr) {
  base::JsonWriter writer;
  attr.writeValue(writer);
  return std::string(writer.text());
}

// Reads `text` into a fresh attribute of `type`; null when it does not fit.
std::unique_ptr<base::Attribute> fromJson(base::name_id type, const std::string& text) {
  std::unique_ptr<base::Attribute> attr(base::attribFactory().create(type));
  base::JsonReader reader(text);
  if (!attr->readValue(reader)) return nullptr;
  return attr;
}

TEST(Json, EveryFactoryTypeRoundTripsItsDefault) {
  for (base::name_id type : base::attribFactory().types()) {
    std::unique_ptr<base::Attribute> attr(base::attribFactory().create(type));
    const auto copy = fromJson(type, json(*attr));
    ASSERT_NE(copy, nullptr) << base::text(type) << ": " << json(*attr);
    EXPECT_EQ(copy->compareData(attr->data()), 0) << base::text(type);
  }
}

TEST(Json, FloatsReadBackToTheSameBits) {
  const float floats[] = {0.1f,
                          -0.0f,
                          std::numeric_limits<float>::denorm_min(),
                          3.4028235e38f,
                          16777217.0f,
                          std::numeric_limits<float>::quiet_NaN(),
                          std::numeric_limits<float>::infinity(),
                          -std::numeric_limits<float>::infinity()};
  for (float value : floats) {
    const base::TypedAttribute<float> attr(value);
    const auto copy = fromJson(attr.type(), json(attr));
    ASSERT_NE(copy, nullptr) << json(attr);
    const float read = *static_cast<const float*>(copy->data());
    if (std::isnan(value)) {
      EXPECT_TRUE(std::isnan(read));
    } else {
      EXPECT_EQ(std::bit_cast<std::uint32_t>(read), std::bit_cast<std::uint32_t>(value)) << json(attr);
    }
  }
  EXPECT_EQ(json(base::TypedAttribute<float>(0.1f)), "0.1");
  EXPECT_EQ(json(base::TypedAttribute<float>(std::numeric_limits<float>::quiet_NaN())), "\"NaN\"");
  EXPECT_EQ(json(base::TypedAttribute<double>(-std::numeric_limits<double>::infinity())), "\"-Infinity\"");
}

TEST(Json, ValuesThatDoNotFitLeaveTheAttributeUnchanged) {
  base::TypedAttribute<float> value(2.0f);
  for (const char* text : {"1e39", "\"x\"", "[1]", "true", "null"}) {
    base::JsonReader reader(text);
    EXPECT_FALSE(value.readValue(reader)) << text;
    EXPECT_EQ(value.value(), 2.0f);
  }
  base::TypedAttribute<unsigned char> byte;
  base::JsonReader tooLarge("256");
  EXPECT_FALSE(byte.readValue(tooLarge));
  base::TypedAttribute<base::base_vec3<float>> vector;
  base::JsonReader shortVector("[1,2]");
  EXPECT_FALSE(vector.readValue(shortVector));
}

TEST(Json, MapShapeAsScriptsReadIt) {
  base::AttribMap map;
  map.attribute<base::vector<base::base_vec3<float>>>("positions"_n) = {{1, 2.5f, -3}};
  map.attribute<base::base_box<base::base_vec3<float>>>("bounds"_n) = {{-1, -2, -3}, {1, 2, 3}};
  map.attribute<base::TimeCode>("time"_n) = {42};
  map.attribute<base::string>("name"_n) = "a \"quoted\" \xC3\xA9";
  map.attribute<float>("hidden"_n) = 1;
  (*map.findAttributeMutable("hidden"_n))->flags |= base::attrNotStored;
  const std::string text = json(map);
  for (const char* part : {"\"positions^vec3f[]\":[[1,2.5,-3]]", "\"bounds^box3f\":[[-1,-2,-3],[1,2,3]]",
                           "\"time^timecode\":42", "\"name^string\":\"a \\\"quoted\\\" \xC3\xA9\""}) {
    EXPECT_NE(text.find(part), std::string::npos) << part << " in " << text;
  }
  EXPECT_EQ(text.find("hidden"), std::string::npos);
  const auto copy = fromJson("map"_n, text);
  ASSERT_NE(copy, nullptr);
  EXPECT_EQ(copy->size(), 4u);
  EXPECT_EQ(json(*copy), text);
}

TEST(Json, ArraysNestedMapsLinksAndUnknownTypes) {
  base::AttribArray array;
  array.append(new base::TypedAttribute<int>(3));
  array.append(nullptr);
  auto* map = new base::AttribMap;
  map->attribute<double>("d"_n) = 0.25;
  auto* alias = new base::AttribLink;
  alias->fromString("d");
  map->attribute("alias"_n, alias);
  array.append(map);
  const std::string text = json(array);
  EXPECT_EQ(text.substr(0, 36), "[{\"^value\":3,\"^type\":\"int32\"},null,{");
  const auto copy = fromJson("array"_n, text);
  ASSERT_NE(copy, nullptr);
  EXPECT_EQ(copy->compareData(array.data()), 0);

  LogCapture capture(base::logWarning);
  const auto partial = fromJson("array"_n, R"([{"^value":1,"^type":"exotic"},{"x^exotic":1,"y^int32":2}])");
  ASSERT_NE(partial, nullptr);
  ASSERT_EQ(partial->size(), 1u);
  EXPECT_EQ(static_cast<const base::AttribMap::Members*>(partial->data(0))->size(), 1u);
  EXPECT_EQ(capture.entries.size(), 4u);  // per unknown type: the factory's line and the warning
}

TEST(Json, MalformedAndDeeplyNestedInputs) {
  try {
    base::JsonReader reader("{\"a^int32\": }");
    FAIL();
  } catch (const base::exception& error) {
    EXPECT_STREQ(error.what(), "JSON parse error at byte 12: Invalid value.");
  }
  // Nesting beyond what a reader follows is refused, not recursed into.
  const std::string deep = std::string(100000, '[') + std::string(100000, ']');
  EXPECT_EQ(fromJson("array"_n, deep), nullptr);
  const std::string deepMaps = "{\"a^map\":" + std::string() + "{}" + "}";
  EXPECT_NE(fromJson("map"_n, deepMaps), nullptr);
}

// Numbers are converted exactly, keep their integer kind while they fit in 64 bits, and a
// number no double holds is refused; long numbers with long exponents (which once read
// outside the number parser's tables) read or fail cleanly.
TEST(Json, NumbersReadExactlyAndOutOfRangeOnesAreRefused) {
  base::JsonReader reader("[0.1, -0, 18446744073709551615, 18446744073709551616, -9223372036854775809, 5e-324]");
  std::size_t size = 0;
  ASSERT_TRUE(reader.beginArray(size));
  double real = 0;
  std::int64_t negative = 1;
  std::uint64_t unsignedValue = 0;
  EXPECT_TRUE(reader.value(real) && real == 0.1);
  EXPECT_TRUE(reader.value(negative) && negative == 0);
  EXPECT_TRUE(reader.value(unsignedValue) && unsignedValue == 18446744073709551615u);
  EXPECT_TRUE(reader.value(real) && real == 18446744073709551616.0);
  EXPECT_TRUE(reader.value(real) && real == -9223372036854775809.0);
  EXPECT_TRUE(reader.value(real) && real == 5e-324);
  try {
    base::JsonReader tooLarge("[1, 1.8e308]");
    FAIL();
  } catch (const base::exception& error) {
    EXPECT_STREQ(error.what(), "JSON parse error at byte 4: number out of range");
  }
  base::JsonReader tiny("[500000000000100000.777770000775044444e-000000000000000000000000350, -0.0001e-330, 50e-00]");
  ASSERT_TRUE(tiny.beginArray(size));
  EXPECT_TRUE(tiny.value(real) && real == 0 && !std::signbit(real));
  EXPECT_TRUE(tiny.value(real) && real == 0 && std::signbit(real));
  EXPECT_TRUE(tiny.value(real) && real == 50);
}

}  // namespace
