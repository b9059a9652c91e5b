// The complex Bessel and Airy exports over 1e6 arguments each: z = r exp(i t) with r on (0, 50)
// and t on (-pi, pi), orders on (0, 20), laid out by the same low-discrepancy rule as
// cxbessel_side_by_side.py uses for SciPy. One iteration is the whole loop: divide by 1e6 for the
// time per point.
#include <benchmark/benchmark.h>

#include <cmath>
#include <cstdint>
#include <vector>

#include "twanlys/special.h"

namespace {

constexpr int kPoints = 1000000;

struct Arguments {
    std::vector<ComplexDouble> z;
    std::vector<double> v;
    Arguments() : z(kPoints), v(kPoints) {
        const double pi = 3.141592653589793;
        for (int i = 0; i < kPoints; ++i) {
            const double r = 50.0 * std::fmod((i + 0.5) * 0.6180339887498949, 1.0);
            const double t = 2.0 * pi * std::fmod((i + 0.5) * 0.7548776662466927, 1.0) - pi;
            z[i] = ComplexDouble{r * std::cos(t), r * std::sin(t)};
            v[i] = 20.0 * std::fmod((i + 0.5) * 0.41421356237309515, 1.0);
        }
    }
};

const Arguments& Args() {
    static const Arguments a;
    return a;
}

template <class F>
void Loop(benchmark::State& state, F f) {
    const Arguments& a = Args();
    for (auto _ : state) {
        double sink = 0.0;
        for (int i = 0; i < kPoints; ++i) {
            ComplexDouble out{0.0, 0.0};
            f(&a.v[i], &a.z[i], &out);
            sink += out.re;
        }
        benchmark::DoNotOptimize(sink);
    }
}

constexpr int32_t kUnscaled = 0, kFirst = 0, kAi = 1;

void jv(benchmark::State& s) {
    Loop(s, [](const double* v, const ComplexDouble* z, ComplexDouble* o) { TW_CxBesselJr(v, z, &kUnscaled, o); });
}
void yv(benchmark::State& s) {
    Loop(s, [](const double* v, const ComplexDouble* z, ComplexDouble* o) { TW_CxBesselYr(v, z, &kUnscaled, o); });
}
void iv(benchmark::State& s) {
    Loop(s, [](const double* v, const ComplexDouble* z, ComplexDouble* o) { TW_CxBesselIr(v, z, &kUnscaled, o); });
}
void kv(benchmark::State& s) {
    Loop(s, [](const double* v, const ComplexDouble* z, ComplexDouble* o) { TW_CxBesselKr(v, z, &kUnscaled, o); });
}
void hankel1(benchmark::State& s) {
    Loop(s, [](const double* v, const ComplexDouble* z, ComplexDouble* o) {
        TW_CxBesselHr(v, z, &kFirst, &kUnscaled, o);
    });
}
// All four functions per point, as SciPy's airy returns them together.
void airy(benchmark::State& s) {
    Loop(s, [](const double*, const ComplexDouble* z, ComplexDouble* o) {
        ComplexDouble w[3];
        TW_CxAiry(z, &kAi, &kUnscaled, o);
        for (int32_t f = 2; f <= 4; ++f) TW_CxAiry(z, &f, &kUnscaled, &w[f - 2]);
        o->re += w[0].re + w[1].re + w[2].re;
    });
}

BENCHMARK(jv)->Unit(benchmark::kMillisecond);
BENCHMARK(yv)->Unit(benchmark::kMillisecond);
BENCHMARK(iv)->Unit(benchmark::kMillisecond);
BENCHMARK(kv)->Unit(benchmark::kMillisecond);
BENCHMARK(hankel1)->Unit(benchmark::kMillisecond);
BENCHMARK(airy)->Unit(benchmark::kMillisecond);

}  // namespace

BENCHMARK_MAIN();
