#pragma once

#include "b_attribute_map.h"
#include "b_plugin.h"
#include "ply_writer.h"

#include <deque>
#include <memory>
#include <string>
#include <vector>

namespace ply {

/// Values an export computed (decoded counts, per-corner coordinates, per-face colours),
/// kept for the elements that point at them. A type of the plug-in's own, so that the
/// container made of it stays inside the plug-in.
struct KeptValues {
  std::vector<std::byte> bytes;
};
using KeptStorage = std::deque<KeptValues>;

/// What a PLY export writes of a mesh.
struct ExportOptions {
  Encoding encoding = Encoding::binaryLittleEndian;
  bool colors = true;              ///< vertex and per-face colour sets
  bool textureCoordinates = true;  ///< vertex and per-face UV sets
  bool edges = true;               ///< primitives of two-corner faces, as an edge element
  bool materials = true;           ///< the materials the primitives name
  bool customProperties = true;    ///< the importer's kept "ply:" lists
};

/// A mesh laid out as PLY elements: a vertex element (positions, normals, UV and colour
/// sets, kept vertex properties), a face, tristrips or edge element per primitive (decoded
/// indices, per-face texture coordinates and colours, kept face properties) and a material
/// element. The elements point into the mesh and into what the layout computed, so both
/// must outlive the writing. A mesh that PLY cannot hold as it is (a fourth UV set, lists
/// of another length than their element's) throws base::exception saying why.
class MeshLayout {
 public:
  MeshLayout(const base::AttribMap& mesh, const ExportOptions& options);
  MeshLayout(const MeshLayout&) = delete;
  MeshLayout& operator=(const MeshLayout&) = delete;

  const std::vector<WriteElement>& elements() const { return m_elements; }

 private:
  void addVertexElement(const ExportOptions& options);
  void addVertexUVSets(WriteElement& vertex);
  void addVertexColourSets(WriteElement& vertex);
  void addPrimitive(const base::AttribMap& primitive, std::uint32_t index, const ExportOptions& options);
  /// Whether primitive `index` (its indices from `start` on) has per-face data: colours or
  /// texture coordinates of its own, or kept properties.
  bool hasFaceData(std::uint32_t index, std::uint32_t start, std::uint32_t corners) const;
  void addFaceElement(const base::AttribMap& primitive, std::uint32_t index, std::uint32_t start, std::uint32_t corners,
                      const ExportOptions& options);
  void addFaceUVs(WriteElement& face, const base::AttribMap& set, std::uint32_t start, const WriteProperty& faces);
  void addFaceColours(WriteElement& face, const base::AttribMap& set, std::uint32_t start, const WriteProperty& faces);
  void addCustomProperties();
  /// A kept list that the mesh's `keptProperties` does not name (a scene stored before it
  /// existed): on the vertices when it has their length, else on the first face element.
  void addUnnamedKeptList(std::string_view member, WriteProperty property, std::uint64_t instances);
  void addMaterials();
  /// A copy of `values` that lives as long as the layout, for the elements to point at.
  template <class T>
  const std::byte* keep(const std::vector<T>& values);

  const base::AttribMap& m_mesh;
  std::vector<WriteElement> m_elements;
  std::uint64_t m_vertexCount = 0;
  std::size_t m_firstFaceElement = 0;  ///< index in m_elements; 0 when there is none
  /// For each primitive, the index in m_elements of its face element; 0 when it has none.
  base::vector<std::size_t> m_faceElementOf;
  base::vector<std::uint32_t> m_indices;  ///< decoded
  KeptStorage m_kept;
};

/// The PLY element of `materials` (principalMaterial objects), through the inverse of the
/// import's conversion: `color` to diffuse_*, `reflectionAmount` to a grey specular_*
/// colour that gives it back, `roughness` to specular_power, `visibilityMap` to opacity.
/// `storage` keeps the element's values.
WriteElement materialElement(const std::vector<const base::IPlugin*>& materials, KeptStorage& storage);

/// Several meshes as one: their vertex lists end to end, their primitives one after the
/// other with the indices moved past the vertices before them (decoded, not delta-encoded).
/// Meshes that differ in their vertex lists or sets, or that have per-face data, throw
/// base::exception saying why.
std::unique_ptr<base::AttribMap> mergedMesh(const std::vector<const base::AttribMap*>& meshes);

/// The PLY type of a list of numbers that the importer keeps ("float[]" gives float32),
/// from the list's type name; none for other lists.
DataType keptListType(base::name_id listType);

/// Whether every value is k/255 for an integer k, as the import's normalisation of a
/// uchar gives it: such values are written as uchar, others as float.
bool fitsUchar(const float* values, std::size_t count);

}  // namespace ply
