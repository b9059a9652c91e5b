// The elliptic, hypergeometric and other special-function exports over 1e6 arguments each, laid
// out by the same low-discrepancy rule as special_other_side_by_side.py uses for SciPy. One
// iteration is the whole loop: divide by 1e6 for the time per point.
#include <benchmark/benchmark.h>

#include <cmath>
#include <cstdint>
#include <vector>

#include "twanlys/special.h"

namespace {

constexpr int kPoints = 1000000;

// Four uniform sequences on (0, 1), as the script draws them.
struct Arguments {
    std::vector<double> p, q, r, s;
    Arguments() : p(kPoints), q(kPoints), r(kPoints), s(kPoints) {
        for (int i = 0; i < kPoints; ++i) {
            p[i] = std::fmod((i + 0.5) * 0.6180339887498949, 1.0);
            q[i] = std::fmod((i + 0.5) * 0.41421356237309515, 1.0);
            r[i] = std::fmod((i + 0.5) * 0.7320508075688772, 1.0);
            s[i] = std::fmod((i + 0.5) * 0.2360679774997898, 1.0);
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
        for (int i = 0; i < kPoints; ++i) sink += f(a.p[i], a.q[i], a.r[i], a.s[i]);
        benchmark::DoNotOptimize(sink);
    }
}

#define TW_OTHER_BENCH(name, expr)                                                   \
    void name(benchmark::State& state) {                                             \
        Loop(state, [](double p, double q, double r, double s) {                     \
            static_cast<void>(q);                                                    \
            static_cast<void>(r);                                                    \
            static_cast<void>(s);                                                    \
            double o = 0.0, o2 = 0.0, o3 = 0.0;                                      \
            expr;                                                                    \
            return o + o2 + o3;                                                      \
        });                                                                          \
    }                                                                                \
    BENCHMARK(name)->Unit(benchmark::kMillisecond)

TW_OTHER_BENCH(ellipk, TW_Elliptic1(p, NAN, &o));
TW_OTHER_BENCH(ellipe, TW_Elliptic2(p, NAN, &o));
TW_OTHER_BENCH(ellipkinc, TW_Elliptic1(p, 20.0 * q - 10.0, &o));
TW_OTHER_BENCH(ellipeinc, TW_Elliptic2(p, 20.0 * q - 10.0, &o));
TW_OTHER_BENCH(ellipj, TW_EllipticJ(40.0 * q - 20.0, p, &o, &o2, &o3, nullptr));
TW_OTHER_BENCH(hyp2f1, TW_Gauss(2.0 * s - 1.0, 6.0 * p - 3.0, 6.0 * q - 3.0, 0.5 + 3.5 * r, &o));
TW_OTHER_BENCH(hyp1f1, TW_Kummer(40.0 * s - 20.0, 10.0 * p - 5.0, 0.5 + 4.5 * q, &o));
TW_OTHER_BENCH(hyperu, TW_Tricomi(0.1 + 29.9 * s, 5.0 * p, 6.0 * q - 3.0, &o));
TW_OTHER_BENCH(zeta, TW_Zeta(1.01 + 59.0 * p, &o));
TW_OTHER_BENCH(spence, TW_Diln(10.0 * p, &o));
TW_OTHER_BENCH(struve, TW_Struve(50.0 * p, 6.0 * q - 3.0, &o));
TW_OTHER_BENCH(pbdv, TW_ParabolicCylinder(15.0 * p - 5.0, 10.0 * q - 5.0, &o));
TW_OTHER_BENCH(dawsn, TW_Dawson(40.0 * p - 20.0, &o));
TW_OTHER_BENCH(fresnel, TW_FresnelIntegrals(20.0 * p - 10.0, &o, &o2));
TW_OTHER_BENCH(expn, TW_ExpI(0.01 + 20.0 * p, static_cast<int32_t>(20.0 * q), &o));
TW_OTHER_BENCH(sici, (TW_SinI(50.0 * p, &o), TW_CosI(50.0 * p, &o2)));
TW_OTHER_BENCH(shichi, (TW_SinhI(50.0 * p, &o), TW_CoshI(50.0 * p, &o2)));

}  // namespace

BENCHMARK_MAIN();
