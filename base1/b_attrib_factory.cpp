#include "b_attrib_factory.h"

#include "b_attrib_array.h"
#include "b_attrib_link.h"
#include "b_attribute_map.h"
#include "b_box.h"
#include "b_color.h"
#include "b_log.h"
#include "b_matrix.h"
#include "b_normal.h"
#include "b_plugin_attribute.h"
#include "b_quat.h"
#include "b_timecode.h"
#include "b_typed_attribute.h"
#include "b_vec.h"

#include <cstdint>

namespace base {
namespace {

template <class T>
void addValue(AttribFactory& factory) {
  factory.add(TypeTraits<T>::n_name, []() -> Attribute* { return new TypedAttribute<T>; });
}

template <class T>
void addList(AttribFactory& factory) {
  factory.add(TypeTraits<T>::n_array_name, []() -> Attribute* { return new TypedVectorAttribute<T>; });
}

template <class... T>
void addValues(AttribFactory& factory) {
  (addValue<T>(factory), ...);
}

template <class... T>
void addLists(AttribFactory& factory) {
  (addList<T>(factory), ...);
}

template <template <class> class Vec>
void addVectorValues(AttribFactory& factory) {
  addValues<Vec<signed char>, Vec<unsigned char>, Vec<short>, Vec<unsigned short>, Vec<int>, Vec<unsigned int>,
            Vec<float>, Vec<double>>(factory);
  addLists<Vec<float>, Vec<double>>(factory);
}

// The value types of the scene model, and the lists of them that it uses.
void addBuiltins(AttribFactory& factory) {
  addValues<bool, unsigned char, unsigned short, unsigned int, int, std::int64_t, std::uint64_t, float, double,
            base::string, TimeCode>(factory);
  addLists<signed char, unsigned char, short, unsigned short, unsigned int, int, float, double, TimeCode>(factory);
  addVectorValues<base_vec2>(factory);
  addVectorValues<base_vec3>(factory);
  addVectorValues<base_vec4>(factory);
  addValues<base_quat<float>, base_quat<double>, base_mat22<float>, base_mat22<double>, base_color4<float>>(factory);
  addLists<base_quat<float>, base_quat<double>, detail::mat43f_type, normal>(factory);
  addValues<base_box<base_vec2<int>>, base_box<base_vec2<unsigned int>>, base_box<base_vec2<float>>,
            base_box<base_vec2<double>>, base_box<base_vec3<int>>, base_box<base_vec3<unsigned int>>,
            base_box<base_vec3<float>>, base_box<base_vec3<double>>>(factory);
  addLists<base_box<base_vec3<float>>>(factory);
  factory.add(intern("map"), []() -> Attribute* { return new AttribMap; });
  factory.add(intern("array"), []() -> Attribute* { return new AttribArray; });
  factory.add(intern("link"), []() -> Attribute* { return new AttribLink; });
  factory.add(TypeTraits<ref<IPlugin>>::n_name, []() -> Attribute* { return new PluginAttribute; });
  factory.add(TypeTraits<ref<IPlugin>>::n_array_name, []() -> Attribute* { return new PluginVectorAttribute; });
}

}  // namespace

void AttribFactory::add(name_id type, Creator create) {
  std::lock_guard lock(m_mutex);
  m_creators[type] = create;
}

Attribute* AttribFactory::create(name_id type) const {
  Creator creator = nullptr;
  {
    std::lock_guard lock(m_mutex);
    if (auto found = m_creators.find(type); found != m_creators.end()) creator = found->second;
  }
  if (!creator) {
    log().message(logSystem, logError, "factory: Trying to create am item with unknown type {}.", text(type));
    return nullptr;
  }
  return creator();
}

bool AttribFactory::knows(name_id type) const {
  std::lock_guard lock(m_mutex);
  return m_creators.count(type) != 0;
}

base::vector<name_id> AttribFactory::types() const {
  std::lock_guard lock(m_mutex);
  base::vector<name_id> names;
  names.reserve(m_creators.size());
  for (const auto& entry : m_creators) names.push_back(entry.first);
  return names;
}

AttribFactory& attribFactory() {
  // Never destroyed: attributes may be created while other static objects go away.
  static AttribFactory* instance = [] {
    auto* factory = new AttribFactory;
    addBuiltins(*factory);
    return factory;
  }();
  return *instance;
}

}  // namespace base
