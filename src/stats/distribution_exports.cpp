#include "frame/frame.hpp"
#include "stats/distributions.hpp"
#include "twanlys/distributions.h"

using namespace tw;

namespace {

// The frame of a scalar distribution export: a non-zero status leaves NaN as the result.
template <class Core>
int32_t Scalar(double* result, int32_t* status, Core core) {
    Frame f(FailOn::NonZero);
    f.Result(result);
    return ToPointer(status, f.Finish(core()));
}

}  // namespace

TW_API int32_t NormDist_head(const double* x, double* p) {
    *p = NormalCdf(*x);
    return 0;
}

TW_API int32_t InvNdist_head(const double* p, double* x, int32_t* status) {
    return Scalar(x, status, [&] { return NormalQuantile(*p, x); });
}

TW_API int32_t TDist_head(const double* t, const int32_t* df, double* p, int32_t* status) {
    return Scalar(p, status, [&] { return StudentTCdf(*t, *df, p); });
}

TW_API int32_t InvTdist_head(const double* p, const int32_t* df, double* t, int32_t* status) {
    return Scalar(t, status, [&] { return StudentTQuantile(*p, *df, t); });
}

TW_API int32_t FDist_head(const double* f, const int32_t* numeratorDf, const int32_t* denominatorDf,
                          double* p, int32_t* status) {
    return Scalar(p, status, [&] { return FisherCdf(*f, *numeratorDf, *denominatorDf, p); });
}

TW_API int32_t InvFDist_head(const double* p, const int32_t* numeratorDf, const int32_t* denominatorDf,
                             double* f, int32_t* status) {
    return Scalar(f, status, [&] { return FisherQuantile(*p, *numeratorDf, *denominatorDf, f); });
}

TW_API int32_t ChiSquare_head(const double* x, const int32_t* df, double* p, int32_t* status) {
    return Scalar(p, status, [&] { return ChiSquareCdf(*x, *df, p); });
}

TW_API int32_t InvChiSquare_head(const double* p, const int32_t* df, double* x, int32_t* status) {
    return Scalar(x, status, [&] { return ChiSquareQuantile(*p, *df, x); });
}
