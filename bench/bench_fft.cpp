// FFT speed beside FFTW (ESTIMATE and MEASURE plans), for the core transforms on a cached table
// and for the exports' whole path (frame, cached table, resize of y, copies). Run
// bench/fft_side_by_side.py for the ratios and NumPy's timings in the same session.
//
// `bench_bench_fft --calls <TwReal|TwComplex|TwExportReal|TwExportComplex> <n> <calls>` makes that
// many calls and nothing else of note, for instruction counts under
// `valgrind --tool=callgrind --toggle-collect=Measured`.
#include <benchmark/benchmark.h>
#include <fftw3.h>

#include <cmath>
#include <complex>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <memory>
#include <vector>

#include "transform/fft/fft.hpp"
#include "twanlys/fft.h"
#include "twrt.hpp"

namespace {

const std::vector<int64_t> kSizes = {64, 256, 1000, 1024, 4096, 48000, 65536, 1 << 20, 999, 2187, 15015,
                                     1009, 10007, 65537};

void Fill(double* p, size_t n) {
    for (size_t i = 0; i < n; ++i) p[i] = std::sin(0.001 * static_cast<double>(i * i % 7919)) + 0.1;
}

void SetRate(benchmark::State& state, int64_t n) {
    state.counters["n"] = static_cast<double>(n);
    state.SetItemsProcessed(state.iterations() * n);
}

// One repeated call of each kind, set up for length n: the cores on their cached table, the
// exports on a cached work cell with 64-byte aligned host blocks resized by the host's default.
struct Case {
    std::function<void()> call;
    std::function<void()> release;
};

Case TwReal(int32_t n) {
    FftTable* t = tw::CreateFftTable(n);
    auto in = std::make_shared<std::vector<double>>(static_cast<size_t>(n));
    auto out = std::make_shared<std::vector<double>>(in->size());
    Fill(in->data(), in->size());
    return {[=] { tw::FftRealForward(t, in->data(), out->data(), 1, 1, n); }, [=] { tw::DestroyFftTable(t); }};
}

Case TwComplex(int32_t n) {
    FftTable* t = tw::CreateFftTable(n);
    auto in = std::make_shared<std::vector<double>>(2 * static_cast<size_t>(n));
    auto out = std::make_shared<std::vector<double>>(in->size());
    Fill(in->data(), in->size());
    return {[=] {
                double* i = in->data();
                double* o = out->data();
                tw::FftComplexForward(t, i, i + 1, o, o + 1, 2, 2, n);
            },
            [=] { tw::DestroyFftTable(t); }};
}

template <class In, class Export>
Case TwExport(int32_t n, Export call) {
    twrt::Placement aligned(true);
    std::vector<In> v(static_cast<size_t>(n));
    Fill(reinterpret_cast<double*>(v.data()), v.size() * sizeof(In) / sizeof(double));
    auto x = std::make_shared<twrt::Array1D<In>>(v);
    auto y = std::make_shared<twrt::Array1D<std::complex<double>>>(n);
    auto cell = std::make_shared<void*>(nullptr);
    return {[=] { call(x->h(), y->h(), cell.get()); }, [] { TWRTRunCleanups(2); }};
}

Case TwExportReal(int32_t n) { return TwExport<double>(n, ReQXFFTH); }
Case TwExportComplex(int32_t n) { return TwExport<std::complex<double>>(n, CxQXFFTH); }

template <Case (*Make)(int32_t)>
void Run(benchmark::State& state) {
    const int32_t n = static_cast<int32_t>(state.range(0));
    const Case c = Make(n);
    c.call();  // the exports build their table and size y on the first call, which is not timed
    for (auto _ : state) {
        c.call();
        benchmark::ClobberMemory();
    }
    c.release();
    SetRate(state, n);
}

// Times one FFTW plan and releases it with its buffers.
void RunPlan(benchmark::State& state, fftw_plan p, void* in, void* out, int64_t n) {
    for (auto _ : state) {
        fftw_execute(p);
        benchmark::DoNotOptimize(out);
    }
    fftw_destroy_plan(p);
    fftw_free(in);
    fftw_free(out);
    SetRate(state, n);
}

template <unsigned Flags>
void FftwReal(benchmark::State& state) {
    const int n = static_cast<int>(state.range(0));
    double* in = fftw_alloc_real(static_cast<size_t>(n));
    fftw_complex* out = fftw_alloc_complex(static_cast<size_t>(n / 2 + 1));
    fftw_plan p = fftw_plan_dft_r2c_1d(n, in, out, Flags);
    Fill(in, static_cast<size_t>(n));
    RunPlan(state, p, in, out, n);
}

template <unsigned Flags>
void FftwComplex(benchmark::State& state) {
    const int n = static_cast<int>(state.range(0));
    fftw_complex* in = fftw_alloc_complex(static_cast<size_t>(n));
    fftw_complex* out = fftw_alloc_complex(static_cast<size_t>(n));
    fftw_plan p = fftw_plan_dft_1d(n, in, out, FFTW_FORWARD, Flags);
    Fill(reinterpret_cast<double*>(in), 2 * static_cast<size_t>(n));
    RunPlan(state, p, in, out, n);
}

// TW_FFT_BENCH_SIZES="n,n,..." replaces the list.
void Sizes(benchmark::internal::Benchmark* b) {
    std::vector<int64_t> sizes = kSizes;
    if (const char* list = std::getenv("TW_FFT_BENCH_SIZES")) {
        sizes.clear();
        for (char* end = nullptr;; list = end + 1) {
            const long long n = std::strtoll(list, &end, 10);
            if (end == list) break;
            sizes.push_back(n);
            if (*end != ',') break;
        }
    }
    for (int64_t n : sizes) b->Arg(n);
    b->Unit(benchmark::kMicrosecond);
}

BENCHMARK(Run<TwReal>)->Name("TwReal")->Apply(Sizes);
BENCHMARK(FftwReal<FFTW_ESTIMATE>)->Apply(Sizes);
BENCHMARK(FftwReal<FFTW_MEASURE>)->Apply(Sizes);
BENCHMARK(Run<TwExportReal>)->Name("TwExportReal")->Apply(Sizes);
BENCHMARK(Run<TwComplex>)->Name("TwComplex")->Apply(Sizes);
BENCHMARK(FftwComplex<FFTW_ESTIMATE>)->Apply(Sizes);
BENCHMARK(FftwComplex<FFTW_MEASURE>)->Apply(Sizes);
BENCHMARK(Run<TwExportComplex>)->Name("TwExportComplex")->Apply(Sizes);

}  // namespace

// Kept out of line so that callgrind can count its instructions alone.
extern "C" __attribute__((noinline)) void Measured(const void* c, long calls) {
    for (long i = 0; i < calls; ++i) static_cast<const Case*>(c)->call();
}

int main(int argc, char** argv) {
    if (argc == 5 && std::strcmp(argv[1], "--calls") == 0) {
        const struct {
            const char* name;
            Case (*make)(int32_t);
        } kinds[] = {{"TwReal", TwReal}, {"TwComplex", TwComplex}, {"TwExportReal", TwExportReal},
                     {"TwExportComplex", TwExportComplex}};
        for (const auto& k : kinds) {
            if (std::strcmp(argv[2], k.name) != 0) continue;
            const Case c = k.make(static_cast<int32_t>(std::atol(argv[3])));
            c.call();  // the first call builds what later calls find cached
            Measured(&c, std::atol(argv[4]));
            c.release();
            return 0;
        }
        std::fprintf(stderr, "unknown kind %s\n", argv[2]);
        return 2;
    }
    benchmark::Initialize(&argc, argv);
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    return 0;
}
