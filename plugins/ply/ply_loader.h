#pragma once

#include "b_color.h"
#include "b_normal.h"
#include "b_vec.h"
#include "ply_columns.h"
#include "ply_parser.h"
#include "ply_plan.h"
#include "scene_plugin.h"

#include <array>
#include <cstdint>
#include <functional>
#include <string_view>

namespace ply {

/// Reads a PLY file into a scene: one mesh (vertex data, one primitive per face, strip or
/// edge element, all sharing one index list), its materials, a root node and a scene. It is
/// the body reader's receiver: each element is decided once (plyElement, plyPlan), and the
/// values then go straight into the mesh's lists.
class PLYImporter final : public scene::SceneImportPlugin {
 public:
  PLYImporter(base::PluginFactory* factory, base::IPluginDesc* descriptor, std::uint32_t index);
  ~PLYImporter() override;

  /// Whether the file starts, after white space, with "ply" in any letter case. A file that
  /// cannot be opened throws its file system's exception.
  bool canImport(std::string_view path) override;
  /// The seven parameters with their defaults; the map's type becomes "sceneImporter".
  void getParameters(base::AttribMap& parameters) override;
  /// Reads the file into `factory`. A file that cannot be opened, a header that fails, a
  /// type the factory cannot make and the conversion errors throw; a body that ends early
  /// keeps what was read (with a warning) and the import succeeds.
  bool importScene(base::PluginFactory& factory, std::string_view path) override;

  // The reader's receiver (ply_parser.h).
  bool plyElement(const Element& element);
  bool plyPlan(const Element& element, ElementPlan& plan);
  void beginInstance(std::uint32_t index) { m_instanceIndex = index; }
  void plyProperty(const Element& element, const Property& property, const ValueArray& values);

 private:
  /// A list of the mesh (or of the importer's material lists) that values go into.
  struct Target {
    std::function<std::byte*(std::size_t)> resize;
    std::function<std::size_t()> size;
    std::uint32_t stride = 0;
  };
  static constexpr std::uint32_t noTarget = 0xFFFFFFFFu;
  /// Where one property of the current element goes.
  struct Route {
    enum class Kind : std::uint8_t { drop, value, indices, material } kind = Kind::drop;
    Conversion conversion = Conversion::toFloat;
    std::uint32_t target = 0;
    std::uint32_t offset = 0;
  };

  void finishElement();
  bool prepareVertices(const Element& element);
  bool prepareIndices(const Element& element);
  void prepareMaterials(const Element& element);
  template <class T>
  std::uint32_t addTarget(base::vector<T>& list);
  void routeVertexProperties(const Element& element, std::uint32_t positions, std::uint32_t normals,
                             const base::vector<std::uint32_t>& uvTargets,
                             const base::vector<std::uint32_t>& colourTargets,
                             const base::vector<std::uint32_t>& floatTargets);
  static std::size_t colourGroup(const base::vector<std::uint32_t>& groupFamily,
                                 const base::vector<std::array<bool, 4>>& filled, std::uint32_t family,
                                 std::uint32_t channel);
  void storeValue(const Route& route, const Property& property, const ValueArray& values);
  void storeIndices(const Property& property, const ValueArray& values);
  void storeMaterialValue(const Property& property, float value);

  /// An object of `type` made by `factory`; throws when the factory cannot make one.
  base::ref<base::IPlugin> createRequired(base::PluginFactory& factory, base::name_id type);
  base::AttribMap& newPrimitive();
  void finishPrimitives();
  void createMaterials(base::PluginFactory& factory);
  void buildScene(base::PluginFactory& factory);

  // Parameters (mirrored by attributes of the same names).
  bool m_importMeshes = true;
  bool m_importTriangulateMeshes = false;
  bool m_importColors = true;
  bool m_importTextureCoordinates = true;
  std::uint8_t m_importNormals = 2;
  bool m_importMaterials = true;
  bool m_importPoints = true;
  /// Off only for tests that compare the column plans with the per-property path.
  bool m_columnPlans = true;

  base::ref<base::IPlugin> m_currentMesh;
  base::vector<base::base_vec3<float>>* m_positionsList = nullptr;
  base::vector<base::normal>* m_normalsList = nullptr;
  base::vector<std::uint32_t>* m_indicesList = nullptr;
  base::vector<std::uint16_t>* m_vcountsList = nullptr;
  base::vector<std::uint32_t>* m_ecountsList = nullptr;
  base::vector<base::vector<base::base_vec2<float>>*> m_uvLists;
  base::vector<base::vector<base::base_vec3<float>>*> m_rgbLists;
  base::vector<base::vector<base::base_vec4<float>>*> m_rgbaLists;
  base::vector<base::vector<float>*> m_floatLists;

  base::vector<base::base_vec3<float>> m_materialDiffuse;
  base::vector<base::base_vec3<float>> m_materialAmbient;
  base::vector<base::base_vec3<float>> m_materialSpecular;
  base::vector<float> m_materialSpecularPower;
  base::vector<base::base_vec3<float>> m_materialOpacity;

  // The current element: its lists, the route of each property, its index sink.
  const Element* m_element = nullptr;
  base::vector<Target> m_targets;
  base::vector<Route> m_routes;
  IndexSink m_sink;
  base::AttribMap* m_primitive = nullptr;
  std::uint32_t m_primitiveStart = 0;
  std::uint32_t m_instanceIndex = 0;
  base::vector<std::uint32_t> m_scratch;
  BadIndexReport m_badIndices;
};

}  // namespace ply
