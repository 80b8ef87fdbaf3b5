// The scene plug-in library: its two entry points and the descriptor of the PLY importer,
// whose objects also export.

#include "ply_loader.h"
#include "scene_schema_registry.h"

#include <mutex>

namespace ply {
namespace {

class PlyPluginDesc final : public scene::IScenePluginDesc {
 public:
  PlyPluginDesc() {
    name = base::intern("PlyImporter");
    author = "Tarn Velisk";
  }
  base::IPlugin* create(base::PluginFactory* factory, std::uint32_t index) override {
    return new PLYImporter(factory, this, index);
  }
  base::string getImporterExtensions() const override { return "ply;ply.gz"; }
  base::string getExporterExtensions() const override { return "ply"; }
};

}  // namespace
}  // namespace ply

SCENE_PLUGIN_EXPORT int loadScenePlugin(base::PluginFactory& factory) {
  // This library's copy of the schema names must be the handles the host uses.
  scene::internSchemaNames();
  factory.registerDesc(base::ref<base::IPluginDesc>(new ply::PlyPluginDesc));
  return 0;
}

SCENE_PLUGIN_EXPORT int unloadScenePlugin(base::PluginFactory&) { return 0; }
