// meshport.import_scene and meshport.Scene: a real import through the scene plug-ins, and a
// view of what it gave whose number lists are NumPy arrays over the scene's own storage.

#include "b_attribute_desc.h"
#include "b_fs.h"
#include "b_path.h"
#include "bindings.h"
#include "python_bridge.h"
#include "python_values.h"
#include "scene_factory.h"
#include "scene_index_delta.h"
#include "scene_mesh.h"
#include "scene_schema.h"
#include "scene_schema_registry.h"
#include "scene_summary.h"

#include <fmt/format.h>

#include <map>
#include <memory>
#include <mutex>
#include <utility>
#include <vector>

#include <pybind11/stl/filesystem.h>

#include <filesystem>

namespace pymeshport {
namespace {

using scene::mesh_schema;
using Parameters = std::vector<std::pair<std::string, std::string>>;

// The plug-ins and their data, loaded once per process from the package's own folder: the
// scene_* libraries lie beside the extension module and data/ inside the package. They stay
// loaded until the process ends, as scenes that Python frees late may still use their code.
class Plugins {
 public:
  static Plugins& get(const std::string& home) {
    static Plugins* loaded = new Plugins(home);
    return *loaded;
  }

 private:
  explicit Plugins(const std::string& home) {
    base::attribDescManager().loadFolder(home + "/data/attributes/");
    factory.reloadPlugins(home, home + "/data/importers.txt");
  }

 public:
  scene::SceneFactory factory;
  std::mutex importing;  // the factory lists its temporary objects: one import at a time
};

// The folder of the package, where this module lies.
std::string packageHome() {
  const std::string file = py::module_::import("meshport._meshport").attr("__file__").cast<std::string>();
  return std::string(base::getDirectory(file));
}

// The importer's parameters with `entries` applied, each read by its parameter's type.
void applyParameters(const Parameters& entries, base::AttribMap& parameters) {
  for (const auto& [name, value] : entries) {
    base::Attribute** slot = parameters.findAttributeMutable(base::intern(name));
    if (!slot || !*slot) {
      std::string known;
      for (const auto& member : parameters.members())
        known += fmt::format("{}{}", known.empty() ? "" : ", ", base::text(member.first));
      throw CallError(
          {CallFailure::Kind::badParameter,
           fmt::format("import_scene() got an unexpected parameter '{}' (the importer's: {})", name, known)});
    }
    if (!(*slot)->fromString(value)) {
      throw CallError({CallFailure::Kind::badParameterValue, fmt::format("import_scene() parameter {}: '{}' is no {}",
                                                                         name, value, base::text((*slot)->type()))});
    }
  }
}

// A Python keyword argument as the text a parameter reads.
std::string parameterText(const py::handle& value) {
  if (py::isinstance<py::bool_>(value)) return value.cast<bool>() ? "true" : "false";
  return py::str(value).cast<std::string>();
}

struct SceneObject {
  std::uint32_t index = 0;
  std::string type;
  py::dict attributes;
};

class Scene {
 public:
  Scene(Plugins& plugins, std::string path, bool decode)
      : m_plugins(plugins), m_scene(new base::PluginFactory("scene")), m_path(std::move(path)), m_decode(decode) {
    scene::register_scene_schema(*m_scene);
  }

  // Runs the import; false when no importer took the file.
  bool load(const Parameters& entries) {
    const std::lock_guard lock(m_plugins.importing);
    if (!base::fs::master().fileExists(m_path)) {
      throw CallError({CallFailure::Kind::notFound, fileMessage(m_path, "no such file")});
    }
    base::AttribMap parameters;
    if (!m_plugins.factory.getImporterParameters(m_path, parameters)) {
      throw CallError({CallFailure::Kind::unsupported,
                       fileMessage(m_path, fmt::format("no scene plug-in imports this kind of file (plug-ins read: {})",
                                                       m_plugins.factory.getSupportedExtensions(true)))});
    }
    applyParameters(entries, parameters);
    return m_plugins.factory.load(*m_scene, m_path, parameters);
  }

  py::list objects(const py::object& self) {
    const ListArrayMaker sharedArray = [&self](const base::Attribute&, const void* data, std::size_t rows,
                                               std::size_t width, const py::dtype& dtype) {
      return readOnly(dtype, data, rows, width, self);
    };
    py::list objects;
    for (const base::ref<base::IPlugin>& object : m_scene->objects()) {
      if (!object) continue;
      SceneObject view{object->index(), std::string(base::text(object->mapType())),
                       toPython(*object, sharedArray).cast<py::dict>()};
      if (m_decode && object->mapType() == mesh_schema::typeName()) decodeIndices(*object, view.attributes, self);
      objects.append(py::cast(std::move(view)));
    }
    return objects;
  }

  std::string summary() const { return scene::sceneSummary(*m_scene); }
  const std::string& path() const { return m_path; }

 private:
  static py::array readOnly(const py::dtype& dtype, const void* data, std::size_t rows, std::size_t width,
                            const py::object& owner) {
    std::vector<py::ssize_t> shape{static_cast<py::ssize_t>(rows)};
    if (width > 0) shape.push_back(static_cast<py::ssize_t>(width));
    py::array array(dtype, shape, {}, data, owner);
    py::detail::array_proxy(array.ptr())->flags &= ~py::detail::npy_api::NPY_ARRAY_WRITEABLE_;
    return array;
  }

  // A delta-encoded mesh shows its plain indices, decoded once and kept with the scene.
  void decodeIndices(const base::AttribMap& mesh, py::dict& attributes, const py::object& self) {
    if (!scene::scalarMember<bool>(mesh, mesh_schema::indicesDeltaCompression()).value_or(false)) return;
    auto [entry, added] = m_decoded.try_emplace(&mesh);
    if (added) entry->second = scene::decodedIndices(mesh);
    attributes["indices"] =
        readOnly(py::dtype::of<std::uint32_t>(), entry->second.data(), entry->second.size(), 0, self);
    attributes["indicesDeltaCompression"] = false;
  }

  Plugins& m_plugins;
  base::ref<base::PluginFactory> m_scene;
  std::string m_path;
  bool m_decode = true;
  std::map<const base::AttribMap*, base::vector<std::uint32_t>> m_decoded;
};

std::shared_ptr<Scene> importScene(const std::filesystem::path& file, bool decode, const py::kwargs& parameters) {
  const std::string path = file.string();
  Parameters entries;
  for (const auto& [name, value] : parameters)
    entries.emplace_back(py::str(name).cast<std::string>(), parameterText(value));
  const std::string home = packageHome();
  return runFileCall(path, [&] {
    auto imported = std::make_shared<Scene>(Plugins::get(home), path, decode);
    if (!imported->load(entries)) {
      throw CallError({CallFailure::Kind::corrupt, fileMessage(path, "the file is not one the scene plug-ins read")});
    }
    return imported;
  });
}

}  // namespace

void bindScene(py::module_& module) {
  py::class_<SceneObject>(module, "SceneObject", "One object of an imported scene.")
      .def_readonly("index", &SceneObject::index, "The object's index in the scene.")
      .def_readonly("type", &SceneObject::type, "The object's type: \"mesh\", \"material\", ...")
      .def_readonly("attributes", &SceneObject::attributes,
                    "The object's attributes by name. Number lists are read-only NumPy arrays over the scene's "
                    "storage; nested structures are dicts and lists.")
      .def("__repr__", [](const SceneObject& object) {
        return fmt::format("<meshport.SceneObject {}: {} ({} attributes)>", object.index, object.type,
                           py::len(object.attributes));
      });
  py::class_<Scene, std::shared_ptr<Scene>>(module, "Scene", "A scene imported through the scene plug-ins.")
      .def_property_readonly(
          "objects", [](py::object self) { return self.cast<Scene&>().objects(self); },
          "The scene's objects in factory order. Each access gives new views of the same storage.")
      .def_property_readonly("path", &Scene::path, "The file the scene was imported from.")
      .def("summary", &Scene::summary, "A line per object, as 'scenetool import' prints it.")
      .def("__repr__", [](const Scene& scene) { return fmt::format("<meshport.Scene from '{}'>", scene.path()); });
  module.def("import_scene", &importScene, py::arg("path"), py::kw_only(), py::arg("decode") = true,
             R"(Imports a scene file through the scene plug-in that reads its extension.

Keyword arguments other than `decode` are the importer's parameters, by name
(import_scene("scan.ply", importCustomProperties=True)); 'scenetool plugins' lists them.
With decode=True (the default) each mesh's face indices are decoded from their stored
delta form into a new array, and the mesh's 'indicesDeltaCompression' reads False;
decode=False gives the stored arrays without a copy.

Raises NotFoundError, UnsupportedError (no plug-in for the extension), CorruptError
(the file's content), TypeError or ValueError (a parameter the importer does not have
or cannot take). The import runs without the interpreter lock.)");
}

}  // namespace pymeshport
