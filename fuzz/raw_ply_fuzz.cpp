// Feeds arbitrary bytes to the Python package's column reader, from memory and from a pipe
// (no size: the columns grow with the data). A read either fails with ReadError or gives
// columns whose sizes agree with their shapes, and the two sources, when both read, give the
// same values.

#include "b_log.h"
#include "raw_ply.h"
#include "test_streams.h"

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <optional>
#include <string>

namespace {

using testing_support::Source;

std::size_t valueCount(const pymeshport::ValueBlock& block) { return block.rows * block.width.value_or(1); }

// The bytes of every value, after checking that each block's counts add up.
std::string flatten(const base::vector<pymeshport::RawElement>& elements) {
  std::string bytes;
  for (const pymeshport::RawElement& element : elements) {
    for (const pymeshport::RawProperty& property : element.properties) {
      const std::size_t values = valueCount(property.values);
      if (property.counts) {
        std::uint64_t items = 0;
        const auto* counts = static_cast<const std::uint32_t*>(property.counts->data);
        for (std::size_t k = 0; k < property.counts->rows; ++k) items += counts[k];
        if (items != values || property.counts->rows != element.count) std::abort();
      } else if (property.values.rows != element.count) {
        std::abort();
      }
      const auto* first = static_cast<const char*>(property.values.data);
      if (values > 0) bytes.append(first, values * ply::dataTypeSize(property.values.type));
    }
  }
  return bytes;
}

std::optional<std::string> read(const std::string& data, Source source) {
  base::Stream stream = testing_support::sourceStream(data, source);
  try {
    return flatten(pymeshport::readRawPly(stream));
  } catch (const pymeshport::ReadError&) {
    return std::nullopt;
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  base::log().setStderr(false);
  const std::string input(reinterpret_cast<const char*>(data), size);
  const std::optional<std::string> fromMemory = read(input, Source::memory);
  const std::optional<std::string> fromPipe = read(input, Source::pipe);
  if (fromMemory && fromPipe && *fromMemory != *fromPipe) std::abort();
  return 0;
}
