// The PLY exporter through the scene factory, as a host uses it: parameters, the round trip
// of every test and corpus file in every encoding (import, export, import: the same scene),
// and what happens around the file (replacing, failing, several meshes, no mesh).

#include "b_attribute_desc.h"
#include "b_color.h"
#include "b_normal.h"
#include "b_vec.h"
#include "linked_member.h"
#include "log_capture.h"
#include "ply_recorder.h"
#include "same_scene.h"
#include "scene_import.h"
#include "thrown.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <map>
#include <optional>
#include <set>
#include <sstream>

namespace {

namespace stdfs = std::filesystem;
using scene::mesh_schema;
using scene::meshColorSet_schema;
using scene::meshPrimitive_schema;
using scene::meshUVSet_schema;
using testing_support::encodings;
using testing_support::expectSameScene;
using testing_support::exportScene;
using testing_support::formatEntries;
using testing_support::ImportedScene;
using testing_support::importFile;

// A fresh folder for the files one test writes.
class ExportFolder {
 public:
  ExportFolder() : m_path(std::string(base::fs::tmpFilename())) {
    stdfs::remove(m_path);
    stdfs::create_directory(m_path);
  }
  ~ExportFolder() { stdfs::remove_all(m_path); }
  std::string file(const std::string& name) const { return (m_path / name).string(); }
  std::vector<std::string> names() const {
    std::vector<std::string> found;
    for (const auto& entry : stdfs::directory_iterator(m_path)) found.push_back(entry.path().filename().string());
    std::sort(found.begin(), found.end());
    return found;
  }

 private:
  stdfs::path m_path;
};

TEST(PlyExport, ParametersAndTheirDefaults) {
  base::AttribMap parameters;
  ASSERT_TRUE(testing_support::pluginFactory().getExporterParameters("out.ply", parameters));
  EXPECT_EQ(parameters.mapType(), scene::sceneExporter_schema::typeName());
  EXPECT_EQ(parameters.size(), 9u);
  for (const char* on : {"exportBinary", "exportColors", "exportTextureCoordinates", "exportEdges", "exportPoints",
                         "exportMaterials", "exportCustomProperties"}) {
    EXPECT_TRUE(*parameters.findAttribute<bool>(base::intern(on))) << on;
  }
  EXPECT_FALSE(*parameters.findAttribute<bool>(base::intern("exportBigEndian")));
  EXPECT_FALSE(*parameters.findAttribute<bool>(base::intern("exportMergeMeshes")));
}

std::string readText(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  return std::string(std::istreambuf_iterator<char>(in), {});
}

TEST(PlyExport, SwitchedOffPartsAreLeftOut) {
  const ImportedScene imported = importFile(MESHPORT_TEST_DATA "/ply/valid/ascii_tetrahedron_normals_colors.ply");
  const ExportFolder folder;
  ASSERT_TRUE(exportScene(imported, folder.file("plain.ply"), {"exportBinary=false", "exportColors=false"}));
  const std::string text = readText(folder.file("plain.ply"));
  EXPECT_EQ(text.find("red"), std::string::npos) << text;
  EXPECT_NE(text.find("property float nx"), std::string::npos) << text;
  EXPECT_NE(text.find("comment written by Meshport\n"), std::string::npos);
}

TEST(PlyExport, AFaceOfMoreThan255CornersGetsAWiderCount) {
  std::string file = testing_support::asciiHeader +
                     "element vertex 300\nproperty float x\nproperty float y\n"
                     "element face 1\nproperty list uchar int vertex_indices\nend_header\n";
  for (int k = 0; k < 300; ++k) file += fmt::format("{} {}\n", std::cos(k * 0.02), std::sin(k * 0.02));
  // uchar counts up to 255: the reader takes the count's word as it is, 300 included.
  file += "300";
  for (int k = 0; k < 300; ++k) file += fmt::format(" {}", k);
  file += "\n";
  const testing_support::TemporaryFile source("big_face.ply", file);
  const ImportedScene imported = importFile(source.path());
  const ExportFolder folder;
  for (const std::string encoding : encodings) {
    const std::string path = folder.file(encoding + ".ply");
    ASSERT_TRUE(exportScene(imported, path, formatEntries(encoding)));
    EXPECT_NE(readText(path).find("property list ushort int vertex_indices\n"), std::string::npos);
    expectSameScene(imported.mesh(), importFile(path).mesh(), encoding);
  }
}

TEST(PlyExport, AnExistingFileIsReplacedOnlyByAWholeOne) {
  const ImportedScene imported = importFile(MESHPORT_TEST_DATA "/ply/valid/binary_le_cube_triangles.ply");
  const ExportFolder folder;
  const std::string path = folder.file("cube.ply");
  std::ofstream(path) << "old content";
  ASSERT_TRUE(exportScene(imported, path));
  EXPECT_EQ(readText(path).substr(0, 4), "ply\n");
  expectSameScene(imported.mesh(), importFile(path).mesh(), "replaced");
  EXPECT_EQ(folder.names(), std::vector<std::string>{"cube.ply"});
}

TEST(PlyExport, AFailedWriteNamesTheFileAndLeavesNothingBehind) {
  testing_support::LogCapture log;
  const ImportedScene imported = importFile(MESHPORT_TEST_DATA "/ply/valid/binary_le_cube_triangles.ply");
  const ExportFolder folder;
  // No such folder, and a folder where the file should be.
  const std::string missing = folder.file("missing/cube.ply");
  const std::string text = stream_tests::thrownText([&] { exportScene(imported, missing); });
  EXPECT_EQ(text.rfind(missing + ": cannot write the file: ", 0), 0u) << text;
  stdfs::create_directory(folder.file("taken.ply"));
  const std::string taken = folder.file("taken.ply");
  EXPECT_EQ(stream_tests::thrownText([&] { exportScene(imported, taken); }).rfind(taken + ": cannot write the file", 0),
            0u);
  EXPECT_TRUE(stdfs::is_directory(taken));
  EXPECT_EQ(folder.names(), std::vector<std::string>{"taken.ply"});
}

// Strips read their indices run by run: runs that together pass the primitive's range would
// make the writer read past the index list.
TEST(PlyExport, StripsLongerThanTheirRangeAreRefused) {
  const ImportedScene imported = importFile(MESHPORT_TEST_DATA "/ply/valid/binary_be_tristrips_material.ply");
  base::AttribMap& primitive = imported.primitive(0);
  auto* strips = const_cast<base::vector<std::uint32_t>*>(
      scene::listMember<std::uint32_t>(primitive, meshPrimitive_schema::ecounts()));
  ASSERT_TRUE(strips && !strips->empty());
  const std::uint32_t range = *scene::scalarMember<std::uint32_t>(primitive, meshPrimitive_schema::indexCount());
  std::uint64_t total = 0;
  for (const std::uint32_t n : *strips) total += n;
  strips->back() += range - static_cast<std::uint32_t>(total) + 1000;
  const ExportFolder folder;
  const std::string path = folder.file("strips.ply");
  EXPECT_EQ(stream_tests::thrownText([&] { exportScene(imported, path); }),
            fmt::format("{}: a primitive's strips have {} indices, its range {}", path, range + 1000, range));
  EXPECT_TRUE(folder.names().empty());
}

// A member stored as a link is written as the member it leads to, as maps read it.
TEST(PlyExport, LinkedMembersAreWrittenAsTheMembersTheyLeadTo) {
  const ImportedScene imported = importFile(MESHPORT_TEST_DATA "/ply/valid/ascii_tetrahedron_normals_colors.ply");
  base::IPlugin& mesh = imported.mesh();
  scene::decodeIndexDeltas(mesh);  // an index list behind a link holds plain indices
  const ExportFolder folder;
  ASSERT_TRUE(exportScene(imported, folder.file("stored.ply")));
  for (const base::name_id name : {mesh_schema::positions(), mesh_schema::normals(), mesh_schema::indices()}) {
    testing_support::moveBehindLink(mesh, name);
  }
  for (const base::name_id name :
       {meshPrimitive_schema::indexStart(), meshPrimitive_schema::indexCount(), meshPrimitive_schema::vcounts()}) {
    testing_support::moveBehindLink(imported.primitive(0), name);
  }
  base::AttribMap* colours = scene::mapAt(*scene::findArrayMember(mesh, mesh_schema::colorSets()), 0);
  ASSERT_TRUE(colours && colours->findMember(meshColorSet_schema::RGB()));
  testing_support::moveBehindLink(*colours, meshColorSet_schema::RGB());
  ASSERT_TRUE(exportScene(imported, folder.file("linked.ply")));
  EXPECT_EQ(readText(folder.file("linked.ply")), readText(folder.file("stored.ply")));
}

TEST(PlyExport, ASceneWithoutMeshesSaysSo) {
  const ImportedScene empty;
  const ExportFolder folder;
  const std::string path = folder.file("empty.ply");
  EXPECT_EQ(stream_tests::thrownText([&] { exportScene(empty, path); }), path + ": the scene holds no mesh to write");
  EXPECT_TRUE(folder.names().empty());
}

TEST(PlyExport, SeveralMeshesGoToOneFileEach) {
  ImportedScene two = importFile(MESHPORT_TEST_DATA "/ply/valid/binary_le_cube_triangles.ply");
  ASSERT_TRUE(testing_support::pluginFactory().load(*two.scene, MESHPORT_TEST_DATA "/ply/valid/ascii_cube_quads.ply",
                                                    base::AttribMap()));
  const ExportFolder folder;
  ASSERT_TRUE(exportScene(two, folder.file("scene.ply")));
  EXPECT_EQ(folder.names(), (std::vector<std::string>{"scene-1.ply", "scene.ply"}));
  expectSameScene(importFile(MESHPORT_TEST_DATA "/ply/valid/ascii_cube_quads.ply").mesh(),
                  importFile(folder.file("scene-1.ply")).mesh(), "second mesh");
}

TEST(PlyExport, SeveralMeshesOfOneLayoutGoToOneFileWhenAsked) {
  const std::string triangles = MESHPORT_TEST_DATA "/ply/valid/binary_le_cube_triangles.ply";
  const std::string quads = MESHPORT_TEST_DATA "/ply/valid/ascii_cube_quads.ply";
  ImportedScene two = importFile(triangles);
  ASSERT_TRUE(testing_support::pluginFactory().load(*two.scene, quads, base::AttribMap()));
  const ExportFolder folder;
  ASSERT_TRUE(exportScene(two, folder.file("scene.ply"), {"exportMergeMeshes=true"}));
  EXPECT_EQ(folder.names(), std::vector<std::string>{"scene.ply"});
  const ImportedScene merged = importFile(folder.file("scene.ply"));
  const auto& positions = testing_support::list<base::base_vec3<float>>(merged.mesh(), mesh_schema::positions());
  const ImportedScene alone = importFile(triangles);
  const auto& first = testing_support::list<base::base_vec3<float>>(alone.mesh(), mesh_schema::positions());
  ASSERT_EQ(positions.size(), 16u);
  EXPECT_TRUE(std::equal(first.begin(), first.end(), positions.begin()));
  ASSERT_EQ(testing_support::arraySize(merged.mesh(), mesh_schema::primitives()), 2u);
  // The second mesh's faces name the vertices after the first mesh's.
  const base::vector<std::uint32_t> indices = scene::decodedIndices(merged.mesh());
  const std::uint32_t start =
      *scene::scalarMember<std::uint32_t>(merged.primitive(1), meshPrimitive_schema::indexStart());
  EXPECT_EQ(*scene::scalarMember<std::uint32_t>(merged.primitive(1), meshPrimitive_schema::indexCount()), 24u);
  EXPECT_TRUE(std::all_of(indices.begin() + start, indices.end(), [](std::uint32_t index) { return index >= 8; }));

  // Meshes of different layouts stay apart, and say why.
  ImportedScene mixed = importFile(triangles);
  ASSERT_TRUE(testing_support::pluginFactory().load(
      *mixed.scene, MESHPORT_TEST_DATA "/ply/valid/ascii_tetrahedron_normals_colors.ply", base::AttribMap()));
  const std::string path = folder.file("mixed.ply");
  EXPECT_EQ(stream_tests::thrownText([&] {
              exportScene(mixed, path, {"exportMergeMeshes=true"});
            }).rfind(path + ": the meshes cannot go into one file: ", 0),
            0u);
}

// Each face of primitive `p`, known by its vertices, with its entry of the kept float list `name`.
std::map<std::set<std::uint32_t>, float> keptPerFace(const ImportedScene& imported, std::uint32_t p,
                                                     const std::string& name) {
  const base::vector<std::uint32_t> indices = scene::decodedIndices(imported.mesh());
  const auto& values = testing_support::list<float>(imported.mesh(), base::intern(name));
  const base::AttribMap& primitive = imported.primitive(p);
  const std::uint32_t start = *scene::scalarMember<std::uint32_t>(primitive, meshPrimitive_schema::indexStart());
  const std::uint32_t count = *scene::scalarMember<std::uint32_t>(primitive, meshPrimitive_schema::indexCount());
  std::map<std::set<std::uint32_t>, float> faces;
  for (std::uint32_t f = 0; 3 * f < count; ++f) {
    faces[{indices.begin() + start + 3 * f, indices.begin() + start + 3 * f + 3}] = values.at(f);
  }
  return faces;
}

// The properties of each element of a written file, by element name.
std::vector<std::pair<std::string, std::vector<std::string>>> writtenLayout(const std::string& path) {
  const std::string text = readText(path);
  base::Stream stream = base::memStream(text.data(), static_cast<std::int64_t>(text.size()));
  ply::Header header;
  testing_support::LogCapture quiet;
  EXPECT_TRUE(ply::parseHeader(header, stream));
  std::vector<std::pair<std::string, std::vector<std::string>>> layout;
  for (const ply::Element& element : header.elements) {
    layout.emplace_back(std::string(element.word), std::vector<std::string>{});
    for (const ply::Property& property : element.properties) layout.back().second.emplace_back(property.word);
  }
  return layout;
}

TEST(PlyExport, KeptPropertiesGoBackToTheElementTheyCameFrom) {
  testing_support::LogCapture quiet;
  // As many faces as vertices, and two face elements that carry the same name.
  const std::string file = testing_support::asciiHeader +
                           "element vertex 4\nproperty float x\nproperty float y\nproperty float z\n"
                           "element face 4\nproperty list uchar int vertex_indices\nproperty float quality\n"
                           "element face 2\nproperty list uchar int vertex_indices\nproperty float quality\n"
                           "end_header\n0 0 0\n1 0 0\n0 1 0\n0 0 1\n"
                           "3 0 1 2 10\n3 0 2 3 20\n3 1 2 3 30\n3 0 1 3 40\n3 2 1 0 50\n3 3 2 0 60\n";
  const testing_support::TemporaryFile source("tetrahedron.ply", file);
  const testing_support::Switches keep{{"importCustomProperties", true}};
  const ImportedScene imported = importFile(source.path(), true, keep);
  const auto first = keptPerFace(imported, 0, "ply:quality");
  const auto second = keptPerFace(imported, 1, "ply:face.quality");
  EXPECT_EQ(first, (std::map<std::set<std::uint32_t>, float>{
                       {{0, 1, 2}, 10.0f}, {{0, 2, 3}, 20.0f}, {{1, 2, 3}, 30.0f}, {{0, 1, 3}, 40.0f}}));
  EXPECT_EQ(second, (std::map<std::set<std::uint32_t>, float>{{{0, 1, 2}, 50.0f}, {{0, 2, 3}, 60.0f}}));
  const ExportFolder folder;
  for (const std::string encoding : encodings) {
    const std::string path = folder.file(encoding + ".ply");
    ASSERT_TRUE(exportScene(imported, path, formatEntries(encoding)));
    EXPECT_EQ(writtenLayout(path),
              (std::vector<std::pair<std::string, std::vector<std::string>>>{{"vertex", {"x", "y", "z"}},
                                                                             {"face", {"vertex_indices", "quality"}},
                                                                             {"face", {"vertex_indices", "quality"}}}))
        << encoding;
    const ImportedScene again = importFile(path, true, keep);
    EXPECT_EQ(keptPerFace(again, 0, "ply:quality"), first) << encoding;
    EXPECT_EQ(keptPerFace(again, 1, "ply:face.quality"), second) << encoding;
  }
  // A scene stored before kept properties named their element places its lists by their
  // names and lengths, as then: four entries are the vertices', and two fit no element.
  imported.mesh().removeMember(base::intern("keptProperties"));
  const std::string old = folder.file("old.ply");
  EXPECT_NE(stream_tests::thrownText([&] {
              exportScene(imported, old);
            }).find("kept property ply:face.quality has 2 entries: as many as neither the vertices nor the faces"),
            std::string::npos);
  const ImportedScene single =
      testing_support::importText(testing_support::asciiHeader +
                                      "element vertex 3\nproperty float x\nproperty float y\nproperty float z\n"
                                      "element face 3\nproperty list uchar int vertex_indices\nproperty float "
                                      "quality\nend_header\n0 0 0\n1 0 0\n0 1 0\n3 0 1 2 1\n3 0 2 1 2\n3 1 0 2 3\n",
                                  true, keep);
  single.mesh().removeMember(base::intern("keptProperties"));
  ASSERT_TRUE(exportScene(single, old));
  EXPECT_EQ(writtenLayout(old)[0].second, (std::vector<std::string>{"x", "y", "z", "quality"}));
}

TEST(PlyExport, AFaceWithoutCornersHasNoColourToTakeFromAnother) {
  // Its colour has no corner to hang on in the scene: it is written as 0, never as the
  // colour of the face after it (or of whatever lies past the last one).
  const ImportedScene imported =
      importFile(MESHPORT_TEST_DATA "/ply/regressions/valid-ascii-faces-without-corners-with-colours.ply");
  const ExportFolder folder;
  ASSERT_TRUE(exportScene(imported, folder.file("out.ply"), formatEntries("ascii")));
  const std::string text = readText(folder.file("out.ply"));
  EXPECT_NE(text.find("\n0 0 0 0\n3 0 1 2 40 50 60\n0 0 0 0\n"), std::string::npos) << text;
}

}  // namespace
