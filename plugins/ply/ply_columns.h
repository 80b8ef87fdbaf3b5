#pragma once

// Typed column operations behind the plans: each is a template over the value type, the
// byte order and the conversion, chosen once per property through a table, so that the
// loops themselves have no switch, no ply::Value and no call per value.

#include "ply_plan.h"

#include <bit>
#include <cstdint>
#include <cstring>
#include <limits>
#include <optional>
#include <tuple>
#include <type_traits>

namespace ply::detail {

/// The C++ type of each data type, in the order of DataType.
using NativeTypes =
    std::tuple<std::int8_t, std::uint8_t, std::int16_t, std::uint16_t, std::int32_t, std::uint32_t, float, double>;
template <DataType T>
using NativeType = std::tuple_element_t<static_cast<std::size_t>(T), NativeTypes>;

inline std::uint8_t swapBytes(std::uint8_t value) { return value; }
inline std::uint16_t swapBytes(std::uint16_t value) { return __builtin_bswap16(value); }
inline std::uint32_t swapBytes(std::uint32_t value) { return __builtin_bswap32(value); }
inline std::uint64_t swapBytes(std::uint64_t value) { return __builtin_bswap64(value); }

/// The unsigned integer type of `Size` bytes (1, 2, 4 or 8).
template <std::size_t Size>
using UnsignedOfSize = std::tuple_element_t<std::bit_width(Size) - 1,
                                            std::tuple<std::uint8_t, std::uint16_t, std::uint32_t, std::uint64_t>>;

/// The value of type T stored at `bytes`, byte-swapped when `Swap`.
template <class T, bool Swap>
inline T loadAs(const std::uint8_t* bytes) {
  using Raw = UnsignedOfSize<sizeof(T)>;
  Raw raw;
  std::memcpy(&raw, bytes, sizeof raw);
  if constexpr (Swap) raw = swapBytes(raw);
  return std::bit_cast<T>(raw);
}

/// Truncation toward zero that stays defined for NaN (0) and out-of-range values (clamped).
inline std::int64_t truncateToInteger(double value) {
  if (!(value == value)) return 0;
  if (value >= 9223372036854775807.0) return std::numeric_limits<std::int64_t>::max();
  if (value <= -9223372036854775808.0) return std::numeric_limits<std::int64_t>::min();
  return static_cast<std::int64_t>(value);
}

/// One over the type's largest value, in single precision: uchar gives 1/255.
template <class T>
inline constexpr float unitFactor = 1.0f / static_cast<float>(std::numeric_limits<T>::max());

/// How a value of type T is held once read: the integer types widened to 32 bits (an ASCII
/// word may hold 300 for a char), floats and doubles as they are, as in ply::Value.
template <DataType T>
using Held = std::conditional_t<std::is_floating_point_v<NativeType<T>>, NativeType<T>,
                                std::conditional_t<std::is_signed_v<NativeType<T>>, std::int32_t, std::uint32_t>>;

/// What Conversion C stores for a held value of type T: the same numbers as
/// Value::convertTo and ply::toFP give, or the value in its own type.
template <DataType T, Conversion C>
inline auto convertHeld(Held<T> value) {
  if constexpr (C == Conversion::native) {
    return static_cast<NativeType<T>>(value);
  } else if constexpr (C == Conversion::toIndex) {
    if constexpr (std::is_floating_point_v<Held<T>>) {
      return static_cast<std::uint32_t>(truncateToInteger(static_cast<double>(value)));
    } else {
      return static_cast<std::uint32_t>(value);  // a signed value keeps its pattern: -1 is 0xFFFFFFFF
    }
  } else if constexpr (C == Conversion::normalised && !std::is_floating_point_v<Held<T>>) {
    return static_cast<float>(value) * unitFactor<NativeType<T>>;
  } else {
    return static_cast<float>(value);
  }
}

/// Converts `count` values of `type`, `sourceStride` bytes apart, and stores them
/// `targetStride` bytes apart.
using ColumnFunction = void (*)(const std::uint8_t* source, std::size_t sourceStride, std::size_t count,
                                std::byte* target, std::size_t targetStride);

template <DataType T, bool Swap, Conversion C>
void convertColumn(const std::uint8_t* source, std::size_t sourceStride, std::size_t count, std::byte* target,
                   std::size_t targetStride) {
  for (std::size_t k = 0; k < count; ++k) {
    const auto stored = convertHeld<T, C>(loadAs<NativeType<T>, Swap>(source + k * sourceStride));
    std::memcpy(target + k * targetStride, &stored, sizeof stored);
  }
}

/// `make.template operator()<T, C>()` for the type and conversion given at run time: the one
/// place where a choice per property turns into a function made for it. A value-initialised
/// result (null) for `none`.
template <Conversion C, class Make>
auto forType(DataType type, Make make) -> decltype(make.template operator()<DataType::int8, C>()) {
  switch (type) {
    case DataType::int8:
      return make.template operator()<DataType::int8, C>();
    case DataType::uint8:
      return make.template operator()<DataType::uint8, C>();
    case DataType::int16:
      return make.template operator()<DataType::int16, C>();
    case DataType::uint16:
      return make.template operator()<DataType::uint16, C>();
    case DataType::int32:
      return make.template operator()<DataType::int32, C>();
    case DataType::uint32:
      return make.template operator()<DataType::uint32, C>();
    case DataType::float32:
      return make.template operator()<DataType::float32, C>();
    case DataType::float64:
      return make.template operator()<DataType::float64, C>();
    case DataType::none:
      break;
  }
  return {};
}

template <class Make>
auto forTypeAndConversion(DataType type, Conversion conversion, Make make) {
  switch (conversion) {
    case Conversion::toFloat:
      return forType<Conversion::toFloat>(type, make);
    case Conversion::normalised:
      return forType<Conversion::normalised>(type, make);
    case Conversion::native:
      return forType<Conversion::native>(type, make);
    case Conversion::toIndex:
      break;
  }
  return forType<Conversion::toIndex>(type, make);
}

/// The column function for binary values of `type` in the byte order `Swap`, stored by
/// `conversion`; null for `none`.
template <bool Swap>
ColumnFunction columnFunction(DataType type, Conversion conversion) {
  return forTypeAndConversion(type, conversion,
                              []<DataType T, Conversion C>() -> ColumnFunction { return convertColumn<T, Swap, C>; });
}

/// The arrays of one element's plan, grown together: to the element's count at once when the
/// stream's size proved the data is there (`sized`), otherwise in steps as instances arrive;
/// then, when the element is done, cut to the instances that were reached.
class PlanTargets {
 public:
  PlanTargets(ElementPlan& plan, std::uint32_t count, bool sized);
  ~PlanTargets();
  PlanTargets(const PlanTargets&) = delete;
  PlanTargets& operator=(const PlanTargets&) = delete;

  /// Makes room for `records` records.
  void reach(std::uint64_t records) {
    if (records > m_capacity) [[unlikely]]
      grow(records);
    m_reached = std::max(m_reached, records);
  }
  /// Where `offset` of record `record` of array `array` lies.
  std::byte* at(std::uint32_t array, std::uint64_t record, std::uint32_t offset) const {
    return m_bases[array] + record * m_plan.arrays[array].stride + offset;
  }
  std::uint32_t stride(std::uint32_t array) const { return m_plan.arrays[array].stride; }

 private:
  void grow(std::uint64_t records);

  ElementPlan& m_plan;
  std::uint64_t m_count;
  bool m_sized;
  std::uint64_t m_capacity = 0;
  std::uint64_t m_reached = 0;
  base::vector<std::byte*> m_bases;
};

/// Replaces each index not below `vertexCount` by 0 and reports it; no check for
/// ListSink::noRangeCheck.
void checkIndices(std::uint32_t* indices, std::size_t count, std::uint32_t vertexCount, BadIndexReport& report);

/// Where the stream's size shows how much data is left (`bytesLeft`), gives `sink` room at
/// once for the rest of an element whose lists have `count` items of at least `itemBytes`
/// bytes each, so that its lists are not copied over and over as they grow. The data left
/// bounds the room, whatever the counts say.
void reserveAhead(const ListSink& sink, std::optional<std::uint64_t> bytesLeft, std::uint64_t instancesLeft,
                  std::uint32_t count, std::uint32_t itemBytes);

/// Stores one complete list into `sink`: checked, split at restart markers for strips,
/// with its count.
void storeList(const ListSink& sink, const std::uint32_t* items, std::size_t count, BadIndexReport& report);

}  // namespace ply::detail
