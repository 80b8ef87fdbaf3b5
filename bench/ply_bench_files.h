#pragma once

#include "b_containers.h"
#include "scene_factory.h"

#include <cstdint>
#include <string>

namespace bench {

/// The PLY files the benchmarks read: a textured, coloured triangle mesh (1,000,000 vertices,
/// 2,000,000 triangles), the same mesh with a texcoord list of six floats per face, a
/// coloured point cloud (2,000,000 points) and a Gaussian-splat cloud (1,000,000 points of
/// 62 floats), in any of the three encodings, ASCII floats with nine significant digits.
/// Written once into a folder under the system's temporary directory.
enum class Shape { mesh, cloud, texcoordMesh, splat };
enum class Encoding { ascii, little, big };

/// The path of the file, writing it first when it is not there yet.
std::string plyFile(Shape shape, Encoding encoding);

/// The scene factory with the plug-ins beside the program, loaded once.
scene::SceneFactory& plugins();

/// The mesh's face indices in the file's order, three per triangle.
base::vector<std::uint32_t> meshIndices();

}  // namespace bench
