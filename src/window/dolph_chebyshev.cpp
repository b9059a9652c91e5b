#include "window/dolph_chebyshev.hpp"

#include <algorithm>
#include <cmath>
#include <limits>
#include <numbers>

namespace tw {

template <class T>
Status DolphChebyshevWindow(T* x, int32_t n, double s, int32_t symmetric,
                            const ChebyshevTransforms& transforms) {
    if (!(s >= 1)) s = 1;
    if (n < 1) return EmptyArrayErr;
    if (n == 1) return 0;
    if (symmetric == 0 && n == std::numeric_limits<int32_t>::max()) return OutOfMemoryErr;
    const int32_t N = symmetric == 0 ? n + 1 : n;
    const int32_t h = (N + 1) / 2;
    Scratch<double> v, w;
    Status status = v.Allocate(static_cast<size_t>(h));
    if (status == 0) status = w.Allocate(static_cast<size_t>(N));
    if (status != 0) return status;

    // Samples of the Chebyshev polynomial T_{N-1}(x0 cos(pi k / N)), which is s at k = 0.
    const double x0 = std::cosh(std::log(s + std::sqrt(s * s - 1)) / (N - 1));
    const double cos1 = std::cos(std::numbers::pi / N);
    double cosPrev = 1, cosK = 1;
    v[0] = s;
    for (int32_t k = 1; k < h; ++k) {
        const double next = k == 1 ? cos1 : 2 * cos1 * cosK - cosPrev;
        cosPrev = cosK;
        cosK = next;
        const double t = x0 * cosK;
        v[k] = std::fabs(t) > 1 ? std::cosh((N - 1) * std::acosh(std::fabs(t)))
                                : std::cos((N - 1) * std::acos(t));
    }
    if (N % 2) {
        status = transforms.inverseReal(v.get(), N, w.get());
    } else {
        v[0] *= std::sqrt(0.5);
        status = transforms.inverseCosine(v.get(), h, w.get());
    }
    if (status == 0) {
        // The transform gives the half from the centre outwards; mirror it into the full window.
        std::copy(w.get() + N % 2, w.get() + h, w.get() + h);
        std::reverse(w.get(), w.get() + h);
        const double scale = 1 / *std::max_element(w.get(), w.get() + h);
        for (int32_t i = 0; i < n; ++i) x[i] *= w[i] * scale;
    }
    status = MergeRelease(status, w.Release());
    return MergeRelease(status, v.Release());
}

template Status DolphChebyshevWindow<double>(double*, int32_t, double, int32_t, const ChebyshevTransforms&);
template Status DolphChebyshevWindow<cdouble>(cdouble*, int32_t, double, int32_t, const ChebyshevTransforms&);

}  // namespace tw
