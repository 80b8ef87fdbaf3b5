#include "b_stack_walker.h"

#include <gtest/gtest.h>

#include <thread>

namespace {

TEST(StackWalker, CapturesFramesUnlessTurnedOffOnThisThread) {
  const base::string stack = base::stackWalker().capture();
  ASSERT_FALSE(stack.empty());
  EXPECT_EQ(stack.back(), '\n');
  {
    base::NoStackCapture off;
    EXPECT_TRUE(base::stackWalker().capture().empty());
    bool otherThreadCaptured = false;
    std::thread([&] { otherThreadCaptured = !base::stackWalker().capture().empty(); }).join();
    EXPECT_TRUE(otherThreadCaptured);
  }
  EXPECT_FALSE(base::stackWalker().capture().empty());
}

}  // namespace
