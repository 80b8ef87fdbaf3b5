#pragma once

#include "b_attribute.h"
#include "b_binary_io.h"
#include "b_components.h"
#include "b_exception.h"
#include "b_hash.h"
#include "b_string_conversion.h"
#include "b_structured.h"
#include "b_type_traits.h"

#include <cmath>
#include <cstdint>
#include <limits>
#include <type_traits>

namespace base {

namespace detail {

/// The component code of a scalar type: 1 uint8, 3 uint16, 5 uint32, 6 int32, 10 float,
/// 11 double as the stored forms know them; the others fill the free codes (0 int8, 2 int16,
/// 4 bool, 7 int64, 8 uint64, 9 text).
template <class C>
constexpr std::uint8_t componentCode() {
  if constexpr (std::is_same_v<C, bool>)
    return 4;
  else if constexpr (std::is_same_v<C, float>)
    return 10;
  else if constexpr (std::is_same_v<C, double>)
    return 11;
  else if constexpr (std::is_integral_v<C> && sizeof(C) == 1)
    return std::is_signed_v<C> ? 0 : 1;
  else if constexpr (std::is_integral_v<C> && sizeof(C) == 2)
    return std::is_signed_v<C> ? 2 : 3;
  else if constexpr (std::is_integral_v<C> && sizeof(C) == 4)
    return std::is_signed_v<C> ? 6 : 5;
  else if constexpr (std::is_integral_v<C> && sizeof(C) == 8)
    return std::is_signed_v<C> ? 7 : 8;
  else
    return 9;
}

/// The component code of a value type: that of its first component.
template <class T>
constexpr std::uint8_t valueCode() {
  if constexpr (ComponentValue<T>)
    return componentCode<component_t<T, 0>>();
  else
    return componentCode<T>();
}

/// -1, 0 or 1: component by component, the first pair that is not equal decides; two
/// components are equal when neither is less than the other, so NaN equals anything.
template <class T>
int compareValues(const T& mine, const T& other) {
  if constexpr (ComponentValue<T>) {
    int order = 0;
    forEachComponent(mine, other, [&order](const auto& a, const auto& b) {
      if (order == 0 && (a < b || b < a)) order = a >= b ? 1 : -1;
    });
    return order;
  } else {
    return mine < other ? -1 : (other < mine ? 1 : 0);
  }
}

/// The bytes of T's components: sizeof(T) when T has no padding, so that lists of it can be
/// written and read as one block.
template <class T>
constexpr std::size_t componentBytes() {
  if constexpr (ComponentValue<T>) {
    std::size_t bytes = 0;
    T value{};
    forEachComponent(value, [&bytes](auto& component) { bytes += sizeof(component); });
    return bytes;
  } else {
    return sizeof(T);
  }
}

/// Writes one value: text as its length and bytes, other values component by component.
template <class T>
void writeValue(Stream& stream, const T& value) {
  if constexpr (std::is_same_v<T, base::string>) {
    binary::put(stream, static_cast<std::uint32_t>(value.size()));
    binary::write(stream, value.data(), value.size());
  } else {
    forEachComponent(value, [&stream](const auto& component) { binary::put(stream, component); });
  }
}

template <class T>
void readValue(Stream& stream, T& value) {
  if constexpr (std::is_same_v<T, base::string>) {
    binary::readPacked(stream, value, binary::readCount(stream, 1, "text bytes"));
  } else {
    forEachComponent(value, [&stream](auto& component) {
      if constexpr (std::is_same_v<std::remove_cvref_t<decltype(component)>, bool>) {
        // A stored bool is one byte; any byte but 0 reads as true, never as a bool that is neither.
        std::uint8_t byte = 0;
        binary::read(stream, &byte, 1);
        component = byte != 0;
      } else {
        binary::read(stream, &component, sizeof component);
      }
    });
  }
}

template <class C>
void writeScalar(StructuredWriter& writer, const C& value) {
  if constexpr (std::is_same_v<C, bool> || std::is_floating_point_v<C>)
    writer.value(value);
  else if constexpr (std::is_signed_v<C>)
    writer.value(static_cast<std::int64_t>(value));
  else
    writer.value(static_cast<std::uint64_t>(value));
}

/// Reads a number of type C; a number the type cannot hold fails: for a float, a finite
/// number that rounds beyond the largest float (1e39), while the texts of NaN and the
/// infinities read back as such. The bound is where rounding overflows, not the largest
/// float itself, so that the largest float's own shortest text (3.4028235e+38) reads back.
template <class C>
bool readScalar(StructuredReader& reader, C& value) {
  if constexpr (std::is_same_v<C, bool> || std::is_same_v<C, double>) {
    return reader.value(value);
  } else if constexpr (std::is_same_v<C, float>) {
    double number = 0;
    constexpr double overflows = 3.4028235677973366e38;  // the largest float plus half its last step
    if (!reader.value(number) || (std::isfinite(number) && std::fabs(number) >= overflows)) return false;
    value = static_cast<float>(number);
    return true;
  } else {
    using Wide = std::conditional_t<std::is_signed_v<C>, std::int64_t, std::uint64_t>;
    Wide number = 0;
    if (!reader.value(number) || number < Wide(std::numeric_limits<C>::min()) ||
        number > Wide(std::numeric_limits<C>::max())) {
      return false;
    }
    value = static_cast<C>(number);
    return true;
  }
}

template <class T>
concept Box = requires(T& value) {
  value.min;
  value.max;
};

/// The structured form of one value: text as a string; numbers and one-component values
/// (time codes) as numbers; a box as [[min...], [max...]]; other values as arrays of their
/// components.
template <class T>
void writeStructured(StructuredWriter& writer, const T& value) {
  if constexpr (std::is_same_v<T, base::string>) {
    writer.value(std::string_view(value));
  } else if constexpr (componentCount<const T> == 1) {
    writeScalar(writer, component<0>(value));
  } else if constexpr (Box<T>) {
    writer.beginArray();
    writeStructured(writer, value.min);
    writeStructured(writer, value.max);
    writer.endArray();
  } else {
    writer.beginArray();
    forEachComponent(value, [&writer](const auto& each) { writeScalar(writer, each); });
    writer.endArray();
  }
}

/// Reads what writeStructured writes into `value`; false when the input does not fit (then
/// `value` may be partly set: callers read into a copy).
template <class T>
bool readStructured(StructuredReader& reader, T& value) {
  if constexpr (std::is_same_v<T, base::string>) {
    return reader.value(value);
  } else if constexpr (componentCount<T> == 1) {
    return readScalar(reader, component<0>(value));
  } else {
    std::size_t size = 0;
    if (!reader.beginArray(size)) return false;
    bool fits = true;
    if constexpr (Box<T>) {
      fits = size == 2 && readStructured(reader, value.min) && readStructured(reader, value.max);
    } else {
      fits = size == componentCount<T>;
      forEachComponent(value, [&](auto& each) { fits = fits && readScalar(reader, each); });
    }
    reader.endArray();
    return fits;
  }
}

}  // namespace detail

/// An attribute holding one value of type T.
template <class T>
class TypedAttribute : public Attribute {
 public:
  TypedAttribute() = default;
  explicit TypedAttribute(const T& value) : m_value(value) {}

  name_id type() const override { return TypeTraits<T>::n_name; }
  Attribute* clone() const override {
    auto* copy = new TypedAttribute(m_value);
    copy->flags = flags;
    return copy;
  }
  std::uint8_t componentType() const override { return detail::valueCode<T>(); }
  void writeValue(StructuredWriter& writer) const override { detail::writeStructured(writer, m_value); }
  void write(Stream& stream, BinaryContext& context) const override {
    Attribute::write(stream, context);
    detail::writeValue(stream, m_value);
  }
  bool readValue(StructuredReader& reader) override {
    T value = m_value;
    if (!detail::readStructured(reader, value)) return false;
    m_value = value;
    return true;
  }
  void read(Stream& stream, BinaryContext& context) override {
    Attribute::read(stream, context);
    detail::readValue(stream, m_value);
  }
  void* data(int = -1) override { return &m_value; }
  std::uint32_t byteSize() const override {
    if constexpr (std::is_same_v<T, base::string>)
      return static_cast<std::uint32_t>(4 + m_value.size());
    else
      return sizeof(T);
  }
  /// Needs mode bit 0 and a source of the same type.
  bool copyFrom(const Attribute& source, std::uint32_t mode, int = -1) override {
    if (!(mode & copyOverwrite) || source.type() != type()) return false;
    m_value = *static_cast<const T*>(source.data());
    return true;
  }
  base::string toString() const override { return toText(m_value); }
  bool fromString(std::string_view text) override {
    T parsed = m_value;
    try {
      from_string(text, parsed);
    } catch (const string_conversion_exception&) {
      return false;
    }
    m_value = parsed;
    return true;
  }
  void setData(const void* data, int = -1) override { m_value = *static_cast<const T*>(data); }
  int compareData(const void* data, int = -1) const override {
    return detail::compareValues(m_value, *static_cast<const T*>(data));
  }

  const T& value() const { return m_value; }
  T& value() { return m_value; }

 private:
  T m_value{};
};

/// An attribute holding a growable list of values of type T.
template <class T>
class TypedVectorAttribute : public Attribute {
 public:
  TypedVectorAttribute() = default;

  name_id type() const override { return TypeTraits<T>::n_array_name; }
  Attribute* clone() const override {
    auto* copy = new TypedVectorAttribute;
    copy->m_values = m_values;
    copy->flags = flags;
    return copy;
  }
  std::uint8_t componentType() const override { return detail::valueCode<T>(); }
  void writeValue(StructuredWriter& writer) const override {
    writer.beginArray();
    for (const T& value : m_values) detail::writeStructured(writer, value);
    writer.endArray();
  }
  bool readValue(StructuredReader& reader) override {
    std::size_t size = 0;
    if (!reader.beginArray(size)) return false;
    base::vector<T> values(size);
    bool fits = true;
    for (std::size_t k = 0; k < size && fits; ++k) fits = detail::readStructured(reader, values[k]);
    reader.endArray();
    if (fits) m_values = std::move(values);
    return fits;
  }
  /// The flags byte, the element count (32 bits), then the elements.
  void write(Stream& stream, BinaryContext& context) const override {
    Attribute::write(stream, context);
    binary::put(stream, static_cast<std::uint32_t>(m_values.size()));
    if constexpr (packed) {
      binary::write(stream, m_values.data(), m_values.size() * sizeof(T));
    } else {
      for (const T& value : m_values) detail::writeValue(stream, value);
    }
  }
  /// The count is trusted only as far as the bytes left; where the stream cannot tell, the
  /// list grows with the data that arrives.
  void read(Stream& stream, BinaryContext& context) override {
    Attribute::read(stream, context);
    const std::uint32_t count = binary::readCount(stream, detail::componentBytes<T>(), "list elements");
    if constexpr (packed) {
      binary::readPacked(stream, m_values, count);
    } else {
      binary::readInBatches(stream, m_values, count, [&](std::uint32_t first, std::uint32_t n) {
        for (std::uint32_t k = first; k < first + n; ++k) detail::readValue(stream, m_values[k]);
      });
    }
  }
  /// Index -1: the list (base::vector<T>*); otherwise element `index`, or null past the end.
  void* data(int index = -1) override {
    if (index < 0) return &m_values;
    return static_cast<std::size_t>(index) < m_values.size() ? &m_values[static_cast<std::size_t>(index)] : nullptr;
  }
  std::uint32_t size() const override { return static_cast<std::uint32_t>(m_values.size()); }
  bool erase(int index) override {
    if (index < 0 || static_cast<std::size_t>(index) >= m_values.size()) return false;
    m_values.erase(m_values.begin() + index);
    return true;
  }
  std::uint32_t byteSize() const override { return static_cast<std::uint32_t>(4 + m_values.size() * sizeof(T)); }
  /// Needs mode bit 0 and a source of the same type.
  bool copyFrom(const Attribute& source, std::uint32_t mode, int = -1) override {
    if (!(mode & copyOverwrite) || source.type() != type()) return false;
    m_values = *static_cast<const base::vector<T>*>(source.data());
    return true;
  }
  void setData(const void* data, int index = -1) override {
    if (index < 0) {
      m_values = *static_cast<const base::vector<T>*>(data);
    } else if (static_cast<std::size_t>(index) < m_values.size()) {
      m_values[static_cast<std::size_t>(index)] = *static_cast<const T*>(data);
    }
  }
  /// Index -1: a shorter list is less; else element by element. Otherwise element `index`.
  int compareData(const void* data, int index = -1) const override {
    if (index >= 0) {
      if (static_cast<std::size_t>(index) >= m_values.size()) return 1;
      return detail::compareValues(m_values[static_cast<std::size_t>(index)], *static_cast<const T*>(data));
    }
    const auto& other = *static_cast<const base::vector<T>*>(data);
    if (m_values.size() != other.size()) return m_values.size() < other.size() ? -1 : 1;
    for (std::size_t k = 0; k < m_values.size(); ++k) {
      if (const int order = detail::compareValues(m_values[k], other[k]); order != 0) return order;
    }
    return 0;
  }

  /// MurmurHash3 (x86, 128-bit, seed 0) of the elements' bytes, as the binary form holds
  /// them; its first 64 bits.
  std::uint64_t hash() const override {
    if constexpr (packed) {
      return murmurHash3(m_values.data(), m_values.size() * sizeof(T));
    } else {
      Stream bytes = memStream(0);
      for (const T& value : m_values) detail::writeValue(bytes, value);
      std::int64_t offset = 0;
      std::int64_t size = 0;
      const std::uint8_t* block = bytes.worker()->getMemory(&offset, &size);
      return murmurHash3(block ? block + offset : nullptr, static_cast<std::size_t>(size));
    }
  }

  const base::vector<T>& values() const { return m_values; }
  base::vector<T>& values() { return m_values; }

 private:
  static constexpr bool packed = !std::is_same_v<T, base::string> && detail::componentBytes<T>() == sizeof(T);

  base::vector<T> m_values;
};

}  // namespace base
