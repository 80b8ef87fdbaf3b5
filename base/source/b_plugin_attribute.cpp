#include "b_plugin_attribute.h"

#include "b_attrib_array.h"
#include "b_binary_io.h"
#include "b_hash.h"
#include "b_log.h"
#include "b_plugin_factory.h"
#include "b_structured.h"

#include <algorithm>

namespace base {
namespace {

std::uint32_t idOf(const ref<IPlugin>& object) { return object ? object->index() : PluginAttribute::none; }

// The object that id `id` names among the objects from `first` on; reported when none.
ref<IPlugin> resolve(PluginFactory& factory, std::uint32_t first, std::uint32_t id, std::string_view name) {
  if (id == PluginAttribute::none) return {};
  const std::uint64_t index = std::uint64_t(first) + id;
  if (index >= factory.objects().size()) {
    log().message(logSystem, logError,
                  "plugin factory| Invalid plugin attribute detected for '{}'! Id {} out of bounds!", clipped(name),
                  id);
    return {};
  }
  const ref<IPlugin>& object = factory.objects()[static_cast<std::size_t>(index)];
  if (!object) {
    log().message(logSystem, logError, "plugin factory| Invalid plugin attribute detected for '{}'! Plugin not set!",
                  clipped(name));
  }
  return object;
}

void writeId(StructuredWriter& writer, std::uint32_t id) {
  if (id == PluginAttribute::none) {
    writer.null();
  } else {
    writer.value(std::uint64_t(id));
  }
}

bool readId(StructuredReader& reader, std::uint32_t& id) {
  if (reader.null()) {
    id = PluginAttribute::none;
    return true;
  }
  std::uint64_t value = 0;
  if (!reader.value(value) || value >= PluginAttribute::none) return false;
  id = static_cast<std::uint32_t>(value);
  return true;
}

std::uint32_t storedId(const BinaryContext& context, std::uint32_t id) {
  return id == PluginAttribute::none ? id : context.pluginId(id);
}

}  // namespace

Attribute* PluginAttribute::clone() const {
  auto* copy = new PluginAttribute;
  copy->flags = flags;
  copy->m_object = m_object;
  copy->m_id = m_id;
  return copy;
}

void PluginAttribute::writeValue(StructuredWriter& writer) const { writeId(writer, m_id); }

void PluginAttribute::write(Stream& stream, BinaryContext& context) const {
  Attribute::write(stream, context);
  binary::put(stream, storedId(context, m_id));
}

bool PluginAttribute::readValue(StructuredReader& reader) {
  std::uint32_t id = none;
  if (!readId(reader, id)) return false;
  m_object.reset();
  m_id = id;
  return true;
}

void PluginAttribute::read(Stream& stream, BinaryContext& context) {
  Attribute::read(stream, context);
  m_object.reset();
  m_id = binary::get<std::uint32_t>(stream);
}

bool PluginAttribute::copyFrom(const Attribute& source, std::uint32_t mode, int) {
  if (!(mode & copyOverwrite) || source.type() != type()) return false;
  const auto& from = static_cast<const PluginAttribute&>(source);
  m_object = from.m_object;
  m_id = from.m_id;
  return true;
}

void PluginAttribute::setData(const void* data, int) {
  m_object = *static_cast<const ref<IPlugin>*>(data);
  m_id = idOf(m_object);
}

int PluginAttribute::compareData(const void* data, int) const {
  const auto& other = *static_cast<const ref<IPlugin>*>(data);
  if (other == m_object) return 0;
  return m_id < idOf(other) ? -1 : 1;
}

void PluginAttribute::bind(PluginFactory& factory, std::uint32_t first, std::string_view name) {
  m_object = resolve(factory, first, m_id, name);
  m_id = idOf(m_object);
}

void PluginAttribute::replace(const IPlugin* old, const ref<IPlugin>& replacement) {
  if (m_object.get() != old) return;
  m_object = replacement;
  m_id = idOf(m_object);
}

Attribute* PluginVectorAttribute::clone() const {
  auto* copy = new PluginVectorAttribute;
  copy->flags = flags;
  copy->m_objects = m_objects;
  copy->m_ids = m_ids;
  return copy;
}

void PluginVectorAttribute::writeValue(StructuredWriter& writer) const {
  writer.beginArray();
  for (std::uint32_t id : m_ids) writeId(writer, id);
  writer.endArray();
}

void PluginVectorAttribute::write(Stream& stream, BinaryContext& context) const {
  Attribute::write(stream, context);
  binary::put(stream, static_cast<std::uint32_t>(m_ids.size()));
  for (std::uint32_t id : m_ids) binary::put(stream, storedId(context, id));
}

bool PluginVectorAttribute::readValue(StructuredReader& reader) {
  std::size_t size = 0;
  if (!reader.beginArray(size)) return false;
  base::vector<std::uint32_t> ids(size, PluginAttribute::none);
  bool fits = true;
  for (std::size_t k = 0; k < size && fits; ++k) fits = readId(reader, ids[k]);
  reader.endArray();
  if (!fits) return false;
  m_ids = std::move(ids);
  m_objects.assign(m_ids.size(), ref<IPlugin>());
  return true;
}

void PluginVectorAttribute::read(Stream& stream, BinaryContext& context) {
  Attribute::read(stream, context);
  // Into a list of its own: a read that fails leaves ids and objects in step.
  base::vector<std::uint32_t> ids;
  binary::readPacked(stream, ids, binary::readCount(stream, 4, "plug-in references"));
  m_ids = std::move(ids);
  m_objects.assign(m_ids.size(), ref<IPlugin>());
}

void* PluginVectorAttribute::data(int index) {
  if (index < 0) return &m_objects;
  return static_cast<std::size_t>(index) < m_objects.size() ? &m_objects[static_cast<std::size_t>(index)] : nullptr;
}

bool PluginVectorAttribute::erase(int index) {
  if (index < 0 || static_cast<std::size_t>(index) >= m_objects.size()) return false;
  m_objects.erase(m_objects.begin() + index);
  m_ids.erase(m_ids.begin() + index);
  return true;
}

bool PluginVectorAttribute::copyFrom(const Attribute& source, std::uint32_t mode, int) {
  if (!(mode & copyOverwrite) || source.type() != type()) return false;
  const auto& from = static_cast<const PluginVectorAttribute&>(source);
  m_objects = from.m_objects;
  m_ids = from.m_ids;
  return true;
}

void PluginVectorAttribute::setData(const void* data, int index) {
  if (index < 0) {
    m_objects = *static_cast<const base::vector<ref<IPlugin>>*>(data);
  } else if (static_cast<std::size_t>(index) < m_objects.size()) {
    m_objects[static_cast<std::size_t>(index)] = *static_cast<const ref<IPlugin>*>(data);
  }
  syncIds();
}

int PluginVectorAttribute::compareData(const void* data, int index) const {
  if (index >= 0) {
    if (static_cast<std::size_t>(index) >= m_objects.size()) return 1;
    return m_objects[static_cast<std::size_t>(index)] == *static_cast<const ref<IPlugin>*>(data) ? 0 : 1;
  }
  const auto& other = *static_cast<const base::vector<ref<IPlugin>>*>(data);
  if (m_objects.size() != other.size()) return m_objects.size() < other.size() ? -1 : 1;
  return std::equal(m_objects.begin(), m_objects.end(), other.begin()) ? 0 : 1;
}

std::uint64_t PluginVectorAttribute::hash() const {
  return murmurHash3(m_objects.data(), m_objects.size() * sizeof(ref<IPlugin>));
}

void PluginVectorAttribute::bind(PluginFactory& factory, std::uint32_t first, std::string_view name) {
  for (std::size_t k = 0; k < m_ids.size(); ++k) m_objects[k] = resolve(factory, first, m_ids[k], name);
  syncIds();
}

void PluginVectorAttribute::replace(const IPlugin* old, const ref<IPlugin>& replacement) {
  for (ref<IPlugin>& object : m_objects) {
    if (object.get() == old) object = replacement;
  }
  syncIds();
}

void PluginVectorAttribute::assign(base::vector<ref<IPlugin>>&& objects) {
  m_objects = std::move(objects);
  syncIds();
}

void PluginVectorAttribute::syncIds() {
  m_ids.resize(m_objects.size());
  std::transform(m_objects.begin(), m_objects.end(), m_ids.begin(), idOf);
}

namespace {

// Calls `visit` with every plug-in reference attribute inside `attr`, and the name of the
// member it belongs to.
template <class Visit>
void forEachReference(Attribute& attr, std::string_view name, Visit& visit) {
  static const name_id single = TypeTraits<ref<IPlugin>>::n_name;
  static const name_id list = TypeTraits<ref<IPlugin>>::n_array_name;
  if (AttribMap* map = attr.asMap()) {
    for (const AttribMap::Member& member : map->members()) forEachReference(*member.second, text(member.first), visit);
  } else if (AttribArray* array = attr.asArray()) {
    for (Attribute* element : array->elements()) {
      if (element) forEachReference(*element, name, visit);
    }
  } else if (attr.type() == single) {
    visit(static_cast<PluginAttribute&>(attr), name);
  } else if (attr.type() == list) {
    visit(static_cast<PluginVectorAttribute&>(attr), name);
  }
}

}  // namespace

void bindPluginReferences(AttribMap& map, PluginFactory& factory, std::uint32_t first) {
  auto bind = [&](auto& reference, std::string_view name) { reference.bind(factory, first, name); };
  forEachReference(map, {}, bind);
}

void dropPluginReferences(AttribMap& map) {
  auto drop = [](auto& reference, std::string_view) { reference.drop(); };
  forEachReference(map, {}, drop);
}

void replacePluginReferences(AttribMap& map, const IPlugin* old, const ref<IPlugin>& replacement) {
  auto replace = [&](auto& reference, std::string_view) { reference.replace(old, replacement); };
  forEachReference(map, {}, replace);
}

}  // namespace base
