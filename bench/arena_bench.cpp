// Cost of one scratch allocate+release pair, on the heap and on the Analysis Workspace arena.
#include <benchmark/benchmark.h>

#include "frame/memory.hpp"
#include "twanlys/workspace.h"

namespace {

void ScratchPair(benchmark::State& state, bool arena) {
    ErrorCluster e{};
    if (arena) {
        InitializeAnalysisWorkspaceH(1 << 24, &e);
        EnableAnalysisWorkspaceH(&e);
    }
    const auto bytes = static_cast<size_t>(state.range(0));
    for (auto _ : state) {
        void* p = tw::ScratchAlloc(bytes);
        benchmark::DoNotOptimize(p);
        tw::ScratchFree(p);
    }
    if (arena) {
        DisableAnalysisWorkspaceH(&e);
        UninitializeAnalysisWorkspaceH(&e);
    }
}

void Heap(benchmark::State& state) { ScratchPair(state, false); }
void Arena(benchmark::State& state) { ScratchPair(state, true); }

BENCHMARK(Heap)->Arg(64)->Arg(4096)->Arg(1 << 20);
BENCHMARK(Arena)->Arg(64)->Arg(4096)->Arg(1 << 20);

}  // namespace

BENCHMARK_MAIN();
