#include "b_exception.h"
#include "b_fs.h"
#include "progress_bar.h"
#include "scene_factory.h"
#include "scene_input.h"
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
  base::ref<base::PluginFactory> scene(new base::PluginFactory("scene"));
  scene::register_scene_schema(*scene);
  const auto start = std::chrono::steady_clock::now();
  // A bar only for people watching: never beside JSON that a script reads.
  std::optional<ProgressBar> bar;
  if (!options.json) bar.emplace();
  if (const int imported = importScene(factory, options.file, options.parameters, *scene); imported != exitOk) {
    return imported;
  }
  bar.reset();
  const auto elapsed = std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - start);
  if (options.json) {
    printSceneJson(*scene);
  } else {
    fmt::print("{}", scene::sceneSummary(*scene));
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
