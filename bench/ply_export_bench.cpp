// Writing PLY: the generated mesh, imported once, exported through the scene factory in each
// encoding (the whole export: decoding the faces, laying out the columns, writing under a
// temporary name and putting the file in place), against the floor of writing the same
// bytes with one fwrite.

#include "b_fs.h"
#include "ply_bench_files.h"
#include "scene_schema_registry.h"

#include <benchmark/benchmark.h>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <memory>
#include <string>

namespace {

using bench::Encoding;
using bench::Shape;

// The binary mesh, imported once.
base::PluginFactory& meshScene() {
  static const base::ref<base::PluginFactory> scene = [] {
    base::ref<base::PluginFactory> imported(new base::PluginFactory("scene"));
    scene::register_scene_schema(*imported);
    bench::plugins().load(*imported, bench::plyFile(Shape::mesh, Encoding::little), base::AttribMap());
    return imported;
  }();
  return *scene;
}

std::string outputPath(const char* name) {
  return (std::filesystem::temp_directory_path() / "meshport-bench" / name).string();
}

void setParameters(base::AttribMap& parameters, Encoding encoding) {
  bench::plugins().getExporterParameters("out.ply", parameters);
  parameters.attribute<bool>(base::intern("exportBinary"), encoding != Encoding::ascii);
  parameters.attribute<bool>(base::intern("exportBigEndian"), encoding == Encoding::big);
}

void BM_PlyExport(benchmark::State& state, Encoding encoding) {
  base::PluginFactory& scene = meshScene();
  base::AttribMap parameters;
  setParameters(parameters, encoding);
  const std::string path = outputPath("export.ply");
  for (auto _ : state) {
    if (!bench::plugins().save(scene, path, parameters)) state.SkipWithError("export failed");
  }
  state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * std::filesystem::file_size(path)));
  std::filesystem::remove(path);
}

// The same bytes as the export in `encoding` gives, written with one fwrite.
void BM_FloorWrite(benchmark::State& state, Encoding encoding) {
  const std::string exported = outputPath("floor-source.ply");
  base::AttribMap parameters;
  setParameters(parameters, encoding);
  bench::plugins().save(meshScene(), exported, parameters);
  std::ifstream in(exported, std::ios::binary);
  const std::string bytes((std::istreambuf_iterator<char>(in)), {});
  const std::string path = outputPath("floor.ply");
  for (auto _ : state) {
    std::unique_ptr<std::FILE, int (*)(std::FILE*)> file(std::fopen(path.c_str(), "wb"), &std::fclose);
    if (!file || std::fwrite(bytes.data(), 1, bytes.size(), file.get()) != bytes.size()) {
      state.SkipWithError("write failed");
    }
  }
  state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * bytes.size()));
  std::filesystem::remove(path);
  std::filesystem::remove(exported);
}

#define EXPORT_BENCHMARKS(encoding)                                                                    \
  BENCHMARK_CAPTURE(BM_PlyExport, mesh_##encoding, Encoding::encoding)->Unit(benchmark::kMillisecond); \
  BENCHMARK_CAPTURE(BM_FloorWrite, mesh_##encoding, Encoding::encoding)->Unit(benchmark::kMillisecond);

EXPORT_BENCHMARKS(little)
EXPORT_BENCHMARKS(big)
EXPORT_BENCHMARKS(ascii)

}  // namespace
