// Per-face texture coordinates and colours: face-varying sets whose index channels the delta
// encoding moves with the faces, so that every corner keeps its own data.

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

// A face of the test meshes: its corners, a coordinate pair per corner and a colour.
struct Face {
  std::vector<std::uint32_t> corners;
  std::vector<UV> uvs;
  std::array<std::uint8_t, 4> colour;
};

// Faces of 3 and 4 corners, out of order, each with distinct corners so that a face is known
// by its set of vertices after sorting and rotation.
std::vector<Face> testFaces() {
  std::vector<Face> faces;
  for (std::uint32_t f = 0; f < 40; ++f) {
    Face face;
    const std::uint32_t n = f % 3 == 0 ? 4 : 3;
    for (std::uint32_t k = 0; k < n; ++k) {
      face.corners.push_back((f * 7 + k * 11 + 5) % 60);
      face.uvs.push_back({static_cast<float>(f) + 0.25f * static_cast<float>(k), static_cast<float>(k) - 0.5f});
    }
    face.colour = {static_cast<std::uint8_t>(f * 5), static_cast<std::uint8_t>(255 - f), 17,
                   static_cast<std::uint8_t>(f * 3)};
    faces.push_back(face);
  }
  return faces;
}

const std::string faceHeader =
    "element vertex 60\nproperty float x\nelement face 40\nproperty uchar red\nproperty list uchar int "
    "vertex_indices\nproperty uchar green\nproperty list uchar float texcoord\nproperty uchar blue\nproperty "
    "uchar alpha\n";

std::string asciiFile(const std::vector<Face>& faces) {
  std::string text = asciiHeader + faceHeader + "end_header\n";
  const auto out = std::back_inserter(text);
  for (int v = 0; v < 60; ++v) fmt::format_to(out, "{}\n", v);
  for (const Face& face : faces) {
    fmt::format_to(out, "{} {} {} {} {}", face.colour[0], face.corners.size(), fmt::join(face.corners, " "),
                   face.colour[1], 2 * face.uvs.size());
    for (const UV& uv : face.uvs) fmt::format_to(out, " {:.6f} {:.6f}", uv.x, uv.y);
    fmt::format_to(out, " {} {}\n", face.colour[2], face.colour[3]);
  }
  return text;
}

template <class T>
void put(std::string& out, T value) {
  out.append(reinterpret_cast<const char*>(&value), sizeof value);
}

std::string binaryFile(const std::vector<Face>& faces) {
  std::string out = "ply\nformat binary_little_endian 1.0\n" + faceHeader + "end_header\n";
  for (int v = 0; v < 60; ++v) put(out, static_cast<float>(v));
  for (const Face& face : faces) {
    put(out, face.colour[0]);
    put(out, static_cast<std::uint8_t>(face.corners.size()));
    for (std::uint32_t corner : face.corners) put(out, static_cast<std::int32_t>(corner));
    put(out, face.colour[1]);
    put(out, static_cast<std::uint8_t>(2 * face.uvs.size()));
    for (const UV& uv : face.uvs) put(out, uv.x), put(out, uv.y);
    put(out, face.colour[2]);
    put(out, face.colour[3]);
  }
  return out;
}

// Every corner of the decoded mesh against the file: its face (known by its vertices), its
// coordinates and its face's colour.
void expectCornersKeepTheirData(base::AttribMap& mesh, const std::vector<Face>& faces, bool textUVs) {
  EXPECT_TRUE(scene::validateMesh(mesh));
  ASSERT_TRUE(scene::decodeIndexDeltas(mesh));
  const auto& indices = list<std::uint32_t>(mesh, mesh_schema::indices());
  const auto& uvs = setList<UV>(mesh, mesh_schema::uvSets(), 0, meshUVSet_schema::UV());
  const auto& uvChannel = setList<std::uint32_t>(mesh, mesh_schema::uvSets(), 0, meshUVSet_schema::indices());
  const auto& colours = setList<RGBA>(mesh, mesh_schema::colorSets(), 0, meshColorSet_schema::RGBA());
  const auto& colourChannel = setList<std::uint32_t>(mesh, mesh_schema::colorSets(), 0, meshColorSet_schema::indices());
  ASSERT_EQ(uvChannel.size(), indices.size());
  ASSERT_EQ(colourChannel.size(), indices.size());
  ASSERT_EQ(colours.size(), faces.size());
  std::map<std::set<std::uint32_t>, const Face*> byVertices;
  for (const Face& face : faces) byVertices[{face.corners.begin(), face.corners.end()}] = &face;
  const auto& counts = list<std::uint16_t>(*scene::mapAt(*scene::findArrayMember(mesh, mesh_schema::primitives()), 0),
                                           scene::meshPrimitive_schema::vcounts());
  std::size_t offset = 0;
  for (const std::uint16_t n : counts) {
    const auto found = byVertices.find({indices.begin() + offset, indices.begin() + offset + n});
    ASSERT_NE(found, byVertices.end()) << "a face the file does not have: "
                                       << fmt::format("{}", fmt::join(indices.begin() + offset,
                                                                      indices.begin() + offset + n, " "));
    const Face& face = *found->second;
    for (std::size_t c = offset; c < offset + n; ++c) {
      const std::size_t k = std::find(face.corners.begin(), face.corners.end(), indices[c]) - face.corners.begin();
      const UV uv = uvs.at(uvChannel[c]);
      // The ASCII file holds the coordinates to six decimals.
      EXPECT_NEAR(uv.x, face.uvs[k].x, textUVs ? 1e-6 : 0);
      EXPECT_NEAR(uv.y, face.uvs[k].y, textUVs ? 1e-6 : 0);
      const RGBA colour = colours.at(colourChannel[c]);
      // uchar colours are normalised by one over 255.
      constexpr float unit = 1.0f / 255.0f;
      EXPECT_EQ(colour,
                (RGBA{face.colour[0] * unit, face.colour[1] * unit, face.colour[2] * unit, face.colour[3] * unit}));
    }
    offset += n;
  }
  EXPECT_EQ(offset, indices.size());
}

TEST(FaceData, EveryCornerKeepsItsCoordinatesAndColourThroughTheEncoding) {
  const std::vector<Face> faces = testFaces();
  for (const bool plans : {true, false}) {
    for (const bool binary : {true, false}) {
      SCOPED_TRACE(std::string(binary ? "binary" : "ascii") + (plans ? ", plans" : ", per property"));
      LogCapture log(base::logWarning);
      ImportedScene imported = importText(binary ? binaryFile(faces) : asciiFile(faces), plans);
      ASSERT_TRUE(imported.loaded);
      expectCornersKeepTheirData(imported.mesh(), faces, !binary);
      EXPECT_TRUE(std::none_of(log.entries.begin(), log.entries.end(),
                               [](const auto& entry) { return entry.text.find("Per face") != std::string::npos; }));
    }
  }
}

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

// Face f's line made unreadable: a byte that starts no value after its first word.
std::string breakFaceLine(std::string file, std::size_t f) {
  std::size_t at = file.find("end_header\n");
  for (std::size_t line = 0; line <= 60 + f; ++line) at = file.find('\n', at + 1);
  file.insert(file.find(' ', at + 1), " #");
  return file;
}

TEST(FaceData, AFaceThatCannotBeReadLeavesWithAllItsValues) {
  const std::vector<Face> faces = testFaces();
  std::vector<Face> kept;
  std::string ascii = asciiFile(faces);
  for (std::size_t f = 0; f < faces.size(); ++f) {
    if (f % 13 == 3 || f + 1 == faces.size()) {
      ascii = breakFaceLine(ascii, f);
    } else {
      kept.push_back(faces[f]);
    }
  }
  // The data ends inside the last face, after its corners and before its coordinates.
  std::string binary = binaryFile(faces);
  binary.resize(binary.size() - 2 - 8 * faces.back().uvs.size() - 2);
  for (const bool plans : {true, false}) {
    for (const bool isBinary : {true, false}) {
      SCOPED_TRACE(std::string(isBinary ? "binary" : "ascii") + (plans ? ", plans" : ", per property"));
      LogCapture log(base::logWarning);
      ImportedScene imported = importText(isBinary ? binary : ascii, plans);
      ASSERT_TRUE(imported.loaded);
      expectCornersKeepTheirData(imported.mesh(), isBinary ? std::vector<Face>(faces.begin(), faces.end() - 1) : kept,
                                 !isBinary);
    }
  }
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
