#include "frame/frame.hpp"
#include "matrix/matrix_core.hpp"
#include "numeric/scaling.hpp"
#include "twanlys/numeric.h"

using namespace tw;

namespace {

// The frame of every in-place export: the data are registered first so that any failure, the
// empty test included, empties them; the scalar results turn NaN.
template <class T, bool TwoD, class Core>
Status InPlace(Handle& data, double* r1, double* r2, Core core) {
    Frame f;
    f.Result(r1);
    f.Result(r2);
    T* x = nullptr;
    int32_t n = 0;
    if constexpr (TwoD) {
        f.Output2D<T>(data);
        n = Elements(Dims(data));
    } else {
        f.Output<T>(data);
        n = Count(data);
    }
    Status s = EmptyArrayErr;
    if (n >= 1) s = TwoD ? f.InPlace2D(data, &x) : f.InPlace(data, &x);
    if (s == 0) s = core(x, n);
    return f.Finish(s);
}

template <bool TwoD>
Status RangeScaleFrame(Handle& data, double* offset, double* scale) {
    return InPlace<double, TwoD>(data, offset, scale, [&](double* x, int32_t n) {
        RangeScale(x, n, offset, scale);
        return 0;
    });
}

template <bool TwoD>
Status PeakScaleFrame(Handle& data, double* peak) {
    return InPlace<double, TwoD>(data, peak, nullptr, [&](double* x, int32_t n) {
        PeakScale(x, n, peak);
        return 0;
    });
}

template <bool TwoD>
Status LinearFrame(Handle& data, double multiplier, double offset) {
    return InPlace<double, TwoD>(data, nullptr, nullptr, [&](double* x, int32_t n) {
        LinearEvaluate(x, n, multiplier, offset);
        return 0;
    });
}

template <bool TwoD>
Status NormaliseFrame(Handle& data, double* deviation, double* mean) {
    return InPlace<double, TwoD>(data, deviation, mean, [&](double* x, int32_t n) {
        Normalise(x, n, deviation, mean);
        return 0;
    });
}

template <class T>
Status UnitVector(Handle& data, double order, double* norm) {
    return InPlace<T, false>(data, norm, nullptr,
                             [&](T* x, int32_t n) { return VectorNorm(x, n, order, 1, norm); });
}

template <bool ToPolar>
Status PolarPair(Handle& a, Handle& b) {
    Frame f;
    f.Output<double>(a);
    f.Output<double>(b);
    const int32_t na = Count(a), nb = Count(b);
    double *pa = nullptr, *pb = nullptr;
    Status s = (na < 1 || nb < 1) ? EmptyArrayErr : na != nb ? EqSamplesErr : f.InPlace(a, &pa);
    if (s == 0) s = f.InPlace(b, &pb);
    if (s == 0) ToPolar ? RectToPolar(pa, pb, na) : PolarToRect(pa, pb, na);
    return f.Finish(s);
}

}  // namespace

TW_API int32_t Scale(Array2DHandle data, double* offset, double* scale, int32_t* status) {
    return ToPointer(status, RangeScaleFrame<true>(data, offset, scale));
}

TW_API int32_t Scale1DCIN(Array1DHandle data, double* offset, double* scale, int32_t* status) {
    return ToPointer(status, RangeScaleFrame<false>(data, offset, scale));
}

TW_API int32_t QScale(Array2DHandle data, double* peak, int32_t* status) {
    return ToPointer(status, PeakScaleFrame<true>(data, peak));
}

TW_API int32_t QS1D(Array1DHandle data, double* peak, int32_t* status) {
    return ToPointer(status, PeakScaleFrame<false>(data, peak));
}

TW_API int32_t Line1(Array1DHandle data, double* offset, double* multiplier, int32_t* status) {
    return ToPointer(status, LinearFrame<false>(data, *multiplier, *offset));
}

TW_API int32_t LinEv(Array2DHandle data, double* multiplier, double* offset, int32_t* status) {
    return ToPointer(status, LinearFrame<true>(data, *multiplier, *offset));
}

TW_API int32_t Norm1(Array1DHandle data, double* deviation, double* mean, int32_t* status) {
    return ToPointer(status, NormaliseFrame<false>(data, deviation, mean));
}

TW_API int32_t Norm2(Array2DHandle data, double* deviation, double* mean, int32_t* status) {
    return ToPointer(status, NormaliseFrame<true>(data, deviation, mean));
}

TW_API int32_t RectToPolar1D_head(Array1DHandle x, Array1DHandle y, int32_t* status) {
    return ToPointer(status, PolarPair<true>(x, y));
}

TW_API int32_t PolarToRect1D_head(Array1DHandle magnitude, Array1DHandle phase, int32_t* status) {
    return ToPointer(status, PolarPair<false>(magnitude, phase));
}

TW_API int32_t unitVector_head(Array1DHandle data, double* norm, int32_t* status) {
    return ToPointer(status, UnitVector<double>(data, 2, norm));
}

TW_API int32_t unitVector80_head(Array1DHandle data, double y, double* norm) {
    return UnitVector<double>(data, y, norm);
}

TW_API int32_t CxUnitVector_head(Array1DHandle data, double* norm) { return UnitVector<cdouble>(data, 2, norm); }

TW_API int32_t CxUnitVector80_head(Array1DHandle data, double y, double* norm) {
    return UnitVector<cdouble>(data, y, norm);
}
