#include "b_string_conversion.h"
#include "b_box.h"
#include "b_color.h"
#include "b_matrix.h"
#include "b_normal.h"
#include "b_quat.h"
#include "b_timecode.h"
#include "b_vec.h"

#include <gtest/gtest.h>

#include <clocale>
#include <cmath>
#include <cstdint>
#include <limits>
#include <string>

namespace {

using base::base_vec3;
using mat43f = base::base_mat43<float, double, base::base_mat33<float>>;

template <class T>
std::string text(const T& value) {
  const base::string out = base::toText(value);
  return std::string(out.data(), out.size());
}

// What an attribute's fromString does: a failed conversion is false and changes nothing.
template <class T>
bool convert(std::string_view input, T& value) {
  try {
    base::from_string(input, value);
    return true;
  } catch (const base::string_conversion_exception&) {
    return false;
  }
}

// The message that from_string throws for `input`, or "" when it converts.
template <class T>
std::string failure(std::string_view input) {
  T value{};
  try {
    base::from_string(input, value);
  } catch (const base::string_conversion_exception& error) {
    EXPECT_STREQ(error.function(), "base::from_string");
    return error.what();
  }
  return "";
}

constexpr double inf = std::numeric_limits<double>::infinity();

TEST(ToText, RealsFixedWithoutTrailingZerosOrShortFormOutsideTheRange) {
  const struct {
    double value;
    bool asFloat;
    const char* expected;
  } cases[] = {
      {2.0, true, "2"},
      {0.5, true, "0.5"},
      {-0.0001, true, "-0.0001"},
      {2e30, true, "2e+30"},
      {1e30, true, "1e+30"},  // 1e30f lies just above 1e30
      {1e30, false, "1000000000000000019884624838656"},
      {-1e31, false, "-1e+31"},
      {0.0, false, "0"},
      {-0.0, false, "-0"},
      {123.456, false, "123.456"},
      {0.0000004, false, "0"},
      {0.1, true, "0.1"},
      {16777217.0, true, "16777216"},
      {std::nan(""), true, "nan"},
      {inf, false, "inf"},
      {-inf, true, "-inf"},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(c.asFloat ? text(static_cast<float>(c.value)) : text(c.value), c.expected) << c.value;
  }
}

TEST(ToText, IntegersAndValueTypesJoinComponentsWithCommas) {
  EXPECT_EQ(text(base_vec3<float>{1, 2.5f, 0}), "1,2.5,0");
  EXPECT_EQ(text(base_vec3<unsigned char>{65, 0, 255}), "65,0,255");  // numbers, not characters
  EXPECT_EQ(text(base::base_vec2<signed char>{-128, 127}), "-128,127");
  EXPECT_EQ(text(std::numeric_limits<std::int64_t>::min()), "-9223372036854775808");
  EXPECT_EQ(text(std::numeric_limits<std::uint64_t>::max()), "18446744073709551615");
  EXPECT_EQ(text(base::TimeCode{-5}), "-5");
  EXPECT_EQ(text(true), "true");
  EXPECT_EQ(text(base::string("a, b")), "a, b");
  EXPECT_EQ(text(base::base_box<base::base_vec2<int>>{{1, 2}, {3, 4}}), "1,2,3,4");
  EXPECT_EQ(text(mat43f{{{{1, 2, 3}, {4, 5, 6}, {7, 8, 9}}}, {0.25, 1e7, -3}}), "1,2,3,4,5,6,7,8,9,0.25,10000000,-3");
}

TEST(FromString, RealsDigitByDigit) {
  const struct {
    const char* input;
    double expected;
  } cases[] = {
      {"2e3", 2000},
      {"+1.5", 1.5},
      {"-0.25", -0.25},
      {"1.", 1},
      {".5", 0.5},
      {"1E2", 100},
      {"25e-1", 2.5},
      {"1.5 rest", 1.5},  // only the character after the number is checked
      {"7\t", 7},
      {"3\n", 3},
      {"3\r\n", 3},
      {"0e999999999999", 0},  // not 0 times infinity
      {"1e999999999999", inf},
      {"-1e-999999999999", 0},
  };
  for (const auto& c : cases) {
    double wide = -1;
    float narrow = -1;
    EXPECT_TRUE(convert(c.input, wide) && convert(c.input, narrow)) << c.input;
    EXPECT_EQ(wide, c.expected) << c.input;
    EXPECT_EQ(narrow, static_cast<float>(c.expected)) << c.input;
  }
  float overflow = 0;
  EXPECT_TRUE(convert("1e39", overflow));
  EXPECT_EQ(overflow, std::numeric_limits<float>::infinity());
  double negativeZero = 1;
  EXPECT_TRUE(convert("-0", negativeZero));
  EXPECT_TRUE(negativeZero == 0 && std::signbit(negativeZero));
}

// Integer digits that would wrap the 64-bit sum are dropped, keeping the sum so far.
TEST(FromString, IntegerDigitsThatWouldWrapAreDropped) {
  const struct {
    const char* input;
    double expected;
  } cases[] = {
      {"18446744073709551615", 18446744073709551615.0},
      {"184467440737095516150", 18446744073709551615.0},
      {"18446744073709551616", 1844674407370955161.0},
      {"30000000000000000000", 3000000000000000000.0},  // ten times the sum wraps, the check sees it
  };
  for (const auto& c : cases) {
    double value = 0;
    EXPECT_TRUE(convert(c.input, value)) << c.input;
    EXPECT_EQ(value, c.expected) << c.input;
  }
}

TEST(FromString, FailuresThrowTheirKindsMessageAndLeaveTheValue) {
  for (const char* input : {"1.5x", "", "-", ".", "e5", "1e", "1e+", "abc", " 1", "1,5", "0x10", "nan", "1.5.2"}) {
    EXPECT_EQ(failure<float>(input), "Can't convert string to float!") << input;
    double value = 4.5;
    EXPECT_FALSE(convert(input, value));
    EXPECT_EQ(value, 4.5);
  }
  for (const char* input : {"256", "-1", "+1", "", "12a", "1.0", " 1"}) {
    EXPECT_EQ(failure<unsigned char>(input), "Can't convert string to unsigned integer!") << input;
  }
  EXPECT_EQ(failure<std::uint64_t>("18446744073709551616"), "Can't convert string to unsigned integer!");
  for (const char* input : {"-129", "128", "", "-", "+-1", "1e2"}) {
    EXPECT_EQ(failure<signed char>(input), "Can't convert string to integer!") << input;
  }
  EXPECT_EQ(failure<std::int64_t>("9223372036854775808"), "Can't convert string to integer!");
  EXPECT_EQ(failure<base::TimeCode>("4.2"), "Can't convert string to integer!");
  for (const char* input : {"yes", "2", "True", "", "10", "truex"}) {
    EXPECT_EQ(failure<bool>(input), "Can't convert string to boolean!") << input;
  }
}

TEST(FromString, IntegersAtTheirLimitsAndBooleanWords) {
  signed char smallest = 0;
  std::int64_t widest = 0;
  std::uint64_t largest = 0;
  unsigned short spaced = 0;
  EXPECT_TRUE(convert("-128", smallest) && convert("-9223372036854775808", widest) &&
              convert("18446744073709551615", largest) && convert("65535 ", spaced));
  EXPECT_EQ(smallest, -128);
  EXPECT_EQ(widest, std::numeric_limits<std::int64_t>::min());
  EXPECT_EQ(largest, std::numeric_limits<std::uint64_t>::max());
  EXPECT_EQ(spaced, 65535);
  int positive = 0;
  EXPECT_TRUE(convert("+7", positive));
  EXPECT_EQ(positive, 7);

  for (const auto& [input, expected] :
       {std::pair{"true", true}, std::pair{"false", false}, std::pair{"1", true}, std::pair{"0", false}}) {
    bool value = !expected;
    EXPECT_TRUE(convert(input, value));
    EXPECT_EQ(value, expected) << input;
  }
}

// Values whose texts read back exactly: the text keeps six decimals and the digit-by-digit
// sum is exact only for short fractions (0.75 reads as 0.7500000000000001 in double).
TEST(FromString, ValueTypesRoundTripThroughText) {
  const auto roundTrip = [](const auto& value) {
    std::remove_cvref_t<decltype(value)> back{};
    EXPECT_TRUE(convert(text(value), back)) << text(value);
    EXPECT_EQ(back, value) << text(value);
  };
  roundTrip(base::base_vec2<float>{-2.25f, 1e6f});
  roundTrip(base_vec3<double>{0.5, -0.125, 123456.75});
  roundTrip(base::base_vec4<int>{-1, 0, 2147483647, -2147483647 - 1});
  roundTrip(base_vec3<unsigned char>{0, 128, 255});
  roundTrip(base::base_quat<float>{0, 0, 0.5f, 1});
  roundTrip(base::base_quat<double>{-1, 0.25, 0, 0.5});
  roundTrip(base::base_box<base_vec3<float>>{{-1, -2, -3}, {1, 2, 3.5f}});
  roundTrip(base::base_box<base::base_vec2<unsigned>>{{0, 1}, {4294967295u, 7}});
  roundTrip(base::base_color4<float>{1, 0.5f, 0.25f, 1});
  roundTrip(base::base_mat22<double>{{{1, 2}, {3, 4}}});
  roundTrip(mat43f{{{{1, 0, 0}, {0, 1, 0}, {0, 0, 1}}}, {1e9, -2.5, 0.125}});
  roundTrip(base::normal{0, 0, -1});
  roundTrip(base::TimeCode{-9000});
  roundTrip(base::string("any text, kept as it is "));
}

TEST(FromString, ValueTypeComponentsMayHaveBlanksAround) {
  base_vec3<float> value;
  EXPECT_TRUE(convert("1, 2.5 ,\t-3", value));
  EXPECT_EQ(value, (base_vec3<float>{1, 2.5f, -3}));
}

TEST(FromString, MalformedValueTypeTextsFailWithTheGenericMessage) {
  for (const char* input : {"1,2", "1,2,3,4", "1,,3", "1,x,3", "", ",1,2", "1,2,3,", "1;2;3", "1.5x,2,3"}) {
    EXPECT_EQ(failure<base_vec3<float>>(input), "Invalid string conversion") << input;
    base_vec3<float> value{7, 8, 9};
    EXPECT_FALSE(convert(input, value));
    EXPECT_EQ(value, (base_vec3<float>{7, 8, 9})) << "changed by " << input;
  }
  EXPECT_EQ(failure<base_vec3<unsigned char>>("1,256,3"), "Invalid string conversion");
  EXPECT_EQ(failure<base::base_box<base::base_vec2<int>>>("1,2,3"), "Invalid string conversion");
}

TEST(StringConversion, IgnoresADecimalCommaLocale) {
  const char* previous = std::setlocale(LC_NUMERIC, nullptr);
  const std::string saved = previous ? previous : "C";
  if (!std::setlocale(LC_NUMERIC, "de_DE.UTF-8")) GTEST_SKIP() << "de_DE.UTF-8 locale not installed";
  const std::string printed = text(base_vec3<float>{0.5f, -1.25f, 2e30f});
  base_vec3<double> parsed;
  const bool converted = convert("0.5,-1.25,3e2", parsed);
  std::setlocale(LC_NUMERIC, saved.c_str());
  EXPECT_EQ(printed, "0.5,-1.25,2e+30");
  EXPECT_TRUE(converted);
  EXPECT_EQ(parsed, (base_vec3<double>{0.5, -1.25, 300}));
}

}  // namespace
