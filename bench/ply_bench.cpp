// Reading speed of the PLY reader against a floor measured in the same run: reading the file
// into memory and splitting its values into columns with the plainest loop (binary: copy and
// swap the records; ASCII: std::from_chars over every number). Both sides produce the same
// column arrays from the same file on disk.

#include "b_fs.h"
#include "ply_bench_files.h"
#include "ply_parser.h"

#include <benchmark/benchmark.h>
#include <malloc.h>

#ifdef __linux__
#  include <fcntl.h>
#  include <sys/mman.h>
#  include <unistd.h>
#endif

#include <algorithm>
#include <charconv>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <string>
#include <vector>

namespace {

#ifdef __GLIBC__
// Every large block comes fresh from the system, as it does in a new process: otherwise the
// allocator keeps the floor's file buffer from one iteration to the next, and the floor
// pays no page faults while the reader's arrays still do.
const int freshLargeBlocks = mallopt(M_MMAP_THRESHOLD, 1 << 20);
#endif

using bench::Encoding;
using bench::Shape;

// What both sides fill: one float column per scalar property, list items and counts.
struct Columns {
  std::vector<std::vector<float>> scalars;
  std::vector<std::int32_t> items;
  std::vector<std::uint32_t> counts;
};

// A file read through the stream interface, not in memory: the way an importer reads.
class FileSource final : public base::StreamWorker {
 public:
  explicit FileSource(const std::string& path)
      : StreamWorker(base::capRead | base::capPosition | base::capSize, path), m_file(std::fopen(path.c_str(), "rb")) {
    std::fseek(m_file, 0, SEEK_END);
    m_size = std::ftell(m_file);
    std::fseek(m_file, 0, SEEK_SET);
  }
  ~FileSource() override { std::fclose(m_file); }
  std::uint32_t read(void* buffer, std::uint32_t count) override {
    return static_cast<std::uint32_t>(std::fread(buffer, 1, count, m_file));
  }
  std::int64_t setPosition(std::int64_t offset, std::uint32_t) override {
    std::fseek(m_file, static_cast<long>(offset), SEEK_SET);
    return getPosition();
  }
  std::int64_t getPosition() override { return std::ftell(m_file); }
  std::int64_t getSize() override { return m_size; }
  bool isEOF() override { return getPosition() >= m_size; }

 private:
  std::FILE* m_file;
  std::int64_t m_size = 0;
};

// The arrays an application fills: positions, normals, colours (RGBA, normalised), texture
// coordinates, face indices and their counts. Filled through plans: whole columns at once.
struct PlainArrays {
  base::vector<float> positions, normals, colors, uvs;
  base::vector<std::uint32_t> indices;
  base::vector<std::uint16_t> counts;
};

class PlanReceiver {
 public:
  explicit PlanReceiver(PlainArrays& arrays) : m_arrays(arrays) {}

  bool plyElement(const ply::Element& element) {
    return element.semantic == ply::ElementSemantic::vertex || element.semantic == ply::ElementSemantic::face;
  }
  void beginInstance(std::uint32_t) {}
  void plyProperty(const ply::Element&, const ply::Property&, const ply::ValueArray&) {}

  bool plyPlan(const ply::Element& element, ply::ElementPlan& plan) {
    using S = ply::PropertySemantic;
    const std::uint32_t colorWidth = channels(element);
    const std::uint32_t positions = addArray(plan, m_arrays.positions, 3);
    const std::uint32_t normals = addArray(plan, m_arrays.normals, 3);
    const std::uint32_t colors = addArray(plan, m_arrays.colors, colorWidth);
    const std::uint32_t uvs = addArray(plan, m_arrays.uvs, 2);
    base::append(plan.sinks, ply::ListSink{&m_arrays.indices, ply::ListSink::noRangeCheck, &m_arrays.counts});
    for (const ply::Property& property : element.properties) {
      ply::PropertyPlan target{ply::PropertyPlan::Kind::scalar};
      const auto semantic = static_cast<std::uint32_t>(property.semantic);
      if (property.semantic == S::vertexIndex) {
        target.kind = ply::PropertyPlan::Kind::indices;
      } else if (semantic <= static_cast<std::uint32_t>(S::z)) {
        target = {ply::PropertyPlan::Kind::scalar, ply::Conversion::toFloat, positions, 4 * semantic};
      } else if (semantic <= static_cast<std::uint32_t>(S::nz)) {
        target = {ply::PropertyPlan::Kind::scalar, ply::Conversion::toFloat, normals, 4 * (semantic - 3)};
      } else if (semantic <= static_cast<std::uint32_t>(S::v)) {
        target = {ply::PropertyPlan::Kind::scalar, ply::Conversion::toFloat, uvs, 4 * (semantic - 6)};
      } else if (semantic <= static_cast<std::uint32_t>(S::alpha)) {
        target = {ply::PropertyPlan::Kind::scalar, ply::Conversion::normalised, colors, 4 * (semantic - 8)};
      } else {
        target.kind = ply::PropertyPlan::Kind::skip;
      }
      base::append(plan.properties, target);
    }
    return true;
  }

 private:
  static std::uint32_t channels(const ply::Element& element) {
    for (const ply::Property& property : element.properties) {
      if (property.semantic == ply::PropertySemantic::alpha) return 4;
    }
    return 3;
  }

  static std::uint32_t addArray(ply::ElementPlan& plan, base::vector<float>& array, std::uint32_t width) {
    base::append(plan.arrays, ply::RecordArray{[&array, width](std::size_t records) {
                                                 array.resize(records * width);
                                                 return reinterpret_cast<std::byte*>(array.data());
                                               },
                                               4 * width});
    return static_cast<std::uint32_t>(plan.arrays.size() - 1);
  }

  PlainArrays& m_arrays;
};

class ColumnReceiver {
 public:
  explicit ColumnReceiver(Columns& columns) : m_columns(columns) {}

  bool plyElement(const ply::Element& element) {
    m_first = m_columns.scalars.size();
    for (const ply::Property& property : element.properties) {
      m_columns.scalars.emplace_back();
      if (!property.isList) m_columns.scalars.back().reserve(element.count);
    }
    return true;
  }
  void beginInstance(std::uint32_t) {}
  void plyProperty(const ply::Element& element, const ply::Property& property, const ply::ValueArray& values) {
    if (!property.isList) {
      m_columns.scalars[m_first + static_cast<std::size_t>(&property - element.properties.data())].push_back(
          values[0].convertTo<float>(property.type));
      return;
    }
    m_columns.counts.push_back(static_cast<std::uint32_t>(values.size()));
    for (const ply::Value& value : values) {
      m_columns.items.push_back(static_cast<std::int32_t>(value.convertTo<std::int64_t>(property.type)));
    }
  }

 private:
  Columns& m_columns;
  std::size_t m_first = 0;
};

// The layout the floor loops know in advance: per element its count and per property
// whether it is a float, a uchar, or a list of ints with a uchar count.
enum class Kind { real, byte, list };
struct ElementLayout {
  std::size_t count;
  std::vector<Kind> kinds;
};

std::vector<ElementLayout> layout(Shape shape) {
  using enum Kind;
  if (shape == Shape::mesh) {
    return {{1'000'000, {real, real, real, real, real, real, byte, byte, byte, byte, real, real}}, {2'000'000, {list}}};
  }
  return {{2'000'000, {real, real, real, byte, byte, byte}}};
}

std::vector<char> readWhole(const std::string& path) {
  std::vector<char> data(std::filesystem::file_size(path));
  std::FILE* file = std::fopen(path.c_str(), "rb");
  const std::size_t got = std::fread(data.data(), 1, data.size(), file);
  std::fclose(file);
  data.resize(got);
  return data;
}

const char* bodyStart(const std::vector<char>& data) {
  const char* marker = "end_header\n";
  return std::search(data.data(), data.data() + data.size(), marker, marker + std::strlen(marker)) +
         std::strlen(marker);
}

// Adds the element's columns with room for its values; returns the first one's index.
std::size_t addColumns(Columns& columns, const ElementLayout& element) {
  const std::size_t first = columns.scalars.size();
  columns.scalars.resize(first + element.kinds.size());
  for (std::size_t p = first; p < columns.scalars.size(); ++p) columns.scalars[p].reserve(element.count);
  return first;
}

template <bool Swap>
std::uint32_t load32(const char* at) {
  std::uint32_t raw;
  std::memcpy(&raw, at, 4);
  return Swap ? __builtin_bswap32(raw) : raw;
}

template <bool Swap>
void splitBinary(const std::vector<char>& data, Shape shape, Columns& columns) {
  const char* at = bodyStart(data);
  for (const ElementLayout& element : layout(shape)) {
    const std::size_t first = addColumns(columns, element);
    for (std::size_t i = 0; i < element.count; ++i) {
      for (std::size_t p = 0; p < element.kinds.size(); ++p) {
        switch (element.kinds[p]) {
          case Kind::real:
            columns.scalars[first + p].push_back(std::bit_cast<float>(load32<Swap>(at)));
            at += 4;
            break;
          case Kind::byte:
            columns.scalars[first + p].push_back(static_cast<unsigned char>(*at));
            at += 1;
            break;
          case Kind::list: {
            const auto count = static_cast<unsigned char>(*at++);
            columns.counts.push_back(count);
            for (unsigned k = 0; k < count; ++k, at += 4)
              columns.items.push_back(static_cast<std::int32_t>(load32<Swap>(at)));
            break;
          }
        }
      }
    }
  }
}

void splitAscii(const std::vector<char>& data, Shape shape, Columns& columns) {
  const char* at = bodyStart(data);
  const char* end = data.data() + data.size();
  auto skipBlanks = [&] {
    while (at != end && (*at == ' ' || *at == '\n' || *at == '\r' || *at == '\t')) ++at;
  };
  auto number = [&](auto& value) {
    skipBlanks();
    at = std::from_chars(at, end, value).ptr;
  };
  for (const ElementLayout& element : layout(shape)) {
    const std::size_t first = addColumns(columns, element);
    for (std::size_t i = 0; i < element.count; ++i) {
      for (std::size_t p = 0; p < element.kinds.size(); ++p) {
        if (element.kinds[p] != Kind::list) {
          float value = 0;
          if (element.kinds[p] == Kind::real) {
            number(value);
          } else {
            unsigned byte = 0;
            number(byte);
            value = static_cast<float>(byte);
          }
          columns.scalars[first + p].push_back(value);
          continue;
        }
        unsigned count = 0;
        number(count);
        columns.counts.push_back(count);
        for (unsigned k = 0; k < count; ++k) {
          std::int32_t item = 0;
          number(item);
          columns.items.push_back(item);
        }
      }
    }
  }
}

void setRate(benchmark::State& state, const std::string& path) {
  state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * std::filesystem::file_size(path)));
}

void BM_PlyParse(benchmark::State& state, Shape shape, Encoding encoding) {
  const std::string path = bench::plyFile(shape, encoding);
  for (auto _ : state) {
    Columns columns;
    ColumnReceiver receiver(columns);
    base::Stream stream = base::Stream::adopt(new FileSource(path));
    ply::Header header;
    if (!ply::parseFile(header, stream, receiver)) state.SkipWithError("parse failed");
    benchmark::DoNotOptimize(columns.items.data());
  }
  setRate(state, path);
}

void BM_PlyColumns(benchmark::State& state, Shape shape, Encoding encoding) {
  const std::string path = bench::plyFile(shape, encoding);
  for (auto _ : state) {
    PlainArrays arrays;
    PlanReceiver receiver(arrays);
    base::Stream stream = base::Stream::adopt(new FileSource(path));
    ply::Header header;
    if (!ply::parseFile(header, stream, receiver)) state.SkipWithError("parse failed");
    benchmark::DoNotOptimize(arrays.positions.data());
    benchmark::DoNotOptimize(arrays.indices.data());
  }
  setRate(state, path);
}

// Every 4 bytes of a block touched.
std::uint32_t touch(const char* data, std::size_t size) {
  std::uint32_t sum = 0;
  for (std::size_t at = 0; at + 4 <= size; at += 4) sum += load32<false>(data + at);
  return sum;
}

// The floor for binary files: the file read into a fresh buffer, and every 4 bytes touched.
void BM_FloorReadTouch(benchmark::State& state, Shape shape, Encoding encoding) {
  const std::string path = bench::plyFile(shape, encoding);
  for (auto _ : state) {
    const std::vector<char> data = readWhole(path);
    benchmark::DoNotOptimize(touch(data.data(), data.size()));
  }
  setRate(state, path);
}

// The two ways a reader can get at a file's bytes, each touching every 4 bytes: through the
// master file system's stream into one reused 256 KiB buffer (the importer's way), and as a
// view of the whole file mapped into memory.
void BM_ReadMasterStream(benchmark::State& state, Shape shape, Encoding encoding) {
  const std::string path = bench::plyFile(shape, encoding);
  std::vector<char> buffer(1 << 18);
  for (auto _ : state) {
    base::Stream stream = base::fs::master().open(path, base::fs::openForReading);
    std::uint32_t sum = 0;
    while (const std::uint32_t got = stream.read(buffer.data(), static_cast<std::uint32_t>(buffer.size()))) {
      sum += touch(buffer.data(), got);
    }
    benchmark::DoNotOptimize(sum);
  }
  setRate(state, path);
}

#ifdef __linux__
void BM_ReadMapped(benchmark::State& state, Shape shape, Encoding encoding) {
  const std::string path = bench::plyFile(shape, encoding);
  const std::size_t size = std::filesystem::file_size(path);
  for (auto _ : state) {
    const int file = open(path.c_str(), O_RDONLY);
    void* view = mmap(nullptr, size, PROT_READ, MAP_PRIVATE, file, 0);
    if (view == MAP_FAILED) state.SkipWithError("mmap failed");
    benchmark::DoNotOptimize(touch(static_cast<const char*>(view), size));
    munmap(view, size);
    close(file);
  }
  setRate(state, path);
}
BENCHMARK_CAPTURE(BM_ReadMapped, mesh_little, Shape::mesh, Encoding::little)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(BM_ReadMapped, cloud_little, Shape::cloud, Encoding::little)->Unit(benchmark::kMillisecond);
#endif
BENCHMARK_CAPTURE(BM_ReadMasterStream, mesh_little, Shape::mesh, Encoding::little)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(BM_ReadMasterStream, cloud_little, Shape::cloud, Encoding::little)->Unit(benchmark::kMillisecond);

void BM_FloorReadFile(benchmark::State& state, Shape shape, Encoding encoding) {
  const std::string path = bench::plyFile(shape, encoding);
  for (auto _ : state) benchmark::DoNotOptimize(readWhole(path).data());
  setRate(state, path);
}

void BM_FloorSplit(benchmark::State& state, Shape shape, Encoding encoding) {
  const std::string path = bench::plyFile(shape, encoding);
  for (auto _ : state) {
    Columns columns;
    const std::vector<char> data = readWhole(path);
    switch (encoding) {
      case Encoding::ascii:
        splitAscii(data, shape, columns);
        break;
      case Encoding::little:
        splitBinary<false>(data, shape, columns);
        break;
      case Encoding::big:
        splitBinary<true>(data, shape, columns);
        break;
    }
    benchmark::DoNotOptimize(columns.items.data());
  }
  setRate(state, path);
}

#define PLY_BENCH(shape, encoding)                                                                                     \
  BENCHMARK_CAPTURE(BM_PlyColumns, shape##_##encoding, Shape::shape, Encoding::encoding)                               \
      ->Unit(benchmark::kMillisecond);                                                                                 \
  BENCHMARK_CAPTURE(BM_PlyParse, shape##_##encoding, Shape::shape, Encoding::encoding)->Unit(benchmark::kMillisecond); \
  BENCHMARK_CAPTURE(BM_FloorReadTouch, shape##_##encoding, Shape::shape, Encoding::encoding)                           \
      ->Unit(benchmark::kMillisecond);                                                                                 \
  BENCHMARK_CAPTURE(BM_FloorSplit, shape##_##encoding, Shape::shape, Encoding::encoding)                               \
      ->Unit(benchmark::kMillisecond);                                                                                 \
  BENCHMARK_CAPTURE(BM_FloorReadFile, shape##_##encoding, Shape::shape, Encoding::encoding)                            \
      ->Unit(benchmark::kMillisecond)

PLY_BENCH(mesh, ascii);
PLY_BENCH(mesh, little);
PLY_BENCH(mesh, big);
PLY_BENCH(cloud, ascii);
PLY_BENCH(cloud, little);
PLY_BENCH(cloud, big);

}  // namespace
