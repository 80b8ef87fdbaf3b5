#pragma once

// The binary forms of attributes: little-endian numbers, names through a context, and the
// checks that keep a truncated or hostile input from reading garbage or allocating more than
// the input can hold.

#include "b_api.h"
#include "b_containers.h"
#include "b_name.h"
#include "b_stream.h"

#include <algorithm>
#include <bit>
#include <cstdint>
#include <optional>
#include <string_view>

namespace base {

class Attribute;

static_assert(std::endian::native == std::endian::little, "the binary forms are written as the machine holds them");

/// How the binary forms store member names, type names and references to plug-in objects.
/// A read also counts in its context how deep it is inside maps and arrays.
class BASE1_API BinaryContext {
 public:
  /// The deepest nesting of maps and arrays that a read accepts, as for JSON: the reader
  /// recurses, and a hostile input must not exhaust its stack.
  static constexpr std::uint32_t deepest = 256;

  /// One level of map or array nesting, counted in the context for as long as it lives.
  /// Entering a level deeper than `deepest` throws base::exception, naming the stream.
  class BASE1_API Level {
   public:
    Level(BinaryContext& context, Stream& stream);
    ~Level() { --m_context.m_depth; }
    Level(const Level&) = delete;
    Level& operator=(const Level&) = delete;

   private:
    BinaryContext& m_context;
  };

  virtual ~BinaryContext();
  /// A member name. The plain form: the text's byte length (32 bits), then its bytes.
  virtual void writeName(Stream& stream, name_id name);
  /// Reads a name of the plain form. A length over 256 MiB, or over what the stream has
  /// left, throws.
  virtual name_id readName(Stream& stream);
  /// A type name; the plain form is that of names.
  virtual void writeType(Stream& stream, name_id type);
  virtual name_id readType(Stream& stream);
  /// The id under which a reference to the plug-in object listed at `index` is stored;
  /// plainly the index itself.
  virtual std::uint32_t pluginId(std::uint32_t index) const;

 private:
  std::uint32_t m_depth = 0;
};

/// A table of names stored elsewhere, each name stored as its 16-bit position in it.
class BASE1_API NameTable {
 public:
  /// Writes the name's id, giving new names the next id; more than 65,536 names throw.
  void write(Stream& stream, name_id name);
  /// Reads an id; one outside the table throws.
  name_id read(Stream& stream) const;

  const base::vector<name_id>& names() const { return m_names; }
  void setNames(base::vector<name_id> names);

 private:
  base::vector<name_id> m_names;
  base::map<name_id, std::uint16_t> m_ids;
};

/// Member names and type names as 16-bit ids of two tables that the context keeps and its
/// user stores.
class BASE1_API StringIdContext : public BinaryContext {
 public:
  void writeName(Stream& stream, name_id name) override { names.write(stream, name); }
  name_id readName(Stream& stream) override { return names.read(stream); }
  void writeType(Stream& stream, name_id type) override { types.write(stream, type); }
  name_id readType(Stream& stream) override { return types.read(stream); }

  NameTable names;
  NameTable types;
};

/// The plain context, for callers that need no string table; one per thread, since reads
/// count their nesting in it.
BASE1_API BinaryContext& plainContext();

namespace binary {

/// Writes `size` bytes; a short write throws as the stream's flags say.
BASE1_API void write(Stream& stream, const void* data, std::uint64_t size);
/// Reads exactly `size` bytes. A short read always throws (the stream's short-read message):
/// a binary form that ends early has no other way to say so.
BASE1_API void read(Stream& stream, void* data, std::uint64_t size);
/// Throws the stream's short-read message for `wanted` bytes of which `got` came.
[[noreturn]] BASE1_API void failShort(Stream& stream, std::uint64_t wanted, std::uint64_t got);
/// Bytes the stream has left, when it can tell.
BASE1_API std::optional<std::uint64_t> bytesLeft(Stream& stream);
/// Reads a 32-bit count of items that take at least `itemBytes` bytes each; a count that the
/// bytes left cannot hold throws, naming `what`.
BASE1_API std::uint32_t readCount(Stream& stream, std::uint64_t itemBytes, std::string_view what);

/// Resizes `items` to `count` and fills it through `readItems(first, n)`, which reads items
/// first to first + n - 1 into it. Where the stream can tell how much it has left, callers
/// have checked `count` against it and `items` is sized once. Elsewhere nothing proves the
/// count: `items` grows by 65,536 items at a time with the data that arrives, so that a
/// hostile count over a few bytes ends in the short-read failure, not in a huge allocation.
template <class Items, class ReadItems>
void readInBatches(Stream& stream, Items& items, std::uint32_t count, ReadItems&& readItems) {
  constexpr std::uint32_t batch = 1 << 16;
  const bool proven = bytesLeft(stream).has_value();
  items.clear();
  for (std::uint32_t done = 0; done < count;) {
    const std::uint32_t n = proven ? count - done : std::min(count - done, batch);
    items.resize(std::size_t(done) + n);
    readItems(done, n);
    done += n;
  }
}

/// readInBatches for items stored as their own bytes (numbers, text).
template <class Items>
void readPacked(Stream& stream, Items& items, std::uint32_t count) {
  readInBatches(stream, items, count, [&](std::uint32_t first, std::uint32_t n) {
    read(stream, items.data() + first, std::uint64_t(n) * sizeof(*items.data()));
  });
}

/// Writes the binary form of `attr` preceded by its byte length (32 bits), so that a reader
/// that cannot read it can skip it.
BASE1_API void writeSized(Stream& stream, const Attribute& attr, BinaryContext& context);
/// Reads into `attr` a binary form of `length` bytes; a form that takes more throws, one
/// that takes less has the rest skipped (where the stream can position).
BASE1_API void readSized(Stream& stream, Attribute& attr, BinaryContext& context, std::uint32_t length);

template <class T>
void put(Stream& stream, T value) {
  write(stream, &value, sizeof value);
}

template <class T>
T get(Stream& stream) {
  T value{};
  read(stream, &value, sizeof value);
  return value;
}

}  // namespace binary
}  // namespace base
