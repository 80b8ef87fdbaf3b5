// Reads arbitrary bytes as an object-list file into a factory that knows the scene types,
// then writes the objects back.

#include "b_exception.h"
#include "b_log.h"
#include "b_plugin_factory.h"
#include "b_stream.h"
#include "scene_schema_registry.h"

#include <cstddef>
#include <cstdint>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  base::log().setLevel(0);
  try {
    base::ref<base::PluginFactory> factory(new base::PluginFactory("scene"));
    scene::register_scene_schema(*factory);
    base::Stream stream = base::memStream(data, static_cast<std::int64_t>(size), "fuzz");
    factory->read(stream);
    base::Stream out = base::memStream(0);
    factory->write(out);
  } catch (const base::exception&) {
    // Refusing bad input is the point; crashing or hanging is the fault.
  }
  return 0;
}
