#include "transform/hartley.hpp"

namespace tw {

Status HartleyTransform(const FftTable* table, double* x, int32_t n, bool inverse) {
    if (n == 1) return 0;
    Scratch<double> h;
    Status s = h.Allocate(static_cast<size_t>(n));
    if (s == 0) s = FftRealForward(table, x, h.get(), 1, 1, n);
    if (s == 0) {
        const double* H = h.get();
        x[0] = H[0];
        for (int32_t k = 1; k <= (n - 1) / 2; ++k) {
            x[k] = H[k] - H[n - k];
            x[n - k] = H[k] + H[n - k];
        }
        if (n % 2 == 0) x[n / 2] = H[n / 2];
        if (inverse) {
            const double scale = 1.0 / n;
            for (int32_t k = 0; k < n; ++k) x[k] *= scale;
        }
    }
    return MergeRelease(s, h.Release());
}

Status HilbertTransform(const FftTable* table, double* x, int32_t n, bool inverse) {
    if (n == 1) {
        x[0] = 0;
        return 0;
    }
    Scratch<double> h;
    Status s = h.Allocate(static_cast<size_t>(n));
    if (s == 0) s = FftRealForward(table, x, h.get(), 1, 1, n);
    if (s == 0) {
        double* H = h.get();
        H[0] = 0;
        if (n % 2 == 0) H[n / 2] = 0;
        for (int32_t k = 1; k <= (n - 1) / 2; ++k) {
            const double r = H[k], i = H[n - k];
            H[k] = i;
            H[n - k] = -r;
        }
        s = FftRealInverse(table, H, x, 1, 1, n);
    }
    if (s == 0 && inverse)
        for (int32_t k = 0; k < n; ++k) x[k] = -x[k];
    return MergeRelease(s, h.Release());
}

}  // namespace tw
