#pragma once

#include "b_attribute_map.h"
#include "b_refcnt.h"

#include <cstdint>

namespace base {

class IPlugin;
class PluginFactory;

/// Further behaviour of a plug-in object, looked up by interface name.
class BASE1_API IPluginInterface {
 public:
  virtual ~IPluginInterface();
  /// The interface's own name; every interface class answers its own.
  virtual name_id interfaceName() const = 0;
};

/// Makes plug-in objects of one type; registered in a factory under its type name.
class BASE1_API IPluginDesc : public RefCntAtomic {
 public:
  /// Bit of `flags` that marks a descriptor the factory made for a type it cannot create.
  static constexpr std::uint32_t dummyFlag = 0x80000000;
  /// The type index of a descriptor whose objects are not being written.
  static constexpr std::uint16_t noTypeIndex = 0xBAAD;

  /// Named "Plugin" until a subclass names its type.
  IPluginDesc();
  ~IPluginDesc() override;

  /// A new object of this type for `factory` at `index` (0xFFFFFFFF: not listed); null on
  /// failure. The base makes a general object without interfaces.
  virtual IPlugin* create(PluginFactory* factory, std::uint32_t index);

  bool isDummy() const { return (flags & dummyFlag) != 0; }

  std::uint32_t flags = 0;
  name_id name;
  base::string author;
  base::string description;
  /// The position of the type's name in the table a factory writes; see noTypeIndex.
  std::uint16_t typeIndex = noTypeIndex;
};

/// The descriptor a factory makes for a type it cannot create: general objects of that
/// type name.
class BASE1_API DummyPluginDesc : public IPluginDesc {
 public:
  explicit DummyPluginDesc(name_id type);
};

/// Everything the host creates by type name: an attribute map with a reference count, made
/// by a descriptor and listed in a factory. Further behaviour comes through interfaces.
class BASE1_API IPlugin : public AttribMap, public RefCntAtomic {
 public:
  // Both bases come from the host allocator and keep weak lists: references to a plug-in
  // object go through its count, and so through the count's list.
  using RefCntAtomic::operator new;
  using RefCntAtomic::operator delete;
  using WeakBase = RefCntAtomic;
  using RefCntAtomic::attachWeak;
  using RefCntAtomic::detachWeak;

  /// An object of `factory` (whose attribute factory it uses) made by `descriptor`, at
  /// `index` in the factory's list (0xFFFFFFFF: not listed). Neither is counted.
  IPlugin(PluginFactory* factory, IPluginDesc* descriptor, std::uint32_t index);
  ~IPlugin() override;

  /// A new object of the same type from the same factory (listed there), holding a clone of
  /// each member; null when there is no factory or the factory cannot make the type.
  Attribute* clone() const override;
  /// The text of the "name" attribute; empty without one.
  base::string toString() const override;
  /// The descriptor's name; the empty name without a descriptor.
  name_id mapType() const override;
  /// The first interface that answers `name`; null when none does.
  virtual IPluginInterface* queryInterface(name_id name) const;

  /// Called by the factory just before the object is written to an object-list file, so
  /// that it can bring its attributes up to date; does nothing here.
  virtual void beforeWrite() {}

  /// Adds an interface; the object does not own it.
  void addInterface(IPluginInterface* interface);

  IPluginDesc* descriptor() const { return m_descriptor; }
  PluginFactory* factory() const { return m_factory; }
  /// The position in the factory's list; 0xFFFFFFFF when not listed.
  std::uint32_t index() const { return m_index; }

  // An enumerator, not a variable: it never needs a definition in the library (an imported
  // constant would on Windows).
  enum : std::uint32_t { unlisted = 0xFFFFFFFF };

 private:
  base::vector<IPluginInterface*> m_interfaces;
  IPluginDesc* m_descriptor;
  PluginFactory* m_factory;
  std::uint32_t m_index;
};

}  // namespace base
