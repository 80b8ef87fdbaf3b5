// Object-list files: a factory written and read back, references between objects, and the
// failures that a damaged or foreign file must give.

#include "b_attrib_link.h"
#include "b_binary_io.h"
#include "b_exception.h"
#include "b_plugin_attribute.h"
#include "b_plugin_factory.h"
#include "log_capture.h"

#include <fmt/format.h>
#include <gtest/gtest.h>

#include <algorithm>

namespace {

using testing_support::LogCapture;

base::name_id operator""_n(const char* text, std::size_t length) { return base::intern({text, length}); }

struct NamedDesc : base::IPluginDesc {
  explicit NamedDesc(base::name_id type) { name = type; }
};

void registerTypes(base::PluginFactory& factory) {
  for (base::name_id type : {"mesh"_n, "node"_n})
    factory.registerDesc(base::ref<base::IPluginDesc>(new NamedDesc(type)));
}

base::ref<base::IPlugin> named(base::PluginFactory& factory, base::name_id type, const char* name) {
  base::ref<base::IPlugin> object = factory.create(type);
  object->attribute<base::string>("name"_n) = name;
  return object;
}

void reference(base::IPlugin& from, base::name_id member, const base::ref<base::IPlugin>& to) {
  auto* attr = new base::PluginAttribute;
  attr->setData(&to);
  from.attribute(member, attr);
}

const base::ref<base::IPlugin>& referenced(base::IPlugin& from, base::name_id member) {
  return *static_cast<const base::ref<base::IPlugin>*>((*from.findAttributeMutable(member))->data());
}

base::vector<std::uint8_t> bytesOf(base::PluginFactory& factory) {
  base::vector<std::uint8_t> bytes;
  base::Stream stream = base::vectorStream(bytes);
  factory.write(stream);
  return bytes;
}

base::Stream over(const base::vector<std::uint8_t>& bytes, std::size_t size) {
  return base::memStream(bytes.data(), static_cast<std::int64_t>(size), "scene.bin");
}

TEST(ObjectList, ReferencesPointAtTheRightObjectsAfterARemoval) {
  base::PluginFactory written("writer");
  registerTypes(written);
  const auto gone = named(written, "mesh"_n, "gone");
  const auto hull = named(written, "mesh"_n, "hull");
  const auto root = named(written, "node"_n, "root");
  const auto light = named(written, "light"_n, "lamp");  // a type nobody registered
  reference(*root, "child"_n, hull);
  auto* list = new base::PluginVectorAttribute;
  const base::vector<base::ref<base::IPlugin>> targets{light, base::ref<base::IPlugin>(), root};
  list->setData(&targets);
  root->attribute("all"_n, list);
  auto* nested = new base::AttribMap;
  nested->attribute<float>("weight"_n) = 0.5f;
  hull->attribute("material"_n, nested);
  written.remove(gone->index());  // ids would shift by one if they were factory indexes

  const auto bytes = bytesOf(written);
  base::PluginFactory read("reader");
  registerTypes(read);
  LogCapture capture(base::logWarning);
  base::Stream stream = over(bytes, bytes.size());
  read.read(stream);
  EXPECT_EQ(capture.texts(), std::vector<std::string>{"plugin factory| Unsupported plugin type light! Objects of this "
                                                      "type will have limited functionality."});
  ASSERT_EQ(read.objects().size(), 3u);
  base::IPlugin& readRoot = *read.object(1);
  EXPECT_EQ(readRoot.toString(), "root");
  EXPECT_EQ(readRoot.mapType(), "node"_n);
  EXPECT_EQ(referenced(readRoot, "child"_n)->toString(), "hull");
  const auto& all =
      *static_cast<const base::vector<base::ref<base::IPlugin>>*>((*readRoot.findAttributeMutable("all"_n))->data());
  ASSERT_EQ(all.size(), 3u);
  EXPECT_EQ(all[0]->toString(), "lamp");
  EXPECT_FALSE(all[1]);
  EXPECT_EQ(all[2].get(), &readRoot);
  EXPECT_TRUE(read.object(2)->descriptor()->isDummy());
  EXPECT_EQ(*static_cast<const float*>(static_cast<const base::AttribMap::Members*>(
                                           (*read.object(0)->findAttributeMutable("material"_n))->data())
                                           ->front()
                                           .second->data()),
            0.5f);
}

TEST(ObjectList, AnEmptyFactoryWritesItsTablesAndNoObject) {
  base::PluginFactory empty("empty");
  const auto bytes = bytesOf(empty);
  base::Stream stream = over(bytes, bytes.size());
  EXPECT_EQ(base::binary::get<std::uint8_t>(stream), 1u);
  EXPECT_EQ(base::binary::get<std::uint32_t>(stream), 0u);  // no plug-in types
  EXPECT_EQ(base::binary::get<std::uint8_t>(stream), 1u);
  EXPECT_EQ(base::binary::get<std::uint32_t>(stream), base::attribFactory().types().size());
  EXPECT_EQ(bytes[bytes.size() - 1], 0u);  // no names, no objects: the last two counts are 0
  EXPECT_EQ(bytes[bytes.size() - 5], 0u);
}

TEST(ObjectList, DamagedFilesFailWithTheirMessages) {
  base::PluginFactory written("writer");
  registerTypes(written);
  named(written, "mesh"_n, "a");
  named(written, "mesh"_n, "b");
  auto bytes = bytesOf(written);

  auto failure = [](const base::vector<std::uint8_t>& data) -> std::string {
    base::PluginFactory factory("reader");
    registerTypes(factory);
    base::Stream stream = over(data, data.size());
    try {
      factory.read(stream);
    } catch (const base::exception& error) {
      return error.what();
    }
    return "(read)";
  };
  auto version = bytes;
  version[0] = 2;
  EXPECT_EQ(failure(version), "plugin factory: Unsupported plugin factory version! Current version 1, needed 2.");
  // Every cut of a good file fails cleanly.
  for (std::size_t cut = 0; cut < bytes.size(); ++cut) {
    const base::vector<std::uint8_t> shortened(bytes.begin(), bytes.begin() + static_cast<std::ptrdiff_t>(cut));
    EXPECT_NE(failure(shortened), "(read)") << cut;
  }
  // The attribute factory's version sits after the type table: "mesh" as 4 + 4 bytes.
  auto attributes = bytes;
  attributes[1 + 4 + 8] = 3;
  EXPECT_EQ(failure(attributes), "factory: Unsupported factory version! Supported version 1, needed 3.");
  auto longType = bytes;
  longType[1 + 4 + 8 + 1 + 4 + 3] = 0xFF;  // the first attribute type's length, top byte
  EXPECT_EQ(failure(longType), "factory: Attribute type with more then 2K detected! Probably a corrupted file.");
}

TEST(ObjectList, ABadTypeRecordStopsTheReadAndKeepsWhatWasRead) {
  base::PluginFactory written("writer");
  registerTypes(written);
  named(written, "mesh"_n, "first");
  named(written, "node"_n, "second");
  auto bytes = bytesOf(written);
  // The second object's type index: find it as the u16 after the first object's form.
  base::PluginFactory probe("probe");
  registerTypes(probe);
  probe.create("mesh"_n)->attribute<base::string>("name"_n) = "first";
  const std::size_t withOne = bytesOf(probe).size();
  // Both files share their start up to the first object; the second file's tables hold one
  // type less ("node": 8 bytes) and its count differs.
  const std::size_t secondType = withOne + 8;
  bytes[secondType] = 9;
  base::PluginFactory read("reader");
  registerTypes(read);
  LogCapture capture;
  base::Stream stream = over(bytes, bytes.size());
  read.read(stream);
  ASSERT_EQ(read.objects().size(), 1u);
  EXPECT_EQ(read.object(0)->toString(), "first");
  EXPECT_NE(std::find(capture.texts().begin(), capture.texts().end(),
                      "plugin factory| Invalid plugin type record for id 1/2, aborting..."),
            capture.texts().end());
}

TEST(PluginReferences, ReplaceAndRemoveRewireTheOtherObjects) {
  base::PluginFactory factory("scene");
  const auto a = named(factory, "a"_n, "a");
  const auto b = named(factory, "b"_n, "b");
  const auto holder = named(factory, "h"_n, "h");
  reference(*holder, "target"_n, a);
  LogCapture capture;
  EXPECT_TRUE(factory.replace(a->index(), b->index()));
  EXPECT_EQ(referenced(*holder, "target"_n), b);
  EXPECT_FALSE(factory.replace(9, 0));
  EXPECT_FALSE(factory.replace(0, 9));
  EXPECT_TRUE(factory.remove(b->index(), /*dropReferences=*/true));
  EXPECT_FALSE(referenced(*holder, "target"_n));
  EXPECT_EQ(capture.texts(),
            (std::vector<std::string>{"plugin factory| Attempt to replace non existing plugin 9 detected!",
                                      "plugin factory| Attempt to replace non existing plugin 0 detected!"}));
}

TEST(PluginReferences, PathsIntoObjectsResolveInTheHoldersFactory) {
  base::PluginFactory factory("scene");
  const auto material = named(factory, "material"_n, "steel");
  material->attribute<float>("roughness"_n) = 0.25f;
  const auto mesh = named(factory, "mesh"_n, "hull");
  auto* link = new base::AttribLink;
  ASSERT_TRUE(link->fromString(fmt::format("@{}/roughness", material->index())));
  mesh->attribute("roughness"_n, link);
  ASSERT_NE(mesh->findAttribute<float>("roughness"_n), nullptr);
  EXPECT_EQ(*mesh->findAttribute<float>("roughness"_n), 0.25f);
}

// A descriptor that makes nothing.
struct BarrenDesc : base::IPluginDesc {
  BarrenDesc() { name = "barren"_n; }
  base::IPlugin* create(base::PluginFactory*, std::uint32_t) override { return nullptr; }
};

TEST(PluginReferences, AnObjectThatCannotBeMadeKeepsItsIndexAndItsDataIsReadPast) {
  base::PluginFactory written("writer");
  named(written, "barren"_n, "lost");
  named(written, "mesh"_n, "kept");
  const auto bytes = bytesOf(written);
  base::PluginFactory read("reader");
  read.registerDesc(base::ref<base::IPluginDesc>(new BarrenDesc));
  LogCapture capture(base::logError);
  base::Stream stream = over(bytes, bytes.size());
  read.read(stream);
  ASSERT_EQ(read.objects().size(), 2u);
  EXPECT_EQ(read.object(0), nullptr);
  EXPECT_EQ(read.object(1)->toString(), "kept");
  // Without a factory there is nothing to clone through.
  base::IPlugin loose(nullptr, nullptr, base::IPlugin::unlisted);
  EXPECT_EQ(loose.clone(), nullptr);
}

}  // namespace
