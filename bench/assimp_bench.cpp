// The reference importer: Debian's assimp reading the same generated files into its own scene
// (no post-processing), built only when the package is installed.

#include "ply_bench_files.h"

#include <assimp/scene.h>
#include <benchmark/benchmark.h>
#include <assimp/Importer.hpp>

#include <filesystem>

namespace {

using bench::Encoding;
using bench::Shape;

void BM_AssimpImport(benchmark::State& state, Shape shape, Encoding encoding) {
  const std::string path = bench::plyFile(shape, encoding);
  for (auto _ : state) {
    Assimp::Importer importer;
    const aiScene* scene = importer.ReadFile(path, 0);
    if (!scene) state.SkipWithError(importer.GetErrorString());
    benchmark::DoNotOptimize(scene);
  }
  state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * std::filesystem::file_size(path)));
}

#define ASSIMP_BENCHMARK(shape, encoding)                                                  \
  BENCHMARK_CAPTURE(BM_AssimpImport, shape##_##encoding, Shape::shape, Encoding::encoding) \
      ->Unit(benchmark::kMillisecond);

ASSIMP_BENCHMARK(mesh, little)
ASSIMP_BENCHMARK(mesh, big)
ASSIMP_BENCHMARK(mesh, ascii)
ASSIMP_BENCHMARK(cloud, little)
ASSIMP_BENCHMARK(cloud, big)
ASSIMP_BENCHMARK(cloud, ascii)

}  // namespace
