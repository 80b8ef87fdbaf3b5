#include "scene_json.h"

#include "b_json.h"

#include <fmt/format.h>

namespace scenetool {

void printSceneJson(const base::PluginFactory& factory) {
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

}  // namespace scenetool
