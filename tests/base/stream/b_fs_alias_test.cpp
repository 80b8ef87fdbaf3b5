#include "b_fs.h"
#include "thrown.h"

#include <gtest/gtest.h>

namespace {

using stream_tests::thrown;

TEST(AliasTable, ReplacesANameAndItsColon) {
  base::fs::AliasTable aliases;
  aliases.set("data", "/srv/data/");
  EXPECT_EQ(aliases.expand("data:models/a.ply"), "/srv/data/models/a.ply");
  EXPECT_EQ(aliases.expand("other:models/a.ply"), "other:models/a.ply");
  EXPECT_EQ(aliases.expand("plain/path.ply"), "plain/path.ply");
  // A name is the text from the scan position to a colon: one further on is looked up too.
  EXPECT_EQ(aliases.expand("x:data:a.ply"), "x:/srv/data/a.ply");
}

TEST(AliasTable, LeavesDriveLettersAlone) {
  base::fs::AliasTable aliases;
  aliases.set("C", "/never/");
  aliases.set("data", "D:\\store\\");
  EXPECT_EQ(aliases.expand("C:\\models\\a.ply"), "C:\\models\\a.ply");
  EXPECT_EQ(aliases.expand("data:a.ply"), "D:\\store\\a.ply");
}

TEST(AliasTable, ExpandsAliasesThatReferToAliases) {
  base::fs::AliasTable aliases;
  aliases.set("root", "/srv/");
  aliases.set("models", "root:models/");
  aliases.set("scans", "models:scans/");
  EXPECT_EQ(aliases.expand("scans:bunny.ply"), "/srv/models/scans/bunny.ply");
}

TEST(AliasTable, ReplacingAndRemovingEntries) {
  base::fs::AliasTable aliases;
  aliases.set("data", "/a/");
  aliases.set("data", "/b/");
  EXPECT_EQ(aliases.expand("data:x"), "/b/x");
  aliases.set("data", "");
  EXPECT_EQ(aliases.expand("data:x"), "data:x");
  aliases.set("data", "/c/");
  aliases.clear();
  EXPECT_EQ(aliases.expand("data:x"), "data:x");
}

TEST(AliasTable, StopsAnExpansionThatWouldNotEnd) {
  base::fs::AliasTable aliases;
  aliases.set("self", "self:more/");
  aliases.set("ping", "pong:a/");
  aliases.set("pong", "ping:b/");
  aliases.set("grow", "x:grow:");
  for (const char* path : {"self:a.ply", "ping:a.ply", "grow:a.ply"}) {
    const auto error = thrown<base::invalid_argument>([&] { aliases.expand(path); });
    ASSERT_TRUE(error) << path;
    EXPECT_NE(error->argument().find("expands into itself"), base::string::npos) << error->argument();
  }
  // The table still works afterwards.
  aliases.set("ok", "/fine/");
  EXPECT_EQ(aliases.expand("ok:a"), "/fine/a");
}

}  // namespace
