#include "b_exception.h"
#include "b_stack_walker.h"
#include "log_capture.h"

#include <gtest/gtest.h>
#include <zlib.h>

#include <cerrno>
#include <string>

namespace {

using testing_support::LogCapture;

// Builds an exception through the throw helper, as production code does.
template <class E, class... Args>
E caught(const char* function, Args&&... args) {
  try {
    base::raise<E>(function, std::forward<Args>(args)...);
  } catch (const E& error) {
    return error;
  }
  ADD_FAILURE() << "nothing thrown";
  throw;
}

TEST(Exception, ThrowHelperRecordsPlaceAndStack) {
  const auto error = caught<base::exception>("ply::PLYImporter::plyProperty", "bad value");
  EXPECT_STREQ(error.what(), "bad value");
  EXPECT_STREQ(error.function(), "ply::PLYImporter::plyProperty");
  EXPECT_NE(std::string(error.file()).find("b_exception_test.cpp"), std::string::npos);
  EXPECT_GT(error.line(), 0u);
  EXPECT_FALSE(error.callStack().empty());
}

// Fixed texts that reports show users, and the extra field that each kind carries through raise.
TEST(Exception, FixedAndDefaultMessagesAndExtraFields) {
  EXPECT_STREQ(caught<base::switch_exception>("f").what(), "Unhandled case in switch statement.");
  EXPECT_STREQ(caught<base::string_conversion_exception>("f", "").what(), "Invalid string conversion");
  const auto unsupported = caught<base::unsupported_interface>("f", "Stream::read->write");
  EXPECT_STREQ(unsupported.what(), "Unsupported interface.");
  EXPECT_STREQ(unsupported.interfaceName(), "Stream::read->write");
  const auto invalid = caught<base::invalid_argument>("f", "count");
  EXPECT_STREQ(invalid.what(), "Invalid argument");
  EXPECT_EQ(std::string_view(invalid.argument()), "count");
  EXPECT_EQ(std::string_view(caught<base::fs::file_not_found>("f", "File not found", "data:a.ply").path()),
            "data:a.ply");
  EXPECT_EQ(caught<base::zlib_exception>("f", "inflate failed", Z_DATA_ERROR).zlibCode(), Z_DATA_ERROR);
}

TEST(Exception, KindsAreCaughtAsTheRootKind) {
  EXPECT_THROW(base::raise<base::fs::file_not_found>("f", "gone", "x"), base::exception);
  EXPECT_THROW(base::raise<base::switch_exception>("f"), std::exception);
}

TEST(ApiException, CarriesTheSystemTextOrNoneForAnUnknownCode) {
  const auto error = caught<base::api_exception>("base::fs::open", "Can't open 'a.ply'", std::uint32_t(ENOENT));
  // The system's own words for code 2 (file not found), whatever the system.
  EXPECT_EQ(std::string(error.what()), "Can't open 'a.ply'| " + std::string(base::systemErrorText(2)));
  EXPECT_FALSE(base::systemErrorText(2).empty());
  EXPECT_EQ(error.errorCode(), std::uint32_t(ENOENT));
  EXPECT_EQ(std::string_view(base::systemErrorText(987654)), "");
  EXPECT_STREQ(caught<base::api_exception>("f", "call failed", std::uint32_t(987654)).what(), "call failed| ");
}

TEST(ExceptionReport, PlainFormatWithStack) {
  const auto error = caught<base::exception>("base::Stream::read", "stream 'a': short");
  LogCapture capture;
  error.report(base::log());
  ASSERT_EQ(capture.entries.size(), 3u);
  EXPECT_EQ(capture.entries[0].text, fmt::format("stream 'a': short\n    File: {} ({})\nFunction: base::Stream::read",
                                                 error.file(), error.line()));
  EXPECT_EQ(capture.entries[1].text, "Call stack:");
  EXPECT_EQ(capture.entries[2].text, std::string_view(error.callStack()));
  for (const auto& entry : capture.entries) {
    EXPECT_EQ(entry.level, base::logError);
    EXPECT_EQ(entry.category, base::logSystem);
  }
}

TEST(ExceptionReport, EmptyMessageNoStackAndMissingPlace) {
  base::NoStackCapture noStack;
  const base::exception error("", nullptr, nullptr, 7);
  EXPECT_TRUE(error.callStack().empty());
  LogCapture capture;
  error.report(base::log());
  EXPECT_EQ(capture.texts(), (std::vector<std::string>{"(null)\n    File: (null) (7)\nFunction: (null)"}));
}

TEST(ExceptionReport, DetailFormats) {
  base::NoStackCapture noStack;
  LogCapture capture;
  base::unsupported_interface("b_stream", "base::Stream::operator >>", 103, "Stream::read->write").report(base::log());
  base::invalid_argument("a.cpp", nullptr, 5, "size").report(base::log());
  base::zlib_exception("inflate", "z.cpp", "inflateBlock", 9, Z_DATA_ERROR).report(base::log());
  EXPECT_EQ(capture.texts(),
            (std::vector<std::string>{"Unsupported interface.(Stream::read->write)\n    File: b_stream "
                                      "(103)\nFunction: base::Stream::operator >>\n",
                                      "Invalid argument(size)\n    File: a.cpp (5)\nFunction: (null)\n",
                                      "zlib| inflate(data error)\n    File: z.cpp (9)\nFunction: inflateBlock\n"}));
}

TEST(ExceptionReport, ZlibCodesOutsideZlibsTableGetAFixedText) {
  base::NoStackCapture noStack;
  LogCapture capture;
  for (int code : {3, -7, -1000}) base::zlib_exception("inflate", "z.cpp", "f", 1, code).report(base::log());
  base::zlib_exception("inflate", "z.cpp", "f", 1, Z_NEED_DICT).report(base::log());
  ASSERT_EQ(capture.entries.size(), 4u);
  EXPECT_EQ(capture.texts()[0].substr(0, 35), "zlib| inflate(unknown zlib error 3)");
  EXPECT_NE(capture.texts()[2].find("unknown zlib error -1000"), std::string::npos);
  EXPECT_NE(capture.texts()[3].find("(need dictionary)"), std::string::npos);
}

}  // namespace
