#include "ply_loader.h"

#include "b_box.h"
#include "b_exception.h"
#include "b_fs.h"
#include "b_plugin_attribute.h"
#include "b_progress.h"
#include "b_timecode.h"
#include "scene_index_delta.h"
#include "scene_mesh.h"
#include "scene_schema.h"

#include <fmt/format.h>

#include <cctype>
#include <limits>

namespace ply {
namespace {

using scene::mesh_schema;
using scene::meshPrimitive_schema;
using scene::node_schema;
using scene::scene_schema;
using scene::sceneImporter_schema;

// Not one of the seven parameters: tests turn the column plans off with it to compare both
// paths of the reader.
base::name_id columnPlansParameter() {
  static const base::name_id name = base::intern("plyColumnPlans");
  return name;
}

// Beside the seven: keeps the properties that no semantic claims (ply_custom_properties.cpp).
base::name_id customPropertiesParameter() {
  static const base::name_id name = base::intern("importCustomProperties");
  return name;
}

bool isBlank(std::uint8_t c) { return c == ' ' || c == '\t' || c == '\r' || c == '\n'; }

// The box of the positions, inverted (largest float to its negative) when there are none.
base::base_box<base::base_vec3<double>> boundsOf(const base::vector<base::base_vec3<float>>* positions) {
  constexpr float largest = std::numeric_limits<float>::max();
  base::base_vec3<float> low{largest, largest, largest};
  base::base_vec3<float> high{-largest, -largest, -largest};
  for (std::size_t i = 0; positions && i < positions->size(); ++i) {
    const base::base_vec3<float>& p = (*positions)[i];
    // Written so that a component that is not a number changes nothing.
    if (p.x < low.x) low.x = p.x;
    if (p.y < low.y) low.y = p.y;
    if (p.z < low.z) low.z = p.z;
    if (p.x > high.x) high.x = p.x;
    if (p.y > high.y) high.y = p.y;
    if (p.z > high.z) high.z = p.z;
  }
  return {{low.x, low.y, low.z}, {high.x, high.y, high.z}};
}

}  // namespace

PLYImporter::PLYImporter(base::PluginFactory* factory, base::IPluginDesc* descriptor, std::uint32_t index)
    : SceneImportPlugin(factory, descriptor, index) {}

PLYImporter::~PLYImporter() = default;

base::IPluginInterface* PLYImporter::queryInterface(base::name_id name) const {
  if (name == scene::sceneExporterInterface()) return const_cast<PLYExporter*>(&m_exporter);
  return SceneImportPlugin::queryInterface(name);
}

bool PLYImporter::canImport(std::string_view path) {
  base::Stream stream = base::fs::master().open(path, base::fs::openForReading);
  std::uint8_t byte = 0;
  while (stream.read(&byte, 1) == 1 && isBlank(byte)) {
  }
  if (isBlank(byte)) return false;
  char magic[3] = {static_cast<char>(byte), 0, 0};
  if (stream.read(magic + 1, 2) != 2) return false;
  for (int k = 0; k < 3; ++k) {
    if (std::tolower(static_cast<unsigned char>(magic[k])) != "ply"[k]) return false;
  }
  return true;
}

void PLYImporter::getParameters(base::AttribMap& parameters) {
  parameters.attribute<bool>(sceneImporter_schema::importMeshes(), true);
  parameters.attribute<bool>(sceneImporter_schema::importTriangulateMeshes(), false);
  parameters.attribute<bool>(sceneImporter_schema::importColors(), true);
  parameters.attribute<bool>(sceneImporter_schema::importTextureCoordinates(), true);
  parameters.attribute<std::uint8_t>(sceneImporter_schema::importNormals(), 2);
  parameters.attribute<bool>(sceneImporter_schema::importMaterials(), true);
  parameters.attribute<bool>(sceneImporter_schema::importPoints(), true);
  parameters.attribute<bool>(customPropertiesParameter(), false);
  parameters.setMapType(sceneImporter_schema::typeName());
}

base::ref<base::IPlugin> PLYImporter::createRequired(base::PluginFactory& factory, base::name_id type) {
  base::ref<base::IPlugin> object =
      factory.create(type, base::PluginFactory::createOrNull | base::PluginFactory::reportFailure);
  if (!object) {
    base::raise<base::exception>("ply::PLYImporter::importScene",
                                 fmt::format("the scene has no type '{}', which a PLY import needs", base::text(type)));
  }
  return object;
}

bool PLYImporter::importScene(base::PluginFactory& factory, std::string_view path) {
  syncAttribute(sceneImporter_schema::importMeshes(), m_importMeshes);
  syncAttribute(sceneImporter_schema::importTriangulateMeshes(), m_importTriangulateMeshes);
  syncAttribute(sceneImporter_schema::importColors(), m_importColors);
  syncAttribute(sceneImporter_schema::importTextureCoordinates(), m_importTextureCoordinates);
  syncAttribute(sceneImporter_schema::importNormals(), m_importNormals);
  syncAttribute(sceneImporter_schema::importMaterials(), m_importMaterials);
  syncAttribute(sceneImporter_schema::importPoints(), m_importPoints);
  syncAttribute(customPropertiesParameter(), m_importCustomProperties);
  if (const bool* plans = findAttribute<bool>(columnPlansParameter())) m_columnPlans = *plans;

  m_positionsList = nullptr;
  m_normalsList = nullptr;
  m_indicesList = nullptr;
  m_vcountsList = nullptr;
  m_customLists.clear();
  m_faceReorders.clear();
  m_faceChannels.clear();
  const base::Stream file = base::fs::master().open(path, base::fs::openForReading);
  m_sized = file.has(base::capSize);
  base::Stream stream = base::progressStream(file, fmt::format("Importing {}", path));
  m_currentMesh = createRequired(factory, mesh_schema::typeName());

  Header header;
  ReadResult read;
  try {
    read = readFile(header, stream, *this);
  } catch (...) {
    // The data could not be read (damaged compressed data, say): the import fails whole.
    factory.remove(m_currentMesh->index());
    throw;
  }
  finishElement();
  if (read == ReadResult::headerFailed) {
    // Nothing of a file whose header fails is imported: its empty mesh goes again.
    factory.remove(m_currentMesh->index());
    base::raise<base::exception>("ply::PLYImporter::importScene", fmt::format("{}: the PLY header is invalid", path));
  }
  finishPrimitives();
  base::log().message(base::logScene, base::logDebug, "Encoding the index deltas.");
  encodeWithFaceOrder();
  base::log().message(base::logScene, base::logDebug, "Building the scene.");
  createMaterials(factory);
  buildScene(factory);
  return true;
}

void PLYImporter::finishPrimitives() {
  padFaceChannels();
  base::AttribArray& primitives = scene::arrayMember(*m_currentMesh, mesh_schema::primitives());
  if (primitives.size() == 0) {
    base::AttribMap& points = scene::appendMap(primitives);
    points.attribute<std::uint16_t>(meshPrimitive_schema::vcounts(), 1);
    points.attribute<std::uint8_t>(meshPrimitive_schema::topology(), 0);
    return;
  }
  // A count list whose counts are all one non-zero value becomes that single value.
  for (std::uint32_t i = 0; i < primitives.size(); ++i) {
    base::AttribMap* primitive = scene::mapAt(primitives, i);
    const scene::FaceCounts counts = primitive ? scene::faceCountsOf(*primitive) : scene::FaceCounts{};
    if (!counts.perFace || counts.perFace->empty()) continue;
    const std::uint16_t first = counts.perFace->front();
    if (first == 0 ||
        std::any_of(counts.perFace->begin(), counts.perFace->end(), [first](auto n) { return n != first; })) {
      continue;
    }
    primitive->attribute<std::uint16_t>(meshPrimitive_schema::vcounts(), first);
  }
}

void PLYImporter::buildScene(base::PluginFactory& factory) {
  const base::base_box<base::base_vec3<double>> bounds = boundsOf(m_positionsList);
  m_currentMesh->attribute(mesh_schema::bounds(), bounds);

  base::ref<base::IPlugin> root = createRequired(factory, node_schema::typeName());
  root->attribute<base::string>(node_schema::name(), "root");
  root->attribute(node_schema::bounds(), bounds);
  root->attribute(node_schema::children(), base::vector<base::ref<base::IPlugin>>{m_currentMesh});

  base::ref<base::IPlugin> sceneObject = createRequired(factory, scene_schema::typeName());
  sceneObject->attribute<base::string>(scene_schema::name(), "scene");
  sceneObject->attribute(scene_schema::root(), root);
  sceneObject->attribute<std::uint8_t>(scene_schema::upAxis(), 1);
  sceneObject->attribute(scene_schema::time(), base::TimeCode{});
  sceneObject->attribute<bool>(node_schema::isLayer(), true);
}

}  // namespace ply
