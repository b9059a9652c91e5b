#include "window/cosine_sum.hpp"

#include "window/rotation.hpp"

namespace tw {
namespace {

// One cosine term: its signed amplitude and its phasor, which starts as (amplitude, 0).
struct Term {
    double amp;
    double re;
    double im;
    Rotation rot;
};

}  // namespace

template <class T>
Status CosineSum(T* x, int32_t n, const double* a, int32_t m, bool scaled) {
    if (n < 1 || m < 1) return EmptyArrayErr;
    if (n == 1 || (m == 1 && a[0] == 1)) return 0;
    if (scaled && a[0] == 0) return WindowSumZeroErr;
    Scratch<Term> terms;
    if (const Status s = terms.Allocate(static_cast<size_t>(m))) return s;
    const double divisor = scaled ? a[0] : 1.0;
    double sum = 0;
    for (int32_t j = 0; j < m; ++j) {
        const double amp = (j % 2 ? -a[j] : a[j]) / divisor;
        terms[j] = {amp, amp, 0.0, j > 0 ? RotationOf(j, n) : Rotation{0, 0}};
        sum += amp;
    }
    x[0] *= sum;
    auto next = [&] {
        double v = 0;
        for (int32_t j = 1; j < m; ++j) {
            Rotate(terms[j].re, terms[j].im, terms[j].rot);
            v += terms[j].re;
        }
        return v + terms[0].amp;
    };
    for (int32_t k = 1; k <= (n - 1) / 2; ++k) {
        const double v = next();
        x[k] *= v;
        x[n - k] *= v;
    }
    if (n % 2 == 0) x[n / 2] *= next();
    return terms.Release();
}

template Status CosineSum<double>(double*, int32_t, const double*, int32_t, bool);
template Status CosineSum<cdouble>(cdouble*, int32_t, const double*, int32_t, bool);

}  // namespace tw
