// What must hold for any PLY file, whatever it holds, checked on random files and on every
// file the repository and the corpus of real files hold: the import with column plans equals
// the import value by value; the faces (decoded, as a multiset of faces turned to their
// smallest rotation, each with its per-face values) and the positions are the file's; a
// valid file validates and counts its faces; import, export to each encoding and import
// again give the same scene; a faulty file never crashes, never gives a face another face's
// values, and fails with an exception or says in a warning where it went wrong.
//
// MESHPORT_RANDOM_PLY_FILES sets how many random files of each kind a run makes (default
// 150), MESHPORT_RANDOM_PLY_SEED the first seed (default 1). A random file that fails is
// written to random_ply_failures/ in the working folder: keep it in tests/data/ply/regressions/
// and every run checks it from then on.

#include "b_exception.h"
#include "b_json.h"
#include "b_normal.h"
#include "b_vec.h"
#include "gzip_data.h"
#include "import_digest.h"
#include "log_capture.h"
#include "ply_generator.h"
#include "same_scene.h"
#include "scene_import.h"
#include "scene_validation.h"

#include <fmt/format.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

namespace {

namespace stdfs = std::filesystem;
using testing_support::ImportDigest;
using testing_support::ImportedScene;
using testing_support::LogCapture;

const testing_support::Switches keep = {{"importCustomProperties", true}};

std::uint64_t setting(const char* name, std::uint64_t fallback) {
  const char* text = std::getenv(name);
  return text && *text ? std::strtoull(text, nullptr, 10) : fallback;
}

bool logged(const LogCapture& log, const std::string& text) {
  return std::any_of(log.entries.begin(), log.entries.end(),
                     [&](const LogCapture::Entry& entry) { return entry.text.find(text) != std::string::npos; });
}

// Import, export to each encoding, import: the same scene.
void expectRoundTrips(const ImportedScene& first) {
  const testing_support::TemporaryFile folder("unused", "");
  for (const std::string encoding : testing_support::encodings) {
    const std::string path = (stdfs::path(folder.path()).parent_path() / (encoding + ".ply")).string();
    try {
      ASSERT_TRUE(testing_support::exportScene(first, path, testing_support::formatEntries(encoding))) << encoding;
    } catch (const base::exception& error) {
      FAIL() << "exported as " << encoding << ": " << error.what();
    }
    const ImportedScene again = testing_support::importFile(path, true, keep);
    ASSERT_TRUE(again.loaded) << encoding;
    testing_support::expectSameScene(first.mesh(), again.mesh(), "exported as " + encoding);
  }
}

// How far a file is checked.
enum class Checks {
  reading,    ///< imported alike both ways, the file's faces and values (a faulty file)
  roundTrip,  ///< and, when the file reads whole, round trips (a file from another tool)
  all,        ///< and validation without findings (a good file)
};

// Every check on the file `bytes`, imported as `name`; `mustLog` is a text the import must
// log (for a file made faulty on purpose).
void expectFileHolds(const std::string& name, const std::string& bytes, Checks checks,
                     const std::string& mustLog = "") {
  SCOPED_TRACE(name);
  LogCapture log(base::logWarning);
  const testing_support::ExpectedImport expected = testing_support::expectedImport(bytes);
  log.entries.clear();
  const testing_support::TemporaryFile file(name, bytes);
  ImportedScene imports[2];
  std::string failures[2];
  for (const bool plans : {true, false}) {
    try {
      imports[plans] = testing_support::importFile(file.path(), plans, keep);
    } catch (const base::exception& error) {
      failures[plans] = error.what();
    }
  }
  EXPECT_EQ(failures[true], failures[false]) << "column plans and values one by one";
  if (expected.fails) {
    EXPECT_TRUE(!failures[true].empty() || !imports[true].loaded) << "the import must fail";
    return;
  }
  ASSERT_EQ(failures[true], "");
  ASSERT_TRUE(imports[true].loaded && imports[false].loaded);
  EXPECT_EQ(imports[true].json(), imports[false].json()) << "column plans and values one by one";
  const ImportDigest digest = testing_support::digestOf(imports[true].mesh());
  // Compressed, the data has no size: lists grow as it arrives instead of being sized first.
  const testing_support::TemporaryFile packed(name + ".gz", testing_support::gzipped(bytes));
  const ImportedScene unsized = testing_support::importFile(packed.path(), true, keep);
  if (!expected.incomplete) {
    EXPECT_EQ(unsized.json(), imports[true].json()) << "compressed";
  } else {
    EXPECT_EQ(testing_support::digestOf(unsized.mesh()).primitives, digest.primitives) << "compressed";
  }
  if (!mustLog.empty()) {
    EXPECT_TRUE(logged(log, mustLog)) << "the import must log " << mustLog;
  }
  if (expected.incomplete) {
    // What could not be read leaves vertex slots as the reader left them; faces go whole.
    ImportDigest faces = expected.digest;
    faces.positions = digest.positions;
    faces.keptVertexProperties = digest.keptVertexProperties;
    faces.faceCount = digest.faceCount;
    EXPECT_EQ(testing_support::firstDifference(faces, digest), "");
    return;
  }
  EXPECT_EQ(testing_support::firstDifference(expected.digest, digest), "");
  if (checks == Checks::reading) return;
  if (checks == Checks::all) {
    log.entries.clear();
    EXPECT_TRUE(scene::validateMesh(imports[true].mesh()));
    const auto error = std::find_if(log.entries.begin(), log.entries.end(),
                                    [](const auto& entry) { return entry.level <= base::logError; });
    EXPECT_TRUE(error == log.entries.end()) << "validation found errors: " << error->text;
  }
  expectRoundTrips(imports[true]);
}

// Writes a random file that failed where a developer finds it.
void keepFailure(const testing_support::GeneratedFile& file) {
  stdfs::create_directories("random_ply_failures");
  const stdfs::path path =
      stdfs::absolute(stdfs::path("random_ply_failures") / (testing_support::describe(file) + ".ply"));
  std::ofstream(path, std::ios::binary) << file.bytes;
  ADD_FAILURE() << testing_support::describe(file) << (file.broken.empty() ? "" : " (" + file.broken + ")")
                << " failed; the file is kept as " << path.string()
                << ": copy it to tests/data/ply/regressions/ so that every run checks it";
}

int failuresSoFar() {
  const testing::TestResult& result = *testing::UnitTest::GetInstance()->current_test_info()->result();
  int failed = 0;
  for (int k = 0; k < result.total_part_count(); ++k) failed += result.GetTestPartResult(k).failed();
  return failed;
}

template <class Make>
void checkRandomFiles(std::uint64_t firstSeed, Checks checks, Make make) {
  const std::uint64_t files = setting("MESHPORT_RANDOM_PLY_FILES", 150);
  int kept = 0;
  for (std::uint64_t seed = firstSeed; seed < firstSeed + files && kept < 3; ++seed) {
    const int before = failuresSoFar();
    const testing_support::GeneratedFile file = make(seed);
    expectFileHolds(testing_support::describe(file) + ".ply", file.bytes, checks, file.expectedMessage);
    if (failuresSoFar() > before) {
      keepFailure(file);
      ++kept;
    }
  }
}

// A seed gives the same bytes on every platform: the fingerprint of the first files is the
// one the Linux build gives, under Wine too.
TEST(RandomPlyFiles, ASeedGivesTheSameBytesEverywhere) {
  std::uint64_t fingerprint = 0xCBF29CE484222325ull;  // FNV-1a
  for (std::uint64_t seed = 1; seed <= 20; ++seed) {
    for (const std::string& bytes :
         {testing_support::randomValidFile(seed).bytes, testing_support::randomInvalidFile(seed).bytes}) {
      for (const char byte : bytes) fingerprint = (fingerprint ^ static_cast<unsigned char>(byte)) * 0x100000001B3ull;
    }
  }
  EXPECT_EQ(fingerprint, 2460344685625017674u);
}

TEST(RandomPlyFiles, ValidFilesImportAsTheyAreAndRoundTrip) {
  testing_support::pluginFactory();
  checkRandomFiles(setting("MESHPORT_RANDOM_PLY_SEED", 1), Checks::all, [](std::uint64_t seed) {
    const testing_support::GeneratedFile file = testing_support::randomValidFile(seed);
    LogCapture quiet;
    EXPECT_FALSE(testing_support::expectedImport(file.bytes).incomplete) << testing_support::describe(file);
    return file;
  });
}

TEST(RandomPlyFiles, FaultyFilesNeverMixFacesAndSayWhere) {
  testing_support::pluginFactory();
  checkRandomFiles(setting("MESHPORT_RANDOM_PLY_SEED", 1) + 1000000, Checks::reading,
                   testing_support::randomInvalidFile);
}

// The repository's test files, the regression files kept from random runs, and the corpus.
std::vector<std::string> filesToCheck() {
  std::vector<std::string> files;
  for (const char* folder : {"valid", "invalid", "regressions"}) {
    const stdfs::path path = stdfs::path(MESHPORT_TEST_DATA) / "ply" / folder;
    if (!stdfs::is_directory(path)) continue;
    for (const auto& entry : stdfs::directory_iterator(path)) {
      if (entry.path().extension() == ".ply") files.push_back(entry.path().string());
    }
  }
  const stdfs::path corpus = stdfs::path(MESHPORT_CORPUS) / "files";
  if (stdfs::is_directory(corpus)) {
    for (const auto& entry : stdfs::directory_iterator(corpus)) files.push_back(entry.path().string());
  }
  std::sort(files.begin(), files.end());
  return files;
}

class EveryFile : public testing::TestWithParam<std::string> {};

TEST_P(EveryFile, ImportsAsItIsAndRoundTrips) {
  std::ifstream in(GetParam(), std::ios::binary);
  const std::string bytes(std::istreambuf_iterator<char>(in), {});
  // Faulty files by their folder or, for regressions, by the random file they came from;
  // files from other tools hold what they hold (NaN coordinates, no positions) and need not
  // validate.
  const stdfs::path path(GetParam());
  const std::string folder = path.parent_path().filename().string();
  const bool faulty = folder == "invalid" || path.filename().string().starts_with("invalid-");
  expectFileHolds(path.filename().string(), bytes,
                  faulty              ? Checks::reading
                  : folder == "files" ? Checks::roundTrip
                                      : Checks::all);
}

INSTANTIATE_TEST_SUITE_P(Files, EveryFile, testing::ValuesIn(filesToCheck()), [](const auto& info) {
  std::string name =
      stdfs::path(info.param).parent_path().filename().string() + "_" + stdfs::path(info.param).stem().string();
  std::replace_if(
      name.begin(), name.end(), [](char c) { return !std::isalnum(static_cast<unsigned char>(c)); }, '_');
  return name;
});

}  // namespace
