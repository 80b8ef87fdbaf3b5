#include "b_stack_walker.h"

#include <gtest/gtest.h>

#include <thread>

namespace {

TEST(StackWalker, CapturesFramesOfTheCaller) {
  const base::string stack = base::stackWalker().capture();
  EXPECT_FALSE(stack.empty());
  EXPECT_EQ(stack.back(), '\n');
}

TEST(StackWalker, CaptureCanBeTurnedOffPerThread) {
  {
    base::NoStackCapture off;
    EXPECT_TRUE(base::stackWalker().capture().empty());
    // Another thread keeps capturing.
    bool otherThreadCaptured = false;
    std::thread([&] { otherThreadCaptured = !base::stackWalker().capture().empty(); }).join();
    EXPECT_TRUE(otherThreadCaptured);
  }
  EXPECT_FALSE(base::stackWalker().capture().empty());
}

}  // namespace
