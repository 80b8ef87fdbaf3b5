#pragma once

#include "b_plugin.h"
#include "b_plugin_factory.h"
#include "scene_schema.h"

#include <cstdint>
#include <string_view>

namespace scene {

/// The interface names that scene plug-in objects answer, made once per process.
base::name_id sceneImporterInterface();
base::name_id sceneExporterInterface();

/// Describes a scene plug-in: what it is called and which file extensions it reads and
/// writes (`;`-separated, lower case; a token may carry `|` and a description).
class IScenePluginDesc : public base::IPluginDesc {
 public:
  /// Bit of `flags` that marks a scene plug-in descriptor. The mark, not the C++ type, is
  /// what the scene factory checks: each plug-in library has its own copy of this class.
  static constexpr std::uint32_t sceneDescFlag = 0x40000000;

  IScenePluginDesc();
  ~IScenePluginDesc() override;

  virtual base::string getImporterExtensions() const = 0;
  virtual base::string getExporterExtensions() const = 0;

  bool isScenePluginDesc() const { return (flags & sceneDescFlag) != 0; }
};

/// Reads files of some format into a scene.
class ISceneImporter : public base::IPluginInterface, public virtual sceneImporter_schema {
 public:
  base::name_id interfaceName() const override;
  /// Whether this importer reads the file at `path` (it looks at the content).
  virtual bool canImport(std::string_view path) = 0;
  /// Fills `parameters` with the importer's parameters and their defaults.
  virtual void getParameters(base::AttribMap& parameters) = 0;
  /// Reads the file and creates the scene's objects in `scene`; false when it failed.
  virtual bool importScene(base::PluginFactory& scene, std::string_view path) = 0;
};

/// Writes the scene of a factory to a file of some format.
class ISceneExporter : public base::IPluginInterface, public virtual sceneExporter_schema {
 public:
  base::name_id interfaceName() const override;
  virtual void getParameters(base::AttribMap& parameters) = 0;
  virtual bool exportScene(base::PluginFactory& scene, std::string_view path) = 0;
};

/// A plug-in object that is an importer: it answers "ISceneImporter" with itself.
class SceneImportPlugin : public base::IPlugin, public ISceneImporter {
 public:
  using base::IPlugin::IPlugin;
  base::IPluginInterface* queryInterface(base::name_id name) const override;
};

/// The importer part of a plug-in object, or null. Found by interface name, never by C++
/// type, so that objects of every plug-in library are found.
ISceneImporter* importerOf(const base::IPlugin& object);
ISceneExporter* exporterOf(const base::IPlugin& object);

/// The entry points a scene plug-in library exports (C names, no decoration).
using LoadScenePluginFunction = int (*)(base::PluginFactory& factory);
using UnloadScenePluginFunction = int (*)(base::PluginFactory& factory);

}  // namespace scene

#if defined(_WIN32)
#  define SCENE_PLUGIN_EXPORT extern "C" __declspec(dllexport)
#else
#  define SCENE_PLUGIN_EXPORT extern "C" __attribute__((visibility("default")))
#endif
