// The cleaning passes on noisy tracks of growing length: each must stay linear (Revise,
// Reduction) or n log n (Smooth). Google Benchmark fits the growth over the sizes.
//
// Each pass allocates its working array per call. Above 32 MiB (about 900,000 points) the C
// library maps every such block afresh and the first touch of each page costs a fault, which
// on a virtual machine outweighs the pass itself; the program keeps large blocks in the heap so
// that the curve shows the passes, not the page faults.
#include <benchmark/benchmark.h>
#include <malloc.h>

#include "../tests/geo_reference.h"
#include "navmisc/geo/cleaning.h"

namespace {

template <int (*Pass)(CPtrList&)>
void Run(benchmark::State& state) {
  navmisc::testing::OwnedPoints track;
  navmisc::testing::AppendNoisyTrack(track.list, 5150, static_cast<int>(state.range(0)));
  for (auto _ : state) benchmark::DoNotOptimize(Pass(track.list));
  state.SetComplexityN(state.range(0));
}

int SmoothAtFinestLevel(CPtrList& points) { return Smooth(points, 0.0001); }

void BM_Revise(benchmark::State& state) { Run<Revise>(state); }
void BM_Reduction(benchmark::State& state) { Run<Reduction>(state); }
void BM_Smooth(benchmark::State& state) { Run<SmoothAtFinestLevel>(state); }

BENCHMARK(BM_Revise)->RangeMultiplier(4)->Range(1 << 12, 1 << 20)->Unit(benchmark::kMillisecond)->Complexity();
BENCHMARK(BM_Reduction)->RangeMultiplier(4)->Range(1 << 12, 1 << 20)->Unit(benchmark::kMillisecond)->Complexity();
BENCHMARK(BM_Smooth)->RangeMultiplier(4)->Range(1 << 12, 1 << 20)->Unit(benchmark::kMillisecond)->Complexity();

}  // namespace

int main(int argc, char** argv) {
  mallopt(M_MMAP_THRESHOLD, 256 << 20);
  mallopt(M_TRIM_THRESHOLD, 512 << 20);
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
  benchmark::RunSpecifiedBenchmarks();
  benchmark::Shutdown();
  return 0;
}
