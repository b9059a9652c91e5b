// twa: runs the library on a built-in signal and prints a readable report.
//   twa demo               statistics, histogram and window of the built-in signal
//   twa window NAME N      a window of length N and its constants (NAME: number or name)
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include <algorithm>
#include <complex>

#include "twanlys/fft.h"
#include "twanlys/generate.h"
#include "twanlys/stats.h"
#include "twanlys/windows.h"
#include "twrt.hpp"

namespace {

using twrt::Array1D;

constexpr int kSamples = 1000;
constexpr double kRate = 1000.0;  // the demo's sampling rate, Hz

struct NamedWindow {
    const char* name;
    int32_t number;
};
constexpr NamedWindow kWindows[] = {
    {"rectangular", 0}, {"hann", 1},     {"hamming", 2},  {"blackman-harris-3", 3},
    {"exact-blackman", 4}, {"blackman", 5}, {"flattop", 6}, {"blackman-harris-4", 7},
    {"blackman-harris-7", 8}, {"low-sidelobe", 9}, {"blackman-nuttall", 11}, {"cosine-taper", 12},
    {"triangle", 30},   {"bartlett-hanning", 31}, {"bohman", 32}, {"parzen", 33}, {"welch", 34},
    {"kaiser", 60},     {"dolph-chebyshev", 61},  {"gaussian", 62}, {"force", 64}, {"exponential", 65},
};

// The built-in signal, made by the library's generators: a 50 Hz sine, a 120 Hz square wave at a
// quarter of the amplitude, and a faint chirp sweeping 200 to 400 Hz.
Array1D<double> DemoSignal() {
    int32_t n = kSamples, status = 0;
    double amplitude = 1.0, frequency = 50 / kRate, phase = 0;
    Array1D<double> sine, square, chirp;
    SineWaveCIN(sine.h(), &n, &amplitude, &frequency, &phase, &status);
    double squareAmplitude = 0.25, squareFrequency = 120 / kRate, squarePhase = 0, duty = 50;
    SquareWaveCIN(square.h(), &n, &squareAmplitude, &squareFrequency, &squarePhase, &duty, &status);
    double chirpAmplitude = 0.1, start = 200 / kRate, end = 400 / kRate;
    ChirpCIN(chirp.h(), &n, &chirpAmplitude, &start, &end, &status);
    Array1D<double> x(n);
    for (int32_t i = 0; i < n; ++i) x.set(i, sine[i] + square[i] + chirp[i]);
    return x;
}

void Statistics(const Array1D<double>& x) {
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

void Histogram(const Array1D<double>& x) {
    int32_t bins = 12, status;
    Array1D<int32_t> counts;
    Array1D<double> centres;
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

void Window(const Array1D<double>& x) {
    Array1D<double> windowed(x.vec());
    const int32_t status = AllWinH(windowed.h(), 1, NAN, 0, 0);
    WindowConstants c{};
    WinConstByNameH(windowed.size(), 1, NAN, &c);
    double rms = 0;
    int32_t s;
    RMS_head(windowed.h(), &rms, &s);
    std::printf("Hann window (status %d)\n  ENBW %.4f bins, coherent gain %.4f, windowed rms %.6f\n\n",
                status, c.enbw, c.coherentGain, rms);
}

// The strongest lines of the windowed signal's spectrum (one-sided magnitude, scaled so that a
// sine of amplitude A shows as A at its bin).
void Spectrum(const Array1D<double>& x) {
    Array1D<double> windowed(x.vec());
    AllWinH(windowed.h(), 1, NAN, 0, 0);
    Array1D<std::complex<double>> spectrum;
    void* cell = nullptr;
    const int32_t status = ReQXFFTH(windowed.h(), spectrum.h(), &cell);
    TWRTRunCleanups(2);  // the table cached in the cell is released with the call site
    if (status != 0) {
        std::printf("FFT failed: %d\n", status);
        return;
    }
    const int32_t n = spectrum.size();
    std::vector<std::pair<double, int32_t>> lines;
    for (int32_t k = 1; k < n / 2; ++k) {
        const double magnitude = 2 * std::abs(spectrum[k]) / (0.5 * n);
        // A line is a local maximum of the magnitude.
        if (magnitude > std::abs(spectrum[k - 1]) * 4 / n && magnitude > std::abs(spectrum[k + 1]) * 4 / n)
            lines.emplace_back(magnitude, k);
    }
    std::sort(lines.rbegin(), lines.rend());
    std::printf("Strongest lines of the Hann-windowed spectrum (%d-point FFT)\n", n);
    for (size_t i = 0; i < lines.size() && i < 6; ++i)
        std::printf("  %7.1f Hz  amplitude %.4f\n", lines[i].second * kRate / n, lines[i].first);
    std::printf("\n");
}

int Demo() {
    const Array1D<double> x = DemoSignal();
    std::printf("twa demo: %d samples at %.0f Hz of a 50 Hz sine, a 120 Hz square wave and a\n"
                "200-400 Hz chirp\n\n", kSamples, kRate);
    Statistics(x);
    Histogram(x);
    Window(x);
    Spectrum(x);
    return 0;
}

int WindowCommand(const char* name, const char* length) {
    int32_t number = -1;
    char* rest = nullptr;
    const long asNumber = std::strtol(name, &rest, 10);
    if (rest != name && *rest == '\0') number = static_cast<int32_t>(asNumber);
    for (const NamedWindow& w : kWindows)
        if (std::strcmp(w.name, name) == 0) number = w.number;
    const int32_t n = std::atoi(length);
    Array1D<double> w(std::vector<double>(static_cast<size_t>(n > 0 ? n : 0), 1.0));
    const int32_t status = AllWinH(w.h(), number, NAN, 0, 0);
    if (status != 0) {
        std::fprintf(stderr, "twa: window %s of length %s failed with status %d\n", name, length, status);
        return 1;
    }
    WindowConstants c{};
    WinConstByNameH_2016(n, number, NAN, &c);
    std::printf("window %d, %d samples: ENBW %.6f bins, coherent gain %.6f\n", number, n, c.enbw,
                c.coherentGain);
    for (int32_t i = 0; i < w.size(); ++i) std::printf("%6d  % .17g\n", i, w[i]);
    return 0;
}

int Usage() {
    std::fprintf(stderr, "usage: twa demo\n       twa window NAME N   (NAME: a number or one of");
    for (const NamedWindow& w : kWindows) std::fprintf(stderr, " %s", w.name);
    std::fprintf(stderr, ")\n");
    return 2;
}

}  // namespace

int main(int argc, char** argv) {
    if (argc == 2 && std::strcmp(argv[1], "demo") == 0) return Demo();
    if (argc == 4 && std::strcmp(argv[1], "window") == 0) return WindowCommand(argv[2], argv[3]);
    return Usage();
}
