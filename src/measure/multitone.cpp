#include "measure/multitone.hpp"

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstring>

#include "transform/fft/fft.hpp"
#include "window/window_dispatch.hpp"

namespace tw {
namespace {

using cd = std::complex<double>;

constexpr double kPi = 3.141592653589793;
constexpr double kRoot2 = 1.4142135623730951;

// Candidate of the peak scan: three neighbouring bins from frequency f1 (cycles per sample).
struct PeakRecord {
    double f1, spacing, value;
    int32_t count;
    int32_t bin;  // index of the first bin
    cd bins[3];
};

struct Tone {
    PeakRecord peak;
    double f, amplitude, phase;  // current estimates: cycles per sample, spectrum units, degrees
    cd a;                        // complex amplitude: the tone is a at f plus its conjugate at -f
    double lastF, lastAmplitude, lastPhase;
    bool converged;
};

// Periodic Hann spectrum of a unit phasor at offset g (cycles per sample) from a bin, normalised
// to 1 at g = 0.
struct Kernel {
    int32_t n;
    cd Dirichlet(double g) const {
        const double s = std::sin(kPi * g);
        // At whole cycles the ratio is the limit cos(n pi g) / cos(pi g).
        const double ratio = std::fabs(s) < 1e-300 ? std::cos(n * kPi * g) / std::cos(kPi * g)
                                                   : std::sin(n * kPi * g) / (n * s);
        const double phase = (1 - n) * kPi * g;
        return {ratio * std::cos(phase), ratio * std::sin(phase)};
    }
    cd operator()(double g) const {
        const double step = 1.0 / n;
        return Dirichlet(g) - (Dirichlet(g - step) + Dirichlet(g + step)) * 0.5;
    }
};

// Least-squares complex amplitude a of a tone at f on bins k, k+1 holding y, modelled as
// a H(k/n - f) + conj(a) H(k/n + f): a real fit in (Re a, Im a) over the two complex bins.
cd FitPair(const Kernel& h, double f, int32_t k, const cd* y) {
    double spp = 0, spq = 0, sqq = 0, spy = 0, sqy = 0;
    for (int32_t j = 0; j < 2; ++j) {
        const double bin = static_cast<double>(k + j) / h.n;
        const cd k1 = h(bin - f), k2 = h(bin + f);
        const cd p = k1 + k2, q = cd(0, 1) * (k1 - k2);
        spp += std::norm(p);
        sqq += std::norm(q);
        spq += (std::conj(p) * q).real();
        spy += (std::conj(p) * y[j]).real();
        sqy += (std::conj(q) * y[j]).real();
    }
    const double det = spp * sqq - spq * spq;
    if (det == 0) return 0;
    return {(sqq * spy - spq * sqy) / det, (spp * sqy - spq * spy) / det};
}

// Balance: the amplitude seen on the upper pair less that on the lower pair; 0 at the tone.
double Balance(const Kernel& h, double f, int32_t k, const cd* y) {
    return std::abs(FitPair(h, f, k + 1, y + 1)) - std::abs(FitPair(h, f, k, y));
}

double Slope(const Kernel& h, double f, int32_t k, const cd* y) {
    return (Balance(h, f + 9.313225746154785e-10, k, y) - Balance(h, f - 9.313225746154785e-10, k, y)) /
           1.862645149230957e-09;
}

// The start bracket is chosen on the balance itself (it changes sign at the tone), and the final
// complex amplitude is the mean of the two pair fits, or the one pair at an edge of the record.
void Estimate(const Kernel& h, const PeakRecord& r, const cd* y, Tone* t) {
    const double b = r.spacing, f1 = r.f1;
    const int32_t k = r.bin;
    const double lo = f1, hi = f1 + 2 * b;
    const double c = f1 + b;
    // Bracket on the side where the balance changes sign, then one secant step as the start.
    double a0 = f1 + 0.75 * b, a1 = c;
    if ((Balance(h, c, k, y) > 0) == (Balance(h, a0, k, y) > 0)) a0 = c, a1 = f1 + 1.25 * b;
    const double g0 = Balance(h, a0, k, y), g1 = Balance(h, a1, k, y);
    double f = g1 != g0 ? a0 - g0 * (a1 - a0) / (g1 - g0) : c;
    if (!(f >= lo && f <= hi)) f = 0.5 * (lo + hi);
    for (int it = 0; it < 100; ++it) {
        const double d = Slope(h, f, k, y);
        if (d == 0 || !std::isfinite(d)) break;
        const double step = Balance(h, f, k, y) / d;
        const double next = f - step;
        // A step out of the record keeps the last estimate inside it.
        if (!(next >= lo && next <= hi)) break;
        f = next;
        if (std::fabs(step) <= 1e-7 * std::fabs(f)) break;
    }
    // Both pairs with half weights; at an edge only the pair that holds the tone.
    const cd lower = FitPair(h, f, k, y), upper = FitPair(h, f, k + 1, y + 1);
    cd a = 0.5 * (lower + upper);
    if (std::fabs(f - lo) <= 1e-6 * b) a = lower;
    else if (std::fabs(f - hi) <= 1e-6 * b) a = upper;
    t->f = f;
    t->a = a;
    t->amplitude = std::abs(a);
    t->phase = std::atan2(a.imag(), a.real()) * 180 / 3.141592653589793;
}

double Change(double a, double b) {
    const double m = std::max(std::fabs(a), std::fabs(b));
    return std::fabs(a - b) / (m < 1e-12 ? 1 : m);
}

// Bin k (0 <= k <= n) of the spectrum held half-complex in h.
cd Bin(const double* h, int32_t n, int32_t k) {
    if (k == 0 || k == n) return {h[0], 0};
    if (2 * k == n) return {h[k], 0};
    return 2 * k < n ? cd(h[k], h[n - k]) : cd(h[n - k], -h[k]);
}

// The scaled, windowed spectrum of x in X[0..count), count at most n + 1.
Status Spectrum(const FftTable* table, const double* x, int32_t n, double* work, double* half, cd* X,
                int32_t count) {
    const double scale = 2.8284271247461903 / n;
    for (int32_t i = 0; i < n; ++i) work[i] = x[i] * scale;
    Status s = CosineSumByNumber(work, n, 1, 0);
    if (s == 0) s = FftRealForward(table, work, half, 1, 1, n);
    for (int32_t k = 0; s == 0 && k < count; ++k) X[k] = Bin(half, n, k);
    return s;
}

// Peaks of the magnitudes above L, at most maxTones, the smallest giving way to larger ones.
int32_t ScanPeaks(const cd* X, const double* m, int32_t range, int32_t n, double limit, int32_t maxTones,
                  PeakRecord* held) {
    int32_t count = 0;
    for (int32_t i = 0; i < range - 1;) {
        const double a = m[i], b = m[i + 1], c = m[i + 2];
        if (!(a >= limit || b >= limit || c >= limit)) {
            ++i;
            continue;
        }
        if (!((a <= b && c <= b) || (i == 0 && a >= b && a > c))) {
            ++i;
            continue;
        }
        const double value = std::max({a, b, c});
        int32_t slot = count;
        if (count == maxTones) {
            slot = 0;
            for (int32_t j = 1; j < count; ++j)
                if (held[j].value < held[slot].value) slot = j;
            if (value < held[slot].value) {
                ++i;
                continue;
            }
        } else {
            ++count;
        }
        held[slot] = {static_cast<double>(i) / n, 1.0 / n, value, i + 2 == range ? 2 : 3, i, {X[i], X[i + 1], X[i + 2]}};
        i += 2;
    }
    return count;
}

}  // namespace

Status MultitoneCore(const double* x, int32_t n, double dt, int32_t sort, int32_t residualMode, double threshold,
                     int32_t maxTones, MultitoneOutputs* out) {
    out->found = 0;
    out->dt = out->f0 = out->df = 0;
    if (n < 3) return TooFewSamples3Err;
    if (!(dt > 0)) return SampleIntervalErr;
    if (residualMode < 0 || residualMode > 3) return InvalidSelectorErr;
    if (maxTones < 1) return BadDataRangeErr;
    const int32_t range = (n + 1) / 2;
    const auto un = static_cast<size_t>(n);
    Scratch<double> work, half, mags;
    Scratch<cd> X;
    Scratch<Tone> tones;
    Scratch<PeakRecord> held;
    Status s = work.Allocate(un);
    if (s == 0) s = half.Allocate(un);
    if (s == 0) s = X.Allocate(static_cast<size_t>(range) + 1);
    if (s == 0) s = mags.Allocate(static_cast<size_t>(range) + 1);
    if (s == 0) s = held.Allocate(static_cast<size_t>(maxTones));
    if (s == 0) s = tones.Allocate(static_cast<size_t>(maxTones));
    FftTable* table = s == 0 ? CreateFftTable(n) : nullptr;
    if (s == 0 && table == nullptr) s = OutOfMemoryErr;
    if (s == 0) s = Spectrum(table, x, n, work.get(), half.get(), X.get(), range + 1);
    if (s != 0) {
        DestroyFftTable(table);
        return s;
    }
    for (int32_t k = 0; k < range; ++k) mags[static_cast<size_t>(k)] = std::sqrt(std::norm(X[static_cast<size_t>(k)]));
    mags[static_cast<size_t>(range)] = 0;
    const int32_t peaks = ScanPeaks(X.get(), mags.get(), range, n, threshold / 2.2627416997969525, maxTones, held.get());

    const Kernel h{n};
    for (int32_t i = 0; i < peaks; ++i) {
        tones[static_cast<size_t>(i)] = {};
        tones[static_cast<size_t>(i)].peak = held[static_cast<size_t>(i)];
    }
    for (int round = 0; round < 10 && peaks > 0; ++round) {
        bool all = true;
        for (int32_t i = 0; i < peaks; ++i) {
            Tone& t = tones[static_cast<size_t>(i)];
            if (t.converged) continue;
            cd y[3] = {t.peak.bins[0], t.peak.bins[1], t.peak.bins[2]};
            // The first round sees the records as scanned; later ones take the other tones'
            // leakage off, both frequency images, using the estimates of the round before.
            if (round > 0) {
                const int32_t k0 = t.peak.bin;
                for (int32_t j = 0; j < peaks; ++j) {
                    const Tone& o = tones[static_cast<size_t>(j)];
                    if (j == i || o.amplitude < 1e-4 * t.peak.value) continue;
                    for (int32_t q = 0; q < 3; ++q) {
                        const double bin = static_cast<double>(k0 + q) / n;
                        y[q] -= o.a * h(bin - o.f) + std::conj(o.a) * h(bin + o.f);
                    }
                }
            }
            Estimate(h, t.peak, y, &t);
            if (round > 0) {
                t.converged = Change(t.f, t.lastF) < 0.001 && Change(t.amplitude, t.lastAmplitude) < 0.001 &&
                              Change(t.phase, t.lastPhase) < 0.001;
            }
            all = all && t.converged;
        }
        for (int32_t i = 0; i < peaks; ++i) {
            Tone& t = tones[static_cast<size_t>(i)];
            t.lastF = t.f, t.lastAmplitude = t.amplitude, t.lastPhase = t.phase;
        }
        if (all && round > 0) break;
    }

    int32_t found = 0;
    for (int32_t i = 0; i < peaks; ++i) {
        const Tone& t = tones[static_cast<size_t>(i)];
        const double amplitude = t.amplitude * kRoot2;
        if (amplitude < threshold) continue;
        out->frequencies[found] = t.f / dt;
        out->amplitudes[found] = amplitude;
        out->phases[found] = t.phase + 90.0;
        ++found;
    }
    // Sort the three arrays together through an index permutation.
    Scratch<int32_t> order;
    Scratch<double> column;
    if (found > 0 && ((s = order.Allocate(static_cast<size_t>(found))) != 0 ||
                      (s = column.Allocate(static_cast<size_t>(found))) != 0)) {
        DestroyFftTable(table);
        return s;
    }
    for (int32_t i = 0; i < found; ++i) order[static_cast<size_t>(i)] = i;
    const double* fr = out->frequencies;
    const double* am = out->amplitudes;
    std::stable_sort(order.get(), order.get() + found, [&](int32_t a, int32_t b) {
        return sort == 1 ? am[a] > am[b] : fr[a] < fr[b];
    });
    for (double* a : {out->frequencies, out->amplitudes, out->phases}) {
        for (int32_t i = 0; i < found; ++i) column[static_cast<size_t>(i)] = a[order[static_cast<size_t>(i)]];
        std::copy(column.get(), column.get() + found, a);
    }
    out->found = found;
    out->dt = dt;
    out->f0 = 0;
    out->df = 1 / (n * dt);

    if (residualMode != 0) {
        double* r = out->residual;
        if (residualMode == 1) {
            std::copy(x, x + n, r);
        } else {
            for (int32_t k = 0; k < n; ++k) {
                double sum = 0;
                for (int32_t j = 0; j < found; ++j)
                    sum += out->amplitudes[j] *
                           std::sin(2 * kPi * out->frequencies[j] * (k * dt) + out->phases[j] * kPi / 180);
                r[k] = residualMode == 2 ? sum : x[k] - sum;
            }
        }
        s = Spectrum(table, r, n, work.get(), half.get(), X.get(), range);
        for (int32_t k = 0; s == 0 && k < range; ++k)
            out->spectrum[k] = 10 * std::log10(std::norm(X[static_cast<size_t>(k)]));
    }
    DestroyFftTable(table);
    return s;
}

}  // namespace tw
