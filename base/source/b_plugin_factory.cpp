#include "b_plugin_factory.h"

#include "b_attrib_link.h"
#include "b_log.h"
#include "b_plugin_attribute.h"

namespace base {
namespace {

// Plug-in steps of attribute paths name objects of the factory of the object that holds the
// link.
AttribMap* objectOfFactory(const AttribMap& from, std::uint32_t id) {
  const auto* holder = dynamic_cast<const IPlugin*>(&from);
  return holder && holder->factory() ? holder->factory()->object(id) : nullptr;
}

}  // namespace

PluginFactory::PluginFactory(std::string_view name, AttribFactory* attributes)
    : m_attributes(attributes), m_name(name) {
  AttribPath::setPluginResolver(objectOfFactory);
}

// Objects go before the descriptors that made them. References between objects may form
// cycles (a node listing itself among its children): they are dropped first, so that every
// object dies with the factory's list.
PluginFactory::~PluginFactory() {
  for (const ref<IPlugin>& object : m_objects) {
    if (object) dropPluginReferences(*object);
  }
  m_objects.clear();
}

bool PluginFactory::registerDesc(const ref<IPluginDesc>& descriptor) {
  if (!descriptor) return false;
  return m_descriptors.emplace(descriptor->name, descriptor).second;
}

bool PluginFactory::unregisterDesc(const ref<IPluginDesc>& descriptor) {
  return descriptor && unregisterDesc(descriptor->name);
}

bool PluginFactory::unregisterDesc(name_id name) { return m_descriptors.erase(name) > 0; }

ref<IPluginDesc> PluginFactory::findDesc(name_id name) const {
  const auto found = m_descriptors.find(name);
  return found == m_descriptors.end() ? ref<IPluginDesc>() : found->second;
}

IPluginDesc* PluginFactory::descriptorFor(name_id type, std::uint32_t flags) {
  if (const auto found = m_descriptors.find(type); found != m_descriptors.end()) return found->second.get();
  if (flags & (createOrNull | reportFailure)) {
    log().message(logSystem, logError, "plugin factory {}| Unable to create plugin of type {}!{}", m_name, text(type),
                  (flags & createOrNull) ? "" : " Creating a general plugin with limited functionality...");
  }
  if (flags & createOrNull) return nullptr;
  return dummyFor(type);
}

IPluginDesc* PluginFactory::dummyFor(name_id type) {
  // Made once: later requests for the type find it and are not reported again.
  ref<IPluginDesc> dummy(new DummyPluginDesc(type));
  base::append(m_dummies, dummy);
  m_descriptors.emplace(type, dummy);
  return dummy.get();
}

ref<IPlugin> PluginFactory::create(name_id type, std::uint32_t flags) {
  IPluginDesc* descriptor = descriptorFor(type, flags);
  if (!descriptor) return {};
  if (flags & createUnlisted) return ref<IPlugin>(descriptor->create(this, IPlugin::unlisted));
  std::unique_lock lock(m_lock, std::defer_lock);
  if (flags & createLocked) lock.lock();
  ref<IPlugin> object(descriptor->create(this, static_cast<std::uint32_t>(m_objects.size())));
  // A null result keeps its index used.
  base::append(m_objects, object);
  return object;
}

bool PluginFactory::replace(std::uint32_t oldIndex, std::uint32_t newIndex) {
  const bool valid = oldIndex < m_objects.size() && m_objects[oldIndex] &&
                     (newIndex < m_objects.size() || newIndex == IPlugin::unlisted);
  if (!valid) {
    log().message(logSystem, logDebug, "plugin factory| Attempt to replace non existing plugin {} detected!", oldIndex);
    return false;
  }
  const ref<IPlugin> replacement = newIndex == IPlugin::unlisted ? ref<IPlugin>() : m_objects[newIndex];
  const IPlugin* old = m_objects[oldIndex].get();
  for (const ref<IPlugin>& object : m_objects) {
    if (object) replacePluginReferences(*object, old, replacement);
  }
  return true;
}

bool PluginFactory::remove(std::uint32_t index, bool dropReferences) {
  if (index == IPlugin::unlisted) return false;
  if (index >= m_objects.size()) {
    log().message(logSystem, logDebug, "plugin factory| Attempt to remove non existing plugin {}!", index);
    return false;
  }
  if (!m_objects[index]) {
    log().message(logSystem, logDebug, "plugin factory| Attempt to remove already removed plugin {}!", index);
    return false;
  }
  // References go first, while the object still holds its slot (so replace finds it).
  if (dropReferences) replace(index, IPlugin::unlisted);
  m_objects[index].reset();
  return true;
}

std::size_t PluginFactory::compact() {
  std::size_t dropped = 0;
  while (!m_objects.empty() && !m_objects.back()) {
    m_objects.pop_back();
    ++dropped;
  }
  return dropped;
}

void PluginFactory::clearDescriptors() { m_descriptors.clear(); }

IPlugin* PluginFactory::object(std::uint32_t index) const {
  return index < m_objects.size() ? m_objects[index].get() : nullptr;
}

}  // namespace base
