// The binary forms of attributes and maps: round trips, left-out members, members of types
// the reader lacks, and inputs that end early or count more than they hold.

#include "address_limit.h"
#include "b_attrib_array.h"
#include "b_attribute_map.h"
#include "b_box.h"
#include "b_color.h"
#include "b_matrix.h"
#include "b_murmurhash3.h"
#include "b_normal.h"
#include "b_plugin_attribute.h"
#include "b_plugin_factory.h"
#include "b_quat.h"
#include "b_timecode.h"
#include "b_typed_attribute.h"
#include "b_vec.h"
#include "log_capture.h"
#include "test_streams.h"
#include "thrown.h"

#include <gtest/gtest.h>

#include <algorithm>

#include <vector>

#include <random>
#ifdef MESHPORT_HAVE_MURMURHASH
#  include <murmurhash.h>
#endif

#include <cstring>
#include <memory>

namespace {

using testing_support::LogCapture;

base::name_id operator""_n(const char* text, std::size_t length) { return base::intern({text, length}); }

// Writes `attr`, reads it into a fresh attribute of its type, and says whether they agree.
void expectRoundTrip(const base::Attribute& attr, base::BinaryContext& context = base::plainContext()) {
  base::Stream stream = base::memStream(0);
  attr.write(stream, context);
  stream.setPosition(0);
  std::unique_ptr<base::Attribute> copy(base::attribFactory().create(attr.type()));
  ASSERT_NE(copy, nullptr) << base::text(attr.type());
  copy->read(stream, context);
  EXPECT_EQ(stream.getPosition(), stream.getSize()) << base::text(attr.type());
  EXPECT_EQ(copy->flags, attr.flags & base::attrPersistent) << base::text(attr.type());
  EXPECT_EQ(copy->compareData(attr.data()), 0) << base::text(attr.type());
  EXPECT_EQ(attr.compareData(copy->data()), 0) << base::text(attr.type());
}

TEST(AttributeBinary, EveryFactoryTypeRoundTripsItsDefault) {
  for (base::name_id type : base::attribFactory().types()) {
    std::unique_ptr<base::Attribute> attr(base::attribFactory().create(type));
    attr->flags = 0x45 | base::attrRuntime;  // the run-time mark is never stored
    expectRoundTrip(*attr);
  }
}

TEST(AttributeBinary, ValuesAndListsRoundTrip) {
  base::TypedAttribute<base::string> text(base::string("t\0ext", 5));
  base::TypedAttribute<base::base_vec2<unsigned char>> bytes({7, 250});
  base::TypedAttribute<base::base_quat<double>> rotation({0.1, -0.2, 0.3, 1e300});
  base::TypedAttribute<base::TimeCode> time(base::TimeCode{-123456789012345});
  base::TypedAttribute<base::base_color4<float>> color({0.5f, 1, 0, 0.25f});
  base::TypedVectorAttribute<base::detail::mat43f_type> transforms;
  transforms.values().resize(3);
  transforms.values()[1].translation = {1e100, -2, 3};
  transforms.values()[2].rotation.m[1][2] = 0.5f;
  base::TypedVectorAttribute<base::base_box<base::base_vec3<float>>> boxes;
  boxes.values() = {{{-1, -2, -3}, {1, 2, 3}}};
  base::TypedVectorAttribute<base::normal> normals;
  normals.values() = {{0, 0, 1}, {1, 0, 0}};
  for (const base::Attribute* attr : std::initializer_list<const base::Attribute*>{
           &text, &bytes, &rotation, &time, &color, &transforms, &boxes, &normals}) {
    expectRoundTrip(*attr);
  }
}

TEST(AttributeBinary, NestedMapsRoundTripWithoutMembersMarkedNotStored) {
  base::AttribMap map;
  map.attribute<int>("count"_n) = 3;
  map.attribute<base::vector<base::base_vec3<float>>>("positions"_n) = {{1, 2, 3}, {4, 5, 6}};
  auto* nested = new base::AttribMap;
  nested->attribute<double>("weight"_n) = 0.5;
  nested->attribute<base::string>("label"_n) = "inner";
  map.attribute("nested"_n, nested);
  map.attribute<float>("scratch"_n) = 9;
  (*map.findAttributeMutable("scratch"_n))->flags |= base::attrNotStored;

  for (bool stringIds : {false, true}) {
    base::StringIdContext ids;
    base::BinaryContext& context = stringIds ? ids : base::plainContext();
    base::Stream stream = base::memStream(0);
    map.write(stream, context);
    stream.setPosition(0);
    base::AttribMap copy;
    copy.read(stream, context);
    EXPECT_EQ(copy.size(), 3u);
    EXPECT_EQ(copy.findAttribute<float>("scratch"_n), nullptr);
    ASSERT_NE(copy.findVecAttribute<base::base_vec3<float>>("positions"_n), nullptr);
    EXPECT_EQ(copy.findVecAttribute<base::base_vec3<float>>("positions"_n)->at(1), (base::base_vec3<float>{4, 5, 6}));
    const auto* inner = static_cast<const base::AttribMap::Members*>((*copy.findAttributeMutable("nested"_n))->data());
    EXPECT_EQ(inner->size(), 2u);
  }
}

// A value type that only the writer knows.
struct Exotic : base::TypedAttribute<int> {
  base::name_id type() const override { return "exotic"_n; }
};

TEST(AttributeBinary, AMemberOfATypeTheReaderLacksIsSkippedAlone) {
  base::AttribFactory writerTypes;
  writerTypes.add("exotic"_n, []() -> base::Attribute* { return new Exotic; });
  writerTypes.add(base::TypeTraits<int>::n_name, []() -> base::Attribute* { return new base::TypedAttribute<int>; });
  base::AttribMap written(&writerTypes);
  written.attribute<int>("before"_n) = 1;
  written.attribute("zz_exotic"_n, new Exotic);
  written.attribute<int>("after"_n) = 2;
  // Into a block stream as well, which appends every write and cannot patch anything.
  for (std::uint32_t capabilities : {base::capsMemory, std::uint32_t(base::capWrite)}) {
    base::vector<std::uint8_t> bytes;
    base::Stream target = capabilities == base::capsMemory ? base::vectorStream(bytes) : base::memBlockStream();
    written.write(target, base::plainContext());
    if (capabilities != base::capsMemory) {
      target.setPosition(0);
      bytes.resize(static_cast<std::size_t>(target.getSize()));
      target.read(bytes.data(), static_cast<std::uint32_t>(bytes.size()));
    }
    LogCapture capture(base::logWarning);
    base::Stream source = base::vectorStream(static_cast<const base::vector<std::uint8_t>&>(bytes));
    base::AttribMap read;
    read.read(source, base::plainContext());
    EXPECT_EQ(read.size(), 2u);
    EXPECT_EQ(*read.findAttribute<int>("after"_n), 2);
    EXPECT_EQ(capture.texts(),
              (std::vector<std::string>{"factory: Trying to create am item with unknown type exotic.",
                                        "map attribute: Attribute 'zz_exotic' has unknown type. This may be caused by "
                                        "newer version or corrupted file. Trying to skip..."}));
  }
}

TEST(AttributeBinary, TruncatedAndHostileInputsFailCleanly) {
  base::AttribMap map;
  map.attribute<base::vector<float>>("values"_n) = {1, 2, 3};
  base::Stream stream = base::memStream(0);
  map.write(stream, base::plainContext());
  base::vector<std::uint8_t> bytes(static_cast<std::size_t>(stream.getSize()));
  stream.setPosition(0);
  stream.read(bytes.data(), static_cast<std::uint32_t>(bytes.size()));
  // Every cut is refused with an exception, never read as garbage.
  for (std::size_t cut = 0; cut < bytes.size(); ++cut) {
    base::Stream shortened = base::memStream(bytes.data(), static_cast<std::int64_t>(cut));
    base::AttribMap read;
    EXPECT_THROW(read.read(shortened, base::plainContext()), base::exception) << cut;
  }
  // A count of 4,294,967,295 list elements in a few bytes allocates nothing.
  base::vector<std::uint8_t> hostile = {0, 0xFF, 0xFF, 0xFF, 0xFF, 1, 2, 3};
  base::TypedVectorAttribute<double> list;
  base::Stream source = base::memStream(hostile.data(), static_cast<std::int64_t>(hostile.size()));
  EXPECT_THROW(list.read(source, base::plainContext()), base::exception);
  // Without a size the list grows only with the data that arrives.
  base::Stream pipe = testing_support::fileLikeStream(std::string(hostile.begin(), hostile.end()), base::capRead);
  EXPECT_THROW(list.read(pipe, base::plainContext()), base::exception);
  EXPECT_LE(list.values().capacity(), 1u << 16);
}

// The plain binary form of `levels` maps (or arrays) each holding the next, the innermost
// empty: built by hand, since nothing that writes would nest this deep.
base::string nestedForm(std::uint32_t levels, bool arrays) {
  const auto put = [](base::string& bytes, auto value) {
    bytes.append(reinterpret_cast<const char*>(&value), sizeof value);
  };
  const auto putName = [&](base::string& bytes, std::string_view name) {
    put(bytes, static_cast<std::uint32_t>(name.size()));
    bytes.append(name);
  };
  // Each level but the innermost: its flags, one member (or element), the child's type and
  // byte length; the children follow one another, so each length is what comes after it.
  const std::size_t header = 1 + 4 + (arrays ? 0 : 4 + 1) + 4 + (arrays ? 5 : 3) + 4;
  const std::size_t innermost = 1 + 4;
  base::string bytes;
  bytes.reserve((levels - 1) * header + innermost);
  for (std::uint32_t level = 1; level < levels; ++level) {
    put(bytes, std::uint8_t(0));
    put(bytes, std::uint32_t(1));
    if (!arrays) putName(bytes, "m");
    putName(bytes, arrays ? "array" : "map");
    put(bytes, static_cast<std::uint32_t>((levels - 1 - level) * header + innermost));
  }
  put(bytes, std::uint8_t(0));
  put(bytes, std::uint32_t(0));
  return bytes;
}

TEST(AttributeBinary, NestingDeeperThan256LevelsIsRefusedNotRecursedInto) {
  for (const bool arrays : {false, true}) {
    const auto readForm = [arrays](const base::string& bytes) {
      base::Stream stream = base::memStream(bytes.data(), static_cast<std::int64_t>(bytes.size()), "deep");
      std::unique_ptr<base::Attribute> attr(arrays ? static_cast<base::Attribute*>(new base::AttribArray)
                                                   : new base::AttribMap);
      attr->read(stream, base::plainContext());
      return stream.getPosition() == stream.getSize();
    };
    const std::string refusal = "stream 'deep': the nesting of maps and arrays is deeper than 256 levels";
    // Deep enough to overflow the stack of a reader that does not count.
    EXPECT_EQ(stream_tests::thrownText([&] { readForm(nestedForm(40000, arrays)); }), refusal) << arrays;
    EXPECT_EQ(stream_tests::thrownText([&] { readForm(nestedForm(257, arrays)); }), refusal) << arrays;
    // The failed reads left the context's count where it was.
    EXPECT_TRUE(readForm(nestedForm(256, arrays))) << arrays;
  }
  // What reads writes back, in time: each member's length is counted once, not again at
  // every level above it (2 to the 256th writes).
  const base::string form = nestedForm(256, false);
  base::Stream in = base::memStream(form.data(), static_cast<std::int64_t>(form.size()), "deep");
  base::AttribMap deep;
  deep.read(in, base::plainContext());
  base::vector<std::uint8_t> written;
  base::Stream out = base::vectorStream(written);
  deep.write(out, base::plainContext());
  EXPECT_EQ(std::string(written.begin(), written.end()), std::string(form.begin(), form.end()));
}

#if defined(MESHPORT_HAS_ADDRESS_LIMIT)

// Runs `read` in a death-test child held to 64 MiB more than it holds. Exits with 0 when
// the read fails with the short-read message, with allocationFailed when it ran out of
// memory, with 4 on any other ending.
template <class Read>
[[noreturn]] void readUnderLimit(Read&& read) {
  LogCapture quiet;
  testing_support::limitAddressSpace(64u << 20);
  try {
    read();
  } catch (const base::exception& error) {
    _exit(std::string_view(error.what()).find("trying to read") != std::string_view::npos ? 0 : 4);
  } catch (const std::bad_alloc&) {
    _exit(testing_support::allocationFailed);
  }
  _exit(4);
}

// A count of up to 4 GiB over a few bytes from a stream that cannot tell its size: nothing
// proves the count, so each form must grow with the data, never allocate the count first.
TEST(AttributeBinary, CountsFromAStreamWithoutASizeAllocateOnlyWhatArrives) {
  const auto bytes = [](std::initializer_list<std::uint8_t> head) {
    std::string data(head.begin(), head.end());
    return data + "abcdefgh";
  };
  const std::string text = bytes({0, 0xFF, 0xFF, 0xFF, 0xFF});
  const std::string name = bytes({0, 0, 0, 0x10});                       // 256 MiB, the longest name allowed
  const std::string objectList = bytes({1, 1, 0, 0, 0, 0, 0, 0, 0x10});  // one plug-in type of that name
  for (const testing_support::Source source : {testing_support::Source::pipe, testing_support::Source::bufferedPipe}) {
    const auto stream = [source](const std::string& data) { return testing_support::sourceStream(data, source); };
    const char* kind = testing_support::sourceName(source);
    EXPECT_EXIT(readUnderLimit([&] {
                  base::Stream in = stream(text);
                  base::TypedAttribute<base::string>().read(in, base::plainContext());
                }),
                ::testing::ExitedWithCode(0), "")
        << "text, " << kind;
    EXPECT_EXIT(readUnderLimit([&] {
                  base::Stream in = stream(text);
                  base::TypedVectorAttribute<double>().read(in, base::plainContext());
                }),
                ::testing::ExitedWithCode(0), "")
        << "list, " << kind;
    EXPECT_EXIT(readUnderLimit([&] {
                  base::Stream in = stream(text);
                  base::PluginVectorAttribute().read(in, base::plainContext());
                }),
                ::testing::ExitedWithCode(0), "")
        << "plug-in references, " << kind;
    EXPECT_EXIT(readUnderLimit([&] {
                  base::Stream in = stream(name);
                  base::plainContext().readName(in);
                }),
                ::testing::ExitedWithCode(0), "")
        << "name, " << kind;
    EXPECT_EXIT(readUnderLimit([&] {
                  base::Stream in = stream(objectList);
                  base::PluginFactory("objects").read(in);
                }),
                ::testing::ExitedWithCode(0), "")
        << "object list, " << kind;
  }
}

#endif

// A stored bool byte other than 0 or 1 reads as true and is written back as 1.
TEST(AttributeBinary, BoolBytesOtherThanZeroAndOneReadAsTrue) {
  for (std::uint8_t stored : {1, 2, 0x80}) {
    const base::vector<std::uint8_t> bytes = {0, stored};
    base::TypedAttribute<bool> flag;
    base::Stream source = base::memStream(bytes.data(), static_cast<std::int64_t>(bytes.size()));
    flag.read(source, base::plainContext());
    EXPECT_TRUE(flag.value()) << int(stored);
    base::Stream written = base::memStream(0);
    flag.write(written, base::plainContext());
    std::uint8_t back[2] = {};
    written.setPosition(0);
    written.read(back, 2);
    EXPECT_EQ(back[1], 1) << int(stored);
  }
}

// MurmurHash3 x86 128-bit: its published verification value (each prefix of 0..255 hashed
// with seed 256 - length, then the digests hashed) must come out.
TEST(AttributeHash, TheHashIsMurmurHash3X86_128) {
  std::uint8_t key[256];
  std::uint32_t digests[256][4];
  for (int length = 0; length < 256; ++length) {
    key[length] = static_cast<std::uint8_t>(length);
    base::detail::murmurHash3x86_128(key, static_cast<std::uint32_t>(length), static_cast<std::uint32_t>(256 - length),
                                     digests[length]);
  }
  std::uint32_t verification[4];
  base::detail::murmurHash3x86_128(digests, sizeof digests, 0, verification);
  EXPECT_EQ(verification[0], 0xB3ECE62Au);
  // hash() is the digest's first 64 bits with seed 0.
  const char* text = "The quick brown fox jumps over the lazy dog";
  EXPECT_EQ(base::murmurHash3(text, std::strlen(text)), 0xecee2c672f1583c3u);
}

#ifdef MESHPORT_HAVE_MURMURHASH
// The code for builds without the library agrees with the library on every length and seed.
TEST(AttributeHash, OwnCodeAgreesWithTheLibrary) {
  std::mt19937 random(3);
  std::vector<std::uint8_t> bytes(300);
  for (std::uint8_t& byte : bytes) byte = static_cast<std::uint8_t>(random());
  for (std::uint32_t length = 0; length < bytes.size(); ++length) {
    std::uint32_t library[4], own[4];
    const std::uint32_t seed = random();
    lmmh_x86_128(bytes.data(), length, seed, library);
    base::detail::murmurHash3x86_128(bytes.data(), length, seed, own);
    EXPECT_TRUE(std::equal(library, library + 4, own)) << "length " << length;
  }
}
#endif

TEST(AttributeHash, ListsHashTheBytesOfTheirBinaryForm) {
  base::TypedVectorAttribute<float> empty;
  EXPECT_EQ(empty.hash(), 0u);  // MurmurHash3 of no bytes with seed 0
  base::TypedVectorAttribute<float> a;
  a.values() = {1, 2, 3};
  base::TypedVectorAttribute<float> b;
  b.values() = {1, 2, 3};
  EXPECT_EQ(a.hash(), b.hash());
  EXPECT_NE(a.hash(), 0u);
  b.values()[2] = 4;
  EXPECT_NE(a.hash(), b.hash());
  // A padded element hashes as the binary form holds it, not its padding.
  base::TypedVectorAttribute<base::detail::mat43f_type> transforms;
  transforms.values().resize(2);
  base::Stream form = base::memStream(0);
  for (const auto& value : transforms.values()) base::detail::writeValue(form, value);
  base::vector<std::uint8_t> bytes(static_cast<std::size_t>(form.getSize()));
  form.setPosition(0);
  form.read(bytes.data(), static_cast<std::uint32_t>(bytes.size()));
  EXPECT_EQ(transforms.hash(), base::murmurHash3(bytes.data(), bytes.size()));
  EXPECT_EQ(base::TypedAttribute<float>(1).hash(), 0u);
}

}  // namespace
