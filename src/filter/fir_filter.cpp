#include "filter/fir_filter.hpp"

#include <algorithm>

#include "signal/convolve.hpp"

namespace tw {

int64_t NarrowbandLength(const NarrowbandTaps& f, int32_t n) {
    if (f.L == 1) return int64_t{f.nModel} + n - 1;
    return int64_t{f.nModel - 1} * f.L + f.nImage + n - 1;
}

Status NarrowbandFilter(const NarrowbandTaps& f, const double* x, int32_t n, double* y) {
    int64_t centre = 0;
    if (f.L == 1) {
        ConvolveDirect(x, n, f.model, f.nModel, y);
        centre = static_cast<int64_t>(0.5 * (f.nModel - 1));
    } else {
        const int32_t nt = f.nImage + n - 1;
        Scratch<double> t;
        if (const Status s = t.Allocate(static_cast<size_t>(nt))) return s;
        ConvolveDirect(x, n, f.image, f.nImage, t.get());
        std::fill(y, y + NarrowbandLength(f, n), 0.0);
        for (int32_t j = 0; j < f.nModel; ++j) {
            double* out = y + int64_t{j} * f.L;
            const double m = f.model[j];
            for (int32_t i = 0; i < nt; ++i) out[i] += t[static_cast<size_t>(i)] * m;
        }
        centre = static_cast<int64_t>(0.5 * (double(int64_t{f.nModel - 1} * f.L) + f.nImage - 1));
        if (const Status s = t.Release()) return s;
    }
    if (f.filterClass >= 3)
        for (int32_t i = 0; i < n; ++i) y[centre + i] += x[i];
    return 0;
}

Status CxNarrowbandFilter(const NarrowbandTaps& f, const std::complex<double>* x, int32_t n,
                          std::complex<double>* y) {
    const int64_t ny = NarrowbandLength(f, n);
    Scratch<double> work;
    if (const Status s = work.Allocate(static_cast<size_t>(n) + 2 * static_cast<size_t>(ny))) return s;
    double* part = work.get();
    double* re = part + n;
    double* im = re + ny;
    for (int32_t i = 0; i < n; ++i) part[i] = x[i].real();
    Status s = NarrowbandFilter(f, part, n, re);
    for (int32_t i = 0; s == 0 && i < n; ++i) part[i] = x[i].imag();
    if (s == 0) s = NarrowbandFilter(f, part, n, im);
    for (int64_t i = 0; s == 0 && i < ny; ++i) y[i] = {re[i], im[i]};
    return MergeRelease(s, work.Release());
}

}  // namespace tw
