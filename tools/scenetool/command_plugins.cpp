#include "b_json.h"
#include "b_path.h"
#include "scene_factory.h"
#include "scene_plugin.h"
#include "scenetool_app.h"

#include <fmt/format.h>
#include <rapidjson/stringbuffer.h>
#include <rapidjson/writer.h>

#include <algorithm>
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

// Each parameter of one side of a plug-in: name, attribute type and default, in name order.
struct Parameter {
  base::string name, type, defaultJson, defaultText;
};

base::vector<Parameter> parametersOf(scene::SceneFactory& factory, scene::IScenePluginDesc& descriptor,
                                     bool importers) {
  base::AttribMap parameters;
  base::vector<Parameter> result;
  if (!factory.getPluginParameters(descriptor, importers, parameters)) return result;
  for (const auto& [name, attribute] : parameters.members()) {
    base::JsonWriter json;
    attribute->writeValue(json);
    result.push_back({base::string(base::text(name)), base::string(base::text(attribute->type())),
                      base::string(json.text()), attribute->toString()});
  }
  std::sort(result.begin(), result.end(), [](const Parameter& a, const Parameter& b) { return a.name < b.name; });
  return result;
}

void writeParameters(rapidjson::Writer<rapidjson::StringBuffer>& writer, const char* key,
                     const base::vector<Parameter>& parameters) {
  writer.Key(key);
  writer.StartArray();
  for (const Parameter& parameter : parameters) {
    writer.StartObject();
    writeMember(writer, "name", parameter.name);
    writeMember(writer, "type", parameter.type);
    writer.Key("default");
    writer.RawValue(parameter.defaultJson.data(), parameter.defaultJson.size(), rapidjson::kObjectType);
    writer.EndObject();
  }
  writer.EndArray();
}

void printJson(scene::SceneFactory& factory) {
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
    writeParameters(writer, "importerParameters", parametersOf(factory, *descriptor, true));
    writeParameters(writer, "exporterParameters", parametersOf(factory, *descriptor, false));
    writer.EndObject();
  }
  writer.EndArray();
  writer.EndObject();
  fmt::print("{}\n", buffer.GetString());
}

void printParameters(const char* side, const base::vector<Parameter>& parameters) {
  if (parameters.empty()) return;
  fmt::print("  {} parameters:\n", side);
  for (const Parameter& parameter : parameters) {
    fmt::print("    {} ({}, default {})\n", parameter.name, parameter.type, parameter.defaultText);
  }
}

void printText(scene::SceneFactory& factory) {
  if (factory.scenePlugins().empty()) {
    fmt::print("no scene plug-ins in {}\n", base::getDirectory(base::getExecutablePath()));
    return;
  }
  for (const auto& descriptor : factory.scenePlugins()) {
    const base::string exports = descriptor->getExporterExtensions();
    fmt::print("{} by {}: imports {}; exports {}; from {}\n", base::text(descriptor->name),
               descriptor->author.empty() ? "(unknown)" : descriptor->author, descriptor->getImporterExtensions(),
               exports.empty() ? "nothing" : exports, factory.libraryOf(descriptor.get()));
    printParameters("importer", parametersOf(factory, *descriptor, true));
    printParameters("exporter", parametersOf(factory, *descriptor, false));
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
