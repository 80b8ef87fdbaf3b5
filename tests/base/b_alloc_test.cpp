#include "b_alloc.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <limits>

namespace {

// Our text must end standard error; the sanitizer's allocator may say something of its own first.
template <class Allocate>
void expectFailure(Allocate allocate) {
  const std::size_t huge = std::numeric_limits<std::size_t>::max() / 2;
  ::testing::internal::CaptureStderr();
  EXPECT_THROW(allocate(huge), std::bad_alloc);
  const std::string output = ::testing::internal::GetCapturedStderr();
  const std::string expected = "Unable to allocate " + std::to_string(huge) + " bytes!\n";
  ASSERT_GE(output.size(), expected.size()) << output;
  EXPECT_EQ(output.substr(output.size() - expected.size()), expected);
}

TEST(Allocator, FailureWritesTheSizeAndThrowsBadAlloc) {
  expectFailure([](std::size_t size) { return base::StdAllocPolicy::allocateBytes(size, __FILE__, __LINE__, "t"); });
  expectFailure(
      [](std::size_t size) { return base::StdAlignAllocPolicy<16>::allocateBytes(size, __FILE__, __LINE__, "t"); });
}

TEST(Allocator, EverySizeGivesAUsableBlockAlignedAsAsked) {
  for (std::size_t size : {0u, 1u, 3u, 17u, 4096u}) {
    void* plain = base::StdAllocPolicy::allocateBytes(size, __FILE__, __LINE__, "test");
    EXPECT_NE(plain, nullptr);
    base::StdAllocPolicy::deallocateBytes(plain);
    void* aligned = base::StdAlignAllocPolicy<16>::allocateBytes(size, __FILE__, __LINE__, "test");
    EXPECT_NE(aligned, nullptr);
    EXPECT_EQ(reinterpret_cast<std::uintptr_t>(aligned) % 16, 0u);
    base::StdAlignAllocPolicy<16>::deallocateBytes(aligned);
  }
}

TEST(Allocator, CountOverflowIsRejectedBeforeAllocating) {
  base::Allocator<std::uint64_t> allocator;
  EXPECT_THROW(allocator.allocate(std::numeric_limits<std::size_t>::max() / 4), std::bad_array_new_length);
}

}  // namespace
