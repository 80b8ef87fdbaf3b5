#pragma once

// Whether two imports hold the same scene, as a round trip through a PLY file must keep it:
// the digest (positions, faces with their values, strips, kept properties, face count), the
// vertex lists it leaves out, and the materials.

#include "import_digest.h"

#include <string>

namespace testing_support {

/// The normals and the vertex UV and colour sets as text. Colour sets compare as a set, an
/// RGB one as RGBA of alpha 1: one PLY vertex element holds them all, and its colour groups
/// become RGBA when any has an alpha, groups before single channels, whatever the order and
/// kinds of the vertex elements they came from.
std::string vertexListsOf(const base::AttribMap& mesh);

/// What an export keeps of each material the first primitive names, as text.
std::string materialsOf(const base::AttribMap& mesh);

/// Checks that the mesh `after` (and the materials it names) holds what `before` holds; `what`
/// names the comparison.
void expectSameScene(const base::AttribMap& before, const base::AttribMap& after, const std::string& what);

}  // namespace testing_support
