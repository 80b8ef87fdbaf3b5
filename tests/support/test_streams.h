#pragma once

#include "b_stream.h"

#include <algorithm>
#include <cstring>
#include <string>
#include <string_view>

namespace testing_support {

/// A source that is not in memory as far as callers can tell (no 0x40, no getMemory), like a
/// file: it reads, positions and has a size. Counts the reads that reach it.
class FileLikeWorker : public base::StreamWorker {
 public:
  FileLikeWorker(std::string data, std::uint32_t capabilities = base::capRead | base::capPosition | base::capSize)
      : StreamWorker(capabilities, "file-like"), m_data(std::move(data)) {}

  std::uint32_t read(void* buffer, std::uint32_t count) override {
    ++reads;
    const auto n = static_cast<std::uint32_t>(std::min<std::size_t>(count, m_data.size() - m_position));
    std::memcpy(buffer, m_data.data() + m_position, n);
    m_position += n;
    return n;
  }
  std::int64_t setPosition(std::int64_t offset, std::uint32_t origin) override {
    std::int64_t target =
        offset + (origin == base::seekCurrent ? getPosition() : 0) + (origin == base::seekEnd ? getSize() : 0);
    m_position = static_cast<std::size_t>(std::clamp<std::int64_t>(target, 0, getSize()));
    return getPosition();
  }
  std::int64_t getPosition() override { return static_cast<std::int64_t>(m_position); }
  std::int64_t getSize() override { return static_cast<std::int64_t>(m_data.size()); }
  bool isEOF() override { return m_position >= m_data.size(); }

  int reads = 0;

 private:
  std::string m_data;
  std::size_t m_position = 0;
};

/// A stream over `data` that is not in memory; `capabilities` may take away positioning.
inline base::Stream fileLikeStream(std::string data,
                                   std::uint32_t capabilities = base::capRead | base::capPosition | base::capSize) {
  return base::Stream::adopt(new FileLikeWorker(std::move(data), capabilities));
}

/// Where a test's bytes come from: memory; a file (it reads, positions and has a size); a
/// pipe (it only reads); a read buffer over a pipe (it positions only within its buffer).
enum class Source { memory, file, pipe, bufferedPipe };
inline constexpr Source allSources[] = {Source::memory, Source::file, Source::pipe, Source::bufferedPipe};

inline const char* sourceName(Source source) {
  constexpr const char* names[] = {"memory", "file", "pipe", "buffered pipe"};
  return names[static_cast<int>(source)];
}

/// A stream over a copy of `data`, of the kind `source` names.
inline base::Stream sourceStream(const std::string& data, Source source) {
  switch (source) {
    case Source::memory:
      return base::memStream(data.data(), static_cast<std::int64_t>(data.size()));
    case Source::file:
      return fileLikeStream(data);
    case Source::pipe:
      return fileLikeStream(data, base::capRead);
    case Source::bufferedPipe:
      return base::bufReadStream(fileLikeStream(data, base::capRead), 0, 4096);
  }
  return {};
}

/// Everything a stream has left, read through its handle.
inline std::string readAll(base::Stream& stream) {
  std::string result;
  char piece[4096];
  for (std::uint32_t got; (got = stream.read(piece, sizeof piece)) > 0;) result.append(piece, got);
  return result;
}

}  // namespace testing_support
