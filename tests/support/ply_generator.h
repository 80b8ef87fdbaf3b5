#pragma once

// Random PLY files for property tests: valid ones that cover what hand-made fixtures do not
// (every type on every kind of property, all three encodings, several vertex, face, strip and
// edge elements, per-face colours, texture coordinates and kept properties, faces in any
// order, names in any encoding, unknown elements between known ones), and invalid ones made
// from them (a malformed ASCII line, a cut body, an index past the vertices). A seed gives
// the same bytes on every platform.

#include "ply_model.h"

#include <cstdint>
#include <string>

namespace testing_support {

/// How the faces of a face element are ordered in the file.
enum class FaceOrder { sorted, reversed, blockShuffled, random };

struct GeneratedFile {
  std::uint64_t seed = 0;
  ply::Encoding encoding = ply::Encoding::ascii;
  PlyModel model;
  std::string bytes;
  /// Empty for a valid file; else what was broken, and a text the import must log for it.
  std::string broken;
  std::string expectedMessage;
};

/// A valid file: every value in range, every index below the vertex count (all vertex
/// elements have one count), every list holding what its element needs.
GeneratedFile randomValidFile(std::uint64_t seed);

/// randomValidFile(seed) with one fault: in an ASCII file a line that does not parse, else
/// (or otherwise) a body cut short or an index past the vertices.
GeneratedFile randomInvalidFile(std::uint64_t seed);

/// A name for files and messages: "valid-ascii-seed-42".
std::string describe(const GeneratedFile& file);

}  // namespace testing_support
