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

// The instance of face f: sources[f], or f itself when there are no sources.
std::uint32_t sourceOf(const base::vector<std::uint32_t>& sources, std::size_t f) {
  return sources.empty() ? static_cast<std::uint32_t>(f) : sources[f];
}

// Record f of `target` becomes the record of face f's instance; `faces` records remain.
void gatherRecords(const ListTarget& target, const base::vector<std::uint32_t>& sources, std::size_t faces) {
  if (sources.empty()) {
    target.resize(faces);
    return;
  }
  const std::size_t stride = target.stride;
  const std::size_t have = target.size();
  const std::byte* from = target.resize(have);
  base::vector<std::byte> gathered(faces * stride);
  for (std::size_t f = 0; f < faces; ++f) {
    if (sources[f] < have) std::memcpy(gathered.data() + f * stride, from + sources[f] * stride, stride);
  }
  if (faces > 0) std::memcpy(target.resize(faces), gathered.data(), gathered.size());
}

// The same for lists: `counts` has an entry per instance and `items` every list's items.
void gatherLists(base::vector<std::uint32_t>& counts, const ListTarget& items,
                 const base::vector<std::uint32_t>& sources, std::size_t faces) {
  base::vector<std::uint64_t> starts(counts.size() + 1, 0);
  for (std::size_t k = 0; k < counts.size(); ++k) starts[k + 1] = starts[k] + counts[k];
  const std::size_t stride = items.stride;
  const std::byte* from = items.resize(items.size());
  base::vector<std::uint32_t> gatheredCounts;
  base::vector<std::byte> gatheredItems;
  gatheredCounts.reserve(faces);
  for (std::size_t f = 0; f < faces; ++f) {
    const std::uint32_t instance = sourceOf(sources, f);
    if (instance >= counts.size()) {
      gatheredCounts.push_back(0);
      continue;
    }
    gatheredCounts.push_back(counts[instance]);
    gatheredItems.insert(gatheredItems.end(), from + starts[instance] * stride, from + starts[instance + 1] * stride);
  }
  counts.swap(gatheredCounts);
  std::byte* to = items.resize(gatheredItems.size() / stride);
  if (!gatheredItems.empty()) std::memcpy(to, gatheredItems.data(), gatheredItems.size());
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

base::vector<std::uint32_t> PLYImporter::faceSources() const {
  base::vector<std::uint32_t> sources;
  if (m_dropped.empty() && m_listsPerInstance == 1) return sources;
  const std::size_t faces = m_vcountsList->size();
  sources.reserve(faces);
  auto dropped = m_dropped.begin();
  for (std::uint32_t instance = 0; instance < m_element->count && sources.size() < faces; ++instance) {
    if (dropped != m_dropped.end() && *dropped == instance) {
      ++dropped;
      continue;
    }
    for (std::uint32_t k = 0; k < m_listsPerInstance && sources.size() < faces; ++k) sources.push_back(instance);
  }
  sources.resize(faces, m_element->count);  // faces of no instance take none of their values
  return sources;
}

void PLYImporter::spreadOverFaces() {
  const base::vector<std::uint32_t> sources = faceSources();
  const std::size_t faces = m_vcountsList->size();
  for (const Target& target : m_targets) gatherRecords(target, sources, faces);
  for (std::size_t k = m_elementCustomLists; k < m_customLists.size(); ++k) {
    gatherLists(*m_customLists[k].counts, m_customLists[k].items, sources, faces);
  }
  finishFaceData(sources);
}

void PLYImporter::finishFaceData(const base::vector<std::uint32_t>& sources) {
  if (!m_faceColourSet && !m_faceUVSet) return;
  const std::uint32_t start = m_primitiveStart;
  const auto corners = static_cast<std::uint32_t>(m_indicesList->size()) - start;
  if (m_faceColourSet) {
    // One colour per face read (spread over the faces already): the corners of face f point
    // at colour f.
    const auto faces = static_cast<std::uint32_t>(m_vcountsList->size());
    base::vector<std::uint32_t>& channel = newFaceChannel(*m_faceColourSet, start, corners);
    const std::size_t end = std::size_t(start) + corners;
    for (std::uint32_t f = 0; f < faces && channel.size() < end; ++f) {
      channel.insert(channel.end(), std::min<std::size_t>((*m_vcountsList)[f], end - channel.size()), f);
    }
    channel.resize(end, invalidIndex);
  }
  if (m_faceUVSet) finishFaceUVs(start, corners, sources);
  m_faceColourSet = nullptr;
  m_faceUVSet = nullptr;
}

void PLYImporter::finishFaceUVs(std::uint32_t start, std::uint32_t corners,
                                const base::vector<std::uint32_t>& sources) {
  using UV = base::base_vec2<float>;
  base::vector<UV>& uvs = m_faceUVSet->attribute<base::vector<UV>>(meshUVSet_schema::UV(), base::vector<UV>());
  base::vector<std::uint32_t>& channel = newFaceChannel(*m_faceUVSet, start, corners);
  channel.resize(std::size_t(start) + corners);
  std::iota(channel.begin() + start, channel.end(), 0u);
  const base::vector<std::uint16_t>& faces = *m_vcountsList;
  const bool matching = sources.empty() && m_faceItemCounts.size() == faces.size() &&
                        m_faceItems.size() == 2 * std::size_t(corners) &&
                        std::equal(faces.begin(), faces.end(), m_faceItemCounts.begin(),
                                   [](std::uint16_t n, std::uint16_t items) { return 2u * n == items; });
  uvs.resize(corners);
  if (matching) {
    if (!m_faceItems.empty()) {
      std::memcpy(static_cast<void*>(uvs.data()), m_faceItems.data(), m_faceItems.size() * sizeof(std::uint32_t));
    }
  } else {
    spreadFaceUVs(uvs, sources);
  }
  base::release(m_faceItems);
  base::release(m_faceItemCounts);
}

void PLYImporter::spreadFaceUVs(base::vector<base::base_vec2<float>>& uvs, const base::vector<std::uint32_t>& sources) {
  // An instance's list covers the corners of every face it gave, in order; missing pairs
  // read (0, 0). Lists come one per instance, an instance that was left out has an empty one.
  using UV = base::base_vec2<float>;
  const base::vector<std::uint16_t>& faces = *m_vcountsList;
  std::size_t item = 0, corner = 0, mismatched = 0;
  std::uint32_t listed = 0;  // instances whose lists lie before `item`
  for (std::size_t f = 0; f < faces.size();) {
    const std::uint32_t instance = sourceOf(sources, f);
    std::size_t instanceCorners = 0;
    const std::size_t first = corner;
    for (; f < faces.size() && sourceOf(sources, f) == instance; ++f) instanceCorners += faces[f];
    for (; listed < instance && listed < m_faceItemCounts.size(); ++listed) item += m_faceItemCounts[listed];
    const std::size_t items = instance < m_faceItemCounts.size() ? m_faceItemCounts[instance] : 0;
    const std::size_t pairs = std::min({instanceCorners, items / 2, uvs.size() - std::min(first, uvs.size())});
    if (pairs > 0) std::memcpy(static_cast<void*>(uvs.data() + first), m_faceItems.data() + item, pairs * sizeof(UV));
    if (items != 2 * instanceCorners) ++mismatched;
    corner = first + instanceCorners;
  }
  if (mismatched == 0) return;
  base::log().message(base::logScene, base::logWarning,
                      "Element '{}': {} faces have a texcoord list without two values per corner: corners without "
                      "values read (0, 0), values beyond the corners are dropped",
                      base::clipped(displayName(*m_element)), mismatched);
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
