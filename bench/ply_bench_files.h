#pragma once

#include "b_containers.h"

#include <cstdint>
#include <string>

namespace bench {

/// The PLY files the benchmarks read: a textured, coloured triangle mesh (1,000,000 vertices,
/// 2,000,000 triangles) and a coloured point cloud (2,000,000 points), each in the three
/// encodings, ASCII floats with nine significant digits. Written once into a folder under
/// the system's temporary directory.
enum class Shape { mesh, cloud };
enum class Encoding { ascii, little, big };

/// The path of the file, writing it first when it is not there yet.
std::string plyFile(Shape shape, Encoding encoding);

/// The mesh's face indices in the file's order, three per triangle.
base::vector<std::uint32_t> meshIndices();

}  // namespace bench
