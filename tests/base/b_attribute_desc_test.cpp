#include "b_attribute_desc.h"
#include "b_attribute.h"
#include "b_fs.h"
#include "log_capture.h"
#include "thrown.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <string>

namespace {

namespace stdfs = std::filesystem;
using testing_support::LogCapture;

std::string document(const std::string& maps) {
  return R"(<?xml version="1.0"?><Document namespace="scene" destination="out" constructor="make">)" + maps +
         "</Document>";
}

// Description files written into a fresh folder.
class Descriptions : public ::testing::Test {
 protected:
  Descriptions() : folder(std::string(base::fs::tmpFilename())) {
    stdfs::remove(folder);
    stdfs::create_directory(folder);
  }
  ~Descriptions() override { stdfs::remove_all(folder); }

  std::string write(const std::string& name, const std::string& text) const {
    std::ofstream(folder / name) << text;
    return (folder / name).string();
  }

  const base::AttribDesc& attribute(const char* map, const char* name) const {
    const base::AttribDesc* desc = manager.findAttribute(base::intern(map), name);
    EXPECT_NE(desc, nullptr) << map << "." << name;
    return *desc;
  }

  stdfs::path folder;
  base::AttribDescManager manager;
};

TEST_F(Descriptions, AttributeFieldsFlagsAndTheirDefaults) {
  manager.load(write("a.xml", document(R"(
    <AttributeMap name="thing">
      <Attribute name="plain" type="float" />
      <Attribute name="hidden" type="float" visible="false" />
      <Attribute name="unsure" type="float" visible="maybe" read-only="yes" />
      <Attribute name="flagged" type="bool" resource="true" optional="1" read-only="true" cmdline="true"
                 state="true" keyable="true" visible="0" />
      <Attribute name="numbers" type="uint32" precision="abc" control-lines="7" />
      <Attribute name="texts" type="vec3f" label="Texts" control="slider" initialisator="init" action="act"
                 default="1 2 3" min="0" max="10" soft_min="1" soft_max="5" enum="a;b" units="m"
                 help="less &amp;lt; more &gt; and &lt; again" precision="3" />
      <Attribute name="turn" type="quat" />
      <Attribute name="qualified" type="ns:thing" />
    </AttributeMap>)")));
  EXPECT_EQ(attribute("thing", "plain").flags, base::AttribDesc::visible);
  EXPECT_EQ(attribute("thing", "hidden").flags, 0u);
  EXPECT_EQ(attribute("thing", "unsure").flags, base::AttribDesc::visible);  // neither text is a boolean
  EXPECT_EQ(attribute("thing", "flagged").flags, 0x7Eu);
  EXPECT_EQ(attribute("thing", "numbers").precision, 0u);
  EXPECT_EQ(attribute("thing", "numbers").controlLines, 7u);

  const base::AttribDesc& texts = attribute("thing", "texts");
  EXPECT_EQ(texts.label, "Texts");
  EXPECT_EQ(texts.control, "slider");
  EXPECT_EQ(texts.initialiser, "init");
  EXPECT_EQ(texts.action, "act");
  EXPECT_EQ(texts.defaultValue, "1 2 3");
  EXPECT_EQ(texts.min + texts.max + texts.softMin + texts.softMax, "01015");
  EXPECT_EQ(texts.enumeration, "a;b");
  EXPECT_EQ(texts.units, "m");
  EXPECT_EQ(texts.help, "less < more > and < again");
  EXPECT_EQ(texts.precision, 3u);
  EXPECT_EQ(texts.type, base::intern("vec3f"));

  EXPECT_EQ(attribute("thing", "turn").type, base::intern("quatf"));
  EXPECT_EQ(attribute("thing", "qualified").type, base::intern("ns:thing"));
  EXPECT_EQ(manager.documentNamespace(), "scene");
  EXPECT_EQ(manager.destination(), "out");
  EXPECT_EQ(manager.constructor(), "make");
}

TEST_F(Descriptions, MapFieldsAndAttributeOrder) {
  manager.load(write("a.xml", document(R"(
    <AttributeMap name="shape" abstract="true" class="IShape" friend="f" copyright="c"
                  flags="customDescriptor|singleInstance" arrayof="part">
      <Attribute name="z" type="float" /><Attribute name="a" type="float" />
    </AttributeMap>
    <AttributeMap name="part" />)")));
  const base::ref<base::AttribMapDesc> shape = manager.find(base::intern("shape"));
  ASSERT_TRUE(shape);
  EXPECT_TRUE(shape->abstract);
  EXPECT_EQ(shape->className, "IShape");
  EXPECT_EQ(shape->friendText, "f");
  EXPECT_EQ(shape->copyright, "c");
  EXPECT_EQ(shape->flags, base::AttribMapDesc::singleInstance | base::AttribMapDesc::customDescriptor);
  EXPECT_EQ(shape->arrayOf, base::intern("part"));
  ASSERT_EQ(shape->attributes.size(), 2u);
  EXPECT_EQ(shape->attributes[0]->name, "z");
  EXPECT_FALSE(manager.find(base::intern("part"))->abstract);
  EXPECT_FALSE(manager.find(base::intern("nothing")));
}

TEST_F(Descriptions, TheFirstOfTwoMapsOfOneNameStaysAndTheSecondFileIsNamed) {
  manager.load(write("first.xml", document(R"(<AttributeMap name="dup"><Attribute name="one" /></AttributeMap>)")));
  LogCapture log;
  const std::string second =
      write("second.xml", document(R"(<AttributeMap name="dup"><Attribute name="two" /></AttributeMap>)"));
  manager.load(second);
  ASSERT_EQ(log.entries.size(), 1u);
  EXPECT_EQ(log.entries[0].text, "Duplicated property map name 'dup' in file " + second + "!");
  EXPECT_EQ(log.entries[0].level, base::logWarning);
  EXPECT_TRUE(manager.find(base::intern("dup"))->find("one"));
  EXPECT_FALSE(manager.find(base::intern("dup"))->find("two"));
}

TEST_F(Descriptions, BrokenXmlThrowsWithThePlaceAndAFolderLoadSkipsIt) {
  const std::string broken = write("broken.xml", "<Document><AttributeMap name=\"x\"></Document>");
  const std::string text = stream_tests::thrownText([&] { manager.load(broken); });
  EXPECT_EQ(text, "Start-end tags mismatch at 'Document>', position 35");

  write("good.XML", document(R"(<AttributeMap name="good" />)"));
  write("notes.txt", "not a description");
  write("other.xml", document(R"(<AttributeMap name="other" />)"));
  LogCapture log;
  EXPECT_EQ(manager.loadFolder(folder.string()), 2u);
  EXPECT_TRUE(manager.find(base::intern("good")));
  EXPECT_TRUE(manager.find(base::intern("other")));
  ASSERT_FALSE(log.entries.empty());
  EXPECT_NE(log.entries[0].text.find("position"), std::string::npos);
  // A missing file is an error of its own.
  EXPECT_TRUE(stream_tests::thrown<base::fs::file_not_found>([&] { manager.load((folder / "none.xml").string()); }));
}

TEST_F(Descriptions, InheritanceIsResolvedAndAMissingBaseIsLogged) {
  LogCapture log;
  write("a.xml", document(R"(
    <AttributeMap name="child" inherit="parent"><Attribute name="own" type="float" /></AttributeMap>
    <AttributeMap name="orphan" inherit="nobody" />)"));
  write("b.xml", document(R"(
    <AttributeMap name="parent" inherit="grandparent"><Attribute name="middle" type="int32" /></AttributeMap>
    <AttributeMap name="grandparent"><Attribute name="top" type="bool" /></AttributeMap>)"));
  manager.loadFolder(folder.string());
  // Resolved once, after every file: the base in the second file is found.
  ASSERT_EQ(log.entries.size(), 1u);
  EXPECT_EQ(log.entries[0].text, "Unable to find inherited class nobody");

  base::name_id declaredBy = nullptr;
  const base::AttribDesc* top = manager.findAttribute(base::intern("child"), "top", &declaredBy);
  ASSERT_NE(top, nullptr);
  EXPECT_EQ(declaredBy, base::intern("grandparent"));
  EXPECT_EQ(manager.findAttribute(base::intern("parent"), "own"), nullptr);
  EXPECT_EQ(manager.inheritors(base::intern("parent")), base::vector<base::name_id>{base::intern("child")});
  EXPECT_TRUE(manager.inheritors(base::intern("child")).empty());
}

TEST_F(Descriptions, AnInheritanceCycleIsCutSoLookupsEnd) {
  LogCapture log;
  manager.load(write("a.xml", document(R"(
    <AttributeMap name="ping" inherit="pong"><Attribute name="a" /></AttributeMap>
    <AttributeMap name="pong" inherit="ping"><Attribute name="b" /></AttributeMap>
    <AttributeMap name="self" inherit="self" />)")));
  EXPECT_EQ(manager.findAttribute(base::intern("ping"), "missing"), nullptr);
  EXPECT_EQ(manager.findAttribute(base::intern("self"), "missing"), nullptr);
  EXPECT_EQ(log.entries.size(), 2u);
  EXPECT_NE(log.entries[0].text.find("inherits itself"), std::string::npos);
}

TEST_F(Descriptions, AnAttributeIsMadeWithItsDefault) {
  manager.load(write("a.xml", document(R"(
    <AttributeMap name="thing">
      <Attribute name="scale" type="float" default="0.5" />
      <Attribute name="bad" type="float" default="lots" />
      <Attribute name="odd" type="unknownType" default="1" />
    </AttributeMap>)")));
  std::unique_ptr<base::Attribute> scale(attribute("thing", "scale").createAttribute());
  ASSERT_TRUE(scale);
  EXPECT_EQ(*static_cast<const float*>(scale->data()), 0.5f);
  std::unique_ptr<base::Attribute> bad(attribute("thing", "bad").createAttribute());
  ASSERT_TRUE(bad);
  EXPECT_EQ(*static_cast<const float*>(bad->data()), 0.0f);
  EXPECT_EQ(attribute("thing", "odd").createAttribute(), nullptr);
}

}  // namespace
