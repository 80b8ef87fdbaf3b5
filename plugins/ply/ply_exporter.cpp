#include "ply_exporter.h"

#include "b_attrib_array.h"
#include "b_exception.h"
#include "b_fs.h"
#include "b_log.h"
#include "ply_mesh_layout.h"
#include "scene_mesh.h"
#include "scene_schema.h"

#include <fmt/format.h>

namespace ply {
namespace {

using scene::sceneExporter_schema;

// The exporter's own parameters, beside the schema's; interned once.
struct OwnParameters {
  base::name_id bigEndian = base::intern("exportBigEndian");
  base::name_id materials = base::intern("exportMaterials");
  base::name_id customProperties = base::intern("exportCustomProperties");
  base::name_id mergeMeshes = base::intern("exportMergeMeshes");
};
const OwnParameters& own() {
  static const OwnParameters names;
  return names;
}

bool flag(const base::AttribMap& parameters, base::name_id name, bool otherwise) {
  const bool* value = parameters.findAttribute<bool>(name);
  return value ? *value : otherwise;
}

ExportOptions optionsOf(const base::AttribMap& parameters) {
  ExportOptions options;
  const bool binary = flag(parameters, sceneExporter_schema::exportBinary(), true);
  const bool big = flag(parameters, own().bigEndian, false);
  options.encoding = !binary ? Encoding::ascii : big ? Encoding::binaryBigEndian : Encoding::binaryLittleEndian;
  options.colors = flag(parameters, sceneExporter_schema::exportColors(), true);
  options.textureCoordinates = flag(parameters, sceneExporter_schema::exportTextureCoordinates(), true);
  options.edges = flag(parameters, sceneExporter_schema::exportEdges(), true);
  options.materials = flag(parameters, own().materials, true);
  options.customProperties = flag(parameters, own().customProperties, true);
  return options;
}

// Whether the mesh has faces, strips or edges: anything but points.
bool hasSurface(const base::AttribMap& mesh) {
  const base::AttribArray* primitives = scene::findArrayMember(mesh, scene::mesh_schema::primitives());
  for (std::uint32_t k = 0; primitives && k < primitives->size(); ++k) {
    const base::AttribMap* primitive = scene::mapAt(*primitives, k);
    if (primitive &&
        scene::valueOf<std::uint32_t>(*primitive, scene::meshPrimitive_schema::indexCount()).value_or(0) > 0) {
      return true;
    }
  }
  return false;
}

// The path of the k-th file of an export to `path`: `path` itself, then name-1.ply, ...
std::string pathOf(std::string_view path, std::size_t k) {
  if (k == 0) return std::string(path);
  const std::size_t slash = path.find_last_of("/\\");
  const std::size_t dot = path.find_last_of('.');
  const std::size_t stem =
      dot != std::string_view::npos && (slash == std::string_view::npos || dot > slash) ? dot : path.size();
  return fmt::format("{}-{}{}", path.substr(0, stem), k, path.substr(stem));
}

// Writes the file under a temporary name beside `path`, then puts it in place: a reader
// never sees a half-written file under the final name, and a failed write leaves none.
void writeReplacing(const std::string& path, const std::vector<WriteElement>& elements, Encoding encoding) {
  const std::string partial = path + ".partial";
  base::fs::MasterFS& files = base::fs::master();
  try {
    {
      base::Stream file = files.open(partial, base::fs::openWrite | base::fs::openCreate | base::fs::openTruncate);
      file.flags |= base::throwOnShortWrite;
      const std::string comments[] = {"written by Meshport"};
      writePly(file, encoding, elements, comments);
    }
    files.replace(partial, path);
  } catch (const base::exception& error) {
    try {
      if (files.fileExists(partial)) files.remove(partial, false);
    } catch (const base::exception&) {
      // The write's failure is the one to report.
    }
    base::raise<base::exception>("ply::PLYExporter::exportScene",
                                 fmt::format("{}: cannot write the file: {}", path, error.what()));
  }
}

}  // namespace

void PLYExporter::getParameters(base::AttribMap& parameters) {
  parameters.attribute<bool>(sceneExporter_schema::exportBinary(), true);
  parameters.attribute<bool>(own().bigEndian, false);
  parameters.attribute<bool>(sceneExporter_schema::exportColors(), true);
  parameters.attribute<bool>(sceneExporter_schema::exportTextureCoordinates(), true);
  parameters.attribute<bool>(sceneExporter_schema::exportEdges(), true);
  parameters.attribute<bool>(sceneExporter_schema::exportPoints(), true);
  parameters.attribute<bool>(own().materials, true);
  parameters.attribute<bool>(own().customProperties, true);
  parameters.attribute<bool>(own().mergeMeshes, false);
  parameters.setMapType(sceneExporter_schema::typeName());
}

bool PLYExporter::exportScene(base::PluginFactory& scene, std::string_view path) {
  const ExportOptions options = optionsOf(m_parameters);
  const bool points = flag(m_parameters, sceneExporter_schema::exportPoints(), true);
  std::vector<const base::AttribMap*> meshes;
  for (const base::ref<base::IPlugin>& object : scene.objects()) {
    if (object && object->mapType() == scene::mesh_schema::typeName() && (points || hasSurface(*object))) {
      meshes.push_back(object.get());
    }
  }
  if (meshes.empty()) {
    base::raise<base::exception>("ply::PLYExporter::exportScene",
                                 fmt::format("{}: the scene holds no mesh to write", path));
  }
  // One file per mesh unless asked: each file then holds its mesh as it is, whatever the
  // others hold, and a scene of one mesh (every PLY import gives one) writes exactly `path`.
  std::unique_ptr<base::AttribMap> merged;
  if (meshes.size() > 1 && flag(m_parameters, own().mergeMeshes, false)) {
    try {
      merged = mergedMesh(meshes);
    } catch (const base::exception& error) {
      base::raise<base::exception>("ply::PLYExporter::exportScene", fmt::format("{}: {}", path, error.what()));
    }
    meshes = {merged.get()};
  }
  for (std::size_t k = 0; k < meshes.size(); ++k) {
    const std::string target = pathOf(path, k);
    base::log().message(base::logScene, base::logDebug, "Writing mesh {} to '{}'.", k, target);
    try {
      const MeshLayout layout(*meshes[k], options);
      writeReplacing(target, layout.elements(), options.encoding);
    } catch (const base::exception& error) {
      const std::string_view what = error.what();
      if (what.starts_with(target + ": ")) throw;
      base::raise<base::exception>("ply::PLYExporter::exportScene", fmt::format("{}: {}", target, what));
    }
  }
  return true;
}

}  // namespace ply
