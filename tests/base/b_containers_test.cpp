#include "b_containers.h"

#include <gtest/gtest.h>

#include <cstdint>

namespace {

TEST(GrowthRule, OneElementThenDoublingUpToOneMiB) {
  EXPECT_EQ(base::grownCapacity(0, 4, 1), 1u);
  EXPECT_EQ(base::grownCapacity(1, 4, 2), 2u);
  EXPECT_EQ(base::grownCapacity(1000, 4, 1001), 2000u);
  // 0x40000 floats are exactly 1 MiB: still doubled.
  EXPECT_EQ(base::grownCapacity(0x40000, 4, 0x40001), 0x80000u);
}

TEST(GrowthRule, ByHalfThenAThirdThenAQuarter) {
  EXPECT_EQ(base::grownCapacity(0x100002, 1, 0x100003), 0x100002u + 0x80001u);
  EXPECT_EQ(base::grownCapacity(0x20000000, 1, 0x20000001), 0x30000000u);
  EXPECT_EQ(base::grownCapacity(0x30000000, 1, 0x30000001), 0x30000000u + 0x10000000u);
  EXPECT_EQ(base::grownCapacity(0x41800000, 1, 0x41800001), 0x41800000u + 0x41800000u / 3);
  EXPECT_EQ(base::grownCapacity(0x80000000, 1, 0x80000001), 0x80000000u + 0x20000000u);
}

TEST(GrowthRule, NeverBelowWhatIsNeeded) {
  EXPECT_EQ(base::grownCapacity(0, 4, 100), 100u);
  EXPECT_EQ(base::grownCapacity(10, 4, 1000), 1000u);
  // A single element larger than 1 MiB still grows.
  EXPECT_EQ(base::grownCapacity(1, 0x200000, 2), 2u);
}

TEST(GrowthRule, AppendFollowsTheRule) {
  base::vector<std::uint32_t> values;
  std::vector<std::size_t> capacities;
  for (std::uint32_t i = 0; i < 9; ++i) {
    base::append(values, i);
    capacities.push_back(values.capacity());
  }
  EXPECT_EQ(capacities, (std::vector<std::size_t>{1, 2, 4, 4, 8, 8, 8, 8, 16}));
  EXPECT_EQ(values.back(), 8u);
  base::release(values);
  EXPECT_EQ(values.capacity(), 0u);
}

}  // namespace
