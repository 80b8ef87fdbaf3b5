#pragma once

#include "b_color.h"
#include "b_normal.h"
#include "b_vec.h"
#include "ply_columns.h"
#include "ply_exporter.h"
#include "ply_parser.h"
#include "ply_plan.h"
#include "scene_plugin.h"

#include <array>
#include <cstdint>
#include <functional>
#include <limits>
#include <string_view>

namespace ply {

/// A list of the mesh (or of the importer's material lists) that values go into, whatever
/// its type: its records can be counted and resized, growing by the project's growth rule.
struct ListTarget {
  std::function<std::byte*(std::size_t)> resize;  ///< to this many records; gives the first
  std::function<std::size_t()> size;
  std::uint32_t stride = 0;  ///< bytes of a record
};

/// The target over `list`, which must outlive it.
template <class T>
ListTarget listTarget(base::vector<T>& list) {
  return {[&list](std::size_t records) {
            if (records > list.size()) base::reserveForAppend(list, records - list.size());
            list.resize(records);
            return reinterpret_cast<std::byte*>(list.data());
          },
          [&list] { return list.size(); }, sizeof(T)};
}

/// What an entry of a material element makes of a principalMaterial: the attributes it
/// sets. Entries with equal values (bit for bit) share one material object.
struct MaterialValues {
  enum : std::uint8_t { hasVisibility = 1, hasColour = 2, hasReflection = 4, hasRoughness = 8 };
  std::uint8_t present = 0;
  base::base_vec3<float> visibility{};
  base::base_vec3<float> colour{};
  float reflection = 0;
  float roughness = 0;
  bool operator==(const MaterialValues& other) const;
};

/// The semantic the importer reads a property as: its own, or for names that other tools
/// give texture coordinates (texture_u/texture_v, texture_s/texture_t) u and v. The header
/// keeps them as unknown names: only the import reads them as coordinates.
PropertySemantic importedSemantic(const Property& property);

/// Reads a PLY file into a scene: one mesh (vertex data, one primitive per face, strip or
/// edge element, all sharing one index list), its materials, a root node and a scene. It is
/// the body reader's receiver: each element is decided once (plyElement, plyPlan), and the
/// values then go straight into the mesh's lists. The same object writes scenes: it
/// answers "ISceneExporter" with its exporter part.
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
  /// "ISceneImporter" gives the importer part, "ISceneExporter" the exporter part.
  base::IPluginInterface* queryInterface(base::name_id name) const override;

  // The reader's receiver (ply_parser.h).
  bool plyElement(const Element& element);
  bool plyPlan(const Element& element, ElementPlan& plan);
  void beginInstance(std::uint32_t index) {
    m_instanceIndex = index;
    if (m_marksInstances) markInstance();
  }
  /// Undoes what instance `index` appended. A face, strip or edge instance is left out with
  /// all its values; any other instance keeps its place (as far as it was read, zero beyond),
  /// so that later faces still name the right vertices.
  void dropInstance(std::uint32_t index);
  void plyProperty(const Element& element, const Property& property, const ValueArray& values);

 private:
  using Target = ListTarget;
  static constexpr std::uint32_t noTarget = 0xFFFFFFFFu;
  /// Where one property of the current element goes.
  struct Route {
    enum class Kind : std::uint8_t {
      drop,
      value,       ///< a scalar into a target (Conversion::native for kept custom properties)
      indices,     ///< vertex indices into the index sink
      faceItems,   ///< a face's texture coordinates into the item sink
      customList,  ///< a kept custom list, through plyProperty into m_customLists[target]
      material
    } kind = Kind::drop;
    Conversion conversion = Conversion::toFloat;
    std::uint32_t target = 0;
    std::uint32_t offset = 0;
  };

  void finishElement();
  void markInstance();
  /// Each face of the current face element takes the per-instance values (colours, kept
  /// properties) of the instance it came from: one face per index list of each instance that
  /// was read whole.
  void spreadOverFaces();
  /// The instance each face of the current face element came from; empty when face f came
  /// from instance f.
  base::vector<std::uint32_t> faceSources() const;
  /// The entries to make for an element's lists before its data arrives: its count when the
  /// stream's size bounds the counts, none otherwise (the lists then grow as data arrives).
  std::uint32_t initialCount(const Element& element) const { return m_sized ? element.count : 0; }
  /// Brings the current element's lists to one length when they grew with the data.
  void evenTargets();
  bool prepareVertices(const Element& element);
  /// Removes what earlier vertex elements made: normals, vertex sets, kept vertex properties.
  void dropVertexData();
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

  // Per-face data (ply_face_data.cpp): texture coordinates and colours of the face element
  // as face-varying sets, whose index channels the delta encoding moves with the faces.
  void prepareFaceData(const Element& element);
  void storeFaceItems(const Property& property, const ValueArray& values);
  void finishFaceData(const base::vector<std::uint32_t>& sources);
  void finishFaceUVs(std::uint32_t start, std::uint32_t corners, const base::vector<std::uint32_t>& sources);
  void spreadFaceUVs(base::vector<base::base_vec2<float>>& uvs, const base::vector<std::uint32_t>& sources);
  base::vector<std::uint32_t>& newFaceChannel(base::AttribMap& set, std::uint32_t start, std::uint32_t corners);
  void padFaceChannels();

  // Kept custom properties (ply_custom_properties.cpp): a typed mesh list per property
  // that no semantic claims, per-face ones put in the order the delta encoding gives the faces.
  void prepareCustomProperties(const Element& element);
  std::uint32_t addCustomColumn(const Element& element, const Property& property);
  void storeCustomList(const Route& route, const Property& property, const ValueArray& values);
  base::string customName(const Element& element, std::string_view name);
  void encodeWithFaceOrder();
  void storeMaterialValue(const Property& property, float value);

  /// An object of `type` made by `factory`; throws when the factory cannot make one.
  base::ref<base::IPlugin> createRequired(base::PluginFactory& factory, base::name_id type);
  base::AttribMap& newPrimitive();
  void finishPrimitives();
  void createMaterials(base::PluginFactory& factory);
  MaterialValues materialValues(std::size_t j) const;
  base::ref<base::IPlugin> createMaterial(base::PluginFactory& factory, const MaterialValues& values);
  /// The most distinct materials that `entries` material instances may make.
  std::size_t materialLimit(std::size_t entries) const;
  [[noreturn]] void refuseMaterials(std::size_t entries, std::size_t limit) const;
  void buildScene(base::PluginFactory& factory);

  // Parameters (mirrored by attributes of the same names).
  bool m_importMeshes = true;
  bool m_importTriangulateMeshes = false;
  bool m_importColors = true;
  bool m_importTextureCoordinates = true;
  std::uint8_t m_importNormals = 2;
  bool m_importMaterials = true;
  bool m_importPoints = true;
  bool m_importCustomProperties = false;
  PLYExporter m_exporter{*this};  // reads the parameters the factory copies into this object
  /// Off only for tests that compare the column plans with the per-property path.
  bool m_columnPlans = true;
  /// Whether the stream has a size (then the header bounds every count by the data).
  bool m_sized = true;

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
  /// RGBA lists of the current element that no alpha reaches, made opaque when it ends.
  base::vector<base::vector<base::base_vec4<float>>*> m_opaqueColours;

  base::vector<base::base_vec3<float>> m_materialDiffuse;
  base::vector<base::base_vec3<float>> m_materialAmbient;
  base::vector<base::base_vec3<float>> m_materialSpecular;
  base::vector<float> m_materialSpecularPower;
  base::vector<base::base_vec3<float>> m_materialOpacity;
  /// Which of the five material lists (ambient, diffuse, specular, power, opacity) the
  /// current material element fills.
  std::array<bool, 5> m_materialPresent{};
  /// The fewest bytes a material instance of the file takes.
  std::uint64_t m_materialBytesPerEntry = std::numeric_limits<std::uint64_t>::max();

  // The current element: its lists, the route of each property, its index sink.
  const Element* m_element = nullptr;
  base::vector<Target> m_targets;
  base::vector<Route> m_routes;
  ListSink m_sink;
  base::AttribMap* m_primitive = nullptr;
  std::uint32_t m_primitiveStart = 0;
  std::uint32_t m_instanceIndex = 0;
  base::vector<std::uint32_t> m_scratch;
  BadIndexReport m_badIndices;
  /// Index lists per instance of the current face element: each gives one face.
  std::uint32_t m_listsPerInstance = 0;
  /// Instances of the current element that could not be read whole, in order.
  base::vector<std::uint32_t> m_dropped;
  /// Whether instances of the current element append to lists, which a drop must undo.
  bool m_marksInstances = false;
  /// The lengths of the current element's growing lists when its current instance began.
  struct InstanceMark {
    std::size_t indices = 0;
    std::size_t faceCounts = 0;
    std::size_t runCounts = 0;
    std::size_t items = 0;
    std::size_t itemCounts = 0;
  } m_mark;

  // The face element's texture coordinates as read (float bits, and the count of each
  // face's list), until its element ends and they become a face-varying UV set.
  ListSink m_itemSink;
  base::vector<std::uint32_t> m_faceItems;
  base::vector<std::uint16_t> m_faceItemCounts;
  base::AttribMap* m_faceUVSet = nullptr;
  /// The face element's colour set (one colour per face), until its element ends.
  base::AttribMap* m_faceColourSet = nullptr;
  /// Face-varying index channels, padded to the whole index list when the mesh is done.
  base::vector<base::vector<std::uint32_t>*> m_faceChannels;

  /// A kept custom list property: the length of each instance's list and every list's items
  /// in the property's own type, with their lengths when the current instance began.
  struct CustomList {
    base::vector<std::uint32_t>* counts;
    Target items;
    std::size_t countsMark = 0;
    std::size_t itemsMark = 0;
  };
  base::vector<CustomList> m_customLists;
  /// The first of m_customLists that the current element made.
  std::size_t m_elementCustomLists = 0;
  /// Per-face custom data of the face primitive `primitive`, put in the faces' new order
  /// (order[k] is the index the face at k had in the file).
  struct FaceReorder {
    std::uint32_t primitive;
    std::function<void(const base::vector<std::uint32_t>& order)> apply;
  };
  base::vector<FaceReorder> m_faceReorders;
};

template <class T>
std::uint32_t PLYImporter::addTarget(base::vector<T>& list) {
  m_targets.push_back(listTarget(list));
  return static_cast<std::uint32_t>(m_targets.size() - 1);
}

}  // namespace ply
