#pragma once

#include "b_attribute_map.h"

#include <cstdint>
#include <span>

namespace scene {

/// Rewrites a mesh's index channels primitive by primitive into a canonical, sorted and
/// delta-encoded form and marks the mesh `indicesDeltaCompression`. Each face is rotated to
/// start at its smallest index (keeping its winding), the faces of a primitive are sorted,
/// and the first channel holds differences; the other channels move in step. Every later
/// user of face order (face-varying data, per-face attributes) must be encoded with it.
/// `companions` are channels of the caller's that move in step as well (per-corner face
/// numbers, say, to learn the new order of per-face data). False, with the mesh unchanged,
/// for a mesh without indices, one already marked, or one whose channels (companions too)
/// are links or differ in length.
///
/// A primitive is left as it is without `vcounts` (strips), with a `vcounts` list holding a
/// count below 3 or reached through a link (which others may share), or with a single count
/// outside 2 to 4; a range beyond the channels is cut to them, and faces that the range does
/// not hold whole are left out. Ranges and counts are read with links followed.
bool encodeIndexDeltas(base::AttribMap& mesh, std::span<base::vector<std::uint32_t>* const> companions = {});

/// Encodes one primitive's range: `channels` point at the range's first index in each
/// channel, `count` indices each. `faceCounts` (rewritten in the sorted order) gives each
/// face's count, or is empty when every face has `uniformCount` indices.
void encodeRangeDeltas(std::span<std::uint32_t* const> channels, std::uint32_t count,
                       std::span<std::uint16_t> faceCounts, std::uint32_t uniformCount);

/// Turns the differences of a marked mesh's first channel back into plain indices and
/// clears the mark; the faces stay rotated and sorted. Touches exactly the primitives that
/// encodeIndexDeltas encodes. False, unchanged, for a mesh that is not marked.
bool decodeIndexDeltas(base::AttribMap& mesh);

/// The mesh's `indices` (links followed) as plain indices: decoded when the mesh is marked
/// and the list is its own, as stored otherwise (empty without indices). The mesh is not
/// changed.
base::vector<std::uint32_t> decodedIndices(const base::AttribMap& mesh);

/// Reverses the difference pass of encodeRangeDeltas on one range of the first channel.
void decodeRangeDeltas(std::uint32_t* channel, std::uint32_t count, std::span<const std::uint16_t> faceCounts,
                       std::uint32_t uniformCount);

}  // namespace scene
