// FFT speed beside FFTW (ESTIMATE and MEASURE plans), for the core transforms on a cached table
// and for the exports' whole path (frame included). Run bench/fft_side_by_side.sh for the ratios
// and NumPy's timings in the same session.
#include <benchmark/benchmark.h>
#include <fftw3.h>

#include <cmath>
#include <complex>
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

void TwReal(benchmark::State& state) {
    const int32_t n = static_cast<int32_t>(state.range(0));
    FftTable* t = tw::CreateFftTable(n);
    std::vector<double> in(static_cast<size_t>(n)), out(in.size());
    Fill(in.data(), in.size());
    for (auto _ : state) {
        tw::FftRealForward(t, in.data(), out.data(), 1, 1, n);
        benchmark::DoNotOptimize(out.data());
    }
    tw::DestroyFftTable(t);
    SetRate(state, n);
}

void TwComplex(benchmark::State& state) {
    const int32_t n = static_cast<int32_t>(state.range(0));
    FftTable* t = tw::CreateFftTable(n);
    std::vector<double> in(2 * static_cast<size_t>(n)), out(in.size());
    Fill(in.data(), in.size());
    for (auto _ : state) {
        tw::FftComplexForward(t, in.data(), in.data() + 1, out.data(), out.data() + 1, 2, 2, n);
        benchmark::DoNotOptimize(out.data());
    }
    tw::DestroyFftTable(t);
    SetRate(state, n);
}

// The exports on a cached table, with 64-byte aligned host blocks.
void TwExportReal(benchmark::State& state) {
    const int32_t n = static_cast<int32_t>(state.range(0));
    twrt::Placement aligned(true);
    std::vector<double> v(static_cast<size_t>(n));
    Fill(v.data(), v.size());
    twrt::Array1D<double> x(v);
    twrt::Array1D<std::complex<double>> y(n);
    void* cell = nullptr;
    for (auto _ : state) benchmark::DoNotOptimize(ReQXFFTH(x.h(), y.h(), &cell));
    TWRTRunCleanups(2);
    SetRate(state, n);
}

void TwExportComplex(benchmark::State& state) {
    const int32_t n = static_cast<int32_t>(state.range(0));
    twrt::Placement aligned(true);
    std::vector<std::complex<double>> v(static_cast<size_t>(n));
    Fill(reinterpret_cast<double*>(v.data()), 2 * v.size());
    twrt::Array1D<std::complex<double>> x(v), y(n);
    void* cell = nullptr;
    for (auto _ : state) benchmark::DoNotOptimize(CxQXFFTH(x.h(), y.h(), &cell));
    TWRTRunCleanups(2);
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

void Sizes(benchmark::internal::Benchmark* b) {
    for (int64_t n : kSizes) b->Arg(n);
    b->Unit(benchmark::kMicrosecond);
}

BENCHMARK(TwReal)->Apply(Sizes);
BENCHMARK(FftwReal<FFTW_ESTIMATE>)->Apply(Sizes);
BENCHMARK(FftwReal<FFTW_MEASURE>)->Apply(Sizes);
BENCHMARK(TwExportReal)->Apply(Sizes);
BENCHMARK(TwComplex)->Apply(Sizes);
BENCHMARK(FftwComplex<FFTW_ESTIMATE>)->Apply(Sizes);
BENCHMARK(FftwComplex<FFTW_MEASURE>)->Apply(Sizes);
BENCHMARK(TwExportComplex)->Apply(Sizes);

}  // namespace

BENCHMARK_MAIN();
