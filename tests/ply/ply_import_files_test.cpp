// Every test and corpus file imported both ways (column plans, and every value delivered one
// by one) gives the same scene, and the scene holds what a raw read of the file holds:
// positions bit for bit, and the faces as a multiset, each up to rotation with its winding.

#include "b_vec.h"
#include "log_capture.h"
#include "ply_parser.h"
#include "scene_import.h"
#include "scene_validation.h"
#include "thrown.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <bit>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <map>
#include <string>
#include <vector>

namespace {

namespace stdfs = std::filesystem;
using scene::mesh_schema;
using testing_support::ImportedScene;
using testing_support::importFile;
using testing_support::LogCapture;

std::vector<stdfs::path> plyFiles() {
  std::vector<stdfs::path> files;
  for (const char* folder : {"valid", "invalid"}) {
    for (const auto& entry : stdfs::directory_iterator(stdfs::path(MESHPORT_TEST_DATA) / "ply" / folder)) {
      if (entry.path().extension() == ".ply") files.push_back(entry.path());
    }
  }
  const stdfs::path corpus = stdfs::path(MESHPORT_CORPUS) / "files";
  if (stdfs::exists(corpus)) {
    for (const auto& entry : stdfs::directory_iterator(corpus)) {
      if (entry.path().extension() == ".ply") files.push_back(entry.path());
    }
  }
  std::sort(files.begin(), files.end());
  return files;
}

// The scene as JSON, or the failure's text.
std::string outcome(const stdfs::path& path, bool plans) {
  try {
    const ImportedScene imported = importFile(path.string(), plans);
    return imported.loaded ? imported.json() : "not imported";
  } catch (const base::exception& error) {
    return std::string("failed: ") + error.what();
  }
}

// What a raw read sees: the x, y, z of the last vertex element that has them, as floats, and
// every index list of the index elements that a mesh primitive can take.
struct RawRead {
  std::vector<float> xyz;
  std::vector<std::vector<std::uint32_t>> faces;
  bool complete = false;

  bool plyElement(const ply::Element& element) {
    m_vertices = element.semantic == ply::ElementSemantic::vertex;
    m_faces = element.semantic == ply::ElementSemantic::face || element.semantic == ply::ElementSemantic::edge;
    if (m_vertices) {
      m_hasX = std::any_of(element.properties.begin(), element.properties.end(),
                           [](const ply::Property& p) { return p.semantic == ply::PropertySemantic::x; });
      if (m_hasX) xyz.assign(std::size_t(element.count) * 3, 0.0f);
    }
    return m_vertices || m_faces;
  }
  void beginInstance(std::uint32_t index) { m_instance = index; }
  void plyProperty(const ply::Element&, const ply::Property& property, const ply::ValueArray& values) {
    const auto semantic = static_cast<std::uint32_t>(property.semantic);
    if (m_vertices && m_hasX && semantic <= 2 && !property.isList) {
      xyz[std::size_t(m_instance) * 3 + semantic] = values[0].convertTo<float>(property.type);
    } else if (m_faces && property.semantic == ply::PropertySemantic::vertexIndex) {
      std::vector<std::uint32_t> face;
      for (const ply::Value& value : values)
        face.push_back(static_cast<std::uint32_t>(value.convertTo<std::int64_t>(property.type)));
      faces.push_back(face);
    }
  }

 private:
  bool m_vertices = false, m_faces = false, m_hasX = false;
  std::uint32_t m_instance = 0;
};

std::vector<std::uint32_t> smallestRotation(std::vector<std::uint32_t> face) {
  std::vector<std::uint32_t> smallest = face;
  for (std::size_t k = 1; k < face.size(); ++k) {
    std::rotate(face.begin(), face.begin() + 1, face.end());
    smallest = std::min(smallest, face);
  }
  return smallest;
}

// The faces of the mesh's primitives that hold faces or edges, decoded.
std::vector<std::vector<std::uint32_t>> importedFaces(base::AttribMap& mesh) {
  scene::decodeIndexDeltas(mesh);
  std::vector<std::vector<std::uint32_t>> faces;
  const auto* indices = mesh.findVecAttribute<std::uint32_t>(mesh_schema::indices());
  const base::AttribArray* primitives = scene::findArrayMember(mesh, mesh_schema::primitives());
  for (std::uint32_t p = 0; indices && primitives && p < primitives->size(); ++p) {
    const base::AttribMap& primitive = *scene::mapAt(*primitives, p);
    const scene::FaceCounts counts = scene::faceCountsOf(primitive);
    if (!counts.present() || primitive.findMember(scene::meshPrimitive_schema::ecounts())) continue;
    std::uint32_t at = *scene::scalarMember<std::uint32_t>(primitive, scene::meshPrimitive_schema::indexStart());
    const std::uint32_t end =
        at + *scene::scalarMember<std::uint32_t>(primitive, scene::meshPrimitive_schema::indexCount());
    for (std::size_t f = 0; at < end; ++f) {
      const std::uint32_t n = counts.perFace ? (*counts.perFace)[f] : *counts.uniform;
      faces.emplace_back(indices->begin() + at, indices->begin() + at + n);
      at += n;
    }
  }
  return faces;
}

class ImportedFile : public ::testing::TestWithParam<stdfs::path> {};

TEST_P(ImportedFile, PlansAndPerPropertyPathGiveTheSameScene) {
  LogCapture quiet;
  const std::string planned = outcome(GetParam(), true);
  const std::string delivered = outcome(GetParam(), false);
  EXPECT_EQ(planned.size(), delivered.size());
  EXPECT_TRUE(planned == delivered) << planned.substr(0, 400) << "\n---\n" << delivered.substr(0, 400);
}

TEST_P(ImportedFile, HoldsWhatARawReadSees) {
  LogCapture quiet;
  RawRead raw;
  ply::Header header;
  base::Stream file = base::fs::master().open(GetParam().string(), base::fs::openForReading);
  const ply::ReadResult read = ply::readFile(header, file, raw);
  ImportedScene imported;
  try {
    imported = importFile(GetParam().string());
  } catch (const base::exception&) {
    // Refused files (a failing header, a face too long) are the path test's business.
    return;
  }
  if (!imported.loaded || read != ply::ReadResult::complete) return;
  base::AttribMap& mesh = imported.mesh();
  const auto* positions = mesh.findVecAttribute<base::base_vec3<float>>(mesh_schema::positions());
  if (!raw.xyz.empty()) {
    ASSERT_NE(positions, nullptr);
    ASSERT_EQ(positions->size() * 3, raw.xyz.size());
    for (std::size_t i = 0; i < positions->size(); ++i) {
      const base::base_vec3<float>& p = (*positions)[i];
      EXPECT_EQ(std::bit_cast<std::uint32_t>(p.x), std::bit_cast<std::uint32_t>(raw.xyz[3 * i])) << "vertex " << i;
      EXPECT_EQ(std::bit_cast<std::uint32_t>(p.z), std::bit_cast<std::uint32_t>(raw.xyz[3 * i + 2])) << "vertex " << i;
    }
  }
  // Bad indices become 0 in the scene: compare only files whose indices are all in range.
  const std::size_t vertices = positions ? positions->size() : 0;
  const bool inRange = std::all_of(raw.faces.begin(), raw.faces.end(), [&](const auto& face) {
    return std::all_of(face.begin(), face.end(), [&](std::uint32_t index) { return !positions || index < vertices; });
  });
  const bool faceSizes =
      std::all_of(raw.faces.begin(), raw.faces.end(), [](const auto& face) { return face.size() >= 3; });
  if (!inRange || !faceSizes) return;
  std::vector<std::vector<std::uint32_t>> expected, actual;
  for (const auto& face : raw.faces) expected.push_back(smallestRotation(face));
  for (const auto& face : importedFaces(mesh)) actual.push_back(smallestRotation(face));
  std::sort(expected.begin(), expected.end());
  std::sort(actual.begin(), actual.end());
  EXPECT_EQ(actual, expected);
}

INSTANTIATE_TEST_SUITE_P(Files, ImportedFile, ::testing::ValuesIn(plyFiles()),
                         [](const ::testing::TestParamInfo<stdfs::path>& info) {
                           std::string name =
                               info.param.parent_path().filename().string() + "_" + info.param.stem().string();
                           for (char& c : name) {
                             if (!std::isalnum(static_cast<unsigned char>(c))) c = '_';
                           }
                           return name;
                         });

// Every valid test file imports into a mesh that validates without a single finding.
TEST(ValidFiles, ImportAndValidateClean) {
  for (const auto& entry : stdfs::directory_iterator(stdfs::path(MESHPORT_TEST_DATA) / "ply" / "valid")) {
    if (entry.path().extension() != ".ply") continue;
    const ImportedScene imported = importFile(entry.path().string());
    ASSERT_TRUE(imported.loaded) << entry.path();
    LogCapture findings(base::logWarning);
    EXPECT_TRUE(scene::validateMesh(imported.mesh())) << entry.path();
    for (const auto& finding : findings.entries) ADD_FAILURE() << entry.path().filename() << ": " << finding.text;
  }
}

// Every valid test file cut after each of its bytes (inside the header, inside a value, a
// list count, a list, between instances and between elements): both paths give the same
// scene or the same refusal, and nothing but a base::exception comes out.
TEST(TruncatedFiles, ImportAlikeAtEveryLength) {
  LogCapture quiet;
  for (const auto& entry : stdfs::directory_iterator(stdfs::path(MESHPORT_TEST_DATA) / "ply" / "valid")) {
    if (entry.path().extension() != ".ply") continue;
    std::ifstream source(entry.path(), std::ios::binary);
    const std::string content((std::istreambuf_iterator<char>(source)), std::istreambuf_iterator<char>());
    testing_support::TemporaryFile cut("cut.ply", "");
    for (std::size_t length = 0; length < content.size(); ++length) {
      std::ofstream(cut.path(), std::ios::binary | std::ios::trunc) << content.substr(0, length);
      ASSERT_EQ(outcome(cut.path(), true), outcome(cut.path(), false))
          << entry.path().filename() << " cut to " << length << " bytes";
    }
  }
}

}  // namespace
