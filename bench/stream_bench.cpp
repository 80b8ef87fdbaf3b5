#include "b_stream.h"

#include <benchmark/benchmark.h>

#include <algorithm>
#include <cstring>
#include <vector>

namespace {

constexpr std::size_t sourceSize = 64 << 20;
constexpr std::uint32_t bufferSize = 0x40000;

// A source that is not in memory as far as the buffers can tell (no 0x40), like a file:
// every byte must come through read.
class ColdSource final : public base::StreamWorker {
 public:
  explicit ColdSource(const std::vector<char>& data)
      : StreamWorker(base::capRead | base::capPosition | base::capSize, "cold"), m_data(data) {}
  std::uint32_t read(void* buffer, std::uint32_t count) override {
    const auto n = static_cast<std::uint32_t>(std::min<std::size_t>(count, m_data.size() - m_position));
    std::memcpy(buffer, m_data.data() + m_position, n);
    m_position += n;
    return n;
  }
  std::int64_t getPosition() override { return static_cast<std::int64_t>(m_position); }
  std::int64_t setPosition(std::int64_t offset, std::uint32_t) override {
    m_position = static_cast<std::size_t>(std::clamp<std::int64_t>(offset, 0, getSize()));
    return getPosition();
  }
  std::int64_t getSize() override { return static_cast<std::int64_t>(m_data.size()); }
  bool isEOF() override { return m_position >= m_data.size(); }

 private:
  const std::vector<char>& m_data;
  std::size_t m_position = 0;
};

const std::vector<char>& sourceData() {
  static const std::vector<char> data = [] {
    std::vector<char> bytes(sourceSize);
    for (std::size_t i = 0; i < bytes.size(); ++i) bytes[i] = static_cast<char>(i * 31);
    return bytes;
  }();
  return data;
}

void reportRate(benchmark::State& state) {
  state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations()) * sourceSize);
}

// One read call per byte through the char stream: the ceiling of a byte-wise text parser.
void BM_CharStreamBytes(benchmark::State& state) {
  for (auto _ : state) {
    base::Stream chars = base::charStream(base::Stream::adopt(new ColdSource(sourceData())), bufferSize);
    char byte;
    unsigned sum = 0;
    while (chars.read(&byte, 1) == 1) sum += static_cast<unsigned char>(byte);
    benchmark::DoNotOptimize(sum);
  }
  reportRate(state);
}
BENCHMARK(BM_CharStreamBytes)->Unit(benchmark::kMillisecond);

// Block reads through the buffered reader, at the block sizes a binary body reader uses.
void BM_BufReadBlocks(benchmark::State& state) {
  std::vector<char> block(static_cast<std::size_t>(state.range(0)));
  for (auto _ : state) {
    base::Stream buffered = base::bufReadStream(base::Stream::adopt(new ColdSource(sourceData())), 0, bufferSize);
    while (buffered.read(block.data(), static_cast<std::uint32_t>(block.size())) == block.size()) {
    }
    benchmark::DoNotOptimize(block.data());
  }
  reportRate(state);
}
BENCHMARK(BM_BufReadBlocks)->Arg(4)->Arg(64)->Arg(4096)->Arg(1 << 20)->Unit(benchmark::kMillisecond);

}  // namespace
