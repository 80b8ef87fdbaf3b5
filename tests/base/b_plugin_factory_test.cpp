#include "b_plugin_factory.h"
#include "log_capture.h"

#include <gtest/gtest.h>

#include <atomic>
#include <thread>
#include <vector>

namespace {

using testing_support::LogCapture;

base::name_id operator""_n(const char* text, std::size_t length) { return base::intern({text, length}); }

// A descriptor of type "mesh" that counts the objects it made and that died.
struct MeshDesc : base::IPluginDesc {
  MeshDesc() { name = "mesh"_n; }
  base::IPlugin* create(base::PluginFactory* factory, std::uint32_t index) override;
  std::atomic<int> destroyed = 0;
};

struct Mesh : base::IPlugin {
  Mesh(base::PluginFactory* factory, MeshDesc* descriptor, std::uint32_t index)
      : IPlugin(factory, descriptor, index), owner(descriptor) {}
  ~Mesh() override { ++owner->destroyed; }
  MeshDesc* owner;
};

base::IPlugin* MeshDesc::create(base::PluginFactory* factory, std::uint32_t index) {
  return new Mesh(factory, this, index);
}

struct Named : base::IPluginInterface {
  base::name_id interfaceName() const override { return "IMesh"_n; }
};

TEST(PluginFactory, RegistrationKeepsTheFirstDescriptorOfAName) {
  base::PluginFactory factory("scene");
  base::ref<base::IPluginDesc> first(new MeshDesc);
  base::ref<base::IPluginDesc> second(new MeshDesc);
  EXPECT_TRUE(factory.registerDesc(first));
  EXPECT_FALSE(factory.registerDesc(second));
  EXPECT_EQ(factory.findDesc("mesh"_n), first);
  EXPECT_EQ(second->refCount(), 1);  // the factory took no reference
  EXPECT_TRUE(factory.unregisterDesc(first));
  EXPECT_FALSE(factory.unregisterDesc("mesh"_n));
  EXPECT_EQ(first->refCount(), 1);
}

TEST(PluginFactory, UnknownTypesByFlags) {
  base::PluginFactory factory("scene");
  LogCapture capture;
  const base::ref<base::IPlugin> general = factory.create("light"_n);
  ASSERT_TRUE(general);
  EXPECT_TRUE(capture.entries.empty());
  ASSERT_TRUE(factory.findDesc("light"_n));
  EXPECT_TRUE(factory.findDesc("light"_n)->isDummy());
  EXPECT_EQ(general->mapType(), "light"_n);
  EXPECT_TRUE(factory.create("light"_n, base::PluginFactory::reportFailure));  // found now: not reported again
  EXPECT_TRUE(capture.entries.empty());

  EXPECT_TRUE(factory.create("camera"_n, base::PluginFactory::reportFailure));
  EXPECT_FALSE(factory.create("probe"_n, base::PluginFactory::createOrNull));
  EXPECT_FALSE(factory.create("probe"_n, base::PluginFactory::createOrNull | base::PluginFactory::reportFailure));
  EXPECT_EQ(capture.texts(),
            (std::vector<std::string>{
                "plugin factory scene| Unable to create plugin of type camera! Creating a general plugin with limited "
                "functionality...",
                "plugin factory scene| Unable to create plugin of type probe!",
                "plugin factory scene| Unable to create plugin of type probe!"}));
}

TEST(PluginFactory, IndexesAreConsecutiveAndSurviveRemoval) {
  base::PluginFactory factory("scene");
  factory.registerDesc(base::ref<base::IPluginDesc>(new MeshDesc));
  const auto a = factory.create("mesh"_n);
  const auto b = factory.create("mesh"_n, base::PluginFactory::createLocked);
  const auto loose = factory.create("mesh"_n, base::PluginFactory::createUnlisted);
  EXPECT_EQ(a->index(), 0u);
  EXPECT_EQ(b->index(), 1u);
  EXPECT_EQ(loose->index(), base::IPlugin::unlisted);
  EXPECT_EQ(factory.objects().size(), 2u);

  LogCapture capture;
  EXPECT_TRUE(factory.remove(0));
  EXPECT_FALSE(factory.remove(0));
  EXPECT_FALSE(factory.remove(7));
  EXPECT_FALSE(factory.remove(base::IPlugin::unlisted));
  EXPECT_EQ(factory.object(1), b.get());
  EXPECT_EQ(factory.create("mesh"_n)->index(), 2u);
  EXPECT_EQ(capture.texts(), (std::vector<std::string>{"plugin factory| Attempt to remove already removed plugin 0!",
                                                       "plugin factory| Attempt to remove non existing plugin 7!"}));
}

TEST(PluginObject, InterfacesNameCloneAndWeakReferences) {
  base::PluginFactory factory("scene");
  auto* descriptor = new MeshDesc;
  factory.registerDesc(base::ref<base::IPluginDesc>(descriptor));
  base::ref<base::IPlugin> mesh = factory.create("mesh"_n);
  EXPECT_EQ(mesh->queryInterface("IMesh"_n), nullptr);
  Named named;
  mesh->addInterface(&named);
  EXPECT_EQ(mesh->queryInterface("IMesh"_n), &named);
  EXPECT_EQ(mesh->queryInterface("ILight"_n), nullptr);

  mesh->attribute<base::string>("name"_n) = "hull";
  mesh->attribute<int>("faces"_n) = 12;
  EXPECT_EQ(mesh->toString(), "hull");
  auto* copy = static_cast<base::IPlugin*>(mesh->clone());
  ASSERT_NE(copy, nullptr);
  EXPECT_EQ(copy->index(), 1u);
  EXPECT_EQ(copy->toString(), "hull");
  EXPECT_EQ(*copy->findAttribute<int>("faces"_n), 12);
  EXPECT_EQ(copy->mapType(), "mesh"_n);

  // The last reference nulls weak references before the object is destroyed.
  base::weak_ref<base::IPlugin> weak(mesh.get());
  factory.remove(0);
  EXPECT_FALSE(weak.expired());
  mesh.reset();
  EXPECT_TRUE(weak.expired());
  EXPECT_EQ(descriptor->destroyed, 1);
}

TEST(PluginObject, ReferencesAcrossThreadsDestroyOnce) {
  base::PluginFactory factory("scene");
  auto* descriptor = new MeshDesc;
  factory.registerDesc(base::ref<base::IPluginDesc>(descriptor));
  for (int round = 0; round < 20; ++round) {
    base::ref<base::IPlugin> object = factory.create("mesh"_n, base::PluginFactory::createUnlisted);
    std::vector<std::thread> threads;
    for (int t = 0; t < 4; ++t) {
      threads.emplace_back([copy = object]() mutable {
        for (int i = 0; i < 1000; ++i) {
          base::ref<base::IPlugin> another = copy;
          another.reset();
        }
      });
    }
    object.reset();
    for (std::thread& thread : threads) thread.join();
  }
  EXPECT_EQ(descriptor->destroyed, 20);
}

}  // namespace
