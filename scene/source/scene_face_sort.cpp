#include "scene_face_sort.h"

#include <algorithm>
#include <array>
#include <numeric>

namespace scene::detail {
namespace {

constexpr std::uint32_t absent = 0xFFFFFFFFu;
// Runs this short are sorted by insertion: most runs hold a handful of faces.
constexpr std::ptrdiff_t shortRun = 16;

template <class Record, class Less>
void sortRun(Record* first, Record* last, Less less) {
  if (last - first > shortRun) {
    std::sort(first, last, less);
    return;
  }
  for (Record* at = first + 1; at < last; ++at) {
    Record moving = *at;
    Record* hole = at;
    for (; hole > first && less(moving, hole[-1]); --hole) *hole = hole[-1];
    *hole = moving;
  }
}

// Counts the records per first key into `table` (entry k + 1 for key k) and turns the
// counts into run starts: afterwards table[k] is where key k's run starts and table[k + 1]
// where it ends. False, with nothing counted, when the keys are too sparse for a table (more
// entries than twice the records and 64 Ki), which keeps the table bounded by the data
// whatever the indices are.
template <class Record, class FirstOf>
bool countKeys(const Record* records, std::size_t count, FirstOf firstOf, base::vector<std::uint32_t>& table) {
  std::uint32_t largest = 0;
  for (std::size_t i = 0; i < count; ++i) largest = std::max(largest, firstOf(records[i]));
  if (largest > 2 * count + 65536) return false;
  table.assign(std::size_t(largest) + 2, 0);
  for (std::size_t i = 0; i < count; ++i) ++table[std::size_t(firstOf(records[i])) + 1];
  std::partial_sum(table.begin(), table.end(), table.begin());
  return true;
}

// Sorts each run of one first key, given the run starts of countKeys.
template <class Record, class Less>
void sortRuns(Record* records, const base::vector<std::uint32_t>& starts, Less less) {
  for (std::size_t k = 0; k + 1 < starts.size(); ++k) {
    if (starts[k + 1] - starts[k] > 1) sortRun(records + starts[k], records + starts[k + 1], less);
  }
}

// Writes `count` records of `from` to `to` ordered by `less`, whose first key is
// `firstOf(record)`: spread by that key, then each run of one key sorted. False, with
// nothing written, when the keys are too sparse (see countKeys).
template <class Record, class FirstOf, class Less>
bool spreadAndSort(const Record* from, Record* to, std::size_t count, FirstOf firstOf, Less less,
                   FaceSortScratch& scratch) {
  if (!countKeys(from, count, firstOf, scratch.starts)) return false;
  scratch.next.assign(scratch.starts.begin(), scratch.starts.end());
  for (std::size_t i = 0; i < count; ++i) to[scratch.next[firstOf(from[i])]++] = from[i];
  sortRuns(to, scratch.starts, less);
  return true;
}

// The same in place: each record is carried to the next free place of its key's run, taking
// the record found there along, until every run holds only its own key. Faces in file order
// mostly sit near their place already, so most records are looked at once.
template <class Record, class Less>
bool placeAndSort(Record* records, std::size_t count, Less less, FaceSortScratch& scratch) {
  const auto first = [](const Record& r) { return r[0]; };
  if (!countKeys(records, count, first, scratch.starts)) return false;
  scratch.next.assign(scratch.starts.begin(), scratch.starts.end());
  std::uint32_t* next = scratch.next.data();
  for (std::uint32_t k = 0; k + 1 < scratch.starts.size(); ++k) {
    // Only this loop fills run k now (earlier runs are full), so its place stays local.
    std::uint32_t at = next[k];
    for (const std::uint32_t end = scratch.starts[k + 1]; at < end; ++at) {
      if (records[at][0] == k) continue;
      Record carried = records[at];
      while (carried[0] != k) std::swap(carried, records[next[carried[0]]++]);
      records[at] = carried;
    }
    next[k] = at;
  }
  sortRuns(records, scratch.starts, less);
  return true;
}

// Records that are in order but for a few (as files often hold faces, and as exported
// meshes always do): the records below the largest one kept so far are lifted out, the
// others closed up, and the lifted ones sorted and merged back in from the end. Only the
// lifted records are copied. False, with nothing moved, when more than one in 64 would be.
template <class Record>
bool mergeFewOutOfOrder(Record* records, std::size_t count, FaceSortScratch& scratch) {
  const std::size_t allowed = count / 64 + 16;
  std::size_t outOfOrder = 0;
  for (std::size_t i = 1, kept = 0; i < count; ++i) {
    if (!(records[i] < records[kept])) {
      kept = i;
    } else if (++outOfOrder > allowed) {
      return false;
    }
  }
  if (outOfOrder == 0) return true;
  scratch.indices.resize(outOfOrder * std::tuple_size_v<Record>);
  auto* lifted = reinterpret_cast<Record*>(scratch.indices.data());
  std::size_t kept = 1, taken = 0;
  for (std::size_t i = 1; i < count; ++i) {
    if (records[i] < records[kept - 1]) {
      lifted[taken++] = records[i];
    } else {
      records[kept++] = records[i];
    }
  }
  std::sort(lifted, lifted + taken);
  for (std::size_t out = count; taken > 0;) {
    records[--out] = kept > 0 && lifted[taken - 1] < records[kept - 1] ? records[--kept] : lifted[--taken];
  }
  return true;
}

// Faces of N indices each in one channel: sorted in place as whole records.
template <std::size_t N>
void sortUniform(std::uint32_t* channel, std::uint32_t count, FaceSortScratch& scratch) {
  using Record = std::array<std::uint32_t, N>;
  auto* records = reinterpret_cast<Record*>(channel);
  const std::size_t faces = count / N;
  if (faces < 2 || mergeFewOutOfOrder(records, faces, scratch)) return;
  if (!placeAndSort(records, faces, std::less<Record>(), scratch)) std::sort(records, records + faces);
}

std::array<std::uint32_t, 4> sortKey(const std::uint32_t* f, std::uint32_t n) {
  return {f[0], n > 1 ? f[1] : absent, n > 2 ? f[2] : absent, n > 3 ? f[3] : absent};
}

// Several channels or faces of mixed sizes: the face records are sorted, then every channel
// (and the counts) rewritten in the new order.
void sortRecords(std::span<std::uint32_t* const> channels, std::uint32_t count, std::span<std::uint16_t> faceCounts,
                 std::uint32_t uniformCount, FaceSortScratch& scratch) {
  scratch.faces.clear();
  forEachFace(count, faceCounts, uniformCount, [&](std::uint32_t offset, std::uint32_t n) {
    base::append(scratch.faces, FaceRecord{offset, static_cast<std::uint16_t>(n)});
  });
  const std::uint32_t* keys = channels[0];
  const auto less = [keys](const FaceRecord& a, const FaceRecord& b) {
    return sortKey(keys + a.start, a.count) < sortKey(keys + b.start, b.count);
  };
  scratch.sorted.resize(scratch.faces.size());
  const auto first = [keys](const FaceRecord& face) { return keys[face.start]; };
  if (!spreadAndSort(scratch.faces.data(), scratch.sorted.data(), scratch.faces.size(), first, less, scratch)) {
    std::sort(scratch.faces.begin(), scratch.faces.end(), less);
    scratch.sorted.swap(scratch.faces);
  }
  scratch.indices.resize(count);
  for (std::uint32_t* channel : channels) {
    std::copy(channel, channel + count, scratch.indices.begin());
    std::uint32_t at = 0;
    for (const FaceRecord& face : scratch.sorted) {
      std::copy_n(scratch.indices.begin() + face.start, face.count, channel + at);
      at += face.count;
    }
  }
  for (std::size_t k = 0; k < faceCounts.size(); ++k) faceCounts[k] = scratch.sorted[k].count;
}

}  // namespace

void sortFaces(std::span<std::uint32_t* const> channels, std::uint32_t count, std::span<std::uint16_t> faceCounts,
               std::uint32_t uniformCount, FaceSortScratch& scratch) {
  if (faceCounts.empty() && channels.size() == 1) {
    if (uniformCount == 2) return sortUniform<2>(channels[0], count, scratch);
    if (uniformCount == 3) return sortUniform<3>(channels[0], count, scratch);
    if (uniformCount == 4) return sortUniform<4>(channels[0], count, scratch);
  }
  sortRecords(channels, count, faceCounts, uniformCount, scratch);
}

}  // namespace scene::detail
