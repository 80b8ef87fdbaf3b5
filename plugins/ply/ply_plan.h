#pragma once

// Per-element reading plans. A receiver that knows where an element's values go answers the
// element with a plan, once, and the reader then moves whole columns into place instead of
// calling the receiver once per property instance. Whatever a plan leaves out is delivered
// through the receiver's plyProperty as before, so a file reads to the same result either way.

#include "b_containers.h"
#include "ply_format.h"

#include <cstddef>
#include <cstdint>
#include <functional>
#include <limits>

namespace ply {

/// How a value becomes the number stored at its destination.
enum class Conversion : std::uint8_t {
  toFloat,     ///< float: the value's float (Value::convertTo<float>)
  normalised,  ///< float: ply::toFP (integer types divided by their largest value)
  toIndex,     ///< uint32: the low 32 bits of Value::convertTo<std::int64_t>
  native,      ///< the value in its own type, dataTypeSize bytes (an ASCII word beyond the
               ///< type's range keeps the low bits, as a cast does); scalars only
};

/// A growable array of fixed-size records that the receiver owns (a mesh's position list, say).
struct RecordArray {
  /// Makes room for `records` records, keeping those already there, and returns the first.
  /// New records must read as the receiver wants unfilled ones to read (zero, or an alpha of
  /// 1). The reader asks for the element's count when the stream's size proves the data is
  /// there, and otherwise grows in steps as data arrives, never past the count; at the end of
  /// such an element it asks once more, for the instances that were reached, which may be
  /// fewer than the array holds.
  std::function<std::byte*(std::size_t records)> resize;
  std::uint32_t stride = 0;  ///< bytes from one record to the next
};

/// Where the items of a list go, one list per instance after the other: the indices of
/// faces, strips and edges, or the 32-bit values of another list (a face's texture
/// coordinates as float bits).
struct ListSink {
  /// Every stored item is appended here.
  base::vector<std::uint32_t>* items = nullptr;
  /// When set, an item not below it is stored as 0 and reported (see BadIndexReport).
  std::uint32_t vertexCount = noRangeCheck;
  /// Each list's length, when set (a face element's vertex counts).
  base::vector<std::uint16_t>* listCounts = nullptr;
  /// When set, the lists are strips: an item of 0xFFFFFFFF is a restart marker, not stored,
  /// and each run of indices between markers appends its length here (a run still open at
  /// the end of a list is appended even when empty; a marker after an empty run adds nothing).
  base::vector<std::uint32_t>* runCounts = nullptr;
  /// A longer list is delivered through plyProperty instead, so the receiver decides.
  std::uint32_t maxLength = std::numeric_limits<std::uint32_t>::max();

  static constexpr std::uint32_t noRangeCheck = std::numeric_limits<std::uint32_t>::max();
};

/// What happens to one property.
struct PropertyPlan {
  enum class Kind : std::uint8_t {
    deliver,    ///< through plyProperty, as without a plan
    skip,       ///< not wanted: read past
    scalar,     ///< a scalar to `offset` in record i of `array`
    indices,    ///< a list of indices to `sink`
    itemList,   ///< a list of values to `sink`, each stored by `conversion` (not toIndex)
    valueList,  ///< a list of exactly `length` items to `offset` in record i of `array`,
                ///< item k at offset + 4k; another length goes through plyProperty
  };
  Kind kind = Kind::deliver;
  Conversion conversion = Conversion::toFloat;
  std::uint32_t array = 0;
  std::uint32_t offset = 0;
  std::uint32_t length = 0;
  std::uint32_t sink = 0;

  /// Whether the property's lists go to `sink`.
  bool toSink() const { return kind == Kind::indices || kind == Kind::itemList; }
  /// How the values are stored: indices always by toIndex.
  Conversion storedAs() const { return kind == Kind::indices ? Conversion::toIndex : conversion; }
};

/// The plan of one element: a PropertyPlan per property, in header order, and the arrays
/// and sinks they name. beginInstance(i) comes before any property of instance i goes to
/// plyProperty; for an element whose plan delivers nothing it need not come at all.
struct ElementPlan {
  base::vector<PropertyPlan> properties;
  base::vector<RecordArray> arrays;
  base::vector<ListSink> sinks;

  void clear() {
    properties.clear();
    arrays.clear();
    sinks.clear();
  }
  /// Whether the plan has a property plan per property of `element`, every one names an
  /// array or sink that exists, and every target lies inside its record.
  bool fits(const Element& element) const;
  /// Whether some property may go to plyProperty: one to deliver, or a list that another
  /// length sends back to the receiver.
  bool delivers() const;
  /// Whether two properties send their lists to one sink (each instance's lists must then
  /// arrive one after the other, never a run of one property's lists at once).
  bool sharesSinks() const;
};

/// Reports indices that are not below the vertex count: the first few with their own line
/// ("Invalid vertex index detected 812, max 800!"), then one line with the element's name and
/// the total when the element ends, so that a file with millions of bad indices neither
/// floods the log nor crawls, and the log says where they were.
class BadIndexReport {
 public:
  static constexpr std::uint64_t linesPerElement = 10;

  void note(std::uint32_t index, std::uint32_t vertexCount);
  /// Logs the element's total, if any, and starts over.
  void finish(const Element& element);

 private:
  std::uint64_t m_count = 0;
};

}  // namespace ply
