#include "b_attribute.h"

namespace base {

Attribute::~Attribute() { m_weak.clear(); }

AttribLink* Attribute::asLink() { return nullptr; }
AttribArray* Attribute::asArray() { return nullptr; }
AttribMap* Attribute::asMap() { return nullptr; }
std::uint32_t Attribute::size() const { return 1; }
bool Attribute::erase(int) { return false; }
base::string Attribute::toString() const { return {}; }
bool Attribute::fromString(std::string_view) { return false; }
bool Attribute::hasRuntimeFlag() const { return (flags & attrRuntime) != 0; }
std::uint64_t Attribute::hash() const { return 0; }

void Attribute::attachWeak(WeakNode& node) { m_weak.attach(node, this); }

void Attribute::detachWeak(WeakNode& node) {
  detail::LockedWeakList::detach(
      node, [](void* target) -> detail::LockedWeakList& { return static_cast<Attribute*>(target)->m_weak; });
}

}  // namespace base
