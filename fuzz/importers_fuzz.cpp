// Reads arbitrary bytes as importers.txt, the list that orders the scene plug-ins, against a
// scene factory that loaded the plug-ins beside the program.

#include "b_log.h"
#include "fuzz_host.h"

#include <cstddef>
#include <cstdint>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  base::log().setLevel(0);
  fuzzing::setInputFile(data, size);
  fuzzing::pluginFactory().orderPlugins("fuzz-input.txt");
  fuzzing::pluginFactory().getSupportedExtensions(true);
  return 0;
}
