// Attribute maps: a lookup by name among 40 members, and the binary form of a mesh-sized list
// (10,000,000 vec3f) written to and read from memory.

#include "b_attribute_map.h"
#include "b_binary_io.h"
#include "b_typed_attribute.h"
#include "b_vec.h"

#include <benchmark/benchmark.h>

#include <fmt/format.h>

namespace {

void BM_FindAttribute40(benchmark::State& state) {
  base::AttribMap map;
  base::vector<base::name_id> names;
  for (int k = 0; k < 40; ++k) {
    names.push_back(base::intern(fmt::format("member{}", k)));
    map.attribute<float>(names.back()) = static_cast<float>(k);
  }
  std::size_t next = 0;
  for (auto _ : state) {
    benchmark::DoNotOptimize(map.findAttribute<float>(names[next]));
    next = (next + 17) % names.size();
  }
}
BENCHMARK(BM_FindAttribute40);

constexpr std::uint32_t meshPositions = 10'000'000;

void fill(base::TypedVectorAttribute<base::base_vec3<float>>& list) {
  list.values().resize(meshPositions);
  for (std::uint32_t k = 0; k < meshPositions; ++k) list.values()[k] = {float(k), float(k) * 0.5f, 1.0f};
}

void BM_WriteVec3fList(benchmark::State& state) {
  base::TypedVectorAttribute<base::base_vec3<float>> list;
  fill(list);
  for (auto _ : state) {
    base::Stream stream = base::memStream(0);
    list.write(stream, base::plainContext());
    benchmark::DoNotOptimize(stream.getSize());
  }
  state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations()) * meshPositions * 12);
}
BENCHMARK(BM_WriteVec3fList)->Unit(benchmark::kMillisecond);

void BM_ReadVec3fList(benchmark::State& state) {
  base::TypedVectorAttribute<base::base_vec3<float>> list;
  fill(list);
  base::Stream stream = base::memStream(0);
  list.write(stream, base::plainContext());
  for (auto _ : state) {
    stream.setPosition(0);
    base::TypedVectorAttribute<base::base_vec3<float>> read;
    read.read(stream, base::plainContext());
    benchmark::DoNotOptimize(read.values().data());
  }
  state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations()) * meshPositions * 12);
}
BENCHMARK(BM_ReadVec3fList)->Unit(benchmark::kMillisecond);

}  // namespace
