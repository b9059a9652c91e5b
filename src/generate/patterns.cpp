#include "generate/patterns.hpp"

#include <algorithm>
#include <cmath>
#include <numbers>

#include "generate/waveforms.hpp"

namespace tw {
namespace {

constexpr double kPi = std::numbers::pi;

template <class Shape>
void OnTimes(double* y, int32_t n, bool timeArray, double dt, double delay, Shape shape) {
    for (int32_t k = 0; k < n; ++k) y[k] = shape(timeArray ? y[k] : k * dt - delay);
}

}  // namespace

void SinePattern(double* y, int32_t n, double amplitude, double phase, double cycles) {
    SineWave(y, n, amplitude, cycles / n, &phase);
}

void SquarePattern(double* y, int32_t n, double amplitude, double duty, double cycles) {
    if (duty == 100) {
        std::fill(y, y + n, amplitude);
        return;
    }
    const double period = std::trunc(n / cycles + 0.5);
    const double high = std::trunc(duty * 0.01 * period + 0.5);
    // A period beyond the block (tiny cycles) leaves k rem P = k.
    const int32_t p = period < n ? static_cast<int32_t>(period) : n;
    for (int32_t k = 0; k < n; ++k) y[k] = k % p < high ? amplitude : 0.0;
}

void PulsePattern(double* y, int32_t n, double amplitude, int32_t delay, int32_t width) {
    std::fill(y, y + n, 0.0);
    std::fill(y + delay, y + delay + width, amplitude);
}

void SincPattern(double* y, int32_t n, double amplitude, double delay, double dt) {
    for (int32_t k = 0; k < n; ++k) {
        const double x = (k * dt - delay) * kPi;
        y[k] = x == 0 ? amplitude : amplitude * std::sin(x) / x;
    }
}

void Ramp(double* y, int32_t n, double start, double end, int32_t excludeEnd, uint32_t scale) {
    const int32_t steps = excludeEnd == 0 ? n - 1 : n;
    y[0] = start;
    if (scale == 0) {
        const double step = (end - start) / steps;
        for (int32_t k = 1; k < n; ++k) y[k] = k * step + start;
    } else {
        const double a = std::log10(start), b = std::log10(end);
        const double step = (b - a) / steps;
        for (int32_t k = 1; k < n; ++k) y[k] = std::pow(10.0, k * step + a);
    }
    if (excludeEnd == 0) y[n - 1] = end;
}

void AperiodTriangle(double* y, int32_t n, bool timeArray, double dt, double delay, double amplitude,
                     double width, double skew) {
    // Given times are centred on the pulse; the grid starts at its foot.
    if (timeArray)
        for (int32_t k = 0; k < n; ++k) y[k] += width * 0.5;
    const double w = width;
    if (skew == 0 || skew == 1) {
        const double slope = amplitude / w;
        const bool falling = skew == 0;
        OnTimes(y, n, timeArray, dt, delay, [=](double t) {
            if (!(t >= 0 && t <= w)) return 0.0;
            return falling ? (w - t) * slope : slope * t;
        });
        return;
    }
    const double m = skew * w;
    const double rise = amplitude / m, fall = amplitude / (w - m);
    OnTimes(y, n, timeArray, dt, delay, [=](double t) {
        if (t >= 0 && t <= m) return rise * t;
        if (t > m && t <= w) return (w - t) * fall;
        return 0.0;
    });
}

void GaussPulse(double* y, int32_t n, bool timeArray, double dt, double delay, double amplitude, double fc,
                double bandwidth, double attenuation) {
    const double g = (-5 * (bandwidth * bandwidth) / std::numbers::ln10) / attenuation;
    OnTimes(y, n, timeArray, dt, delay, [=](double t) {
        const double u = t * fc * kPi;
        return amplitude * std::exp(u * u * g) * std::cos(2 * u);
    });
}

void GaussMonopulse(double* y, int32_t n, bool timeArray, double dt, double delay, double fc,
                    double amplitude) {
    const double d = 2 * amplitude * std::sqrt(2.718281828459045);
    OnTimes(y, n, timeArray, dt, delay, [=](double t) {
        const double u = t * fc * kPi;
        return u * d * std::exp(-2 * u * u);
    });
}

void PeriodicSinc(double* y, int32_t n, bool timeArray, double dt, double delay, double amplitude,
                  int32_t order) {
    const double N = order;
    OnTimes(y, n, timeArray, dt, delay, [=](double t) {
        const double x = t * 0.5;
        const double s = std::sin(x);
        // An absolute test, so even orders give +1 (not the limit -1) at odd multiples of pi.
        const double shape = std::fabs(s) <= 0x1p-52 ? 1.0 : std::sin(N * x) / (N * s);
        return amplitude * shape;
    });
}

}  // namespace tw
