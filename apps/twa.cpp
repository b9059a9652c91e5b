// twa: runs the library on a built-in signal and prints a readable report.
#include <cmath>
#include <cstdio>
#include <cstring>
#include <numbers>
#include <string>
#include <vector>

#include "twanlys/stats.h"
#include "twrt.hpp"

namespace {

// The built-in signal: a 50 Hz sine with a third harmonic, sampled at 1 kHz.
std::vector<double> DemoSignal(int n) {
    std::vector<double> x(static_cast<size_t>(n));
    for (int i = 0; i < n; ++i) {
        const double t = i / 1000.0;
        x[static_cast<size_t>(i)] = std::sin(2 * std::numbers::pi * 50 * t) +
                                    0.3 * std::sin(2 * std::numbers::pi * 150 * t);
    }
    return x;
}

void Statistics(const twrt::Array1D<double>& x) {
    double mean, rms, median, variance;
    int32_t status, order = 2;
    Mean_head(x.h(), &mean, &status);
    RMS_head(x.h(), &rms, &status);
    Median_head(x.h(), &median, &status);
    Moment_head(x.h(), &order, &variance, &status);
    std::printf("Statistics of %d samples\n", x.size());
    std::printf("  mean      % .6f\n  rms       % .6f\n  median    % .6f\n  variance  % .6f\n\n", mean,
                rms, median, variance);
}

void Histogram(const twrt::Array1D<double>& x) {
    int32_t bins = 10, status;
    twrt::Array1D<int32_t> counts;
    twrt::Array1D<double> centres;
    histgran_head(x.h(), &bins, counts.h(), centres.h(), &status);
    if (status != 0) {
        std::printf("histogram failed: %d\n", status);
        return;
    }
    std::printf("Histogram (%d bins)\n", bins);
    for (int32_t i = 0; i < counts.size(); ++i)
        std::printf("  % .3f  %4d  %s\n", centres[i], counts[i],
                    std::string(static_cast<size_t>(counts[i] / 4), '#').c_str());
    std::printf("\n");
}

int Demo() {
    const twrt::Array1D<double> x(DemoSignal(1000));
    std::printf("twa demo: 1000 samples of a 50 Hz sine with a 150 Hz harmonic at 1 kHz\n\n");
    Statistics(x);
    Histogram(x);
    return 0;
}

int Usage() {
    std::fprintf(stderr, "usage: twa demo\n");
    return 2;
}

}  // namespace

int main(int argc, char** argv) {
    if (argc < 2) return Usage();
    if (std::strcmp(argv[1], "demo") == 0) return Demo();
    return Usage();
}
