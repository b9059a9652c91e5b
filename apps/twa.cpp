// twa: the library from the command line, on a built-in signal or on a user's CSV or WAV file.
// `twa help` lists the commands; `twa COMMAND --help` describes one.
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include <algorithm>

#include "twanlys/fit.h"
#include "twanlys/generate.h"
#include "twanlys/stats.h"
#include "twanlys/transforms.h"
#include "twanlys/windows.h"
#include "twrt.hpp"

#include "data.hpp"
#include "plot.hpp"

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

// The Hann-windowed power spectrum and its strongest lines. The two-sided power |X|^2 / n^2 of a
// sine of amplitude A is (A g / 2)^2 at its bin, g being the window's coherent gain, so the
// amplitude reads back as 2 sqrt(P) / g and the sine's power A^2 / 2 as 2 P / g^2.
void Spectrum(const Array1D<double>& x) {
    Array1D<double> power(x.vec());
    const int32_t windowStatus = AllWinH(power.h(), 1, NAN, 0, 0);
    WindowConstants c{};
    WinConstByNameH(x.size(), 1, NAN, &c);
    void* cell = nullptr;
    const int32_t status = SpectrumH(power.h(), &cell);
    TWRTRunCleanups(2);  // the FFT table cached in the cell goes with the call site
    if (windowStatus != 0 || status != 0) {
        std::printf("spectrum failed: %d %d\n", windowStatus, status);
        return;
    }
    std::printf("Hann window: ENBW %.4f bins, coherent gain %.4f\n", c.enbw, c.coherentGain);
    const int32_t n = power.size();
    std::vector<std::pair<double, int32_t>> lines;
    for (int32_t k = 1; k < n / 2; ++k)
        if (power[k] > power[k - 1] && power[k] > power[k + 1]) lines.emplace_back(power[k], k);
    std::sort(lines.rbegin(), lines.rend());
    std::printf("Strongest lines of the windowed power spectrum (%d points)\n", n);
    for (size_t i = 0; i < lines.size() && i < 5; ++i)
        std::printf("  %7.1f Hz  %8.2f dB  amplitude %.4f\n", lines[i].second * kRate / n,
                    10 * std::log10(2 * lines[i].first / (c.coherentGain * c.coherentGain)), 2 * std::sqrt(lines[i].first) / c.coherentGain);
    std::printf("\n");
}

// A line and a Gaussian peak fitted to data made from known parameters plus a small deterministic
// ripple; R squared from the goodness-of-fit export.
void Fits() {
    const int32_t n = 200;
    Array1D<double> x(n), line(n), peak(n);
    for (int32_t i = 0; i < n; ++i) {
        const double t = i * 0.05, ripple = 0.05 * std::sin(2.3 * i) * std::cos(0.7 * i);
        const double u = (t - 4.2) / 0.8;
        x.set(i, t);
        line.set(i, 0.75 * t - 1.5 + ripple);
        peak.set(i, 2.5 * std::exp(-0.5 * u * u) + ripple);
    }
    const Array1D<double> none, lineData(line.vec()), peakData(peak.vec());
    double slope, intercept, mse, sse, r2, rmse;
    int32_t status = LinFit_head(line.h(), x.h(), none.h(), &slope, &intercept, &mse);  // line now holds the fit
    GoodnessOfFit_head(lineData.h(), line.h(), none.h(), 0, &sse, &r2, &rmse);
    std::printf("Fits to %d samples with a ripple of 0.05\n", n);
    std::printf("  line 0.75 t - 1.5:        slope %.6f, intercept %.6f, R^2 %.6f (status %d)\n", slope,
                intercept, r2, status);
    Array1D<double> cu, cl, pu, pl, upperParams, lowerParams;
    double dSlope = 0, dIntercept = 0;
    const int32_t cs = ConfBndLinear_head(lineData.h(), x.h(), none.h(), slope, intercept, 0.95, cu.h(), cl.h(),
                                          upperParams.h(), lowerParams.h(), &dSlope, &dIntercept);
    const int32_t ps = PredBndLinear_head(lineData.h(), x.h(), none.h(), slope, intercept, 0.95, pu.h(), pl.h());
    if (cs == 0 && ps == 0) {
        std::printf("  95 %% intervals: slope +/- %.6f, intercept +/- %.6f; bands of the line:\n", dSlope, dIntercept);
        for (int32_t i : {0, 100, n - 1})
            std::printf("    t %5.2f  fit %8.4f  confidence [%8.4f, %8.4f]  prediction [%8.4f, %8.4f]\n", x[i],
                        line[i], cl[i], cu[i], pl[i], pu[i]);
    } else {
        std::printf("  bounds failed: %d %d\n", cs, ps);
    }
    double amplitude, centre, deviation;
    int32_t steps = 500;
    status = GaussianPeakFit_head(peak.h(), x.h(), none.h(), 1e-8, none.h(), &amplitude, &centre, &deviation,
                                  &mse, &steps, 0);
    GoodnessOfFit_head(peakData.h(), peak.h(), none.h(), 0, &sse, &r2, &rmse);
    std::printf("  Gaussian 2.5, 4.2, 0.8:   amplitude %.6f, centre %.6f, sd %.6f, R^2 %.6f (%d steps)\n",
                amplitude, centre, deviation, r2, steps);
}

int Demo() {
    const Array1D<double> x = DemoSignal();
    std::printf("twa demo: %d samples at %.0f Hz of a 50 Hz sine, a 120 Hz square wave and a\n"
                "200-400 Hz chirp\n\n", kSamples, kRate);
    Statistics(x);
    Histogram(x);
    Spectrum(x);
    Fits();
    return 0;
}

// ---- command line ----------------------------------------------------------------------------

// Positional arguments and --key value options (a bare --key is "1").
struct Args {
    std::vector<std::string> positional;
    std::vector<std::pair<std::string, std::string>> options;
    std::string Get(const std::string& key, const std::string& fallback = "") const {
        for (const auto& [k, v] : options)
            if (k == key) return v;
        return fallback;
    }
    bool Has(const std::string& key) const {
        for (const auto& o : options)
            if (o.first == key) return true;
        return false;
    }
};

Args Parse(int argc, char** argv, const std::vector<std::string>& flags) {
    Args a;
    for (int i = 2; i < argc; ++i) {
        const std::string s = argv[i];
        if (s.rfind("--", 0) != 0 || s.size() == 2) {
            a.positional.push_back(s);
            continue;
        }
        const std::string key = s.substr(2);
        bool flag = key == "help";
        for (const std::string& f : flags) flag = flag || f == key;
        a.options.emplace_back(key, flag || i + 1 >= argc ? std::string("1") : std::string(argv[++i]));
    }
    return a;
}

int Fail(const std::string& message) {
    std::fprintf(stderr, "twa: %s\n", message.c_str());
    return 1;
}

int UsageError(const std::string& message, const char* usage) {
    std::fprintf(stderr, "twa: %s\nusage: %s\n", message.c_str(), usage);
    return 2;
}

bool ToInt(const std::string& s, int32_t* v) {
    char* end = nullptr;
    const long n = std::strtol(s.c_str(), &end, 10);
    if (s.empty() || *end != '\0' || n < INT32_MIN || n > INT32_MAX) return false;
    *v = static_cast<int32_t>(n);
    return true;
}

bool ToDouble(const std::string& s, double* v) {
    char* end = nullptr;
    *v = std::strtod(s.c_str(), &end);
    return !s.empty() && *end == '\0';
}

// A window by name or number; -1 if neither.
int32_t WindowNumber(const std::string& name) {
    int32_t number = -1;
    if (ToInt(name, &number)) return number;
    for (const NamedWindow& w : kWindows)
        if (name == w.name) return w.number;
    return -1;
}

std::string WindowNames() {
    std::string names;
    for (const NamedWindow& w : kWindows) names += std::string(names.empty() ? "" : " ") + w.name;
    return names;
}

// The columns a command works on: the one named by --column, or all.
bool LoadColumns(const Args& a, twa::Table* table, std::vector<int>* which, std::string* error) {
    if (!twa::ReadTable(a.positional[0], table, error)) return false;
    which->clear();
    if (!a.Has("column")) {
        for (size_t c = 0; c < table->columns.size(); ++c) which->push_back(static_cast<int>(c));
        return true;
    }
    const int c = twa::FindColumn(*table, a.Get("column"), error);
    if (c < 0) return false;
    which->push_back(c);
    return true;
}

// ---- commands --------------------------------------------------------------------------------

constexpr const char* kWindowUsage = "twa window NAME N [--plot FILE.svg|png]";
constexpr const char* kWindowHelp =
    "Prints a window of N samples as CSV (index,value) after a comment line with its equivalent\n"
    "noise bandwidth (bins) and coherent gain. NAME is a window number or one of:\n  %s\n"
    "--plot FILE   also draws the window (gnuplot) into FILE.svg or FILE.png\n";

int WindowCommand(const Args& a) {
    if (a.positional.size() != 2) return UsageError("window takes a name and a length", kWindowUsage);
    const int32_t number = WindowNumber(a.positional[0]);
    int32_t n = 0;
    if (number < 0) return UsageError("unknown window \"" + a.positional[0] + "\"", kWindowUsage);
    if (!ToInt(a.positional[1], &n) || n < 1)
        return UsageError("the length must be a positive integer", kWindowUsage);
    Array1D<double> w(std::vector<double>(static_cast<size_t>(n), 1.0));
    const int32_t status = AllWinH(w.h(), number, NAN, 0, 0);
    if (status != 0) return Fail("window " + a.positional[0] + " failed with status " + std::to_string(status));
    WindowConstants c{};
    WinConstByNameH_2016(n, number, NAN, &c);
    std::printf("# window %d, %d samples: ENBW %.6f bins, coherent gain %.6f\nindex,value\n", number, n,
                c.enbw, c.coherentGain);
    std::vector<double> index, value = w.vec();
    for (int32_t i = 0; i < n; ++i) {
        std::printf("%d,%.17g\n", i, value[static_cast<size_t>(i)]);
        index.push_back(i);
    }
    std::string error;
    if (a.Has("plot") && !twa::Plot(a.Get("plot"), {"window " + a.positional[0], "sample", "value", true},
                                    index, value, &error))
        return Fail(error);
    return 0;
}

constexpr const char* kStatsUsage = "twa stats FILE [--column C]";
constexpr const char* kStatsHelp =
    "Prints, as CSV, the count, mean, rms, median, population variance, minimum and maximum of each\n"
    "column of FILE (CSV with an optional header row, or WAV).\n"
    "--column C   only column C (a 1-based number or a header name)\n";

int StatsCommand(const Args& a) {
    if (a.positional.size() != 1) return UsageError("stats takes one file", kStatsUsage);
    twa::Table table;
    std::vector<int> which;
    std::string error;
    if (!LoadColumns(a, &table, &which, &error)) return Fail(error);
    std::printf("column,count,mean,rms,median,variance,min,max\n");
    for (int c : which) {
        const std::vector<double>& v = table.columns[static_cast<size_t>(c)];
        const Array1D<double> x(v);
        double mean, rms, median, variance;
        int32_t s1, s2, s3, s4, order = 2;
        Mean_head(x.h(), &mean, &s1);
        RMS_head(x.h(), &rms, &s2);
        Median_head(x.h(), &median, &s3);
        Moment_head(x.h(), &order, &variance, &s4);
        const auto [lo, hi] = std::minmax_element(v.begin(), v.end());
        std::printf("%s,%zu,%.17g,%.17g,%.17g,%.17g,%.17g,%.17g\n", table.names[static_cast<size_t>(c)].c_str(),
                    v.size(), mean, rms, median, variance, *lo, *hi);
        // A NaN in the data makes the median fail; the other figures stand as computed.
        if (s3 != 0) std::fprintf(stderr, "twa: column %s: median failed with status %d\n",
                                  table.names[static_cast<size_t>(c)].c_str(), s3);
    }
    return 0;
}

constexpr const char* kSpectrumUsage =
    "twa spectrum FILE [--column C] [--window NAME] [--size N] [--rate HZ] [--plot FILE.svg|png]";
constexpr const char* kSpectrumHelp =
    "Prints the one-sided power spectrum of a column of FILE (CSV or WAV) as CSV:\n"
    "frequency,power,power_db. The power is corrected for the window's coherent gain, so a sine of\n"
    "amplitude A reads A^2/2 at its frequency; dB are relative to 1 unit^2.\n"
    "--column C     the column (default 1)\n"
    "--window NAME  the window (default hann; see twa window --help)\n"
    "--size N       transform the first N samples, zero-padded if the column is shorter\n"
    "--rate HZ      samples per second (default: the WAV file's rate, else 1)\n"
    "--plot FILE    also draws the spectrum in dB (gnuplot) into FILE.svg or FILE.png\n";

int SpectrumCommand(const Args& a) {
    if (a.positional.size() != 1) return UsageError("spectrum takes one file", kSpectrumUsage);
    const int32_t window = WindowNumber(a.Get("window", "hann"));
    if (window < 0) return UsageError("unknown window \"" + a.Get("window") + "\"", kSpectrumUsage);
    int32_t size = 0;
    if (a.Has("size") && (!ToInt(a.Get("size"), &size) || size < 1))
        return UsageError("--size must be a positive integer", kSpectrumUsage);
    double rate = 0;
    if (a.Has("rate") && (!ToDouble(a.Get("rate"), &rate) || !(rate > 0)))
        return UsageError("--rate must be a positive number", kSpectrumUsage);
    twa::Table table;
    std::string error;
    if (!twa::ReadTable(a.positional[0], &table, &error)) return Fail(error);
    const int c = twa::FindColumn(table, a.Get("column", "1"), &error);
    if (c < 0) return Fail(error);
    if (rate == 0) rate = table.rate > 0 ? table.rate : 1.0;
    std::vector<double> v = table.columns[static_cast<size_t>(c)];
    if (size > 0) v.resize(static_cast<size_t>(size), 0.0);
    const auto n = static_cast<int32_t>(v.size());

    Array1D<double> power(v);
    int32_t status = AllWinH(power.h(), window, NAN, 0, 0);
    WindowConstants k{};
    WinConstByNameH_2016(n, window, NAN, &k);
    void* cell = nullptr;
    if (status == 0) status = SpectrumH(power.h(), &cell);
    TWRTRunCleanups(2);  // the FFT table cached in the cell goes with this call site
    if (status != 0) return Fail("spectrum failed with status " + std::to_string(status));

    const double gain2 = k.coherentGain * k.coherentGain;
    std::vector<double> freq, db;
    std::printf("frequency,power,power_db\n");
    for (int32_t i = 0; i <= n / 2; ++i) {
        const bool single = i == 0 || 2 * i == n;  // DC and Nyquist have no mirror image
        const double p = (single ? 1.0 : 2.0) * power[i] / gain2;
        freq.push_back(i * rate / n);
        db.push_back(10 * std::log10(p));
        std::printf("%.17g,%.17g,%.6f\n", freq.back(), p, db.back());
    }
    const std::string unit = table.rate > 0 || a.Has("rate") ? "frequency (Hz)" : "frequency (cycles/sample)";
    if (a.Has("plot") && !twa::Plot(a.Get("plot"), {"power spectrum of " + table.names[static_cast<size_t>(c)],
                                                    unit, "power (dB)", true},
                                    freq, db, &error))
        return Fail(error);
    return 0;
}

struct Command {
    const char* name;
    int (*run)(const Args&);
    const char* usage;
    const char* help;
    std::vector<std::string> flags;
};

int DemoCommand(const Args&) { return Demo(); }

const Command kCommands[] = {
    {"demo", DemoCommand, "twa demo", "Statistics, histogram and windowed spectrum of a built-in signal.\n", {}},
    {"stats", StatsCommand, kStatsUsage, kStatsHelp, {}},
    {"spectrum", SpectrumCommand, kSpectrumUsage, kSpectrumHelp, {}},
    {"window", WindowCommand, kWindowUsage, kWindowHelp, {}},
};

int Help() {
    std::printf("twa: the twanlys library from the command line\n\n");
    for (const Command& c : kCommands) std::printf("  %s\n", c.usage);
    std::printf("\n`twa COMMAND --help` describes a command. Exit status: 0 done, 1 failed, 2 usage error.\n");
    return 0;
}

}  // namespace

int main(int argc, char** argv) {
    const std::string name = argc > 1 ? argv[1] : "";
    if (name == "help" || name == "--help" || name == "-h") return Help();
    for (const Command& c : kCommands) {
        if (name != c.name) continue;
        const Args a = Parse(argc, argv, c.flags);
        if (a.Has("help")) {
            std::printf("usage: %s\n\n", c.usage);
            std::printf(c.help, WindowNames().c_str());
            return 0;
        }
        return c.run(a);
    }
    Help();
    return 2;
}
