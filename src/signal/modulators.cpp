#include "signal/modulators.hpp"

#include <cmath>
#include <cstring>

#include "signal/calculus.hpp"

namespace tw {

namespace {

// The oscillator runs uncorrected: (c, s) turns by w each step from (cos phase, sin phase), so
// blocks of any split see the same drift as one call.
template <class Sample>
void Rotate(int32_t n, double w, double* phase, Sample sample) {
    const double cw = std::cos(w), sw = std::sin(w);
    double c = std::cos(*phase), s = std::sin(*phase);
    for (int32_t k = 0; k < n; ++k) {
        sample(k, c, s);
        const double nc = cw * c - sw * s;
        s = c * sw + cw * s;
        c = nc;
    }
    const double p = *phase + n * w;
    *phase = p - kTwoPi * std::floor(p / kTwoPi);
}

double Load(const void* x, int32_t i) {
    double v;
    std::memcpy(&v, static_cast<const unsigned char*>(x) + 8 * static_cast<size_t>(i), sizeof v);
    return v;
}

void Store(void* x, int32_t i, double v) {
    std::memcpy(static_cast<unsigned char*>(x) + 8 * static_cast<size_t>(i), &v, sizeof v);
}

template <bool Frequency>
void Modulate(int32_t n, double k, double* phase, double carrier, void* x, double* peak, double* acc) {
    const double limit = kTwoPi / k;
    double a = *acc, top = *peak, out = 0;
    for (int32_t i = 0; i < n; ++i) {
        const double v = Load(x, i);
        if (std::fabs(std::trunc(v)) > std::fabs(std::trunc(top))) top = v;
        if constexpr (Frequency)
            a = v * kTwoPi + carrier * kTwoPi + a;
        else
            a += carrier * kTwoPi;
        // Every value below the limit, negative or not, moves up by it: k a changes by 2 pi, so
        // the sine is the same, but the phase output shows the step.
        if (a >= limit)
            a -= limit;
        else
            a += limit;
        if constexpr (Frequency)
            out = std::sin(a * k);
        else
            out = std::sin(a * k + v * kPi / 180);
        Store(x, i, out);
    }
    *peak = top;
    *acc = a;
    *phase = a * k * 180 / kPi;
    if constexpr (!Frequency) *phase = *phase + out;
}

}  // namespace

void ModulateComplex(cdouble* x, int32_t n, double w, double* phase) {
    Rotate(n, w, phase, [x](int32_t k, double c, double s) {
        const double re = x[k].real(), im = x[k].imag();
        x[k] = {re * c - im * s, re * s + im * c};
    });
}

void ModulateReal(const double* x, int32_t n, double w, double* phase, cdouble* y) {
    Rotate(n, w, phase, [x, y](int32_t k, double c, double s) { y[k] = {x[k] * c, x[k] * s}; });
}

void PhaseModulate(int32_t n, double k, double* phase, double carrier, void* x, double* peak, double* acc) {
    Modulate<false>(n, k, phase, carrier, x, peak, acc);
}

void FrequencyModulate(int32_t n, double k, double* phase, double carrier, void* x, double* peak,
                       double* acc) {
    Modulate<true>(n, k, phase, carrier, x, peak, acc);
}

}  // namespace tw
