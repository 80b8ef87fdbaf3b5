#include "b_attribute_desc.h"

#include "b_attribute.h"
#include "b_exception.h"
#include "b_fs.h"
#include "b_log.h"
#include "b_string_conversion.h"

#include <fmt/format.h>
#ifdef MESHPORT_HAVE_PUGIXML
#  include <pugixml.hpp>
#endif

#include <algorithm>
#include <memory>

namespace base {
namespace {

// Larger than any description file; a file beyond it is refused before it is read.
constexpr std::int64_t maximumFileSize = std::int64_t(64) << 20;

#ifdef MESHPORT_HAVE_PUGIXML
bool readFlag(const pugi::xml_node& node, const char* key, bool fallback) {
  const pugi::xml_attribute attribute = node.attribute(key);
  bool value = fallback;
  if (attribute && !detail::parseBool(attribute.value(), value)) value = fallback;
  return value;
}

std::uint32_t readUnsigned(const pugi::xml_node& node, const char* key) {
  std::uint64_t value = 0;
  if (!detail::parseUnsigned(node.attribute(key).value(), 0xFFFFFFFFu, value)) return 0;
  return static_cast<std::uint32_t>(value);
}

name_id readName(const pugi::xml_node& node, const char* key) {
  const std::string_view text = node.attribute(key).value();
  return text.empty() ? nullptr : intern(text);
}

// "quat" is the old spelling of "quatf"; a text with ':' is a qualified name, kept as it is.
name_id readType(const pugi::xml_node& node) {
  const std::string_view text = node.attribute("type").value();
  if (text == "quat") return intern("quatf");
  return text.empty() ? nullptr : intern(text);
}

// Help texts may carry the entities once more escaped than XML needs.
base::string unescapeAngles(std::string_view text) {
  base::string result;
  result.reserve(text.size());
  for (std::size_t at = 0; at < text.size();) {
    if (text.substr(at, 4) == "&lt;" || text.substr(at, 4) == "&gt;") {
      result += text[at + 1] == 'l' ? '<' : '>';
      at += 4;
    } else {
      result += text[at++];
    }
  }
  return result;
}

ref<AttribDesc> readAttribute(const pugi::xml_node& node) {
  ref<AttribDesc> desc(new AttribDesc);
  desc->name = node.attribute("name").value();
  desc->label = node.attribute("label").value();
  desc->type = readType(node);
  desc->control = node.attribute("control").value();
  desc->initialiser = node.attribute("initialisator").value();
  desc->action = node.attribute("action").value();
  desc->defaultValue = node.attribute("default").value();
  desc->min = node.attribute("min").value();
  desc->max = node.attribute("max").value();
  desc->softMin = node.attribute("soft_min").value();
  desc->softMax = node.attribute("soft_max").value();
  desc->enumeration = node.attribute("enum").value();
  desc->help = unescapeAngles(node.attribute("help").value());
  desc->units = node.attribute("units").value();
  desc->precision = readUnsigned(node, "precision");
  desc->controlLines = readUnsigned(node, "control-lines");
  constexpr std::pair<const char*, AttribDesc::Flag> flagNames[] = {
      {"resource", AttribDesc::resource}, {"optional", AttribDesc::optional}, {"read-only", AttribDesc::readOnly},
      {"cmdline", AttribDesc::cmdline},   {"state", AttribDesc::state},       {"keyable", AttribDesc::keyable}};
  desc->flags = readFlag(node, "visible", true) ? std::uint32_t(AttribDesc::visible) : 0u;
  for (const auto& [key, bit] : flagNames) {
    if (readFlag(node, key, false)) desc->flags |= bit;
  }
  return desc;
}

ref<AttribMapDesc> readMap(const pugi::xml_node& node) {
  ref<AttribMapDesc> desc(new AttribMapDesc);
  desc->name = intern(node.attribute("name").value());
  desc->friendText = node.attribute("friend").value();
  desc->inherit = readName(node, "inherit");
  desc->className = node.attribute("class").value();
  desc->abstract = readFlag(node, "abstract", false);
  desc->copyright = node.attribute("copyright").value();
  const std::string_view flags = node.attribute("flags").value();
  if (flags.find("singleInstance") != std::string_view::npos) desc->flags |= AttribMapDesc::singleInstance;
  if (flags.find("customDescriptor") != std::string_view::npos) desc->flags |= AttribMapDesc::customDescriptor;
  desc->arrayOf = readName(node, "arrayof");
  for (const pugi::xml_node& attribute : node.children("Attribute")) {
    base::append(desc->attributes, readAttribute(attribute));
  }
  return desc;
}

base::string readWholeFile(std::string_view path) {
  Stream file = fs::master().open(path, fs::openForReading);
  const std::int64_t size = file.getSize();
  if (size > maximumFileSize) {
    raise<exception>("base::AttribDescManager::load",
                     fmt::format("description file {} is {} bytes, more than a description file can be", path, size));
  }
  base::string text(static_cast<std::size_t>(size), '\0');
  text.resize(file.read(text.data(), static_cast<std::uint32_t>(size)));
  return text;
}

#endif

bool hasXmlExtension(std::string_view name) {
  const std::size_t dot = name.rfind('.');
  if (dot == std::string_view::npos || name.size() - dot != 4) return false;
  return asciiLower(name.substr(dot + 1)) == "xml";
}

}  // namespace

Attribute* AttribDesc::createAttribute(const AttribFactory& factory) const {
  if (!type || !factory.knows(type)) return nullptr;
  Attribute* attribute = factory.create(type);
  if (attribute && !defaultValue.empty()) attribute->fromString(defaultValue);
  return attribute;
}

const AttribDesc* AttribMapDesc::find(std::string_view attributeName) const {
  for (const ref<AttribDesc>& attribute : attributes) {
    if (attribute->name == attributeName) return attribute.get();
  }
  return nullptr;
}

#ifdef MESHPORT_HAVE_PUGIXML
void AttribDescManager::read(std::string_view path) {
  const base::string content = readWholeFile(path);
  pugi::xml_document document;
  const pugi::xml_parse_result parsed = document.load_buffer(content.data(), content.size());
  if (!parsed) {
    const std::size_t offset = std::min(static_cast<std::size_t>(parsed.offset), content.size());
    raise<exception>("base::AttribDescManager::load",
                     fmt::format("{} at '{}', position {}", parsed.description(),
                                 clipped(std::string_view(content).substr(offset), 40), parsed.offset));
  }
  const pugi::xml_node root = document.child("Document");
  m_namespace = root.attribute("namespace").value();
  m_destination = root.attribute("destination").value();
  m_constructor = root.attribute("constructor").value();
  for (const pugi::xpath_node& node : document.select_nodes("Document/AttributeMap")) {
    ref<AttribMapDesc> desc = readMap(node.node());
    if (!m_descriptors.emplace(desc->name, desc).second) {
      log().message(logSystem, logWarning, "Duplicated property map name '{}' in file {}!", text(desc->name), path);
    }
  }
}
#else
// The Windows cross build has no XML library yet.
void AttribDescManager::read(std::string_view path) {
  raise<exception>("base::AttribDescManager::load",
                   fmt::format("description file {}: this build cannot read XML files", path));
}
#endif

void AttribDescManager::load(std::string_view path) {
  read(path);
  resolveInheritance();
}

std::size_t AttribDescManager::loadFolder(std::string_view folder) {
  base::string directory(folder);
  if (!directory.empty() && directory.back() != '/' && directory.back() != '\\') directory += '/';
  base::vector<base::string> files;
  for (ref<fs::IEnum> listing = fs::master().findFiles(directory + "*"); !listing->atEnd(); listing->next()) {
    if (hasXmlExtension(listing->name())) base::append(files, listing->directory() + listing->name());
  }
  // The first description of a type wins: load in a fixed order.
  std::sort(files.begin(), files.end());
  std::size_t loaded = 0;
  for (const base::string& file : files) {
    try {
      read(file);
      ++loaded;
    } catch (const exception& error) {
      error.report(log());
    }
  }
  resolveInheritance();
  return loaded;
}

void AttribDescManager::clear() {
  m_descriptors.clear();
  m_inheritors.clear();
}

ref<AttribMapDesc> AttribDescManager::find(name_id type) const {
  const auto found = m_descriptors.find(type);
  return found == m_descriptors.end() ? nullptr : found->second;
}

const AttribDesc* AttribDescManager::findAttribute(name_id type, std::string_view attributeName,
                                                   name_id* declaredBy) const {
  // Inheritance cycles are cut when they are resolved, so this walk ends.
  for (ref<AttribMapDesc> desc = find(type); desc; desc = find(desc->inherit)) {
    if (const AttribDesc* attribute = desc->find(attributeName)) {
      if (declaredBy) *declaredBy = desc->name;
      return attribute;
    }
  }
  return nullptr;
}

base::vector<name_id> AttribDescManager::inheritors(name_id type) const {
  const auto found = m_inheritors.find(type);
  return found == m_inheritors.end() ? base::vector<name_id>() : found->second;
}

bool AttribDescManager::inheritsItself(const AttribMapDesc& desc) const {
  std::size_t hops = 0;
  for (ref<AttribMapDesc> base = find(desc.inherit); base; base = find(base->inherit)) {
    if (base.get() == &desc) return true;
    // A cycle that does not pass through `desc` is reported for its own members.
    if (++hops > m_descriptors.size()) return false;
  }
  return false;
}

void AttribDescManager::resolveInheritance() {
  m_inheritors.clear();
  for (const auto& [name, desc] : m_descriptors) {
    if (!desc->inherit) continue;
    if (!find(desc->inherit)) {
      log().message(logSystem, logError, "Unable to find inherited class {}", text(desc->inherit));
      continue;
    }
    // Every lookup through a chain that comes back to this type would be endless.
    if (inheritsItself(*desc)) {
      log().message(logSystem, logError, "Map type '{}' inherits itself through '{}'; it inherits nothing now",
                    text(name), text(desc->inherit));
      desc->inherit = nullptr;
      continue;
    }
    base::append(m_inheritors[desc->inherit], name);
  }
}

}  // namespace base
