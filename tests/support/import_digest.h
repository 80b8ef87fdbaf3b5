#pragma once

// A mesh reduced to what the random-file tests compare, in one form for what the importer
// made and for what it must make of a file: positions, every primitive's faces (as a
// multiset of faces turned to their smallest rotation, each with its per-corner texture
// coordinates, its colour and its kept values) or strips (in order), the kept vertex
// properties, and the face count. The expectation comes from a raw read of the file through
// the reader alone, so that any file can be checked: generated ones, regression files, real
// files from other tools.

#include "b_attribute_map.h"

#include <cstdint>
#include <optional>
#include <ostream>
#include <string>
#include <vector>

namespace testing_support {

struct ImportDigest {
  /// One text per vertex; "?" for a vertex whose line could not be parsed.
  std::vector<std::string> positions;
  /// Per primitive that holds indices, in order: "faces" and its sorted faces, or "strips"
  /// and its strips.
  std::vector<std::vector<std::string>> primitives;
  /// Each kept vertex property, in file order: its name and values.
  std::vector<std::string> keptVertexProperties;
  /// Faces of three corners or more, and a strip's triangles.
  std::uint32_t faceCount = 0;

  bool operator==(const ImportDigest&) const = default;
};

std::ostream& operator<<(std::ostream& out, const ImportDigest& digest);

/// Where two digests first differ, as a line of each; empty when they are equal.
std::string firstDifference(const ImportDigest& expected, const ImportDigest& actual);

/// What the importer must make of a file, with importCustomProperties on.
struct ExpectedImport {
  /// The import fails (a face of more than 65,535 corners).
  bool fails = false;
  /// The body ended early, or some ASCII line could not be parsed.
  bool incomplete = false;
  ImportDigest digest;
};

/// The expectation for the file `bytes`, from what the reader delivers of it.
ExpectedImport expectedImport(const std::string& bytes);

/// What the importer made: the digest of `mesh`.
ImportDigest digestOf(const base::AttribMap& mesh);

}  // namespace testing_support
