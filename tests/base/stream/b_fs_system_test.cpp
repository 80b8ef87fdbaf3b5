#include "b_fs.h"
#include "log_capture.h"
#include "thrown.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

namespace {

namespace stdfs = std::filesystem;
using stream_tests::thrown;

const std::string separator(1, static_cast<char>(stdfs::path::preferred_separator));

// Symbolic links need a privilege on Windows (and Wine has none): tests of them are skipped
// where one cannot be made.
bool makeLink(const stdfs::path& target, const stdfs::path& link, bool folder) {
  std::error_code error;
  folder ? stdfs::create_directory_symlink(target, link, error) : stdfs::create_symlink(target, link, error);
  return !error;
}

// A fresh folder for each test, holding the files a and b and the folder c with c/d.txt.
class SystemFS : public ::testing::Test {
 protected:
  SystemFS() {
    root = stdfs::path(std::string(base::fs::tmpFilename()));
    stdfs::remove(root);
    stdfs::create_directories(root / "c");
    write("a", "alpha");
    write("b", "beta");
    write("c/d.txt", "delta");
    system = base::fs::master().findFS("system");
  }
  ~SystemFS() override { stdfs::remove_all(root); }

  void write(const std::string& name, const std::string& text) const { std::ofstream(root / name) << text; }
  std::string read(const std::string& name) const {
    std::ifstream file(root / name);
    return std::string(std::istreambuf_iterator<char>(file), {});
  }
  std::string path(const std::string& name) const { return (root / name).string(); }

  static std::vector<std::string> names(base::ref<base::fs::IEnum> listing) {
    std::vector<std::string> result;
    for (; !listing->atEnd(); listing->next()) result.emplace_back(listing->name());
    std::sort(result.begin(), result.end());
    return result;
  }

  stdfs::path root;
  base::ref<base::fs::IPlugin> system;
};

TEST_F(SystemFS, FileListingsShowFilesOnlyAndFolderListingsFoldersOnly) {
  EXPECT_EQ(names(system->findFiles(path("*"))), (std::vector<std::string>{"a", "b"}));
  EXPECT_EQ(names(system->findFolders(path("*"))), (std::vector<std::string>{"c"}));
  EXPECT_EQ(names(system->findFiles(path("*.*"))), (std::vector<std::string>{"a", "b"}));
  EXPECT_EQ(names(system->findFiles(path("c/*.txt"))), (std::vector<std::string>{"d.txt"}));

  const auto listing = system->findFiles(path("c/*.txt"));
  EXPECT_EQ(std::string(listing->directory()), path("c") + separator);
  EXPECT_EQ(listing->size(), 5);
  EXPECT_EQ(listing->attributes() & base::fs::entryDirectory, 0u);
  EXPECT_GT(listing->modifiedTime(), 0);
}

TEST_F(SystemFS, APatternMatchingNothingIsAtItsEndAndAMissingFolderFails) {
  const auto none = system->findFiles(path("*.ply"));
  EXPECT_TRUE(none->atEnd());
  EXPECT_TRUE(thrown<base::exception>([&] { none->next(); }));
  EXPECT_TRUE(thrown<base::api_exception>([&] { system->findFiles(path("missing/*")); }));
  // The master passes over a file system whose listing fails.
  EXPECT_TRUE(base::fs::master().findFiles(path("missing/*"))->atEnd());
}

TEST_F(SystemFS, RecursiveListingVisitsEveryFolderBelowTheStart) {
  stdfs::create_directories(root / "c" / "e");
  write("c/e/f.txt", "");
  write("c/e/g.bin", "");
  // A link back up the tree must not make the listing endless.
  makeLink(root, root / "c" / "loop", true);
  EXPECT_EQ(names(system->findRecursive(path("*.txt"))), (std::vector<std::string>{"d.txt", "f.txt"}));
  EXPECT_EQ(names(base::fs::master().findRecursive(path("*"))),
            (std::vector<std::string>{"a", "b", "d.txt", "f.txt", "g.bin"}));
  EXPECT_TRUE(system->findRecursive(path("*.none"))->atEnd());
}

TEST_F(SystemFS, ExistenceTellsFilesFromFolders) {
  EXPECT_TRUE(system->fileExists(path("a")));
  EXPECT_FALSE(system->fileExists(path("c")));
  EXPECT_TRUE(system->dirExists(path("c")));
  EXPECT_FALSE(system->dirExists(path("a")));
  EXPECT_FALSE(system->fileExists(path("none")));
  EXPECT_TRUE(base::fs::master().fileExists(path("c/d.txt")));
}

TEST_F(SystemFS, AMissingFileIsNotFoundThroughTheMaster) {
  const auto error = thrown<base::fs::file_not_found>([&] { base::fs::master().open(path("none.ply"), 5); });
  ASSERT_TRUE(error);
  EXPECT_EQ(std::string(error->path()), path("none.ply"));
  // A missing folder on the way is "not found" too.
  EXPECT_TRUE(thrown<base::fs::file_not_found>([&] { base::fs::master().open(path("a/x.ply"), 5); }));
}

TEST_F(SystemFS, OpenedStreamsHaveTheWordsOfTheirMode) {
  EXPECT_EQ(system->open(path("a"), base::fs::openForReading).worker()->capabilities(), 653u);
  EXPECT_EQ(system->open(path("a"), base::fs::openWrite).worker()->capabilities(), 670u);
  EXPECT_EQ(system->open(path("a"), base::fs::openRead | base::fs::openWrite).worker()->capabilities(), 671u);
}

TEST_F(SystemFS, WriteOnlyCreatesAndTruncateEmpties) {
  {
    base::Stream created = base::fs::master().open(path("new.txt"), base::fs::openWrite);
    created.write("hello", 5);
  }
  EXPECT_EQ(read("new.txt"), "hello");
  // Without truncation a write overwrites in place.
  base::fs::master().open(path("new.txt"), base::fs::openWrite).write("J", 1);
  EXPECT_EQ(read("new.txt"), "Jello");
  base::fs::master().open(path("new.txt"), base::fs::openWrite | base::fs::openTruncate).write("x", 1);
  EXPECT_EQ(read("new.txt"), "x");
  // Reading and writing without create needs the file.
  EXPECT_TRUE(thrown<base::fs::file_not_found>(
      [&] { system->open(path("other.txt"), base::fs::openRead | base::fs::openWrite); }));
}

TEST_F(SystemFS, ReadersShareAFileWithAWriter) {
  base::Stream writer =
      system->open(path("a"), base::fs::openRead | base::fs::openWrite | base::fs::shareRead | base::fs::shareWrite);
  base::Stream reader = system->open(path("a"), base::fs::openForReading | base::fs::shareWrite);
  writer.setPosition(0, base::seekEnd);
  writer.write("!", 1);
  char text[6];
  ASSERT_EQ(reader.read(text, 6), 6u);
  EXPECT_EQ(std::string(text, 6), "alpha!");
  EXPECT_TRUE(reader.isEOF());
}

TEST_F(SystemFS, StreamPositionsSizesAndReopen) {
  const std::uint32_t shared = base::fs::shareRead | base::fs::shareWrite;
  base::Stream stream =
      system->open(path("new.bin"), base::fs::openRead | base::fs::openWrite | base::fs::openCreate | shared);
  stream.write("0123456789", 10);
  EXPECT_EQ(stream.getSize(), 10);
  EXPECT_EQ(stream.setPosition(-3, base::seekEnd), 7);
  EXPECT_EQ(stream.setPosition(1, base::seekCurrent), 8);
  stream.worker()->setSize(4);
  EXPECT_EQ(stream.getSize(), 4);
  EXPECT_EQ(stream.getPosition(), 4);
  EXPECT_TRUE(stream.isEOF());
  stream.worker()->flush();
  // A reopened stream starts at the beginning of the same data, even of a truncating mode.
  base::Stream writer = system->open(path("new.bin"), base::fs::openWrite | base::fs::openTruncate | shared);
  writer.write("abc", 3);
  base::Stream again = writer.clone();
  EXPECT_EQ(again.getSize(), 3);
  EXPECT_TRUE(thrown<base::api_exception>([&] { stream.setPosition(-1); }));
  stream.worker()->close();
  EXPECT_EQ(stream.worker()->capabilities(), 0u);
}

TEST_F(SystemFS, AHasherSeesEveryBlockAndAMoveIsLogged) {
  struct Counter : base::Hash {
    void update(const void*, std::size_t size) override { *total += size; }
    std::unique_ptr<base::Hash> clone() const override { return std::make_unique<Counter>(*this); }
    void reset() override {}
    base::vector<std::uint8_t> digest() const override { return {}; }
    std::size_t* total;
  };
  std::size_t total = 0;
  base::Stream stream = system->open(path("a"), base::fs::openForReading);
  auto counter = std::make_unique<Counter>();
  counter->total = &total;
  stream.worker()->setHasher(std::move(counter));
  char text[3];
  stream.read(text, 3);
  stream.read(text, 3);
  EXPECT_EQ(total, 5u);
  testing_support::LogCapture log;
  stream.setPosition(1);
  ASSERT_EQ(log.entries.size(), 1u);
  EXPECT_EQ(log.entries[0].text, "File position moved to 5 while calculating the hash!");
  EXPECT_EQ(log.entries[0].level, base::logDebug);
}

TEST_F(SystemFS, SystemFailuresCarryTheNativeCodeAndText) {
  const auto error = thrown<base::api_exception>([&] { system->open(path("c"), base::fs::openForReading); });
  ASSERT_TRUE(error);
#ifdef _WIN32
  const std::uint32_t code = 5;  // ERROR_ACCESS_DENIED: Windows opens no folder as a file
#else
  const std::uint32_t code = EISDIR;
#endif
  EXPECT_EQ(error->errorCode(), code);
  const std::string text = error->what();
  EXPECT_NE(text.find(path("c")), std::string::npos) << text;
  EXPECT_NE(text.find(std::string("| ") + std::string(base::systemErrorText(code))), std::string::npos) << text;
}

TEST_F(SystemFS, ModifyingOperations) {
  base::fs::MasterFS& master = base::fs::master();
  master.mkdir(path("made"));
  EXPECT_TRUE(stdfs::is_directory(root / "made"));
  EXPECT_NE(stream_tests::thrownText([&] { master.mkdir(path("x/y/z")); }).find("Invalid path to create"),
            std::string::npos);
  EXPECT_TRUE(thrown<base::api_exception>([&] { system->mkdir(path("made")); }));

  master.copy(path("a"), path("made/a2"));
  EXPECT_EQ(read("made/a2"), "alpha");
  EXPECT_TRUE(thrown<base::api_exception>([&] { system->copy(path("c"), path("c2")); }));

  master.rename(path("made/a2"), path("made/a3"));
  EXPECT_EQ(read("made/a3"), "alpha");
  // A rename never replaces a file that is there.
  EXPECT_TRUE(thrown<base::api_exception>([&] { system->rename(path("a"), path("b")); }));
  EXPECT_EQ(read("b"), "beta");
  // A replace does, in one step, and also moves to a name that is free.
  master.replace(path("made/a3"), path("b"));
  EXPECT_EQ(read("b"), "alpha");
  EXPECT_FALSE(stdfs::exists(root / "made/a3"));
  master.replace(path("b"), path("made/b2"));
  EXPECT_EQ(read("made/b2"), "alpha");
  EXPECT_TRUE(thrown<base::exception>([&] { master.replace(path("missing"), path("made/b2")); }));
  EXPECT_EQ(read("made/b2"), "alpha");

  stdfs::last_write_time(root / "a", stdfs::file_time_type::clock::now() - std::chrono::hours(48));
  master.touch(path("a"));
  EXPECT_GT(stdfs::last_write_time(root / "a"), stdfs::file_time_type::clock::now() - std::chrono::hours(1));

  EXPECT_TRUE(thrown<base::api_exception>([&] { system->remove(path("c"), false); }));  // not empty
  master.remove(path("c"), true);
  EXPECT_FALSE(stdfs::exists(root / "c"));
  master.remove(path("a"), false);
  EXPECT_FALSE(stdfs::exists(root / "a"));
  EXPECT_TRUE(thrown<base::api_exception>([&] { system->remove(path("a"), false); }));
}

TEST_F(SystemFS, LinksAndTheLinkSwitch) {
  if (!makeLink(root / "a", root / "link", false)) GTEST_SKIP() << "this system makes no symbolic links";
  EXPECT_EQ(std::string(system->readLink(path("link"))), path("a"));
  EXPECT_EQ(system->readLink(path("a")), "");
  EXPECT_TRUE(system->symLinksPermitted());
  EXPECT_TRUE(system->fileExists(path("link")));
  system->symLinksPermitted(false);
  EXPECT_TRUE(thrown<base::api_exception>([&] { system->open(path("link"), base::fs::openForReading); }));
  system->symLinksPermitted(true);
  EXPECT_EQ(system->open(path("link"), base::fs::openForReading).getSize(), 5);
}

TEST_F(SystemFS, PathFunctions) {
  const std::string temp(base::fs::tmpPath());
  EXPECT_EQ(temp.back(), separator[0]);
  EXPECT_TRUE(stdfs::is_directory(temp));
  EXPECT_EQ(std::string(base::fs::currentPath()), stdfs::current_path().string());
  EXPECT_EQ(std::string(system->curdir()), stdfs::current_path().string());
  EXPECT_EQ(std::string(base::fs::master().curdir()), stdfs::current_path().string());
  EXPECT_EQ(std::string(base::fs::absolutePath("x/../y")), (stdfs::current_path() / "y").string());
  const std::string first(base::fs::tmpFilename());
  const std::string second(base::fs::tmpFilename());
  EXPECT_NE(first, second);
  EXPECT_TRUE(stdfs::exists(first));
  stdfs::remove(first);
  stdfs::remove(second);
}

}  // namespace
