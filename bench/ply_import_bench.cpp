// The whole import, from the scene factory's load to the finished scene, of the generated
// files through the scene_ply plug-in loaded from disk. Each run is split into its phases by
// the importer's own debug messages (header; body with conversion; delta encoding; scene
// assembly), and on Linux its peak memory is set against the size of the scene it leaves.

#include "b_log.h"
#include "ply_bench_files.h"
#include "scene_factory.h"
#include "scene_index_delta.h"
#include "scene_schema.h"
#include "scene_schema_registry.h"

#include <benchmark/benchmark.h>

#include <array>
#include <chrono>
#include <filesystem>
#include <fstream>
#include <string>
#include <string_view>

namespace {

using bench::Encoding;
using bench::Shape;
using Clock = std::chrono::steady_clock;

// The phases of one import, ended by these debug messages of the reader and the importer;
// the last one ends when load returns.
constexpr std::array<std::string_view, 3> phaseEnds = {"Begin parsing the ply elements.", "Encoding the index deltas.",
                                                       "Building the scene."};
constexpr std::array<const char*, 4> phaseNames = {"header_ms", "body_ms", "delta_ms", "assembly_ms"};

class PhaseClock final : public base::LogSink {
 public:
  PhaseClock() : m_level(base::log().level()) {
    base::log().setLevel(base::logDebug);
    base::log().setStderr(false);
    base::log().addSink(this);
  }
  ~PhaseClock() override {
    base::log().removeSink(this);
    base::log().setStderr(true);
    base::log().setLevel(m_level);
  }
  void write(base::name_id, int, std::string_view text) override {
    for (std::size_t k = 0; k < phaseEnds.size(); ++k) {
      if (text == phaseEnds[k]) m_ends[k] = Clock::now();
    }
  }
  void start() { m_start = Clock::now(); }
  // Adds the phases of the import that ended now to `totals`, in milliseconds.
  void finish(std::array<double, 4>& totals) const {
    Clock::time_point from = m_start;
    for (std::size_t k = 0; k < totals.size(); ++k) {
      const Clock::time_point to = k < m_ends.size() ? m_ends[k] : Clock::now();
      totals[k] += std::chrono::duration<double, std::milli>(to - from).count();
      from = to;
    }
  }

 private:
  int m_level;
  Clock::time_point m_start;
  std::array<Clock::time_point, 3> m_ends;
};

#ifdef __linux__
// The process's resident memory in bytes, now ("VmRSS") or at its peak since the last reset
// ("VmHWM").
double residentBytes(std::string_view field) {
  std::ifstream status("/proc/self/status");
  std::string key;
  double kilobytes = 0;
  while (status >> key) {
    if (key.substr(0, key.size() - 1) == field) {
      status >> kilobytes;
      return kilobytes * 1024;
    }
  }
  return 0;
}
void resetPeak() { std::ofstream("/proc/self/clear_refs") << "5"; }
#endif

void setRate(benchmark::State& state, const std::string& path) {
  state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * std::filesystem::file_size(path)));
}

void BM_PlyImport(benchmark::State& state, Shape shape, Encoding encoding) {
  const std::string path = bench::plyFile(shape, encoding);
  // A splat cloud is imported with all its fields.
  base::AttribMap parameters;
  if (shape == Shape::splat) parameters.attribute(base::intern("importCustomProperties"), true);
  bench::plugins();  // loaded once, before the clock runs, as a host loads them at start-up
  PhaseClock phases;
  std::array<double, 4> totals{};
  double peak = 0, kept = 0;
  for (auto _ : state) {
    base::ref<base::PluginFactory> sceneFactory(new base::PluginFactory("scene"));
    scene::register_scene_schema(*sceneFactory);
#ifdef __linux__
    state.PauseTiming();
    resetPeak();
    const double before = residentBytes("VmRSS");
    state.ResumeTiming();
#endif
    phases.start();
    if (!bench::plugins().load(*sceneFactory, path, parameters)) state.SkipWithError("import failed");
    phases.finish(totals);
#ifdef __linux__
    state.PauseTiming();
    peak = std::max(peak, residentBytes("VmHWM") - before);
    kept = std::max(kept, residentBytes("VmRSS") - before);
    state.ResumeTiming();
#endif
    benchmark::DoNotOptimize(sceneFactory->objects().data());
  }
  for (std::size_t k = 0; k < totals.size(); ++k) {
    state.counters[phaseNames[k]] = totals[k] / static_cast<double>(state.iterations());
  }
  if (kept > 0) {
    state.counters["peak_MB"] = peak / 1e6;
    state.counters["scene_MB"] = kept / 1e6;
  }
  setRate(state, path);
}

// The encoding of the imported mesh's indices alone, from the faces in the file's order each
// time (the order an import meets).
void BM_DeltaEncode(benchmark::State& state, Shape shape) {
  const std::string path = bench::plyFile(shape, Encoding::little);
  base::ref<base::PluginFactory> sceneFactory(new base::PluginFactory("scene"));
  scene::register_scene_schema(*sceneFactory);
  base::AttribMap parameters;
  bench::plugins().load(*sceneFactory, path, parameters);
  base::IPlugin& mesh = *sceneFactory->object(0);
  const base::vector<std::uint32_t> inFileOrder = bench::meshIndices();
  for (auto _ : state) {
    state.PauseTiming();
    mesh.attribute(scene::mesh_schema::indices(), inFileOrder);
    mesh.attribute(scene::mesh_schema::indicesDeltaCompression(), false);
    state.ResumeTiming();
    scene::encodeIndexDeltas(mesh);
  }
  state.SetItemsProcessed(static_cast<std::int64_t>(state.iterations() * inFileOrder.size()));
}

#define IMPORT_BENCHMARKS(shape, encoding) \
  BENCHMARK_CAPTURE(BM_PlyImport, shape##_##encoding, Shape::shape, Encoding::encoding)->Unit(benchmark::kMillisecond);

IMPORT_BENCHMARKS(mesh, little)
IMPORT_BENCHMARKS(mesh, big)
IMPORT_BENCHMARKS(mesh, ascii)
IMPORT_BENCHMARKS(cloud, little)
IMPORT_BENCHMARKS(cloud, big)
IMPORT_BENCHMARKS(cloud, ascii)
IMPORT_BENCHMARKS(texcoordMesh, little)
IMPORT_BENCHMARKS(splat, little)
BENCHMARK_CAPTURE(BM_DeltaEncode, mesh, Shape::mesh)->Unit(benchmark::kMillisecond);

}  // namespace
