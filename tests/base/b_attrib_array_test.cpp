#include "b_attrib_array.h"
#include "b_attribute_map.h"
#include "b_binary_io.h"
#include "b_typed_attribute.h"
#include "log_capture.h"

#include <gtest/gtest.h>

#include <memory>

namespace {

using testing_support::LogCapture;

base::name_id operator""_n(const char* text, std::size_t length) { return base::intern({text, length}); }

// An array of an int, a null slot and a map holding a double.
std::unique_ptr<base::AttribArray> sample() {
  auto array = std::make_unique<base::AttribArray>();
  array->append(new base::TypedAttribute<int>(4));
  array->append(nullptr);
  auto* map = new base::AttribMap;
  map->attribute<double>("d"_n) = 0.5;
  array->append(map);
  return array;
}

TEST(AttribArray, OwnsClonesAndErasesItsElements) {
  const auto array = sample();
  std::unique_ptr<base::Attribute> copy(array->clone());
  auto& cloned = *copy->asArray();
  ASSERT_EQ(cloned.size(), 3u);
  EXPECT_EQ(cloned.elements()[1], nullptr);
  EXPECT_NE(cloned.elements()[2], array->elements()[2]);
  EXPECT_EQ(array->compareData(cloned.data()), 0);
  EXPECT_EQ(*static_cast<const int*>(cloned.data(0)), 4);

  EXPECT_FALSE(cloned.hasRuntimeFlag());
  cloned.elements()[2]->flags |= base::attrRuntime;
  EXPECT_TRUE(cloned.hasRuntimeFlag());

  EXPECT_FALSE(cloned.erase(3));
  EXPECT_TRUE(cloned.erase(0));
  EXPECT_EQ(cloned.size(), 2u);
  EXPECT_EQ(array->compareData(cloned.data()), 1);
}

TEST(AttribArray, BinaryRoundTripSkipsElementsOfUnknownTypes) {
  const auto array = sample();
  base::AttribFactory fewer;  // knows int32 only: the map element cannot be read
  fewer.add(base::TypeTraits<int>::n_name, []() -> base::Attribute* { return new base::TypedAttribute<int>; });
  for (bool stringIds : {false, true}) {
    base::StringIdContext ids;
    base::BinaryContext& context = stringIds ? ids : base::plainContext();
    base::Stream stream = base::memStream(0);
    array->write(stream, context);

    stream.setPosition(0);
    base::AttribArray full;
    full.read(stream, context);
    EXPECT_EQ(array->compareData(full.data()), 0);

    stream.setPosition(0);
    LogCapture capture(base::logWarning);
    base::AttribArray partial(&fewer);
    partial.read(stream, context);
    EXPECT_EQ(partial.size(), 2u);
    EXPECT_EQ(stream.getPosition(), stream.getSize());
    EXPECT_EQ(capture.texts().back(), "array attribute: Unknown attribute type 'map'. Ignoring...");
  }
}

TEST(AttribArray, AnUnreadableTypeIsReportedAsCorruption) {
  const auto array = sample();
  base::StringIdContext writer;
  base::Stream stream = base::memStream(0);
  array->write(stream, writer);
  stream.setPosition(0);
  base::StringIdContext reader;  // its table is empty: no id can be read
  LogCapture capture;
  base::AttribArray read;
  EXPECT_THROW(read.read(stream, reader), base::exception);
  EXPECT_EQ(capture.texts().front(),
            "array attribute: Unable to read the attribute type inside! Probably a corrupted file!");
}

}  // namespace
