#pragma once

#include "b_attribute.h"
#include "b_containers.h"
#include "b_name.h"

#include <cstdint>
#include <string_view>

namespace base {

class AttribLink;
class AttribMap;

/// Where an attribute lies, step by step. A local path starts in the map that holds the
/// link ("material/color"); any other path starts at a plug-in object, named by its id
/// ("@12/color"), which the plug-in framework resolves (setPluginResolver).
class BASE1_API AttribPath {
 public:
  struct Step {
    name_id name = nullptr;  ///< a member name; null for a plug-in step
    std::uint32_t plugin = noPlugin;
    bool local = true;
  };
  static constexpr std::uint32_t noPlugin = 0xFFFFFFFF;

  /// Finds the map of a plug-in object by its id; null when there is none.
  /// Finds the map of the plug-in object with id `id`, as seen from the map `from` that
  /// holds the link (the plug-in factory looks in the factory of `from`); null when there is
  /// none.
  using PluginResolver = AttribMap* (*)(const AttribMap& from, std::uint32_t id);
  /// Sets the resolver for plug-in steps (the plug-in factory's); null for none.
  static void setPluginResolver(PluginResolver resolver);

  bool empty() const { return m_steps.empty(); }
  const base::vector<Step>& steps() const { return m_steps; }
  void append(const Step& step) { base::append(m_steps, step); }

  /// The text form: steps joined by '/', a plug-in step as '@' and its id.
  base::string toText() const;
  /// Parses the text form ("" is the empty path); false (path unchanged) for an empty step,
  /// a bad id, or a plug-in step after the first.
  bool fromText(std::string_view text);

  /// The attribute the path leads to, starting from `from` for a local path; null when a
  /// step does not resolve. `container` receives the map that holds the result.
  Attribute* resolve(const AttribMap& from, const AttribMap** container = nullptr) const;

  /// The plug-in object that a path starting at one starts at; null for local paths and
  /// objects that do not resolve.
  AttribMap* pluginObject(const AttribMap& from) const;

  /// The link that owns the path, or null.
  AttribLink* owner = nullptr;

  friend bool operator==(const AttribPath& a, const AttribPath& b);

 private:
  base::vector<Step> m_steps;
};

/// An attribute that refers to another attribute through a path. Maps follow links when
/// they look a name up.
class BASE1_API AttribLink : public Attribute {
 public:
  AttribLink() = default;

  name_id type() const override;
  AttribLink* asLink() override { return this; }
  Attribute* clone() const override;
  std::uint8_t componentType() const override { return 0xFF; }
  /// The path's text form, as a string.
  void writeValue(StructuredWriter& writer) const override;
  bool readValue(StructuredReader& reader) override;
  /// The flags byte, the step count (32 bits), then per step: a flags byte (bit 0 local),
  /// the name through `context` and the plug-in id (32 bits).
  void write(Stream& stream, BinaryContext& context) const override;
  void read(Stream& stream, BinaryContext& context) override;
  /// The path (AttribPath*).
  void* data(int index = -1) override;
  std::uint32_t byteSize() const override { return 24; }
  /// Takes the path of another link, with mode bit 0.
  bool copyFrom(const Attribute& source, std::uint32_t mode, int index = -1) override;
  base::string toString() const override { return m_path.toText(); }
  bool fromString(std::string_view text) override;
  /// `data` is an AttribPath.
  void setData(const void* data, int index = -1) override;
  /// 0 for the same path, else 1.
  int compareData(const void* data, int index = -1) const override;

  const AttribPath& path() const { return m_path; }
  void setPath(const AttribPath& path);

 private:
  AttribPath m_path;
};

}  // namespace base
