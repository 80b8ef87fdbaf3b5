// Imports arbitrary bytes as "fuzz-input.ply" through a scene factory that loaded the PLY
// plug-in from disk, the way a host does: once with column plans and once with every value
// delivered one by one. Both must give the same scene (or the same refusal), or the target
// aborts; each scene is then validated and its face indices decoded.

#include "b_exception.h"
#include "b_json.h"
#include "b_log.h"
#include "fuzz_host.h"
#include "scene_index_delta.h"
#include "scene_schema.h"
#include "scene_schema_registry.h"
#include "scene_validation.h"

#include <cstdio>
#include <cstdlib>
#include <string>

namespace {

// The scene as JSON after validation and decoding, or the refusal's text.
std::string import(bool plans) {
  base::ref<base::PluginFactory> scene(new base::PluginFactory("scene"));
  scene::register_scene_schema(*scene);
  base::AttribMap parameters;
  parameters.attribute(base::intern("plyColumnPlans"), plans);
  try {
    if (!fuzzing::pluginFactory().load(*scene, "fuzz-input.ply", parameters)) return "not imported";
  } catch (const base::exception& error) {
    return std::string("refused: ") + error.what();
  }
  base::JsonWriter writer;
  writer.beginArray();
  for (const auto& object : scene->objects()) {
    if (!object) continue;
    object->writeValue(writer);
    if (object->mapType() == scene::mesh_schema::typeName()) {
      scene::validateMesh(*object);
      scene::decodeIndexDeltas(*object);
    }
  }
  writer.endArray();
  return std::string(writer.text());
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  base::log().setLevel(0);
  fuzzing::setInputFile(data, size);
  if (import(true) != import(false)) {
    std::fprintf(stderr, "the planned and the delivered import differ\n");
    std::abort();
  }
  return 0;
}
