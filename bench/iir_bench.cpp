// IIR_Filter_PtbyPt on a cascade of four second-order sections, one call per sample, beside the
// block call IIR_Filter2 on the same samples: the per-call cost of the point-by-point frame.
#include <benchmark/benchmark.h>

#include <cmath>
#include <cstdint>
#include <vector>

#include "twanlys/filter.h"
#include "twrt.hpp"

namespace {

constexpr int kSamples = 100000;

struct Design {
    twrt::Array1D<double> a, b;
    Design() {
        double fs = 1000, fl = 100, fh = 0;
        int32_t order = 8, type = 0, status = 0;
        BWCoefs(&fs, &fl, &fh, &order, &type, a.h(), b.h(), &status);
    }
};

std::vector<double> Samples() {
    std::vector<double> x(kSamples);
    for (int i = 0; i < kSamples; ++i) x[i] = std::sin(0.01 * i) + 0.25 * std::sin(1.3 * i);
    return x;
}

void PointByPoint(benchmark::State& state) {
    Design d;
    twrt::Array1D<double> st;
    const std::vector<double> x = Samples();
    uint8_t keep = 0;
    for (auto _ : state) {
        double sink = 0;
        for (int i = 0; i < kSamples; ++i) {
            double v = x[i];
            IIR_Filter_PtbyPt(&v, 0, d.a.h(), d.b.h(), st.h(), &keep);
            sink += v;
        }
        benchmark::DoNotOptimize(sink);
    }
    state.SetItemsProcessed(state.iterations() * kSamples);
}

void Block(benchmark::State& state) {
    Design d;
    twrt::Array1D<double> st, x(Samples());
    int32_t form = 0, status = 0;
    uint8_t keep = 1;
    for (auto _ : state) {
        IIR_Filter2(x.h(), &form, d.a.h(), d.b.h(), st.h(), &keep, &status);
        benchmark::DoNotOptimize(x.data());
    }
    state.SetItemsProcessed(state.iterations() * kSamples);
}

BENCHMARK(PointByPoint)->Unit(benchmark::kMillisecond);
BENCHMARK(Block)->Unit(benchmark::kMillisecond);

}  // namespace

BENCHMARK_MAIN();
