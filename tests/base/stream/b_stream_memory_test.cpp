#include "b_exception.h"
#include "b_stream.h"
#include "test_streams.h"
#include "thrown.h"

#include <gtest/gtest.h>

namespace {

using stream_tests::thrownText;
using testing_support::fileLikeStream;
using testing_support::readAll;

TEST(MemStream, ReadOnlyStreamsReadButRefuseWrites) {
  base::vector<std::uint8_t> bytes{'a', 'b'};
  const base::vector<std::uint8_t>& constBytes = bytes;
  base::string text = "ab";
  const base::string& constText = text;
  for (base::Stream stream :
       {base::vectorStream(constBytes), base::stringStream(constText), base::memStream("ab", 2, "view")}) {
    EXPECT_EQ(stream.write("xyz", 3), 0u);
    EXPECT_FALSE(stream.has(base::capSetSize));
    EXPECT_EQ(readAll(stream), "ab");
    EXPECT_TRUE(stream.isEOF());
  }
  EXPECT_EQ(bytes.size(), 2u);
  EXPECT_EQ(text, "ab");
}

TEST(MemStream, PositionsClampIntoTheBlock) {
  base::Stream stream = base::memStream("abcd", 4);
  EXPECT_EQ(stream.setPosition(-5, base::seekBegin), 0);
  EXPECT_EQ(stream.setPosition(5, base::seekEnd), 4);
  EXPECT_EQ(stream.setPosition(-1, base::seekCurrent), 3);
  EXPECT_EQ(stream.setPosition(1, /*origin=*/7), 3);
  EXPECT_FALSE(stream.isEOF());
}

TEST(MemStream, WritesPastTheEndGrowTheBlockAndDropNothing) {
  base::Stream stream = base::memStream("abcd", 4);
  stream.setPosition(2);
  EXPECT_EQ(stream.write("XYZ", 3), 3u);
  EXPECT_EQ(stream.getSize(), 5);
  stream.setPosition(0, base::seekEnd);
  stream.write("123", 3);
  EXPECT_EQ(stream.getSize(), 8);
  stream.setPosition(0);
  EXPECT_EQ(readAll(stream), "abXYZ123");
}

TEST(MemStream, SetSizeAndCloseAndEmptyBlocks) {
  base::Stream stream = base::memStream("abcdef", 6);
  stream.setPosition(5);
  stream.worker()->setSize(2);
  EXPECT_EQ(stream.getPosition(), 2);
  EXPECT_EQ(stream.getSize(), 2);
  stream.worker()->close();
  EXPECT_EQ(stream.getSize(), 0);

  base::Stream none = base::memStream(-3);
  EXPECT_EQ(none.getSize(), 0);
  EXPECT_TRUE(none.isEOF());
}

TEST(MemStream, ViewReadsExternalMemoryWithoutCopying) {
  const char data[] = "view me";
  base::Stream view = base::memStream(data, 7, "view");
  std::int64_t offset = -1, size = -1;
  EXPECT_EQ(view.worker()->getMemory(&offset, &size), reinterpret_cast<const std::uint8_t*>(data));
  EXPECT_EQ(offset, 0);
  EXPECT_EQ(size, 7);
  view.worker()->setSize(1);
  EXPECT_EQ(view.getSize(), 7);
  EXPECT_EQ(readAll(view), "view me");
}

TEST(MemStream, FromASourceTakesWhatIsLeft) {
  base::Stream source = fileLikeStream("0123456789");
  source.setPosition(3);
  base::Stream copy = base::memStream(source);
  EXPECT_EQ(readAll(copy), "3456789");

  base::Stream atItsEnd = base::memStream("abc", 3);
  atItsEnd.setPosition(0, base::seekEnd);
  EXPECT_EQ(base::memStream(atItsEnd).getSize(), 0);

  base::Stream unsized = fileLikeStream("stream without a size", base::capRead);
  base::Stream whole = base::memStream(unsized);
  EXPECT_EQ(readAll(whole), "stream without a size");
}

TEST(MemBlockStream, EachWriteAppendsAndReadsCrossBlocks) {
  base::Stream stream = base::memBlockStream();
  stream.write("ab", 2);
  stream.write("cde", 3);
  stream.write("f", 1);
  EXPECT_EQ(stream.getSize(), 6);
  EXPECT_EQ(stream.getPosition(), 6);
  char nothing[1];
  EXPECT_EQ(stream.read(nothing, 1), 0u);
  // A write after a seek still appends, and leaves the stream at the end.
  stream.setPosition(2);
  stream.write("g", 1);
  EXPECT_EQ(stream.getPosition(), 7);
  EXPECT_EQ(stream.read(nothing, 1), 0u);
  EXPECT_EQ(stream.setPosition(1), 1);
  char buffer[8] = {};
  EXPECT_EQ(stream.read(buffer, 4), 4u);
  EXPECT_EQ(std::string(buffer, 4), "bcde");
  EXPECT_EQ(stream.setPosition(-10, base::seekCurrent), 0);
  EXPECT_EQ(readAll(stream), "abcdefg");
}

TEST(MemBlockStream, OnlyTruncationToZeroIsAResize) {
  base::Stream stream = base::memBlockStream();
  stream.write("abc", 3);
  stream.worker()->setSize(3);
  EXPECT_EQ(stream.getSize(), 3);
  EXPECT_EQ(thrownText([&] { stream.worker()->setSize(2); }), "memBlockStream do not support resizing!");
  stream.worker()->setSize(0);
  EXPECT_EQ(stream.getSize(), 0);
  EXPECT_EQ(stream.getPosition(), 0);
}

TEST(ContainerStreams, WriteIntoTheCallersContainer) {
  base::string text = "hello";
  base::Stream stream = base::stringStream(text);
  stream.setPosition(3);
  stream.write("p me", 4);
  EXPECT_EQ(text, "help me");
  stream.worker()->setSize(4);
  EXPECT_EQ(text, "help");
  EXPECT_EQ(stream.getPosition(), 4);
}

}  // namespace
