#include "b_plugin_factory.h"
#include "scene_input.h"
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
  base::ref<base::PluginFactory> factory(new base::PluginFactory("scene"));
  scene::register_scene_schema(*factory);
  if (const int read = readObjectList(options.file, *factory); read != exitOk) return read;
  options.json ? printSceneJson(*factory) : fmt::print("{}", scene::sceneSummary(*factory));
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
