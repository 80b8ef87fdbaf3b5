// Every valid test file cut after each of its bytes imports alike both ways (column plans, and
// every value delivered one by one). Whole files, test and corpus ones alike, are held to what
// a raw read of them holds by ply_random_files_test.cpp.

#include "b_vec.h"
#include "log_capture.h"
#include "ply_parser.h"
#include "scene_import.h"
#include "scene_validation.h"
#include "thrown.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <bit>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <map>
#include <string>
#include <vector>

namespace {

namespace stdfs = std::filesystem;
using scene::mesh_schema;
using testing_support::ImportedScene;
using testing_support::importFile;
using testing_support::LogCapture;

// The scene as JSON, or the failure's text.
std::string outcome(const stdfs::path& path, bool plans) {
  try {
    const ImportedScene imported = importFile(path.string(), plans);
    return imported.loaded ? imported.json() : "not imported";
  } catch (const base::exception& error) {
    return std::string("failed: ") + error.what();
  }
}

// Every valid test file cut after each of its bytes (inside the header, inside a value, a
// list count, a list, between instances and between elements): both paths give the same
// scene or the same refusal, and nothing but a base::exception comes out.
TEST(TruncatedFiles, ImportAlikeAtEveryLength) {
  LogCapture quiet;
  for (const auto& entry : stdfs::directory_iterator(stdfs::path(MESHPORT_TEST_DATA) / "ply" / "valid")) {
    if (entry.path().extension() != ".ply") continue;
    std::ifstream source(entry.path(), std::ios::binary);
    const std::string content((std::istreambuf_iterator<char>(source)), std::istreambuf_iterator<char>());
    testing_support::TemporaryFile cut("cut.ply", "");
    for (std::size_t length = 0; length < content.size(); ++length) {
      std::ofstream(cut.path(), std::ios::binary | std::ios::trunc) << content.substr(0, length);
      ASSERT_EQ(outcome(cut.path(), true), outcome(cut.path(), false))
          << entry.path().filename() << " cut to " << length << " bytes";
    }
  }
}

}  // namespace
