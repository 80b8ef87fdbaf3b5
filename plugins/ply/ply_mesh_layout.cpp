#include "ply_mesh_layout.h"

#include "b_exception.h"
#include "b_log.h"
#include "b_normal.h"
#include "b_plugin_attribute.h"
#include "b_vec.h"
#include "ply_kept_properties.h"
#include "scene_index_delta.h"
#include "scene_mesh.h"
#include "scene_schema.h"

#include <fmt/format.h>

#include <algorithm>
#include <cstring>
#include <optional>

namespace ply {
namespace {

using scene::mesh_schema;
using scene::meshColorSet_schema;
using scene::meshPrimitive_schema;
using scene::meshUVSet_schema;

constexpr std::uint32_t noIndex = 0xFFFFFFFFu;
constexpr std::pair<const char*, const char*> uvNames[] = {{"u", "v"}, {"s", "t"}, {"tx", "ty"}};
constexpr const char* colourPrefixes[] = {"", "ambient_", "diffuse_", "specular_"};
constexpr const char* channelNames[] = {"red", "green", "blue", "alpha"};
constexpr const char* singleChannelNames[] = {"opacity", "specular_power"};

// The floats of a list of vectors of floats (null for an empty list).
template <class V>
const float* floatsOf(const base::vector<V>& list) {
  return reinterpret_cast<const float*>(list.data());
}

// Component `c` of the first entry of `values`; null when there are none, as nothing is read.
const float* component(const float* values, std::uint32_t c) { return values ? values + c : nullptr; }

[[noreturn]] void refuse(const std::string& why) { base::raise<base::exception>("ply::MeshLayout", why); }

WriteProperty scalar(std::string name, DataType type, const void* data, std::size_t stride, bool normalised = false) {
  WriteProperty property;
  property.name = std::move(name);
  property.type = type;
  property.values = static_cast<const std::byte*>(data);
  property.stride = stride;
  property.normalised = normalised;
  return property;
}

// A colour set's values: RGB, RGBA or a single channel (A), `channels` floats an entry.
struct ColourList {
  const float* values = nullptr;
  std::size_t entries = 0;
  std::uint32_t channels = 0;
};

ColourList colourListOf(const base::AttribMap& set) {
  if (const auto* rgb = set.findVecAttribute<base::base_vec3<float>>(meshColorSet_schema::RGB())) {
    return {floatsOf(*rgb), rgb->size(), 3};
  }
  if (const auto* rgba = set.findVecAttribute<base::base_vec4<float>>(meshColorSet_schema::RGBA())) {
    return {floatsOf(*rgba), rgba->size(), 4};
  }
  if (const auto* a = set.findVecAttribute<float>(meshColorSet_schema::A())) return {a->data(), a->size(), 1};
  return {};
}

// The channels of one colour list as scalar properties named `names[c]`, each value
// `stride` floats after the one before; uchar when every value is one.
void addChannels(WriteElement& element, const float* values, std::size_t entries, std::uint32_t channels,
                 const std::vector<std::string>& names) {
  const bool uchar = fitsUchar(values, entries * channels);
  for (std::uint32_t c = 0; c < channels; ++c) {
    element.properties.push_back(scalar(names[c], uchar ? DataType::uint8 : DataType::float32, component(values, c),
                                        channels * sizeof(float), uchar));
  }
}

std::vector<std::string> colourNames(const char* prefix, std::uint32_t channels) {
  std::vector<std::string> names;
  for (std::uint32_t c = 0; c < channels; ++c) names.push_back(std::string(prefix) + channelNames[c]);
  return names;
}

// The set's own index channel (per corner), or null for a set of one entry per vertex.
const base::vector<std::uint32_t>* cornerIndices(const base::AttribMap& set) {
  return set.findVecAttribute<std::uint32_t>(meshUVSet_schema::indices());
}

// Whether the set's corner channel names an entry for some corner of [start, start + corners).
bool coversRange(const base::AttribMap& set, std::uint32_t start, std::uint32_t corners) {
  const base::vector<std::uint32_t>* indices = cornerIndices(set);
  if (!indices || indices->size() < std::size_t(start) + corners) return false;
  return std::any_of(indices->begin() + start, indices->begin() + start + corners,
                     [](std::uint32_t index) { return index != noIndex; });
}

std::vector<const base::AttribMap*> setsOf(const base::AttribMap& mesh, base::name_id name) {
  std::vector<const base::AttribMap*> sets;
  if (const base::AttribArray* array = scene::findArrayMember(mesh, name)) {
    for (std::uint32_t k = 0; k < array->size(); ++k) {
      if (const base::AttribMap* set = scene::mapAt(*array, k)) sets.push_back(set);
    }
  }
  return sets;
}

// The mesh's kept lists ("ply:" members), sorted by name. A type of this file's own, so that
// the containers made of it stay inside the plug-in.
struct KeptList {
  std::string_view name;
  const base::Attribute* member;
  bool operator<(const KeptList& other) const { return name < other.name; }
};

std::vector<KeptList> keptListsOf(const base::AttribMap& mesh) {
  std::vector<KeptList> kept;
  for (const auto& [name, member] : mesh.members()) {
    if (base::text(name).starts_with("ply:")) kept.push_back({base::text(name), member});
  }
  std::sort(kept.begin(), kept.end());
  return kept;
}

}  // namespace

DataType keptListType(base::name_id listType) {
  struct TypeName {
    std::string_view name;
    DataType type;
  };
  static constexpr TypeName types[] = {{"int8[]", DataType::int8},     {"uint8[]", DataType::uint8},
                                       {"int16[]", DataType::int16},   {"uint16[]", DataType::uint16},
                                       {"int32[]", DataType::int32},   {"uint32[]", DataType::uint32},
                                       {"float[]", DataType::float32}, {"double[]", DataType::float64}};
  const std::string_view text = base::text(listType);
  for (const TypeName& entry : types) {
    if (entry.name == text) return entry.type;
  }
  return DataType::none;
}

bool fitsUchar(const float* values, std::size_t count) {
  return std::all_of(values, values + count, [](float value) {
    const float scaled = value * 255.0f;
    if (!(scaled >= 0.0f && scaled <= 255.0f)) return false;
    return static_cast<float>(static_cast<int>(scaled + 0.5f)) * (1.0f / 255.0f) == value;
  });
}

template <class T>
const std::byte* MeshLayout::keep(const std::vector<T>& values) {
  std::vector<std::byte>& bytes = m_kept.emplace_back().bytes;
  bytes.resize(values.size() * sizeof(T));
  if (!values.empty()) std::memcpy(bytes.data(), values.data(), bytes.size());
  return bytes.data();
}

MeshLayout::MeshLayout(const base::AttribMap& mesh, const ExportOptions& options)
    : m_mesh(mesh), m_indices(scene::decodedIndices(mesh)) {
  addVertexElement(options);
  if (const base::AttribArray* primitives = scene::findArrayMember(mesh, mesh_schema::primitives())) {
    for (std::uint32_t k = 0; k < primitives->size(); ++k) {
      if (const base::AttribMap* primitive = scene::mapAt(*primitives, k)) addPrimitive(*primitive, k, options);
    }
  }
  if (options.customProperties) addCustomProperties();
  if (options.materials) addMaterials();
}

namespace {

// The vertices' count: the positions', or for a mesh without positions the length of its
// normals or of its first kept vertex property (for a scene stored before kept properties
// named their element, of the first kept list that is not a face's).
std::uint64_t vertexCountOf(const base::AttribMap& mesh) {
  if (const auto* positions = mesh.findVecAttribute<base::base_vec3<float>>(mesh_schema::positions())) {
    return positions->size();
  }
  if (const auto* normals = mesh.findVecAttribute<base::normal>(mesh_schema::normals())) return normals->size();
  const base::vector<KeptProperty> named = keptPropertiesOf(mesh);
  for (const KeptProperty& property : named) {
    if (property.primitive != KeptProperty::vertexElement) continue;
    const base::Attribute* values = mesh.findMember(base::intern(property.attribute));
    if (!values) values = mesh.findMember(base::intern(property.attribute + ".counts"));
    if (values) return values->size();
  }
  if (!named.empty()) return 0;
  for (const KeptList& kept : keptListsOf(mesh)) {
    if (!kept.name.starts_with("ply:face.") && !kept.name.ends_with(".items")) return kept.member->size();
  }
  return 0;
}

}  // namespace

void MeshLayout::addVertexElement(const ExportOptions& options) {
  m_vertexCount = vertexCountOf(m_mesh);
  WriteElement vertex{"vertex", m_vertexCount, {}};
  if (const auto* positions = m_mesh.findVecAttribute<base::base_vec3<float>>(mesh_schema::positions())) {
    for (std::uint32_t c = 0; c < 3; ++c) {
      vertex.properties.push_back(
          scalar(std::string(1, "xyz"[c]), DataType::float32, component(floatsOf(*positions), c), 12));
    }
  }
  if (const auto* normals = m_mesh.findVecAttribute<base::normal>(mesh_schema::normals())) {
    if (normals->size() != m_vertexCount) {
      refuse(fmt::format("the mesh has {} normals for {} vertices", normals->size(), m_vertexCount));
    }
    for (std::uint32_t c = 0; c < 3; ++c) {
      vertex.properties.push_back(
          scalar(fmt::format("n{}", "xyz"[c]), DataType::float32, component(floatsOf(*normals), c), 12));
    }
  }
  if (options.textureCoordinates) addVertexUVSets(vertex);
  if (options.colors) addVertexColourSets(vertex);
  m_elements.push_back(std::move(vertex));
}

void MeshLayout::addVertexUVSets(WriteElement& vertex) {
  std::size_t written = 0;
  for (const base::AttribMap* set : setsOf(m_mesh, mesh_schema::uvSets())) {
    const auto* uv = set->findVecAttribute<base::base_vec2<float>>(meshUVSet_schema::UV());
    if (!uv || cornerIndices(*set)) continue;  // per-corner sets go with their faces
    if (written == std::size(uvNames)) {
      refuse("a PLY vertex holds at most three UV sets (u v, s t, tx ty); this mesh has more");
    }
    if (uv->size() != m_vertexCount) {
      refuse(fmt::format("UV set {} has {} entries for {} vertices", written, uv->size(), m_vertexCount));
    }
    const auto [u, v] = uvNames[written++];
    vertex.properties.push_back(scalar(u, DataType::float32, floatsOf(*uv), 8));
    vertex.properties.push_back(scalar(v, DataType::float32, component(floatsOf(*uv), 1), 8));
  }
}

void MeshLayout::addVertexColourSets(WriteElement& vertex) {
  std::size_t colours = 0, singles = 0;
  for (const base::AttribMap* set : setsOf(m_mesh, mesh_schema::colorSets())) {
    const ColourList list = colourListOf(*set);
    if (!list.values && list.channels == 0) continue;
    if (cornerIndices(*set)) continue;  // per-face colours go with their faces
    if (list.entries != m_vertexCount) {
      refuse(fmt::format("a colour set has {} entries for {} vertices", list.entries, m_vertexCount));
    }
    if (list.channels == 1) {
      if (singles == std::size(singleChannelNames)) {
        refuse("a PLY vertex holds at most two single-channel colour sets (opacity, specular_power)");
      }
      addChannels(vertex, list.values, list.entries, 1, {singleChannelNames[singles++]});
      continue;
    }
    if (colours == std::size(colourPrefixes)) {
      refuse("a PLY vertex holds at most four colour sets (red green blue, then ambient_, diffuse_, specular_)");
    }
    addChannels(vertex, list.values, list.entries, list.channels,
                colourNames(colourPrefixes[colours++], list.channels));
  }
}

void MeshLayout::addPrimitive(const base::AttribMap& primitive, std::uint32_t index, const ExportOptions& options) {
  const std::uint32_t start = scene::valueOf<std::uint32_t>(primitive, meshPrimitive_schema::indexStart()).value_or(0);
  const std::uint32_t corners =
      scene::valueOf<std::uint32_t>(primitive, meshPrimitive_schema::indexCount()).value_or(0);
  if (std::uint64_t(start) + corners > m_indices.size()) {
    refuse(fmt::format("a primitive names indices {} to {} of {}", start, std::uint64_t(start) + corners,
                       m_indices.size()));
  }
  // Points: the vertices say it all. Faces without corners still carry their own values.
  const scene::FaceCounts counts = scene::faceCountsOf(primitive);
  if (corners == 0 && !(counts.perFace && !counts.perFace->empty())) return;
  WriteProperty indices = scalar("vertex_indices", DataType::int32, m_indices.data() + start, 4);
  indices.isList = true;
  if (const auto* strips = primitive.findVecAttribute<std::uint32_t>(meshPrimitive_schema::ecounts())) {
    // The writer takes each strip's indices in turn: together they must lie in the range.
    std::uint64_t total = 0;
    for (const std::uint32_t n : *strips) total += n;
    if (total > corners) refuse(fmt::format("a primitive's strips have {} indices, its range {}", total, corners));
    indices.counts = strips->data();
    indices.countType = countTypeFor(strips->empty() ? 0 : *std::max_element(strips->begin(), strips->end()));
    m_elements.push_back(WriteElement{"tristrips", strips->size(), {indices}});
    return;
  }
  // Faces of two corners each are edges, unless they carry a face element's own data.
  if (counts.uniform == 2 && !hasFaceData(index, start, corners)) {
    if (!options.edges) return;
    indices.length = 2;
    m_elements.push_back(WriteElement{"edge", corners / 2, {indices}});
    return;
  }
  addFaceElement(primitive, index, start, corners, options);
}

bool MeshLayout::hasFaceData(std::uint32_t index, std::uint32_t start, std::uint32_t corners) const {
  for (const KeptProperty& property : keptPropertiesOf(m_mesh)) {
    if (property.primitive == static_cast<std::int32_t>(index)) return true;
  }
  for (const base::name_id sets : {mesh_schema::uvSets(), mesh_schema::colorSets()}) {
    for (const base::AttribMap* set : setsOf(m_mesh, sets)) {
      if (coversRange(*set, start, corners)) return true;
    }
  }
  return false;
}

void MeshLayout::addFaceElement(const base::AttribMap& primitive, std::uint32_t index, std::uint32_t start,
                                std::uint32_t corners, const ExportOptions& options) {
  WriteProperty indices = scalar("vertex_indices", DataType::int32, m_indices.data() + start, 4);
  indices.isList = true;
  WriteElement face{"face", 0, {}};
  const scene::FaceCounts counts = scene::faceCountsOf(primitive);
  if (counts.perFace) {
    std::uint64_t total = 0;
    for (const std::uint16_t n : *counts.perFace) total += n;
    if (total > corners) refuse(fmt::format("a primitive's faces have {} corners, its range {}", total, corners));
    indices.counts = reinterpret_cast<const std::uint32_t*>(
        keep(std::vector<std::uint32_t>(counts.perFace->begin(), counts.perFace->end())));
    indices.countType =
        countTypeFor(counts.perFace->empty() ? 0 : *std::max_element(counts.perFace->begin(), counts.perFace->end()));
    face.count = counts.perFace->size();
  } else {
    indices.length = counts.uniform.value_or(3);
    indices.countType = countTypeFor(indices.length);
    face.count = indices.length ? corners / indices.length : 0;
  }
  face.properties.push_back(indices);
  // The face element's own data: one texture coordinate list and one colour per face.
  const std::vector<const base::AttribMap*> uvSets = setsOf(m_mesh, mesh_schema::uvSets());
  const std::vector<const base::AttribMap*> colourSets = setsOf(m_mesh, mesh_schema::colorSets());
  std::size_t uvs = 0, colours = 0;
  for (const base::AttribMap* set : options.textureCoordinates ? uvSets : std::vector<const base::AttribMap*>{}) {
    if (coversRange(*set, start, corners) && uvs++ == 0) addFaceUVs(face, *set, start, indices);
  }
  for (const base::AttribMap* set : options.colors ? colourSets : std::vector<const base::AttribMap*>{}) {
    if (coversRange(*set, start, corners) && colours++ == 0) addFaceColours(face, *set, start, indices);
  }
  if (uvs > 1 || colours > 1) {
    refuse("a PLY face element holds one texture coordinate list and one colour; these faces have more");
  }
  if (m_firstFaceElement == 0) m_firstFaceElement = m_elements.size();
  if (m_faceElementOf.size() <= index) m_faceElementOf.resize(std::size_t(index) + 1, 0);
  m_faceElementOf[index] = m_elements.size();
  m_elements.push_back(std::move(face));
}

// Each face's corners' coordinates, u and v in turn, as the face's "texcoord" list.
void MeshLayout::addFaceUVs(WriteElement& face, const base::AttribMap& set, std::uint32_t start,
                            const WriteProperty& faces) {
  const auto* uv = set.findVecAttribute<base::base_vec2<float>>(meshUVSet_schema::UV());
  const base::vector<std::uint32_t>& channel = *cornerIndices(set);
  std::vector<float> coordinates;
  std::uint64_t corner = start;
  for (std::uint64_t f = 0; f < face.count; ++f) {
    const std::uint32_t n = faces.counts ? faces.counts[f] : faces.length;
    for (std::uint32_t k = 0; k < n; ++k, ++corner) {
      const std::uint32_t entry = channel[corner];
      const base::base_vec2<float> value = uv && entry < uv->size() ? (*uv)[entry] : base::base_vec2<float>{};
      coordinates.push_back(value.x);
      coordinates.push_back(value.y);
    }
  }
  WriteProperty texcoord = scalar("texcoord", DataType::float32, keep(coordinates), 4);
  texcoord.isList = true;
  if (faces.counts) {
    std::vector<std::uint32_t> lengths(faces.counts, faces.counts + face.count);
    for (std::uint32_t& length : lengths) length *= 2;
    texcoord.counts = reinterpret_cast<const std::uint32_t*>(keep(lengths));
    texcoord.countType = countTypeFor(lengths.empty() ? 0 : *std::max_element(lengths.begin(), lengths.end()));
  } else {
    texcoord.length = 2 * faces.length;
    texcoord.countType = countTypeFor(texcoord.length);
  }
  face.properties.push_back(texcoord);
}

// Each face's colour, the entry its first corner names, as red green blue [alpha].
void MeshLayout::addFaceColours(WriteElement& face, const base::AttribMap& set, std::uint32_t start,
                                const WriteProperty& faces) {
  const ColourList list = colourListOf(set);
  if (list.channels < 3) return;  // a single channel has no per-face name
  const base::vector<std::uint32_t>& channel = *cornerIndices(set);
  std::vector<float> colours;
  std::uint64_t corner = start;
  for (std::uint64_t f = 0; f < face.count; ++f) {
    // A face without corners has none to carry its colour: it reads 0, never the next face's.
    const std::uint32_t corners = faces.counts ? faces.counts[f] : faces.length;
    const std::uint32_t entry = corners > 0 ? channel[corner] : noIndex;
    for (std::uint32_t c = 0; c < list.channels; ++c) {
      colours.push_back(entry < list.entries ? list.values[std::size_t(entry) * list.channels + c] : 0.0f);
    }
    corner += corners;
  }
  const auto* values = reinterpret_cast<const float*>(keep(colours));
  addChannels(face, values, face.count, list.channels, colourNames("", list.channels));
}

namespace {

// The column of a kept property whose values lie in the mesh member `stem` (a scalar per
// instance) or in `stem.counts` and `stem.items` (a list per instance); none when the mesh
// holds no such lists. `instances` becomes the number of instances.
std::optional<WriteProperty> keptColumn(const std::vector<KeptList>& kept, std::string_view stem,
                                        std::uint64_t& instances) {
  const auto find = [&](std::string_view name) -> const base::Attribute* {
    const auto found = std::find_if(kept.begin(), kept.end(), [&](const KeptList& list) { return list.name == name; });
    return found == kept.end() ? nullptr : found->member;
  };
  const std::string stemText(stem);
  const base::Attribute* counts = find(stemText + ".counts");
  const base::Attribute* items = counts ? find(stemText + ".items") : find(stem);
  if (!items || (counts && counts->type() != base::TypeTraits<std::uint32_t>::n_array_name)) {
    return std::nullopt;
  }
  const DataType type = keptListType(items->type());
  if (type == DataType::none) return std::nullopt;
  WriteProperty property = scalar("", type, const_cast<base::Attribute*>(items)->data(0), dataTypeSize(type));
  instances = items->size();
  if (counts) {
    const auto* lengths = static_cast<const base::vector<std::uint32_t>*>(const_cast<base::Attribute*>(counts)->data());
    std::uint64_t total = 0;
    for (const std::uint32_t n : *lengths) total += n;
    if (total != items->size()) refuse(fmt::format("kept property {}: its counts and items disagree", stem));
    property.isList = true;
    property.counts = lengths->data();
    property.countType = countTypeFor(lengths->empty() ? 0 : *std::max_element(lengths->begin(), lengths->end()));
    instances = lengths->size();
  }
  return property;
}

}  // namespace

void MeshLayout::addCustomProperties() {
  const std::vector<KeptList> kept = keptListsOf(m_mesh);
  const base::vector<KeptProperty> named = keptPropertiesOf(m_mesh);
  base::vector<std::string_view> placed;
  for (const KeptProperty& property : named) {
    std::uint64_t instances = 0;
    std::optional<WriteProperty> column = keptColumn(kept, property.attribute, instances);
    if (!column) continue;
    placed.push_back(property.attribute);
    const bool ofVertices = property.primitive == KeptProperty::vertexElement;
    const std::size_t at = ofVertices ? 0
                           : std::size_t(property.primitive) < m_faceElementOf.size()
                               ? m_faceElementOf[property.primitive]
                               : 0;
    if (!ofVertices && at == 0) {
      if (instances == 0) continue;  // the faces of an empty element: nothing to write
      refuse(fmt::format("kept property {} belongs to primitive {}, which is no face element here",
                         base::clipped(property.attribute), property.primitive));
    }
    WriteElement& element = m_elements[at];
    if (element.count != instances) {
      refuse(fmt::format("kept property {} has {} entries for {} {}", base::clipped(property.attribute), instances,
                         element.count, ofVertices ? "vertices" : "faces"));
    }
    column->name = std::string(property.name);
    element.properties.push_back(*column);
  }
  for (const auto& [name, member] : kept) {
    std::string_view stem = name;
    if (stem.ends_with(".items")) continue;  // with its counts
    if (stem.ends_with(".counts")) stem.remove_suffix(7);
    if (std::find(placed.begin(), placed.end(), stem) != placed.end()) continue;
    std::uint64_t instances = 0;
    if (std::optional<WriteProperty> column = keptColumn(kept, stem, instances)) {
      addUnnamedKeptList(stem, *column, instances);
    }
  }
}

void MeshLayout::addUnnamedKeptList(std::string_view member, WriteProperty property, std::uint64_t instances) {
  // A kept face property says so in its name when a vertex property took the plain one;
  // otherwise its length tells.
  std::string_view name = member.substr(4);
  const bool faceNamed = name.starts_with("face.");
  if (faceNamed) name.remove_prefix(5);
  WriteElement* element = &m_elements.front();
  if (faceNamed || instances != m_vertexCount) {
    if (m_firstFaceElement == 0 || m_elements[m_firstFaceElement].count != instances) {
      refuse(fmt::format("kept property {} has {} entries: as many as neither the vertices nor the faces", member,
                         instances));
    }
    element = &m_elements[m_firstFaceElement];
  }
  property.name = std::string(name);
  element->properties.push_back(property);
}

void MeshLayout::addMaterials() {
  // The first primitive that names materials keeps its list as it is, an instance per entry,
  // so that entries sharing a material still count as many; later ones add what it lacks.
  std::vector<const base::IPlugin*> materials;
  bool first = true;
  for (const base::AttribMap* primitive : setsOf(m_mesh, mesh_schema::primitives())) {
    const auto* named = primitive->findVecAttribute<base::ref<base::IPlugin>>(meshPrimitive_schema::materials());
    for (const base::ref<base::IPlugin>& material : named ? *named : base::vector<base::ref<base::IPlugin>>{}) {
      if (material && material->mapType() == scene::principalMaterial_schema::typeName() &&
          (first || std::find(materials.begin(), materials.end(), material.get()) == materials.end())) {
        materials.push_back(material.get());
      }
    }
    first = first && materials.empty();
  }
  if (!materials.empty()) m_elements.push_back(materialElement(materials, m_kept));
}

}  // namespace ply
