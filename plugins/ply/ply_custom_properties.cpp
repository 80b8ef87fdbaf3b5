// Custom properties, kept when the importer's importCustomProperties parameter is on: every
// vertex or face property that no semantic claims becomes a mesh list named "ply:" and the
// property's name, in the property's own type, one entry per instance. A list property
// becomes "ply:NAME.counts" (uint32, one per instance) and "ply:NAME.items". Per-face lists
// follow the faces into the order the delta encoding gives them.

#include "b_log.h"
#include "ply_columns.h"
#include "ply_kept_properties.h"
#include "ply_loader.h"
#include "scene_index_delta.h"
#include "scene_mesh.h"
#include "scene_schema.h"

#include <fmt/format.h>

namespace ply {
namespace {

using scene::mesh_schema;
using scene::meshPrimitive_schema;

constexpr std::uint32_t noFace = 0xFFFFFFFFu;

// Entries 0 to order.size() - 1 take the entries order names; later ones stay.
template <class T>
void reorderEntries(base::vector<T>& list, const base::vector<std::uint32_t>& order) {
  if (list.size() < order.size()) return;
  base::vector<T> sorted(list.begin(), list.end());
  for (std::size_t k = 0; k < order.size(); ++k) {
    if (order[k] < list.size()) sorted[k] = list[order[k]];
  }
  list.swap(sorted);
}

// The items of each instance's list, moved with the instances.
template <class T>
void reorderLists(base::vector<std::uint32_t>& counts, base::vector<T>& items,
                  const base::vector<std::uint32_t>& order) {
  if (counts.size() < order.size()) return;
  base::vector<std::uint64_t> starts(counts.size() + 1, 0);
  for (std::size_t k = 0; k < counts.size(); ++k) starts[k + 1] = starts[k] + counts[k];
  if (starts.back() != items.size()) return;
  base::vector<T> sortedItems;
  sortedItems.reserve(items.size());
  for (std::size_t k = 0; k < counts.size(); ++k) {
    const std::size_t from = k < order.size() && order[k] < counts.size() ? order[k] : k;
    sortedItems.insert(sortedItems.end(), items.begin() + starts[from], items.begin() + starts[from + 1]);
  }
  items.swap(sortedItems);
  reorderEntries(counts, order);
}

// Calls each(offset, n) for every face of the primitive's range, in stored order.
template <class Each>
void forEachFaceOf(const base::AttribMap& primitive, Each each) {
  const scene::FaceCounts counts = scene::faceCountsOf(primitive);
  std::uint32_t offset = scene::scalarMember<std::uint32_t>(primitive, meshPrimitive_schema::indexStart()).value_or(0);
  if (counts.perFace) {
    for (const std::uint16_t n : *counts.perFace) {
      each(offset, n);
      offset += n;
    }
  } else if (counts.uniform && *counts.uniform > 0) {
    const std::uint32_t count =
        scene::scalarMember<std::uint32_t>(primitive, meshPrimitive_schema::indexCount()).value_or(0);
    for (std::uint32_t k = 0; k + *counts.uniform <= count; k += *counts.uniform) each(offset + k, *counts.uniform);
  }
}

bool isCustom(const Property& property, PropertySemantic imported) {
  return imported == PropertySemantic::unknown && !(property.isList && property.name == "texcoord");
}

}  // namespace

base::string PLYImporter::customName(const Element& element, std::string_view name) {
  // A name that an earlier element's property took gets the element's name as well, then a
  // number: a list once made is never replaced, as the faces' reordering holds on to it.
  const auto taken = [this](const base::string& candidate) {
    return m_currentMesh->findMember(base::intern(candidate)) ||
           m_currentMesh->findMember(base::intern(candidate + ".counts"));
  };
  const base::string plain = "ply:" + base::string(name);
  if (!taken(plain)) return plain;
  const base::string qualified = "ply:" + base::string(displayName(element)) + "." + base::string(name);
  base::string kept = qualified;
  for (int k = 2; taken(kept); ++k) kept = qualified + fmt::format(".{}", k).c_str();
  return kept;
}

void PLYImporter::prepareCustomProperties(const Element& element) {
  if (!m_importCustomProperties) return;
  const bool faces = element.semantic == ElementSemantic::face;
  const std::uint32_t primitive =
      faces ? static_cast<std::uint32_t>(scene::arrayMember(*m_currentMesh, mesh_schema::primitives()).size() - 1) : 0;
  for (std::size_t p = 0; p < element.properties.size(); ++p) {
    const Property& property = element.properties[p];
    if (m_routes[p].kind != Route::Kind::drop || !isCustom(property, importedSemantic(property))) continue;
    detail::forType<Conversion::native>(property.type, [&]<DataType T, Conversion>() {
      using Native = detail::NativeType<T>;
      const base::string name = customName(element, property.name);
      addKeptProperty(*m_currentMesh,
                      {property.word, element.word,
                       faces ? static_cast<std::int32_t>(primitive) : KeptProperty::vertexElement, name});
      if (!property.isList) {
        auto& list = m_currentMesh->attribute<base::vector<Native>>(base::intern(name), base::vector<Native>());
        list.resize(initialCount(element));  // sized like the mesh's other lists
        m_routes[p] = Route{Route::Kind::value, Conversion::native, addTarget(list), 0};
        if (faces) m_faceReorders.push_back({primitive, [&list](const auto& order) { reorderEntries(list, order); }});
        return true;
      }
      auto& counts = m_currentMesh->attribute<base::vector<std::uint32_t>>(base::intern(name + ".counts"),
                                                                           base::vector<std::uint32_t>());
      auto& items =
          m_currentMesh->attribute<base::vector<Native>>(base::intern(name + ".items"), base::vector<Native>());
      m_routes[p] =
          Route{Route::Kind::customList, Conversion::native, static_cast<std::uint32_t>(m_customLists.size()), 0};
      m_customLists.push_back({&counts, listTarget(items)});
      if (faces) {
        m_faceReorders.push_back(
            {primitive, [&counts, &items](const auto& order) { reorderLists(counts, items, order); }});
      }
      return true;
    });
  }
}

void PLYImporter::storeCustomList(const Route& route, const Property& property, const ValueArray& values) {
  CustomList& list = m_customLists[route.target];
  base::append(*list.counts, static_cast<std::uint32_t>(values.size()));
  const std::size_t start = list.items.size();
  std::byte* at = list.items.resize(start + values.size()) + start * list.items.stride;
  for (const Value& value : values) {
    storeNative(value, property.type, at);
    at += list.items.stride;
  }
}

void PLYImporter::encodeWithFaceOrder() {
  if (m_faceReorders.empty() || !m_indicesList) {
    scene::encodeIndexDeltas(*m_currentMesh);
    return;
  }
  // Each corner of a face primitive with per-face data carries its face's number through
  // the encoding, which then tells where each face went.
  base::vector<std::uint32_t> faceNumbers(m_indicesList->size(), noFace);
  base::AttribArray& primitives = scene::arrayMember(*m_currentMesh, mesh_schema::primitives());
  for (const FaceReorder& reorder : m_faceReorders) {
    std::uint32_t face = 0;
    forEachFaceOf(*scene::mapAt(primitives, reorder.primitive), [&](std::uint32_t offset, std::uint32_t n) {
      const std::uint32_t end = std::min<std::uint32_t>(offset + n, static_cast<std::uint32_t>(faceNumbers.size()));
      for (std::uint32_t k = offset; k < end; ++k) faceNumbers[k] = face;
      ++face;
    });
  }
  base::vector<std::uint32_t>* companions[] = {&faceNumbers};
  if (!scene::encodeIndexDeltas(*m_currentMesh, companions)) return;
  base::vector<std::uint32_t> order;
  for (const FaceReorder& reorder : m_faceReorders) {
    order.clear();
    forEachFaceOf(*scene::mapAt(primitives, reorder.primitive), [&](std::uint32_t offset, std::uint32_t n) {
      // A face without corners was not moved: the encoding leaves its primitive as it is.
      const auto k = static_cast<std::uint32_t>(order.size());
      base::append(order, n > 0 && offset < faceNumbers.size() ? faceNumbers[offset] : k);
    });
    reorder.apply(order);
  }
}

}  // namespace ply
