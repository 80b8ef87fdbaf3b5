// Object-list files: a factory's objects with the name tables they need.

#include "b_binary_io.h"
#include "b_exception.h"
#include "b_log.h"
#include "b_plugin_attribute.h"
#include "b_plugin_factory.h"
#include "b_progress.h"

#include <fmt/format.h>

#include <algorithm>
#include <memory>
#include <set>

namespace base {
namespace {

constexpr std::uint8_t factoryVersion = 1;
constexpr std::uint8_t attributeFactoryVersion = 1;
constexpr std::uint32_t longestTypeName = 2048;

// Restores a stream's flags when the work on it ends, however it ends.
class FlagsFor {
 public:
  FlagsFor(Stream& stream, std::uint32_t extra) : m_stream(stream), m_flags(stream.flags) { stream.flags |= extra; }
  ~FlagsFor() { m_stream.flags = m_flags; }
  FlagsFor(const FlagsFor&) = delete;
  FlagsFor& operator=(const FlagsFor&) = delete;

 private:
  Stream& m_stream;
  std::uint32_t m_flags;
};

// The names and types through the file's tables; references as positions in the written list.
class ObjectListContext final : public StringIdContext {
 public:
  std::uint32_t pluginId(std::uint32_t index) const override {
    return index < positions.size() ? positions[index] : PluginAttribute::none;
  }
  base::vector<std::uint32_t> positions;  ///< by factory index: the position written, or none
};

// Collects the member names that the objects' binary forms use, in a pass that writes
// nothing.
class NameCollector final : public BinaryContext {
 public:
  void writeName(Stream&, name_id name) override { names.insert(name); }
  void writeType(Stream&, name_id) override {}
  std::set<name_id> names;
};

// Swallows what is written; the collecting pass needs no bytes.
class Discard final : public StreamWorker {
 public:
  Discard() : StreamWorker(capWrite, "discard") {}
  std::uint32_t write(const void*, std::uint32_t count) override { return count; }
};

void writeText(Stream& stream, std::string_view text) {
  binary::put(stream, static_cast<std::uint32_t>(text.size()));
  binary::write(stream, text.data(), text.size());
}

void writeTable(Stream& stream, const base::vector<name_id>& names) {
  binary::put(stream, static_cast<std::uint32_t>(names.size()));
  for (name_id name : names) writeText(stream, text(name));
}

}  // namespace

void PluginFactory::write(Stream& stream) {
  const FlagsFor flags(stream, throwOnShortWrite);
  ObjectListContext context;
  base::vector<IPlugin*> written;
  context.positions.assign(m_objects.size(), PluginAttribute::none);
  for (const ref<IPlugin>& object : m_objects) {
    if (!object || (object->flags & attrNotStored)) continue;
    context.positions[object->index()] = static_cast<std::uint32_t>(written.size());
    written.push_back(object.get());
  }
  std::set<name_id> typeNames;
  NameCollector collector;
  Stream discard = Stream::adopt(new Discard);
  for (IPlugin* object : written) {
    // Before the names are collected: the hook may add members.
    object->beforeWrite();
    typeNames.insert(object->mapType());
    object->write(discard, collector);
  }

  binary::put(stream, factoryVersion);
  base::vector<name_id> types(typeNames.begin(), typeNames.end());
  writeTable(stream, types);
  for (std::size_t k = 0; k < types.size(); ++k) {
    if (ref<IPluginDesc> descriptor = findDesc(types[k])) descriptor->typeIndex = static_cast<std::uint16_t>(k);
  }
  binary::put(stream, attributeFactoryVersion);
  context.types.setNames(m_attributes->types());
  writeTable(stream, context.types.names());
  context.names.setNames(base::vector<name_id>(collector.names.begin(), collector.names.end()));
  writeTable(stream, context.names.names());

  binary::put(stream, static_cast<std::uint32_t>(written.size()));
  Progress progress(logSystem, "Writing plugins", written.size());
  for (std::size_t i = 0; i < written.size(); ++i) {
    progress.at(i);
    const auto type = std::lower_bound(types.begin(), types.end(), written[i]->mapType());
    binary::put(stream, static_cast<std::uint16_t>(type - types.begin()));
    written[i]->write(stream, context);
  }
}

namespace {

name_id readText(Stream& stream, std::uint32_t longest, const char* function, const char* tooLong) {
  const auto length = binary::get<std::uint32_t>(stream);
  if (length > longest || (longest == longestTypeName && length == 0)) raise<exception>(function, tooLong);
  if (const auto left = binary::bytesLeft(stream); left && length > *left) binary::failShort(stream, length, *left);
  base::string bytes;
  binary::readPacked(stream, bytes, length);
  return intern(bytes);
}

name_id readName(Stream& stream) {
  return readText(stream, 0x10000000, "base::xdr_read", "Trying to read a string bigger then 256MB, aborting...");
}

}  // namespace

void PluginFactory::read(Stream& stream) {
  const FlagsFor flags(stream, throwOnShortRead);
  if (const auto version = binary::get<std::uint8_t>(stream); version != factoryVersion) {
    raise<exception>("base::PluginFactory::read",
                     fmt::format("plugin factory: Unsupported plugin factory version! Current version {}, needed {}.",
                                 factoryVersion, version));
  }
  base::vector<IPluginDesc*> descriptors;
  for (std::uint32_t k = 0, count = binary::readCount(stream, 4, "plug-in types"); k < count; ++k) {
    const name_id type = readName(stream);
    IPluginDesc* descriptor = findDesc(type).get();
    if (!descriptor) {
      log().message(logSystem, logWarning,
                    "plugin factory| Unsupported plugin type {}! Objects of this type will have limited functionality.",
                    clipped(text(type)));
      descriptor = dummyFor(type);
    }
    descriptors.push_back(descriptor);
  }

  if (const auto version = binary::get<std::uint8_t>(stream); version != attributeFactoryVersion) {
    raise<exception>("base::Factory<class base::Attribute>::read",
                     fmt::format("factory: Unsupported factory version! Supported version {}, needed {}.",
                                 attributeFactoryVersion, version));
  }
  ObjectListContext context;
  base::vector<name_id> types;
  for (std::uint32_t k = 0, count = binary::readCount(stream, 5, "attribute types"); k < count; ++k) {
    const name_id type = readText(stream, longestTypeName, "base::Factory<class base::Attribute>::read",
                                  "factory: Attribute type with more then 2K detected! Probably a corrupted file.");
    if (!m_attributes->knows(type)) {
      log().message(logSystem, logWarning, "factory: Detected unknown item type during loading - '{}'!",
                    clipped(text(type)));
    }
    types.push_back(type);
  }
  context.types.setNames(std::move(types));
  base::vector<name_id> names;
  for (std::uint32_t k = 0, count = binary::readCount(stream, 4, "names"); k < count; ++k)
    names.push_back(readName(stream));
  context.names.setNames(std::move(names));

  const auto first = static_cast<std::uint32_t>(m_objects.size());
  // The least an object takes: its type index, its flags byte and its member count.
  const std::uint32_t count = binary::readCount(stream, 2 + 1 + 4, "objects");
  Progress progress(logSystem, "Reading plugins", count);
  for (std::uint32_t i = 0; i < count; ++i) {
    progress.at(i);
    const auto type = binary::get<std::uint16_t>(stream);
    if (type >= descriptors.size()) {
      log().message(logSystem, logError, "plugin factory| Invalid plugin type record for id {}/{}, aborting...", i,
                    count);
      break;
    }
    ref<IPlugin> object(descriptors[type]->create(this, static_cast<std::uint32_t>(m_objects.size())));
    base::append(m_objects, object);
    // An object its descriptor would not make keeps its index; its data is read past.
    AttribMap placeholder(m_attributes);
    AttribMap& target = object ? static_cast<AttribMap&>(*object) : placeholder;
    target.read(stream, context);
  }
  for (std::size_t k = first; k < m_objects.size(); ++k) {
    if (m_objects[k]) bindPluginReferences(*m_objects[k], *this, first);
  }
}

}  // namespace base
