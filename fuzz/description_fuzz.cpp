// Loads arbitrary bytes as a description file (XML) from memory, then looks up every
// attribute of every map type it described, through the inheritance chains it built.

#include "b_attribute_desc.h"
#include "b_exception.h"
#include "b_log.h"
#include "fuzz_host.h"

#include <cstddef>
#include <cstdint>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  base::log().setLevel(0);
  fuzzing::setInputFile(data, size);
  base::AttribDescManager descriptions;
  try {
    descriptions.load("fuzz-input.xml");
  } catch (const base::exception&) {
    return 0;
  }
  for (const auto& [type, description] : descriptions.descriptors()) {
    for (const auto& attribute : description->attributes) descriptions.findAttribute(type, attribute->name);
    descriptions.findAttribute(type, "no such attribute");
    descriptions.inheritors(type);
  }
  return 0;
}
