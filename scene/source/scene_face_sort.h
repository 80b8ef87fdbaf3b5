#pragma once

// The face order of the index delta encoding: the faces of one primitive range sorted by
// their indices (first index, then the next ones), every index channel moved in step. Faces
// are first put in runs by their first index (counted into a table), then each run is
// sorted on its own: a mesh's first indices are dense, so the runs are short. Indices too
// far apart for a table fall back to a comparison sort.

#include "b_containers.h"

#include <cstdint>
#include <span>

namespace scene::detail {

/// Calls `each(offset, n)` for every face of a range of `count` indices, in order: the faces
/// of `faceCounts`, or of `uniformCount` indices each when it is empty.
template <class Each>
void forEachFace(std::uint32_t count, std::span<const std::uint16_t> faceCounts, std::uint32_t uniformCount,
                 Each&& each) {
  if (faceCounts.empty()) {
    for (std::uint32_t offset = 0; offset + uniformCount <= count; offset += uniformCount) each(offset, uniformCount);
    return;
  }
  std::uint32_t offset = 0;
  for (const std::uint16_t n : faceCounts) {
    each(offset, n);
    offset += n;
  }
}

/// Where a face lies in its range.
struct FaceRecord {
  std::uint32_t start;
  std::uint16_t count;
};

/// Memory that the encoding reuses from one range of a mesh to the next: the table of runs
/// per first index, the face records and the copy of a channel that the general case needs
/// (uniform single-channel ranges are sorted in place and need neither; uniform ranges of
/// several channels sort their first channel's faces with their numbers in `records`).
struct FaceSortScratch {
  base::vector<std::uint32_t> starts;
  base::vector<std::uint32_t> next;
  base::vector<std::uint32_t> indices;
  base::vector<std::uint32_t> records;
  base::vector<std::uint8_t> flags;
  base::vector<FaceRecord> faces;
  base::vector<FaceRecord> sorted;
};

/// Sorts the faces of a range (`count` indices per channel, rotated so that each face starts
/// at its smallest first-channel index) by the first channel; `faceCounts` is rewritten in
/// the new order.
void sortFaces(std::span<std::uint32_t* const> channels, std::uint32_t count, std::span<std::uint16_t> faceCounts,
               std::uint32_t uniformCount, FaceSortScratch& scratch);

}  // namespace scene::detail
