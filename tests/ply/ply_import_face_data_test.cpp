// Per-face texture coordinates and colours: face-varying sets whose index channels the delta
// encoding moves with the faces, so that every corner keeps its own data. Random files check
// that on every kind of file (ply_random_files_test.cpp); these cases pin what they do not:
// the warning for short lists, two faces per instance, and the corners of other primitives.

#include "b_vec.h"
#include "log_capture.h"
#include "scene_import.h"
#include "scene_validation.h"

#include <fmt/format.h>
#include <fmt/ranges.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstring>
#include <iterator>
#include <map>
#include <set>
#include <string>

namespace {

using scene::mesh_schema;
using scene::meshColorSet_schema;
using scene::meshUVSet_schema;
using testing_support::asciiHeader;
using testing_support::ImportedScene;
using testing_support::importText;
using testing_support::list;
using testing_support::LogCapture;
using testing_support::setList;
using UV = base::base_vec2<float>;
using RGBA = base::base_vec4<float>;

constexpr std::uint32_t invalid = 0xFFFFFFFFu;

TEST(FaceData, ListsWithoutTwoValuesPerCornerFillWhatTheyHave) {
  LogCapture log(base::logWarning);
  ImportedScene imported = importText(asciiHeader +
                                      "element vertex 4\nproperty float x\nelement face 3\nproperty list uchar int "
                                      "vertex_indices\nproperty list uchar float texcoord\nend_header\n0\n1\n2\n3\n"
                                      "3 0 1 2 4 1 2 3 4\n3 1 2 3 8 5 6 7 8 9 10 11 12\n3 0 2 3 0\n");
  base::AttribMap& mesh = imported.mesh();
  scene::decodeIndexDeltas(mesh);
  const auto& indices = list<std::uint32_t>(mesh, mesh_schema::indices());
  const auto& uvs = setList<UV>(mesh, mesh_schema::uvSets(), 0, meshUVSet_schema::UV());
  const auto& channel = setList<std::uint32_t>(mesh, mesh_schema::uvSets(), 0, meshUVSet_schema::indices());
  // Sorted: (0 1 2), (0 2 3), (1 2 3).
  ASSERT_EQ(indices, (base::vector<std::uint32_t>{0, 1, 2, 0, 2, 3, 1, 2, 3}));
  std::vector<UV> corners;
  for (std::uint32_t c : channel) corners.push_back(uvs.at(c));
  EXPECT_EQ(corners, (std::vector<UV>{{1, 2}, {3, 4}, {0, 0}, {0, 0}, {0, 0}, {0, 0}, {5, 6}, {7, 8}, {9, 10}}));
  ASSERT_EQ(log.entries.size(), 2u);  // the unknown name, then the faces that did not match
  EXPECT_EQ(log.entries[1].text.rfind("Element 'face': 3 faces have a texcoord list without two values", 0), 0u);
}

TEST(FaceData, EveryFaceOfAnInstanceTakesItsValuesAndKeptProperties) {
  // Two index lists per instance: each gives a face, and both faces carry the instance's
  // colour and kept values. The middle instance cannot be read.
  const std::string file = asciiHeader +
                           "element vertex 4\nproperty float x\nelement face 3\nproperty uchar red\nproperty uchar "
                           "green\nproperty uchar blue\nproperty list uchar int vertex_indices\nproperty list uchar "
                           "int vertex_index\nproperty float quality\nproperty list uchar ushort tags\nend_header\n"
                           "0\n1\n2\n3\n"
                           "51 0 0 3 0 1 2 3 1 2 3 1.5 2 7 8\n"
                           "102 0 0 3 0 # 3 3 0 1 3 2.5 1 9\n"
                           "153 0 0 3 0 2 3 3 0 1 3 3.5 0\n";
  // Each face by its vertices: red, quality, tags.
  struct Expected {
    float red;
    float quality;
    std::vector<std::uint16_t> tags;
  };
  const std::map<std::set<std::uint32_t>, Expected> expected = {{{0, 1, 2}, {0.2f, 1.5f, {7, 8}}},
                                                                {{1, 2, 3}, {0.2f, 1.5f, {7, 8}}},
                                                                {{0, 2, 3}, {0.6f, 3.5f, {}}},
                                                                {{0, 1, 3}, {0.6f, 3.5f, {}}}};
  for (const bool plans : {true, false}) {
    SCOPED_TRACE(plans ? "plans" : "per property");
    LogCapture quiet;
    ImportedScene imported = importText(file, plans, {{"importCustomProperties", true}});
    base::AttribMap& mesh = imported.mesh();
    ASSERT_TRUE(scene::decodeIndexDeltas(mesh));
    const auto& indices = list<std::uint32_t>(mesh, mesh_schema::indices());
    const auto& colours =
        setList<base::base_vec3<float>>(mesh, mesh_schema::colorSets(), 0, meshColorSet_schema::RGB());
    const auto& channel = setList<std::uint32_t>(mesh, mesh_schema::colorSets(), 0, meshColorSet_schema::indices());
    const auto& quality = list<float>(mesh, base::intern("ply:quality"));
    const auto& tagCounts = list<std::uint32_t>(mesh, base::intern("ply:tags.counts"));
    const auto& tagItems = list<std::uint16_t>(mesh, base::intern("ply:tags.items"));
    ASSERT_EQ(indices.size(), 12u);
    ASSERT_EQ(quality.size(), 4u);
    ASSERT_EQ(tagCounts.size(), 4u);
    std::size_t tag = 0;
    for (std::size_t f = 0; f < 4; ++f) {
      const Expected& face = expected.at({indices.begin() + 3 * f, indices.begin() + 3 * f + 3});
      for (std::size_t c = 3 * f; c < 3 * f + 3; ++c) EXPECT_NEAR(colours.at(channel.at(c)).x, face.red, 1e-6);
      EXPECT_EQ(quality[f], face.quality);
      EXPECT_EQ(std::vector<std::uint16_t>(tagItems.begin() + tag, tagItems.begin() + tag + tagCounts[f]), face.tags);
      tag += tagCounts[f];
    }
  }
}

TEST(FaceData, CornersOfOtherPrimitivesHoldTheInvalidIndex) {
  ImportedScene imported = importText(asciiHeader +
                                      "element vertex 3\nproperty float x\nelement edge 1\nproperty list uchar int "
                                      "vertex_indices\nelement face 1\nproperty list uchar int vertex_indices\n"
                                      "property uchar red\nproperty uchar green\nproperty uchar blue\nproperty list "
                                      "uchar float texcoord\nend_header\n0\n1\n2\n2 2 1\n3 1 2 0 255 255 0 6 1 2 3 "
                                      "4 5 6\n");
  base::AttribMap& mesh = imported.mesh();
  EXPECT_TRUE(scene::validateMesh(mesh));
  ASSERT_TRUE(scene::decodeIndexDeltas(mesh));
  EXPECT_EQ(list<std::uint32_t>(mesh, mesh_schema::indices()), (base::vector<std::uint32_t>{1, 2, 0, 1, 2}));
  EXPECT_EQ(setList<std::uint32_t>(mesh, mesh_schema::uvSets(), 0, meshUVSet_schema::indices()),
            (base::vector<std::uint32_t>{invalid, invalid, 2, 0, 1}));
  EXPECT_EQ(setList<std::uint32_t>(mesh, mesh_schema::colorSets(), 0, meshColorSet_schema::indices()),
            (base::vector<std::uint32_t>{invalid, invalid, 0, 0, 0}));
  EXPECT_EQ(setList<base::base_vec3<float>>(mesh, mesh_schema::colorSets(), 0, meshColorSet_schema::RGB()),
            (base::vector<base::base_vec3<float>>{{1, 1, 0}}));
  EXPECT_EQ(*setList<std::uint32_t>(mesh, mesh_schema::uvSets(), 0, meshUVSet_schema::indices()).begin(), invalid);
}

}  // namespace
