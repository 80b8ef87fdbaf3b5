#include "b_attribute_map.h"

#include "b_attrib_link.h"
#include "b_binary_io.h"
#include "b_stream.h"
#include "b_structured.h"

#include "b_exception.h"
#include "b_log.h"

#include <fmt/format.h>

#include <algorithm>
#include <cstring>
#include <memory>
#include <mutex>

namespace base {
namespace {

const name_id& mapTypeName() {
  static const name_id name = intern("map");
  return name;
}

void requireName(name_id name, const char* function) {
  if (!name || name->length == 0) raise<exception>(function, "The attribute name can't be an empty string.");
}

bool nameLess(const AttribMap::Member& member, name_id name) { return member.first < name; }

// Text order of two names: bytewise over the shorter length, then the shorter first.
int compareTexts(name_id a, name_id b) {
  const std::string_view left = text(a);
  const std::string_view right = text(b);
  const int bytes = std::memcmp(left.data(), right.data(), std::min(left.size(), right.size()));
  if (bytes != 0) return bytes < 0 ? -1 : 1;
  if (left.size() == right.size()) return 0;
  return left.size() < right.size() ? -1 : 1;
}

}  // namespace

AttribMap::AttribMap(AttribFactory* factory) : m_factory(factory) {}

AttribMap::~AttribMap() { destroyMembers(); }

void AttribMap::destroyMembers() {
  for (Member& member : m_members) delete member.second;
  m_members.clear();
}

name_id AttribMap::type() const { return mapTypeName(); }

Attribute* AttribMap::clone() const {
  auto* copy = new AttribMap(m_factory);
  copy->flags = flags;
  m_baseMap.visit([copy](AttribMap* base) { copy->m_baseMap.set(base); });
  copy->m_members.reserve(m_members.size());
  for (const Member& member : m_members) copy->m_members.emplace_back(member.first, member.second->clone());
  return copy;
}

void* AttribMap::data(int index) {
  if (index < 0) return &m_members;
  if (static_cast<std::size_t>(index) >= m_members.size()) return nullptr;
  return m_members[static_cast<std::size_t>(index)].second->data();
}

std::uint32_t AttribMap::byteSize() const {
  std::uint32_t bytes = 4;
  for (const Member& member : m_members) bytes += member.second->byteSize();
  return bytes;
}

bool AttribMap::copyFrom(const Attribute& source, std::uint32_t mode, int) {
  const AttribMap* from = source.asMap();
  if (!from) return false;
  for (const Member& incoming : from->m_members) {
    auto at = lowerBound(incoming.first);
    if (at == m_members.end() || at->first != incoming.first) {
      insert(at, incoming.first, incoming.second->clone());
      continue;
    }
    if (!(mode & (copyOverwrite | copyMerge))) continue;
    if (!at->second->copyFrom(*incoming.second, mode) && (mode & copyOverwrite)) {
      delete std::exchange(at->second, incoming.second->clone());
    }
  }
  return true;
}

bool AttribMap::hasRuntimeFlag() const {
  return Attribute::hasRuntimeFlag() || std::any_of(m_members.begin(), m_members.end(), [](const Member& member) {
           return member.second->hasRuntimeFlag();
         });
}

void AttribMap::setData(const void* data, int index) {
  if (index >= 0) {
    if (static_cast<std::size_t>(index) < m_members.size()) {
      m_members[static_cast<std::size_t>(index)].second->setData(data);
    }
    return;
  }
  const auto& source = *static_cast<const Members*>(data);
  if (&source == &m_members) return;
  destroyMembers();
  for (const Member& incoming : source) {
    auto at = lowerBound(incoming.first);
    if (at == m_members.end() || at->first != incoming.first) insert(at, incoming.first, incoming.second->clone());
  }
}

int AttribMap::compareData(const void* data, int index) const {
  if (index >= 0) {
    if (static_cast<std::size_t>(index) >= m_members.size()) return 1;
    return m_members[static_cast<std::size_t>(index)].second->compareData(data);
  }
  const auto& other = *static_cast<const Members*>(data);
  if (m_members.size() != other.size()) return m_members.size() < other.size() ? -1 : 1;
  for (std::size_t k = 0; k < m_members.size(); ++k) {
    const Member& mine = m_members[k];
    const Member& theirs = other[k];
    if (mine.first != theirs.first) {
      if (text(mine.first).empty() && text(theirs.first).empty()) continue;
      return compareTexts(mine.first, theirs.first);
    }
    if (mine.second->type() != theirs.second->type()) return 1;
    if (const int order = mine.second->compareData(theirs.second->data()); order != 0) return order;
  }
  return 0;
}

namespace {

// Left out of the stored forms: members marked so, and links into plug-in objects that are.
bool stored(const AttribMap& map, const AttribMap::Member& member) {
  Attribute* attr = member.second;
  if (!attr || (attr->flags & attrNotStored)) return false;
  const AttribLink* link = attr->asLink();
  const AttribMap* object = link ? link->path().pluginObject(map) : nullptr;
  return !object || !(object->flags & attrNotStored);
}

// The least a stored member takes: two 16-bit name ids, its length and its flags byte.
constexpr std::uint64_t smallestMember = 2 + 2 + 4 + 1;

}  // namespace

void AttribMap::write(Stream& stream, BinaryContext& context) const {
  Attribute::write(stream, context);
  binary::put(stream,
              static_cast<std::uint32_t>(std::count_if(
                  m_members.begin(), m_members.end(), [this](const Member& member) { return stored(*this, member); })));
  for (const Member& member : m_members) {
    if (!stored(*this, member)) continue;
    context.writeName(stream, member.first);
    context.writeType(stream, member.second->type());
    binary::writeSized(stream, *member.second, context);
  }
}

void AttribMap::writeValue(StructuredWriter& writer) const {
  // In name order: the members' own order follows handle addresses, which differ from one
  // process to the next, and the same map should always read the same.
  base::vector<const Member*> ordered;
  for (const Member& member : m_members) ordered.push_back(&member);
  std::sort(ordered.begin(), ordered.end(),
            [](const Member* a, const Member* b) { return text(a->first) < text(b->first); });
  writer.beginObject();
  for (const Member* entry : ordered) {
    const Member& member = *entry;
    if (!stored(*this, member)) continue;
    base::string key(text(member.first));
    key += '^';
    key += text(member.second->type());
    writer.key(key);
    member.second->writeValue(writer);
  }
  writer.endObject();
}

bool AttribMap::readValue(StructuredReader& reader) {
  std::size_t size = 0;
  if (!reader.beginObject(size)) return false;
  bool fits = true;
  for (base::string key; fits && reader.key(key);) {
    // Type names hold no '^'; member names may.
    const std::size_t mark = key.rfind('^');
    const name_id name = intern(std::string_view(key).substr(0, mark));
    std::unique_ptr<Attribute> attr(mark == base::string::npos ? nullptr
                                                               : m_factory->create(intern(key.substr(mark + 1))));
    if (!attr) {
      log().message(logSystem, logWarning,
                    "map attribute: Attribute '{}' has unknown type. This may be caused by newer version or "
                    "corrupted file. Trying to skip...",
                    clipped(text(name)));
      reader.skip();
      continue;
    }
    fits = !text(name).empty() && attr->readValue(reader);
    if (!fits) break;
    auto at = lowerBound(name);
    if (at != m_members.end() && at->first == name) {
      delete std::exchange(at->second, attr.release());
    } else {
      insert(at, name, attr.release());
    }
  }
  reader.endObject();
  return fits;
}

void AttribMap::read(Stream& stream, BinaryContext& context) {
  const BinaryContext::Level level(context, stream);
  Attribute::read(stream, context);
  const std::uint32_t count = binary::readCount(stream, smallestMember, "map members");
  for (std::uint32_t k = 0; k < count; ++k) {
    const name_id name = context.readName(stream);
    const name_id type = context.readType(stream);
    const std::uint32_t length = binary::readCount(stream, 1, "member bytes");
    std::unique_ptr<Attribute> attr(m_factory->create(type));
    if (!attr) {
      log().message(logSystem, logWarning,
                    "map attribute: Attribute '{}' has unknown type. This may be caused by newer version or "
                    "corrupted file. Trying to skip...",
                    clipped(text(name)));
      if (const std::uint64_t skipped = stream.skip(length); skipped < length) {
        binary::failShort(stream, length, skipped);
      }
      continue;
    }
    binary::readSized(stream, *attr, context, length);
    auto at = lowerBound(name);
    if (at != m_members.end() && at->first == name) {
      delete std::exchange(at->second, attr.release());
    } else {
      insert(at, name, attr.release());
    }
  }
}

void AttribMap::attribute(name_id name, Attribute* attr) {
  requireName(name, "base::AttribMap::attribute");
  if (!attr) raise<exception>("base::AttribMap::attribute", "Can't set invalid attribute");
  auto at = lowerBound(name);
  if (at == m_members.end() || at->first != name) {
    insert(at, name, attr);
  } else if (at->second->type() != attr->type()) {
    delete std::exchange(at->second, attr);
  } else {
    // The member keeps its object (others may refer to it); the map owns `attr` and so
    // destroys it once its value is taken.
    at->second->setData(attr->data());
    delete attr;
  }
}

bool AttribMap::removeMember(name_id name) {
  const auto at = lowerBound(name);
  if (at == m_members.end() || at->first != name) return false;
  delete at->second;
  m_members.erase(at);
  return true;
}

Attribute** AttribMap::findAttributeMutable(name_id name) {
  requireName(name, "base::AttribMap::findAttributeMutable");
  auto at = lowerBound(name);
  if (at != m_members.end() && at->first == name) return &at->second;
  // An absent name gets a slot that holds null; callers must not store into it.
  static thread_local Attribute* absent;
  absent = nullptr;
  return &absent;
}

AttribMap::Members::iterator AttribMap::lowerBound(name_id name) {
  return std::lower_bound(m_members.begin(), m_members.end(), name, nameLess);
}

AttribMap::Members::const_iterator AttribMap::lowerBound(name_id name) const {
  return std::lower_bound(m_members.begin(), m_members.end(), name, nameLess);
}

Attribute* AttribMap::member(name_id name) const {
  const auto at = lowerBound(name);
  return at != m_members.end() && at->first == name ? at->second : nullptr;
}

void AttribMap::insert(Members::iterator at, name_id name, Attribute* attr) {
  const auto offset = at - m_members.begin();
  base::reserveForAppend(m_members, 1);
  m_members.insert(m_members.begin() + offset, Member(name, attr));
}

Attribute* AttribMap::create(name_id type) const {
  Attribute* attr = m_factory->create(type);
  if (!attr)
    raise<exception>("base::AttribMap::attribute",
                     fmt::format("Trying to access not registered attribute type '{}'.", text(type)));
  return attr;
}

Attribute& AttribMap::obtain(name_id name, name_id type, const char* function) {
  requireName(name, function);
  auto at = lowerBound(name);
  if (at != m_members.end() && at->first == name) {
    if (at->second->type() != type) {
      raise<exception>(function, fmt::format("Detected invalid access to attribute '{}'. Expected type '{}', actual "
                                             "attribute type - '{}'",
                                             text(name), text(type), text(at->second->type())));
    }
    return *at->second;
  }
  Attribute* created = create(type);
  insert(at, name, created);
  return *created;
}

Attribute& AttribMap::replace(name_id name, name_id type) {
  requireName(name, "base::AttribMap::attribute");
  auto at = lowerBound(name);
  if (at != m_members.end() && at->first == name) {
    if (at->second->type() != type || at->second->asLink()) delete std::exchange(at->second, create(type));
    return *at->second;
  }
  Attribute* created = create(type);
  insert(at, name, created);
  return *created;
}

Attribute* AttribMap::sync(name_id name, name_id type, const void* initial) {
  requireName(name, "base::AttribMap::syncAttribute");
  auto at = lowerBound(name);
  if (at == m_members.end() || at->first != name) {
    Attribute* created = create(type);
    created->setData(initial);
    insert(at, name, created);
    return nullptr;
  }
  Attribute* existing = at->second;
  if (existing->asLink()) return nullptr;
  if (existing->type() != type) {
    raise<exception>("base::AttribMap::syncAttribute",
                     fmt::format("Detected invalid access to attribute '{}'. Expected type '{}', attribute type - '{}'",
                                 text(name), text(type), text(existing->type())));
  }
  return existing;
}

const Attribute* AttribMap::followLinks(name_id name, const Attribute* found) const {
  // A chain of links that comes back to itself ends here like an unresolvable one.
  constexpr int longestChain = 64;
  const Attribute* target = found;
  const AttribMap* holder = this;
  for (int hops = 0; target && target->asLink(); ++hops) {
    const AttribLink* link = target->asLink();
    target = hops < longestChain ? link->path().resolve(*holder, &holder) : nullptr;
  }
  if (!target && !(found->flags & attrSilentLink)) {
    log().message(logSystem, logError,
                  "map attribute| Detected invalid link attribute! Cannot resolve '{}' with value '{}'!", text(name),
                  clipped(found->asLink()->path().toText()));
  }
  return target;
}

const Attribute* AttribMap::findResolved(name_id name) const {
  requireName(name, "base::AttribMap::findAttribute");
  if (const Attribute* found = member(name)) return found->asLink() ? followLinks(name, found) : found;
  // Inherited: the base map cannot die while its node is held.
  return m_baseMap.visit([&](const AttribMap* base) { return base ? base->findResolved(name) : nullptr; });
}

const void* AttribMap::find(name_id name, name_id type, Mismatch mismatch) const {
  const Attribute* found = findResolved(name);
  if (!found) return nullptr;
  if (found->type() == type) return found->data();
  if (mismatch == Mismatch::value) {
    log().message(logSystem, logError,
                  "map attribute| Detected invalid access to attribute '{}'. Expected '{}', actual attribute type - "
                  "'{}'",
                  text(name), text(type), text(found->type()));
  } else {
    log().message(logSystem, logError,
                  "map attribute| Detected invalid access to attribute '{}'. Expected type '{}', actual attribute "
                  "type - '{}'!",
                  text(name), text(type), text(found->type()));
  }
  return nullptr;
}

bool AttribMap::inheritsFrom(const AttribMap* map) const {
  return m_baseMap.visit([map](const AttribMap* base) { return base && (base == map || base->inheritsFrom(map)); });
}

}  // namespace base
