#include "b_exception.h"
#include "b_stream.h"
#include "log_capture.h"
#include "test_streams.h"
#include "thrown.h"

#include <gtest/gtest.h>

#include <string>

namespace {

using stream_tests::thrown;
using stream_tests::thrownText;
using testing_support::fileLikeStream;
using testing_support::FileLikeWorker;
using testing_support::LogCapture;
using testing_support::readAll;

std::string pattern(std::size_t size) {
  std::string data(size, '\0');
  for (std::size_t i = 0; i < size; ++i) data[i] = static_cast<char>('a' + (i * 7) % 26);
  return data;
}

TEST(BufReadStream, CapabilitiesFollowTheSource) {
  // Data in memory gets no buffer, so buffers never stack up; a size only where the source has one.
  base::Stream memory = base::memStream("abc", 3);
  EXPECT_EQ(base::bufReadStream(memory, 0, 64).worker(), memory.worker());
  EXPECT_TRUE(base::bufReadStream(fileLikeStream("x"), 0, 64).has(base::capSize));
  EXPECT_FALSE(base::bufReadStream(fileLikeStream("x", base::capRead), 0, 64).has(base::capSize));
  EXPECT_FALSE(base::bufReadStream(fileLikeStream("x"), 0, 64).has(base::capInMemory));
  EXPECT_TRUE(base::bufWriteStream(base::memStream(0), 64).has(base::capSize));
  EXPECT_FALSE(base::bufWriteStream(fileLikeStream("", base::capWrite), 64).has(base::capSize));
}

TEST(BufReadStream, ReadsAcrossRefillsWithFewSourceCalls) {
  const std::string data = pattern(1000);
  auto* worker = new FileLikeWorker(data);
  base::Stream source = base::Stream::adopt(worker);
  base::Stream buffered = base::bufReadStream(source, 0, 128);
  std::string got;
  char piece[37];
  for (std::uint32_t n; (n = buffered.read(piece, sizeof piece)) > 0;) got.append(piece, n);
  EXPECT_EQ(got, data);
  // 1000 bytes through refills of 64 new bytes each after the first (history is kept).
  EXPECT_LE(worker->reads, 17);
  EXPECT_TRUE(buffered.isEOF());
}

// Stepping back `back` bytes and reading them again is served from the buffer's history.
void expectRereadWithoutSourceAccess(base::Stream& buffered, const FileLikeWorker& worker, const std::string& data,
                                     std::uint32_t back) {
  const int readsBefore = worker.reads;
  const std::int64_t position = buffered.getPosition();
  EXPECT_EQ(buffered.setPosition(-std::int64_t(back), base::seekCurrent), position - back);
  std::string again(back, '\0');
  ASSERT_EQ(buffered.read(again.data(), back), back);
  EXPECT_EQ(again, data.substr(position - back, back));
  EXPECT_EQ(worker.reads, readsBefore);
}

TEST(BufReadStream, HistoryAllowsShortBackwardMovesAfterARefillAndALargeRead) {
  const std::string data = pattern(5000);
  auto* worker = new FileLikeWorker(data);
  base::Stream buffered = base::bufReadStream(base::Stream::adopt(worker), 0, 128);
  std::string got(4000, '\0');
  ASSERT_EQ(buffered.read(got.data(), 100), 100u);
  ASSERT_EQ(buffered.read(got.data(), 50), 50u);  // crosses the buffer's edge: a refill
  expectRereadWithoutSourceAccess(buffered, *worker, data, 60);
  // Larger than the buffer: read around it, and its tail becomes the history.
  ASSERT_EQ(buffered.read(got.data(), 4000), 4000u);
  EXPECT_EQ(got, data.substr(150, 4000));
  expectRereadWithoutSourceAccess(buffered, *worker, data, 10);
}

TEST(BufReadStream, PositionsCountFromTheSourcePositionAndFarSeeksMoveIt) {
  const std::string data = pattern(1000);
  base::Stream source = fileLikeStream(data);
  source.setPosition(100);
  base::Stream buffered = base::bufReadStream(source, 0, 64);
  EXPECT_EQ(buffered.getPosition(), 0);
  EXPECT_EQ(buffered.getSize(), 900);
  EXPECT_EQ(buffered.setPosition(-10, base::seekEnd), 890);
  char buffer[20];
  EXPECT_EQ(buffered.read(buffer, 20), 10u);
  EXPECT_EQ(std::string(buffer, 10), data.substr(990));
  EXPECT_EQ(buffered.setPosition(5000), 900);
}

TEST(BufReadStream, TinyBufferServesLargeAndSmallReads) {
  const std::string data = pattern(200);
  base::Stream buffered = base::bufReadStream(fileLikeStream(data), 0, 16);
  std::string big(100, '\0');
  ASSERT_EQ(buffered.read(big.data(), 100), 100u);
  EXPECT_EQ(buffered.setPosition(-3, base::seekCurrent), 97);
  EXPECT_EQ(big + readAll(buffered).substr(3), data);
}

TEST(BufReadStream, LengthLimitsTheView) {
  base::Stream buffered = base::bufReadStream(fileLikeStream("0123456789"), 4, 64);
  EXPECT_EQ(buffered.getSize(), 4);
  EXPECT_EQ(readAll(buffered), "0123");
}

TEST(BufReadStream, BadOriginsThrow) {
  base::Stream buffered = base::bufReadStream(fileLikeStream("abc"), 0, 64);
  EXPECT_THROW(buffered.setPosition(0, 3), base::switch_exception);
  base::Stream unsized = base::bufReadStream(fileLikeStream("abc", base::capRead | base::capPosition), 0, 64);
  const auto error = thrown<base::unsupported_interface>([&] { unsized.setPosition(0, base::seekEnd); });
  ASSERT_TRUE(error);
  EXPECT_STREQ(error->interfaceName(), "Stream::getSize");
}

TEST(BufReadStream, SourceDoesNotThrowInsideTheBufferAndComesBackWithItsFlags) {
  base::Stream source = fileLikeStream("abc");
  source.flags = base::throwOnShortRead;
  source.tag = 0x100000000;
  base::Stream buffered = base::bufReadStream(source, 0, 64);
  EXPECT_EQ(buffered.tag, 0x100000000u);
  char buffer[10];
  EXPECT_EQ(buffered.read(buffer, 10), 3u);
  base::Stream back = buffered.worker()->getSource();
  EXPECT_EQ(back.flags, base::throwOnShortRead);
  EXPECT_EQ(back.tag, 0x100000000u);
}

TEST(BufReadStream, ReleaseLeavesTheSourceWhereReadingStopped) {
  base::Stream source = fileLikeStream(pattern(1000));
  {
    base::Stream buffered = base::bufReadStream(source, 0, 256);
    char buffer[10];
    buffered.read(buffer, 10);
  }
  EXPECT_EQ(source.getPosition(), 10);
}

TEST(CharStream, OneBytePerReadAndPushbackAtABufferEdge) {
  const std::string data = pattern(200);
  base::Stream chars = base::charStream(fileLikeStream(data), 64);
  char byte = 0;
  char many[8];
  std::string got;
  for (int i = 0; i < 64; ++i) {
    ASSERT_EQ(chars.read(many, 8), 1u);
    got += many[0];
  }
  // The buffer is exhausted: the next read refills, then one byte goes back over the edge.
  ASSERT_EQ(chars.read(&byte, 1), 1u);
  EXPECT_EQ(byte, data[64]);
  EXPECT_EQ(chars.setPosition(-1, base::seekCurrent), 64);
  ASSERT_EQ(chars.read(&byte, 1), 1u);
  EXPECT_EQ(byte, data[64]);
  while (chars.read(&byte, 1) == 1) got += byte;
  EXPECT_EQ(got.size(), 199u);
  EXPECT_EQ(chars.read(&byte, 1), 0u);
}

// A destination that takes `room` bytes in all and at most `perCall` bytes per write.
struct Limited : FileLikeWorker {
  Limited(std::uint32_t room, std::uint32_t perCall = 1000)
      : FileLikeWorker("", base::capWrite | base::capSize), room(room), perCall(perCall) {}
  std::uint32_t write(const void* data, std::uint32_t count) override {
    const std::uint32_t n = std::min({count, perCall, room - static_cast<std::uint32_t>(written.size())});
    written.append(static_cast<const char*>(data), n);
    return n;
  }
  std::int64_t getSize() override { return static_cast<std::int64_t>(written.size()); }
  std::uint32_t room, perCall;
  std::string written;
};

TEST(BufWriteStream, CollectsWritesAndFlushesOnClose) {
  base::Stream target = base::memStream(0);
  {
    base::Stream buffered = base::bufWriteStream(target, 16);
    buffered.write("0123456789", 10);
    EXPECT_EQ(target.getSize(), 0);
    buffered.write("abcdefghij", 10);  // fills the buffer, writes it, then the rest directly
    EXPECT_EQ(target.getSize(), 20);
    buffered.write("tail", 4);
    EXPECT_EQ(target.getSize(), 20);
  }
  target.setPosition(0);
  EXPECT_EQ(readAll(target), "0123456789abcdefghijtail");
}

TEST(BufWriteStream, ShortWriteThrowsWhenTheDestinationAskedForIt) {
  base::Stream destination = base::Stream::adopt(new Limited(5));
  destination.flags = base::throwOnShortWrite;
  base::Stream buffered = base::bufWriteStream(destination, 4, "out");
  EXPECT_EQ(thrownText([&] { buffered.write("0123456789", 10); }),
            "stream 'file-like': trying to write 6 bytes, written 1 bytes");
}

TEST(BufWriteStream, BytesTakenBeforeAShortWriteAreNotWrittenAgain) {
  auto* trickle = new Limited(1000, 2);
  base::Stream destination = base::Stream::adopt(trickle);
  destination.flags = base::throwOnShortWrite;
  base::Stream buffered = base::bufWriteStream(destination, 8);
  buffered.write("abc", 3);
  EXPECT_THROW(buffered.worker()->flush(), base::exception);
  trickle->perCall = 100;
  buffered.write("def", 3);
  buffered.worker()->flush();
  EXPECT_EQ(trickle->written, "abcdef");
}

TEST(BufWriteStream, CloseLogsTheBytesThatWereLost) {
  LogCapture capture;
  {
    base::Stream buffered = base::bufWriteStream(base::Stream::adopt(new Limited(2)), 8, "out");
    buffered.write("abcde", 5);
  }
  EXPECT_EQ(capture.texts(), std::vector<std::string>{"stream 'out': 3 buffered bytes could not be written"});
}

TEST(BufReadStream, LengthEndsAWindowOverASourceWithoutASize) {
  base::Stream window = base::bufReadStream(fileLikeStream("abcdef", base::capRead), 4, 64);
  EXPECT_EQ(readAll(window), "abcd");
  EXPECT_TRUE(window.isEOF());
}

}  // namespace
