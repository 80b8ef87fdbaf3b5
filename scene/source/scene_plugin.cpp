#include "scene_plugin.h"

namespace scene {

base::name_id sceneImporterInterface() {
  static const base::name_id name = base::intern("ISceneImporter");
  return name;
}

base::name_id sceneExporterInterface() {
  static const base::name_id name = base::intern("ISceneExporter");
  return name;
}

IScenePluginDesc::IScenePluginDesc() { flags |= sceneDescFlag; }

IScenePluginDesc::~IScenePluginDesc() = default;

base::name_id ISceneImporter::interfaceName() const { return sceneImporterInterface(); }

base::name_id ISceneExporter::interfaceName() const { return sceneExporterInterface(); }

base::IPluginInterface* SceneImportPlugin::queryInterface(base::name_id name) const {
  if (name == sceneImporterInterface()) {
    return const_cast<ISceneImporter*>(static_cast<const ISceneImporter*>(this));
  }
  return base::IPlugin::queryInterface(name);
}

ISceneImporter* importerOf(const base::IPlugin& object) {
  base::IPluginInterface* found = object.queryInterface(sceneImporterInterface());
  return found && found->interfaceName() == sceneImporterInterface() ? static_cast<ISceneImporter*>(found) : nullptr;
}

ISceneExporter* exporterOf(const base::IPlugin& object) {
  base::IPluginInterface* found = object.queryInterface(sceneExporterInterface());
  return found && found->interfaceName() == sceneExporterInterface() ? static_cast<ISceneExporter*>(found) : nullptr;
}

}  // namespace scene
