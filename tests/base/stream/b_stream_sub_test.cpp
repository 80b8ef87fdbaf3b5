#include "b_exception.h"
#include "b_stream.h"
#include "test_streams.h"
#include "thrown.h"

#include <gtest/gtest.h>

namespace {

using stream_tests::thrownText;
using testing_support::fileLikeStream;
using testing_support::readAll;

TEST(SubStream, ParentMustPositionAndHoldTheOffset) {
  base::Stream parent = base::memStream("abcd", 4, "parent");
  EXPECT_EQ(thrownText([&] { base::subStream(parent, 6, 1); }), "empty substream of 'parent'!");
  EXPECT_THROW(base::subStream(fileLikeStream("abc", base::capRead), 1, 1), base::unsupported_interface);
  // A negative offset is the parent's start.
  base::Stream window = base::subStream(parent, -3, 2);
  EXPECT_EQ(window.getSize(), 2);
  EXPECT_EQ(readAll(window), "ab");
}

TEST(SubStream, WindowIsCutAtTheParentsEnd) {
  base::Stream parent = base::memStream("abcd", 4, "parent");
  parent.tag = 1;
  base::Stream window = base::subStream(parent, 2, 10);
  EXPECT_EQ(window.getSize(), 2);
  EXPECT_EQ(window.tag, 1u);
  EXPECT_EQ(window.name(), "parent");
  EXPECT_EQ(readAll(window), "cd");
  EXPECT_TRUE(window.isEOF());
}

TEST(SubStream, PositionsAreWindowCoordinatesAndMoveTheParent) {
  base::Stream parent = fileLikeStream("0123456789");
  base::Stream window = base::subStream(parent, 3, 4, "window");
  EXPECT_EQ(window.getPosition(), 0);
  EXPECT_EQ(window.setPosition(2), 2);
  EXPECT_EQ(parent.getPosition(), 5);
  EXPECT_EQ(window.setPosition(9), 4);
  EXPECT_EQ(window.setPosition(-1, base::seekEnd), 3);
  EXPECT_EQ(window.setPosition(-9, base::seekCurrent), 0);
  EXPECT_EQ(readAll(window), "3456");
}

TEST(SubStream, ShortReadThrowsWithTheParentsName) {
  // A parent without a size cannot cut the window, so the window can promise more than
  // the parent holds.
  base::Stream parent = fileLikeStream("abc", base::capRead | base::capPosition);
  parent.flags |= base::throwOnShortRead;
  base::Stream window = base::subStream(parent, 1, 10);
  char buffer[4];
  EXPECT_EQ(thrownText([&] { window.read(buffer, 4); }), "stream 'file-like': trying to read 4 bytes, read 2 bytes");
}

TEST(SubStream, MemoryIsNarrowedToTheWindow) {
  const char data[] = "0123456789";
  base::Stream parent = base::memStream(data, 10, "view");
  base::Stream window = base::subStream(parent, 4, 3);
  std::int64_t offset = 0, size = 0;
  const std::uint8_t* block = window.worker()->getMemory(&offset, &size);
  ASSERT_NE(block, nullptr);
  EXPECT_EQ(std::string(reinterpret_cast<const char*>(block + offset), size), "456");
  base::Stream target = base::memStream(0);
  base::copyStream(target, window);
  EXPECT_EQ(target.getSize(), 3);
}

}  // namespace
