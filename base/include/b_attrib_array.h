#pragma once

#include "b_attrib_factory.h"
#include "b_attribute.h"
#include "b_containers.h"

#include <cstdint>

namespace base {

/// An ordered list of attributes of any types, each owned by the array (an element may be
/// null).
class BASE1_API AttribArray : public Attribute {
 public:
  using Elements = base::vector<Attribute*>;

  explicit AttribArray(AttribFactory* factory = &attribFactory());
  /// Destroys every element.
  ~AttribArray() override;

  name_id type() const override;
  AttribArray* asArray() override { return this; }
  /// Every element cloned; null stays null.
  Attribute* clone() const override;
  std::uint8_t componentType() const override { return 0xFF; }
  /// An array: a map element as its object, null as null, any other element as
  /// {"^value": value, "^type": "type"}.
  void writeValue(StructuredWriter& writer) const override;
  /// Reads the array that writeValue writes; elements of types the factory does not know
  /// are skipped with a warning. False when an element does not fit.
  bool readValue(StructuredReader& reader) override;
  /// The flags byte, the element count (32 bits), then per element its type name (through
  /// `context`; an empty name for null), the byte length of its binary form (32 bits) and
  /// that form.
  void write(Stream& stream, BinaryContext& context) const override;
  /// Reads the elements back; one of a type the factory does not know is skipped by its
  /// length with a warning. Maps and arrays nested deeper than BinaryContext::deepest
  /// levels throw.
  void read(Stream& stream, BinaryContext& context) override;
  /// Index -1: the element list (Elements*); otherwise element `index`'s value.
  void* data(int index = -1) override;
  std::uint32_t size() const override { return static_cast<std::uint32_t>(m_elements.size()); }
  /// Destroys element `index` and removes its slot; false when there is none.
  bool erase(int index) override;
  /// 4 plus the elements' byte sizes.
  std::uint32_t byteSize() const override;
  /// From another array with mode bit 0: this array becomes a clone of its elements.
  bool copyFrom(const Attribute& source, std::uint32_t mode, int index = -1) override;
  bool hasRuntimeFlag() const override;
  /// Index -1: `data` is another array's Elements; this array then holds a clone of each.
  /// Otherwise forwards to element `index`.
  void setData(const void* data, int index = -1) override;
  /// Index -1: by count, then element by element by type and value.
  int compareData(const void* data, int index = -1) const override;
  /// The name that the array carries for its users; null until set.
  virtual name_id arrayName() const { return m_name; }

  /// Appends `element`, which the array owns from now on (null is allowed).
  void append(Attribute* element);
  const Elements& elements() const { return m_elements; }
  void setArrayName(name_id name) { m_name = name; }

 private:
  void destroyElements();

  Elements m_elements;
  name_id m_name = nullptr;
  AttribFactory* m_factory;
};

}  // namespace base
