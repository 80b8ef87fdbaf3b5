#include "b_progress.h"
#include "gzip_data.h"
#include "log_capture.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace {

using testing_support::LogCapture;

TEST(Progress, ReportsEachPercentOnceAndLogsEveryTenth) {
  LogCapture log;
  {
    base::Progress progress(base::logSystem, "Counting", 1000);
    for (std::uint64_t i = 0; i <= 1000; ++i) progress.at(i);
  }
  // 0 to 100 percent, then the end from the destructor.
  ASSERT_EQ(log.progressReports.size(), 102u);
  EXPECT_EQ(log.progressReports[50].done, 500u);
  EXPECT_EQ(log.progressReports.back().done, 1000u);
  std::vector<std::string> expected;
  for (int percent = 0; percent <= 100; percent += 10) expected.push_back("Counting: " + std::to_string(percent) + "%");
  expected.push_back("Counting: done");
  EXPECT_EQ(log.texts(), expected);
}

TEST(Progress, AReadingStreamReportsHowFarItRead) {
  const std::string data(1000, 'x');
  base::Stream source = base::memStream(data.data(), 1000, "data");
  LogCapture log;
  {
    base::Stream stream = base::progressStream(source, "Reading data");
    EXPECT_FALSE(stream.has(base::capInMemory));
    EXPECT_EQ(stream.getSize(), 1000);
    char buffer[250];
    for (int i = 0; i < 4; ++i) EXPECT_EQ(stream.read(buffer, 250), 250u);
    EXPECT_TRUE(stream.isEOF());
  }
  ASSERT_EQ(log.progressReports.size(), 5u);
  EXPECT_EQ(log.progressReports[0].what, "Reading data");
  EXPECT_EQ(log.progressReports[1].done, 500u);
  EXPECT_EQ(log.progressReports[3].done, 1000u);
}

// Decompressed data has no size: the reads are measured on the compressed stream.
TEST(Progress, DecompressedDataReportsHowFarTheCompressedStreamIsRead) {
  std::string data;
  for (int k = 0; data.size() < 1000000; ++k) data += std::to_string(k * 7919 % 100003) + " ";
  const std::string compressed = testing_support::gzipped(data);
  base::Stream source = base::memStream(compressed.data(), std::int64_t(compressed.size()), "data.gz");
  LogCapture log;
  {
    base::Stream stream = base::progressStream(base::inflateStream(source), "Reading data.gz");
    EXPECT_FALSE(stream.has(base::capSize));
    std::string buffer(4096, '\0');
    while (stream.read(buffer.data(), 4096) > 0) {
    }
  }
  ASSERT_GE(log.progressReports.size(), 3u);
  EXPECT_EQ(log.progressReports.back().total, compressed.size());
  EXPECT_EQ(log.progressReports.back().done, compressed.size());
  EXPECT_GT(log.progressReports[1].done, 0u);
  EXPECT_LT(log.progressReports[1].done, compressed.size());
}

}  // namespace
