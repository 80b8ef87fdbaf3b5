#include "ply_kept_properties.h"

#include "b_attrib_array.h"
#include "scene_mesh.h"

namespace ply {
namespace {

struct Names {
  base::name_id name = base::intern("name");
  base::name_id element = base::intern("element");
  base::name_id primitive = base::intern("primitive");
  base::name_id attribute = base::intern("attribute");
};

const Names& names() {
  static const Names interned;
  return interned;
}

// The members that hold a kept property's values.
void removeValues(base::AttribMap& mesh, const base::string& attribute) {
  for (const char* suffix : {"", ".counts", ".items"}) {
    mesh.removeMember(base::intern(attribute + suffix));
  }
}

}  // namespace

base::name_id keptPropertiesName() {
  static const base::name_id name = base::intern("keptProperties");
  return name;
}

void addKeptProperty(base::AttribMap& mesh, const KeptProperty& kept) {
  base::AttribMap& entry = scene::appendMap(scene::arrayMember(mesh, keptPropertiesName()));
  entry.attribute<base::string>(names().name, kept.name);
  entry.attribute<base::string>(names().element, kept.element);
  entry.attribute<std::int32_t>(names().primitive, kept.primitive);
  entry.attribute<base::string>(names().attribute, kept.attribute);
}

base::vector<KeptProperty> keptPropertiesOf(const base::AttribMap& mesh) {
  base::vector<KeptProperty> kept;
  const base::AttribArray* array = scene::findArrayMember(mesh, keptPropertiesName());
  for (std::uint32_t k = 0; array && k < array->size(); ++k) {
    const base::AttribMap* entry = scene::mapAt(*array, k);
    if (!entry) continue;
    const auto name = scene::scalarMember<base::string>(*entry, names().name);
    const auto element = scene::scalarMember<base::string>(*entry, names().element);
    const auto primitive = scene::scalarMember<std::int32_t>(*entry, names().primitive);
    const auto attribute = scene::scalarMember<base::string>(*entry, names().attribute);
    if (name && element && primitive && attribute) kept.push_back({*name, *element, *primitive, *attribute});
  }
  return kept;
}

void removeKeptVertexProperties(base::AttribMap& mesh) {
  base::AttribArray* array = const_cast<base::AttribArray*>(scene::findArrayMember(mesh, keptPropertiesName()));
  for (std::uint32_t k = array ? array->size() : 0; k-- > 0;) {
    const base::AttribMap* entry = scene::mapAt(*array, k);
    const auto primitive = entry ? scene::scalarMember<std::int32_t>(*entry, names().primitive) : std::nullopt;
    if (primitive != KeptProperty::vertexElement) continue;
    if (const auto attribute = scene::scalarMember<base::string>(*entry, names().attribute)) {
      removeValues(mesh, *attribute);
    }
    array->erase(static_cast<int>(k));
  }
}

}  // namespace ply
