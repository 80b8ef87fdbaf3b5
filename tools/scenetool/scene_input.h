#pragma once

#include "b_plugin_factory.h"
#include "scene_factory.h"

#include <string>
#include <string_view>
#include <vector>

namespace scenetool {

/// Applies NAME=VALUE entries to the parameters of the importer or exporter (`side`), each
/// read by its parameter's type. Returns exitOk, or exitUsage with the error line printed.
int applyParameters(const std::vector<std::string>& entries, base::AttribMap& parameters, std::string_view side);

/// Reads the object-list file at `path` into `scene`. Returns an exit code: exitOk, or
/// exitFailed with the error line printed (naming the file and the cause).
int readObjectList(const std::string& path, base::PluginFactory& scene);

/// Imports `path` through the plug-ins of `factory` into `scene`, with the importer's
/// parameters and the NAME=VALUE `entries` applied to them. Returns an exit code: exitOk,
/// exitFailed (no importer, the file cannot be read) or exitUsage (an entry that does not
/// fit), with the error line printed.
int importScene(scene::SceneFactory& factory, const std::string& path, const std::vector<std::string>& entries,
                base::PluginFactory& scene);

/// An object-list file (".scene") is read, any other file imported with the plug-ins beside
/// the program and their default parameters.
int loadScene(const std::string& path, base::PluginFactory& scene);

}  // namespace scenetool
