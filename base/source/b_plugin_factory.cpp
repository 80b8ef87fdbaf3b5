#include "b_plugin_factory.h"

#include "b_log.h"

namespace base {

PluginFactory::PluginFactory(std::string_view name, AttribFactory* attributes)
    : m_ownAttributes(attributes), m_attributes(attributes), m_name(name) {}

// Objects go before the descriptors that made them.
PluginFactory::~PluginFactory() { m_objects.clear(); }

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

base::vector<ref<IPluginDesc>> PluginFactory::descriptors() const {
  base::vector<ref<IPluginDesc>> all;
  all.reserve(m_descriptors.size());
  for (const auto& entry : m_descriptors) all.push_back(entry.second);
  return all;
}

IPluginDesc* PluginFactory::descriptorFor(name_id type, std::uint32_t flags) {
  if (const auto found = m_descriptors.find(type); found != m_descriptors.end()) return found->second.get();
  if (flags & (createOrNull | reportFailure)) {
    log().message(logSystem, logError, "plugin factory {}| Unable to create plugin of type {}!{}", m_name, text(type),
                  (flags & createOrNull) ? "" : " Creating a general plugin with limited functionality...");
  }
  if (flags & createOrNull) return nullptr;
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

bool PluginFactory::remove(std::uint32_t index) {
  if (index == IPlugin::unlisted) return false;
  if (index >= m_objects.size()) {
    log().message(logSystem, logDebug, "plugin factory| Attempt to remove non existing plugin {}!", index);
    return false;
  }
  if (!m_objects[index]) {
    log().message(logSystem, logDebug, "plugin factory| Attempt to remove already removed plugin {}!", index);
    return false;
  }
  m_objects[index].reset();
  return true;
}

IPlugin* PluginFactory::object(std::uint32_t index) const {
  return index < m_objects.size() ? m_objects[index].get() : nullptr;
}

}  // namespace base
