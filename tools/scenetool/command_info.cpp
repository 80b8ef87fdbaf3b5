#include "b_exception.h"
#include "b_json.h"
#include "b_plugin_factory.h"
#include "b_stream.h"
#include "file_input.h"
#include "log_relay.h"
#include "scenetool_app.h"

#include <fmt/format.h>

#include <memory>

namespace scenetool {
namespace {

struct InfoOptions {
  std::string file;
  bool json = false;
};

// {"objects": [{"index": I, "type": T, "attributes": {...}}, ...]} in factory order.
void printJson(const base::PluginFactory& factory) {
  base::JsonWriter writer;
  writer.beginObject();
  writer.key("objects");
  writer.beginArray();
  for (const base::ref<base::IPlugin>& object : factory.objects()) {
    if (!object) continue;
    writer.beginObject();
    writer.key("index");
    writer.value(std::uint64_t(object->index()));
    writer.key("type");
    writer.value(base::text(object->mapType()));
    writer.key("attributes");
    object->writeValue(writer);
    writer.endObject();
  }
  writer.endArray();
  writer.endObject();
  fmt::print("{}\n", writer.text());
}

void printSummary(const base::PluginFactory& factory) {
  for (const base::ref<base::IPlugin>& object : factory.objects()) {
    if (!object) continue;
    const base::string name = object->toString();
    fmt::print("object {}: {}{} ({} attributes)\n", object->index(), base::text(object->mapType()),
               name.empty() ? std::string() : fmt::format(" '{}'", name), object->size());
  }
}

int runInfo(const InfoOptions& options) {
  base::Stream file;
  if (!openInput(options.file, file)) return exitFailed;
  // The reader asks for a few bytes at a time.
  base::Stream stream = base::bufReadStream(file, 0, 256 * 1024, options.file);
  base::ref<base::PluginFactory> factory(new base::PluginFactory("scene"));
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
  options.json ? printJson(*factory) : printSummary(*factory);
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
