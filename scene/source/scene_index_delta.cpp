#include "scene_index_delta.h"

#include "b_log.h"
#include "scene_face_sort.h"
#include "scene_mesh.h"
#include "scene_schema.h"

#include <algorithm>
#include <array>

namespace scene {
namespace {

// Pass 1: the corner a face starts at, chosen on the first channel.
std::uint32_t startCorner(const std::uint32_t* f, std::uint32_t n) {
  if (n == 3) {
    if (f[1] <= f[0] && f[1] <= f[2]) return 1;
    if (f[2] <= f[0] && f[2] <= f[1]) return 2;
    return 0;
  }
  if (n == 4) {
    for (std::uint32_t s = 1; s < 4; ++s) {
      bool smallest = true;
      for (std::uint32_t j = 0; j < 4; ++j) smallest = smallest && (j == s || f[s] <= f[j]);
      if (smallest) return s;
    }
    return 0;
  }
  return static_cast<std::uint32_t>(std::min_element(f, f + n) - f);
}

// Faces of N indices: the same rotation in a loop the compiler sees through, with a loop of
// its own for a single channel.
template <std::uint32_t N>
void rotateUniform(std::span<std::uint32_t* const> channels, std::uint32_t count) {
  if (channels.size() == 1) {
    std::uint32_t* channel = channels[0];
    for (std::uint32_t* f = channel; f + N <= channel + count; f += N) {
      if (const std::uint32_t start = startCorner(f, N)) std::rotate(f, f + start, f + N);
    }
    return;
  }
  for (std::uint32_t offset = 0; offset + N <= count; offset += N) {
    const std::uint32_t start = startCorner(channels[0] + offset, N);
    if (start == 0) continue;
    for (std::uint32_t* channel : channels)
      std::rotate(channel + offset, channel + offset + start, channel + offset + N);
  }
}

void rotateFaces(std::span<std::uint32_t* const> channels, std::uint32_t count,
                 std::span<const std::uint16_t> faceCounts, std::uint32_t uniformCount) {
  if (faceCounts.empty()) {
    if (uniformCount == 2) return rotateUniform<2>(channels, count);
    if (uniformCount == 3) return rotateUniform<3>(channels, count);
    if (uniformCount == 4) return rotateUniform<4>(channels, count);
  }
  detail::forEachFace(count, faceCounts, uniformCount, [&](std::uint32_t offset, std::uint32_t n) {
    if (n == 2) {
      if (channels[0][offset + 1] < channels[0][offset]) {
        for (std::uint32_t* channel : channels) std::swap(channel[offset], channel[offset + 1]);
      }
      return;
    }
    const std::uint32_t start = startCorner(channels[0] + offset, n);
    if (start == 0) return;
    for (std::uint32_t* channel : channels)
      std::rotate(channel + offset, channel + offset + start, channel + offset + n);
  });
}

// Pass 3: each face against the previous one, from the last face to the first, so that the
// previous face still holds plain values. `startOf(k)` and `sizeOf(k)` describe face k.
template <class StartOf, class SizeOf>
void encodeFaces(std::uint32_t* channel, std::size_t faces, StartOf startOf, SizeOf sizeOf) {
  for (std::size_t k = faces; k-- > 0;) {
    std::uint32_t* f = channel + startOf(k);
    const std::uint32_t* p = k > 0 ? channel + startOf(k - 1) : nullptr;
    const std::uint32_t base = p && f[0] == p[0] ? p[1] : f[0];
    f[1] -= base;
    for (std::uint32_t j = 2; j < sizeOf(k); ++j) f[j] -= f[0];
    if (p) f[0] -= p[0];
  }
}

void encodeDeltas(std::uint32_t* channel, std::uint32_t count, std::span<const std::uint16_t> faceCounts,
                  std::uint32_t uniformCount, detail::FaceSortScratch& scratch) {
  if (faceCounts.empty()) {
    encodeFaces(
        channel, count / uniformCount, [uniformCount](std::size_t k) { return k * uniformCount; },
        [uniformCount](std::size_t) { return uniformCount; });
    return;
  }
  base::vector<std::uint32_t>& starts = scratch.starts;
  starts.clear();
  detail::forEachFace(count, faceCounts, uniformCount,
                      [&](std::uint32_t offset, std::uint32_t) { base::append(starts, offset); });
  encodeFaces(
      channel, starts.size(), [&starts](std::size_t k) { return starts[k]; },
      [faceCounts](std::size_t k) { return std::uint32_t(faceCounts[k]); });
}

void encodeRange(std::span<std::uint32_t* const> channels, std::uint32_t count, std::span<std::uint16_t> faceCounts,
                 std::uint32_t uniformCount, detail::FaceSortScratch& scratch) {
  if (channels.empty() || count == 0) return;
  rotateFaces(channels, count, faceCounts, uniformCount);
  detail::sortFaces(channels, count, faceCounts, uniformCount, scratch);
  encodeDeltas(channels[0], count, faceCounts, uniformCount, scratch);
}

// The channels of a mesh, first channel first; false (logged where the reason is the
// channels themselves) when the mesh cannot be encoded.
bool gatherChannels(base::AttribMap& mesh, base::vector<std::uint32_t*>& channels, std::uint32_t& length,
                    std::span<base::vector<std::uint32_t>* const> companions = {}) {
  base::vector<base::vector<std::uint32_t>*> lists;
  bool linked = false;
  const auto add = [&](base::AttribMap& map, base::name_id name) {
    const base::Attribute* member = map.findMember(name);
    if (!member) return;
    if (const_cast<base::Attribute*>(member)->asLink()) linked = true;
    if (member->type() == base::TypeTraits<std::uint32_t>::n_array_name) {
      lists.push_back(static_cast<base::vector<std::uint32_t>*>(const_cast<base::Attribute*>(member)->data()));
    }
  };
  add(mesh, mesh_schema::indices());
  if (lists.empty() || lists[0]->empty() || linked) return false;
  add(mesh, mesh_schema::positionIndices());
  add(mesh, mesh_schema::normalIndices());
  add(mesh, mesh_schema::tangentIndices());
  for (const base::name_id sets : {mesh_schema::uvSets(), mesh_schema::colorSets()}) {
    const base::AttribArray* array = findArrayMember(mesh, sets);
    for (std::uint32_t i = 0; array && i < array->size(); ++i) {
      if (base::AttribMap* set = mapAt(*array, i)) add(*set, meshUVSet_schema::indices());
    }
  }
  lists.insert(lists.end(), companions.begin(), companions.end());
  length = static_cast<std::uint32_t>(lists[0]->size());
  const bool inStep = std::all_of(lists.begin(), lists.end(), [&](const auto* list) { return list->size() == length; });
  if (linked || !inStep) {
    const base::string* name = mesh.findAttribute<base::string>(mesh_schema::name());
    base::log().message(base::logScene, base::logDebug,
                        "Failed to encode delta channel for mesh '{}'! Shared or verbose index channel detected.",
                        name ? std::string_view(*name) : std::string_view());
    return false;
  }
  for (base::vector<std::uint32_t>* list : lists) channels.push_back(list->data());
  return true;
}

// Calls `range(start, count, faceCounts, uniformCount)` for every primitive range that the
// encoding covers: whole faces of 2 to 4 indices each, or of 3 and more by a count list,
// inside the channels.
template <class Range>
void forEachEncodableRange(const base::AttribMap& mesh, std::uint32_t length, Range&& range) {
  const base::AttribArray* primitives = findArrayMember(mesh, mesh_schema::primitives());
  for (std::uint32_t i = 0; primitives && i < primitives->size(); ++i) {
    const base::AttribMap* primitive = mapAt(*primitives, i);
    if (!primitive) continue;
    const FaceCounts counts = faceCountsOf(*primitive);
    // Sorting rewrites a count list: one reached through a link may be shared.
    if (counts.perFace && !counts.own) continue;
    if (counts.uniform && (*counts.uniform < 2 || *counts.uniform > 4)) continue;
    if (counts.perFace && std::any_of(counts.perFace->begin(), counts.perFace->end(), [](auto n) { return n < 3; })) {
      continue;
    }
    if (!counts.present()) continue;
    const std::uint32_t start = valueOf<std::uint32_t>(*primitive, meshPrimitive_schema::indexStart()).value_or(0);
    if (start >= length) continue;
    std::uint32_t count = std::min(
        valueOf<std::uint32_t>(*primitive, meshPrimitive_schema::indexCount()).value_or(length), length - start);
    std::span<std::uint16_t> faceCounts;
    if (counts.perFace) {
      auto* list = const_cast<base::vector<std::uint16_t>*>(counts.perFace);
      std::size_t faces = 0;
      std::uint32_t covered = 0;
      while (faces < list->size() && covered + (*list)[faces] <= count) covered += (*list)[faces++];
      faceCounts = std::span<std::uint16_t>(list->data(), faces);
      count = covered;
    } else {
      count -= count % *counts.uniform;
    }
    if (count > 0) range(start, count, faceCounts, counts.perFace ? 3u : std::uint32_t(*counts.uniform));
  }
}

bool marked(const base::AttribMap& mesh) {
  return scalarMember<bool>(mesh, mesh_schema::indicesDeltaCompression()).value_or(false);
}

}  // namespace

void encodeRangeDeltas(std::span<std::uint32_t* const> channels, std::uint32_t count,
                       std::span<std::uint16_t> faceCounts, std::uint32_t uniformCount) {
  detail::FaceSortScratch scratch;
  encodeRange(channels, count, faceCounts, uniformCount, scratch);
}

void decodeRangeDeltas(std::uint32_t* channel, std::uint32_t count, std::span<const std::uint16_t> faceCounts,
                       std::uint32_t uniformCount) {
  const std::uint32_t* previous = nullptr;
  detail::forEachFace(count, faceCounts, uniformCount, [&](std::uint32_t offset, std::uint32_t n) {
    std::uint32_t* f = channel + offset;
    if (previous) f[0] += previous[0];
    const std::uint32_t base = previous && f[0] == previous[0] ? previous[1] : f[0];
    f[1] += base;
    for (std::uint32_t j = 2; j < n; ++j) f[j] += f[0];
    previous = f;
  });
}

bool encodeIndexDeltas(base::AttribMap& mesh, std::span<base::vector<std::uint32_t>* const> companions) {
  if (marked(mesh)) return false;
  base::vector<std::uint32_t*> channels;
  std::uint32_t length = 0;
  if (!gatherChannels(mesh, channels, length, companions)) return false;
  base::vector<std::uint32_t*> atStart(channels.size());
  detail::FaceSortScratch scratch;  // one for every range of the mesh
  forEachEncodableRange(
      mesh, length,
      [&](std::uint32_t start, std::uint32_t count, std::span<std::uint16_t> faceCounts, std::uint32_t uniformCount) {
        for (std::size_t c = 0; c < channels.size(); ++c) atStart[c] = channels[c] + start;
        encodeRange(atStart, count, faceCounts, uniformCount, scratch);
      });
  mesh.attribute<bool>(mesh_schema::indicesDeltaCompression(), true);
  return true;
}

bool decodeIndexDeltas(base::AttribMap& mesh) {
  if (!marked(mesh)) return false;
  base::vector<std::uint32_t*> channels;
  std::uint32_t length = 0;
  // Channels that no longer run in step cannot be decoded: the mark stays, so nobody reads
  // the differences as plain indices.
  if (!gatherChannels(mesh, channels, length)) return false;
  forEachEncodableRange(
      mesh, length,
      [&](std::uint32_t start, std::uint32_t count, std::span<std::uint16_t> faceCounts, std::uint32_t uniformCount) {
        decodeRangeDeltas(channels[0] + start, count, faceCounts, uniformCount);
      });
  mesh.attribute<bool>(mesh_schema::indicesDeltaCompression(), false);
  return true;
}

base::vector<std::uint32_t> decodedIndices(const base::AttribMap& mesh) {
  const base::vector<std::uint32_t>* stored = mesh.findVecAttribute<std::uint32_t>(mesh_schema::indices());
  if (!stored) return {};
  base::vector<std::uint32_t> plain = *stored;
  // Only the mesh's own list is ever encoded: one reached through a link holds plain indices.
  if (!marked(mesh) || stored != listMember<std::uint32_t>(mesh, mesh_schema::indices())) return plain;
  forEachEncodableRange(
      mesh, static_cast<std::uint32_t>(plain.size()),
      [&](std::uint32_t start, std::uint32_t count, std::span<std::uint16_t> faceCounts, std::uint32_t uniformCount) {
        decodeRangeDeltas(plain.data() + start, count, faceCounts, uniformCount);
      });
  return plain;
}

}  // namespace scene
