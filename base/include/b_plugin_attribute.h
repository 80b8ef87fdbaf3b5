#pragma once

#include "b_attribute.h"
#include "b_plugin.h"
#include "b_type_traits.h"

#include <cstdint>

namespace base {

BASE_TYPE_NAMES(ref<IPlugin>, "plugin");

/// A reference to a plug-in object. The stored forms keep the object's id (its position in
/// the written list; 0xFFFFFFFF for none); after a read the factory binds the id to the
/// object again (see bindPluginReferences).
class BASE1_API PluginAttribute : public Attribute {
 public:
  static constexpr std::uint32_t none = 0xFFFFFFFF;

  name_id type() const override { return TypeTraits<ref<IPlugin>>::n_name; }
  Attribute* clone() const override;
  std::uint8_t componentType() const override { return 5; }
  /// The object's index in its factory, or null.
  void writeValue(StructuredWriter& writer) const override;
  void write(Stream& stream, BinaryContext& context) const override;
  /// Reads an index (or null) into the id; the reference waits for binding.
  bool readValue(StructuredReader& reader) override;
  void read(Stream& stream, BinaryContext& context) override;
  /// The reference (ref<IPlugin>*).
  void* data(int = -1) override { return &m_object; }
  std::uint32_t byteSize() const override { return 4; }
  bool copyFrom(const Attribute& source, std::uint32_t mode, int index = -1) override;
  /// `data` is a ref<IPlugin>; the id follows the object.
  void setData(const void* data, int index = -1) override;
  /// 0 for the same object, else by id.
  int compareData(const void* data, int index = -1) const override;

  const ref<IPlugin>& object() const { return m_object; }
  std::uint32_t id() const { return m_id; }
  /// Binds the stored id to the object at `first` + id in `factory`; see bindPluginReferences.
  void bind(PluginFactory& factory, std::uint32_t first, std::string_view name);
  /// Refers to `replacement` instead of `old`.
  void replace(const IPlugin* old, const ref<IPlugin>& replacement);
  /// Refers to nothing.
  void drop() { replace(m_object.get(), ref<IPlugin>()); }

 private:
  ref<IPlugin> m_object;
  std::uint32_t m_id = none;
};

/// A list of references to plug-in objects, with the ids beside them.
class BASE1_API PluginVectorAttribute : public Attribute {
 public:
  name_id type() const override { return TypeTraits<ref<IPlugin>>::n_array_name; }
  Attribute* clone() const override;
  std::uint8_t componentType() const override { return 5; }
  void writeValue(StructuredWriter& writer) const override;
  void write(Stream& stream, BinaryContext& context) const override;
  bool readValue(StructuredReader& reader) override;
  void read(Stream& stream, BinaryContext& context) override;
  /// Index -1: the list (base::vector<ref<IPlugin>>*); otherwise that element.
  void* data(int index = -1) override;
  std::uint32_t size() const override { return static_cast<std::uint32_t>(m_objects.size()); }
  bool erase(int index) override;
  std::uint32_t byteSize() const override { return static_cast<std::uint32_t>(4 + 4 * m_objects.size()); }
  bool copyFrom(const Attribute& source, std::uint32_t mode, int index = -1) override;
  void setData(const void* data, int index = -1) override;
  int compareData(const void* data, int index = -1) const override;
  /// MurmurHash3 of the reference words.
  std::uint64_t hash() const override;

  const base::vector<ref<IPlugin>>& objects() const { return m_objects; }
  const base::vector<std::uint32_t>& ids() const { return m_ids; }
  /// Takes `objects` as the list without copying it (a long list need not exist twice); the
  /// ids follow.
  void assign(base::vector<ref<IPlugin>>&& objects);
  void bind(PluginFactory& factory, std::uint32_t first, std::string_view name);
  void replace(const IPlugin* old, const ref<IPlugin>& replacement);
  /// Refers to nothing.
  void drop() {
    m_objects.clear();
    m_ids.clear();
  }

 private:
  void syncIds();

  base::vector<ref<IPlugin>> m_objects;
  base::vector<std::uint32_t> m_ids;
};

/// Binds every plug-in reference inside `map` (nested maps and arrays included), whose ids
/// count from the object at `first` in `factory`. An id that does not resolve is reported
/// ("plugin factory| Invalid plugin attribute detected for '{}'! Id {} out of bounds!", or
/// "... Plugin not set!" for an empty slot) and left unset.
BASE1_API void bindPluginReferences(AttribMap& map, PluginFactory& factory, std::uint32_t first);

/// Drops every plug-in reference inside `map` (nested maps and arrays included).
BASE1_API void dropPluginReferences(AttribMap& map);

/// Makes every plug-in reference inside `map` (nested maps and arrays included) that refers
/// to `old` refer to `replacement` (null for none).
BASE1_API void replacePluginReferences(AttribMap& map, const IPlugin* old, const ref<IPlugin>& replacement);

}  // namespace base
