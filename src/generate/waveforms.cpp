#include "generate/waveforms.hpp"

#include <algorithm>
#include <cmath>
#include <numbers>

#include "frame/frame.hpp"

namespace tw {
namespace {

constexpr double kPi = std::numbers::pi;
constexpr double kInv180 = 1.0 / 180.0;

// Square, triangle and sawtooth evaluate the phase of every sample afresh from the entry phase, so
// that no rounding accumulates over long runs of blocks.
template <class Shape>
void PhaseStepped(double* y, int32_t n, double amplitude, double frequency, double* phase, Shape shape) {
    const double p0 = *phase;
    for (int32_t k = 0; k < n; ++k) y[k] = amplitude * shape(FoldDegrees(k * 360.0 * frequency + p0));
    *phase = FoldDegrees(n * 360.0 * frequency + p0);
}

// One period of m samples read at position t.
double TableValue(const double* table, int32_t m, double t, int32_t interpolation) {
    if (m < 1) return 0.0;
    double r = std::fmod(t, static_cast<double>(m));
    if (r < 0) r += m;
    // Only a position that overflowed (a step near the f64 limit) has no sample.
    if (std::isnan(r)) return kNaN;
    // A tiny negative remainder rounds up to m itself: that position is index 0.
    int32_t i = static_cast<int32_t>(r);
    if (i >= m) i -= m;
    if (interpolation != 1) return table[i];
    return table[i] + (r - std::floor(r)) * (table[(i + 1) % m] - table[i]);
}

}  // namespace

double FoldDegrees(double p) {
    const double x = std::fmod(p, 360.0);
    return x < 0 ? x + 360.0 : x;
}

void SineWave(double* y, int32_t n, double amplitude, double frequency, double* phase) {
    const double w = frequency * 2 * kPi;
    const double p = *phase * (kPi / 180);
    // Two-step recurrence: no sine call per sample. The clamp keeps the rounding drift of very
    // long blocks from carrying the sine branch beyond its amplitude.
    const long double c = 2 * std::sin(static_cast<long double>(w));
    const double limit = std::fabs(amplitude);
    y[0] = amplitude * std::sin(p);
    if (n > 1) {
        long double q0 = amplitude * std::cos(p);
        long double q1 = amplitude * std::cos(p + w);
        y[1] = amplitude * std::sin(p + w);
        for (int32_t k = 2; k < n; ++k) {
            const long double v = c * q1 + y[k - 2];
            y[k] = std::clamp(static_cast<double>(v), -limit, limit);
            const long double q = q0 - c * y[k - 1];
            q0 = q1;
            q1 = q;
        }
    }
    *phase = FoldDegrees(*phase + n * frequency * 360);
}

void SquareWave(double* y, int32_t n, double amplitude, double frequency, double* phase, double duty) {
    duty = std::clamp(duty, 0.0, 100.0);
    const double edge = duty * 3.6;
    PhaseStepped(y, n, amplitude, frequency, phase, [edge](double x) { return x < edge ? 1.0 : -1.0; });
}

void TriangleWave(double* y, int32_t n, double amplitude, double frequency, double* phase) {
    PhaseStepped(y, n, amplitude, frequency, phase, [](double x) {
        const double u = x * kInv180;
        return u < 0.5 ? 2 * u : u < 1.5 ? 2 * (1 - u) : 2 * (u - 2);
    });
}

void SawtoothWave(double* y, int32_t n, double amplitude, double frequency, double* phase) {
    PhaseStepped(y, n, amplitude, frequency, phase, [](double x) {
        const double v = x * kInv180;
        return x >= 180 ? v - 2 : v;
    });
}

Status ArbitraryWave(double* y, int32_t n, double amplitude, double frequency, double* phase,
                     const double* table, int32_t m, int32_t interpolation) {
    if (!std::isfinite(*phase) || !std::isfinite(frequency)) return NanInfErr;
    double t = (static_cast<double>(m) / 360) * *phase;
    const double step = m * frequency;
    for (int32_t k = 0; k < n; ++k) {
        y[k] = TableValue(table, m, t, interpolation) * amplitude;
        t += step;
    }
    *phase = m < 1 ? 0.0 : FoldDegrees(t * 360 / m);
    return 0;
}

void Chirp(double* y, int32_t n, double amplitude, double start, double end) {
    for (int32_t k = 0; k < n; ++k)
        y[k] = amplitude * std::sin(((end - start) * kPi / n * k + start * 2 * kPi) * k);
}

}  // namespace tw
