#include "b_attrib_link.h"
#include "b_attribute_map.h"
#include "b_binary_io.h"
#include "log_capture.h"

#include <gtest/gtest.h>

#include <memory>

namespace {

using testing_support::LogCapture;

base::name_id operator""_n(const char* text, std::size_t length) { return base::intern({text, length}); }

base::AttribLink* link(std::string_view path, std::uint32_t flags = 0) {
  auto* made = new base::AttribLink;
  EXPECT_TRUE(made->fromString(path)) << path;
  made->flags = flags;
  return made;
}

TEST(AttribLink, MapsFollowLocalLinksAndChains) {
  base::AttribMap map;
  map.attribute<int>("target"_n) = 7;
  auto* sub = new base::AttribMap;
  sub->attribute<float>("value"_n) = 1.5f;
  map.attribute("sub"_n, sub);
  map.attribute("alias"_n, link("target"));
  map.attribute("deep"_n, link("sub/value"));
  map.attribute("chain"_n, link("alias"));
  EXPECT_EQ(*map.findAttribute<int>("alias"_n), 7);
  EXPECT_EQ(*map.findAttribute<float>("deep"_n), 1.5f);
  EXPECT_EQ(*map.findAttribute<int>("chain"_n), 7);
  // A link's value is its path: setting a value through attribute<T> replaces the link.
  map.attribute<int>("alias"_n, 3);
  EXPECT_EQ(*map.findAttribute<int>("chain"_n), 3);
}

TEST(AttribLink, UnresolvableLinksAndCyclesGiveNullWithOneMessage) {
  base::AttribMap map;
  map.attribute("lost"_n, link("missing"));
  map.attribute("quiet"_n, link("missing", base::attrSilentLink));
  map.attribute("a"_n, link("b"));
  map.attribute("b"_n, link("a"));
  LogCapture capture;
  EXPECT_EQ(map.findAttribute<int>("lost"_n), nullptr);
  EXPECT_EQ(map.findAttribute<int>("quiet"_n), nullptr);
  EXPECT_EQ(map.findAttribute<int>("a"_n), nullptr);
  EXPECT_EQ(capture.texts(),
            (std::vector<std::string>{
                "map attribute| Detected invalid link attribute! Cannot resolve 'lost' with value 'missing'!",
                "map attribute| Detected invalid link attribute! Cannot resolve 'a' with value 'b'!"}));
}

base::AttribMap* registeredObject = nullptr;

TEST(AttribLink, PluginStepsGoThroughTheResolver) {
  base::AttribMap object;
  object.attribute<int>("color"_n) = 5;
  registeredObject = &object;
  base::AttribPath::setPluginResolver([](const base::AttribMap&, std::uint32_t id) {
    return id == 12 ? registeredObject : static_cast<base::AttribMap*>(nullptr);
  });
  base::AttribMap map;
  map.attribute("theirs"_n, link("@12/color"));
  map.attribute("gone"_n, link("@13/color", base::attrSilentLink));
  EXPECT_EQ(*map.findAttribute<int>("theirs"_n), 5);
  EXPECT_EQ(map.findAttribute<int>("gone"_n), nullptr);

  // A link into an object that is not stored is not stored either.
  object.flags |= base::attrNotStored;
  base::Stream stream = base::memStream(0);
  map.write(stream, base::plainContext());
  stream.setPosition(0);
  base::AttribMap read;
  read.read(stream, base::plainContext());
  EXPECT_EQ(read.size(), 1u);
  base::AttribPath::setPluginResolver(nullptr);
}

TEST(AttribLink, TextAndBinaryForms) {
  base::AttribLink parsed;
  EXPECT_TRUE(parsed.fromString("@4/material/color"));
  EXPECT_EQ(parsed.toString(), "@4/material/color");
  EXPECT_EQ(parsed.path().owner, &parsed);
  EXPECT_FALSE(parsed.fromString("a//b"));
  EXPECT_FALSE(parsed.fromString("@x/b"));
  EXPECT_FALSE(parsed.fromString("a/@4"));
  EXPECT_EQ(parsed.toString(), "@4/material/color");

  for (bool stringIds : {false, true}) {
    base::StringIdContext ids;
    base::BinaryContext& context = stringIds ? ids : base::plainContext();
    base::Stream stream = base::memStream(0);
    parsed.write(stream, context);
    stream.setPosition(0);
    base::AttribLink read;
    read.read(stream, context);
    EXPECT_EQ(read.compareData(parsed.data()), 0);
    EXPECT_EQ(read.path().owner, &read);
  }
  std::unique_ptr<base::Attribute> copy(parsed.clone());
  EXPECT_EQ(copy->compareData(parsed.data()), 0);
  EXPECT_EQ(copy->asLink()->path().owner, copy.get());
}

}  // namespace
