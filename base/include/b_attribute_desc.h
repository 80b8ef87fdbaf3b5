#pragma once

#include "b_api.h"
#include "b_attrib_factory.h"
#include "b_containers.h"
#include "b_name.h"
#include "b_refcnt.h"

#include <cstdint>
#include <string_view>

namespace base {

/// What one attribute of a map type is: its value type, default, limits and the data a user
/// interface shows. Read from an `Attribute` element of a description file.
class BASE1_API AttribDesc : public RefCntAtomic {
 public:
  /// Bits of `flags`.
  enum Flag : std::uint32_t {
    visible = 0x1,
    resource = 0x2,
    optional = 0x4,
    readOnly = 0x8,
    cmdline = 0x10,
    state = 0x20,
    keyable = 0x40,
  };

  /// A new attribute of this type holding the default (the type's own initial value when the
  /// default is empty or does not convert); null when `factory` cannot make the type.
  Attribute* createAttribute(const AttribFactory& factory = attribFactory()) const;
  bool has(Flag flag) const { return (flags & flag) != 0; }

  base::string name;
  base::string label;
  /// The value type's name, as TypeTraits<T>::n_name or n_array_name carries it.
  name_id type = nullptr;
  base::string control;
  base::string initialiser;
  base::string action;
  base::string defaultValue;
  base::string min;
  base::string max;
  base::string softMin;
  base::string softMax;
  base::string enumeration;
  base::string help;
  base::string units;
  std::uint32_t precision = 0;
  std::uint32_t controlLines = 0;
  std::uint32_t flags = visible;
};

/// A map type: its attributes in declaration order, and the type it extends. Read from an
/// `AttributeMap` element of a description file.
class BASE1_API AttribMapDesc : public RefCntAtomic {
 public:
  /// Bits of `flags`.
  enum MapFlag : std::uint32_t { singleInstance = 0x1, customDescriptor = 0x2 };

  /// The attribute of that name declared by this type itself, or null.
  const AttribDesc* find(std::string_view attributeName) const;

  name_id name = nullptr;
  base::string friendText;
  /// The map type this one extends; null for none.
  name_id inherit = nullptr;
  base::string className;
  bool abstract = false;
  base::string copyright;
  std::uint32_t flags = 0;
  name_id arrayOf = nullptr;
  base::vector<ref<AttribDesc>> attributes;
};

/// The descriptions of every map type the process knows, loaded from description files.
/// Loading is not locked against lookups: load before objects use the descriptions.
class BASE1_API AttribDescManager {
 public:
  /// Loads one description file (through the master file system) and resolves inheritance.
  /// A file that cannot be read or parsed throws base::exception; a map type that is known
  /// already keeps its first description (with a warning naming this file).
  void load(std::string_view path);
  /// Loads every ".xml" file of `folder` (a file that throws base::exception is logged and
  /// skipped), then resolves inheritance once. Returns the number of files loaded.
  std::size_t loadFolder(std::string_view folder);
  /// Forgets every description.
  void clear();

  /// The description of a map type, or null.
  ref<AttribMapDesc> find(name_id type) const;
  /// The description of attribute `attributeName` of map type `type` or of the nearest type
  /// it extends that declares it; null when none does. `declaredBy` receives that type.
  const AttribDesc* findAttribute(name_id type, std::string_view attributeName, name_id* declaredBy = nullptr) const;
  /// The map types that extend `type` directly, in name order.
  base::vector<name_id> inheritors(name_id type) const;
  const base::map<name_id, ref<AttribMapDesc>>& descriptors() const { return m_descriptors; }

  const base::string& documentNamespace() const { return m_namespace; }
  const base::string& destination() const { return m_destination; }
  const base::string& constructor() const { return m_constructor; }

 private:
  /// Reads one file's map types without resolving inheritance.
  void read(std::string_view path);
  void resolveInheritance();
  bool inheritsItself(const AttribMapDesc& desc) const;

  base::map<name_id, ref<AttribMapDesc>> m_descriptors;
  base::string m_namespace;
  base::string m_destination;
  base::string m_constructor;
  base::map<name_id, base::vector<name_id>> m_inheritors;
};

/// The process-wide descriptor manager; callers never own it.
BASE1_API AttribDescManager& attribDescManager();

}  // namespace base
