// Reads arbitrary bytes as the binary form of an attribute map, with plain names and with
// string ids, and writes back what was read.

#include "b_attribute_map.h"
#include "b_binary_io.h"
#include "b_exception.h"
#include "b_log.h"

#include <cstddef>
#include <cstdint>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  base::log().setLevel(0);
  for (bool stringIds : {false, true}) {
    base::StringIdContext ids;
    ids.names.setNames({base::intern("a"), base::intern("b")});
    ids.types.setNames({base::intern("int32"), base::intern("map"), base::intern("float[]"), base::intern("array")});
    base::BinaryContext& context = stringIds ? static_cast<base::BinaryContext&>(ids) : base::plainContext();
    base::Stream stream = base::memStream(data, static_cast<std::int64_t>(size), "fuzz");
    base::AttribMap map;
    try {
      map.read(stream, context);
      base::Stream out = base::memStream(0);
      map.write(out, context);
    } catch (const base::exception&) {
      // Refusing bad input is the point; crashing or hanging is the fault.
    }
  }
  return 0;
}
