// Scene plug-ins for the scene factory's tests, one library per TEST_PLUGIN variant:
// PAIR registers two importers (the first also exports); GAMMA registers one importer and a
// descriptor that is no scene plug-in, and fails to unload; THROWS fails to load; NO_ENTRY
// lacks the load entry point.
#include "b_exception.h"
#include "scene_plugin.h"

#include <stdexcept>
#include <string>

namespace {

// Imports by making one object in the scene that records who imported what, with which
// "quality" parameter; refuses paths holding "refused", fails for paths holding "fail".
// Importer and exporter share one getParameters, which names the plug-in.
class TestPlugin final : public scene::SceneImportPlugin, public scene::ISceneExporter {
 public:
  TestPlugin(base::PluginFactory* factory, base::IPluginDesc* descriptor, std::uint32_t index, bool exports)
      : SceneImportPlugin(factory, descriptor, index), m_exports(exports) {}

  base::IPluginInterface* queryInterface(base::name_id name) const override {
    if (m_exports && name == scene::sceneExporterInterface()) {
      return const_cast<scene::ISceneExporter*>(static_cast<const scene::ISceneExporter*>(this));
    }
    return SceneImportPlugin::queryInterface(name);
  }
  bool canImport(std::string_view path) override { return path.find("refused") == std::string_view::npos; }
  void getParameters(base::AttribMap& parameters) override {
    parameters.attribute<base::string>(base::intern("parametersFrom")) = base::text(descriptor()->name);
  }
  bool importScene(base::PluginFactory& scene, std::string_view path) override {
    const base::ref<base::IPlugin> record = scene.create(base::intern("record"));
    const base::string* quality = findAttribute<base::string>(base::intern("quality"));
    record->attribute<base::string>(base::intern("name")) =
        base::string(base::text(descriptor()->name)) + " " + base::string(path) + " " + (quality ? *quality : "-");
    return path.find("fail") == std::string_view::npos;
  }
  bool exportScene(base::PluginFactory& scene, std::string_view) override { return !scene.objects().empty(); }

 private:
  bool m_exports;
};

class TestDesc final : public scene::IScenePluginDesc {
 public:
  TestDesc(const char* type, const char* importers, const char* exporters)
      : m_importers(importers), m_exporters(exporters) {
    name = base::intern(type);
    author = "tests";
  }
  base::IPlugin* create(base::PluginFactory* factory, std::uint32_t index) override {
    return new TestPlugin(factory, this, index, !m_exporters.empty());
  }
  base::string getImporterExtensions() const override { return m_importers; }
  base::string getExporterExtensions() const override { return m_exporters; }

 private:
  base::string m_importers;
  base::string m_exporters;
};

}  // namespace

#if TEST_PLUGIN != TEST_PLUGIN_NO_ENTRY
SCENE_PLUGIN_EXPORT int loadScenePlugin([[maybe_unused]] base::PluginFactory& factory) {
#  if TEST_PLUGIN == TEST_PLUGIN_PAIR
  factory.registerDesc(
      base::ref<base::IPluginDesc>(new TestDesc("AlphaImporter", "alpha; shared|Shared test format", "alpha")));
  factory.registerDesc(base::ref<base::IPluginDesc>(new TestDesc("BetaImporter", " beta ;\tshared ;raw.ply", "")));
#  elif TEST_PLUGIN == TEST_PLUGIN_GAMMA
  factory.registerDesc(base::ref<base::IPluginDesc>(new TestDesc("GammaImporter", "ply;gamma", "")));
  auto* plain = new base::IPluginDesc;
  plain->name = base::intern("NotAScenePlugin");
  factory.registerDesc(base::ref<base::IPluginDesc>(plain));
#  elif TEST_PLUGIN == TEST_PLUGIN_THROWS
  base::raise<base::exception>("loadScenePlugin", "the throwing test plug-in cannot load");
#  endif
  return 0;
}
#endif

#if TEST_PLUGIN == TEST_PLUGIN_GAMMA
SCENE_PLUGIN_EXPORT int unloadScenePlugin(base::PluginFactory&) {
  throw std::runtime_error("the gamma test plug-in cannot unload");
}
#endif
