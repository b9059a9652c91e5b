#include <algorithm>
#include <cmath>

#include "signal/convolve.hpp"
#include "transform/fft/fft.hpp"

namespace tw {
namespace {

constexpr double kSmallestNormal = 2.2250738585072014e-308;

// The zero-state direct-form filter b/a driven by a unit impulse: out[i] is the i-th coefficient
// of the series b(z)/a(z), which makes the first outputs the quotient of a long division. The
// per-sample accumulation keeps the filter's order (b terms, then a[j] for j from the top down,
// then the division by a0, then the underflow flush); terms that only meet the zero state or
// zero input add nothing and are skipped.
void ImpulseResponse(const double* b, int32_t nb, const double* a, int32_t na, double* out, int32_t n) {
    for (int32_t i = 0; i < n; ++i) {
        double acc = 0.0;
        if (i < nb) acc += b[i];
        for (int32_t j = std::min(na - 1, i); j >= 1; --j) acc -= a[j] * out[i - j];
        double v = acc / a[0];
        if (std::fabs(v) <= kSmallestNormal) v = 0.0;
        out[i] = v;
    }
}

// Long division after skipping the divisor's s leading zeros; the quotient starts at index s.
Status LongDivision(const double* x, int32_t nx, const double* y, int32_t ny, double* q) {
    int32_t s = 0;
    while (s < ny && y[s] == 0.0) ++s;
    if (s == ny) return DivisorLeadingZeroErr;
    const int32_t d = ny - s;
    const int32_t len = nx - d + 1;
    Scratch<double> out;
    if (const Status st = out.Allocate(static_cast<size_t>(len))) return st;
    ImpulseResponse(x, nx, y + s, d, out.get(), len);
    std::copy(out.get() + s, out.get() + len, q);
    return out.Release();
}

int32_t PowerOfTwoAtLeast(int32_t n) {
    int32_t p = 1;
    while (p < n) p *= 2;
    return p;
}

}  // namespace

Status Deconvolve(const double* x, int32_t nx, const double* y, int32_t ny, double* q) {
    const int32_t n = PowerOfTwoAtLeast(nx);
    const int32_t h = n / 2;
    CallTable call(n);
    FftTable* table = call.get();
    if (table == nullptr) return OutOfMemoryErr;
    Scratch<double> work;
    Status s = work.Allocate(3 * static_cast<size_t>(n));
    double* a = work.get();
    double* yf = a + n;
    double* xf = yf + n;
    if (s == 0) {
        std::copy(y, y + ny, a);
        std::fill(a + ny, a + n, 0.0);
        s = FftRealForward(table, a, yf, 1, 1, n);
    }
    // The singular test pairs bin k with index h + k of the packing, not with its imaginary part
    // at n - k: only a divisor zero at bin 0, n/4 or n/2 is caught. Kept as it stands.
    bool singular = false;
    const double tol = std::min(n * 0x1p-52, 1e-09);
    for (int32_t k = 0; s == 0 && k <= h && !singular; ++k) {
        const double re = yf[k];
        const double other = (k == 0 || k == h) ? 0.0 : yf[h + k];
        singular = std::fabs(re) < tol && std::fabs(other) < tol;
    }
    if (s == 0 && singular) {
        s = LongDivision(x, nx, y, ny, q);
    } else if (s == 0) {
        std::copy(x, x + nx, a);
        std::fill(a + nx, a + n, 0.0);
        s = FftRealForward(table, a, xf, 1, 1, n);
        if (s == 0) {
            xf[0] = xf[0] / yf[0];
            for (int32_t k = 1; k < h; ++k) {
                const double yr = yf[k], yi = yf[n - k], xr = xf[k], xi = xf[n - k];
                const double r = 1.0 / (yr * yr + yi * yi);
                xf[k] = (xr * yr + xi * yi) * r;
                xf[n - k] = (xi * yr - xr * yi) * r;
            }
            if (n > 1) xf[h] = xf[h] / yf[h];
            s = FftRealInverse(table, xf, a, 1, 1, n);
        }
        if (s == 0) std::copy(a, a + (nx - ny + 1), q);
    }
    return MergeRelease(s, work.Release());
}

}  // namespace tw
