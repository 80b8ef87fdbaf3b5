#include "b_plugin_factory.h"
#include "log_capture.h"
#include "scene_interfaces.h"
#include "scene_schema_registry.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <set>
#include <string>

namespace {

base::name_id operator""_n(const char* text, std::size_t length) { return base::intern({text, length}); }

class SceneFactory : public ::testing::Test {
 protected:
  SceneFactory() { scene::register_scene_schema(factory); }
  base::PluginFactory factory{"scene"};
};

TEST_F(SceneFactory, RegistersEveryConcreteTypeAndNoAbstractOne) {
  std::size_t registered = 0;
  for (const scene::SchemaInfo& schema : scene::schemas()) {
    const bool found = factory.findDesc(base::intern(schema.type)) != nullptr;
    EXPECT_EQ(found, schema.kind == scene::SchemaKind::sceneType) << schema.type;
    registered += found;
  }
  EXPECT_EQ(registered, 38u);
  testing_support::LogCapture log;  // the factory reports each type it cannot make
  for (const char* abstract : {"material", "geometry", "subdividable", "bitmapTexture"}) {
    EXPECT_FALSE(factory.findDesc(base::intern(abstract))) << abstract;
    EXPECT_FALSE(factory.create(base::intern(abstract), base::PluginFactory::createOrNull)) << abstract;
  }
}

TEST_F(SceneFactory, ObjectsHaveTheirTypesInterfaces) {
  const base::ref<base::IPlugin> mesh = factory.create("mesh"_n);
  ASSERT_TRUE(dynamic_cast<scene::IMesh*>(mesh.get()));
  EXPECT_EQ(mesh->mapType(), "mesh"_n);
  EXPECT_TRUE(mesh->queryInterface("IBounded"_n));
  EXPECT_FALSE(mesh->queryInterface("IHierarchical"_n));
  const base::ref<base::IPlugin> node = factory.create("node"_n);
  ASSERT_TRUE(dynamic_cast<scene::INode*>(node.get()));
  EXPECT_TRUE(node->queryInterface("IHierarchical"_n));
  EXPECT_TRUE(dynamic_cast<scene::IBitmapTexture*>(factory.create("fileTexture"_n).get()));
  EXPECT_TRUE(dynamic_cast<scene::IMaterial*>(factory.create("principalMaterial"_n).get()));
  EXPECT_EQ(factory.objects().size(), 4u);
}

TEST_F(SceneFactory, DescriptorsAreMadeOncePerProcess) {
  base::PluginFactory other("other");
  scene::register_scene_schema(other);
  scene::register_scene_schema(other);  // again: the factory keeps the first
  EXPECT_EQ(other.findDesc("mesh"_n), factory.findDesc("mesh"_n));
  EXPECT_TRUE(factory.findDesc("mesh"_n)->description.empty());
}

TEST(SceneSchema, NamesAreSharedHandles) {
  EXPECT_EQ(scene::scene_schema::name(), scene::node_schema::name());
  EXPECT_EQ(scene::texture_schema::name(), "name"_n);
  EXPECT_EQ(scene::viewport_schema::name(), scene::camera_schema::name());
  EXPECT_EQ(scene::principalMaterial_schema::visibilityMap(), scene::toonMaterial_schema::visibilityMap());
  EXPECT_EQ(scene::lightGroup_schema::private_(), "private"_n);
  EXPECT_EQ(scene::mesh_schema::typeName(), "mesh"_n);
  EXPECT_EQ(scene::IMesh::typeName(), "mesh"_n);
  EXPECT_EQ(scene::IFileTexture::typeName(), "fileTexture"_n);
}

TEST(SceneSchema, TheMeshReachesItsBasesNamesWithoutDeclaringThem) {
  EXPECT_EQ(scene::IMesh::subdivide(), "subdivide"_n);
  EXPECT_EQ(scene::IMesh::visible(), "visible"_n);
  EXPECT_EQ(scene::mesh_schema::positions(), "positions"_n);
  const scene::SchemaInfo* mesh = scene::findSchema("mesh");
  ASSERT_NE(mesh, nullptr);
  EXPECT_EQ(std::string(mesh->base), "subdividable");
  EXPECT_EQ(std::string(scene::findSchema("subdividable")->base), "geometry");
  for (const char* inherited : {"subdivide", "visible"}) {
    EXPECT_EQ(std::count_if(mesh->names.begin(), mesh->names.end(),
                            [&](const char* name) { return std::string(name) == inherited; }),
              0);
  }
  EXPECT_EQ(std::string(mesh->names.front()), "uvSets");
  EXPECT_EQ(std::string(mesh->names.back()), "vertexCreasesWeights");
}

TEST(SceneSchema, TheTableIsConsistent) {
  std::set<std::string> types;
  for (const scene::SchemaInfo& schema : scene::schemas()) {
    EXPECT_TRUE(types.insert(schema.type).second) << schema.type;
    if (schema.base) {
      EXPECT_TRUE(types.count(schema.base)) << schema.type << " comes before its base " << schema.base;
    }
    const std::set<std::string> names(schema.names.begin(), schema.names.end());
    EXPECT_EQ(names.size(), schema.names.size()) << schema.type;
    const bool hasInterface = *schema.interfaceName != '\0';
    EXPECT_EQ(hasInterface, schema.kind == scene::SchemaKind::sceneType ||
                                schema.kind == scene::SchemaKind::abstractType ||
                                schema.kind == scene::SchemaKind::interfaceOnly)
        << schema.type;
  }
  EXPECT_EQ(types.size(), 63u);
  EXPECT_EQ(scene::findSchema("nothing"), nullptr);
}

TEST(SceneSchema, ViewportTypesAreRegisteredApart) {
  base::PluginFactory factory("viewport");
  scene::register_viewport_schema(factory);
  for (const char* type : {"viewport", "popupWindow", "viewportWindow"}) {
    const base::ref<base::IPlugin> object = factory.create(base::intern(type), base::PluginFactory::createOrNull);
    ASSERT_TRUE(object) << type;
    EXPECT_EQ(object->mapType(), base::intern(type));
  }
  EXPECT_FALSE(factory.findDesc("mesh"_n));
}

TEST(SceneSchema, ParameterHelpTexts) {
  const auto texts = scene::parameterHelpTexts();
  EXPECT_EQ(texts.size(), 32u);
  EXPECT_EQ(std::string(texts.front().parameter), "importMeshes");
  EXPECT_EQ(std::string(texts.front().help), "Whether to import meshes.");
  EXPECT_EQ(std::string(texts.back().parameter), "exportEmbedded");
  const auto listed = [](const char* schema, std::string_view name) {
    const auto& names = scene::findSchema(schema)->names;
    return std::find(names.begin(), names.end(), name) != names.end();
  };
  for (const scene::ParameterHelp& entry : texts) {
    EXPECT_TRUE(listed("sceneImporter", entry.parameter) || listed("sceneExporter", entry.parameter))
        << entry.parameter;
  }
}

}  // namespace
