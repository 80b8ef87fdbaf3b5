#include "b_stream.h"
#include "b_exception.h"
#include "log_capture.h"
#include "test_streams.h"
#include "thrown.h"

#include <gtest/gtest.h>

#include <string>

namespace {

using stream_tests::thrown;
using stream_tests::thrownText;
using testing_support::fileLikeStream;
using testing_support::LogCapture;
using testing_support::readAll;

TEST(Stream, FactoriesHandOverTheirOnlyReference) {
  for (base::Stream stream : {base::nullStream(), base::memStream(4), base::memBlockStream()}) {
    EXPECT_EQ(stream.worker()->refCount(), 2u);  // the factory's handle and this copy
  }
}

TEST(Stream, ShortReadAndWriteThrowOnlyWhenAsked) {
  base::Stream stream = base::memStream("abcd", 4);
  char buffer[10];
  EXPECT_EQ(stream.read(buffer, 10), 4u);
  stream.setPosition(0);
  stream.flags |= base::throwOnShortRead;
  EXPECT_EQ(thrownText([&] { stream.read(buffer, 10); }), "stream 'memory': trying to read 10 bytes, read 4 bytes");

  base::Stream readOnly = base::memStream("abcd", 4, "view");
  EXPECT_EQ(readOnly.write("xy", 2), 0u);
  readOnly.flags |= base::throwOnShortWrite;
  EXPECT_EQ(thrownText([&] { readOnly.write("xy", 2); }), "stream 'view': trying to write 2 bytes, written 0 bytes");
}

TEST(Stream, SkipSeeksOrReadsAndReportsRunningPastTheEnd) {
  for (std::uint32_t capabilities : {base::capRead | base::capPosition | base::capSize, std::uint32_t(base::capRead)}) {
    base::Stream stream = fileLikeStream(std::string(2000, 'x'), capabilities);
    EXPECT_EQ(stream.skip(1500), 1500u);
    EXPECT_EQ(thrownText([&] { stream.skip(3000); }), "stream 'file-like': seeking pass the end of stream!");
    base::Stream quiet = fileLikeStream(std::string(2000, 'x'), capabilities);
    quiet.flags = 0;
    EXPECT_EQ(quiet.skip(3000), 2000u);
  }
}

TEST(Stream, CopyOperatorsNeedReadAndWriteAndRestoreTheSource) {
  base::Stream source = fileLikeStream(std::string(600000, 'a') + "end");
  source.setPosition(10);
  base::Stream target = base::memStream(0);
  source >> target;
  EXPECT_EQ(source.getPosition(), 10);
  EXPECT_EQ(target.getSize(), 600000 - 10 + 3);

  base::Stream other = base::memStream(0);
  other << source;
  EXPECT_EQ(other.getSize(), target.getSize());

  base::Stream view = base::memStream("abc", 3, "view");
  const auto reading = thrown<base::unsupported_interface>([&] { source >> view; });
  const auto writing = thrown<base::unsupported_interface>([&] { view << source; });
  ASSERT_TRUE(reading && writing);
  EXPECT_STREQ(reading->interfaceName(), "Stream::read->write");
  EXPECT_STREQ(writing->interfaceName(), "Stream::write->read");

  base::Stream empty = base::memStream(0);
  base::Stream untouched = base::memBlockStream();
  empty >> untouched;
  EXPECT_EQ(untouched.getSize(), 0);
}

TEST(Stream, CopyOperatorThatThrowsStillRestoresTheSource) {
  // The size promises more than the data holds: a short read, reported as asked.
  struct Overstated : testing_support::FileLikeWorker {
    using FileLikeWorker::FileLikeWorker;
    std::int64_t getSize() override { return FileLikeWorker::getSize() + 100; }
  };
  base::Stream source = base::Stream::adopt(new Overstated("0123456789"));
  source.flags |= base::throwOnShortRead;
  source.setPosition(5);
  base::Stream target = base::memStream(0);
  EXPECT_THROW(source >> target, base::exception);
  EXPECT_EQ(source.getPosition(), 5);
}

TEST(CopyStream, PiecewiseCopyHonoursTheMaximumAndReportsFailures) {
  const std::string data(700000, 'q');
  base::Stream fileLike = fileLikeStream(data);
  base::Stream whole = base::memStream(0);
  EXPECT_TRUE(base::copyStream(whole, fileLike));
  EXPECT_EQ(whole.getSize(), 700000);

  base::Stream limited = base::memStream(0);
  base::Stream again = fileLikeStream(data);
  EXPECT_TRUE(base::copyStream(limited, again, 300000));
  EXPECT_EQ(limited.getSize(), 300000);

  base::Stream full = base::memStream("ab", 2, "full");
  EXPECT_FALSE(base::copyStream(full, again));

  // Asking for more than the source holds is a short read when the source says so.
  base::Stream shortSource = fileLikeStream("12345");
  shortSource.flags |= base::throwOnShortRead;
  base::Stream sink = base::memStream(0);
  EXPECT_THROW(base::copyStream(sink, shortSource, 10), base::exception);
}

TEST(CopyStream, StartsAtTheSourcePositionAndMovesPastWhatItCopied) {
  for (bool inMemory : {true, false}) {
    SCOPED_TRACE(inMemory ? "in memory" : "file-like");
    base::Stream source = inMemory ? base::memStream("abcdef", 6) : fileLikeStream("abcdef");
    source.setPosition(3);
    base::string copied;
    base::Stream target = base::stringStream(copied);
    EXPECT_TRUE(base::copyStream(target, source));
    EXPECT_EQ(copied, "def");
    EXPECT_EQ(source.getPosition(), 6);

    source.setPosition(1);
    copied.clear();
    base::Stream limited = base::stringStream(copied);
    EXPECT_TRUE(base::copyStream(limited, source, 2));
    EXPECT_EQ(copied, "bc");
    EXPECT_EQ(source.getPosition(), 3);
  }
}

TEST(ReadLines, SplitsAtLineBreaksAndSkipsBlankRuns) {
  base::Stream stream = base::memStream("a\r\n\r\n  b", 8);
  base::vector<base::string> lines;
  base::readLines(stream, lines);
  ASSERT_EQ(lines.size(), 2u);
  EXPECT_EQ(lines[0], "a");
  EXPECT_EQ(lines[1], "b");
}

TEST(ReadLines, LongInputAcrossPiecesKeepsEveryLine) {
  std::string text;
  for (int i = 0; i < 40000; ++i) text += "line " + std::to_string(i) + (i % 2 ? "\n" : "\r\n");
  text += "last without break";
  base::Stream stream = fileLikeStream(text);
  stream.flags |= base::throwOnShortRead;  // the last short piece is the end, not an error
  base::vector<base::string> lines;
  base::readLines(stream, lines);
  ASSERT_EQ(lines.size(), 40001u);
  EXPECT_EQ(lines[12345], "line 12345");
  EXPECT_EQ(lines.back(), "last without break");
}

TEST(ReadLines, BlanksAfterABreakAreSkippedWhereverAPieceEnds) {
  // The break is the last byte of the first 256 KiB piece; its blanks open the next one.
  const std::string text = std::string(0x40000 - 1, 'x') + "\n  b";
  base::Stream stream = fileLikeStream(text);
  base::vector<base::string> lines;
  base::readLines(stream, lines);
  ASSERT_EQ(lines.size(), 2u);
  EXPECT_EQ(lines[1], "b");
}

struct ThrowingClose : base::StreamWorker {
  explicit ThrowingClose(bool standard) : StreamWorker(base::capRead, "fragile"), standard(standard) {}
  void close() override {
    if (standard) throw std::runtime_error("disk went away");
    throw 42;
  }
  bool standard;
};

TEST(Stream, ReleaseLogsWhatCloseThrows) {
  LogCapture capture;
  base::Stream::adopt(new ThrowingClose(true));
  base::Stream::adopt(new ThrowingClose(false));
  ASSERT_EQ(capture.entries.size(), 2u);
  EXPECT_EQ(capture.entries[0].text, "disk went away");
  EXPECT_EQ(capture.entries[1].text, "Unhandled exception while closing 'fragile'!");
  EXPECT_EQ(capture.entries[1].category, base::logIO);
  EXPECT_EQ(capture.entries[1].level, base::logError);
}

struct ByteCounter : base::Hash {
  void update(const void*, std::size_t size) override { bytes += size; }
  std::unique_ptr<base::Hash> clone() const override { return std::make_unique<ByteCounter>(*this); }
  void reset() override { bytes = 0; }
  base::vector<std::uint8_t> digest() const override { return {static_cast<std::uint8_t>(bytes)}; }
  std::size_t bytes = 0;
};

struct Reopenable : base::StreamWorker {
  Reopenable() : StreamWorker(base::capRead | base::capReopen, "reopenable") {}
  base::Stream reopen() override { return base::Stream::adopt(new Reopenable); }
};

TEST(Stream, CloneReopensAndResetsAClonedHasher) {
  base::Stream original = base::Stream::adopt(new Reopenable);
  auto counter = std::make_unique<ByteCounter>();
  counter->bytes = 7;
  original.worker()->setHasher(std::move(counter));
  original.tag = 0x100000001;
  base::Stream copy = original.clone();
  ASSERT_NE(copy.worker(), original.worker());
  EXPECT_EQ(copy.tag, original.tag);
  auto* cloned = dynamic_cast<ByteCounter*>(copy.worker()->hasher());
  ASSERT_NE(cloned, nullptr);
  EXPECT_EQ(cloned->bytes, 0u);
  EXPECT_EQ(static_cast<ByteCounter*>(original.worker()->hasher())->bytes, 7u);

  EXPECT_THROW(base::memStream(2).clone(), base::unsupported_interface);
}

TEST(NullStream, SwallowsEverythingAndIsItsOwnSource) {
  base::Stream stream = base::nullStream();
  char buffer[4] = {'k', 'k', 'k', 'k'};
  EXPECT_EQ(stream.read(buffer, 4), 4u);
  EXPECT_EQ(buffer[0], 'k');
  EXPECT_EQ(stream.write(buffer, 4), 4u);
  EXPECT_EQ(stream.getSize(), 0);
  EXPECT_TRUE(stream.isEOF());
  EXPECT_EQ(stream.worker()->getSource().worker(), stream.worker());
  EXPECT_EQ(stream.clone().worker(), stream.worker());
}

}  // namespace
