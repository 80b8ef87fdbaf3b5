#include "b_exception.h"
#include "b_stream.h"

#include <algorithm>
#include <cstring>

namespace base {
namespace {

std::int64_t clampPosition(std::int64_t target, std::int64_t size) { return std::clamp<std::int64_t>(target, 0, size); }

// Where setPosition aims before clamping; -1 for an origin it does not know.
bool seekTarget(std::int64_t offset, std::uint32_t origin, std::int64_t position, std::int64_t size,
                std::int64_t& target) {
  switch (origin) {
    case seekBegin:
      target = offset;
      return true;
    case seekCurrent:
      target = position + offset;
      return true;
    case seekEnd:
      target = size + offset;
      return true;
    default:
      return false;
  }
}

// A block in memory, owned (growing on writes past the end) or a read-only view of memory
// that the caller keeps alive.
class MemStreamWorker final : public StreamWorker {
 public:
  // Owned.
  explicit MemStreamWorker(base::vector<std::uint8_t>&& block)
      : StreamWorker(capsMemory, "memory"),
        m_block(std::move(block)),
        m_data(m_block.data()),
        m_size(static_cast<std::int64_t>(m_block.size())) {}
  // View.
  MemStreamWorker(const void* data, std::int64_t size, std::string_view name)
      : StreamWorker(capsMemoryView, name),
        m_data(size > 0 ? static_cast<const std::uint8_t*>(data) : nullptr),
        m_size(size > 0 ? size : 0),
        m_view(true) {}

  const std::uint8_t* getMemory(std::int64_t* offset, std::int64_t* size) override {
    if (offset) *offset = 0;
    if (size) *size = m_size;
    return m_data;
  }
  std::uint32_t read(void* buffer, std::uint32_t count) override {
    const auto n = static_cast<std::uint32_t>(std::min<std::int64_t>(count, m_size - m_position));
    if (n) std::memcpy(buffer, m_data + m_position, n);
    m_position += n;
    return n;
  }
  std::uint32_t write(const void* buffer, std::uint32_t count) override {
    if (m_view || count == 0) return 0;
    const std::int64_t end = m_position + count;
    if (end > m_size) resize(end);
    std::memcpy(m_block.data() + m_position, buffer, count);
    m_position = end;
    return count;
  }
  std::int64_t setPosition(std::int64_t offset, std::uint32_t origin) override {
    std::int64_t target = 0;
    if (seekTarget(offset, origin, m_position, m_size, target)) m_position = clampPosition(target, m_size);
    return m_position;
  }
  std::int64_t getPosition() override { return m_position; }
  std::int64_t getSize() override { return m_size; }
  void setSize(std::int64_t size) override {
    if (m_view) return;
    resize(std::max<std::int64_t>(size, 0));
    m_position = std::min(m_position, m_size);
  }
  bool isEOF() override { return m_position >= m_size; }
  void close() override {
    base::release(m_block);
    m_data = nullptr;
    m_size = 0;
    m_position = 0;
    StreamWorker::close();
  }

 private:
  void resize(std::int64_t size) {
    // Capacity grows by the growth rule; the size is exactly what was asked.
    base::reserveForAppend(m_block, static_cast<std::size_t>(size) - std::min(m_block.size(), std::size_t(size)));
    m_block.resize(static_cast<std::size_t>(size));
    m_data = m_block.data();
    m_size = size;
  }

  base::vector<std::uint8_t> m_block;
  const std::uint8_t* m_data = nullptr;
  std::int64_t m_size = 0;
  std::int64_t m_position = 0;
  bool m_view = false;
};

// One block per write; reads and seeks walk the chain.
class MemBlockStreamWorker final : public StreamWorker {
 public:
  MemBlockStreamWorker() : StreamWorker(capsReadWrite, "memory blocks") {}

  std::uint32_t read(void* buffer, std::uint32_t count) override {
    auto* out = static_cast<std::uint8_t*>(buffer);
    std::uint32_t done = 0;
    while (done < count && m_block < m_blocks.size()) {
      const auto& block = m_blocks[m_block];
      const auto n = static_cast<std::uint32_t>(std::min<std::size_t>(count - done, block.size() - m_offset));
      std::memcpy(out + done, block.data() + m_offset, n);
      done += n;
      m_offset += n;
      if (m_offset == block.size()) nextBlock();
    }
    m_position += done;
    return done;
  }
  std::uint32_t write(const void* buffer, std::uint32_t count) override {
    if (count == 0) return 0;
    const auto* bytes = static_cast<const std::uint8_t*>(buffer);
    base::append(m_blocks, base::vector<std::uint8_t>(bytes, bytes + count));
    // Writes append: afterwards the stream stands at its new end.
    m_size += count;
    m_position = m_size;
    m_block = m_blocks.size();
    m_offset = 0;
    return count;
  }
  std::int64_t setPosition(std::int64_t offset, std::uint32_t origin) override {
    std::int64_t target = 0;
    if (!seekTarget(offset, origin, m_position, m_size, target)) return m_position;
    m_position = clampPosition(target, m_size);
    m_block = 0;
    m_offset = static_cast<std::size_t>(m_position);
    while (m_block < m_blocks.size() && m_offset >= m_blocks[m_block].size()) {
      m_offset -= m_blocks[m_block].size();
      ++m_block;
    }
    return m_position;
  }
  std::int64_t getPosition() override { return m_position; }
  std::int64_t getSize() override { return m_size; }
  void setSize(std::int64_t size) override {
    if (size == m_size) return;
    if (size != 0) raise<exception>("base::memBlockSetSize", "memBlockStream do not support resizing!");
    m_blocks.clear();
    m_size = m_position = 0;
    m_block = m_offset = 0;
  }
  bool isEOF() override { return m_position >= m_size; }
  void close() override {
    base::release(m_blocks);
    StreamWorker::close();
  }

 private:
  void nextBlock() {
    ++m_block;
    m_offset = 0;
  }

  base::vector<base::vector<std::uint8_t>> m_blocks;
  std::size_t m_block = 0;
  std::size_t m_offset = 0;
  std::int64_t m_size = 0;
  std::int64_t m_position = 0;
};

// A caller's byte vector or string; writes past the end resize it.
template <class Container, bool Writable>
class ContainerStreamWorker final : public StreamWorker {
  using Reference = std::conditional_t<Writable, Container&, const Container&>;

 public:
  ContainerStreamWorker(Reference data, std::string_view name)
      : StreamWorker(Writable ? capsReadWrite : capsReadOnly, name), m_data(data) {}

  std::uint32_t read(void* buffer, std::uint32_t count) override {
    // The caller may have shrunk the container behind the stream's back.
    const auto n = static_cast<std::uint32_t>(std::clamp<std::int64_t>(size() - m_position, 0, count));
    if (n) std::memcpy(buffer, m_data.data() + m_position, n);
    m_position += n;
    return n;
  }
  std::uint32_t write(const void* buffer, std::uint32_t count) override {
    if constexpr (Writable) {
      const std::int64_t end = m_position + count;
      if (end > size()) m_data.resize(static_cast<std::size_t>(end));
      if (count) std::memcpy(m_data.data() + m_position, buffer, count);
      m_position = end;
      return count;
    } else {
      return 0;
    }
  }
  std::int64_t setPosition(std::int64_t offset, std::uint32_t origin) override {
    std::int64_t target = 0;
    if (seekTarget(offset, origin, m_position, size(), target)) m_position = clampPosition(target, size());
    return m_position;
  }
  std::int64_t getPosition() override { return m_position; }
  std::int64_t getSize() override { return size(); }
  void setSize(std::int64_t newSize) override {
    if constexpr (Writable) {
      m_data.resize(static_cast<std::size_t>(std::max<std::int64_t>(newSize, 0)));
      m_position = std::min(m_position, size());
    }
  }
  bool isEOF() override { return m_position >= size(); }

 private:
  std::int64_t size() const { return static_cast<std::int64_t>(m_data.size()); }

  Reference m_data;
  std::int64_t m_position = 0;
};

}  // namespace

Stream memStream(std::int64_t size) { return memStream(nullptr, size); }

Stream memStream(const void* data, std::int64_t size) {
  base::vector<std::uint8_t> block(static_cast<std::size_t>(std::max<std::int64_t>(size, 0)));
  if (data && !block.empty()) std::memcpy(block.data(), data, block.size());
  return Stream::adopt(new MemStreamWorker(std::move(block)));
}

Stream memStream(const void* data, std::int64_t size, std::string_view name) {
  return Stream::adopt(new MemStreamWorker(data, size, name));
}

Stream memStream(Stream& source) {
  const std::int64_t left =
      source.has(capSize) ? source.getSize() - (source.has(capPosition) ? source.getPosition() : 0) : 0;
  if (left <= 0 && source.has(capSize)) return memStream(0);
  if (left <= 0) {
    // A source without a size is copied until its end.
    Stream stream = memStream(0);
    copyStream(stream, source);
    stream.setPosition(0);
    return stream;
  }
  base::vector<std::uint8_t> block(static_cast<std::size_t>(left));
  std::int64_t done = 0;
  while (done < left) {
    // Reads take 32-bit counts.
    const auto piece = static_cast<std::uint32_t>(std::min<std::int64_t>(left - done, 0x80000000));
    const std::uint32_t got = source.read(block.data() + done, piece);
    done += got;
    if (got < piece) break;
  }
  block.resize(static_cast<std::size_t>(done));
  return Stream::adopt(new MemStreamWorker(std::move(block)));
}

Stream memBlockStream() { return Stream::adopt(new MemBlockStreamWorker); }

Stream vectorStream(base::vector<std::uint8_t>& data) {
  return Stream::adopt(new ContainerStreamWorker<base::vector<std::uint8_t>, true>(data, "vector"));
}
Stream vectorStream(const base::vector<std::uint8_t>& data) {
  return Stream::adopt(new ContainerStreamWorker<base::vector<std::uint8_t>, false>(data, "vector"));
}
Stream stringStream(base::string& data) {
  return Stream::adopt(new ContainerStreamWorker<base::string, true>(data, "string"));
}
Stream stringStream(const base::string& data) {
  return Stream::adopt(new ContainerStreamWorker<base::string, false>(data, "string"));
}

}  // namespace base
