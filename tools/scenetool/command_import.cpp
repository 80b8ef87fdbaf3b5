#include "b_exception.h"
#include "b_fs.h"
#include "log_relay.h"
#include "progress_bar.h"
#include "scene_factory.h"
#include "scene_json.h"
#include "scene_schema_registry.h"
#include "scene_summary.h"
#include "scenetool_app.h"

#include <fmt/format.h>

#include <chrono>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace scenetool {
namespace {

struct ImportOptions {
  std::string file;
  std::vector<std::string> parameters;
  bool json = false;
  std::string output;
};

// The importer's parameters for the file with the command line's NAME=VALUE entries applied;
// empty, with the error printed, when there is no importer or an entry does not fit.
std::optional<int> collectParameters(scene::SceneFactory& factory, const ImportOptions& options,
                                     base::AttribMap& parameters) {
  if (!factory.getImporterParameters(options.file, parameters)) {
    printError(fmt::format("{}: no scene plug-in imports this kind of file (plug-ins read: {})", options.file,
                           factory.getSupportedExtensions(true)));
    return exitFailed;
  }
  for (const std::string& entry : options.parameters) {
    const std::size_t equals = entry.find('=');
    const std::string name = entry.substr(0, equals);
    base::Attribute** slot = name.empty() ? nullptr : parameters.findAttributeMutable(base::intern(name));
    if (equals == std::string::npos || !slot || !*slot) {
      printError(fmt::format("-p {}: the importer has no parameter '{}'", entry, name));
      return exitUsage;
    }
    if (!(*slot)->fromString(std::string_view(entry).substr(equals + 1))) {
      printError(fmt::format("-p {}: '{}' is no {}", entry, entry.substr(equals + 1), base::text((*slot)->type())));
      return exitUsage;
    }
  }
  return std::nullopt;
}

// Writes the scene's object list to `path`; false, with the error printed, when it cannot.
bool writeScene(base::PluginFactory& scene, const std::string& path) {
  try {
    base::Stream file =
        base::fs::master().open(path, base::fs::openWrite | base::fs::openCreate | base::fs::openTruncate);
    base::Stream buffered = base::bufWriteStream(file, 256 * 1024, path);
    scene.write(buffered);
    buffered.worker()->flush();
    return true;
  } catch (const base::exception& error) {
    printError(fmt::format("{}: cannot write the scene: {}", path, error.what()));
    return false;
  }
}

int runImport(const ImportOptions& options) {
  scene::SceneFactory factory;
  factory.reloadPlugins();
  base::AttribMap parameters;
  LogRelay relay;
  base::ref<base::PluginFactory> scene(new base::PluginFactory("scene"));
  scene::register_scene_schema(*scene);
  const auto start = std::chrono::steady_clock::now();
  // A bar only for people watching: never beside JSON that a script reads.
  std::optional<ProgressBar> bar;
  if (!options.json) bar.emplace();
  try {
    if (const std::optional<int> failed = collectParameters(factory, options, parameters)) return *failed;
    if (!factory.load(*scene, options.file, parameters)) {
      printError(fmt::format("{}: the file is not one the scene plug-ins read", options.file));
      return exitFailed;
    }
  } catch (const base::fs::file_not_found&) {
    printError(fmt::format("{}: no such file", options.file));
    return exitFailed;
  } catch (const base::exception& error) {
    const auto cause = relay.takeCause();
    printError(fmt::format("{}: {}", options.file, cause ? *cause : error.what()));
    return exitFailed;
  }
  bar.reset();
  const auto elapsed = std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - start);
  if (options.json) {
    printSceneJson(*scene);
  } else {
    printSceneSummary(*scene);
    fmt::print("imported {} in {:.1f} ms\n", options.file, elapsed.count());
  }
  if (!options.output.empty() && !writeScene(*scene, options.output)) return exitFailed;
  return exitOk;
}

}  // namespace

Command addImportCommand(CLI::App& app) {
  auto options = std::make_shared<ImportOptions>();
  CLI::App* command =
      app.add_subcommand("import", "Import a scene file through the scene plug-ins and show what it holds");
  command->add_option("FILE", options->file, "The file to import (its extension picks the plug-in)")->required();
  command
      ->add_option("-p,--parameter", options->parameters,
                   "Set an importer parameter, NAME=VALUE (repeatable; 'scenetool schema sceneImporter' lists "
                   "them)")
      ->type_name("NAME=VALUE")
      ->allow_extra_args(false);
  command->add_flag("--json", options->json, "Write every object with all its attributes as JSON");
  command->add_option("-o,--output", options->output, "Also write the scene as an object-list file")
      ->type_name("OUT.scene");
  return {command, [options] { return runImport(*options); }};
}

}  // namespace scenetool
