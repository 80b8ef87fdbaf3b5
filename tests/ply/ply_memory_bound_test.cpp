// Importing a file of N bytes never needs more than a small multiple of N plus a fixed
// amount: every test file is imported in a child process whose address space is limited to
// what it already holds, 16 MiB and 16 times the file's size. An allocation beyond that
// fails, and the child reports it by its exit status. Gzip files are held to the size of
// the data they hold: their stream has no size, so no count is bounded before data arrives.

#include "address_limit.h"
#include "b_exception.h"
#include "gzip_data.h"
#include "log_capture.h"
#include "scene_import.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <new>

#include <fstream>
#include <iterator>
#include <string>
#include <vector>

namespace {

namespace stdfs = std::filesystem;

#if defined(MESHPORT_HAS_ADDRESS_LIMIT)

using testing_support::allocationFailed;

constexpr std::uint64_t fixedBytes = 16u << 20;
constexpr std::uint64_t bytesPerFileByte = 16;

[[noreturn]] void importUnderLimit(const stdfs::path& path, std::uint64_t dataBytes = 0) {
  testing_support::LogCapture quiet;
  if (dataBytes == 0) dataBytes = stdfs::file_size(path);
  testing_support::limitAddressSpace(fixedBytes + bytesPerFileByte * dataBytes);
  try {
    testing_support::importFile(path.string());
  } catch (const base::exception&) {
    // A refusal is a fine answer; running out of memory is not.
  } catch (const std::bad_alloc&) {
    _exit(allocationFailed);
  }
  _exit(0);
}

TEST(MemoryBound, EveryTestFileImportsWithinASmallMultipleOfItsSize) {
  testing_support::pluginFactory();  // loaded before the limit, as a host loads it at start-up
  for (const char* folder : {"valid", "invalid"}) {
    for (const auto& entry : stdfs::directory_iterator(stdfs::path(MESHPORT_TEST_DATA) / "ply" / folder)) {
      if (entry.path().extension() != ".ply") continue;
      EXPECT_EXIT(importUnderLimit(entry.path()), ::testing::ExitedWithCode(0), "^$") << entry.path();
    }
  }
}

// The files that make the most of each byte: a one-byte x per vertex becomes 12 bytes of
// position, and a face of no corners (one byte) holds room for a triangle's indices and
// its count. Big enough that the multiple, not the fixed amount, decides.
TEST(MemoryBound, DenseFilesStayWithinTheMultiple) {
  testing_support::pluginFactory();
  constexpr std::size_t count = 4u << 20;
  const std::string vertices = "ply\nformat binary_little_endian 1.0\nelement vertex " + std::to_string(count) +
                               "\nproperty uchar x\nend_header\n" + std::string(count, '\1');
  const std::string faces =
      "ply\nformat binary_little_endian 1.0\nelement vertex 1\nproperty float x\n"
      "element face " +
      std::to_string(count) + "\nproperty list uchar uint vertex_indices\nend_header\n" + std::string(4, '\0') +
      std::string(count, '\0');
  // A million one-byte materials (256 distinct ones), and as many distinct float materials
  // as a material element of its size may make.
  std::string materials = "ply\nformat binary_little_endian 1.0\nelement material " + std::to_string(count) +
                          "\nproperty uchar diffuse_red\nend_header\n";
  for (std::size_t k = 0; k < count; ++k) materials += static_cast<char>(k * 7);
  std::string distinct =
      "ply\nformat binary_little_endian 1.0\nelement material 100000\nproperty float "
      "diffuse_red\nend_header\n";
  for (std::uint32_t k = 0; k < 100000; ++k) {
    const float value = static_cast<float>(k % 11000);
    distinct.append(reinterpret_cast<const char*>(&value), sizeof value);
  }
  for (const std::string& content : {vertices, faces, materials, distinct}) {
    const testing_support::TemporaryFile file("dense.ply", content);
    EXPECT_EXIT(importUnderLimit(file.path()), ::testing::ExitedWithCode(0), "^$") << content.substr(0, 120);
  }
}

// Every test file gzipped, and a header whose count a few bytes of zeros cannot fill.
TEST(MemoryBound, GzipFilesStayWithinAMultipleOfTheDataTheyHold) {
  testing_support::pluginFactory();
  std::vector<std::string> contents = {
      "ply\nformat binary_little_endian 1.0\nelement vertex 4000000000\nproperty "
      "float x\nproperty float y\nproperty float z\nelement material 4000000000\n"
      "property uchar diffuse_red\nend_header\n" +
      std::string(4096, '\0')};
  for (const char* folder : {"valid", "invalid"}) {
    for (const auto& entry : stdfs::directory_iterator(stdfs::path(MESHPORT_TEST_DATA) / "ply" / folder)) {
      if (entry.path().extension() != ".ply") continue;
      std::ifstream in(entry.path(), std::ios::binary);
      contents.emplace_back(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    }
  }
  for (const std::string& content : contents) {
    const testing_support::TemporaryFile file("data.ply.gz", testing_support::gzipped(content));
    EXPECT_EXIT(importUnderLimit(file.path(), content.size()), ::testing::ExitedWithCode(0), "^$")
        << content.substr(0, 120);
  }
}

#else

TEST(MemoryBound, EveryTestFileImportsWithinASmallMultipleOfItsSize) {
  GTEST_SKIP() << "address-space limits need POSIX and a build without AddressSanitizer";
}

#endif

}  // namespace
