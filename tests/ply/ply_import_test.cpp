// The PLY importer as a host meets it: files imported through a scene factory that loaded
// the plug-in from disk.

#include "b_box.h"
#include "b_color.h"
#include "b_normal.h"
#include "b_plugin_attribute.h"
#include "log_capture.h"
#include "scene_import.h"
#include "scene_validation.h"
#include "thrown.h"

#include <gtest/gtest.h>

#include <string>

namespace {

using scene::mesh_schema;
using scene::meshColorSet_schema;
using scene::meshPrimitive_schema;
using scene::meshUVSet_schema;
using scene::principalMaterial_schema;
using testing_support::arraySize;
using testing_support::asciiHeader;
using testing_support::ImportedScene;
using testing_support::importFile;
using testing_support::importText;
using testing_support::list;
using testing_support::LogCapture;
using testing_support::setList;
using testing_support::TemporaryFile;
using Vec3 = base::base_vec3<float>;

// The mesh's plain indices.
base::vector<std::uint32_t> decodedIndices(base::AttribMap& mesh) {
  scene::decodeIndexDeltas(mesh);
  return list<std::uint32_t>(mesh, mesh_schema::indices());
}

TEST(PlyImport, APointCloudIsOnePointPrimitive) {
  ImportedScene imported =
      importText(asciiHeader +
                 "element vertex 3\nproperty float x\nproperty float y\nproperty float z\nend_header\n"
                 "0 0 0\n1 2 3\n-1 0.5 2\n");
  ASSERT_TRUE(imported.loaded);
  ASSERT_EQ(imported.scene->objects().size(), 3u);  // mesh, root node, scene
  base::AttribMap& points = imported.primitive(0);
  EXPECT_EQ(*points.findAttribute<std::uint16_t>(meshPrimitive_schema::vcounts()), 1u);
  EXPECT_EQ(*points.findAttribute<std::uint8_t>(meshPrimitive_schema::topology()), 0u);
  EXPECT_EQ(list<Vec3>(imported.mesh(), mesh_schema::positions())[1], (Vec3{1, 2, 3}));
  const auto& bounds = *imported.mesh().findAttribute<base::base_box<base::base_vec3<double>>>(mesh_schema::bounds());
  EXPECT_EQ(bounds.min.x, -1.0);
  EXPECT_EQ(bounds.max.z, 3.0);
  EXPECT_EQ(scene::getFaceCount(imported.mesh()), 0u);

  base::IPlugin& node = *imported.first(scene::node_schema::typeName());
  EXPECT_EQ(*node.findAttribute<base::string>(scene::node_schema::name()), "root");
  EXPECT_EQ(list<base::ref<base::IPlugin>>(node, scene::node_schema::children())[0].get(), &imported.mesh());
  base::IPlugin& sceneObject = *imported.first(scene::scene_schema::typeName());
  EXPECT_EQ(sceneObject.findAttribute<base::ref<base::IPlugin>>(scene::scene_schema::root())->get(), &node);
  EXPECT_EQ(*sceneObject.findAttribute<std::uint8_t>(scene::scene_schema::upAxis()), 1u);
  EXPECT_TRUE(*sceneObject.findAttribute<bool>(scene::node_schema::isLayer()));
}

TEST(PlyImport, UniformFaceCountsBecomeOneValueAndMixedOnesStayALIST) {
  const std::string vertices = "element vertex 5\nproperty float x\nproperty float y\nproperty float z\n";
  const std::string body = "0 0 0\n1 0 0\n1 1 0\n0 1 0\n2 2 2\n";
  ImportedScene triangles = importText(asciiHeader + vertices +
                                       "element face 2\nproperty list uchar int vertex_indices\n"
                                       "end_header\n" +
                                       body + "3 0 1 2\n3 2 3 4\n");
  EXPECT_EQ(*triangles.primitive(0).findAttribute<std::uint16_t>(meshPrimitive_schema::vcounts()), 3u);
  EXPECT_TRUE(*triangles.mesh().findAttribute<bool>(mesh_schema::indicesDeltaCompression()));
  EXPECT_EQ(decodedIndices(triangles.mesh()), (base::vector<std::uint32_t>{0, 1, 2, 2, 3, 4}));

  ImportedScene mixed = importText(asciiHeader + vertices +
                                   "element face 2\nproperty list uchar int vertex_indices\n"
                                   "end_header\n" +
                                   body + "4 3 2 1 0\n3 4 0 1\n");
  // The counts move with their faces when the encoding sorts them.
  EXPECT_EQ(list<std::uint16_t>(mixed.primitive(0), meshPrimitive_schema::vcounts()),
            (base::vector<std::uint16_t>{3, 4}));
  EXPECT_EQ(scene::getFaceCount(mixed.mesh()), 2u);
  EXPECT_EQ(scene::getTriangleCount(mixed.mesh()), 3u);
  // Sorted and rotated, winding kept: (0 3 2 1) then (0 1 4).
  EXPECT_EQ(decodedIndices(mixed.mesh()), (base::vector<std::uint32_t>{0, 1, 4, 0, 3, 2, 1}));
}

TEST(PlyImport, EmptyFacesKeepTheirCounts) {
  ImportedScene zeros = importText(asciiHeader +
                                   "element face 2\nproperty list uchar int vertex_indices\n"
                                   "end_header\n0\n0\n");
  EXPECT_EQ(list<std::uint16_t>(zeros.primitive(0), meshPrimitive_schema::vcounts()),
            (base::vector<std::uint16_t>{0, 0}));
  ImportedScene none = importText(asciiHeader + "element face 0\nproperty list uchar int vertex_indices\nend_header\n");
  EXPECT_TRUE(list<std::uint16_t>(none.primitive(0), meshPrimitive_schema::vcounts()).empty());
  // Without positions the box is inverted, on the mesh and on the node.
  const auto& bounds = *none.mesh().findAttribute<base::base_box<base::base_vec3<double>>>(mesh_schema::bounds());
  EXPECT_EQ(bounds.min.x, 3.4028234663852886e38);
  EXPECT_EQ(bounds.max.y, -3.4028234663852886e38);
}

TEST(PlyImport, ColoursNormalsAndTextureCoordinates) {
  ImportedScene imported = importText(
      asciiHeader +
      "element vertex 2\nproperty float x\nproperty float y\nproperty float z\nproperty float nx\nproperty float ny\n"
      "property float nz\nproperty uchar red\nproperty uchar green\nproperty uchar blue\nproperty float u\n"
      "property float v\nproperty float s\nproperty float t\nend_header\n"
      "0 0 0 0 0 1 255 0 51 0.25 0.5 0.75 1\n1 1 1 0 1 0 0 255 0 1 1 0 0\n");
  base::AttribMap& mesh = imported.mesh();
  EXPECT_EQ(list<base::normal>(mesh, mesh_schema::normals())[1], (base::normal{0, 1, 0}));
  ASSERT_EQ(arraySize(mesh, mesh_schema::colorSets()), 1u);
  const Vec3 colour = setList<Vec3>(mesh, mesh_schema::colorSets(), 0, meshColorSet_schema::RGB())[0];
  EXPECT_EQ(colour.x, 1.0f);
  EXPECT_EQ(colour.y, 0.0f);
  EXPECT_FLOAT_EQ(colour.z, 0.2f);
  ASSERT_EQ(arraySize(mesh, mesh_schema::uvSets()), 2u);
  EXPECT_EQ((setList<base::base_vec2<float>>(mesh, mesh_schema::uvSets(), 1, meshUVSet_schema::UV())[0]),
            (base::base_vec2<float>{0.75f, 1.0f}));
}

// texture_u/texture_v and texture_s/texture_t are texture coordinates too, in the import
// only: both ways of reading give the same sets, in property order, from binary and ASCII.
TEST(PlyImport, TextureNamesOfOtherToolsFillUVSets) {
  const std::string header =
      "element vertex 2\nproperty float x\nproperty float y\nproperty float z\n"
      "property float texture_u\nproperty float texture_v\nproperty float u\nproperty float v\n"
      "property double texture_s\nproperty double texture_t\nend_header\n";
  const std::string body = "0 0 0 0.25 0.5 1 2 0.125 0.0625\n1 1 1 0.75 1 3 4 0.5 0.375\n";
  for (bool plans : {true, false}) {
    LogCapture log(base::logWarning);
    ImportedScene imported = importText(asciiHeader + header + body, plans);
    base::AttribMap& mesh = imported.mesh();
    ASSERT_EQ(arraySize(mesh, mesh_schema::uvSets()), 3u);
    using UV = base::base_vec2<float>;
    EXPECT_EQ((setList<UV>(mesh, mesh_schema::uvSets(), 0, meshUVSet_schema::UV())),
              (base::vector<UV>{{0.25f, 0.5f}, {0.75f, 1}}));
    EXPECT_EQ((setList<UV>(mesh, mesh_schema::uvSets(), 1, meshUVSet_schema::UV())),
              (base::vector<UV>{{1, 2}, {3, 4}}));
    EXPECT_EQ((setList<UV>(mesh, mesh_schema::uvSets(), 2, meshUVSet_schema::UV())),
              (base::vector<UV>{{0.125f, 0.0625f}, {0.5f, 0.375f}}));
    // The header still calls them unknown, as it names them for everyone else.
    EXPECT_EQ(std::count_if(log.entries.begin(), log.entries.end(),
                            [](const auto& entry) { return entry.text.find("texture_") != std::string::npos; }),
              4);
  }
}

TEST(PlyImport, ColourGroupsWithAndWithoutAlphaStayApart) {
  ImportedScene imported =
      importText(asciiHeader +
                 "element vertex 1\nproperty float x\nproperty uchar diffuse_red\nproperty uchar diffuse_green\n"
                 "property uchar diffuse_blue\nproperty uchar red\nproperty uchar green\nproperty uchar blue\nproperty "
                 "uchar alpha\n"
                 "end_header\n0 255 255 255 0 0 255 51\n");
  base::AttribMap& mesh = imported.mesh();
  ASSERT_EQ(arraySize(mesh, mesh_schema::colorSets()), 2u);
  using Vec4 = base::base_vec4<float>;
  EXPECT_EQ(setList<Vec4>(mesh, mesh_schema::colorSets(), 0, meshColorSet_schema::RGBA())[0], (Vec4{1, 1, 1, 1}));
  const Vec4 plain = setList<Vec4>(mesh, mesh_schema::colorSets(), 1, meshColorSet_schema::RGBA())[0];
  EXPECT_EQ(plain.z, 1.0f);
  EXPECT_FLOAT_EQ(plain.w, 0.2f);
}

TEST(PlyImport, BadIndicesAreLoggedAndStoredAsZero) {
  LogCapture log(base::logError);
  ImportedScene imported =
      importText(asciiHeader +
                 "element vertex 3\nproperty float x\nelement face 1\nproperty list uchar int vertex_index\n"
                 "end_header\n0\n1\n2\n3 1 2 3\n");
  EXPECT_EQ(decodedIndices(imported.mesh()), (base::vector<std::uint32_t>{0, 1, 2}));
  ASSERT_FALSE(log.entries.empty());
  EXPECT_EQ(log.entries[0].text, "Invalid vertex index detected 3, max 3!");
}

TEST(PlyImport, FacesBeforeVerticesAreNotChecked) {
  ImportedScene imported = importText(asciiHeader +
                                      "element face 1\nproperty list uchar int vertex_index\n"
                                      "element vertex 2\nproperty float x\nend_header\n3 7 8 9\n0\n1\n");
  EXPECT_EQ(decodedIndices(imported.mesh()), (base::vector<std::uint32_t>{7, 8, 9}));
}

TEST(PlyImport, StripsEdgesAndSeveralIndexElementsShareOneList) {
  ImportedScene imported = importText(
      asciiHeader +
      "element vertex 8\nproperty float x\nelement tristrips 2\nproperty list int int vertex_indices\n"
      "element edge 2\nproperty list uchar int vertex_indices\nelement face 1\nproperty list uchar int vertex_indices\n"
      "end_header\n0\n1\n2\n3\n4\n5\n6\n7\n8 0 1 2 3 -1 4 5 6\n0\n2 7 6\n2 1 0\n3 5 6 7\n");
  ASSERT_EQ(arraySize(imported.mesh(), mesh_schema::primitives()), 3u);
  base::AttribMap& strips = imported.primitive(0);
  EXPECT_EQ(list<std::uint32_t>(strips, meshPrimitive_schema::ecounts()), (base::vector<std::uint32_t>{4, 3, 0}));
  EXPECT_EQ(*strips.findAttribute<std::uint32_t>(meshPrimitive_schema::indexStart()), 0u);
  EXPECT_EQ(*strips.findAttribute<std::uint32_t>(meshPrimitive_schema::indexCount()), 7u);
  base::AttribMap& edges = imported.primitive(1);
  EXPECT_EQ(*edges.findAttribute<std::uint16_t>(meshPrimitive_schema::vcounts()), 2u);
  EXPECT_EQ(*edges.findAttribute<std::uint32_t>(meshPrimitive_schema::indexStart()), 7u);
  EXPECT_EQ(*imported.primitive(2).findAttribute<std::uint32_t>(meshPrimitive_schema::indexStart()), 11u);
  // Strips stay as read; edges and faces are sorted within their own ranges.
  EXPECT_EQ(decodedIndices(imported.mesh()), (base::vector<std::uint32_t>{0, 1, 2, 3, 4, 5, 6, 0, 1, 6, 7, 5, 6, 7}));
  EXPECT_EQ(scene::getTriangleCount(imported.mesh()), 3u + 1u);
}

TEST(PlyImport, FacesOfUpTo65535Indices) {
  const std::string vertices =
      "element vertex 1\nproperty float x\nelement face 1\nproperty list uint int vertex_index\n"
      "end_header\n0\n";
  std::string zeros;
  for (int i = 0; i < 65535; ++i) zeros += " 0";
  EXPECT_TRUE(importText(asciiHeader + vertices + "65535" + zeros + "\n").loaded);
  const TemporaryFile tooLong("long.ply", asciiHeader + vertices + "65536" + zeros + " 0\n");
  ImportedScene scene;
  EXPECT_EQ(stream_tests::thrownText(
                [&] { testing_support::pluginFactory().load(*scene.scene, tooLong.path(), base::AttribMap()); }),
            "Trying to process more then 65535 vertex indices for a face. This is not supported, aborting!");
}

TEST(PlyImport, PerFaceDataLeavesTheVertexDataAlone) {
  LogCapture log(base::logWarning);
  ImportedScene imported = importText(
      asciiHeader +
      "element vertex 3\nproperty float x\nproperty float nx\nproperty float opacity\nelement face 1\n"
      "property list uchar int vertex_indices\nproperty float nx\nproperty uchar red\nproperty float opacity\n"
      "end_header\n0 1 0.5\n1 1 0.5\n2 1 0.5\n3 0 1 2 -5 255 0.25\n");
  EXPECT_EQ(list<base::normal>(imported.mesh(), mesh_schema::normals())[0].x, 1.0f);
  EXPECT_EQ(setList<float>(imported.mesh(), mesh_schema::colorSets(), 0, meshColorSet_schema::A())[0], 0.5f);
  // The face's red is a colour set of its own, one colour per face.
  EXPECT_EQ(setList<Vec3>(imported.mesh(), mesh_schema::colorSets(), 1, meshColorSet_schema::RGB()),
            (base::vector<Vec3>{{1, 0, 0}}));
  EXPECT_TRUE(std::none_of(log.entries.begin(), log.entries.end(),
                           [](const auto& entry) { return entry.text.find("Per face") != std::string::npos; }));
}

TEST(PlyImport, AVertexElementWithOnlyOpacityIsNotRead) {
  ImportedScene imported =
      importText(asciiHeader + "element vertex 2\nproperty float opacity\nend_header\n0.5\n0.25\n");
  EXPECT_EQ(setList<float>(imported.mesh(), mesh_schema::colorSets(), 0, meshColorSet_schema::A()),
            (base::vector<float>{0, 0}));
}

TEST(PlyImport, MaterialsFollowTheirFormulas) {
  ImportedScene imported =
      importText(asciiHeader +
                 "element vertex 1\nproperty float x\nelement material 4\nproperty uchar diffuse_red\nproperty uchar "
                 "diffuse_green\n"
                 "property uchar diffuse_blue\nproperty float specular_red\nproperty float specular_green\n"
                 "property float specular_blue\nproperty float specular_power\nproperty float opacity\nend_header\n0\n"
                 "255 128 0 0.3 0.6 0.9 64 1\n0 0 0 0 0 0 200 0.5\n0 0 0 0 0 0 -3 nan\n0 0 0 0 0 0 nan 1\n");
  std::vector<base::IPlugin*> materials;
  for (const auto& object : imported.scene->objects()) {
    if (object->mapType() == principalMaterial_schema::typeName()) materials.push_back(object.get());
  }
  // The last two entries make equal materials: they share one.
  ASSERT_EQ(materials.size(), 3u);
  const Vec3 colour = *materials[0]->findAttribute<Vec3>(principalMaterial_schema::color());
  EXPECT_EQ(colour.x, 1.0f);
  EXPECT_FLOAT_EQ(colour.y, 0.5019608f);
  EXPECT_EQ(colour.z, 0.0f);
  EXPECT_EQ(*materials[0]->findAttribute<float>(principalMaterial_schema::reflectionAmount()),
            (0.6f + 0.3f + 0.9f) * 0.33333f);
  EXPECT_EQ(*materials[0]->findAttribute<float>(principalMaterial_schema::roughness()), 0.5f);
  EXPECT_EQ(materials[0]->findAttribute<Vec3>(principalMaterial_schema::visibilityMap()), nullptr);
  EXPECT_EQ(*materials[1]->findAttribute<float>(principalMaterial_schema::roughness()), 1.0f);
  EXPECT_EQ(*materials[1]->findAttribute<Vec3>(principalMaterial_schema::visibilityMap()), (Vec3{0.5f, 0.5f, 0.5f}));
  EXPECT_EQ(*materials[2]->findAttribute<float>(principalMaterial_schema::roughness()), 0.0f);
  EXPECT_EQ(materials[2]->findAttribute<Vec3>(principalMaterial_schema::visibilityMap()), nullptr);  // NaN is opaque
  const auto& attached = list<base::ref<base::IPlugin>>(imported.primitive(0), meshPrimitive_schema::materials());
  ASSERT_EQ(attached.size(), 4u);
  EXPECT_EQ(attached[0].get(), materials[0]);
  EXPECT_EQ(attached[2].get(), materials[2]);
  EXPECT_EQ(attached[3].get(), materials[2]);
}

TEST(PlyImport, MaterialsCostNoMoreThanTheirShareOfTheMemoryBound) {
  // A million one-byte entries of 256 values make 256 materials; distinct floats beyond what
  // the element's bytes allow are refused before any is made.
  const auto materialFile = [](std::uint32_t count, const std::string& type, const std::string& body) {
    return "ply\nformat binary_little_endian 1.0\nelement material " + std::to_string(count) + "\nproperty " + type +
           " diffuse_red\nend_header\n" + body;
  };
  std::string bytes(1000000, '\0');
  for (std::size_t k = 0; k < bytes.size(); ++k) bytes[k] = static_cast<char>(k * 7);
  const ImportedScene shared = importText(materialFile(1000000, "uchar", bytes));
  std::size_t made = 0;
  for (const auto& object : shared.scene->objects()) made += object->mapType() == principalMaterial_schema::typeName();
  EXPECT_EQ(made, 256u);
  EXPECT_EQ(list<base::ref<base::IPlugin>>(shared.primitive(0), meshPrimitive_schema::materials()).size(), 1000000u);
  std::string floats;
  for (std::uint32_t k = 0; k < 100000; ++k) {
    const float value = static_cast<float>(k);
    floats.append(reinterpret_cast<const char*>(&value), 4);
  }
  testing_support::LogCapture quiet;
  const std::string refused = stream_tests::thrownText([&] { importText(materialFile(100000, "float", floats)); });
  EXPECT_NE(refused.find("element 'material': its 100000 instances hold more than 11317 distinct materials"),
            std::string::npos)
      << refused;
}

TEST(PlyImport, ASpecularPowerAloneMakesNoMaterial) {
  ImportedScene imported =
      importText(asciiHeader + "element material 1\nproperty uchar specular_power\nend_header\n255\n");
  EXPECT_EQ(imported.first(principalMaterial_schema::typeName()), nullptr);
  EXPECT_EQ(imported.primitive(0).findMember(meshPrimitive_schema::materials()), nullptr);
}

TEST(PlyImport, ABinaryBodyThatEndsEarlyKeepsWhatWasRead) {
  std::string file =
      "ply\nformat binary_little_endian 1.0\nelement vertex 1\nproperty float x\nelement face 2\n"
      "property list uchar int vertex_indices\nend_header\n";
  const float x = 4.5f;
  file.append(reinterpret_cast<const char*>(&x), sizeof x);
  file += std::string("\x03\0\0\0\0\0\0\0\0\0\0\0\0\x03\0\0", 16);
  LogCapture log(base::logWarning);
  ImportedScene imported = importText(file);
  ASSERT_TRUE(imported.loaded);
  EXPECT_EQ(list<Vec3>(imported.mesh(), mesh_schema::positions())[0].x, 4.5f);
  EXPECT_EQ(decodedIndices(imported.mesh()), (base::vector<std::uint32_t>{0, 0, 0}));
  ASSERT_GE(log.entries.size(), 1u);
  EXPECT_EQ(log.entries.back().text, "The data ends early in element 'face': 1 of 2 instances read");
}

TEST(PlyImport, AFailingHeaderFailsTheImportAndLeavesNothing) {
  LogCapture log;
  const TemporaryFile file("bad.ply", asciiHeader + "element vertex 1\nproperty int64 x\nend_header\n1\n");
  ImportedScene scene;
  const std::string text = stream_tests::thrownText(
      [&] { testing_support::pluginFactory().load(*scene.scene, file.path(), base::AttribMap()); });
  EXPECT_EQ(text, file.path() + ": the PLY header is invalid");
  EXPECT_TRUE(std::none_of(scene.scene->objects().begin(), scene.scene->objects().end(),
                           [](const auto& object) { return object != nullptr; }));
}

TEST(PlyImport, ASceneThatCannotMakeTheNeededTypesFailsClearly) {
  LogCapture log;
  const TemporaryFile file("points.ply", asciiHeader + "element vertex 1\nproperty float x\nend_header\n1\n");
  base::PluginFactory bare("bare");
  EXPECT_EQ(
      stream_tests::thrownText([&] { testing_support::pluginFactory().load(bare, file.path(), base::AttribMap()); }),
      "the scene has no type 'mesh', which a PLY import needs");
}

TEST(PlyImport, TheImporterObject) {
  scene::SceneFactory& factory = testing_support::pluginFactory();
  ASSERT_EQ(factory.scenePlugins().size(), 1u);
  EXPECT_EQ(factory.scenePlugins()[0]->getImporterExtensions(), "ply;ply.gz");
  EXPECT_EQ(factory.scenePlugins()[0]->getExporterExtensions(), "ply");
  EXPECT_EQ(factory.scenePlugins()[0]->author, "Tarn Velisk");
  const base::ref<base::IPlugin> importer = factory.create(base::intern("PlyImporter"));
  ASSERT_TRUE(scene::importerOf(*importer));
  // The same object writes: its exporter part is a part of its own.
  ASSERT_TRUE(scene::exporterOf(*importer));
  EXPECT_NE(static_cast<void*>(scene::exporterOf(*importer)), static_cast<void*>(scene::importerOf(*importer)));

  base::AttribMap parameters;
  scene::importerOf(*importer)->getParameters(parameters);
  // The seven, and the switch for properties that no semantic claims, off.
  EXPECT_EQ(parameters.size(), 8u);
  EXPECT_EQ(*parameters.findAttribute<std::uint8_t>(scene::sceneImporter_schema::importNormals()), 2u);
  EXPECT_FALSE(*parameters.findAttribute<bool>(base::intern("importCustomProperties")));
  EXPECT_EQ(parameters.mapType(), scene::sceneImporter_schema::typeName());

  const TemporaryFile upper("a.ply", "\r\n  PLY\nformat");
  EXPECT_TRUE(scene::importerOf(*importer)->canImport(upper.path()));
  const TemporaryFile tooShort("b.ply", "pl");
  EXPECT_FALSE(scene::importerOf(*importer)->canImport(tooShort.path()));
  const TemporaryFile blank("c.ply", " \n");
  EXPECT_FALSE(scene::importerOf(*importer)->canImport(blank.path()));
  EXPECT_THROW(scene::importerOf(*importer)->canImport(upper.path() + ".none"), base::fs::file_not_found);
  factory.remove(importer->index());
}

}  // namespace
