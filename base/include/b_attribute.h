#pragma once

#include "b_alloc.h"
#include "b_api.h"
#include "b_containers.h"
#include "b_name.h"
#include "b_refcnt.h"

#include <cstdint>
#include <string_view>

namespace base {

class AttribArray;
class AttribLink;
class AttribMap;
class BinaryContext;
class Stream;
class StructuredReader;
class StructuredWriter;

/// Bits of an attribute's `flags`. The low byte is the persistent part.
enum AttributeFlag : std::uint32_t {
  attrPersistent = 0xFF,      ///< the bits that the stored forms keep
  attrLinkFlagged = 1u << 0,  ///< read by links that ask whether their target is flagged
  attrSilentLink = 1u << 7,   ///< on a link: an unresolvable target is not logged
  attrRuntime = 1u << 30,     ///< a run-time mark, never stored
  attrNotStored = 1u << 31,   ///< a map member that the stored forms leave out
};

/// Modes of copyFrom: bit 0 overwrites values (and replaces members of another type),
/// bit 1 merges into nested maps.
enum CopyMode : std::uint32_t { copyAddMissing = 0, copyOverwrite = 1, copyMerge = 2 };

/// One piece of data of one declared type: a value, a list of values, or a structure of
/// further attributes. Attributes are owned by exactly one container and never copied;
/// `clone` makes a deep copy. Weak references to an attribute (paths, base-map links) read
/// null once it is destroyed.
class BASE1_API Attribute : public HostAllocated {
 public:
  /// weak_ref<T> of any attribute class uses this class's weak list.
  using WeakBase = Attribute;

  Attribute() = default;
  Attribute(const Attribute&) = delete;
  Attribute& operator=(const Attribute&) = delete;

  /// Nulls every weak reference to this attribute.
  virtual ~Attribute();
  /// The interned name of the attribute's type ("float", "vec3f[]", "map", ...).
  virtual name_id type() const = 0;
  virtual AttribLink* asLink();
  virtual AttribArray* asArray();
  virtual AttribMap* asMap();
  /// A deep copy with the same flags; the caller owns it.
  virtual Attribute* clone() const = 0;
  /// The scalar element type: 1 uint8, 3 uint16, 5 uint32, 6 int32, 10 float, 11 double;
  /// 0xFF for structures.
  virtual std::uint8_t componentType() const = 0;
  /// The structured form: the value through `writer` (JSON: see b_json.h).
  virtual void writeValue(StructuredWriter& writer) const = 0;
  /// The binary form: the persistent flags byte, then the class's value; names go through
  /// `context`. Stream failures throw.
  virtual void write(Stream& stream, BinaryContext& context) const;
  /// Reads the structured form that writeValue gives; false (value unchanged) when the input
  /// does not fit the type.
  virtual bool readValue(StructuredReader& reader) = 0;
  /// Reads the binary form that write gives. A form that ends early or counts more than the
  /// stream holds throws.
  virtual void read(Stream& stream, BinaryContext& context);
  /// The raw value (index -1) or the element `index` of a list or structure.
  virtual void* data(int index = -1) = 0;
  /// The element count: 1 for a single value.
  virtual std::uint32_t size() const;
  /// Removes element `index`; false when there is none (or the attribute has no elements).
  virtual bool erase(int index);
  /// The bytes of the value as stored.
  virtual std::uint32_t byteSize() const = 0;
  /// Takes the value of `source` when `mode` allows and the types agree; false otherwise.
  virtual bool copyFrom(const Attribute& source, std::uint32_t mode, int index = -1) = 0;
  /// The value as text; empty when the attribute has no text form.
  virtual base::string toString() const;
  /// Sets the value from text; false (value unchanged) when the text does not convert.
  virtual bool fromString(std::string_view text);
  /// Whether the run-time mark (flags bit 30) is set here or, for structures, inside.
  virtual bool hasRuntimeFlag() const;
  /// Sets the value from raw data of the attribute's own type (as `data` gives it).
  virtual void setData(const void* data, int index = -1) = 0;
  /// Compares the value with raw data of the same type: -1, 0 or 1.
  virtual int compareData(const void* data, int index = -1) const = 0;
  /// A hash of the value; 0 for attributes without one.
  virtual std::uint64_t hash() const;

  const void* data(int index = -1) const { return const_cast<Attribute*>(this)->data(index); }
  const AttribLink* asLink() const { return const_cast<Attribute*>(this)->asLink(); }
  const AttribArray* asArray() const { return const_cast<Attribute*>(this)->asArray(); }
  const AttribMap* asMap() const { return const_cast<Attribute*>(this)->asMap(); }

  /// Links a weak reference's node to this attribute; the caller knows it is alive.
  void attachWeak(WeakNode& node);
  /// Unlinks a holder's node, safely against a concurrent destruction.
  static void detachWeak(WeakNode& node);

  std::uint32_t flags = 0;

 private:
  detail::LockedWeakList m_weak;
};

}  // namespace base
