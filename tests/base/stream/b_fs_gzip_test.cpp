#include "b_exception.h"
#include "b_fs.h"
#include "gzip_data.h"
#include "thrown.h"

#include <gtest/gtest.h>

#include <cstdio>
#include <fstream>
#include <string>

namespace {

using stream_tests::thrown;
using testing_support::gzipped;

std::string text(std::size_t size) {
  std::string data;
  for (std::size_t k = 0; data.size() < size; ++k) data += "line " + std::to_string(k * 7919 % 100003) + "\n";
  data.resize(size);
  return data;
}

// Everything the stream gives, read in pieces of `piece` bytes.
std::string readAll(base::Stream stream, std::uint32_t piece = 4096) {
  std::string out, buffer(piece, '\0');
  while (const std::uint32_t got = stream.read(buffer.data(), piece)) out.append(buffer, 0, got);
  return out;
}

base::Stream inflated(const std::string& compressed) {
  return base::inflateStream(base::memStream(compressed.data(), std::int64_t(compressed.size())), "data.gz");
}

TEST(InflateStream, GivesTheDataOfOneOrMoreMembersInPiecesOfAnySize) {
  const std::string data = text(300000);
  for (const std::uint32_t piece : {1u, 7u, 65536u, 1u << 20}) {
    EXPECT_EQ(readAll(inflated(gzipped(data)), piece), data) << piece;
  }
  // Members one after the other read as one stream; zero padding after them is ignored.
  EXPECT_EQ(readAll(inflated(gzipped("first ") + gzipped("second") + std::string(512, '\0'))), "first second");
  EXPECT_EQ(readAll(inflated(gzipped(""))), "");
  EXPECT_EQ(readAll(inflated("")), "");
  base::Stream stream = inflated(gzipped("abc"));
  EXPECT_FALSE(stream.has(base::capSize) || stream.has(base::capPosition));
  EXPECT_EQ(readAll(stream), "abc");
  EXPECT_TRUE(stream.isEOF());
}

TEST(InflateStream, DataThatEndsEarlyOrIsDamagedThrowsNamingTheStream) {
  const std::string whole = gzipped(text(100000));
  for (std::size_t length = 1; length < whole.size(); length += whole.size() / 37 + 1) {
    const auto error = thrown<base::zlib_exception>([&] { readAll(inflated(whole.substr(0, length))); });
    ASSERT_TRUE(error) << length;
    EXPECT_EQ(std::string(error->what()).rfind("data.gz: ", 0), 0u) << error->what();
  }
  std::string damaged = whole;
  for (std::size_t k = 20; k < 60; ++k) damaged[k] = static_cast<char>(~damaged[k]);
  const auto error = thrown<base::zlib_exception>([&] { readAll(inflated(damaged)); });
  ASSERT_TRUE(error);
  EXPECT_NE(std::string(error->what()).find("corrupt"), std::string::npos) << error->what();
  EXPECT_EQ(error->zlibCode(), -3);  // Z_DATA_ERROR
}

class GzipFiles : public ::testing::Test {
 protected:
  void TearDown() override {
    for (const std::string& path : written) std::remove(path.c_str());
  }
  std::string write(const std::string& name, const std::string& bytes) {
    const std::string path = std::string(base::fs::tmpPath()) + name;
    std::ofstream(path, std::ios::binary) << bytes;
    written.push_back(path);
    return path;
  }
  std::vector<std::string> written;
};

TEST_F(GzipFiles, TheProcessMasterOpensGzipFilesAsTheirDataAndOtherFilesAsTheyAre) {
  base::fs::MasterFS& master = base::fs::master();
  ASSERT_TRUE(master.findFS("gzip"));
  EXPECT_EQ(master.findFS("gzip")->getDesc()->extensions, "gz");
  EXPECT_EQ(master.findFS("gzip")->capabilities(), 0u);

  const std::string data = text(5000);
  EXPECT_EQ(readAll(master.open(write("meshport_gzip_test.ply.gz", gzipped(data)), base::fs::openForReading)), data);
  // A file named .gz that holds no gzip data is read as it is.
  EXPECT_EQ(readAll(master.open(write("meshport_plain_test.ply.gz", data), base::fs::openForReading)), data);
  // A plain file is the system's, a missing one is not found.
  EXPECT_EQ(readAll(master.open(write("meshport_gzip_test.gzip", data), base::fs::openForReading)), data);
  EXPECT_TRUE(thrown<base::fs::file_not_found>(
      [&] { master.open(std::string(base::fs::tmpPath()) + "meshport_none.ply.gz", base::fs::openForReading); }));
}

}  // namespace
