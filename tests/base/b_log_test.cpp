#include "b_log.h"
#include "log_capture.h"

#include <gtest/gtest.h>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <sstream>

namespace {

using testing_support::LogCapture;

// Counts how often it is formatted, to prove that filtered messages are never formatted.
struct Counted {
  int* formatted;
};

}  // namespace

template <>
struct fmt::formatter<Counted> : fmt::formatter<int> {
  auto format(const Counted& value, fmt::format_context& context) const {
    ++*value.formatted;
    return fmt::formatter<int>::format(*value.formatted, context);
  }
};

namespace {

TEST(Log, MessagesAboveTheLevelOrEmptyAreDroppedBeforeFormatting) {
  LogCapture capture(base::logWarning);
  int formatted = 0;
  base::log().message(base::logScene, base::logInfo, "value {}", Counted{&formatted});
  base::log().message(base::logScene, base::logDebug, "value {}", Counted{&formatted});
  base::log().text(base::logScene, base::logInfo, "finished text");
  base::log().message(base::logIO, base::logError, "");
  base::log().text(base::logIO, base::logError, "");
  EXPECT_EQ(formatted, 0);
  EXPECT_TRUE(capture.entries.empty());

  base::log().message(base::logScene, base::logWarning, "value {}", Counted{&formatted});
  base::log().message(base::logScene, base::logError, "value {}", Counted{&formatted});
  EXPECT_EQ(formatted, 2);
  ASSERT_EQ(capture.entries.size(), 2u);
  EXPECT_EQ(capture.entries[0].level, base::logWarning);
  EXPECT_EQ(capture.entries[0].category, base::logScene);
}

TEST(Log, PlaceholdersAreFilledButAMessageWithoutArgumentsIsNotAFormat) {
  LogCapture capture;
  base::log().message(base::logSystem, base::logError, "plugin {} at {:x}", "mesh", 255u);
  base::log().message(base::logSystem, base::logError, "no arguments: {} stays");
  EXPECT_EQ(capture.texts(), (std::vector<std::string>{"plugin mesh at ff", "no arguments: {} stays"}));
}

TEST(Log, FileSinkAppendsLevelCategoryAndTextOrSaysWhyItCannot) {
  const std::string path = ::testing::TempDir() + "meshport_log_test.txt";
  std::remove(path.c_str());
  std::string error;
  LogCapture capture;
  ASSERT_TRUE(base::log().setFile(path, error)) << error;
  base::log().message(base::logIO, base::logWarning, "stream '{}' is short", "a.ply");
  ASSERT_TRUE(base::log().setFile("", error));

  std::ifstream file(path);
  std::stringstream content;
  content << file.rdbuf();
  EXPECT_NE(content.str().find("warning [io] stream 'a.ply' is short\n"), std::string::npos) << content.str();

  EXPECT_FALSE(base::log().setFile("/nonexistent-dir/x/log.txt", error));
  EXPECT_EQ(error, "No such file or directory");
}

// The path is UTF-8 on every system: a folder named in Cyrillic and Chinese holds
// the log like any other (Windows' narrow fopen would read the name in its code page).
TEST(Log, FileSinkWritesIntoAFolderWithANonAsciiName) {
  const std::filesystem::path folder =
      std::filesystem::path(::testing::TempDir()) / u8"\u0436\u0443\u0440\u043d\u0430\u043b \u65e5\u5fd7";
  std::filesystem::remove_all(folder);
  ASSERT_TRUE(std::filesystem::create_directory(folder));
  const std::u8string utf8 = (folder / "log.txt").u8string();
  std::string error;
  {
    LogCapture capture;
    ASSERT_TRUE(base::log().setFile(std::string(utf8.begin(), utf8.end()), error)) << error;
    base::log().message(base::logIO, base::logWarning, "written in a named folder");
    ASSERT_TRUE(base::log().setFile("", error));
  }
  std::ifstream file(folder / "log.txt");
  std::stringstream content;
  content << file.rdbuf();
  EXPECT_NE(content.str().find("warning [io] written in a named folder\n"), std::string::npos) << content.str();
  file.close();
  std::filesystem::remove_all(folder);
}

// A sink that logs while it writes: before the fix this deadlocked on the log's own lock.
struct EchoingSink : base::LogSink {
  int calls = 0;
  void write(base::name_id, int, std::string_view text) override {
    ++calls;
    base::log().message(base::logIO, base::logError, "echo of {}", text);
  }
};

TEST(Log, SinkThatLogsNeitherDeadlocksNorRecursesForever) {
  LogCapture capture;
  EchoingSink echo;
  base::log().addSink(&echo);
  base::log().message(base::logIO, base::logError, "first");
  base::log().removeSink(&echo);
  EXPECT_GT(echo.calls, 1);
  EXPECT_LT(echo.calls, 10);
  ASSERT_GE(capture.entries.size(), 2u);
  EXPECT_EQ(capture.entries[0].text, "first");
  EXPECT_EQ(capture.entries[1].text, "echo of first");
}

TEST(Log, ClippedCutsLongWordsOnly) {
  EXPECT_EQ(base::clipped("vertex"), "vertex");
  EXPECT_EQ(base::clipped(std::string(80, 'a')), std::string(80, 'a'));
  EXPECT_EQ(base::clipped(std::string(50'000'000, 'a')), std::string(80, 'a') + "...");
  // Two-byte characters: the cut backs off to the start of the sequence it would split.
  std::string accents;
  for (int i = 0; i < 50; ++i) accents += "\xC3\xA9";
  EXPECT_EQ(base::clipped(accents, 5), "\xC3\xA9\xC3\xA9...");
}

}  // namespace
