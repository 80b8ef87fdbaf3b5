#include "b_path.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <string>

namespace {

// getDirectory answers with the system's own separator.
base::string native(base::string path) {
  for (char& c : path) {
    if (c == '/') c = static_cast<char>(std::filesystem::path::preferred_separator);
  }
  return path;
}

TEST(Path, ExtensionComesFromTheFileNameOnly) {
  EXPECT_EQ(base::getExtension("a\\b.c.ply"), "ply");
  EXPECT_EQ(base::getExtension("a\\b.c.ply", true), "c.ply");
  EXPECT_EQ(base::getExtension("dir.old\\file"), "");
  EXPECT_EQ(base::getExtension("dir.old\\file", true), "");
  // A dot in a POSIX folder name is not an extension either.
  EXPECT_EQ(base::getExtension("/home/me/dir.old/file"), "");
  EXPECT_EQ(base::getExtension("/data/scan.ply.gz"), "gz");
  EXPECT_EQ(base::getExtension("/data/scan.ply.gz", true), "ply.gz");
  EXPECT_EQ(base::getExtension("bunny.ply", true), "ply");
  EXPECT_EQ(base::getExtension(".ply"), "ply");
  EXPECT_EQ(base::getExtension(".ply", true), "ply");
  EXPECT_EQ(base::getExtension("name."), "");
  EXPECT_EQ(base::getExtension(""), "");
}

TEST(Path, DirectoryKeepsTheRootAndResolvesParentParts) {
  EXPECT_EQ(base::getDirectory("/usr/bin/scenetool"), native("/usr/bin/"));
  EXPECT_EQ(base::getDirectory("/usr/bin/../data/importers.txt"), native("/usr/data/"));
  EXPECT_EQ(base::getDirectory("/scenetool"), native("/"));
  EXPECT_EQ(base::getDirectory("bin/../data/"), native("data/"));
  EXPECT_EQ(base::getDirectory("../data/x"), native("../data/"));
  EXPECT_EQ(base::getDirectory("a//b///c"), native("a/b/"));
  EXPECT_EQ(base::getDirectory("file.ply"), "");
  EXPECT_EQ(base::getDirectory(""), "");
}

TEST(Path, DirectoryReadsWindowsPathsWithEitherSeparator) {
  EXPECT_EQ(base::getDirectory("C:\\models\\..\\scans\\bunny.ply"), native("C:/scans/"));
  EXPECT_EQ(base::getDirectory("C:/models/bunny.ply"), native("C:/models/"));
  EXPECT_EQ(base::getDirectory("C:\\..\\x"), native("C:/../"));
  // A network path keeps its two leading separators.
  EXPECT_EQ(base::getDirectory("\\\\server\\share\\x.ply"), native("//server/share/"));
}

TEST(Path, ExecutablePathNamesThisProgram) {
  const std::filesystem::path path(std::string(base::getExecutablePath()));
  EXPECT_TRUE(path.is_absolute());
  EXPECT_EQ(path.stem(), "base1_tests");
  EXPECT_TRUE(std::filesystem::exists(path));
}

}  // namespace
