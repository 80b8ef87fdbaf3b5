// Custom properties kept by importCustomProperties: typed mesh lists named "ply:NAME", lists
// as ".counts" and ".items", per-face ones in the order the delta encoding gives the faces.

#include "b_json.h"
#include "b_normal.h"
#include "b_vec.h"
#include "log_capture.h"
#include "scene_import.h"

#include <fmt/format.h>
#include <fmt/ranges.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <iterator>
#include <map>
#include <set>
#include <string>

namespace {

using scene::mesh_schema;
using testing_support::asciiHeader;
using testing_support::ImportedScene;
using testing_support::importText;
using testing_support::list;
using testing_support::LogCapture;
using testing_support::setList;
using testing_support::Switches;

const Switches keep = {{"importCustomProperties", true}};

template <class T>
const base::vector<T>& kept(const base::AttribMap& mesh, const std::string& name) {
  return list<T>(mesh, base::intern(name));
}

std::size_t keptCount(const base::AttribMap& mesh) {
  return static_cast<std::size_t>(std::count_if(mesh.members().begin(), mesh.members().end(), [](const auto& member) {
    return base::text(member.first).starts_with("ply:");
  }));
}

// The 62 properties of a Gaussian-splat point.
std::vector<std::string> splatNames() {
  std::vector<std::string> names = {"x", "y", "z", "nx", "ny", "nz", "f_dc_0", "f_dc_1", "f_dc_2"};
  for (int k = 0; k < 45; ++k) names.push_back(fmt::format("f_rest_{}", k));
  names.push_back("opacity");
  for (int k = 0; k < 3; ++k) names.push_back(fmt::format("scale_{}", k));
  for (int k = 0; k < 4; ++k) names.push_back(fmt::format("rot_{}", k));
  return names;
}

float splatValue(std::size_t point, std::size_t property) {
  return static_cast<float>(point) * 100.0f + static_cast<float>(property) + 0.125f;
}

TEST(CustomProperties, ASplatCloudKeepsAllItsFields) {
  const std::vector<std::string> names = splatNames();
  ASSERT_EQ(names.size(), 62u);
  std::string file = "ply\nformat binary_little_endian 1.0\nelement vertex 5\n";
  for (const std::string& name : names) file += "property float " + name + "\n";
  file += "end_header\n";
  for (std::size_t point = 0; point < 5; ++point) {
    for (std::size_t p = 0; p < names.size(); ++p) {
      const float value = splatValue(point, p);
      file.append(reinterpret_cast<const char*>(&value), sizeof value);
    }
  }
  for (const bool plans : {true, false}) {
    LogCapture log(base::logWarning);
    ImportedScene imported = importText(file, plans, keep);
    base::AttribMap& mesh = imported.mesh();
    // Positions, normals and opacity are the mesh's own; the other 55 are kept.
    EXPECT_EQ(keptCount(mesh), 55u);
    EXPECT_EQ(list<base::base_vec3<float>>(mesh, mesh_schema::positions())[4].z, splatValue(4, 2));
    EXPECT_EQ(list<base::normal>(mesh, mesh_schema::normals())[3].x, splatValue(3, 3));
    EXPECT_EQ(setList<float>(mesh, mesh_schema::colorSets(), 0, scene::meshColorSet_schema::A())[2], splatValue(2, 54));
    for (std::size_t p = 6; p < names.size(); ++p) {
      if (names[p] == "opacity") continue;
      const auto& column = kept<float>(mesh, "ply:" + names[p]);
      ASSERT_EQ(column.size(), 5u) << names[p];
      for (std::size_t point = 0; point < 5; ++point) EXPECT_EQ(column[point], splatValue(point, p)) << names[p];
    }
    EXPECT_EQ(keptCount(importText(file, plans).mesh()), 0u);
  }
}

TEST(CustomProperties, EachKeepsItsOwnType) {
  const std::string header =
      "element vertex 2\nproperty float x\nproperty char a\nproperty uchar bb\nproperty short c\nproperty ushort d\n"
      "property int e\nproperty uint f\nproperty float gg\nproperty double h\nproperty list uchar ushort l\n"
      "end_header\n";
  // An ASCII char of 300 keeps its low byte, as a cast does.
  ImportedScene imported = importText(asciiHeader + header +
                                          "0 -5 250 -30000 60000 -2000000000 4000000000 0.5 1e300 2 7 8\n"
                                          "1 300 1 2 3 4 5 6 7 0\n",
                                      true, keep);
  base::AttribMap& mesh = imported.mesh();
  EXPECT_EQ(kept<std::int8_t>(mesh, "ply:a"), (base::vector<std::int8_t>{-5, 44}));
  EXPECT_EQ(kept<std::uint8_t>(mesh, "ply:bb"), (base::vector<std::uint8_t>{250, 1}));
  EXPECT_EQ(kept<std::int16_t>(mesh, "ply:c"), (base::vector<std::int16_t>{-30000, 2}));
  EXPECT_EQ(kept<std::uint16_t>(mesh, "ply:d"), (base::vector<std::uint16_t>{60000, 3}));
  EXPECT_EQ(kept<std::int32_t>(mesh, "ply:e"), (base::vector<std::int32_t>{-2000000000, 4}));
  EXPECT_EQ(kept<std::uint32_t>(mesh, "ply:f"), (base::vector<std::uint32_t>{4000000000u, 5}));
  EXPECT_EQ(kept<float>(mesh, "ply:gg"), (base::vector<float>{0.5f, 6}));
  EXPECT_EQ(kept<double>(mesh, "ply:h"), (base::vector<double>{1e300, 7}));
  EXPECT_EQ(kept<std::uint32_t>(mesh, "ply:l.counts"), (base::vector<std::uint32_t>{2, 0}));
  EXPECT_EQ(kept<std::uint16_t>(mesh, "ply:l.items"), (base::vector<std::uint16_t>{7, 8}));
  // The types as the JSON dump names them.
  const std::string json = imported.json();
  for (const char* typed : {"\"ply:a^int8[]\"", "\"ply:bb^uint8[]\"", "\"ply:h^double[]\"", "\"ply:l.counts^uint32[]\"",
                            "\"ply:l.items^uint16[]\""}) {
    EXPECT_NE(json.find(typed), std::string::npos) << typed;
  }
}

// Faces known by their vertices: each with a quality, a list of tags and a colour index.
struct Face {
  std::vector<int> corners;
  float quality;
  std::vector<int> tags;
};

TEST(CustomProperties, PerFaceOnesFollowTheFacesIntoTheirEncodedOrder) {
  std::vector<Face> faces;
  for (int f = 0; f < 30; ++f) {
    Face face{{(f * 7 + 3) % 40, (f * 7 + 17) % 40, (f * 7 + 29) % 40}, 0.5f * static_cast<float>(f), {}};
    if (f % 4 == 1) face.corners.push_back((f * 7 + 36) % 40);
    for (int t = 0; t < f % 3; ++t) face.tags.push_back(f * 10 + t);
    faces.push_back(face);
  }
  std::string text = asciiHeader +
                     "element vertex 40\nproperty float x\nproperty float quality\nelement face 30\nproperty float "
                     "quality\nproperty list uchar int vertex_indices\nproperty list uchar short tags\nend_header\n";
  const auto out = std::back_inserter(text);
  for (int v = 0; v < 40; ++v) fmt::format_to(out, "{} {}\n", v, -v);
  for (const Face& face : faces) {
    fmt::format_to(out, "{} {} {} {} {}\n", face.quality, face.corners.size(), fmt::join(face.corners, " "),
                   face.tags.size(), fmt::join(face.tags, " "));
  }
  // A second face element of one triangle: its names are taken twice over.
  text.insert(text.find("end_header"),
              "element face 1\nproperty float quality\nproperty list uchar int vertex_indices\n");
  text += "9.5 3 0 1 2\n";
  for (const bool plans : {true, false}) {
    ImportedScene imported = importText(text, plans, keep);
    base::AttribMap& mesh = imported.mesh();
    // The vertex element took the plain name first, the first face element the qualified one.
    EXPECT_EQ(kept<float>(mesh, "ply:quality")[7], -7.0f);
    EXPECT_EQ(kept<float>(mesh, "ply:face.quality.2"), (base::vector<float>{9.5f}));
    const auto& quality = kept<float>(mesh, "ply:face.quality");
    const auto& counts = kept<std::uint32_t>(mesh, "ply:tags.counts");
    const auto& items = kept<std::int16_t>(mesh, "ply:tags.items");
    ASSERT_EQ(quality.size(), faces.size());
    ASSERT_EQ(counts.size(), faces.size());
    std::map<std::set<int>, const Face*> byVertices;
    for (const Face& face : faces) byVertices[{face.corners.begin(), face.corners.end()}] = &face;
    const base::vector<std::uint32_t> indices = scene::decodedIndices(mesh);
    const auto& faceCounts = list<std::uint16_t>(imported.primitive(0), scene::meshPrimitive_schema::vcounts());
    std::size_t offset = 0, item = 0;
    for (std::size_t k = 0; k < faceCounts.size(); ++k) {
      const Face& face = *byVertices.at({indices.begin() + offset, indices.begin() + offset + faceCounts[k]});
      EXPECT_EQ(quality[k], face.quality);
      ASSERT_EQ(counts[k], face.tags.size());
      for (std::size_t t = 0; t < face.tags.size(); ++t) EXPECT_EQ(items[item + t], face.tags[t]);
      offset += faceCounts[k];
      item += counts[k];
    }
    EXPECT_EQ(item, items.size());
  }
}

TEST(CustomProperties, TheRecordNamesEachPropertysElementAsWritten) {
  LogCapture quiet;
  const ImportedScene imported =
      importText(asciiHeader +
                     "element vertex 3\nproperty float x\nproperty int quality\nelement face 1\nproperty list uchar "
                     "int vertex_indices\nproperty float quality\nend_header\n0 7\n1 8\n2 9\n3 0 1 2 0.5\n",
                 true, keep);
  base::JsonWriter writer;
  scene::findArrayMember(imported.mesh(), base::intern("keptProperties"))->writeValue(writer);
  EXPECT_EQ(writer.text(),
            "[{\"attribute^string\":\"ply:quality\",\"element^string\":\"vertex\",\"name^string\":\"quality\","
            "\"primitive^int32\":-1},{\"attribute^string\":\"ply:face.quality\",\"element^string\":\"face\","
            "\"name^string\":\"quality\",\"primitive^int32\":0}]");
}

TEST(CustomProperties, AVertexElementThatComesAgainReplacesAllVertexData) {
  LogCapture log(base::logWarning);
  const ImportedScene imported = importText(
      asciiHeader +
          "element vertex 2\nproperty float x\nproperty float nx\nproperty float u\nproperty float v\nproperty uchar "
          "red\nproperty uchar green\nproperty uchar blue\nproperty int quality\n"
          "element vertex 3\nproperty float x\nproperty short quality\nproperty short weight\n"
          "end_header\n0 1 0 0 1 2 3 4\n1 1 0 0 1 2 3 5\n10 -1 11\n20 -2 21\n30 -3 31\n",
      true, keep);
  const base::AttribMap& mesh = imported.mesh();
  EXPECT_EQ(list<base::base_vec3<float>>(mesh, mesh_schema::positions()).size(), 3u);
  EXPECT_EQ(mesh.findMember(mesh_schema::normals()), nullptr);
  EXPECT_EQ(testing_support::arraySize(mesh, mesh_schema::uvSets()), 0u);
  EXPECT_EQ(testing_support::arraySize(mesh, mesh_schema::colorSets()), 0u);
  EXPECT_EQ(kept<std::int16_t>(mesh, "ply:quality"), (base::vector<std::int16_t>{-1, -2, -3}));
  EXPECT_EQ(kept<std::int16_t>(mesh, "ply:weight"), (base::vector<std::int16_t>{11, 21, 31}));
  EXPECT_EQ(keptCount(mesh), 2u);
  EXPECT_EQ(testing_support::arraySize(mesh, base::intern("keptProperties")), 2u);
  const std::vector<std::string> texts = log.texts();
  EXPECT_NE(std::find(texts.begin(), texts.end(),
                      "Element 'vertex' appears again: its vertices replace the earlier ones, with all their data"),
            texts.end());
}

}  // namespace
