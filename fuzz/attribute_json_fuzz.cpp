// Reads arbitrary bytes as the JSON form of an attribute map and writes back what was read.

#include "b_attribute_map.h"
#include "b_exception.h"
#include "b_json.h"
#include "b_log.h"

#include <cstddef>
#include <cstdint>
#include <string_view>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  base::log().setLevel(0);
  try {
    base::JsonReader reader(std::string_view(reinterpret_cast<const char*>(data), size));
    base::AttribMap map;
    map.readValue(reader);
    base::JsonWriter writer;
    map.writeValue(writer);
  } catch (const base::exception&) {
    // Refusing bad input is the point; crashing or hanging is the fault.
  }
  return 0;
}
