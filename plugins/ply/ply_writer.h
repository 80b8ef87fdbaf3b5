#pragma once

// Writes PLY files from columns that a caller holds: each property names where its values
// lie, and the writer converts and lays them out element by element. Like the reader, it
// decides per property once (a conversion function for its type, byte order and encoding)
// and then moves whole columns: a binary element of fixed-size records is written a block
// of records at a time, column by column.

#include "b_stream.h"
#include "ply_format.h"

#include <cstddef>
#include <cstdint>
#include <span>
#include <string>
#include <vector>

namespace ply {

/// One property to write. A scalar has one value per instance at `values`, `stride` bytes
/// apart; a list has its instances' items one list after the other at `values`, each item
/// `stride` bytes after the one before, and each list's length in `counts` (or `length`
/// for every list when `counts` is null).
struct WriteProperty {
  std::string name;
  DataType type = DataType::float32;  ///< the written type (a list's item type)
  /// The values are floats, written as `type` (an integer type) scaled by the type's
  /// largest value and rounded: the inverse of reading with ply::toFP.
  bool normalised = false;
  const std::byte* values = nullptr;  ///< held in `type`, or as float when normalised
  std::size_t stride = 0;
  bool isList = false;
  DataType countType = DataType::uint8;
  const std::uint32_t* counts = nullptr;
  std::uint32_t length = 0;
};

/// One element: `count` instances of its properties, in order.
struct WriteElement {
  std::string name;
  std::uint64_t count = 0;
  std::vector<WriteProperty> properties;
};

/// Writes a whole PLY file: the header (with a comment line per entry of `comments`), then
/// the body in `encoding`. ASCII numbers are written in the shortest form that reads back
/// to the same value (floats and doubles bit for bit, NaN as "nan"). Stream failures throw.
void writePly(base::Stream& stream, Encoding encoding, const std::vector<WriteElement>& elements,
              std::span<const std::string> comments = {});

/// The narrowest unsigned count type that holds `longest`: uchar, ushort or uint.
DataType countTypeFor(std::uint32_t longest);

}  // namespace ply
