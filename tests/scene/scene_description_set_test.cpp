#include "b_attrib_factory.h"
#include "b_attribute_desc.h"
#include "log_capture.h"
#include "scene_schema_registry.h"

#include <gtest/gtest.h>

#include <string>

namespace {

// The description set that ships in data/attributes: every name of every schema has a
// description whose type the attribute factory can make, with a default that reads.
TEST(DescriptionSet, DescribesEverySchemaName) {
  base::AttribDescManager manager;
  testing_support::LogCapture log(base::logWarning);
  EXPECT_GE(manager.loadFolder(MESHPORT_DATA "/attributes"), 1u);
  EXPECT_TRUE(log.entries.empty()) << log.entries.front().text;
  for (const scene::SchemaInfo& schema : scene::schemas()) {
    const base::ref<base::AttribMapDesc> map = manager.find(base::intern(schema.type));
    ASSERT_TRUE(map) << schema.type;
    EXPECT_EQ(map->abstract, schema.kind == scene::SchemaKind::abstractType) << schema.type;
    EXPECT_EQ(map->inherit, schema.base ? base::intern(schema.base) : nullptr) << schema.type;
    ASSERT_EQ(map->attributes.size(), schema.names.size()) << schema.type;
    for (std::size_t i = 0; i < schema.names.size(); ++i) {
      const base::AttribDesc& desc = *map->attributes[i];
      EXPECT_EQ(desc.name, schema.names[i]) << schema.type;
      ASSERT_TRUE(desc.type && base::attribFactory().knows(desc.type)) << schema.type << "." << desc.name;
      std::unique_ptr<base::Attribute> value(base::attribFactory().create(desc.type));
      if (!desc.defaultValue.empty()) {
        EXPECT_TRUE(value->fromString(desc.defaultValue))
            << schema.type << "." << desc.name << " = '" << desc.defaultValue << "'";
      }
    }
  }
}

// The types the importer writes.
TEST(DescriptionSet, GivesTheImportersAttributesTheirTypes) {
  base::AttribDescManager manager;
  manager.loadFolder(MESHPORT_DATA "/attributes");
  const auto typeOf = [&](const char* type, const char* name) {
    const base::AttribDesc* desc = manager.findAttribute(base::intern(type), name);
    return desc ? std::string(base::text(desc->type)) : std::string("(none)");
  };
  EXPECT_EQ(typeOf("mesh", "positions"), "vec3f[]");
  EXPECT_EQ(typeOf("mesh", "indices"), "uint32[]");
  EXPECT_EQ(typeOf("mesh", "bounds"), "box3d");
  EXPECT_EQ(typeOf("mesh", "indicesDeltaCompression"), "bool");
  EXPECT_EQ(typeOf("node", "children"), "plugin[]");
  EXPECT_EQ(typeOf("mesh", "primitives"), "array");
  EXPECT_EQ(typeOf("meshPrimitive", "materials"), "plugin[]");
  EXPECT_EQ(typeOf("meshPrimitive", "indexStart"), "uint32");
  EXPECT_EQ(typeOf("animClip", "startTime"), "timecode");
  EXPECT_EQ(typeOf("keyframeChannelCurve", "times"), "timecode[]");
  EXPECT_EQ(typeOf("sceneImporter", "importNormals"), "uint8");
  const base::AttribDesc* normals = manager.findAttribute(base::intern("sceneImporter"), "importNormals");
  EXPECT_EQ(normals->defaultValue, "2");
}

}  // namespace
