#include "b_exception.h"
#include "log_relay.h"
#include "progress_bar.h"
#include "scene_factory.h"
#include "scene_input.h"
#include "scene_schema_registry.h"
#include "scenetool_app.h"

#include <fmt/format.h>

#include <chrono>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace scenetool {
namespace {

struct ConvertOptions {
  std::string input;
  std::string output;
  std::string format;
  std::vector<std::string> parameters;
};

// The exporter parameters that --format sets.
const std::map<std::string, std::vector<std::string>> formats = {
    {"ascii", {"exportBinary=false"}},
    {"binary_little_endian", {"exportBinary=true", "exportBigEndian=false"}},
    {"binary_big_endian", {"exportBinary=true", "exportBigEndian=true"}},
};

bool has(base::AttribMap& parameters, const std::string& entry) {
  base::Attribute** slot = parameters.findAttributeMutable(base::intern(entry.substr(0, entry.find('='))));
  return slot && *slot;
}

// Writes the scene through the plug-in that writes the output's extension. Returns an exit code.
int save(scene::SceneFactory& factory, base::PluginFactory& scene, const std::string& path,
         const base::AttribMap& parameters) {
  LogRelay relay;
  try {
    if (factory.save(scene, path, parameters)) return exitOk;
    printFileError(path, relay.takeCause().value_or("the plug-in did not write the file"));
  } catch (const base::exception& error) {
    printFileError(path, relay.takeCause().value_or(error.what()));
  }
  return exitFailed;
}

int runConvert(const ConvertOptions& options) {
  scene::SceneFactory factory;
  factory.reloadPlugins();
  base::AttribMap exportParameters, importParameters;
  try {
    if (!factory.getExporterParameters(options.output, exportParameters)) {
      printError(fmt::format("{}: no scene plug-in writes this kind of file (plug-ins write: {})", options.output,
                             factory.getSupportedExtensions(false)));
      return exitFailed;
    }
    factory.getImporterParameters(options.input, importParameters);
  } catch (const base::exception& error) {
    printError(error.what());
    return exitFailed;
  }
  // A conversion keeps what it can: the importer's custom properties are on unless said otherwise.
  std::vector<std::string> importEntries, exportEntries;
  if (has(importParameters, "importCustomProperties")) importEntries.push_back("importCustomProperties=true");
  if (!options.format.empty()) exportEntries = formats.at(options.format);
  for (const std::string& entry : options.parameters) {
    if (has(exportParameters, entry)) {
      exportEntries.push_back(entry);
    } else if (has(importParameters, entry)) {
      importEntries.push_back(entry);
    } else {
      printError(fmt::format("-p {}: neither the importer nor the exporter has a parameter '{}'", entry,
                             entry.substr(0, entry.find('='))));
      return exitUsage;
    }
  }
  if (const int applied = applyParameters(exportEntries, exportParameters, "exporter"); applied != exitOk) {
    return applied;
  }
  base::ref<base::PluginFactory> scene(new base::PluginFactory("scene"));
  scene::register_scene_schema(*scene);
  const auto start = std::chrono::steady_clock::now();
  std::optional<ProgressBar> bar(std::in_place);
  if (const int imported = importScene(factory, options.input, importEntries, *scene); imported != exitOk) {
    return imported;
  }
  if (const int saved = save(factory, *scene, options.output, exportParameters); saved != exitOk) return saved;
  bar.reset();
  const auto elapsed = std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - start);
  fmt::print("converted {} to {} in {:.1f} ms\n", options.input, options.output, elapsed.count());
  return exitOk;
}

}  // namespace

Command addConvertCommand(CLI::App& app) {
  auto options = std::make_shared<ConvertOptions>();
  CLI::App* command = app.add_subcommand(
      "convert",
      "Import IN through the scene plug-ins and write the scene to OUT through the plug-in that writes OUT's "
      "extension (PLY: binary little-endian unless --format says otherwise)");
  command->add_option("IN", options->input, "The file to import")->required();
  command->add_option("OUT", options->output, "The file to write; an existing file is replaced once OUT is complete")
      ->required();
  command->add_option("--format", options->format, "The PLY encoding to write")
      ->check(CLI::IsMember({"ascii", "binary_little_endian", "binary_big_endian"}));
  command
      ->add_option("-p,--parameter", options->parameters,
                   "Set an importer or exporter parameter, NAME=VALUE (repeatable; 'scenetool plugins' lists them)")
      ->type_name("NAME=VALUE")
      ->allow_extra_args(false);
  command->footer(
      "A conversion goes through the scene, so the written file does not keep:\n"
      "  - elements the importer does not read (unknown elements); the vertex and face properties it\n"
      "    has no meaning for are kept, as importCustomProperties is on (-p importCustomProperties=false\n"
      "    drops them),\n"
      "  - comment and obj_info lines,\n"
      "  - the face order: faces are sorted and each is rotated to start at its smallest vertex index\n"
      "    (the winding is kept),\n"
      "  - ambient material colours, and a material's specular hue (its mean is kept).\n"
      "A scene of several meshes is written one file per mesh (OUT, then OUT-1.ply, ...) unless\n"
      "-p exportMergeMeshes=true.");
  return {command, [options] { return runConvert(*options); }};
}

}  // namespace scenetool
