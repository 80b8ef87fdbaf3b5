#include "b_path.h"
#include "scene_factory.h"
#include "scenetool_app.h"

#include <fmt/format.h>
#include <rapidjson/stringbuffer.h>
#include <rapidjson/writer.h>

#include <memory>
#include <string_view>

namespace scenetool {
namespace {

struct PluginsOptions {
  bool json = false;
};

void writeMember(rapidjson::Writer<rapidjson::StringBuffer>& writer, const char* key, std::string_view text) {
  writer.Key(key);
  writer.String(text.data(), static_cast<rapidjson::SizeType>(text.size()));
}

void printJson(const scene::SceneFactory& factory) {
  rapidjson::StringBuffer buffer;
  rapidjson::Writer<rapidjson::StringBuffer> writer(buffer);
  writer.StartObject();
  writer.Key("plugins");
  writer.StartArray();
  for (const auto& descriptor : factory.scenePlugins()) {
    writer.StartObject();
    writeMember(writer, "name", base::text(descriptor->name));
    writeMember(writer, "author", descriptor->author);
    writeMember(writer, "importerExtensions", descriptor->getImporterExtensions());
    writeMember(writer, "exporterExtensions", descriptor->getExporterExtensions());
    writeMember(writer, "library", factory.libraryOf(descriptor.get()));
    writer.EndObject();
  }
  writer.EndArray();
  writer.EndObject();
  fmt::print("{}\n", buffer.GetString());
}

void printText(const scene::SceneFactory& factory) {
  if (factory.scenePlugins().empty()) {
    fmt::print("no scene plug-ins in {}\n", base::getDirectory(base::getExecutablePath()));
    return;
  }
  for (const auto& descriptor : factory.scenePlugins()) {
    const base::string exports = descriptor->getExporterExtensions();
    fmt::print("{} by {}: imports {}; exports {}; from {}\n", base::text(descriptor->name),
               descriptor->author.empty() ? "(unknown)" : descriptor->author, descriptor->getImporterExtensions(),
               exports.empty() ? "nothing" : exports, factory.libraryOf(descriptor.get()));
  }
}

int runPlugins(const PluginsOptions& options) {
  scene::SceneFactory factory;
  factory.reloadPlugins();
  options.json ? printJson(factory) : printText(factory);
  return exitOk;
}

}  // namespace

Command addPluginsCommand(CLI::App& app) {
  auto options = std::make_shared<PluginsOptions>();
  CLI::App* command = app.add_subcommand(
      "plugins", "List the scene plug-ins beside this program in priority order (data/importers.txt sets it)");
  command->add_flag("--json", options->json, "Write JSON instead of text");
  return {command, [options] { return runPlugins(*options); }};
}

}  // namespace scenetool
