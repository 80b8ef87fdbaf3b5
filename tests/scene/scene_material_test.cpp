#include "b_plugin_attribute.h"
#include "b_plugin_factory.h"
#include "log_capture.h"
#include "scene_interfaces.h"
#include "scene_schema_registry.h"

#include <gtest/gtest.h>

namespace {

class MaterialInheritance : public ::testing::Test {
 protected:
  MaterialInheritance() { scene::register_scene_schema(factory); }

  scene::IMaterial& make() {
    return dynamic_cast<scene::IMaterial&>(*factory.create(scene::principalMaterial_schema::typeName()));
  }

  base::PluginFactory factory{"scene"};
};

TEST_F(MaterialInheritance, AMaterialReadsWhatItLacksFromItsBase) {
  scene::IMaterial& base = make();
  scene::IMaterial& derived = make();
  base.attribute<float>(scene::principalMaterial_schema::roughness()) = 0.25f;
  ASSERT_TRUE(derived.inheritFrom(&base));
  const float* roughness = derived.findAttribute<float>(scene::principalMaterial_schema::roughness());
  ASSERT_NE(roughness, nullptr);
  EXPECT_EQ(*roughness, 0.25f);
  EXPECT_EQ(derived.attribute<base::ref<base::IPlugin>>(scene::material_schema::inherit()).get(), &base);
  // Undone: nothing inherited any more.
  ASSERT_TRUE(derived.inheritFrom(nullptr));
  EXPECT_EQ(derived.findAttribute<float>(scene::principalMaterial_schema::roughness()), nullptr);
}

TEST_F(MaterialInheritance, SelfAndCyclesAreRefused) {
  scene::IMaterial& a = make();
  scene::IMaterial& b = make();
  scene::IMaterial& c = make();
  testing_support::LogCapture log;
  EXPECT_FALSE(a.inheritFrom(&a));
  ASSERT_TRUE(a.inheritFrom(&b));
  ASSERT_TRUE(b.inheritFrom(&c));
  EXPECT_FALSE(c.inheritFrom(&a));  // a -> b -> c -> a
  ASSERT_EQ(log.entries.size(), 2u);
  EXPECT_EQ(log.entries[0].text, "The object can't inherit itself!");
  EXPECT_EQ(log.entries[1].text, "The object can't inherit itself!");
  // The refused link left everything as it was: a lookup of a missing name ends.
  EXPECT_EQ(a.findAttribute<float>(scene::principalMaterial_schema::roughness()), nullptr);
}

}  // namespace
