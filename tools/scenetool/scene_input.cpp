#include "scene_input.h"

#include "b_exception.h"
#include "b_fs.h"
#include "b_path.h"
#include "file_input.h"
#include "log_relay.h"
#include "scenetool_app.h"

#include <fmt/format.h>

#include <cctype>

namespace scenetool {

int applyParameters(const std::vector<std::string>& entries, base::AttribMap& parameters, std::string_view side) {
  for (const std::string& entry : entries) {
    const std::size_t equals = entry.find('=');
    const std::string name = entry.substr(0, equals);
    base::Attribute** slot = name.empty() ? nullptr : parameters.findAttributeMutable(base::intern(name));
    if (equals == std::string::npos || !slot || !*slot) {
      printError(fmt::format("-p {}: the {} has no parameter '{}'", entry, side, name));
      return exitUsage;
    }
    if (!(*slot)->fromString(std::string_view(entry).substr(equals + 1))) {
      printError(fmt::format("-p {}: '{}' is no {}", entry, entry.substr(equals + 1), base::text((*slot)->type())));
      return exitUsage;
    }
  }
  return exitOk;
}

int readObjectList(const std::string& path, base::PluginFactory& scene) {
  base::Stream file;
  if (!openInput(path, file)) return exitFailed;
  // The reader asks for a few bytes at a time.
  base::Stream stream = base::bufReadStream(file, 0, 256 * 1024, path);
  LogRelay relay;
  try {
    scene.read(stream);
  } catch (const base::exception& failure) {
    printFileError(path, failure.what());
    return exitFailed;
  }
  // A bad type record ends the read early with an error: the file is damaged.
  if (const auto cause = relay.takeCause()) {
    printFileError(path, *cause);
    return exitFailed;
  }
  return exitOk;
}

int importScene(scene::SceneFactory& factory, const std::string& path, const std::vector<std::string>& entries,
                base::PluginFactory& scene) {
  LogRelay relay;
  try {
    base::AttribMap parameters;
    if (!factory.getImporterParameters(path, parameters)) {
      printError(fmt::format("{}: no scene plug-in imports this kind of file (plug-ins read: {})", path,
                             factory.getSupportedExtensions(true)));
      return exitFailed;
    }
    if (const int applied = applyParameters(entries, parameters, "importer"); applied != exitOk) return applied;
    if (factory.load(scene, path, parameters)) return exitOk;
    printError(fmt::format("{}: the file is not one the scene plug-ins read", path));
  } catch (const base::fs::file_not_found&) {
    printError(fmt::format("{}: no such file", path));
  } catch (const base::exception& error) {
    const auto cause = relay.takeCause();
    printFileError(path, cause ? *cause : error.what());
  }
  return exitFailed;
}

int loadScene(const std::string& path, base::PluginFactory& scene) {
  base::string extension = base::getExtension(path);
  for (char& c : extension) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
  if (extension == "scene") return readObjectList(path, scene);
  scene::SceneFactory factory;
  factory.reloadPlugins();
  return importScene(factory, path, {}, scene);
}

}  // namespace scenetool
