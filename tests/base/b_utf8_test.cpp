#include "b_utf8.h"
#include "b_json.h"

#include <gtest/gtest.h>

#include <string>
#include <utility>

namespace {

using namespace std::string_literals;

TEST(Utf8, WellFormedTextStaysAndEveryIllFormedPartBecomesOneReplacement) {
  const std::string replacement = "\xEF\xBF\xBD";
  const std::pair<std::string, std::string> cases[] = {
      {"plain", "plain"},
      {"\xC3\xA9t\xC3\xA9 \xE2\x82\xAC \xF0\x9F\x98\x80", "\xC3\xA9t\xC3\xA9 \xE2\x82\xAC \xF0\x9F\x98\x80"},
      {"nul\0byte"s, "nul\0byte"s},
      {"a\xFF"
       "b",
       "a" + replacement + "b"},
      {"\xC3", replacement},  // cut short
      {"\xE2\x82"
       "x",
       replacement + "x"},                                                          // one subpart for the cut sequence
      {"\xC0\xAF", replacement + replacement},                                      // overlong
      {"\xED\xA0\x80", replacement + replacement + replacement},                    // a surrogate
      {"\xF4\x90\x80\x80", replacement + replacement + replacement + replacement},  // beyond U+10FFFF
      {"\x80\x80", replacement + replacement},                                      // continuations alone
  };
  for (const auto& [bytes, text] : cases) {
    EXPECT_EQ(base::utf8Text(bytes), text) << bytes;
    EXPECT_EQ(base::isUtf8(bytes), bytes == text) << bytes;
  }
}

TEST(Utf8, JsonOutputIsAlwaysText) {
  base::JsonWriter writer;
  writer.beginObject();
  writer.key("ply:\xFF");
  writer.value(std::string_view("\xC3\xA9\xC3"));
  writer.endObject();
  EXPECT_EQ(writer.text(), "{\"ply:\xEF\xBF\xBD\":\"\xC3\xA9\xEF\xBF\xBD\"}");
  base::JsonReader reader(writer.text());  // and reads back
}

}  // namespace
