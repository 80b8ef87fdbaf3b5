#pragma once

// Imports files the way a host does: a scene factory that loads the PLY plug-in from disk,
// and a scene factory with the scene types that receives the objects.

#include "b_attrib_array.h"
#include "b_fs.h"
#include "b_json.h"
#include "scene_factory.h"
#include "scene_index_delta.h"
#include "scene_mesh.h"
#include "scene_schema.h"
#include "scene_schema_registry.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <string>
#include <utility>
#include <vector>

namespace testing_support {

/// The scene factory with the plug-ins beside the programs (the build's bin folder).
inline scene::SceneFactory& pluginFactory() {
  static scene::SceneFactory factory;
  static const bool loaded = [] {
    factory.reloadPlugins(MESHPORT_PLUGIN_DIR, MESHPORT_DATA_DIR "/importers.txt");
    return true;
  }();
  static_cast<void>(loaded);
  return factory;
}

/// One import: the scene factory that received it.
struct ImportedScene {
  base::ref<base::PluginFactory> scene{new base::PluginFactory("scene")};
  bool loaded = false;

  ImportedScene() { scene::register_scene_schema(*scene); }

  /// The first object of `type`, or null.
  base::IPlugin* first(base::name_id type) const {
    for (const auto& object : scene->objects()) {
      if (object && object->mapType() == type) return object.get();
    }
    return nullptr;
  }
  base::IPlugin& mesh() const { return *first(scene::mesh_schema::typeName()); }
  /// Primitive `index` of the mesh.
  base::AttribMap& primitive(std::uint32_t index) const {
    return *scene::mapAt(*scene::findArrayMember(mesh(), scene::mesh_schema::primitives()), index);
  }
  /// The objects as JSON, in factory order.
  std::string json() const {
    base::JsonWriter writer;
    writer.beginArray();
    for (const auto& object : scene->objects()) {
      if (object) object->writeValue(writer);
    }
    writer.endArray();
    return std::string(writer.text());
  }
};

/// Boolean importer parameters by name.
using Switches = std::vector<std::pair<std::string, bool>>;

/// Imports `path` with the importer's `switches`; with `plans` false the reader delivers
/// every value one by one.
inline ImportedScene importFile(const std::string& path, bool plans = true, const Switches& switches = {}) {
  ImportedScene imported;
  base::AttribMap parameters;
  for (const auto& [name, on] : switches) parameters.attribute(base::intern(name), on);
  if (!plans) parameters.attribute(base::intern("plyColumnPlans"), false);
  imported.loaded = pluginFactory().load(*imported.scene, path, parameters);
  return imported;
}

/// The encodings by the words of their format lines.
inline constexpr const char* encodings[] = {"ascii", "binary_little_endian", "binary_big_endian"};

/// Exports `imported` to `path` through the plug-in that writes its extension, with the
/// exporter's defaults and `entries` (NAME=VALUE).
inline bool exportScene(const ImportedScene& imported, const std::string& path,
                        const std::vector<std::string>& entries = {}) {
  base::AttribMap parameters;
  scene::SceneFactory& factory = pluginFactory();
  EXPECT_TRUE(factory.getExporterParameters(path, parameters));
  for (const std::string& entry : entries) {
    const std::size_t equals = entry.find('=');
    base::Attribute** slot = parameters.findAttributeMutable(base::intern(entry.substr(0, equals)));
    EXPECT_TRUE(slot && *slot && (*slot)->fromString(entry.substr(equals + 1))) << entry;
  }
  return factory.save(*imported.scene, path, parameters);
}

/// The exporter's parameters that choose `encoding` (one of `encodings`).
inline std::vector<std::string> formatEntries(const std::string& encoding) {
  if (encoding == "ascii") return {"exportBinary=false"};
  return {"exportBinary=true", encoding == "binary_big_endian" ? "exportBigEndian=true" : "exportBigEndian=false"};
}

/// A file in a fresh temporary folder, removed with the object.
class TemporaryFile {
 public:
  TemporaryFile(const std::string& name, const std::string& content) : m_folder(std::string(base::fs::tmpFilename())) {
    std::filesystem::remove(m_folder);
    std::filesystem::create_directory(m_folder);
    std::ofstream(m_folder / name, std::ios::binary) << content;
    m_path = (m_folder / name).string();
  }
  ~TemporaryFile() { std::filesystem::remove_all(m_folder); }
  const std::string& path() const { return m_path; }

 private:
  std::filesystem::path m_folder;
  std::string m_path;
};

inline const std::string asciiHeader = "ply\nformat ascii 1.0\n";

/// Imports `text` from a temporary "test.ply".
inline ImportedScene importText(const std::string& text, bool plans = true, const Switches& switches = {}) {
  const TemporaryFile file("test.ply", text);
  return importFile(file.path(), plans, switches);
}

/// The list `name` of `map`; empty when there is none.
template <class T>
const base::vector<T>& list(const base::AttribMap& map, base::name_id name) {
  const base::vector<T>* found = map.findVecAttribute<T>(name);
  static const base::vector<T> none;
  return found ? *found : none;
}

/// The list `name` of entry `index` of the mesh's set array `sets` (uvSets, colorSets).
template <class T>
const base::vector<T>& setList(const base::AttribMap& mesh, base::name_id sets, std::uint32_t index,
                               base::name_id name) {
  return list<T>(*scene::mapAt(*scene::findArrayMember(mesh, sets), index), name);
}

inline std::size_t arraySize(const base::AttribMap& map, base::name_id name) {
  const base::AttribArray* array = scene::findArrayMember(map, name);
  return array ? array->size() : 0;
}

}  // namespace testing_support
