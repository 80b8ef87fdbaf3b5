#include "b_attribute.h"

#include "b_binary_io.h"

namespace base {

Attribute::~Attribute() { m_weak.clear(); }

AttribLink* Attribute::asLink() { return nullptr; }
AttribArray* Attribute::asArray() { return nullptr; }
AttribMap* Attribute::asMap() { return nullptr; }
void Attribute::write(Stream& stream, BinaryContext&) const {
  binary::put(stream, static_cast<std::uint8_t>(flags & attrPersistent));
}

void Attribute::read(Stream& stream, BinaryContext&) {
  flags = (flags & ~std::uint32_t(attrPersistent)) | binary::get<std::uint8_t>(stream);
}

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
