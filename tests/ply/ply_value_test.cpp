#include "ply_value.h"
#include "b_exception.h"

#include <gtest/gtest.h>

#include <bit>
#include <limits>

namespace {

ply::Value make(auto member) {
  ply::Value value;
  value.d = 0;
  if constexpr (std::is_same_v<decltype(member), float>) value.f = member;
  if constexpr (std::is_same_v<decltype(member), double>) value.d = member;
  if constexpr (std::is_same_v<decltype(member), int>) value.i = member;
  if constexpr (std::is_same_v<decltype(member), unsigned>) value.u = member;
  return value;
}

ply::Property typed(ply::DataType type) {
  ply::Property property;
  property.type = type;
  return property;
}

TEST(PlyValue, IntegerConversionReadsPatternsAsUnsignedAndTruncatesReals) {
  EXPECT_EQ(make(-1).convertTo<std::int64_t>(ply::DataType::int32), 4294967295);
  EXPECT_EQ(make(7u).convertTo<std::int64_t>(ply::DataType::uint8), 7);
  EXPECT_EQ(make(2.9f).convertTo<std::int64_t>(ply::DataType::float32), 2);
  EXPECT_EQ(make(-2.9f).convertTo<std::int64_t>(ply::DataType::float32), -2);
  EXPECT_EQ(make(3.7).convertTo<std::int64_t>(ply::DataType::float64), 3);
  // Out of range or NaN stays defined.
  EXPECT_EQ(make(std::numeric_limits<float>::quiet_NaN()).convertTo<std::int64_t>(ply::DataType::float32), 0);
  EXPECT_EQ(make(1e30).convertTo<std::int64_t>(ply::DataType::float64), std::numeric_limits<std::int64_t>::max());
}

TEST(PlyValue, FloatConversionFollowsSignedness) {
  EXPECT_EQ(make(-3).convertTo<float>(ply::DataType::int16), -3.0f);
  EXPECT_EQ(make(4294967295u).convertTo<float>(ply::DataType::uint32), 4294967296.0f);
  EXPECT_EQ(make(0.1).convertTo<float>(ply::DataType::float64), 0.1f);
}

TEST(PlyValue, NormalisedIntegersAndUnchangedReals) {
  EXPECT_EQ(ply::toFP(make(255u), typed(ply::DataType::uint8)), 1.0f);
  EXPECT_EQ(ply::toFP(make(0u), typed(ply::DataType::uint8)), 0.0f);
  EXPECT_EQ(ply::toFP(make(-127), typed(ply::DataType::int8)), -1.0f);
  EXPECT_EQ(ply::toFP(make(2.5f), typed(ply::DataType::float32)), 2.5f);
  EXPECT_EQ(ply::toFP(make(2.5), typed(ply::DataType::float64)), 2.5f);
  // The factor is the single-precision reciprocal, applied to the converted value.
  EXPECT_EQ(ply::toFP(make(1u), typed(ply::DataType::uint16)), std::bit_cast<float>(0x37800080u));
  EXPECT_EQ(ply::toFP(make(1), typed(ply::DataType::int32)), std::bit_cast<float>(0x30000000u));
  EXPECT_EQ(ply::toFP(make(1u), typed(ply::DataType::uint32)), std::bit_cast<float>(0x2F800000u));
  EXPECT_EQ(ply::toFP(make(1), typed(ply::DataType::int16)), std::bit_cast<float>(0x38000100u));
}

TEST(PlyValue, UnknownTypesThrowTheSwitchException) {
  try {
    make(1).convertTo<float>(ply::DataType::none);
    FAIL();
  } catch (const base::switch_exception& error) {
    EXPECT_STREQ(error.function(), "ply::Value::convertTo");
  }
  try {
    ply::toFP(make(1), typed(ply::DataType::none));
    FAIL();
  } catch (const base::switch_exception& error) {
    EXPECT_STREQ(error.function(), "ply::toFP");
  }
  EXPECT_THROW(make(1).convertTo<std::int64_t>(ply::DataType::none), base::switch_exception);
}

}  // namespace
