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

// mergeFewOutOfOrder for faces of N indices in several channels. The moves are worked out on
// the first channel before anything moves (which faces are lifted, and for each place of
// the result whether it takes a lifted face or the next kept one), then made in every
// channel alike: only the lifted faces are copied. False, with nothing moved, when more than
// one face in 64 is out of order.
template <std::size_t N>
bool mergeFewOutOfOrderChannels(std::span<std::uint32_t* const> channels, std::size_t faces, FaceSortScratch& scratch) {
  using Face = std::array<std::uint32_t, N>;
  using Record = std::array<std::uint32_t, N + 1>;  // a lifted face's indices, then its place
  const auto* keys = reinterpret_cast<const Face*>(channels[0]);
  const std::size_t allowed = faces / 64 + 16;
  base::vector<std::uint32_t>& liftedAt = scratch.next;  // ascending
  liftedAt.clear();
  for (std::size_t i = 1, kept = 0; i < faces; ++i) {
    if (!(keys[i] < keys[kept])) {
      kept = i;
    } else if (liftedAt.size() == allowed) {
      return false;
    } else {
      base::append(liftedAt, static_cast<std::uint32_t>(i));
    }
  }
  const std::size_t taken = liftedAt.size();
  if (taken == 0) return true;
  scratch.records.resize(taken * (N + 1));
  auto* lifted = reinterpret_cast<Record*>(scratch.records.data());
  for (std::size_t k = 0; k < taken; ++k) {
    std::copy(keys[liftedAt[k]].begin(), keys[liftedAt[k]].end(), lifted[k].begin());
    lifted[k][N] = liftedAt[k];
  }
  std::sort(lifted, lifted + taken);
  const auto liftedLess = [](const Record& record, const Face& face) {
    return std::lexicographical_compare(record.begin(), record.begin() + N, face.begin(), face.end());
  };
  // The merge from the last place back, as mergeFewOutOfOrder makes it.
  base::vector<std::uint8_t>& fromLifted = scratch.flags;
  fromLifted.assign(faces, 0);
  std::size_t original = faces, skip = taken;
  const auto previousKept = [&] {
    while (original > 0) {
      --original;
      if (skip > 0 && liftedAt[skip - 1] == original) {
        --skip;
        continue;
      }
      return true;
    }
    return false;
  };
  bool haveKept = previousKept();
  for (std::size_t out = faces, t = taken; out-- > 0 && t > 0;) {
    if (haveKept && liftedLess(lifted[t - 1], keys[original])) {
      haveKept = previousKept();
    } else {
      fromLifted[out] = 1;
      --t;
    }
  }
  scratch.indices.resize(taken * N);
  for (std::uint32_t* channel : channels) {
    auto* face = reinterpret_cast<Face*>(channel);
    auto* liftedFaces = reinterpret_cast<Face*>(scratch.indices.data());
    for (std::size_t k = 0; k < taken; ++k) liftedFaces[k] = face[lifted[k][N]];
    std::size_t kept = 0;
    for (std::size_t i = 0, s = 0; i < faces; ++i) {
      if (s < taken && liftedAt[s] == i) {
        ++s;
      } else {
        face[kept++] = face[i];
      }
    }
    for (std::size_t out = faces, t = taken; out-- > 0 && t > 0;)
      face[out] = fromLifted[out] ? liftedFaces[--t] : face[--kept];
  }
  return true;
}

// Faces of N indices each in several channels: in order but for a few, they are merged in
// place; otherwise the first channel's faces, each with its number, are sorted as records
// (ties keep the file's order), the first channel takes their indices and the other
// channels are gathered by the numbers.
template <std::size_t N>
void sortUniformChannels(std::span<std::uint32_t* const> channels, std::uint32_t count, FaceSortScratch& scratch) {
  using Face = std::array<std::uint32_t, N>;
  using Record = std::array<std::uint32_t, N + 1>;
  const std::size_t faces = count / N;
  const auto* keys = reinterpret_cast<const Face*>(channels[0]);
  if (faces < 2 || mergeFewOutOfOrderChannels<N>(channels, faces, scratch)) return;
  scratch.records.resize(faces * (N + 1));
  auto* records = reinterpret_cast<Record*>(scratch.records.data());
  for (std::size_t f = 0; f < faces; ++f) {
    std::copy(keys[f].begin(), keys[f].end(), records[f].begin());
    records[f][N] = static_cast<std::uint32_t>(f);
  }
  if (!placeAndSort(records, faces, std::less<Record>(), scratch)) {
    std::sort(records, records + faces);
  }
  for (std::size_t f = 0; f < faces; ++f) std::copy_n(records[f].begin(), N, channels[0] + f * N);
  scratch.indices.resize(count);
  for (std::uint32_t* channel : channels.subspan(1)) {
    std::copy(channel, channel + count, scratch.indices.begin());
    for (std::size_t f = 0; f < faces; ++f) {
      std::copy_n(scratch.indices.begin() + std::size_t(records[f][N]) * N, N, channel + f * N);
    }
  }
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
  if (faceCounts.empty()) {
    if (uniformCount == 2) return sortUniformChannels<2>(channels, count, scratch);
    if (uniformCount == 3) return sortUniformChannels<3>(channels, count, scratch);
    if (uniformCount == 4) return sortUniformChannels<4>(channels, count, scratch);
  }
  sortRecords(channels, count, faceCounts, uniformCount, scratch);
}

}  // namespace scene::detail
