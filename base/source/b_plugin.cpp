#include "b_plugin.h"

#include "b_plugin_factory.h"

#include <algorithm>

namespace base {

IPluginInterface::~IPluginInterface() = default;

IPluginDesc::IPluginDesc() : name(intern("Plugin")) {}

IPluginDesc::~IPluginDesc() = default;

IPlugin* IPluginDesc::create(PluginFactory* factory, std::uint32_t index) { return new IPlugin(factory, this, index); }

DummyPluginDesc::DummyPluginDesc(name_id type) {
  name = type;
  flags |= dummyFlag;
}

IPlugin::IPlugin(PluginFactory* factory, IPluginDesc* descriptor, std::uint32_t index)
    : AttribMap(factory ? factory->attributeFactory() : &attribFactory()),
      m_descriptor(descriptor),
      m_factory(factory),
      m_index(index) {}

IPlugin::~IPlugin() = default;

Attribute* IPlugin::clone() const {
  if (!m_factory || !m_descriptor) return nullptr;
  ref<IPlugin> copy = m_factory->create(m_descriptor->name, PluginFactory::createOrNull | PluginFactory::createLocked);
  if (!copy) return nullptr;
  // The new object may hold members of its own already; those stay.
  copy->copyFrom(*this, copyAddMissing);
  return copy.get();
}

base::string IPlugin::toString() const {
  static const name_id nameKey = intern("name");
  const base::string* name = findAttribute<base::string>(nameKey);
  return name ? *name : base::string();
}

name_id IPlugin::mapType() const {
  static const name_id none = intern("");
  return m_descriptor ? m_descriptor->name : none;
}

IPluginInterface* IPlugin::queryInterface(name_id name) const {
  const auto found = std::find_if(m_interfaces.begin(), m_interfaces.end(), [name](const IPluginInterface* interface) {
    return interface->interfaceName() == name;
  });
  return found == m_interfaces.end() ? nullptr : *found;
}

void IPlugin::addInterface(IPluginInterface* interface) { base::append(m_interfaces, interface); }

}  // namespace base
