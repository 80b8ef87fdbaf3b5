#include "scene_index_delta.h"
#include "b_attrib_array.h"
#include "linked_member.h"
#include "log_capture.h"
#include "scene_mesh.h"
#include "scene_schema.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <memory>
#include <numeric>
#include <random>
#include <vector>

namespace {

using scene::mesh_schema;
using scene::meshPrimitive_schema;
using Indices = base::vector<std::uint32_t>;

Indices encoded(Indices indices, std::uint32_t uniform) {
  std::uint32_t* channel = indices.data();
  scene::encodeRangeDeltas(std::span<std::uint32_t* const>(&channel, 1), static_cast<std::uint32_t>(indices.size()), {},
                           uniform);
  return indices;
}

Indices decoded(Indices indices, std::uint32_t uniform, std::span<const std::uint16_t> faceCounts = {}) {
  scene::decodeRangeDeltas(indices.data(), static_cast<std::uint32_t>(indices.size()), faceCounts, uniform);
  return indices;
}

// A mesh with one index list and one primitive per entry of `primitives`: {start, count,
// uniform count (0: use the list)} with the count list given.
struct PrimitiveLayout {
  std::uint32_t start;
  std::uint32_t count;
  std::uint16_t uniform;
  base::vector<std::uint16_t> counts;
};

std::unique_ptr<base::AttribMap> makeMesh(const Indices& indices, const std::vector<PrimitiveLayout>& primitives) {
  auto made = std::make_unique<base::AttribMap>();
  base::AttribMap& mesh = *made;
  mesh.attribute(mesh_schema::indices(), indices);
  base::AttribArray& array = scene::arrayMember(mesh, mesh_schema::primitives());
  for (const PrimitiveLayout& layout : primitives) {
    base::AttribMap& primitive = scene::appendMap(array);
    primitive.attribute(meshPrimitive_schema::indexStart(), layout.start);
    primitive.attribute(meshPrimitive_schema::indexCount(), layout.count);
    if (layout.uniform) {
      primitive.attribute(meshPrimitive_schema::vcounts(), layout.uniform);
    } else {
      primitive.attribute(meshPrimitive_schema::vcounts(), layout.counts);
    }
  }
  return made;
}

const Indices& indicesOf(const base::AttribMap& mesh) {
  return *mesh.findVecAttribute<std::uint32_t>(mesh_schema::indices());
}

TEST(IndexDeltas, WorkedExample) {
  EXPECT_EQ(encoded({4, 5, 6, 2, 0, 1}, 3), (Indices{0, 1, 2, 4, 1, 2}));
  EXPECT_EQ(decoded({0, 1, 2, 4, 1, 2}, 3), (Indices{0, 1, 2, 4, 5, 6}));
}

TEST(IndexDeltas, FacesAreRotatedToTheirSmallestIndexKeepingTheWinding) {
  EXPECT_EQ(decoded(encoded({7, 3, 5}, 3), 3), (Indices{3, 5, 7}));
  EXPECT_EQ(decoded(encoded({9, 8, 2, 4}, 4), 4), (Indices{2, 4, 9, 8}));
  EXPECT_EQ(decoded(encoded({5, 1}, 2), 2), (Indices{1, 5}));
  base::vector<std::uint16_t> pentagon{5};
  Indices face{6, 2, 9, 2, 7};
  std::uint32_t* channel = face.data();
  scene::encodeRangeDeltas(std::span<std::uint32_t* const>(&channel, 1), 5, pentagon, 3);
  EXPECT_EQ(decoded(face, 3, pentagon), (Indices{2, 9, 2, 7, 6}));
}

TEST(IndexDeltas, AFaceStartingLikeThePreviousOneIsEncodedAgainstItsSecondIndex) {
  EXPECT_EQ(encoded({0, 3, 4, 0, 1, 2}, 3), (Indices{0, 1, 2, 0, 2, 4}));
}

TEST(IndexDeltas, MixedFacesSortWithATriangleAfterTheQuadItStartsLike) {
  // Two channels keep step: the second follows the first's rotation and order.
  Indices first{0, 1, 2, 5, 6, 7, 8, 0, 1, 2, 3};
  Indices second{10, 11, 12, 15, 16, 17, 18, 20, 21, 22, 23};
  base::vector<std::uint16_t> counts{3, 4, 4};
  std::uint32_t* channels[] = {first.data(), second.data()};
  scene::encodeRangeDeltas(channels, 11, counts, 3);
  EXPECT_EQ(counts, (base::vector<std::uint16_t>{4, 3, 4}));
  EXPECT_EQ(second, (Indices{20, 21, 22, 23, 10, 11, 12, 15, 16, 17, 18}));
  EXPECT_EQ(decoded(first, 3, counts), (Indices{0, 1, 2, 3, 0, 1, 2, 5, 6, 7, 8}));
}

TEST(IndexDeltas, OnlyEncodablePrimitivesChangeAndTheMeshIsMarked) {
  // Triangles, an edge among faces (left alone), a point set (left alone).
  const Indices plain{4, 5, 6, 2, 0, 1, 9, 8, 7, 3, 2, 1};
  const auto made = makeMesh(plain, {{0, 6, 3, {}}, {6, 5, 0, {3, 2}}, {11, 1, 1, {}}});
  base::AttribMap& mesh = *made;
  ASSERT_TRUE(scene::encodeIndexDeltas(mesh));
  EXPECT_EQ(indicesOf(mesh), (Indices{0, 1, 2, 4, 1, 2, 9, 8, 7, 3, 2, 1}));
  EXPECT_TRUE(*mesh.findAttribute<bool>(mesh_schema::indicesDeltaCompression()));
  EXPECT_FALSE(scene::encodeIndexDeltas(mesh));  // marked: never encoded twice
  ASSERT_TRUE(scene::decodeIndexDeltas(mesh));
  EXPECT_EQ(indicesOf(mesh), (Indices{0, 1, 2, 4, 5, 6, 9, 8, 7, 3, 2, 1}));
  EXPECT_FALSE(*mesh.findAttribute<bool>(mesh_schema::indicesDeltaCompression()));
  EXPECT_FALSE(scene::decodeIndexDeltas(mesh));
}

TEST(IndexDeltas, RangesStayInsideTheChannelAndHoldWholeFaces) {
  // After encoding and decoding, the faces a range holds whole come back rotated; nothing
  // outside them changes.
  const Indices plain{2, 1, 0, 5, 4, 3, 9};
  const Indices bothFaces{0, 2, 1, 3, 5, 4, 9};
  const Indices firstFace{0, 2, 1, 5, 4, 3, 9};
  const std::vector<std::pair<std::vector<PrimitiveLayout>, Indices>> cases{
      {{{0, 100, 3, {}}}, bothFaces},    // a count beyond the list
      {{{0, 5, 3, {}}}, firstFace},      // a range that ends inside a face
      {{{9, 3, 3, {}}}, plain},          // a start past the end
      {{{0, 5, 0, {3, 3}}}, firstFace},  // more counts than the range holds
      {{{0, 7, 1, {}}}, plain},          // faces of one index
      {{{0, 7, 0, {}}}, plain},          // an empty count list
  };
  for (const auto& [primitives, expected] : cases) {
    const auto made = makeMesh(plain, primitives);
    scene::encodeIndexDeltas(*made);
    scene::decodeIndexDeltas(*made);
    EXPECT_EQ(indicesOf(*made), expected) << primitives[0].start << " " << primitives[0].count;
  }
}

// What the encoding rewrites must be the mesh's own: a primitive whose count list is a link
// (which others may share) is left alone, by decoding too. A linked range or single count is
// only read, so it is followed.
TEST(IndexDeltas, ALinkedCountListIsNotEncodedAndALinkedRangeIsFollowed) {
  const Indices plain{4, 5, 6, 2, 0, 1, 9, 8, 7, 6, 3, 2, 1};
  const auto made = makeMesh(plain, {{0, 6, 3, {}}, {6, 7, 0, {4, 3}}});
  base::AttribMap& mesh = *made;
  base::AttribArray& primitives = scene::arrayMember(mesh, mesh_schema::primitives());
  for (const base::name_id name :
       {meshPrimitive_schema::indexStart(), meshPrimitive_schema::indexCount(), meshPrimitive_schema::vcounts()}) {
    testing_support::moveBehindLink(*scene::mapAt(primitives, 0), name);
  }
  testing_support::moveBehindLink(*scene::mapAt(primitives, 1), meshPrimitive_schema::vcounts());
  ASSERT_TRUE(scene::encodeIndexDeltas(mesh));
  EXPECT_EQ(indicesOf(mesh), (Indices{0, 1, 2, 4, 1, 2, 9, 8, 7, 6, 3, 2, 1}));
  const scene::FaceCounts linked = scene::faceCountsOf(*scene::mapAt(primitives, 1));
  ASSERT_NE(linked.perFace, nullptr);
  EXPECT_EQ(*linked.perFace, (base::vector<std::uint16_t>{4, 3}));
  const Indices back{0, 1, 2, 4, 5, 6, 9, 8, 7, 6, 3, 2, 1};
  EXPECT_EQ(scene::decodedIndices(mesh), back);
  ASSERT_TRUE(scene::decodeIndexDeltas(mesh));
  EXPECT_EQ(indicesOf(mesh), back);
}

TEST(IndexDeltas, MeshesThatCannotBeEncodedAreLeftAlone) {
  base::AttribMap empty;
  EXPECT_FALSE(scene::encodeIndexDeltas(empty));
  EXPECT_FALSE(empty.findAttribute<bool>(mesh_schema::indicesDeltaCompression()));
  const auto made = makeMesh({0, 1, 2}, {{0, 3, 3, {}}});
  base::AttribMap& uneven = *made;
  uneven.attribute(mesh_schema::positionIndices(), Indices{0, 1});
  testing_support::LogCapture log;
  EXPECT_FALSE(scene::encodeIndexDeltas(uneven));
  EXPECT_EQ(indicesOf(uneven), (Indices{0, 1, 2}));
  ASSERT_EQ(log.entries.size(), 1u);
  EXPECT_EQ(log.entries[0].text,
            "Failed to encode delta channel for mesh ''! Shared or verbose index channel detected.");
}

// Each face as its rotation that starts at the smallest index: equal for equal faces with the
// same winding.
std::vector<std::vector<std::uint32_t>> canonicalFaces(const Indices& indices,
                                                       const base::vector<std::uint16_t>& counts) {
  std::vector<std::vector<std::uint32_t>> faces;
  std::size_t at = 0;
  for (const std::uint16_t n : counts) {
    // The smallest of the face's rotations stands for all of them.
    std::vector<std::uint32_t> face(indices.begin() + at, indices.begin() + at + n);
    std::vector<std::uint32_t> smallest = face;
    for (std::uint16_t k = 1; k < n; ++k) {
      std::rotate(face.begin(), face.begin() + 1, face.end());
      smallest = std::min(smallest, face);
    }
    faces.push_back(smallest);
    at += n;
  }
  std::sort(faces.begin(), faces.end());
  return faces;
}

// The encoding's face order: by first index, then the next ones (up to four), each face
// rotated to start at its smallest index.
bool inEncodingOrder(const Indices& indices, const base::vector<std::uint16_t>& counts) {
  std::vector<std::vector<std::uint32_t>> keys;
  std::size_t at = 0;
  for (const std::uint16_t n : counts) {
    std::vector<std::uint32_t> key(indices.begin() + at, indices.begin() + at + std::min<std::uint16_t>(n, 4));
    key.resize(4, 0xFFFFFFFFu);
    keys.push_back(key);
    at += n;
  }
  return std::is_sorted(keys.begin(), keys.end());
}

// The faces in encoding order (rotated and sorted), then a few of them moved elsewhere: the
// order that files written sorted hold, give or take an edit.
Indices nearlySorted(const Indices& indices, std::uint16_t n, std::mt19937& random) {
  std::vector<std::vector<std::uint32_t>> faces =
      canonicalFaces(indices, base::vector<std::uint16_t>(indices.size() / n, n));
  for (int moved = 0; moved < 3 && faces.size() > 1; ++moved) {
    const std::size_t from = random() % faces.size(), to = random() % faces.size();
    std::swap(faces[from], faces[to]);
  }
  Indices result;
  for (const auto& face : faces) result.insert(result.end(), face.begin(), face.end());
  return result;
}

// Dense first indices take the counting sort, with short and long runs of one first index;
// indices far apart take the comparison sort; faces nearly in order are merged. All must
// give the same order.
TEST(IndexDeltas, RandomMeshesDecodeToTheirFacesUpToRotationInEncodingOrder) {
  std::mt19937 random(7);
  for (int round = 0; round < 400; ++round) {
    const bool mixed = round % 2 == 1;
    const std::uint16_t uniform = static_cast<std::uint16_t>(2 + (round / 2) % 3);
    const std::uint32_t vertices = round % 5 == 4 ? 0xFFFFFFF0u : 12;
    base::vector<std::uint16_t> counts(1 + random() % (round % 3 == 0 ? 400 : 40));
    Indices indices;
    for (std::uint16_t& n : counts) {
      n = mixed ? static_cast<std::uint16_t>(3 + random() % 5) : uniform;
      for (std::uint16_t k = 0; k < n; ++k) indices.push_back(static_cast<std::uint32_t>(random() % vertices));
    }
    if (!mixed && round % 4 == 3) indices = nearlySorted(indices, uniform, random);
    const auto expected = canonicalFaces(indices, counts);
    const auto made = makeMesh(
        indices, {{0, static_cast<std::uint32_t>(indices.size()), mixed ? std::uint16_t(0) : uniform, counts}});
    base::AttribMap& mesh = *made;
    // Three rounds in four carry a second channel: each corner's place in the file.
    Indices corners(indices.size());
    std::iota(corners.begin(), corners.end(), 0u);
    if (round % 4 != 2) mesh.attribute(mesh_schema::positionIndices(), corners);
    ASSERT_TRUE(scene::encodeIndexDeltas(mesh));
    ASSERT_TRUE(scene::decodeIndexDeltas(mesh));
    if (round % 4 != 2) {
      const Indices& moved = *mesh.findVecAttribute<std::uint32_t>(mesh_schema::positionIndices());
      for (std::size_t c = 0; c < moved.size(); ++c) ASSERT_EQ(indices[moved[c]], indicesOf(mesh)[c]) << round;
    }
    const scene::FaceCounts after =
        scene::faceCountsOf(*scene::mapAt(*scene::findArrayMember(mesh, mesh_schema::primitives()), 0));
    const base::vector<std::uint16_t>& finalCounts = mixed ? *after.perFace : counts;
    EXPECT_EQ(canonicalFaces(indicesOf(mesh), finalCounts), expected) << "round " << round;
    EXPECT_TRUE(inEncodingOrder(indicesOf(mesh), finalCounts)) << "round " << round;
  }
}

}  // namespace
