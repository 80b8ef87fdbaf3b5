// Every file under tests/data/ply, from every kind of stream: valid/ files read complete
// without an error; each invalid/ file gives the outcome that its row in the folder's
// README.md states, so the README and the reader cannot drift apart.

#include "log_capture.h"
#include "ply_parser.h"
#include "ply_recorder.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <map>
#include <regex>
#include <sstream>

namespace {

using testing_support::allSources;
using testing_support::LogCapture;
using testing_support::PlyRecorder;
using testing_support::readPly;
using testing_support::Source;
using testing_support::sourceName;

const std::filesystem::path dataFolder = std::filesystem::path(MESHPORT_TEST_DATA) / "ply";

std::string fileText(const std::filesystem::path& path) {
  std::ifstream file(path, std::ios::binary);
  std::stringstream content;
  content << file.rdbuf();
  return content.str();
}

std::vector<std::string> filesIn(const char* folder) {
  std::vector<std::string> names;
  for (const auto& entry : std::filesystem::directory_iterator(dataFolder / folder)) {
    if (entry.path().extension() == ".ply") names.push_back(entry.path().stem().string());
  }
  std::sort(names.begin(), names.end());
  return names;
}

// The "Expected outcome" column of the README's invalid/ table, by file name.
std::map<std::string, std::string> expectedOutcomes() {
  const std::string readme = fileText(dataFolder / "README.md");
  const std::string table = readme.substr(readme.find("## invalid/"));
  const std::regex row(R"(\n\| `([a-z0-9_]+)\.ply` \| [^|]* \| ([^|]*) \|)");
  std::map<std::string, std::string> outcomes;
  for (std::sregex_iterator it(table.begin(), table.end(), row), end; it != end; ++it) {
    outcomes[(*it)[1]] = (*it)[2];
  }
  return outcomes;
}

struct Outcome {
  ply::ReadResult result;
  std::vector<LogCapture::Entry> log;
  bool logged(int level, std::string_view start) const {
    return std::any_of(log.begin(), log.end(), [&](const LogCapture::Entry& entry) {
      return entry.level == level && entry.text.starts_with(start);
    });
  }
  std::string lastError() const {
    for (auto it = log.rbegin(); it != log.rend(); ++it) {
      if (it->level == base::logError) return it->text;
    }
    return "";
  }
};

Outcome readDataFile(const char* folder, const std::string& name, Source source) {
  const std::string content = fileText(dataFolder / folder / (name + ".ply"));
  LogCapture capture(base::logWarning);
  PlyRecorder recorder;
  ply::Header header;
  const ply::ReadResult result = readPly(content, recorder, header, source);
  return {result, capture.entries};
}

class ValidFile : public ::testing::TestWithParam<std::string> {};

TEST_P(ValidFile, ReadsCompleteWithoutErrors) {
  for (Source source : allSources) {
    SCOPED_TRACE(sourceName(source));
    const Outcome outcome = readDataFile("valid", GetParam(), source);
    EXPECT_EQ(outcome.result, ply::ReadResult::complete);
    EXPECT_FALSE(outcome.logged(base::logError, ""));
    EXPECT_FALSE(outcome.logged(base::logWarning, "Unable"));
    EXPECT_FALSE(outcome.logged(base::logWarning, "The data ends early"));
  }
}

INSTANTIATE_TEST_SUITE_P(Data, ValidFile, ::testing::ValuesIn(filesIn("valid")));

class InvalidFile : public ::testing::TestWithParam<std::string> {};

// Outcomes: "header fails: `TEXT`" (the last error logged), "body ends early: E n of m",
// "instance skipped", or "reads complete". A stream without a size gives the header no bound
// for its counts: there a count the data cannot hold ends the body early instead.
void expectOutcome(const Outcome& outcome, const std::string& expected, bool sized) {
  std::smatch match;
  if (!sized && expected.find("instances of at least") != std::string::npos) {
    EXPECT_EQ(outcome.result, ply::ReadResult::bodyEndedEarly);
    EXPECT_TRUE(outcome.logged(base::logWarning, "The data ends early in element"));
  } else if (std::regex_search(expected, match, std::regex("^header fails: `([^`]*)`"))) {
    EXPECT_EQ(outcome.result, ply::ReadResult::headerFailed);
    EXPECT_EQ(outcome.lastError(), match[1].str());
  } else if (expected.starts_with("header fails")) {
    EXPECT_EQ(outcome.result, ply::ReadResult::headerFailed);
    EXPECT_NE(outcome.lastError(), "");
  } else if (std::regex_search(expected, match, std::regex(R"(^body ends early: (\w+) (\d+) of (\d+))"))) {
    EXPECT_EQ(outcome.result, ply::ReadResult::bodyEndedEarly);
    EXPECT_TRUE(outcome.logged(base::logWarning, "The data ends early in element '" + match[1].str() + "': " +
                                                     match[2].str() + " of " + match[3].str() + " instances read"));
  } else if (expected.starts_with("instance skipped")) {
    EXPECT_EQ(outcome.result, ply::ReadResult::complete);
    EXPECT_TRUE(outcome.logged(base::logWarning, "Unable to parse property instance. Skipping this element instance"));
  } else {
    ASSERT_TRUE(expected.starts_with("reads complete")) << "unknown outcome: " << expected;
    EXPECT_EQ(outcome.result, ply::ReadResult::complete);
  }
}

TEST_P(InvalidFile, GivesTheOutcomeItsReadmeRowStates) {
  static const std::map<std::string, std::string> outcomes = expectedOutcomes();
  const auto row = outcomes.find(GetParam());
  ASSERT_NE(row, outcomes.end()) << "no row in tests/data/ply/README.md";
  for (Source source : allSources) {
    SCOPED_TRACE(sourceName(source));
    const bool sized = source == Source::memory || source == Source::file;
    expectOutcome(readDataFile("invalid", GetParam(), source), row->second, sized);
  }
}

INSTANTIATE_TEST_SUITE_P(Data, InvalidFile, ::testing::ValuesIn(filesIn("invalid")));

}  // namespace
