// Per-face data of the face element: its `texcoord` lists and its colours become face-varying
// sets of the mesh. Each set has an index channel beside the vertex indices (one entry per
// face corner), which the delta encoding moves with the faces; corners of other primitives
// hold the set's invalid index.

#include "b_log.h"
#include "ply_loader.h"
#include "scene_mesh.h"
#include "scene_schema.h"

#include <algorithm>
#include <bit>
#include <cstring>
#include <numeric>

namespace ply {
namespace {

using scene::mesh_schema;
using scene::meshColorSet_schema;
using scene::meshUVSet_schema;

constexpr std::uint32_t invalidIndex = 0xFFFFFFFFu;
// A face's texcoord list is kept up to this many values, the most a face's count list holds.
constexpr std::uint32_t longestItemList = 65535;

bool isFaceColour(PropertySemantic s) {
  return s == PropertySemantic::red || s == PropertySemantic::green || s == PropertySemantic::blue ||
         s == PropertySemantic::alpha;
}

bool isTexcoordList(const Property& property) {
  return property.isList && property.semantic == PropertySemantic::unknown && property.name == "texcoord";
}

template <class T>
base::vector<T>& newFaceColours(base::AttribMap& set, std::uint32_t count) {
  base::vector<T>& list = set.attribute<base::vector<T>>(
      std::is_same_v<T, base::base_vec4<float>> ? meshColorSet_schema::RGBA() : meshColorSet_schema::RGB(),
      base::vector<T>());
  list.resize(count);
  return list;
}

}  // namespace

void PLYImporter::prepareFaceData(const Element& element) {
  m_faceUVSet = nullptr;
  m_faceColourSet = nullptr;
  const bool colours = std::any_of(element.properties.begin(), element.properties.end(),
                                   [](const Property& p) { return p.semantic == PropertySemantic::red; });
  if (colours) {
    m_faceColourSet = &scene::appendMap(scene::arrayMember(*m_currentMesh, mesh_schema::colorSets()));
    const bool alpha = std::any_of(element.properties.begin(), element.properties.end(),
                                   [](const Property& p) { return p.semantic == PropertySemantic::alpha; });
    const std::uint32_t target =
        alpha ? addTarget(newFaceColours<base::base_vec4<float>>(*m_faceColourSet, initialCount(element)))
              : addTarget(newFaceColours<base::base_vec3<float>>(*m_faceColourSet, initialCount(element)));
    for (std::size_t p = 0; p < element.properties.size(); ++p) {
      const Property& property = element.properties[p];
      if (property.isList || !isFaceColour(property.semantic)) continue;
      const auto channel =
          static_cast<std::uint32_t>(property.semantic) - static_cast<std::uint32_t>(PropertySemantic::red);
      if (channel == 3 && !alpha) continue;
      m_routes[p] = Route{Route::Kind::value, Conversion::normalised, target, 4 * channel};
    }
  }
  const auto texcoord = std::find_if(element.properties.begin(), element.properties.end(), isTexcoordList);
  if (texcoord == element.properties.end()) return;
  m_faceUVSet = &scene::appendMap(scene::arrayMember(*m_currentMesh, mesh_schema::uvSets()));
  m_faceItems.clear();
  m_faceItemCounts.clear();
  m_itemSink = ListSink{};
  m_itemSink.items = &m_faceItems;
  m_itemSink.listCounts = &m_faceItemCounts;
  m_itemSink.maxLength = longestItemList;
  m_routes[static_cast<std::size_t>(texcoord - element.properties.begin())].kind = Route::Kind::faceItems;
}

void PLYImporter::storeFaceItems(const Property& property, const ValueArray& values) {
  // Longer lists than a plan takes come here; what a count cannot hold is left out.
  const std::size_t count = std::min<std::size_t>(values.size(), longestItemList);
  base::reserveForAppend(m_faceItems, count);
  for (std::size_t k = 0; k < count; ++k) {
    base::append(m_faceItems, std::bit_cast<std::uint32_t>(values[k].convertTo<float>(property.type)));
  }
  base::append(m_faceItemCounts, static_cast<std::uint16_t>(count));
}

void PLYImporter::finishFaceData() {
  if (!m_vcountsList || (!m_faceColourSet && !m_faceUVSet)) return;
  const std::uint32_t start = m_primitiveStart;
  const auto corners = static_cast<std::uint32_t>(m_indicesList->size()) - start;
  if (m_faceColourSet) {
    // One colour per face read: the corners of face f point at colour f.
    const auto faces = static_cast<std::uint32_t>(m_vcountsList->size());
    if (m_faceColourSet->findMember(meshColorSet_schema::RGBA())) {
      m_faceColourSet->attribute<base::vector<base::base_vec4<float>>>(meshColorSet_schema::RGBA()).resize(faces);
    } else {
      m_faceColourSet->attribute<base::vector<base::base_vec3<float>>>(meshColorSet_schema::RGB()).resize(faces);
    }
    base::vector<std::uint32_t>& channel = newFaceChannel(*m_faceColourSet, start, corners);
    const std::size_t end = std::size_t(start) + corners;
    for (std::uint32_t f = 0; f < faces && channel.size() < end; ++f) {
      channel.insert(channel.end(), std::min<std::size_t>((*m_vcountsList)[f], end - channel.size()), f);
    }
    channel.resize(end, invalidIndex);
  }
  if (m_faceUVSet) finishFaceUVs(start, corners);
  m_faceColourSet = nullptr;
  m_faceUVSet = nullptr;
}

void PLYImporter::finishFaceUVs(std::uint32_t start, std::uint32_t corners) {
  using UV = base::base_vec2<float>;
  base::vector<UV>& uvs = m_faceUVSet->attribute<base::vector<UV>>(meshUVSet_schema::UV(), base::vector<UV>());
  base::vector<std::uint32_t>& channel = newFaceChannel(*m_faceUVSet, start, corners);
  channel.resize(std::size_t(start) + corners);
  std::iota(channel.begin() + start, channel.end(), 0u);
  const base::vector<std::uint16_t>& faces = *m_vcountsList;
  const bool matching = m_faceItemCounts.size() == faces.size() && m_faceItems.size() == 2 * std::size_t(corners) &&
                        std::equal(faces.begin(), faces.end(), m_faceItemCounts.begin(),
                                   [](std::uint16_t n, std::uint16_t items) { return 2u * n == items; });
  uvs.resize(corners);
  if (matching) {
    if (!m_faceItems.empty()) {
      std::memcpy(static_cast<void*>(uvs.data()), m_faceItems.data(), m_faceItems.size() * sizeof(std::uint32_t));
    }
  } else {
    // Each face takes the pairs its list has for its corners; missing ones read (0, 0).
    std::size_t item = 0, corner = 0, mismatched = 0;
    for (std::size_t f = 0; f < faces.size(); ++f) {
      const std::size_t items = f < m_faceItemCounts.size() ? m_faceItemCounts[f] : 0;
      const std::size_t pairs =
          std::min<std::size_t>({faces[f], items / 2, corners - std::min<std::size_t>(corner, corners)});
      if (pairs > 0)
        std::memcpy(static_cast<void*>(uvs.data() + corner), m_faceItems.data() + item, pairs * sizeof(UV));
      if (items != 2u * faces[f]) ++mismatched;
      item += items;
      corner += faces[f];
    }
    base::log().message(base::logScene, base::logWarning,
                        "{} faces have a texcoord list without two values per corner: corners without values read "
                        "(0, 0), values beyond the corners are dropped",
                        mismatched);
  }
  m_faceItems = {};
  m_faceItemCounts = {};
}

base::vector<std::uint32_t>& PLYImporter::newFaceChannel(base::AttribMap& set, std::uint32_t start,
                                                         std::uint32_t corners) {
  set.attribute<std::uint32_t>(meshUVSet_schema::invalidIndex(), invalidIndex);
  base::vector<std::uint32_t>& channel =
      set.attribute<base::vector<std::uint32_t>>(meshUVSet_schema::indices(), base::vector<std::uint32_t>());
  // The corners before the set's own range; the caller appends the range's.
  channel.reserve(std::size_t(start) + corners);
  channel.assign(start, invalidIndex);
  base::append(m_faceChannels, &channel);
  return channel;
}

void PLYImporter::padFaceChannels() {
  const std::size_t length = m_indicesList ? m_indicesList->size() : 0;
  for (base::vector<std::uint32_t>* channel : m_faceChannels) channel->resize(length, invalidIndex);
  m_faceChannels.clear();
}

}  // namespace ply
