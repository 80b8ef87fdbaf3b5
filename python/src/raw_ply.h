#pragma once

// A PLY file's raw elements, read column by column for the Python module: one array per
// scalar property in its own type, one array of items per list property with each list's
// length. Nothing here knows Python, so the module only wraps what it finds.

#include "b_containers.h"
#include "b_stream.h"
#include "ply_format.h"

#include <cstddef>
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>

namespace pymeshport {

/// A block of values that keeps its own storage alive: `rows` values of `type`, or, when
/// `width` is set, `rows` rows of `width` values each.
struct ValueBlock {
  ply::DataType type = ply::DataType::none;
  std::shared_ptr<void> owner;  ///< the storage; `data` points into it
  const void* data = nullptr;
  std::size_t rows = 0;
  std::optional<std::size_t> width;
};

/// One property as read: its values, and for a list whose lengths differ, every list's
/// length (`counts`, one per instance; the values are then all items one after the other).
struct RawProperty {
  std::string name;  ///< the name as the header spells it
  ValueBlock values;
  std::optional<ValueBlock> counts;
};

struct RawElement {
  std::string name;
  std::uint32_t count = 0;
  base::vector<RawProperty> properties;
};

/// Reads the PLY file that `stream` is positioned at. An ASCII integer property whose words
/// leave its declared type's range comes back in the 32-bit type of the same signedness
/// (the reader keeps 32 bits of every ASCII integer). Throws ReadError when the header is not
/// one this reader takes or the body ends before the header's counts are reached; `stream`
/// failures propagate as they are.
base::vector<RawElement> readRawPly(base::Stream& stream);

/// Why a file could not be read; the message is the reader's own cause.
class ReadError : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

}  // namespace pymeshport
