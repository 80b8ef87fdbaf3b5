#include "ply_window.h"

#include "b_exception.h"
#include "b_log.h"

#include <fmt/format.h>

#include <algorithm>
#include <cstring>

namespace ply {

ByteWindow::ByteWindow(base::Stream& stream, std::uint32_t capacity)
    : m_stream(stream),
      m_capacity(capacity),
      m_inMemory(stream.has(base::capInMemory)),
      // A stream used directly keeps its flags; buffered reading never reports short reads.
      m_throwOnShortRead(m_inMemory && (stream.flags & base::throwOnShortRead)) {
  if (stream.has(base::capPosition)) m_origin = stream.getPosition();
  if (m_inMemory) {
    std::int64_t offset = 0;
    std::int64_t size = 0;
    const std::uint8_t* block = stream.worker()->getMemory(&offset, &size);
    const std::int64_t start = std::clamp<std::int64_t>(m_origin, 0, size);
    m_begin = m_cursor = block ? block + offset + start : nullptr;
    m_end = block ? block + offset + size : nullptr;
    return;
  }
  // A small file needs no more than its own size and a byte to see its end; every item of
  // any type still fits.
  constexpr std::size_t smallest = 4096;
  if (stream.has(base::capSize) && m_capacity > smallest) {
    const auto left = static_cast<std::uint64_t>(std::max<std::int64_t>(stream.getSize() - m_origin, 0));
    m_capacity = static_cast<std::size_t>(std::clamp<std::uint64_t>(left + 1, smallest, m_capacity));
  }
  resizeBuffer(m_capacity);
  m_begin = m_cursor = m_end = m_buffer.get();
}

void ByteWindow::resizeBuffer(std::size_t size) {
  std::unique_ptr<std::uint8_t[], FreeBytes> grown(static_cast<std::uint8_t*>(
      base::StdAllocPolicy::allocateBytes(size, __FILE__, __LINE__, "ply::ByteWindow::resizeBuffer")));
  if (m_bufferSize) std::memcpy(grown.get(), m_buffer.get(), std::min(size, m_bufferSize));
  m_buffer = std::move(grown);
  m_bufferSize = size;
}

ByteWindow::~ByteWindow() {
  const std::uint64_t ahead = readAhead();
  if (giveBack()) return;
  try {
    // Only the body reader ends here with bytes read ahead: they lie past the data it read
    // (or past where it stopped on an error that was reported), so this is no loss.
    base::log().message(base::logIO, base::logDebug, "stream '{}': {} bytes read ahead could not be given back",
                        base::clipped(m_stream.name()), ahead);
  } catch (...) {
    // Nothing may leave a destructor; the log failing leaves nothing else to tell.
  }
}

bool ByteWindow::giveBack() noexcept {
  if (m_givenBack) return true;
  m_givenBack = true;
  if (!m_stream.has(base::capPosition)) return readAhead() == 0;
  try {
    const std::int64_t target = m_origin + static_cast<std::int64_t>(position());
    return m_stream.setPosition(target) == target;
  } catch (...) {
    // A buffered source that cannot seek back as far as the window read ahead.
    return false;
  }
}

std::optional<std::uint64_t> ByteWindow::remaining() const {
  if (m_inMemory) return static_cast<std::uint64_t>(m_end - m_cursor);
  if (!m_stream.has(base::capSize)) return std::nullopt;
  const std::int64_t left = m_stream.getSize() - m_origin - static_cast<std::int64_t>(position());
  return static_cast<std::uint64_t>(std::max<std::int64_t>(left, 0));
}

bool ByteWindow::refill(std::size_t count) {
  if (m_inMemory || !m_stream.has(base::capRead)) return false;
  // Keep one consumed byte so that unget() works across a refill.
  const std::size_t keep = m_cursor > m_begin ? 1 : 0;
  const std::size_t unread = static_cast<std::size_t>(m_end - m_cursor);
  const std::size_t from = static_cast<std::size_t>(m_cursor - m_buffer.get()) - keep;
  m_consumedBefore += static_cast<std::uint64_t>(m_cursor - m_begin) - keep;
  // Growing moves the block: the pointers are rebuilt from offsets below.
  if (keep + count > m_bufferSize) resizeBuffer(keep + count);
  std::uint8_t* front = m_buffer.get();
  std::memmove(front, front + from, keep + unread);
  m_begin = front;
  m_cursor = front + keep;
  std::uint8_t* fill = front + keep + unread;
  const std::uint8_t* limit = front + m_bufferSize;
  while (static_cast<std::size_t>(fill - m_cursor) < count) {
    const std::uint32_t got = m_stream.worker()->read(fill, static_cast<std::uint32_t>(limit - fill));
    if (got == 0) break;
    fill += got;
  }
  m_end = fill;
  return static_cast<std::size_t>(m_end - m_cursor) >= count;
}

const std::uint8_t* ByteWindow::failShort(std::size_t count) {
  if (m_throwOnShortRead) {
    base::raise<base::exception>(
        "base::Stream::read", fmt::format("stream '{}': trying to read {} bytes, read {} bytes", m_stream.name(), count,
                                          static_cast<std::size_t>(m_end - m_cursor)));
  }
  return nullptr;
}

bool ByteWindow::skip(std::uint64_t count) {
  // A far skip seeks instead of reading what it passes over, when the size says the bytes
  // are there.
  const auto inWindow = static_cast<std::uint64_t>(m_end - m_cursor);
  const std::optional<std::uint64_t> left = remaining();
  if (count > inWindow && !m_inMemory && m_stream.has(base::capPosition) && left && *left >= count) {
    m_consumedBefore = position() + count;
    m_stream.setPosition(m_origin + static_cast<std::int64_t>(m_consumedBefore));
    m_begin = m_cursor = m_end = m_buffer.get();
    return true;
  }
  for (;;) {
    const auto inWindow = static_cast<std::uint64_t>(m_end - m_cursor);
    if (count <= inWindow) {
      m_cursor += count;
      return true;
    }
    count -= inWindow;
    m_cursor = m_end;
    if (!refill(1)) return failShort(static_cast<std::size_t>(std::min<std::uint64_t>(count, SIZE_MAX))) != nullptr;
  }
}

}  // namespace ply
