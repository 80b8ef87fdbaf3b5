#include "b_attrib_array.h"
#include "b_vec.h"
#include "scene_mesh.h"
#include "scene_schema.h"
#include "scene_validation.h"

#include <gtest/gtest.h>

namespace {

using scene::mesh_schema;
using scene::meshPrimitive_schema;

base::AttribMap& addPrimitive(base::AttribMap& mesh) {
  return scene::appendMap(scene::arrayMember(mesh, mesh_schema::primitives()));
}

TEST(FaceCount, CountListsCountFacesOfThreeOrMoreVertices) {
  base::AttribMap mesh;
  addPrimitive(mesh).attribute(meshPrimitive_schema::vcounts(), base::vector<std::uint16_t>{3, 4, 5, 2});
  EXPECT_EQ(scene::getFaceCount(mesh), 3u);
  EXPECT_EQ(scene::getTriangleCount(mesh), 6u);
}

TEST(FaceCount, AUniformCountDividesTheRange) {
  base::AttribMap mesh;
  mesh.attribute(mesh_schema::indices(), base::vector<std::uint32_t>(24));
  base::AttribMap& quads = addPrimitive(mesh);
  quads.attribute<std::uint16_t>(meshPrimitive_schema::vcounts(), 4);
  EXPECT_EQ(scene::getFaceCount(mesh), 6u);  // no range: the whole index list
  EXPECT_EQ(scene::getTriangleCount(mesh), 12u);
  quads.attribute<std::uint32_t>(meshPrimitive_schema::indexCount(), 8);
  EXPECT_EQ(scene::getFaceCount(mesh), 2u);
  // Points, edges and a count of 0 add nothing (and divide by nothing).
  for (const std::uint16_t small : {0, 1, 2}) {
    addPrimitive(mesh).attribute<std::uint16_t>(meshPrimitive_schema::vcounts(), small);
  }
  EXPECT_EQ(scene::getFaceCount(mesh), 2u);
}

TEST(FaceCount, TriangleModeUsesTriIndices) {
  base::AttribMap mesh;
  mesh.attribute(mesh_schema::triIndices(), base::vector<std::uint32_t>(12));
  mesh.attribute(mesh_schema::indices(), base::vector<std::uint32_t>(8));
  addPrimitive(mesh).attribute<std::uint16_t>(meshPrimitive_schema::vcounts(), 4);
  EXPECT_EQ(scene::getTriangleCount(mesh), 4u);
  EXPECT_EQ(scene::getTriangleCount(mesh, scene::ignoreTriIndices), 4u);  // 8 / 4 quads, 2 triangles each
  EXPECT_EQ(scene::getFaceCount(mesh), 2u);
}

TEST(FaceCount, StripsCountTheirTriangles) {
  base::AttribMap mesh;
  addPrimitive(mesh).attribute(meshPrimitive_schema::ecounts(), base::vector<std::uint32_t>{4, 3, 0, 2});
  EXPECT_EQ(scene::getTriangleCount(mesh), 3u);
  EXPECT_EQ(scene::getFaceCount(mesh), 3u);
  // Without counts: the range split at restart markers; the last strip needs no marker.
  base::AttribMap marked;
  marked.attribute(mesh_schema::indices(), base::vector<std::uint32_t>{0, 1, 2, 3, 0xFFFFFFFF, 4, 5, 6});
  base::AttribMap& strip = addPrimitive(marked);
  strip.attribute<std::uint8_t>(meshPrimitive_schema::topology(), 4);
  EXPECT_EQ(scene::getTriangleCount(marked), 3u);
  strip.attribute<std::uint8_t>(meshPrimitive_schema::topology(), 6);  // line strips
  EXPECT_EQ(scene::getFaceCount(marked), 5u);
}

TEST(FaceCount, APointSetCountsNothing) {
  base::AttribMap mesh;
  mesh.attribute(mesh_schema::positions(), base::vector<base::base_vec3<float>>(5));
  base::AttribMap& points = addPrimitive(mesh);
  points.attribute<std::uint16_t>(meshPrimitive_schema::vcounts(), 1);
  points.attribute<std::uint8_t>(meshPrimitive_schema::topology(), 0);
  EXPECT_EQ(scene::getFaceCount(mesh), 0u);
  base::AttribMap none;
  EXPECT_EQ(scene::getFaceCount(none), 0u);
}

}  // namespace
