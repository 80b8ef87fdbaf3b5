#pragma once

#include "b_attribute_map.h"

#include <cstdint>

namespace scene {

/// Bits of countFaces' flags.
enum FaceCountFlag : std::uint32_t {
  countTriangles = 0x1,    ///< count triangles instead of faces
  ignoreTriIndices = 0x2,  ///< never use the mesh's triIndices
};

/// Checks a mesh and logs every problem in the "scene" category with the mesh's name: bad
/// vector values (NaN, infinite; zero or not unit length for normals and tangents), ranges
/// outside the index list, face counts that do not fit their primitive's range, indices past
/// the vertices (on the plain indices of a delta-encoded mesh). False only when a per-vertex
/// list has another count than the positions.
bool validateMesh(const base::AttribMap& mesh);

/// What a mesh's primitives describe: faces, or triangles with countTriangles. Faces of
/// fewer than three vertices (points, edges) count nothing; a strip of n indices counts
/// n - 2 triangles (n - 1 lines for topology 6). Logs at level 5 only.
std::uint32_t countFaces(const base::AttribMap& mesh, std::uint32_t flags);
/// countFaces with no flags.
std::uint32_t getFaceCount(const base::AttribMap& mesh);
/// countFaces with `flags` and countTriangles.
std::uint32_t getTriangleCount(const base::AttribMap& mesh, std::uint32_t flags = 0);

}  // namespace scene
