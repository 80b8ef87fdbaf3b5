#include "scene_validation.h"
#include "b_attrib_array.h"
#include "b_normal.h"
#include "b_vec.h"
#include "linked_member.h"
#include "log_capture.h"
#include "scene_index_delta.h"
#include "scene_mesh.h"
#include "scene_schema.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <memory>
#include <string>
#include <vector>

namespace {

using scene::mesh_schema;
using scene::meshPrimitive_schema;
using testing_support::LogCapture;
using testing_support::moveBehindLink;
using Vec3 = base::base_vec3<float>;
using Indices = base::vector<std::uint32_t>;

// The findings of one validation, as "level: text".
struct Validation {
  bool valid;
  std::vector<std::string> findings;
};

Validation validate(const base::AttribMap& mesh) {
  LogCapture log(base::logWarning);
  const bool valid = scene::validateMesh(mesh);
  std::vector<std::string> findings;
  for (const auto& entry : log.entries) findings.push_back(base::levelText(entry.level) + ": " + entry.text);
  return {valid, findings};
}

base::AttribMap& addPrimitive(base::AttribMap& mesh) {
  return scene::appendMap(scene::arrayMember(mesh, mesh_schema::primitives()));
}

// A named mesh of `vertices` positions with one primitive over `indices` in triangles.
void makeTriangles(base::AttribMap& mesh, std::size_t vertices, const Indices& indices) {
  mesh.attribute<base::string>(mesh_schema::name(), "m");
  mesh.attribute(mesh_schema::positions(), base::vector<Vec3>(vertices));
  mesh.attribute(mesh_schema::indices(), indices);
  addPrimitive(mesh).attribute<std::uint16_t>(meshPrimitive_schema::vcounts(), 3);
}

TEST(ValidateMesh, BadValuesAreReportedButOnlyACountMismatchFails) {
  base::AttribMap mesh;
  makeTriangles(mesh, 2, {0, 1, 1});
  const float nan = std::numeric_limits<float>::quiet_NaN();
  const float infinity = std::numeric_limits<float>::infinity();
  mesh.attribute(mesh_schema::positions(), base::vector<Vec3>{{nan, 0, 0}, {0, infinity, 0}});
  mesh.attribute(mesh_schema::normals(), base::vector<base::normal>{{0, 0, 0}, {0, 0, 1}});
  const Validation first = validate(mesh);
  EXPECT_TRUE(first.valid);
  EXPECT_EQ(first.findings, (std::vector<std::string>{"error: validate |m| Nan detected in the positions!",
                                                      "error: validate |m| Inf detected in the positions!",
                                                      "warning: validate |m| Zero length detected in the normals!"}));

  mesh.attribute(mesh_schema::normals(), base::vector<base::normal>(3, base::normal{0, 0, 1}));
  const Validation second = validate(mesh);
  EXPECT_FALSE(second.valid);
  EXPECT_EQ(second.findings.back(), "error: validate |m| The normals and positions count doesn't match!");
}

TEST(ValidateMesh, UnitLengthIsCheckedWithinTheTolerance) {
  base::AttribMap mesh;
  makeTriangles(mesh, 2, {0, 1, 1});
  // Squared lengths 1.00002 (reported) and 1.000009 (not).
  mesh.attribute(mesh_schema::normals(),
                 base::vector<base::normal>{{0, 0, std::sqrt(1.00002f)}, {0, 0, std::sqrt(1.000009f)}});
  EXPECT_EQ(validate(mesh).findings,
            (std::vector<std::string>{"warning: validate |m| Unnormalized detected in the normals!"}));
}

TEST(ValidateMesh, RangesMustLieInsideTheIndexList) {
  base::AttribMap mesh;
  makeTriangles(mesh, 3, {0, 1, 2, 2, 1, 0});
  base::AttribMap& primitive = *scene::mapAt(*scene::findArrayMember(mesh, mesh_schema::primitives()), 0);
  primitive.attribute<std::uint32_t>(meshPrimitive_schema::indexStart(), 0);
  primitive.attribute<std::uint32_t>(meshPrimitive_schema::indexCount(), 6);
  EXPECT_TRUE(validate(mesh).findings.empty());
  primitive.attribute<std::uint32_t>(meshPrimitive_schema::indexStart(), 1);
  EXPECT_EQ(validate(mesh).findings,
            (std::vector<std::string>{"error: validate |m| Index offset/count out of bounds 1-6 out of 6!"}));
}

TEST(ValidateMesh, SeveralPrimitivesNeedTheirRangesAndEachIsCheckedOnItsOwn) {
  base::AttribMap mesh;
  makeTriangles(mesh, 4, {0, 1, 2, 0, 1, 2, 3});
  // One primitive without a range: nothing to say.
  EXPECT_EQ(validate(mesh).findings, (std::vector<std::string>{"error: validate |m| Invalid face vertex count 3!"}));
  addPrimitive(mesh).attribute(meshPrimitive_schema::vcounts(), base::vector<std::uint16_t>{4});
  EXPECT_EQ(
      validate(mesh).findings,
      (std::vector<std::string>{"error: validate |m| Missing start index!", "error: validate |m| Missing index count!",
                                "error: validate |m| Invalid face vertex count 3!",
                                "error: validate |m| Missing start index!", "error: validate |m| Missing index count!",
                                "error: validate |m| Invalid face vertex counts. Expected 7, got 4!"}));
  // With ranges, triangles 0-2 and a quad 3-6 are both right.
  const base::AttribArray& primitives = *scene::findArrayMember(mesh, mesh_schema::primitives());
  scene::mapAt(primitives, 0)->attribute<std::uint32_t>(meshPrimitive_schema::indexStart(), 0);
  scene::mapAt(primitives, 0)->attribute<std::uint32_t>(meshPrimitive_schema::indexCount(), 3);
  scene::mapAt(primitives, 1)->attribute<std::uint32_t>(meshPrimitive_schema::indexStart(), 3);
  scene::mapAt(primitives, 1)->attribute<std::uint32_t>(meshPrimitive_schema::indexCount(), 4);
  EXPECT_TRUE(validate(mesh).findings.empty());
}

TEST(ValidateMesh, FaceCountsAgainstTheIndices) {
  base::AttribMap mesh;
  mesh.attribute<base::string>(mesh_schema::name(), "m");
  mesh.attribute(mesh_schema::positions(), base::vector<Vec3>(10));
  mesh.attribute(mesh_schema::indices(), Indices(10));
  base::AttribMap& primitive = addPrimitive(mesh);
  primitive.attribute<std::uint16_t>(meshPrimitive_schema::vcounts(), 3);
  EXPECT_EQ(validate(mesh).findings, (std::vector<std::string>{"error: validate |m| Invalid face vertex count 3!"}));
  primitive.attribute<std::uint16_t>(meshPrimitive_schema::vcounts(), 0);
  EXPECT_EQ(validate(mesh).findings, (std::vector<std::string>{"error: validate |m| Invalid face vertex count 0!"}));
  mesh.attribute(mesh_schema::indices(), Indices(6));
  primitive.attribute(meshPrimitive_schema::vcounts(), base::vector<std::uint16_t>{3, 4});
  EXPECT_EQ(validate(mesh).findings,
            (std::vector<std::string>{"error: validate |m| Invalid face vertex counts. Expected 6, got 7!"}));
  primitive.attribute(meshPrimitive_schema::vcounts(), base::string("three"));
  EXPECT_EQ(validate(mesh).findings.back(), "warning: validate |m| Found primitive from unknown type!!");
}

TEST(ValidateMesh, IndicesBeyondTheVerticesAndMissingParts) {
  base::AttribMap mesh;
  makeTriangles(mesh, 3, {0, 1, 3});
  EXPECT_EQ(validate(mesh).findings,
            (std::vector<std::string>{"error: validate |m| Found face index out of range at position 3!"}));
  base::AttribMap bare;
  const Validation empty = validate(bare);
  EXPECT_TRUE(empty.valid);
  EXPECT_EQ(empty.findings, (std::vector<std::string>{"error: validate || The vertex positions are missing!",
                                                      "warning: validate || Mesh doesn't contain any primitives!"}));
  base::AttribMap noIndices;
  noIndices.attribute(mesh_schema::positions(), base::vector<Vec3>(3));
  addPrimitive(noIndices).attribute<std::uint16_t>(meshPrimitive_schema::vcounts(), 3);
  EXPECT_EQ(validate(noIndices).findings, (std::vector<std::string>{"warning: validate || Missing indices!"}));
}

TEST(ValidateMesh, StripsAreCheckedByTheirCounts) {
  base::AttribMap mesh;
  mesh.attribute(mesh_schema::positions(), base::vector<Vec3>(7));
  mesh.attribute(mesh_schema::indices(), Indices{0, 1, 2, 3, 4, 5, 6});
  addPrimitive(mesh).attribute(meshPrimitive_schema::ecounts(), base::vector<std::uint32_t>{4, 3});
  EXPECT_TRUE(validate(mesh).findings.empty());
}

// A member stored as a link reads as the member it leads to: linked positions, indices and
// face counts (one count or a list) validate and count as stored ones do.
TEST(ValidateMesh, LinkedMembersValidateAndCountLikeStoredOnes) {
  for (const bool countList : {false, true}) {
    base::AttribMap stored;
    makeTriangles(stored, 4, {0, 1, 2, 0, 2, 5});  // one index past the vertices
    base::AttribArray& primitives = scene::arrayMember(stored, mesh_schema::primitives());
    if (countList) {
      scene::mapAt(primitives, 0)->attribute(meshPrimitive_schema::vcounts(), base::vector<std::uint16_t>{3, 3});
    }
    const std::unique_ptr<base::AttribMap> linked(static_cast<base::AttribMap*>(stored.clone()));
    moveBehindLink(*linked, mesh_schema::positions());
    moveBehindLink(*linked, mesh_schema::indices());
    moveBehindLink(*scene::mapAt(scene::arrayMember(*linked, mesh_schema::primitives()), 0),
                   meshPrimitive_schema::vcounts());
    const Validation expected = validate(stored);
    ASSERT_EQ(expected.findings.size(), 1u);
    const Validation got = validate(*linked);
    EXPECT_EQ(got.findings, expected.findings) << countList;
    EXPECT_EQ(got.valid, expected.valid) << countList;
    EXPECT_EQ(scene::getFaceCount(*linked), 2u) << countList;
    EXPECT_EQ(scene::getTriangleCount(*linked), 2u) << countList;
  }
}

// A member of another type than the one read is reported as the map's typed lookups report
// it, not passed over as if it were absent.
TEST(ValidateMesh, MistypedIndicesAndRangesAreReported) {
  base::AttribMap mesh;
  makeTriangles(mesh, 3, {0, 1, 2});
  mesh.attribute(mesh_schema::indices(), base::vector<float>{0, 1, 2});
  EXPECT_EQ(validate(mesh).findings,
            (std::vector<std::string>{"error: map attribute| Detected invalid access to attribute 'indices'. Expected "
                                      "type 'uint32[]', actual attribute type - 'float[]'!",
                                      "warning: validate |m| Missing indices!"}));

  base::AttribMap ranged;
  makeTriangles(ranged, 3, {0, 1, 2});
  base::AttribMap& primitive = *scene::mapAt(scene::arrayMember(ranged, mesh_schema::primitives()), 0);
  primitive.attribute<float>(meshPrimitive_schema::indexStart(), 0);
  primitive.attribute<std::uint32_t>(meshPrimitive_schema::indexCount(), 3);
  EXPECT_EQ(validate(ranged).findings,
            (std::vector<std::string>{"error: map attribute| Detected invalid access to attribute 'indexStart'. "
                                      "Expected 'uint32', actual attribute type - 'float'"}));
}

TEST(ValidateMesh, ADeltaEncodedMeshIsCheckedOnItsPlainIndices) {
  base::AttribMap mesh;
  makeTriangles(mesh, 10, {9, 8, 7, 9, 8, 6, 5, 4, 3});
  ASSERT_TRUE(scene::encodeIndexDeltas(mesh));
  // The differences themselves hold values like 4294967295 that are no vertex.
  EXPECT_TRUE(validate(mesh).findings.empty());
  EXPECT_EQ(scene::getFaceCount(mesh), 3u);
}

}  // namespace

TEST(ValidateMeshSets, ASetWithItsOwnChannelIsCheckedByItsChannel) {
  using UV = base::base_vec2<float>;
  base::AttribMap mesh;
  makeTriangles(mesh, 3, {0, 1, 2, 2, 1, 0});
  base::AttribMap& uvs = scene::appendMap(scene::arrayMember(mesh, mesh_schema::uvSets()));
  uvs.attribute(scene::meshUVSet_schema::UV(), base::vector<UV>(4));  // four entries for three vertices
  uvs.attribute(scene::meshUVSet_schema::indices(), Indices{0, 1, 2, 3, 0xFFFFFFFFu, 1});
  base::AttribMap& colours = scene::appendMap(scene::arrayMember(mesh, mesh_schema::colorSets()));
  colours.attribute(scene::meshColorSet_schema::RGB(), base::vector<Vec3>(2));  // one per face
  colours.attribute(scene::meshColorSet_schema::indices(), Indices{0, 0, 0, 1, 1, 1});
  EXPECT_TRUE(validate(mesh).valid);

  colours.attribute(scene::meshColorSet_schema::indices(), Indices{0, 0, 0, 1, 1, 2});
  uvs.attribute(scene::meshUVSet_schema::indices(), Indices{0, 1, 2});
  const Validation bad = validate(mesh);
  EXPECT_FALSE(bad.valid);
  EXPECT_EQ(bad.findings,
            (std::vector<std::string>{"error: validate |m| Found color index out of range at position 5!",
                                      "error: validate |m| The uv index channel and indices count doesn't match!"}));
}
