// The real Bessel, Airy and Kelvin exports over 1e6 arguments each, x on (0, 50) and orders on
// (0, 20), laid out by the same low-discrepancy rule as bessel_side_by_side.py uses for SciPy.
// One iteration is the whole loop: divide by 1e6 for the time per point.
#include <benchmark/benchmark.h>

#include <cmath>
#include <cstdint>
#include <vector>

#include "twanlys/special.h"

namespace {

constexpr int kPoints = 1000000;

struct Arguments {
    std::vector<double> x, v;
    Arguments() : x(kPoints), v(kPoints) {
        for (int i = 0; i < kPoints; ++i) {
            x[i] = 50.0 * std::fmod((i + 0.5) * 0.6180339887498949, 1.0);
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
        for (int i = 0; i < kPoints; ++i) sink += f(a.v[i], a.x[i]);
        benchmark::DoNotOptimize(sink);
    }
}

#define TW_BESSEL_BENCH(name, expr)                                            \
    void name(benchmark::State& state) {                                       \
        Loop(state, [](double v, double x) {                                   \
            static_cast<void>(v);                                              \
            double o = 0.0, p = 0.0, q = 0.0, r = 0.0;                         \
            expr;                                                              \
            static_cast<void>(p);                                              \
            static_cast<void>(q);                                              \
            static_cast<void>(r);                                              \
            return o;                                                          \
        });                                                                    \
    }                                                                          \
    BENCHMARK(name)->Unit(benchmark::kMillisecond)

TW_BESSEL_BENCH(j0, TW_BesselJr(0.0, x, &o));
TW_BESSEL_BENCH(j1, TW_BesselJr(1.0, x, &o));
TW_BESSEL_BENCH(y0, TW_BesselYr(0.0, x, &o));
TW_BESSEL_BENCH(y1, TW_BesselYr(1.0, x, &o));
TW_BESSEL_BENCH(i0, TW_BesselIr(0.0, x, &o));
TW_BESSEL_BENCH(i1, TW_BesselIr(1.0, x, &o));
TW_BESSEL_BENCH(k0, TW_BesselKn(0, x, &o));
TW_BESSEL_BENCH(k1, TW_BesselKn(1, x, &o));
TW_BESSEL_BENCH(jv, TW_BesselJr(v, x, &o));
TW_BESSEL_BENCH(yv, TW_BesselYr(v, x, &o));
TW_BESSEL_BENCH(iv, TW_BesselIr(v, x, &o));
TW_BESSEL_BENCH(kn, TW_BesselKn(static_cast<int32_t>(v), x, &o));
TW_BESSEL_BENCH(airy, TW_Airy(x - 25.0, &o, &p, &q, &r));
TW_BESSEL_BENCH(ber_bei, TW_KelvinI(x, 0, &o, &p));
TW_BESSEL_BENCH(ker_kei, TW_KelvinK(x, 0, &o, &p));

}  // namespace

BENCHMARK_MAIN();
