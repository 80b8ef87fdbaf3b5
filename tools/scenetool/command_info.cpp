#include "b_exception.h"
#include "b_plugin_factory.h"
#include "b_stream.h"
#include "file_input.h"
#include "log_relay.h"
#include "scene_json.h"
#include "scene_schema_registry.h"
#include "scene_summary.h"
#include "scenetool_app.h"

#include <fmt/format.h>

#include <memory>

namespace scenetool {
namespace {

struct InfoOptions {
  std::string file;
  bool json = false;
};

int runInfo(const InfoOptions& options) {
  base::Stream file;
  if (!openInput(options.file, file)) return exitFailed;
  // The reader asks for a few bytes at a time.
  base::Stream stream = base::bufReadStream(file, 0, 256 * 1024, options.file);
  base::ref<base::PluginFactory> factory(new base::PluginFactory("scene"));
  scene::register_scene_schema(*factory);
  LogRelay relay;
  try {
    factory->read(stream);
  } catch (const base::exception& failure) {
    printError(fmt::format("{}: {}", options.file, failure.what()));
    return exitFailed;
  }
  // A bad type record ends the read early with an error: the file is damaged.
  if (const auto cause = relay.takeCause()) {
    printError(fmt::format("{}: {}", options.file, *cause));
    return exitFailed;
  }
  options.json ? printSceneJson(*factory) : printSceneSummary(*factory);
  return exitOk;
}

}  // namespace

Command addInfoCommand(CLI::App& app) {
  auto options = std::make_shared<InfoOptions>();
  CLI::App* command = app.add_subcommand("info", "Read an object-list file and show its objects");
  command->add_option("FILE", options->file, "The object-list file (.scene)")->required();
  command->add_flag("--json", options->json, "Write the objects with all their attributes as JSON");
  return {command, [options] { return runInfo(*options); }};
}

}  // namespace scenetool
