// Feeds arbitrary bytes to the PLY reader, both from memory and through a stream that is
// not in memory, with a receiver that touches every delivered value.

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
    for (const ply::Value& value : values) sum += static_cast<std::uint64_t>(value.convertTo<std::int64_t>(property.type));
  }
};

// A source without memory access, so that the reader's own buffering is exercised.
class Cold final : public base::StreamWorker {
public:
  Cold(const std::uint8_t* data, std::size_t size)
      : StreamWorker(base::capRead | base::capPosition | base::capSize, "fuzz"), m_data(data), m_size(size) {}
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

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  base::log().setLevel(0);
  for (bool inMemory : {true, false}) {
    base::Stream stream = inMemory ? base::memStream(data, static_cast<std::int64_t>(size), "fuzz")
                                   : base::Stream::adopt(new Cold(data, size));
    ply::Header header;
    Touch touch;
    ply::readFile(header, stream, touch);
  }
  return 0;
}
