// Feeds arbitrary bytes to the PLY reader from every kind of source: memory, a file-like
// stream, a pipe (no size: the header cannot bound the counts) and a read buffer over a pipe
// (it cannot go back far), with a receiver that touches every delivered value.

#include "ply_parser.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>

namespace {

struct Touch {
  std::uint64_t sum = 0;
  bool plyElement(const ply::Element&) { return true; }
  void beginInstance(std::uint32_t index) { sum += index; }
  void plyProperty(const ply::Element&, const ply::Property& property, const ply::ValueArray& values) {
    for (const ply::Value& value : values)
      sum += static_cast<std::uint64_t>(value.convertTo<std::int64_t>(property.type));
  }
};

// A source without memory access, so that the reader's own buffering is exercised; without
// position and size it is a pipe.
class Cold final : public base::StreamWorker {
 public:
  Cold(const std::uint8_t* data, std::size_t size, std::uint32_t capabilities)
      : StreamWorker(capabilities, "fuzz"), m_data(data), m_size(size) {}
  std::uint32_t read(void* buffer, std::uint32_t count) override {
    const std::size_t n = std::min<std::size_t>(count, m_size - m_position);
    std::memcpy(buffer, m_data + m_position, n);
    m_position += n;
    return static_cast<std::uint32_t>(n);
  }
  std::int64_t setPosition(std::int64_t offset, std::uint32_t) override {
    m_position = static_cast<std::size_t>(std::clamp<std::int64_t>(offset, 0, static_cast<std::int64_t>(m_size)));
    return getPosition();
  }
  std::int64_t getPosition() override { return static_cast<std::int64_t>(m_position); }
  std::int64_t getSize() override { return static_cast<std::int64_t>(m_size); }

 private:
  const std::uint8_t* m_data;
  std::size_t m_size;
  std::size_t m_position = 0;
};

enum class Source { memory, file, pipe, bufferedPipe };

base::Stream open(const std::uint8_t* data, std::size_t size, Source source) {
  constexpr std::uint32_t file = base::capRead | base::capPosition | base::capSize;
  switch (source) {
    case Source::memory:
      return base::memStream(data, static_cast<std::int64_t>(size), "fuzz");
    case Source::file:
      return base::Stream::adopt(new Cold(data, size, file));
    case Source::pipe:
      return base::Stream::adopt(new Cold(data, size, base::capRead));
    case Source::bufferedPipe:
      return base::bufReadStream(base::Stream::adopt(new Cold(data, size, base::capRead)), 0, 4096);
  }
  return {};
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  base::log().setLevel(0);
  for (Source source : {Source::memory, Source::file, Source::pipe, Source::bufferedPipe}) {
    base::Stream stream = open(data, size, source);
    ply::Header header;
    Touch touch;
    ply::readFile(header, stream, touch);
    // The header alone must leave any source readable at its body.
    base::Stream again = open(data, size, source);
    ply::Header alone;
    std::uint8_t rest[64];
    if (ply::parseHeader(alone, again)) again.read(rest, sizeof rest);
  }
  return 0;
}
