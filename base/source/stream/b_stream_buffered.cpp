#include "b_exception.h"
#include "b_log.h"
#include "b_stream.h"

#include <fmt/format.h>

#include <algorithm>
#include <cstring>
#include <limits>

namespace base {
namespace {

// Bytes of the old buffer kept at the front on a refill, so that a parser's short backward
// moves cost no source access.
constexpr std::uint32_t historySize = 64;

// A 16-byte aligned block from the host allocator.
class AlignedBuffer {
 public:
  explicit AlignedBuffer(std::uint32_t size)
      : m_data(static_cast<std::uint8_t*>(
            StdAlignAllocPolicy<16>::allocateBytes(size, __FILE__, __LINE__, "base::AlignedBuffer"))),
        m_size(size) {}
  ~AlignedBuffer() { release(); }
  AlignedBuffer(const AlignedBuffer&) = delete;
  AlignedBuffer& operator=(const AlignedBuffer&) = delete;

  std::uint8_t* data() const { return m_data; }
  std::uint32_t size() const { return m_size; }
  void release() {
    StdAlignAllocPolicy<16>::deallocateBytes(m_data);
    m_data = nullptr;
    m_size = 0;
  }

 private:
  std::uint8_t* m_data;
  std::uint32_t m_size;
};

// Common to both directions: the source handle with its flags cleared, so that it never
// throws inside the buffer, and the original tag and flags for getSource.
class BufferedWorker : public StreamWorker {
 public:
  BufferedWorker(std::uint32_t capabilities, const Stream& source, std::uint32_t bufferSize, std::string_view name)
      : StreamWorker(capabilities, name.empty() ? std::string_view(source.name()) : name),
        m_source(source),
        m_sourceTag(source.tag),
        m_sourceFlags(source.flags),
        m_buffer(std::max<std::uint32_t>(bufferSize, 1)) {
    m_source.flags = 0;
  }

  Stream getSource() override {
    Stream source = m_source;
    source.tag = m_sourceTag;
    source.flags = m_sourceFlags;
    return source;
  }

 protected:
  Stream m_source;
  std::uint64_t m_sourceTag;
  std::uint32_t m_sourceFlags;
  AlignedBuffer m_buffer;
};

// Buffered reading; positions count from where the source stood at creation. The buffer
// holds the source bytes [m_start, m_start + m_filled); m_cursor is the read position in it.
class BufReadWorker final : public BufferedWorker {
 public:
  BufReadWorker(std::uint32_t capabilities, const Stream& source, std::int64_t length, std::uint32_t bufferSize,
                std::string_view name, bool byteWise)
      : BufferedWorker(capabilities, source, bufferSize, name),
        m_base(source.has(capPosition) ? source.getPosition() : 0),
        m_length(length),
        m_byteWise(byteWise) {}

  const std::uint8_t* getMemory(std::int64_t* offset, std::int64_t* size) override {
    std::int64_t sourceOffset = 0;
    const std::uint8_t* block = m_source.worker()->getMemory(&sourceOffset, size);
    if (offset) *offset = sourceOffset + m_base;
    if (size) *size = getSize();
    return block;
  }

  std::uint32_t read(void* buffer, std::uint32_t count) override {
    if (m_byteWise) count = std::min<std::uint32_t>(count, 1);
    auto* out = static_cast<std::uint8_t*>(buffer);
    std::uint32_t done = 0;
    while (done < count) {
      if (m_cursor < m_filled) {
        const std::uint32_t n = std::min(count - done, m_filled - m_cursor);
        std::memcpy(out + done, m_buffer.data() + m_cursor, n);
        m_cursor += n;
        done += n;
      } else if (count - done >= m_buffer.size()) {
        done += readAround(out + done, count - done);
        break;
      } else if (!refill()) {
        break;
      }
    }
    return done;
  }

  std::int64_t setPosition(std::int64_t offset, std::uint32_t origin) override {
    std::int64_t target = offset;
    switch (origin) {
      case seekBegin:
        break;
      case seekCurrent:
        target += getPosition();
        break;
      case seekEnd:
        if (!m_source.has(capSize)) raise<unsupported_interface>("base::bufSetPosition", "Stream::getSize");
        target += getSize();
        break;
      default:
        raise<switch_exception>("base::bufSetPosition");
    }
    target = std::max<std::int64_t>(target, 0);
    if (m_source.has(capSize)) target = std::min(target, getSize());
    if (target >= m_start && target <= m_start + m_filled) {
      m_cursor = static_cast<std::uint32_t>(target - m_start);
    } else {
      moveSource(target);
    }
    return getPosition();
  }

  std::int64_t getPosition() override { return m_start + m_cursor; }

  std::int64_t getSize() override {
    const std::int64_t available = std::max<std::int64_t>(m_source.getSize() - m_base, 0);
    return m_length > 0 ? std::min(m_length, available) : available;
  }

  bool isEOF() override {
    if (m_cursor < m_filled) return false;
    // A window over a source without a size ends at its length, or a reader never stops.
    if (m_length > 0 && getPosition() >= m_length) return true;
    return m_source.has(capSize) ? getPosition() >= getSize() : m_source.isEOF();
  }

  void close() override {
    // Leave the source where this stream's reader stopped, not where read-ahead took it.
    if (m_source && m_source.has(capPosition)) m_source.setPosition(m_base + getPosition(), seekBegin);
    m_buffer.release();
    m_source.reset();
    StreamWorker::close();
  }

 private:
  // How many more bytes the window allows from `position`.
  std::uint32_t allowed(std::int64_t position, std::uint32_t wanted) const {
    if (m_length <= 0) return wanted;
    return static_cast<std::uint32_t>(std::clamp<std::int64_t>(m_length - position, 0, wanted));
  }

  bool refill() {
    // A tiny buffer keeps less history, so that a refill always has room for new bytes.
    const std::uint32_t keep = std::min({historySize, m_filled, m_buffer.size() / 2});
    std::memmove(m_buffer.data(), m_buffer.data() + m_filled - keep, keep);
    m_start += m_filled - keep;
    m_cursor = m_filled = keep;
    const std::uint32_t got = m_source.read(m_buffer.data() + keep, allowed(m_start + keep, m_buffer.size() - keep));
    m_filled += got;
    return got > 0;
  }

  // A request larger than the buffer goes straight to the source; its tail becomes the
  // history.
  std::uint32_t readAround(std::uint8_t* out, std::uint32_t count) {
    const std::int64_t position = getPosition();
    const std::uint32_t got = m_source.read(out, allowed(position, count));
    const std::uint32_t keep = std::min({historySize, got, m_buffer.size() / 2});
    std::memcpy(m_buffer.data(), out + got - keep, keep);
    m_start = position + got - keep;
    m_cursor = m_filled = keep;
    return got;
  }

  void moveSource(std::int64_t target) {
    const std::int64_t sourceAt = m_start + m_filled;
    if (m_source.has(capPosition)) {
      m_source.setPosition(m_base + target, seekBegin);
    } else if (target > sourceAt) {
      m_source.skip(static_cast<std::uint64_t>(target - sourceAt));
    } else {
      raise<unsupported_interface>("base::bufSetPosition", "Stream::setPosition");
    }
    m_start = target;
    m_cursor = m_filled = 0;
  }

  std::int64_t m_base;
  std::int64_t m_length;
  bool m_byteWise;
  std::int64_t m_start = 0;
  std::uint32_t m_filled = 0;
  std::uint32_t m_cursor = 0;
};

// Buffered writing: writes collect in the buffer and go to the destination when it is full.
class BufWriteWorker final : public BufferedWorker {
 public:
  using BufferedWorker::BufferedWorker;

  std::uint32_t write(const void* buffer, std::uint32_t count) override {
    const auto* in = static_cast<const std::uint8_t*>(buffer);
    const std::uint32_t space = m_buffer.size() - m_pending;
    if (count < space) {
      std::memcpy(m_buffer.data() + m_pending, in, count);
      m_pending += count;
      return count;
    }
    std::memcpy(m_buffer.data() + m_pending, in, space);
    m_pending += space;
    if (!writePending()) return space;
    if (count == space) return count;
    return space + writeSource(in + space, count - space);
  }

  std::int64_t getSize() override {
    writePending();
    return m_source.getSize();
  }

  void flush() override {
    writePending();
    m_source.worker()->flush();
  }

  void close() override {
    // Nothing is thrown here (release would only log it): the bytes left are logged instead.
    if (m_source && drainPending() > 0) {
      log().message(logIO, logError, "stream '{}': {} buffered bytes could not be written", name(), m_pending);
    }
    m_buffer.release();
    m_source.reset();
    StreamWorker::close();
  }

 private:
  // Writes what is pending and removes from the buffer what the destination took; returns
  // the bytes still pending.
  std::uint32_t drainPending() {
    if (m_pending == 0) return 0;
    const std::uint32_t written = m_source.write(m_buffer.data(), m_pending);
    std::memmove(m_buffer.data(), m_buffer.data() + written, m_pending - written);
    m_pending -= written;
    return m_pending;
  }

  // drainPending, then the short write is reported (once the buffer is right, so that a
  // later flush never writes the same bytes twice). False when bytes are still pending.
  bool writePending() {
    const std::uint32_t wanted = m_pending;
    if (drainPending() == 0) return true;
    reportShortWrite(wanted, wanted - m_pending);
    return false;
  }

  std::uint32_t writeSource(const std::uint8_t* data, std::uint32_t count) {
    const std::uint32_t written = m_source.write(data, count);
    if (written < count) reportShortWrite(count, written);
    return written;
  }

  void reportShortWrite(std::uint32_t count, std::uint32_t written) const {
    if (!(m_sourceFlags & throwOnShortWrite)) return;
    raise<exception>("base::Stream::write", fmt::format("stream '{}': trying to write {} bytes, written {} bytes",
                                                        m_source.name(), count, written));
  }

  std::uint32_t m_pending = 0;
};

std::uint32_t readCapabilities(const Stream& source) {
  std::uint32_t capabilities = capsBufferedRead;
  if (source.has(capSize)) capabilities |= capSize;
  if (source.has(capMemory)) capabilities |= capMemory;
  return capabilities;
}

Stream withTag(Stream stream, const Stream& source) {
  stream.tag = source.tag;
  return stream;
}

}  // namespace

Stream bufReadStream(const Stream& source, std::int64_t length, std::uint32_t bufferSize, std::string_view name) {
  if (source.has(capInMemory)) return source;
  return withTag(
      Stream::adopt(new BufReadWorker(readCapabilities(source), source, length, bufferSize, name, /*byteWise=*/false)),
      source);
}

Stream charStream(const Stream& source, std::uint32_t bufferSize, std::string_view name) {
  return withTag(
      Stream::adopt(new BufReadWorker(readCapabilities(source), source, 0, bufferSize, name, /*byteWise=*/true)),
      source);
}

Stream bufWriteStream(const Stream& destination, std::uint32_t bufferSize, std::string_view name) {
  const std::uint32_t capabilities = capsBufferedWrite | (destination.has(capSize) ? std::uint32_t(capSize) : 0u);
  return withTag(Stream::adopt(new BufWriteWorker(capabilities, destination, bufferSize, name)), destination);
}

}  // namespace base
