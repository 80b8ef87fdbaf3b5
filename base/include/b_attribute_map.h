#pragma once

#include "b_attrib_factory.h"
#include "b_attribute.h"
#include "b_refcnt.h"
#include "b_type_traits.h"

#include <cstdint>
#include <type_traits>
#include <utility>

namespace base {

/// A set of named attributes, each owned by the map: the object model of the scene. Members
/// are kept sorted by the value of their name handle, so lookup is a binary search over
/// handles. A map may inherit every member it lacks from a base map, which it refers to
/// weakly: once the base map dies, the inheritance ends.
///
/// Access by name and type: `attribute` gets or creates and throws on misuse (an empty
/// name, a member of another type, a type the factory does not know); `findAttribute` and
/// `findVecAttribute` never create and never throw for type problems: they log and give
/// null, so that callers can fall back to defaults.
class BASE1_API AttribMap : public Attribute {
 public:
  using Member = std::pair<name_id, Attribute*>;
  using Members = base::vector<Member>;

  explicit AttribMap(AttribFactory* factory = &attribFactory());
  /// Destroys every member in order.
  ~AttribMap() override;

  name_id type() const override;
  AttribMap* asMap() override { return this; }
  /// Same factory, flags and base map, members cloned; the map type is not copied.
  Attribute* clone() const override;
  std::uint8_t componentType() const override { return 0xFF; }
  /// An object with a member per stored member, under the key "name^type".
  void writeValue(StructuredWriter& writer) const override;
  /// Reads the object that writeValue writes; members of types the factory does not know
  /// are skipped with a warning. False when the input is no object or a member does not fit
  /// its type (the members read before it stay).
  bool readValue(StructuredReader& reader) override;
  /// The flags byte, the count of stored members, then per member its name and type name
  /// (through `context`), the byte length of its binary form (32 bits) and that form.
  /// Members with flags bit 31 are left out.
  void write(Stream& stream, BinaryContext& context) const override;
  /// Reads the members back, inserted at their places (an existing member of the same name is
  /// replaced). A member of a type the factory does not know is skipped by its length, with a
  /// warning; reading goes on with the next one. Maps and arrays nested deeper than
  /// BinaryContext::deepest levels throw.
  void read(Stream& stream, BinaryContext& context) override;
  /// Index -1: the member array (Members*); otherwise member `index`'s value.
  void* data(int index = -1) override;
  std::uint32_t size() const override { return static_cast<std::uint32_t>(m_members.size()); }
  /// 4 plus the members' byte sizes.
  std::uint32_t byteSize() const override;
  /// From another map: with mode 0 only the names this map lacks are added (as clones);
  /// with bit 0 or 1 present members copy from the source's, and where that fails with
  /// bit 0 the member is replaced by a clone of the source's. False when `source` is no map.
  bool copyFrom(const Attribute& source, std::uint32_t mode, int index = -1) override;
  bool hasRuntimeFlag() const override;
  /// Index -1: `data` is another map's Members; this map then holds a clone of each (a name
  /// that occurs twice is taken once). Otherwise forwards to member `index`.
  void setData(const void* data, int index = -1) override;
  /// Index -1: compares with another map's Members: by count, then member by member in
  /// order, by name text, type and value.
  int compareData(const void* data, int index = -1) const override;
  /// The name of the map's declared type; null until set.
  virtual name_id mapType() const { return m_mapType; }

  /// The value of member `name`, created with its type's default when absent. Throws on an
  /// empty name, a member of another type, or a type the factory does not know.
  template <class T>
  T& attribute(name_id name) {
    return *static_cast<T*>(obtain(name, TypeTraits<T>::n_name, "base::AttribMap::attribute").data());
  }
  /// Sets member `name` to `value`, replacing a member of another type (or a link).
  template <class T>
  requires(!std::is_convertible_v<T, Attribute*>) T& attribute(name_id name, const T& value) {
    // Through setData, so that an attribute that keeps more than the value (a plug-in
    // reference keeps its object's id) stays consistent.
    Attribute& stored = replace(name, TypeTraits<T>::n_name);
    stored.setData(&value);
    return *static_cast<T*>(stored.data());
  }
  /// Stores `attr`, which the map owns from now on: inserted when absent; replacing a member
  /// of another type; a member of the same type keeps its object, takes `attr`'s value and
  /// `attr` is destroyed. Throws on an empty name or a null `attr`.
  void attribute(name_id name, Attribute* attr);

  /// The value of member `name` when it is a T, else null (logged when it is another type).
  /// Absent names are looked up in the base map chain.
  template <class T>
  const T* findAttribute(name_id name) const {
    return static_cast<const T*>(find(name, TypeTraits<T>::n_name, Mismatch::value));
  }
  /// The list of member `name` when it is a list of T, else null; as findAttribute.
  template <class T>
  const base::vector<T>* findVecAttribute(name_id name) const {
    return static_cast<const base::vector<T>*>(find(name, TypeTraits<T>::n_array_name, Mismatch::list));
  }
  /// The member `name` as stored here (no links followed, no base map asked), or null.
  const Attribute* findMember(name_id name) const { return member(name); }
  /// The member `name` as findAttribute finds it (links followed, absent names looked up in
  /// the base map chain) but of any type, for members that may take more than one; null
  /// when absent or when a link does not resolve (logged as findAttribute logs it).
  const Attribute* findResolved(name_id name) const;
  /// Destroys member `name` (as stored here; a base map keeps its own); false when absent.
  bool removeMember(name_id name);
  /// The slot that owns member `name`, or a shared slot holding null when absent. Neither
  /// links nor types are looked at. Throws on an empty name.
  Attribute** findAttributeMutable(name_id name);

  /// Binds `member` to attribute `name`: a stored value wins (copied into `member`), an
  /// absent one is created from `member`'s value; a link is left alone. Throws on an empty
  /// name, a member of another type, or a type the factory does not know.
  template <class T>
  void syncAttribute(name_id name, T& member) {
    if (Attribute* attr = sync(name, TypeTraits<T>::n_name, &member)) member = *static_cast<const T*>(attr->data());
  }

  /// The map this one inherits absent members from; null for none (or once it died).
  void setBaseMap(AttribMap* base) { m_baseMap.set(base); }
  /// Whether `map` is this map's base map or, further up, a base of its base.
  bool inheritsFrom(const AttribMap* map) const;
  void setMapType(name_id mapType) { m_mapType = mapType; }
  const Members& members() const { return m_members; }
  AttribFactory* factory() const { return m_factory; }

 private:
  enum class Mismatch { value, list };

  Members::iterator lowerBound(name_id name);
  Members::const_iterator lowerBound(name_id name) const;
  Attribute* member(name_id name) const;
  Attribute& obtain(name_id name, name_id type, const char* function);
  Attribute& replace(name_id name, name_id type);
  Attribute* sync(name_id name, name_id type, const void* initial);
  const void* find(name_id name, name_id type, Mismatch mismatch) const;
  const Attribute* followLinks(name_id name, const Attribute* found) const;
  Attribute* create(name_id type) const;
  void insert(Members::iterator at, name_id name, Attribute* attr);
  void destroyMembers();

  name_id m_mapType = nullptr;
  Members m_members;
  AttribFactory* m_factory;
  weak_ref<AttribMap> m_baseMap;
};

}  // namespace base
