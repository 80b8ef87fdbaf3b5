#pragma once

#include "b_attrib_factory.h"
#include "b_attribute_map.h"
#include "b_critical_section.h"
#include "b_plugin.h"
#include "b_refcnt.h"

#include <cstdint>
#include <mutex>
#include <string_view>

namespace base {

/// Makes plug-in objects by type name through registered descriptors and keeps the objects
/// it lists: an object's index is its position in the list, and a removed object leaves an
/// empty slot, so every other object keeps its index.
class BASE1_API PluginFactory : public RefCntAtomic {
 public:
  /// Bits of create's flags.
  enum CreateFlag : std::uint32_t {
    createOrNull = 1,    ///< an unknown type gives null instead of a general object
    reportFailure = 2,   ///< an unknown type is logged
    createLocked = 4,    ///< the object is made and listed under the factory's lock
    createUnlisted = 8,  ///< the object is not entered in the list
  };

  /// `name` appears in the factory's messages; objects get their attributes from
  /// `attributes`.
  explicit PluginFactory(std::string_view name = {}, AttribFactory* attributes = &attribFactory());
  ~PluginFactory() override;
  PluginFactory(const PluginFactory&) = delete;
  PluginFactory& operator=(const PluginFactory&) = delete;

  /// Registers `descriptor` under its name; false (nothing changes) when the name is taken.
  bool registerDesc(const ref<IPluginDesc>& descriptor);
  /// Removes the descriptor of that name; false when there is none.
  bool unregisterDesc(const ref<IPluginDesc>& descriptor);
  bool unregisterDesc(name_id name);
  /// The descriptor registered under `name`, or null.
  ref<IPluginDesc> findDesc(name_id name) const;
  /// Every registered descriptor by name.
  const base::map<name_id, ref<IPluginDesc>>& descriptors() const { return m_descriptors; }
  /// Unregisters every descriptor.
  void clearDescriptors();

  /// A new object of `type` (see CreateFlag). An unknown type gives a general object under a
  /// dummy descriptor made once for it, or null with createOrNull; it is logged with
  /// createOrNull or reportFailure. A listed object takes the next index, even when its
  /// descriptor gives null.
  ref<IPlugin> create(name_id type, std::uint32_t flags = 0);

  /// Tells every listed object to refer to object `newIndex` (none for 0xFFFFFFFF) wherever
  /// it refers to object `oldIndex`; false, logged, when `oldIndex` holds no object or
  /// `newIndex` is outside the list.
  bool replace(std::uint32_t oldIndex, std::uint32_t newIndex);
  /// Empties slot `index`, dropping the list's reference; with `dropReferences` the other
  /// objects' references to it are replaced by none first. False, logged, for an index
  /// outside the list or an empty slot (nothing logged for 0xFFFFFFFF).
  bool remove(std::uint32_t index, bool dropReferences = false);

  /// Drops the empty slots at the end of the object list, which removed objects left
  /// behind; every listed object keeps its index. Returns the slots dropped.
  std::size_t compact();

  /// Writes the object list as an object-list file (see docs/formats.md): the plug-in type,
  /// attribute type and name tables, then each listed object that is stored (not empty, no
  /// flags bit 31) with its type index and attribute map. References between objects are
  /// stored as positions in the written list. Stream failures throw.
  void write(Stream& stream);
  /// Appends the objects of an object-list file. Version, size and table errors throw; a bad
  /// type record stops the read with an error message and keeps the objects read so far;
  /// unknown plug-in types become general objects, unknown attribute types are skipped.
  /// References are bound to the objects of this read at the end.
  void read(Stream& stream);

  /// The listed object at `index`, or null.
  IPlugin* object(std::uint32_t index) const;
  const base::vector<ref<IPlugin>>& objects() const { return m_objects; }
  const base::string& name() const { return m_name; }
  AttribFactory* attributeFactory() const { return m_attributes; }

 private:
  IPluginDesc* descriptorFor(name_id type, std::uint32_t flags);
  IPluginDesc* dummyFor(name_id type);

  base::map<name_id, ref<IPluginDesc>> m_descriptors;
  base::vector<ref<IPlugin>> m_objects;
  AttribFactory* m_attributes;
  CriticalSection m_lock;
  base::string m_name;
  base::vector<ref<IPluginDesc>> m_dummies;
};

}  // namespace base
