#pragma once

#include "b_alloc.h"
#include "b_stream.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>

namespace ply {

/// The reader's own window over a stream: a 256 KiB buffer refilled from the stream, or,
/// for a stream whose data lies in memory, the stream's memory itself. Text is read byte by
/// byte with one byte of pushback; binary values are read straight out of the window.
/// When the window goes, the stream is put back at the first byte that was not consumed
/// (when it can position); a stream that cannot go back that far is logged (debug level),
/// never thrown.
class ByteWindow {
  struct FreeBytes {
    void operator()(std::uint8_t* bytes) const noexcept { base::StdAllocPolicy::deallocateBytes(bytes); }
  };

 public:
  static constexpr std::uint32_t defaultCapacity = 0x40000;

  /// A capacity of 1 reads the stream byte by byte, never further than a peek.
  explicit ByteWindow(base::Stream& stream, std::uint32_t capacity = defaultCapacity);
  ~ByteWindow();
  ByteWindow(const ByteWindow&) = delete;
  ByteWindow& operator=(const ByteWindow&) = delete;

  /// The next byte without consuming it; -1 at the end of the data.
  int peek() {
    if (m_cursor == m_end && !refill(1)) return -1;
    return *m_cursor;
  }
  /// The next byte, consumed; -1 at the end of the data.
  int get() {
    if (m_cursor == m_end && !refill(1)) return -1;
    return *m_cursor++;
  }
  /// Gives back the byte that the last get() consumed.
  void unget() { --m_cursor; }

  /// `count` contiguous bytes at the cursor, not consumed; null when the data ends first
  /// (then a stream that reports short reads throws instead).
  const std::uint8_t* require(std::size_t count) {
    if (static_cast<std::size_t>(m_end - m_cursor) >= count) return m_cursor;
    return refill(count) ? m_cursor : failShort(count);
  }
  /// Consumes `count` bytes that require() made available.
  void advance(std::size_t count) { m_cursor += count; }
  /// Consumes `count` bytes; false when the data ends first (what there was is consumed).
  bool skip(std::uint64_t count);

  /// Bytes at the cursor that need no refill.
  const std::uint8_t* cursor() const { return m_cursor; }
  const std::uint8_t* end() const { return m_end; }
  /// Largest request that require() can always serve.
  std::size_t capacity() const { return m_capacity; }

  /// Bytes consumed since the window was made.
  std::uint64_t position() const { return m_consumedBefore + static_cast<std::uint64_t>(m_cursor - m_begin); }
  /// Bytes left in the data when the stream knows its size.
  std::optional<std::uint64_t> remaining() const;

  /// Bytes taken from the stream but not consumed.
  std::uint64_t readAhead() const { return m_inMemory ? 0 : static_cast<std::uint64_t>(m_end - m_cursor); }
  /// Puts the stream at the first byte not consumed; false when it cannot go back that far.
  /// Runs once: the window is of no further use after it.
  bool giveBack() noexcept;

 private:
  bool refill(std::size_t count);
  /// Makes the buffer `size` bytes long, keeping its bytes; new bytes are left unfilled, as
  /// every byte is written by a read before it is looked at.
  void resizeBuffer(std::size_t size);
  const std::uint8_t* failShort(std::size_t count);

  base::Stream& m_stream;
  std::unique_ptr<std::uint8_t[], FreeBytes> m_buffer;
  std::size_t m_bufferSize = 0;
  const std::uint8_t* m_begin = nullptr;
  const std::uint8_t* m_cursor = nullptr;
  const std::uint8_t* m_end = nullptr;
  std::uint64_t m_consumedBefore = 0;  ///< bytes consumed before m_begin
  std::int64_t m_origin = 0;           ///< stream position when the window was made
  std::size_t m_capacity;
  bool m_inMemory;
  bool m_throwOnShortRead;
  bool m_givenBack = false;
};

}  // namespace ply
