#include "b_alloc.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <limits>

namespace {

// The sanitizer's allocator may say something of its own first; our text must end the output.
void expectFailureText(const std::string& output, std::size_t size) {
  const std::string expected = "Unable to allocate " + std::to_string(size) + " bytes!\n";
  ASSERT_GE(output.size(), expected.size()) << output;
  EXPECT_EQ(output.substr(output.size() - expected.size()), expected);
}

TEST(Allocator, FailureWritesTheSizeAndThrowsBadAlloc) {
  const std::size_t huge = std::numeric_limits<std::size_t>::max() / 2;
  ::testing::internal::CaptureStderr();
  EXPECT_THROW(base::StdAllocPolicy::allocateBytes(huge, __FILE__, __LINE__, "test"), std::bad_alloc);
  expectFailureText(::testing::internal::GetCapturedStderr(), huge);
}

TEST(Allocator, AlignedFailureAlsoThrows) {
  const std::size_t huge = std::numeric_limits<std::size_t>::max() / 2;
  ::testing::internal::CaptureStderr();
  EXPECT_THROW((base::StdAlignAllocPolicy<16>::allocateBytes(huge, __FILE__, __LINE__, "test")), std::bad_alloc);
  expectFailureText(::testing::internal::GetCapturedStderr(), huge);
}

TEST(Allocator, AlignedBlocksAreAligned) {
  for (std::size_t size : {1u, 3u, 17u, 4096u}) {
    void* block = base::StdAlignAllocPolicy<16>::allocateBytes(size, __FILE__, __LINE__, "test");
    EXPECT_EQ(reinterpret_cast<std::uintptr_t>(block) % 16, 0u);
    base::StdAlignAllocPolicy<16>::deallocateBytes(block);
  }
}

TEST(Allocator, ZeroBytesGiveAUsableBlock) {
  void* block = base::StdAllocPolicy::allocateBytes(0, __FILE__, __LINE__, "test");
  EXPECT_NE(block, nullptr);
  base::StdAllocPolicy::deallocateBytes(block);
}

TEST(Allocator, CountOverflowIsRejectedBeforeAllocating) {
  base::Allocator<std::uint64_t> allocator;
  EXPECT_THROW(allocator.allocate(std::numeric_limits<std::size_t>::max() / 4), std::bad_array_new_length);
}

}  // namespace
