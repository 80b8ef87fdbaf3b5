#pragma once

#include "b_dynlib.h"
#include "b_plugin_factory.h"
#include "scene_plugin.h"

#include <string_view>

namespace scene {

/// The front end through which a host loads and saves scene files: it loads the scene
/// plug-in libraries, keeps their descriptors in priority order and picks the plug-in for a
/// file by its extension. It holds scene plug-in descriptors only; the scene's own objects
/// go to the factory passed to load and save.
class SceneFactory : public base::PluginFactory {
 public:
  SceneFactory();
  ~SceneFactory() override;

  /// Unloads everything, loads the plug-ins beside the program and orders them by
  /// data/importers.txt in the folder beside the program's folder.
  void reloadPlugins();
  /// The same with the plug-in folder and the list file given.
  void reloadPlugins(std::string_view pluginDirectory, std::string_view importerList);
  /// Loads every scene plug-in library (scene_* with the system's library suffix) of a
  /// folder. A library that fails is reported and the scan goes on.
  void loadPluginsFromPath(std::string_view directory);
  /// Puts the registered scene plug-ins in priority order: those the list file names, in its
  /// order, then the others in name order.
  void orderPlugins(std::string_view importerList);
  /// Drops the descriptors, then calls each library's unloadScenePlugin, then frees them.
  void unloadPlugins();

  bool getImporterParameters(std::string_view path, base::AttribMap& parameters);
  /// The importer's (or exporter's) parameters of one registered plug-in, with their
  /// defaults; false when the plug-in has no such side.
  bool getPluginParameters(IScenePluginDesc& descriptor, bool importers, base::AttribMap& parameters);
  bool getExporterParameters(std::string_view path, base::AttribMap& parameters);
  /// Imports `path` into `scene` with the parameters; false when no plug-in reads it or the
  /// import failed. A path without an extension throws base::exception.
  bool load(base::PluginFactory& scene, std::string_view path, const base::AttribMap& parameters);
  bool save(base::PluginFactory& scene, std::string_view path, const base::AttribMap& parameters);
  /// Every importer (or exporter) extension, sorted, unique, `;`-separated.
  base::string getSupportedExtensions(bool importers) const;
  bool isExtensionSupported(std::string_view extension, bool importers) const;

  const base::vector<base::ref<IScenePluginDesc>>& scenePlugins() const { return m_scenePlugins; }
  const base::vector<base::ref<base::DynLib>>& pluginLibraries() const { return m_pluginLibraries; }
  /// The file of the library that registered `descriptor`; empty when none did.
  base::string libraryOf(const base::IPluginDesc* descriptor) const;

 private:
  /// A temporary object of the first plug-in, in priority order, that lists `extension`;
  /// null when none makes one. It is not listed: it goes with its last reference.
  base::ref<base::IPlugin> createFor(std::string_view extension, bool importers);
  /// The extension loop of the import side: the extension after the second-to-last dot,
  /// then after the last one. A path without one throws `emptyMessage`.
  base::ref<base::IPlugin> createImporter(std::string_view path, const char* function, std::string_view emptyMessage);
  void loadLibrary(const base::string& file);

  base::vector<base::ref<IScenePluginDesc>> m_scenePlugins;
  base::vector<base::ref<base::DynLib>> m_pluginLibraries;
  base::map<const base::IPluginDesc*, base::string> m_libraryOf;
};

/// Whether `extension` is one of the `;`-separated tokens of `list` (spaces and tabs around
/// a token ignored; a token "ext|description" also matches as "ext").
bool matchesExtension(std::string_view extension, std::string_view list);

}  // namespace scene
