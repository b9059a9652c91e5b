#include "filter/smoothing.hpp"
#include "frame/frame.hpp"
#include "twanlys/smoothing.h"

using namespace tw;

namespace {

Status MedianFrame(Handle& x, int32_t left, int32_t right) {
    Frame f;
    f.Output<double>(x);
    const int32_t n = Count(x);
    double* px = nullptr;
    Status s = left < 0 ? NegativeLengthErr : (n >= 1 && n <= right) ? SizeMismatchErr : 0;
    if (s == 0 && n > 0) s = f.InPlace(x, &px);
    if (s == 0) s = MedianFilter(px, n, left, right);
    return f.Finish(s);
}

}  // namespace

TW_API int32_t SavitzkyGolayCoefH(int32_t order, int32_t frame, Array1DHandle weights,
                                  int32_t wantDerivatives, Array2DHandle H, Array2DHandle K) {
    Frame f;
    f.Output2D<double>(H);
    // Without derivatives K is not an output at all: it keeps whatever it held, also on failure.
    if (wantDerivatives != 0) f.Output2D<double>(K);
    const int32_t nw = Count(weights);
    const double* w = nullptr;
    double *ph = nullptr, *pk = nullptr;
    Status s = SavitzkyGolayArguments(order, frame, nw, -1);
    if (s == 0 && nw > 0) s = f.In(weights, &w);
    if (s == 0) s = f.Resize2D(H, frame, frame, &ph);
    if (s == 0 && wantDerivatives != 0) s = f.Resize2D(K, order + 1, frame, &pk);
    if (s == 0) s = SavitzkyGolayDesign(order, frame, w, ph, pk);
    return f.Finish(s);
}

TW_API int32_t SavitzkyGolayFiltH(Array1DHandle x, int32_t order, int32_t frame, Array1DHandle weights,
                                  Array1DHandle y) {
    Frame f;
    f.Output<double>(y);
    const int32_t n = Count(x), nw = Count(weights);
    const double *px = nullptr, *w = nullptr;
    double* py = nullptr;
    Scratch<double> h;
    Status s = SavitzkyGolayArguments(order, frame, nw, n);
    if (s == 0) s = f.In(x, &px);
    if (s == 0 && nw > 0) s = f.In(weights, &w);
    if (s == 0) s = f.Resize(y, n, &py);
    if (s == 0) s = h.Allocate(static_cast<size_t>(frame) * static_cast<size_t>(frame));
    if (s == 0) s = SavitzkyGolayDesign(order, frame, w, h.get(), nullptr);
    if (s == 0) SavitzkyGolaySmooth(px, n, h.get(), frame, py);
    return f.Finish(MergeRelease(s, h.Release()));
}

TW_API int32_t MedianFilterCIN(Array1DHandle x, int32_t* halfWidth, int32_t* status) {
    return ToPointer(status, MedianFrame(x, *halfWidth, *halfWidth));
}

TW_API int32_t MedianFilter81_H(Array1DHandle x, int32_t left, int32_t right) {
    return MedianFrame(x, left, right < 0 ? left : right);
}
