#include "b_attribute_map.h"
#include "b_typed_attribute.h"
#include "b_vec.h"
#include "log_capture.h"

#include <gtest/gtest.h>

#include <atomic>
#include <cmath>
#include <limits>
#include <memory>
#include <thread>

namespace {

using testing_support::LogCapture;

base::name_id operator""_n(const char* text, std::size_t length) { return base::intern({text, length}); }

template <class F>
std::string thrownText(F&& action) {
  try {
    action();
  } catch (const base::exception& error) {
    return error.what();
  }
  return "(nothing thrown)";
}

TEST(AttribMap, AttributeGetsOrCreatesAndRefusesMisuse) {
  base::AttribMap map;
  map.attribute<int>("count"_n) = 7;
  EXPECT_EQ(map.attribute<int>("count"_n), 7);
  EXPECT_EQ(map.attribute<float>("scale"_n), 0.0f);
  EXPECT_EQ(map.size(), 2u);

  EXPECT_EQ(thrownText([&] { map.attribute<float>("count"_n); }),
            "Detected invalid access to attribute 'count'. Expected type 'float', actual attribute type - 'int32'");
  EXPECT_EQ(thrownText([&] { map.attribute<int>(""_n); }), "The attribute name can't be an empty string.");
  EXPECT_EQ(thrownText([&] { map.attribute<int>(nullptr); }), "The attribute name can't be an empty string.");
  // A type without a creator: the factory says so, the access throws, the map is unchanged.
  base::AttribFactory empty;
  base::AttribMap bare(&empty);
  LogCapture capture;
  EXPECT_EQ(thrownText([&] { bare.attribute<int>("x"_n); }), "Trying to access not registered attribute type 'int32'.");
  EXPECT_EQ(capture.texts(), std::vector<std::string>{"factory: Trying to create am item with unknown type int32."});
  EXPECT_EQ(bare.size(), 0u);
}

TEST(AttribMap, SettingAValueReplacesAMemberOfAnotherType) {
  base::AttribMap map;
  map.attribute<int>("a"_n) = 3;
  map.attribute<float>("a"_n, 2.5f);
  ASSERT_NE(map.findAttribute<float>("a"_n), nullptr);
  EXPECT_EQ(*map.findAttribute<float>("a"_n), 2.5f);
  EXPECT_EQ(map.size(), 1u);
}

TEST(AttribMap, MembersStaySortedByHandle) {
  base::AttribMap map;
  for (const char* name : {"zeta", "alpha", "mid", "beta", "omega"}) map.attribute<int>(base::intern(name)) = 1;
  const auto& members = map.members();
  for (std::size_t k = 1; k < members.size(); ++k) EXPECT_LT(members[k - 1].first, members[k].first);
  EXPECT_TRUE(map.removeMember("mid"_n));
  EXPECT_FALSE(map.removeMember("mid"_n));
  EXPECT_EQ(map.size(), 4u);
  EXPECT_EQ(map.findMember("mid"_n), nullptr);
  EXPECT_NE(map.findMember("omega"_n), nullptr);
}

TEST(AttribMap, FindLogsTypeMismatchesAndNeverCreates) {
  base::AttribMap map;
  map.attribute<int>("n"_n) = 1;
  map.attribute<base::vector<float>>("list"_n);
  LogCapture capture;
  EXPECT_EQ(map.findAttribute<int>("absent"_n), nullptr);
  EXPECT_TRUE(capture.entries.empty());
  EXPECT_EQ(map.findAttribute<float>("n"_n), nullptr);
  EXPECT_EQ(map.findVecAttribute<int>("n"_n), nullptr);
  EXPECT_EQ(capture.texts(),
            (std::vector<std::string>{
                "map attribute| Detected invalid access to attribute 'n'. Expected 'float', actual attribute type - "
                "'int32'",
                "map attribute| Detected invalid access to attribute 'n'. Expected type 'int32[]', actual attribute "
                "type - 'int32'!"}));
  EXPECT_EQ(map.size(), 2u);
}

TEST(AttribMap, AbsentNamesComeFromTheBaseMapChainUntilItDies) {
  auto grand = std::make_unique<base::AttribMap>();
  auto parent = std::make_unique<base::AttribMap>();
  base::AttribMap child;
  grand->attribute<int>("depth"_n) = 2;
  parent->attribute<int>("width"_n) = 5;
  parent->setBaseMap(grand.get());
  child.setBaseMap(parent.get());
  ASSERT_NE(child.findAttribute<int>("depth"_n), nullptr);
  EXPECT_EQ(*child.findAttribute<int>("depth"_n), 2);
  EXPECT_EQ(*child.findAttribute<int>("width"_n), 5);
  // Own members win over inherited ones.
  child.attribute<int>("width"_n) = 9;
  EXPECT_EQ(*child.findAttribute<int>("width"_n), 9);
  // A base map that dies first ends the inheritance; nothing dangles.
  parent.reset();
  EXPECT_EQ(child.findAttribute<int>("depth"_n), nullptr);
  EXPECT_EQ(*child.findAttribute<int>("width"_n), 9);
}

TEST(AttribMap, ConcurrentDeathOfTheBaseMapIsSeenAsNull) {
  for (int round = 0; round < 50; ++round) {
    auto base = std::make_unique<base::AttribMap>();
    base->attribute<int>("v"_n) = 1;
    base::AttribMap derived;
    derived.setBaseMap(base.get());
    std::atomic<bool> go = false;
    std::thread reader([&] {
      while (!go) std::this_thread::yield();
      for (int i = 0; i < 200; ++i) {
        const int* value = derived.findAttribute<int>("v"_n);
        if (value) {
          EXPECT_EQ(*value, 1);
        }
      }
    });
    go = true;
    base.reset();
    reader.join();
    EXPECT_EQ(derived.findAttribute<int>("v"_n), nullptr);
  }
}

TEST(AttribMap, CopyFromModes) {
  base::AttribMap source;
  source.attribute<float>("a"_n, 1.5f);
  source.attribute<int>("new"_n, 4);
  auto* sourceNested = new base::AttribMap;
  sourceNested->attribute<int>("inner"_n, 8);
  sourceNested->attribute<int>("extra"_n, 9);
  source.attribute("nested"_n, sourceNested);
  const auto makeTarget = [] {
    auto target = std::make_unique<base::AttribMap>();
    target->attribute<int>("a"_n, 3);
    auto* nested = new base::AttribMap;
    nested->attribute<int>("inner"_n, 1);
    target->attribute("nested"_n, nested);
    return target;
  };
  const auto nestedOf = [](base::AttribMap& map) {
    return static_cast<const base::AttribMap::Members*>((*map.findAttributeMutable("nested"_n))->data());
  };

  auto added = makeTarget();  // mode 0: only missing names
  EXPECT_TRUE(added->copyFrom(source, base::copyAddMissing));
  EXPECT_EQ(*added->findAttribute<int>("a"_n), 3);
  EXPECT_EQ(*added->findAttribute<int>("new"_n), 4);
  EXPECT_EQ(nestedOf(*added)->size(), 1u);

  auto merged = makeTarget();  // bit 1: into nested maps, values kept
  EXPECT_TRUE(merged->copyFrom(source, base::copyMerge));
  EXPECT_EQ(*merged->findAttribute<int>("a"_n), 3);
  EXPECT_EQ(nestedOf(*merged)->size(), 2u);

  auto overwritten = makeTarget();  // bit 0: values overwritten, other types replaced
  EXPECT_TRUE(overwritten->copyFrom(source, base::copyOverwrite));
  ASSERT_NE(overwritten->findAttribute<float>("a"_n), nullptr);
  EXPECT_EQ(*overwritten->findAttribute<float>("a"_n), 1.5f);
  const base::AttribMap::Members& nested = *nestedOf(*overwritten);
  EXPECT_EQ(nested.size(), 2u);

  base::TypedAttribute<int> scalar;
  EXPECT_FALSE(overwritten->copyFrom(scalar, base::copyOverwrite));
}

TEST(AttribMap, StoringAReadyAttribute) {
  LogCapture capture;
  base::AttribMap map;
  map.attribute<int>("a"_n) = 1;
  const int* before = map.findAttribute<int>("a"_n);
  map.attribute("a"_n, new base::TypedAttribute<int>(5));  // same type: value taken, object kept
  EXPECT_EQ(map.findAttribute<int>("a"_n), before);
  EXPECT_EQ(*before, 5);
  map.attribute("a"_n, new base::TypedAttribute<double>(0.5));  // another type: replaced
  EXPECT_EQ(*map.findAttribute<double>("a"_n), 0.5);
  EXPECT_EQ(thrownText([&] { map.attribute("b"_n, nullptr); }), "Can't set invalid attribute");
}

TEST(AttribMap, SyncAttributeLetsStoredValuesWin) {
  base::AttribMap map;
  float scale = 2.0f;
  map.syncAttribute("scale"_n, scale);  // absent: the member's value becomes the stored one
  EXPECT_EQ(*map.findAttribute<float>("scale"_n), 2.0f);
  map.attribute<float>("scale"_n) = 3.0f;
  map.syncAttribute("scale"_n, scale);
  EXPECT_EQ(scale, 3.0f);
  int wrong = 0;
  EXPECT_EQ(thrownText([&] { map.syncAttribute("scale"_n, wrong); }),
            "Detected invalid access to attribute 'scale'. Expected type 'int32', attribute type - 'float'");
}

TEST(AttribMap, CloneCompareAndByteSize) {
  base::AttribMap base;
  base::AttribMap map;
  map.flags = 0x5;
  map.setMapType("sceneImporter"_n);
  map.setBaseMap(&base);
  base.attribute<int>("inherited"_n) = 1;
  map.attribute<base::base_vec3<float>>("p"_n) = {1, 2, 3};
  map.attribute<double>("d"_n) = 0.25;
  std::unique_ptr<base::Attribute> copy(map.clone());
  auto& cloned = *copy->asMap();
  EXPECT_EQ(cloned.flags, 0x5u);
  EXPECT_EQ(cloned.mapType(), nullptr);
  EXPECT_EQ(*cloned.findAttribute<int>("inherited"_n), 1);
  EXPECT_EQ(map.compareData(cloned.data()), 0);
  cloned.attribute<double>("d"_n) = 0.5;
  EXPECT_EQ(map.compareData(cloned.data()), -1);
  cloned.attribute<int>("more"_n) = 1;
  EXPECT_EQ(map.compareData(cloned.data()), -1);
  EXPECT_EQ(cloned.compareData(map.data()), 1);
  EXPECT_EQ(map.byteSize(), 4u + 12u + 8u);
}

TEST(TypedAttribute, TextForms) {
  const std::pair<float, const char*> floats[] = {{2.0f, "2"}, {0.5f, "0.5"}, {-0.0001f, "-0.0001"}, {2e30f, "2e+30"}};
  for (const auto& [value, expected] : floats) EXPECT_EQ(base::TypedAttribute<float>(value).toString(), expected);
  EXPECT_EQ(base::TypedAttribute<base::base_vec3<float>>({1, 2.5f, 0}).toString(), "1,2.5,0");

  base::TypedAttribute<float> value(1.0f);
  EXPECT_FALSE(value.fromString("1.5x"));
  EXPECT_EQ(value.value(), 1.0f);
  EXPECT_TRUE(value.fromString("2e3"));
  EXPECT_EQ(value.value(), 2000.0f);
  base::TypedAttribute<base::base_vec3<float>> vector;
  EXPECT_FALSE(vector.fromString("1,2"));
  EXPECT_TRUE(vector.fromString("1,2,3"));
  EXPECT_EQ(vector.value(), (base::base_vec3<float>{1, 2, 3}));
}

TEST(TypedAttribute, CopyCompareAndLists) {
  base::TypedAttribute<float> f(1.0f);
  const base::TypedAttribute<double> d(2.0);
  EXPECT_FALSE(f.copyFrom(d, base::copyOverwrite));
  EXPECT_FALSE(f.copyFrom(base::TypedAttribute<float>(3.0f), base::copyAddMissing));
  EXPECT_TRUE(f.copyFrom(base::TypedAttribute<float>(3.0f), base::copyOverwrite));
  EXPECT_EQ(f.value(), 3.0f);

  const base::base_vec3<float> p{1, std::numeric_limits<float>::quiet_NaN(), 3};
  base::TypedAttribute<base::base_vec3<float>> v(p);
  const base::base_vec3<float> same{1, 7, 3};  // NaN equals anything
  const base::base_vec3<float> larger{1, 7, 4};
  EXPECT_EQ(v.compareData(&same), 0);
  EXPECT_EQ(v.compareData(&larger), -1);

  base::TypedVectorAttribute<unsigned short> list;
  list.values() = {1, 2};
  EXPECT_EQ(list.byteSize(), 8u);
  EXPECT_FALSE(list.erase(2));
  EXPECT_TRUE(list.erase(0));
  EXPECT_TRUE(list.erase(0));
  EXPECT_EQ(list.byteSize(), 4u);
  EXPECT_EQ(list.componentType(), 3u);
  EXPECT_EQ(base::TypedAttribute<base::base_vec4<double>>().componentType(), 11u);
  EXPECT_EQ(base::TypedAttribute<base::base_vec4<double>>().byteSize(), 32u);
}

TEST(AttribFactory, KnowsTheSceneValueTypes) {
  for (const char* type : {"bool", "uint8[]", "int8[]", "float", "double[]", "string", "timecode", "vec2ub", "vec3f[]",
                           "quatd[]", "mat22f", "mat43f[]", "box3f[]", "box2i", "color4f", "normal[]", "map"}) {
    std::unique_ptr<base::Attribute> created(base::attribFactory().create(base::intern(type)));
    ASSERT_NE(created, nullptr) << type;
    EXPECT_EQ(base::text(created->type()), type);
  }
}

}  // namespace
