// The importer's conversion of elements and properties into mesh data: each element is
// decided once, as a route per property into the mesh's lists, which serves both the column
// plan and the per-property path.

#include "b_exception.h"
#include "b_log.h"
#include "ply_kept_properties.h"
#include "ply_loader.h"
#include "scene_mesh.h"
#include "scene_schema.h"

#include <algorithm>
#include <array>
#include <cstring>

namespace ply {
namespace {

using scene::mesh_schema;
using scene::meshColorSet_schema;
using scene::meshPrimitive_schema;
using scene::meshUVSet_schema;

// Faces and edges longer than this are refused; strips have no limit.
constexpr std::uint32_t longestFace = 65535;

bool isRedLike(PropertySemantic s) {
  return s == PropertySemantic::red || s == PropertySemantic::ambientRed || s == PropertySemantic::diffuseRed ||
         s == PropertySemantic::specularRed;
}

bool isAlphaLike(PropertySemantic s) {
  return s == PropertySemantic::alpha || s == PropertySemantic::ambientAlpha || s == PropertySemantic::diffuseAlpha ||
         s == PropertySemantic::specularAlpha;
}

// A colour property's family (plain, ambient, diffuse, specular) and channel (r, g, b, a);
// false for any other property.
bool colourChannel(PropertySemantic s, std::uint32_t& family, std::uint32_t& channel) {
  const auto value = static_cast<std::uint32_t>(s);
  if (value >= static_cast<std::uint32_t>(PropertySemantic::red) &&
      value <= static_cast<std::uint32_t>(PropertySemantic::alpha)) {
    family = 0;
    channel = value - static_cast<std::uint32_t>(PropertySemantic::red);
    return true;
  }
  const auto first = static_cast<std::uint32_t>(PropertySemantic::ambientRed);
  if (value >= first && value <= static_cast<std::uint32_t>(PropertySemantic::specularAlpha)) {
    family = 1 + (value - first) / 4;
    channel = (value - first) % 4;
    return true;
  }
  return false;
}

std::size_t countOf(const Element& element, bool (*test)(PropertySemantic)) {
  return static_cast<std::size_t>(std::count_if(element.properties.begin(), element.properties.end(),
                                                [test](const Property& p) { return test(importedSemantic(p)); }));
}

bool has(const Element& element, PropertySemantic semantic) {
  return std::any_of(element.properties.begin(), element.properties.end(),
                     [semantic](const Property& p) { return p.semantic == semantic; });
}

bool isFloatChannel(PropertySemantic s) {
  return s == PropertySemantic::specularPower || s == PropertySemantic::opacity;
}

// A new list in a new entry of one of the mesh's set arrays (uvSets, colorSets).
// An empty list to store: what replaces a member that was there.
template <class T>
const base::vector<T>& emptyList() {
  static const base::vector<T> empty;
  return empty;
}

template <class T>
base::vector<T>& newSetList(base::AttribMap& mesh, base::name_id sets, base::name_id layout, std::uint32_t count) {
  base::AttribMap& set = scene::appendMap(scene::arrayMember(mesh, sets));
  base::vector<T>& list = set.attribute<base::vector<T>>(layout, emptyList<T>());
  list.resize(count);
  return list;
}

template <class T>
base::vector<T>& newMeshList(base::AttribMap& mesh, base::name_id name, std::uint32_t count) {
  base::vector<T>& list = mesh.attribute<base::vector<T>>(name, emptyList<T>());
  list.resize(count);
  return list;
}

float converted(const Value& value, const Property& property, Conversion conversion) {
  return conversion == Conversion::normalised ? toFP(value, property) : value.convertTo<float>(property.type);
}

}  // namespace

PropertySemantic importedSemantic(const Property& property) {
  if (property.semantic != PropertySemantic::unknown) return property.semantic;
  if (property.name == "texture_u" || property.name == "texture_s") return PropertySemantic::u;
  if (property.name == "texture_v" || property.name == "texture_t") return PropertySemantic::v;
  return PropertySemantic::unknown;
}

bool PLYImporter::plyElement(const Element& element) {
  finishElement();
  m_element = &element;
  m_targets.clear();
  m_routes.assign(element.properties.size(), Route{});
  m_dropped.clear();
  m_elementCustomLists = m_customLists.size();
  bool wanted = false;
  switch (element.semantic) {
    case ElementSemantic::vertex:
      wanted = prepareVertices(element);
      break;
    case ElementSemantic::face:
    case ElementSemantic::tristrips:
    case ElementSemantic::edge:
      wanted = prepareIndices(element);
      break;
    case ElementSemantic::material:
      prepareMaterials(element);
      wanted = true;
      break;
    case ElementSemantic::unknown:
      break;
  }
  m_marksInstances = m_primitive || m_customLists.size() > m_elementCustomLists;
  return wanted;
}

void PLYImporter::finishElement() {
  if (!m_element) return;
  m_badIndices.finish(*m_element);
  if (m_primitive && m_vcountsList) {
    spreadOverFaces();
  } else {
    evenTargets();
  }
  if (m_primitive) {
    m_primitive->attribute<std::uint32_t>(meshPrimitive_schema::indexCount(),
                                          static_cast<std::uint32_t>(m_indicesList->size()) - m_primitiveStart);
  }
  m_primitive = nullptr;
  m_element = nullptr;
}

void PLYImporter::evenTargets() {
  std::size_t length = 0;
  for (const Target& target : m_targets) length = std::max(length, target.size());
  for (const Target& target : m_targets) target.resize(length);
  for (base::vector<base::base_vec4<float>>* colours : m_opaqueColours) {
    for (auto& colour : *colours) colour.w = 1.0f;
  }
  m_opaqueColours.clear();
}

bool PLYImporter::prepareVertices(const Element& element) {
  base::AttribMap& mesh = *m_currentMesh;
  const std::uint32_t count = initialCount(element);
  bool wanted = false;
  // Lists made by an earlier vertex element take no values from this one.
  base::vector<base::base_vec3<float>>* positions = nullptr;
  base::vector<base::normal>* normals = nullptr;
  if (has(element, PropertySemantic::x)) {
    // A file may hold several vertex elements; the last one's positions are the mesh's, so
    // say that the earlier ones are no longer there.
    if (m_positionsList) {
      base::log().message(base::logScene, base::logWarning,
                          "Element 'vertex' appears again: its vertices replace the earlier ones, with all their data");
      dropVertexData();
    }
    positions = m_positionsList = &newMeshList<base::base_vec3<float>>(mesh, mesh_schema::positions(), count);
    wanted = true;
  }
  if (has(element, PropertySemantic::nx)) {
    normals = m_normalsList = &newMeshList<base::normal>(mesh, mesh_schema::normals(), count);
    wanted = true;
  }
  base::vector<std::uint32_t> uvTargets, colourTargets, floatTargets;
  if (const std::size_t k = countOf(element, [](PropertySemantic s) { return s == PropertySemantic::u; })) {
    m_uvLists.clear();
    for (std::size_t i = 0; i < k; ++i) {
      m_uvLists.push_back(
          &newSetList<base::base_vec2<float>>(mesh, mesh_schema::uvSets(), meshUVSet_schema::UV(), count));
      uvTargets.push_back(addTarget(*m_uvLists.back()));
    }
    wanted = true;
  }
  if (const std::size_t c = countOf(element, isRedLike)) {
    m_rgbLists.clear();
    m_rgbaLists.clear();
    const std::size_t a = countOf(element, isAlphaLike);
    for (std::size_t i = 0; i < c; ++i) {
      if (a == 0) {
        m_rgbLists.push_back(
            &newSetList<base::base_vec3<float>>(mesh, mesh_schema::colorSets(), meshColorSet_schema::RGB(), count));
        colourTargets.push_back(addTarget(*m_rgbLists.back()));
        continue;
      }
      auto& list =
          newSetList<base::base_vec4<float>>(mesh, mesh_schema::colorSets(), meshColorSet_schema::RGBA(), count);
      // A set that no alpha may reach reads as opaque; the others keep what the file gives.
      if (a != c) {
        for (auto& colour : list) colour.w = 1.0f;
      }
      m_rgbaLists.push_back(&list);
      colourTargets.push_back(addTarget(list));
    }
    wanted = true;
  }
  if (const std::size_t f = countOf(element, isFloatChannel)) {
    m_floatLists.clear();
    for (std::size_t i = 0; i < f; ++i) {
      m_floatLists.push_back(&newSetList<float>(mesh, mesh_schema::colorSets(), meshColorSet_schema::A(), count));
      floatTargets.push_back(addTarget(*m_floatLists.back()));
    }
  }
  if (has(element, PropertySemantic::materialIndex)) wanted = true;
  routeVertexProperties(element, positions ? addTarget(*positions) : noTarget, normals ? addTarget(*normals) : noTarget,
                        uvTargets, colourTargets, floatTargets);
  prepareCustomProperties(element);
  return wanted || std::any_of(m_routes.begin(), m_routes.end(), [](const Route& route) {
           return route.kind == Route::Kind::customList || route.conversion == Conversion::native;
         });
}

void PLYImporter::dropVertexData() {
  // Lists of the vertices that are no longer the mesh's cannot stay beside the new ones:
  // nothing could tell which vertices they describe.
  base::AttribMap& mesh = *m_currentMesh;
  mesh.removeMember(mesh_schema::normals());
  m_normalsList = nullptr;
  for (const base::name_id sets : {mesh_schema::uvSets(), mesh_schema::colorSets()}) {
    base::AttribArray& array = scene::arrayMember(mesh, sets);
    for (std::uint32_t k = array.size(); k-- > 0;) {
      const base::AttribMap* set = scene::mapAt(array, k);
      // Face-varying sets (with their own index channel) belong to faces, which stay.
      if (!set || !set->findMember(meshUVSet_schema::indices())) array.erase(static_cast<int>(k));
    }
  }
  removeKeptVertexProperties(mesh);
}

void PLYImporter::routeVertexProperties(const Element& element, std::uint32_t positions, std::uint32_t normals,
                                        const base::vector<std::uint32_t>& uvTargets,
                                        const base::vector<std::uint32_t>& colourTargets,
                                        const base::vector<std::uint32_t>& floatTargets) {
  // The colour groups: one per red-like property, in order, each with its family.
  base::vector<std::uint32_t> groupFamily;
  for (const Property& property : element.properties) {
    std::uint32_t family = 0, channel = 0;
    if (isRedLike(property.semantic) && colourChannel(property.semantic, family, channel))
      groupFamily.push_back(family);
  }
  base::vector<std::array<bool, 4>> filled(groupFamily.size(), {false, false, false, false});
  std::uint32_t uvCursor = 0, floatCursor = 0;
  for (std::size_t p = 0; p < element.properties.size(); ++p) {
    const Property& property = element.properties[p];
    Route& route = m_routes[p];
    if (property.isList) {
      route.kind = property.semantic == PropertySemantic::vertexIndex ? Route::Kind::indices : Route::Kind::drop;
      continue;
    }
    const auto value = [&](std::uint32_t target, std::uint32_t offset, Conversion conversion) {
      if (target != noTarget) route = Route{Route::Kind::value, conversion, target, offset};
    };
    std::uint32_t family = 0, channel = 0;
    switch (importedSemantic(property)) {
      case PropertySemantic::x:
      case PropertySemantic::y:
      case PropertySemantic::z:
        value(positions, 4 * static_cast<std::uint32_t>(property.semantic), Conversion::toFloat);
        break;
      case PropertySemantic::nx:
      case PropertySemantic::ny:
      case PropertySemantic::nz:
        value(normals, 4 * (static_cast<std::uint32_t>(property.semantic) - 3), Conversion::toFloat);
        break;
      case PropertySemantic::u:
        if (uvCursor < uvTargets.size()) value(uvTargets[uvCursor], 0, Conversion::toFloat);
        break;
      case PropertySemantic::v:
        if (uvCursor < uvTargets.size()) value(uvTargets[uvCursor], 4, Conversion::toFloat);
        ++uvCursor;
        break;
      case PropertySemantic::specularPower:
      case PropertySemantic::opacity:
        if (floatCursor < floatTargets.size()) value(floatTargets[floatCursor], 0, Conversion::normalised);
        ++floatCursor;
        break;
      default:
        if (colourChannel(property.semantic, family, channel)) {
          const std::size_t group = colourGroup(groupFamily, filled, family, channel);
          if (group < colourTargets.size() && (channel < 3 || !m_rgbaLists.empty())) {
            filled[group][channel] = true;
            value(colourTargets[group], 4 * channel, Conversion::normalised);
          }
        }
        break;
    }
  }
  // Lists that grow with the data start without their opaque alpha.
  m_opaqueColours.clear();
  for (std::size_t g = 0; !m_sized && g < m_rgbaLists.size() && g < filled.size(); ++g) {
    if (!filled[g][3]) m_opaqueColours.push_back(m_rgbaLists[g]);
  }
}

std::size_t PLYImporter::colourGroup(const base::vector<std::uint32_t>& groupFamily,
                                     const base::vector<std::array<bool, 4>>& filled, std::uint32_t family,
                                     std::uint32_t channel) {
  // The first group of the property's own family that lacks this channel; a family without
  // groups of its own (an alpha of another family, say) takes the first group that lacks it.
  const bool familyHasGroups = std::find(groupFamily.begin(), groupFamily.end(), family) != groupFamily.end();
  for (std::size_t g = 0; g < groupFamily.size(); ++g) {
    if ((!familyHasGroups || groupFamily[g] == family) && !filled[g][channel]) return g;
  }
  return groupFamily.size();
}

bool PLYImporter::prepareIndices(const Element& element) {
  const bool faces = element.semantic == ElementSemantic::face;
  if (!has(element, PropertySemantic::vertexIndex)) return false;
  // Every index element appends to one shared list; its primitive names its own range.
  m_indicesList = &m_currentMesh->attribute<base::vector<std::uint32_t>>(mesh_schema::indices());
  m_primitiveStart = static_cast<std::uint32_t>(m_indicesList->size());
  m_primitive = &newPrimitive();
  m_primitive->attribute<std::uint32_t>(meshPrimitive_schema::indexStart(), m_primitiveStart);
  m_vcountsList = nullptr;
  m_ecountsList = nullptr;
  m_sink = ListSink{};
  m_sink.items = m_indicesList;
  if (m_positionsList) m_sink.vertexCount = static_cast<std::uint32_t>(m_positionsList->size());
  if (element.semantic == ElementSemantic::tristrips) {
    m_ecountsList = &m_primitive->attribute<base::vector<std::uint32_t>>(meshPrimitive_schema::ecounts(),
                                                                         emptyList<std::uint32_t>());
    m_sink.runCounts = m_ecountsList;
  } else {
    m_sink.maxLength = longestFace;
    if (faces) {
      m_vcountsList = &m_primitive->attribute<base::vector<std::uint16_t>>(meshPrimitive_schema::vcounts(),
                                                                           emptyList<std::uint16_t>());
      m_sink.listCounts = m_vcountsList;
    } else {
      m_primitive->attribute<std::uint16_t>(meshPrimitive_schema::vcounts(), 2);
    }
  }
  m_listsPerInstance = 0;
  for (std::size_t p = 0; p < element.properties.size(); ++p) {
    if (element.properties[p].semantic != PropertySemantic::vertexIndex) continue;
    m_routes[p].kind = Route::Kind::indices;
    ++m_listsPerInstance;
  }
  if (faces) {
    prepareFaceData(element);
    prepareCustomProperties(element);
  }
  return true;
}

base::AttribMap& PLYImporter::newPrimitive() {
  return scene::appendMap(scene::arrayMember(*m_currentMesh, mesh_schema::primitives()));
}

bool PLYImporter::plyPlan(const Element& element, ElementPlan& plan) {
  if (!m_columnPlans || element.semantic == ElementSemantic::material) return false;
  for (const Target& target : m_targets) plan.arrays.push_back({target.resize, target.stride});
  if (m_primitive) plan.sinks.push_back(m_sink);
  const auto itemSink = static_cast<std::uint32_t>(plan.sinks.size());
  if (m_faceUVSet) plan.sinks.push_back(m_itemSink);
  for (std::size_t p = 0; p < element.properties.size(); ++p) {
    const Route& route = m_routes[p];
    PropertyPlan property;
    switch (route.kind) {
      case Route::Kind::drop:
        property.kind = PropertyPlan::Kind::skip;
        break;
      case Route::Kind::value:
        property = {PropertyPlan::Kind::scalar, route.conversion, route.target, route.offset};
        break;
      case Route::Kind::indices:
        // A lone index (not a list) and indices outside an index element are the receiver's.
        if (m_primitive && element.properties[p].isList) property.kind = PropertyPlan::Kind::indices;
        break;
      case Route::Kind::faceItems:
        property = {PropertyPlan::Kind::itemList, Conversion::toFloat};
        property.sink = itemSink;
        break;
      case Route::Kind::customList:
      case Route::Kind::material:
        break;
    }
    plan.properties.push_back(property);
  }
  return true;
}

void PLYImporter::plyProperty(const Element& element, const Property& property, const ValueArray& values) {
  const Route& route = m_routes[static_cast<std::size_t>(&property - element.properties.data())];
  switch (route.kind) {
    case Route::Kind::drop:
      return;
    case Route::Kind::value:
      storeValue(route, property, values);
      return;
    case Route::Kind::indices:
      storeIndices(property, values);
      return;
    case Route::Kind::faceItems:
      storeFaceItems(property, values);
      return;
    case Route::Kind::customList:
      storeCustomList(route, property, values);
      return;
    case Route::Kind::material:
      if (!values.empty()) storeMaterialValue(property, toFP(values[0], property));
      return;
  }
}

void PLYImporter::markInstance() {
  if (m_primitive) {
    m_mark.indices = m_indicesList->size();
    m_mark.faceCounts = m_vcountsList ? m_vcountsList->size() : 0;
    m_mark.runCounts = m_ecountsList ? m_ecountsList->size() : 0;
  }
  if (m_faceUVSet) {
    m_mark.items = m_faceItems.size();
    m_mark.itemCounts = m_faceItemCounts.size();
  }
  for (std::size_t k = m_elementCustomLists; k < m_customLists.size(); ++k) {
    m_customLists[k].countsMark = m_customLists[k].counts->size();
    m_customLists[k].itemsMark = m_customLists[k].items.size();
  }
}

void PLYImporter::dropInstance(std::uint32_t index) {
  if (m_primitive) {
    m_indicesList->resize(m_mark.indices);
    if (m_vcountsList) m_vcountsList->resize(m_mark.faceCounts);
    if (m_ecountsList) m_ecountsList->resize(m_mark.runCounts);
  }
  // Lists of values per instance keep the instance's place with an empty list, so that they
  // stay in step with the values stored by instance number.
  if (m_faceUVSet) {
    m_faceItems.resize(m_mark.items);
    m_faceItemCounts.resize(m_mark.itemCounts);
    base::append(m_faceItemCounts, std::uint16_t{0});
  }
  for (std::size_t k = m_elementCustomLists; k < m_customLists.size(); ++k) {
    CustomList& list = m_customLists[k];
    list.counts->resize(list.countsMark);
    list.items.resize(list.itemsMark);
    base::append(*list.counts, 0u);
  }
  // A vertex keeps its place even when its line ended before any of its values.
  if (!m_primitive) {
    for (const Target& target : m_targets) {
      if (target.size() <= index) target.resize(std::size_t(index) + 1);
    }
  }
  base::append(m_dropped, index);
}

void PLYImporter::storeValue(const Route& route, const Property& property, const ValueArray& values) {
  const Target& target = m_targets[route.target];
  if (values.empty()) return;
  // Lists that grow with the data take each instance as it arrives.
  if (m_instanceIndex >= target.size()) target.resize(std::size_t(m_instanceIndex) + 1);
  std::byte* at = target.resize(target.size()) + std::size_t(m_instanceIndex) * target.stride + route.offset;
  if (route.conversion == Conversion::native) return storeNative(values[0], property.type, at);
  const float value = converted(values[0], property, route.conversion);
  std::memcpy(at, &value, sizeof value);
}

void PLYImporter::storeIndices(const Property& property, const ValueArray& values) {
  if (!m_indicesList) {
    base::raise<base::exception>("ply::PLYImporter::plyProperty",
                                 "Trying to process vertex indices without supported element!");
  }
  // Indices in an element that is no face, strip or edge element have no primitive to go to.
  if (!m_primitive) return;
  if (!m_sink.runCounts && values.size() > longestFace) {
    base::raise<base::exception>("ply::PLYImporter::plyProperty",
                                 "Trying to process more then 65535 vertex indices for a face. This is not "
                                 "supported, aborting!");
  }
  m_scratch.resize(values.size());
  for (std::size_t k = 0; k < values.size(); ++k) {
    m_scratch[k] = static_cast<std::uint32_t>(values[k].convertTo<std::int64_t>(property.type));
  }
  detail::storeList(m_sink, m_scratch.data(), m_scratch.size(), m_badIndices);
}

}  // namespace ply
