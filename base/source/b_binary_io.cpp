#include "b_binary_io.h"

#include "b_attribute.h"
#include "b_exception.h"
#include "b_log.h"

#include <fmt/format.h>

#include <algorithm>

namespace base {
namespace {

constexpr std::uint32_t longestName = 0x10000000;

// Counts what is written to it and keeps nothing.
class ByteCounter final : public StreamWorker {
 public:
  ByteCounter() : StreamWorker(capWrite, "byte counter") {}
  std::uint32_t write(const void*, std::uint32_t count) override {
    total += count;
    return count;
  }
  std::uint64_t total = 0;
};

}  // namespace

BinaryContext::Level::Level(BinaryContext& context, Stream& stream) : m_context(context) {
  if (context.m_depth >= deepest) {
    raise<exception>("base::Attribute::read",
                     fmt::format("stream '{}': the nesting of maps and arrays is deeper than {} levels",
                                 clipped(stream.name()), deepest));
  }
  ++context.m_depth;
}

BinaryContext::~BinaryContext() = default;

void BinaryContext::writeName(Stream& stream, name_id name) {
  const std::string_view bytes = text(name);
  binary::put(stream, static_cast<std::uint32_t>(bytes.size()));
  binary::write(stream, bytes.data(), bytes.size());
}

name_id BinaryContext::readName(Stream& stream) {
  const auto length = binary::get<std::uint32_t>(stream);
  if (length > longestName)
    raise<exception>("base::xdr_read", "Trying to read a string bigger then 256MB, aborting...");
  if (const auto left = binary::bytesLeft(stream); left && length > *left) {
    raise<exception>("base::xdr_read", fmt::format("stream '{}': a name of {} bytes, but only {} bytes are left",
                                                   clipped(stream.name()), length, *left));
  }
  base::string bytes;
  binary::readPacked(stream, bytes, length);
  return intern(bytes);
}

void BinaryContext::writeType(Stream& stream, name_id type) { BinaryContext::writeName(stream, type); }

name_id BinaryContext::readType(Stream& stream) { return BinaryContext::readName(stream); }

std::uint32_t BinaryContext::pluginId(std::uint32_t index) const { return index; }

void NameTable::write(Stream& stream, name_id name) {
  auto found = m_ids.find(name);
  if (found == m_ids.end()) {
    if (m_names.size() > 0xFFFF) raise<exception>("base::NameTable::write", "More than 65536 names to store");
    found = m_ids.emplace(name, static_cast<std::uint16_t>(m_names.size())).first;
    base::append(m_names, name);
  }
  binary::put(stream, found->second);
}

name_id NameTable::read(Stream& stream) const {
  const auto id = binary::get<std::uint16_t>(stream);
  if (id >= m_names.size()) {
    raise<exception>("base::NameTable::read",
                     fmt::format("Name id {} is not in the table of {} names", id, m_names.size()));
  }
  return m_names[id];
}

void NameTable::setNames(base::vector<name_id> names) {
  m_names = std::move(names);
  m_ids.clear();
  for (std::size_t k = 0; k < m_names.size(); ++k) m_ids.emplace(m_names[k], static_cast<std::uint16_t>(k));
}

BinaryContext& plainContext() {
  static thread_local BinaryContext context;
  return context;
}

namespace binary {

void write(Stream& stream, const void* data, std::uint64_t size) {
  const auto* bytes = static_cast<const std::uint8_t*>(data);
  // Stream calls take 32-bit counts: larger blocks go in pieces.
  for (std::uint64_t done = 0; done < size;) {
    const auto piece = static_cast<std::uint32_t>(std::min<std::uint64_t>(size - done, 0x40000000));
    const std::uint32_t written = stream.write(bytes + done, piece);
    done += written;
    if (written < piece) return;
  }
}

void read(Stream& stream, void* data, std::uint64_t size) {
  auto* bytes = static_cast<std::uint8_t*>(data);
  for (std::uint64_t done = 0; done < size;) {
    const auto piece = static_cast<std::uint32_t>(std::min<std::uint64_t>(size - done, 0x40000000));
    const std::uint32_t got = stream.read(bytes + done, piece);
    done += got;
    if (got < piece) failShort(stream, size, done);
  }
}

void failShort(Stream& stream, std::uint64_t wanted, std::uint64_t got) {
  raise<exception>("base::Stream::read", fmt::format("stream '{}': trying to read {} bytes, read {} bytes",
                                                     clipped(stream.name()), wanted, got));
}

std::optional<std::uint64_t> bytesLeft(Stream& stream) {
  if (!stream.has(capSize | capPosition)) return std::nullopt;
  return static_cast<std::uint64_t>(std::max<std::int64_t>(stream.getSize() - stream.getPosition(), 0));
}

std::uint32_t readCount(Stream& stream, std::uint64_t itemBytes, std::string_view what) {
  const auto count = get<std::uint32_t>(stream);
  if (const auto left = bytesLeft(stream); left && count * itemBytes > *left) {
    raise<exception>("base::Attribute::read",
                     fmt::format("stream '{}': {} {} need at least {} bytes, but only {} bytes are left",
                                 clipped(stream.name()), count, what, count * itemBytes, *left));
  }
  return count;
}

namespace {

// Whether this thread is counting a member's bytes. The members nested in it then write once:
// their lengths' values do not change the count, and counting each nested member again at
// every level would cost twice as much per level of nesting.
thread_local bool countingMember = false;

}  // namespace

// A member's binary form preceded by its byte length, which a first pass counts: no stream
// has to go back and no form is buffered (a list's elements are counted as one block).
void writeSized(Stream& stream, const Attribute& attr, BinaryContext& context) {
  if (countingMember) {
    binary::put(stream, std::uint32_t{0});
    attr.write(stream, context);
    return;
  }
  auto* counter = new ByteCounter;
  Stream counting = Stream::adopt(counter);
  struct Counting {
    Counting() { countingMember = true; }
    ~Counting() { countingMember = false; }
  };
  {
    const Counting guard;
    attr.write(counting, context);
  }
  if (counter->total > 0xFFFFFFFFu) {
    raise<exception>("base::AttribMap::write", fmt::format("A member of type '{}' takes {} bytes, more than 4 GiB",
                                                           text(attr.type()), counter->total));
  }
  binary::put(stream, static_cast<std::uint32_t>(counter->total));
  attr.write(stream, context);
}

void readSized(Stream& stream, Attribute& attr, BinaryContext& context, std::uint32_t length) {
  if (!stream.has(capPosition)) {
    attr.read(stream, context);
    return;
  }
  const std::int64_t start = stream.getPosition();
  attr.read(stream, context);
  const std::int64_t used = stream.getPosition() - start;
  if (used > length) {
    raise<exception>("base::Attribute::read", fmt::format("stream '{}': a member of type '{}' took {} bytes of its {}",
                                                          clipped(stream.name()), text(attr.type()), used, length));
  }
  stream.setPosition(start + length);
}

}  // namespace binary
}  // namespace base
