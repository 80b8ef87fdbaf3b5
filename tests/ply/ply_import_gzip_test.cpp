// Compressed PLY files: a .ply.gz imports as the file it holds; damaged gzip data fails the
// import with an error that names the file, and leaves nothing behind.

#include "gzip_data.h"
#include "log_capture.h"
#include "scene_import.h"
#include "thrown.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

namespace {

using testing_support::gzipped;
using testing_support::ImportedScene;
using testing_support::importFile;
using testing_support::TemporaryFile;

std::string fileBytes(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  std::ostringstream bytes;
  bytes << in.rdbuf();
  return bytes.str();
}

// Every test and corpus file imports gzipped as it does plain (ply_random_files_test.cpp).
TEST(GzipImport, TheImporterTakesGzippedFiles) {
  EXPECT_NE(testing_support::pluginFactory().getSupportedExtensions(true).find("ply.gz"), std::string::npos);
}

TEST(GzipImport, DamagedGzipDataFailsNamingTheFileAndLeavesNothing) {
  testing_support::LogCapture log;
  const std::string whole = gzipped(fileBytes(MESHPORT_TEST_DATA "/ply/valid/binary_le_cube_triangles.ply"));
  std::string damaged = whole;
  for (std::size_t k = 40; k < 60; ++k) damaged[k] = static_cast<char>(damaged[k] ^ 0x5a);
  for (const std::string& bytes : {whole.substr(0, whole.size() / 2), whole.substr(0, whole.size() - 9), damaged}) {
    const TemporaryFile file("cut.ply.gz", bytes);
    ImportedScene scene;
    const std::string text = stream_tests::thrownText(
        [&] { testing_support::pluginFactory().load(*scene.scene, file.path(), base::AttribMap()); });
    EXPECT_EQ(text.rfind(file.path() + ": ", 0), 0u) << text;
    EXPECT_TRUE(std::none_of(scene.scene->objects().begin(), scene.scene->objects().end(),
                             [](const auto& object) { return object != nullptr; }));
  }
}

}  // namespace
