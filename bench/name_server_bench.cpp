#include "b_name.h"

#include <benchmark/benchmark.h>

#include <string>
#include <vector>

namespace {

// Interning a name that exists already: the path every attribute lookup by text takes.
void BM_InternExisting(benchmark::State& state) {
  std::vector<std::string> names;
  for (int i = 0; i < 1000; ++i) names.push_back("attribute-" + std::to_string(i));
  for (const std::string& name : names) base::intern(name);
  std::size_t i = 0;
  for (auto _ : state) {
    benchmark::DoNotOptimize(base::intern(names[i++ % names.size()]));
  }
}
BENCHMARK(BM_InternExisting)->ThreadRange(1, 2);

}  // namespace
