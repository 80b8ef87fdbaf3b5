#include "b_log.h"
#include "scene_input.h"
#include "scene_schema.h"
#include "scene_schema_registry.h"
#include "scene_validation.h"
#include "scenetool_app.h"

#include <fmt/format.h>

#include <algorithm>
#include <memory>
#include <string>
#include <vector>

namespace scenetool {
namespace {

struct ValidateOptions {
  std::string file;
};

// Takes the findings of a validation, errors and warnings, in place of the log's own output.
class Findings : public base::LogSink {
 public:
  Findings() : m_level(base::log().level()) {
    base::log().setLevel(std::max<int>(m_level, base::logWarning));
    base::log().setStderr(false);
    base::log().addSink(this);
  }
  ~Findings() override {
    base::log().removeSink(this);
    base::log().setStderr(true);
    base::log().setLevel(m_level);
  }
  Findings(const Findings&) = delete;
  Findings& operator=(const Findings&) = delete;

  void write(base::name_id, int level, std::string_view text) override {
    if (level <= base::logWarning) lines.push_back(fmt::format("{}: {}", base::levelText(level), text));
  }

  std::vector<std::string> lines;

 private:
  int m_level;
};

int runValidate(const ValidateOptions& options) {
  base::ref<base::PluginFactory> scene(new base::PluginFactory("scene"));
  scene::register_scene_schema(*scene);
  if (const int loaded = loadScene(options.file, *scene); loaded != exitOk) return loaded;
  bool allValid = true;
  std::size_t meshes = 0;
  for (const base::ref<base::IPlugin>& object : scene->objects()) {
    if (!object || object->mapType() != scene::mesh_schema::typeName()) continue;
    ++meshes;
    bool valid = false;
    std::vector<std::string> lines;
    {
      Findings findings;
      valid = scene::validateMesh(*object);
      lines = std::move(findings.lines);
    }
    for (const std::string& line : lines) fmt::print("{}\n", line);
    fmt::print("mesh {}: {} faces, {} triangles, {}\n", object->index(), scene::getFaceCount(*object),
               scene::getTriangleCount(*object), valid ? "valid" : "invalid");
    allValid = allValid && valid;
  }
  if (meshes == 0) fmt::print("{}: no meshes\n", options.file);
  return allValid ? exitOk : exitFailed;
}

}  // namespace

Command addValidateCommand(CLI::App& app) {
  auto options = std::make_shared<ValidateOptions>();
  CLI::App* command = app.add_subcommand(
      "validate", "Import a scene file (or read an object-list file) and check every mesh; exit 1 when one is invalid");
  command->add_option("FILE", options->file, "The file to check: a scene file any plug-in imports, or a .scene file")
      ->required();
  return {command, [options] { return runValidate(*options); }};
}

}  // namespace scenetool
