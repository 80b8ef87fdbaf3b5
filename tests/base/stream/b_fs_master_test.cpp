#include "b_fs.h"
#include "b_stack_walker.h"
#include "log_capture.h"
#include "thrown.h"

#include <gtest/gtest.h>

#include <functional>
#include <map>
#include <string>
#include <vector>

namespace {

using stream_tests::thrown;

// A file system whose answers a test sets: the files it holds (name to content), whether
// open fails in some other way, and what its modifying operations do.
struct FakeFS : base::fs::IPlugin {
  FakeFS(base::PluginFactory* factory, base::fs::PluginDesc* descriptor, std::uint32_t index,
         std::uint32_t capabilities)
      : IPlugin(factory, descriptor, index, capabilities) {}

  bool fileExists(std::string_view path) override { return files.count(std::string(path)) != 0; }
  bool dirExists(std::string_view path) override { return path == folder; }
  base::Stream open(std::string_view path, std::uint32_t) override {
    opened.emplace_back(path);
    stackCaptureWhileOpening = base::StackWalker::threadCapture();
    if (wrongPassword) base::raise<base::wrong_password>("FakeFS::open", std::string(text(getDesc()->name)));
    const auto file = files.find(std::string(path));
    if (file == files.end()) {
      base::raise<base::fs::file_not_found>("FakeFS::open", std::string(text(getDesc()->name)), path);
    }
    return base::memStream(file->second.data(), static_cast<std::int64_t>(file->second.size()));
  }
  base::ref<base::fs::IEnum> findFolders(std::string_view pattern) override { return listing(pattern, folders); }
  base::ref<base::fs::IEnum> findFiles(std::string_view pattern) override {
    std::vector<std::string> names;
    for (const auto& file : files) names.push_back(file.first);
    return listing(pattern, names);
  }
  void mkdir(std::string_view path) override {
    if (failModify) base::raise<base::exception>("FakeFS::mkdir", std::string(text(getDesc()->name)) + " failed");
    made.emplace_back(path);
  }
  bool symLinksPermitted() const override { return links; }
  void symLinksPermitted(bool permitted) override { links = permitted; }

  base::ref<base::fs::IEnum> listing(std::string_view pattern, const std::vector<std::string>& names);

  std::map<std::string, std::string> files;
  std::vector<std::string> folders;
  std::string folder;
  std::vector<std::string> opened;
  std::vector<std::string> made;
  bool wrongPassword = false;
  bool failListing = false;
  bool failModify = false;
  bool links = false;
  bool stackCaptureWhileOpening = true;
};

// Lists a fixed set of names, whatever the pattern.
struct NameList : base::fs::IEnum {
  explicit NameList(std::vector<std::string> entries) : names(std::move(entries)) {}
  bool atEnd() const override { return at >= names.size(); }
  void next() override { ++at; }
  base::string name() const override { return base::string(names[at]); }
  base::string directory() const override { return "fake/"; }
  std::uint32_t attributes() const override { return 0; }
  std::int64_t size() const override { return 0; }
  std::int64_t modifiedTime() const override { return 0; }
  std::vector<std::string> names;
  std::size_t at = 0;
};

base::ref<base::fs::IEnum> FakeFS::listing(std::string_view, const std::vector<std::string>& names) {
  if (failListing) base::raise<base::exception>("FakeFS::find", "cannot list");
  return base::ref<base::fs::IEnum>(new NameList(names));
}

struct FakeDesc : base::fs::PluginDesc {
  FakeDesc(const char* name, std::uint32_t capabilities, const char* extensions = "")
      : PluginDesc(name, "tests", extensions), capabilities(capabilities) {}
  base::IPlugin* create(base::PluginFactory* factory, std::uint32_t index) override {
    return new FakeFS(factory, this, index, capabilities);
  }
  std::uint32_t capabilities;
};

// A master over fake file systems named "system" and "gzip" (attached in that order at
// construction) and "remote" (registered, attached by the tests that want it).
class MasterTest : public ::testing::Test {
 protected:
  MasterTest() {
    factory.registerDesc(base::ref<base::IPluginDesc>(new FakeDesc("remote", 0, "zip;jar")));
    factory.registerDesc(base::ref<base::IPluginDesc>(new FakeDesc("gzip", base::fs::canMkdir, "gz")));
    factory.registerDesc(
        base::ref<base::IPluginDesc>(new FakeDesc("system", base::fs::canMkdir | base::fs::canSwitchLinks)));
    master = new base::fs::MasterFS(&factory, &masterDesc, base::IPlugin::unlisted);
  }

  FakeFS& fs(const char* name) { return static_cast<FakeFS&>(*master->findFS(name)); }

  base::PluginFactory factory{"file systems"};
  base::fs::PluginDesc masterDesc{"master", "", ""};
  base::ref<base::fs::MasterFS> master;
};

TEST_F(MasterTest, AttachesTheKnownFileSystemsInOrderAndCombinesTheirWords) {
  ASSERT_EQ(master->plugins().size(), 2u);
  EXPECT_EQ(base::text(master->plugins()[0]->getDesc()->name), "system");
  EXPECT_EQ(base::text(master->plugins()[1]->getDesc()->name), "gzip");
  EXPECT_EQ(master->capabilities(), base::fs::canMkdir | base::fs::canSwitchLinks);

  master->attachFS("remote");
  master->attachFS("remote");  // attached already: nothing happens
  EXPECT_EQ(master->plugins().size(), 3u);
  master->detachFS("system");
  ASSERT_EQ(master->plugins().size(), 2u);
  EXPECT_EQ(base::text(master->plugins()[0]->getDesc()->name), "gzip");
  EXPECT_EQ(master->capabilities(), base::fs::canMkdir);
  EXPECT_FALSE(master->findFS("system"));

  const auto error = thrown<base::invalid_argument>([&] { master->attachFS("nfs"); });
  ASSERT_TRUE(error);
  EXPECT_EQ(error->argument(), "file system with name nfs can't be found");
}

TEST_F(MasterTest, OpenGivesTheFirstFileSystemThatHasTheFile) {
  fs("gzip").files["a.ply"] = "gzip's";
  base::Stream stream = master->open("a.ply", base::fs::openForReading);
  char text[6];
  ASSERT_EQ(stream.read(text, 6), 6u);
  EXPECT_EQ(std::string(text, 6), "gzip's");
  EXPECT_EQ(fs("system").opened, std::vector<std::string>{"a.ply"});

  fs("system").files["a.ply"] = "system";
  stream = master->open("a.ply", base::fs::openForReading);
  EXPECT_EQ(fs("gzip").opened.size(), 1u);
}

TEST_F(MasterTest, AMissingFileIsTheFirstFileSystemsNotFoundWithCaptureRestored) {
  ASSERT_TRUE(base::StackWalker::threadCapture());
  const auto error = thrown<base::fs::file_not_found>([&] { master->open("none.ply", base::fs::openForReading); });
  ASSERT_TRUE(error);
  EXPECT_STREQ(error->what(), "system");
  EXPECT_EQ(error->path(), "none.ply");
  EXPECT_TRUE(error->callStack().empty());
  EXPECT_FALSE(fs("system").stackCaptureWhileOpening);
  EXPECT_EQ(fs("gzip").opened.size(), 1u);  // every file system was tried
  EXPECT_TRUE(base::StackWalker::threadCapture());
}

TEST_F(MasterTest, AWrongPasswordWinsOverNotFoundAndTheLastOneIsKept) {
  master->attachFS("remote");
  fs("gzip").wrongPassword = true;
  fs("remote").wrongPassword = true;
  const auto error = thrown<base::wrong_password>([&] { master->open("x.ply", base::fs::openForReading); });
  ASSERT_TRUE(error);
  EXPECT_STREQ(error->what(), "remote");
  EXPECT_TRUE(base::StackWalker::threadCapture());
}

TEST_F(MasterTest, OpenRefusesAnEmptyNameAndWorksWithoutFileSystems) {
  const auto empty = thrown<base::invalid_argument>([&] { master->open("", base::fs::openForReading); });
  ASSERT_TRUE(empty);
  EXPECT_EQ(empty->argument(), "file name not provided");
  master->detachFS("system");
  master->detachFS("gzip");
  EXPECT_TRUE(thrown<base::fs::file_not_found>([&] { master->open("a", base::fs::openForReading); }));
}

TEST_F(MasterTest, WritingByExtensionGoesToTheFileSystemThatListsIt) {
  master->attachFS("remote");
  fs("remote").files["/out/x.jar"] = "";
  master->open("/out/x.jar", base::fs::openWrite | base::fs::openByExtension);
  EXPECT_TRUE(fs("system").opened.empty());
  EXPECT_EQ(fs("remote").opened.size(), 1u);
  // Only whole entries of the list count, and only the file name's extension.
  fs("system").files["/out.zip/x.j"] = "";
  master->open("/out.zip/x.j", base::fs::openWrite | base::fs::openByExtension);
  EXPECT_EQ(fs("system").opened.size(), 1u);
}

TEST_F(MasterTest, ReadingAsksTheFileSystemsThatListTheExtensionFirst) {
  fs("gzip").files["scan.ply.GZ"] = "inflated";
  fs("system").files["scan.ply.GZ"] = "raw";
  char text[8];
  ASSERT_EQ(master->open("scan.ply.GZ", base::fs::openForReading).read(text, 8), 8u);
  EXPECT_EQ(std::string(text, 8), "inflated");
  EXPECT_TRUE(fs("system").opened.empty());
  // One that does not have the file leaves it to the others, in attach order.
  fs("system").files["other.gz"] = "raw";
  ASSERT_EQ(master->open("other.gz", base::fs::openForReading).read(text, 3), 3u);
  EXPECT_EQ(std::string(text, 3), "raw");
  EXPECT_EQ(fs("gzip").opened, (std::vector<std::string>{"scan.ply.GZ", "other.gz"}));
  // Writing keeps the attach order.
  master->open("scan.ply.GZ", base::fs::openWrite);
  EXPECT_EQ(fs("system").opened, (std::vector<std::string>{"other.gz", "scan.ply.GZ"}));
}

TEST_F(MasterTest, ExistenceIsAnyFileSystemsAnswerAfterAliasExpansion) {
  base::fs::aliases().set("fakeroot", "inside/");
  fs("gzip").files["inside/a.ply"] = "";
  fs("system").folder = "inside/models";
  EXPECT_TRUE(master->fileExists("fakeroot:a.ply"));
  EXPECT_FALSE(master->fileExists("fakeroot:b.ply"));
  EXPECT_TRUE(master->dirExists("fakeroot:models"));
  EXPECT_FALSE(master->isArchive("fakeroot:a.ply"));
  base::fs::aliases().set("fakeroot", "");
}

TEST_F(MasterTest, ListingsAreGroupedByFileSystemAndSkipFailingOnes) {
  master->attachFS("remote");
  fs("system").files = {{"a", ""}, {"b", ""}};
  fs("gzip").failListing = true;
  fs("remote").files = {{"c", ""}};
  std::vector<std::string> names;
  for (auto files = master->findFiles("*"); !files->atEnd(); files->next()) names.emplace_back(files->name());
  EXPECT_EQ(names, (std::vector<std::string>{"a", "b", "c"}));

  const auto none = master->findFolders("*");
  EXPECT_TRUE(none->atEnd());
  EXPECT_TRUE(thrown<base::exception>([&] { none->next(); }));
}

TEST_F(MasterTest, ModifyingGoesToTheFirstCapableFileSystemThatSucceeds) {
  master->mkdir("one");
  EXPECT_EQ(fs("system").made, std::vector<std::string>{"one"});
  fs("system").failModify = true;
  master->mkdir("two");
  EXPECT_EQ(fs("gzip").made, std::vector<std::string>{"two"});
  fs("gzip").failModify = true;
  // Every one failed: the first one's failure is the answer.
  EXPECT_STREQ(stream_tests::thrownText([&] { master->mkdir("three"); }).c_str(), "system failed");
  // Nobody can: a failure that says so.
  const std::string none = stream_tests::thrownText([&] { master->touch("x"); });
  EXPECT_NE(none.find("'x'"), std::string::npos) << none;
}

TEST_F(MasterTest, TheLinkSwitchGoesToCapableFileSystems) {
  EXPECT_FALSE(master->symLinksPermitted());
  master->symLinksPermitted(true);
  EXPECT_TRUE(fs("system").links);
  EXPECT_FALSE(fs("gzip").links);
  EXPECT_TRUE(master->symLinksPermitted());
}

TEST_F(MasterTest, TheMasterHasNoLinkReaderAndCurdirNeedsTheSystem) {
  const auto link = thrown<base::unsupported_interface>([&] { master->readLink("x"); });
  ASSERT_TRUE(link);
  EXPECT_STREQ(link->interfaceName(), "fs::Plugin::readLink");
  EXPECT_STREQ(link->function(), "base::fs::IPlugin::readLink");
  // The fake "system" has no curdir of its own.
  const auto curdir = thrown<base::unsupported_interface>([&] { master->curdir(); });
  ASSERT_TRUE(curdir);
  EXPECT_STREQ(curdir->interfaceName(), "fs::Plugin::curdir");
}

TEST(MasterFS, AFailingAttachIsLoggedAndConstructionGoesOn) {
  // "system" is registered but its descriptor makes nothing.
  struct BrokenDesc : base::fs::PluginDesc {
    BrokenDesc() : PluginDesc("system", "", "") {}
    base::IPlugin* create(base::PluginFactory*, std::uint32_t) override { return nullptr; }
  };
  base::PluginFactory factory("file systems");
  factory.registerDesc(base::ref<base::IPluginDesc>(new BrokenDesc));
  factory.registerDesc(base::ref<base::IPluginDesc>(new FakeDesc("vexa", 0)));
  base::fs::PluginDesc masterDesc("master", "", "");
  testing_support::LogCapture log;
  base::ref<base::fs::MasterFS> master(new base::fs::MasterFS(&factory, &masterDesc, base::IPlugin::unlisted));
  ASSERT_EQ(master->plugins().size(), 1u);
  EXPECT_EQ(base::text(master->plugins()[0]->getDesc()->name), "vexa");
  ASSERT_FALSE(log.entries.empty());
  EXPECT_NE(log.entries[0].text.find("file system system could not be made"), std::string::npos);
}

TEST(MasterFS, TheProcessMasterHasTheSystemFileSystem) {
  base::fs::MasterFS& master = base::fs::master();
  ASSERT_TRUE(master.findFS("system"));
  EXPECT_EQ(master.getDesc()->author, "");
  EXPECT_EQ(master.findFS("system")->getDesc()->author, "Tarn Velisk");
  EXPECT_EQ(master.capabilities(), base::fs::systemCapabilities);
  EXPECT_EQ(&base::fs::master(), &master);
}

}  // namespace
