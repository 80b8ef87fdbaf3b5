// The whole import, from the scene factory's load to the finished scene (delta encoding
// included), of the generated files; and the delta encoding alone, to tell the shares apart.

#include "ply_bench_files.h"
#include "scene_factory.h"
#include "scene_index_delta.h"
#include "scene_schema.h"
#include "scene_schema_registry.h"

#include <benchmark/benchmark.h>

#include <filesystem>

namespace {

using bench::Encoding;
using bench::Shape;

scene::SceneFactory& plugins() {
  static scene::SceneFactory factory;
  static const bool loaded = [] {
    factory.reloadPlugins();
    return true;
  }();
  static_cast<void>(loaded);
  return factory;
}

void setRate(benchmark::State& state, const std::string& path) {
  state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * std::filesystem::file_size(path)));
}

void BM_PlyImport(benchmark::State& state, Shape shape, Encoding encoding) {
  const std::string path = bench::plyFile(shape, encoding);
  const base::AttribMap parameters;
  for (auto _ : state) {
    base::ref<base::PluginFactory> sceneFactory(new base::PluginFactory("scene"));
    scene::register_scene_schema(*sceneFactory);
    if (!plugins().load(*sceneFactory, path, parameters)) state.SkipWithError("import failed");
    benchmark::DoNotOptimize(sceneFactory->objects().data());
  }
  setRate(state, path);
}

// The encoding of the imported mesh's indices, started from the plain indices each time.
void BM_DeltaEncode(benchmark::State& state, Shape shape) {
  const std::string path = bench::plyFile(shape, Encoding::little);
  base::ref<base::PluginFactory> sceneFactory(new base::PluginFactory("scene"));
  scene::register_scene_schema(*sceneFactory);
  plugins().load(*sceneFactory, path, base::AttribMap());
  base::IPlugin& mesh = *sceneFactory->object(0);
  scene::decodeIndexDeltas(mesh);
  const base::vector<std::uint32_t> plain = *mesh.findVecAttribute<std::uint32_t>(scene::mesh_schema::indices());
  for (auto _ : state) {
    state.PauseTiming();
    mesh.attribute(scene::mesh_schema::indices(), plain);
    mesh.attribute(scene::mesh_schema::indicesDeltaCompression(), false);
    state.ResumeTiming();
    scene::encodeIndexDeltas(mesh);
  }
  state.SetItemsProcessed(static_cast<std::int64_t>(state.iterations() * plain.size()));
}

#define IMPORT_BENCHMARKS(shape, encoding) \
  BENCHMARK_CAPTURE(BM_PlyImport, shape##_##encoding, Shape::shape, Encoding::encoding)->Unit(benchmark::kMillisecond);

IMPORT_BENCHMARKS(mesh, little)
IMPORT_BENCHMARKS(mesh, big)
IMPORT_BENCHMARKS(mesh, ascii)
IMPORT_BENCHMARKS(cloud, little)
IMPORT_BENCHMARKS(cloud, ascii)
BENCHMARK_CAPTURE(BM_DeltaEncode, mesh, Shape::mesh)->Unit(benchmark::kMillisecond);

}  // namespace
