#pragma once

#include "b_api.h"
#include "b_attribute.h"
#include "b_containers.h"
#include "b_name.h"

#include <mutex>

namespace base {

/// Creates attributes by type name. The process-wide one, base::attribFactory(), knows every
/// value type of the scene model; a map creates every member it needs through its factory.
class BASE1_API AttribFactory {
 public:
  using Creator = Attribute* (*)();

  /// Registers `create` for `type`; a later registration replaces an earlier one.
  void add(name_id type, Creator create);
  /// A new attribute of `type`, owned by the caller. Null when no creator is registered,
  /// logged as "factory: Trying to create am item with unknown type {}.".
  Attribute* create(name_id type) const;
  /// Whether `type` can be created.
  bool knows(name_id type) const;
  /// The registered type names, in handle order.
  base::vector<name_id> types() const;

 private:
  mutable std::mutex m_mutex;
  base::map<name_id, Creator> m_creators;
};

/// The process-wide attribute factory; callers never own it.
BASE1_API AttribFactory& attribFactory();

}  // namespace base
