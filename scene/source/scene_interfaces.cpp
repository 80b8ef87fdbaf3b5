#include "scene_interfaces.h"

#include "b_log.h"
#include "b_plugin_attribute.h"

namespace scene {

base::name_id IBounded::interfaceName() const {
  static const base::name_id name = base::intern("IBounded");
  return name;
}

base::name_id IHierarchical::interfaceName() const {
  static const base::name_id name = base::intern("IHierarchical");
  return name;
}

INode::INode(base::PluginFactory* factory, base::IPluginDesc* descriptor, std::uint32_t index)
    : IPlugin(factory, descriptor, index) {
  addInterface(static_cast<IBounded*>(this));
  addInterface(static_cast<IHierarchical*>(this));
}

IGeometry::IGeometry(base::PluginFactory* factory, base::IPluginDesc* descriptor, std::uint32_t index)
    : IPlugin(factory, descriptor, index) {
  addInterface(static_cast<IBounded*>(this));
}

bool IMaterial::inheritFrom(IMaterial* material) {
  // A chain that leads back here would make every lookup of an absent attribute endless.
  if (material && (material == this || material->inheritsFrom(this))) {
    base::log().message(base::logScene, base::logWarning, "The object can't inherit itself!");
    return false;
  }
  setBaseMap(material);
  attribute(inherit(), base::ref<base::IPlugin>(material));
  return true;
}

}  // namespace scene
