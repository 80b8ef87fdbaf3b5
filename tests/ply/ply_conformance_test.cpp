// Every file under tests/data/ply: valid/ files read complete without an error; invalid/
// header_ files fail in the header; invalid/payload_ files pass the header and then end
// early or skip an instance, as their names say.

#include "log_capture.h"
#include "ply_parser.h"
#include "ply_recorder.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <sstream>

namespace {

using testing_support::LogCapture;
using testing_support::PlyRecorder;
using testing_support::readPly;

std::vector<std::string> filesIn(const char* folder) {
  std::vector<std::string> names;
  for (const auto& entry : std::filesystem::directory_iterator(std::filesystem::path(MESHPORT_TEST_DATA) / "ply" / folder)) {
    if (entry.path().extension() == ".ply") names.push_back(entry.path().stem().string());
  }
  std::sort(names.begin(), names.end());
  return names;
}

struct Outcome {
  ply::ReadResult result;
  std::vector<LogCapture::Entry> log;
  bool logged(int level, std::string_view start) const {
    return std::any_of(log.begin(), log.end(), [&](const LogCapture::Entry& entry) {
      return entry.level == level && entry.text.starts_with(start);
    });
  }
};

Outcome readDataFile(const char* folder, const std::string& name, bool inMemory) {
  std::ifstream file(std::filesystem::path(MESHPORT_TEST_DATA) / "ply" / folder / (name + ".ply"), std::ios::binary);
  std::stringstream content;
  content << file.rdbuf();
  LogCapture capture(base::logWarning);
  PlyRecorder recorder;
  ply::Header header;
  const ply::ReadResult result = readPly(content.str(), recorder, header, inMemory);
  return {result, capture.entries};
}

class ValidFile : public ::testing::TestWithParam<std::string> {};

TEST_P(ValidFile, ReadsCompleteWithoutErrors) {
  for (bool inMemory : {true, false}) {
    const Outcome outcome = readDataFile("valid", GetParam(), inMemory);
    EXPECT_EQ(outcome.result, ply::ReadResult::complete);
    EXPECT_FALSE(outcome.logged(base::logError, ""));
    EXPECT_FALSE(outcome.logged(base::logWarning, "Unable"));
    EXPECT_FALSE(outcome.logged(base::logWarning, "The data ends early"));
  }
}

INSTANTIATE_TEST_SUITE_P(Data, ValidFile, ::testing::ValuesIn(filesIn("valid")));

class InvalidFile : public ::testing::TestWithParam<std::string> {};

TEST_P(InvalidFile, FailsWhereItsNameSays) {
  const std::string& name = GetParam();
  const Outcome outcome = readDataFile("invalid", name, /*inMemory=*/false);
  if (name.starts_with("header_")) {
    EXPECT_EQ(outcome.result, ply::ReadResult::headerFailed);
    EXPECT_TRUE(outcome.logged(base::logError, ""));
    return;
  }
  ASSERT_TRUE(name.starts_with("payload_")) << "name invalid files header_... or payload_...";
  EXPECT_NE(outcome.result, ply::ReadResult::headerFailed);
  if (name.find("truncated") != std::string::npos || name.find("hostile") != std::string::npos ||
      name.find("overruns") != std::string::npos) {
    EXPECT_EQ(outcome.result, ply::ReadResult::bodyEndedEarly);
    EXPECT_TRUE(outcome.logged(base::logWarning, "The data ends early"));
  } else if (name.find("as_value") != std::string::npos) {
    EXPECT_TRUE(outcome.logged(base::logWarning, "Unable to parse property instance. Skipping this element instance"));
  }
}

INSTANTIATE_TEST_SUITE_P(Data, InvalidFile, ::testing::ValuesIn(filesIn("invalid")));

}  // namespace
