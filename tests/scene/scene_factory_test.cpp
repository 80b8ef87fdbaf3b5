#include "scene_factory.h"
#include "b_exception.h"
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
using testing_support::LogCapture;

std::vector<std::string> order(const scene::SceneFactory& factory) {
  std::vector<std::string> names;
  for (const auto& descriptor : factory.scenePlugins()) names.emplace_back(base::text(descriptor->name));
  return names;
}

bool logged(const LogCapture& log, const std::string& text) {
  return std::any_of(log.entries.begin(), log.entries.end(),
                     [&](const LogCapture::Entry& entry) { return entry.text.find(text) != std::string::npos; });
}

// A scene factory over the test plug-ins, ordered by an importers.txt the test writes.
class SceneFactoryTest : public ::testing::Test {
 protected:
  SceneFactoryTest() : listFile(std::string(base::fs::tmpFilename())) {}
  ~SceneFactoryTest() override { stdfs::remove(listFile); }

  void reload(const std::string& list) {
    std::ofstream(listFile) << list;
    factory.reloadPlugins(TEST_PLUGIN_DIR, listFile.string());
  }

  std::string recordOf(const base::PluginFactory& scene) const {
    if (scene.objects().empty()) return "(nothing)";
    const base::string* name = scene.objects().back()->findAttribute<base::string>(base::intern("name"));
    return name ? std::string(*name) : "(unnamed)";
  }

  LogCapture log;  // the failing test libraries are reported on every load
  stdfs::path listFile;
  scene::SceneFactory factory;
};

TEST_F(SceneFactoryTest, LoadingGoesOnPastLibrariesThatFail) {
  reload("");
  // pair (two descriptors), gamma; broken, no_entry and throws are reported.
  EXPECT_EQ(factory.pluginLibraries().size(), 3u);
  EXPECT_EQ(order(factory), (std::vector<std::string>{"AlphaImporter", "BetaImporter", "GammaImporter"}));
  EXPECT_TRUE(logged(log, "scene_broken"));
  EXPECT_TRUE(logged(log, "Failed to load scene plugin '"));
  EXPECT_TRUE(logged(log, "scene_no_entry"));
  EXPECT_TRUE(logged(log, "the throwing test plug-in cannot load"));
  EXPECT_TRUE(logged(log, "'NotAScenePlugin' is not a scene plugin descriptor; it is skipped"));
  EXPECT_TRUE(logged(log, "Trying to load 'scene_pair"));
  EXPECT_NE(factory.libraryOf(factory.scenePlugins()[0].get()).find("scene_pair"), base::string::npos);
}

TEST_F(SceneFactoryTest, ImportersTxtPutsNamedPluginsFirst) {
  reload("// priority list\n  GammaImporter   \n  // AlphaImporter\n\nMissingImporter\nBetaImporter // second\n");
  EXPECT_EQ(order(factory), (std::vector<std::string>{"GammaImporter", "BetaImporter", "AlphaImporter"}));
  EXPECT_TRUE(logged(log, "Can't find mesh importer called 'MissingImporter'!"));
  EXPECT_FALSE(logged(log, "Can't open importers.txt!"));
}

TEST_F(SceneFactoryTest, AMissingImportersTxtKeepsEveryPluginInNameOrder) {
  stdfs::remove(listFile);
  factory.reloadPlugins(TEST_PLUGIN_DIR, listFile.string());
  EXPECT_EQ(order(factory), (std::vector<std::string>{"AlphaImporter", "BetaImporter", "GammaImporter"}));
  EXPECT_TRUE(logged(log, "Can't open importers.txt!"));
}

TEST_F(SceneFactoryTest, UnloadingReportsAFailureAndFreesEveryLibrary) {
  reload("");
  log.entries.clear();
  factory.unloadPlugins();
  EXPECT_TRUE(logged(log, "the gamma test plug-in cannot unload"));
  EXPECT_TRUE(factory.pluginLibraries().empty());
  EXPECT_TRUE(factory.scenePlugins().empty());
  EXPECT_TRUE(factory.descriptors().empty());
  // Loading again after an unload works.
  reload("");
  EXPECT_EQ(factory.scenePlugins().size(), 3u);
}

TEST_F(SceneFactoryTest, LoadPicksThePluginByExtensionInTwoPasses) {
  reload("BetaImporter\nAlphaImporter\n");
  base::PluginFactory scene("scene");
  base::AttribMap parameters;
  parameters.attribute<base::string>(base::intern("quality")) = "high";
  EXPECT_TRUE(factory.load(scene, "dir/model.ALPHA", parameters));
  EXPECT_EQ(recordOf(scene), "AlphaImporter dir/model.ALPHA high");
  // The first pass looks for "raw.ply" (Beta lists it), ahead of Gamma's "ply".
  EXPECT_TRUE(factory.load(scene, "scan.raw.ply", parameters));
  EXPECT_EQ(recordOf(scene), "BetaImporter scan.raw.ply high");
  EXPECT_TRUE(factory.load(scene, "scan.old.ply", parameters));
  EXPECT_EQ(recordOf(scene), "GammaImporter scan.old.ply high");
  // Both list "shared"; the list file put Beta first.
  EXPECT_TRUE(factory.load(scene, "x.shared", parameters));
  EXPECT_EQ(recordOf(scene), "BetaImporter x.shared high");
  EXPECT_FALSE(factory.load(scene, "model.none", parameters));
  EXPECT_FALSE(factory.load(scene, "refused.alpha", parameters));
  EXPECT_FALSE(factory.load(scene, "fail.alpha", parameters));
  EXPECT_TRUE(factory.objects().empty());  // temporary plug-in objects are never listed
}

TEST_F(SceneFactoryTest, APathWithoutExtensionThrows) {
  reload("");
  base::PluginFactory scene("scene");
  base::AttribMap parameters;
  EXPECT_EQ(stream_tests::thrownText([&] { factory.load(scene, "data.old\\model", parameters); }),
            "mesh factory|data.old\\model| Can't load meshes without an extension!");
  EXPECT_EQ(stream_tests::thrownText([&] { factory.load(scene, "data.old/model", parameters); }),
            "mesh factory|data.old/model| Can't load meshes without an extension!");
  EXPECT_EQ(stream_tests::thrownText([&] { factory.getImporterParameters("model", parameters); }),
            "mesh factory: Can't load meshes without an extension!");
  EXPECT_EQ(stream_tests::thrownText([&] { factory.getExporterParameters("model", parameters); }),
            "mesh factory: Can't save meshes without an extension!");
  EXPECT_EQ(stream_tests::thrownText([&] { factory.save(scene, "model", parameters); }),
            "mesh factory: Can't save meshes without a provided format!");
}

TEST_F(SceneFactoryTest, ParametersAndSaving) {
  reload("");
  base::AttribMap parameters;
  EXPECT_TRUE(factory.getImporterParameters("missing.beta", parameters));
  EXPECT_EQ(*parameters.findAttribute<base::string>(base::intern("parametersFrom")), "BetaImporter");
  // An existing file that the importer refuses: true, but no parameters.
  const stdfs::path refused = stdfs::path(listFile).replace_filename("refused.gamma");
  std::ofstream(refused) << "x";
  base::AttribMap none;
  EXPECT_TRUE(factory.getImporterParameters(refused.string(), none));
  EXPECT_EQ(none.findAttribute<base::string>(base::intern("parametersFrom")), nullptr);
  stdfs::remove(refused);
  EXPECT_FALSE(factory.getImporterParameters("x.none", parameters));

  base::AttribMap exportParameters;
  EXPECT_TRUE(factory.getExporterParameters("out.alpha", exportParameters));
  EXPECT_EQ(*exportParameters.findAttribute<base::string>(base::intern("parametersFrom")), "AlphaImporter");
  EXPECT_FALSE(factory.getExporterParameters("out.beta", exportParameters));

  // One plug-in's sides, whatever the file: Alpha imports and exports, Beta only imports.
  for (const auto& descriptor : factory.scenePlugins()) {
    const std::string_view name = base::text(descriptor->name);
    base::AttribMap imports, exports;
    EXPECT_TRUE(factory.getPluginParameters(*descriptor, true, imports)) << name;
    EXPECT_EQ(*imports.findAttribute<base::string>(base::intern("parametersFrom")), name);
    EXPECT_EQ(factory.getPluginParameters(*descriptor, false, exports), name == "AlphaImporter") << name;
  }
  EXPECT_TRUE(factory.objects().empty());

  base::PluginFactory scene("scene");
  EXPECT_FALSE(factory.save(scene, "out.alpha", parameters));  // the test exporter wants objects
  scene.create(base::intern("record"));
  EXPECT_TRUE(factory.save(scene, "OUT.ALPHA", parameters));
  EXPECT_FALSE(factory.save(scene, "out.beta", parameters));
  EXPECT_TRUE(factory.objects().empty());
}

// A host's round: parameters, import, export. Each call's importer or exporter object is its
// own and never listed, so nothing is removed afterwards either: removing what was never
// listed is logged as a misuse.
TEST_F(SceneFactoryTest, ImportingAndSavingRemoveNothing) {
  reload("");
  log.entries.clear();
  base::PluginFactory scene("scene");
  base::AttribMap parameters;
  EXPECT_TRUE(factory.getImporterParameters("model.alpha", parameters));
  EXPECT_TRUE(factory.load(scene, "model.alpha", parameters));
  base::AttribMap exportParameters;
  EXPECT_TRUE(factory.getExporterParameters("out.alpha", exportParameters));
  EXPECT_TRUE(factory.save(scene, "out.alpha", exportParameters));
  EXPECT_FALSE(logged(log, "Attempt to remove"));
  EXPECT_TRUE(factory.objects().empty());
}

TEST_F(SceneFactoryTest, SupportedExtensions) {
  reload("");
  EXPECT_EQ(factory.getSupportedExtensions(true), "alpha;beta;gamma;ply;raw.ply;shared;shared|Shared test format");
  EXPECT_EQ(factory.getSupportedExtensions(false), "alpha");
  EXPECT_TRUE(factory.isExtensionSupported("shared", true));
  EXPECT_TRUE(factory.isExtensionSupported("raw.ply", true));
  EXPECT_FALSE(factory.isExtensionSupported("PLY", true));
  EXPECT_FALSE(factory.isExtensionSupported("beta", false));
}

TEST(MatchesExtension, TokensAreTrimmedAndMayCarryADescription) {
  EXPECT_TRUE(scene::matchesExtension("ply", "ply|Stanford polygon file"));
  EXPECT_TRUE(scene::matchesExtension("obj", "ply; obj ;fbx"));
  EXPECT_TRUE(scene::matchesExtension("ply|x", "ply|x"));
  EXPECT_FALSE(scene::matchesExtension("pl", "ply"));
  EXPECT_FALSE(scene::matchesExtension("", ";;"));
  EXPECT_FALSE(scene::matchesExtension("PLY", "ply"));
}

TEST(PluginFactoryCompact, DropsOnlyTheEmptySlotsAtTheEnd) {
  base::PluginFactory factory("objects");
  for (int i = 0; i < 4; ++i) factory.create(base::intern("thing"));
  factory.remove(1);
  factory.remove(3);
  EXPECT_EQ(factory.compact(), 1u);
  EXPECT_EQ(factory.objects().size(), 3u);
  EXPECT_EQ(factory.object(2)->index(), 2u);
  EXPECT_EQ(factory.compact(), 0u);
}

}  // namespace
