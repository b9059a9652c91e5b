#include "fit/bounds.hpp"
#include "frame/frame.hpp"
#include "twanlys/fit.h"

using namespace tw;

namespace {

// The outputs of one export: the curves always, the parameter intervals of the confidence
// exports as handles (and for the polynomial its deltas too) or as delta scalars.
struct BoundOutputs {
    Handle* upper;
    Handle* lower;
    Handle* upperParams;
    Handle* lowerParams;
    Handle* deltaArray;
    double* deltas[3];
};

BoundOutputs Prediction(Handle& upper, Handle& lower) {
    return {&upper, &lower, nullptr, nullptr, nullptr, {nullptr, nullptr, nullptr}};
}

BoundOutputs Confidence(Handle& upper, Handle& lower, Handle& upperParams, Handle& lowerParams, double* d0,
                        double* d1, double* d2 = nullptr) {
    return {&upper, &lower, &upperParams, &lowerParams, nullptr, {d0, d1, d2}};
}

// params holds the fixed models' parameters; the polynomial reads its coefficients from coef.
Status BoundsFrame(BoundModel kind, Handle y, Handle x, Handle w, const double* params, Handle coef,
                   double base, double level, bool prediction, const BoundOutputs& o) {
    Frame f;
    f.Output<double>(*o.upper);
    f.Output<double>(*o.lower);
    for (Handle* h : {o.upperParams, o.lowerParams, o.deltaArray})
        if (h != nullptr) f.Output<double>(*h);
    const bool poly = kind == BoundModel::Poly;
    const int32_t n = Count(y), nw = Count(w), p = poly ? Count(coef) : BoundParameterCount(kind);
    const double *ys = nullptr, *xs = nullptr, *ws = nullptr, *cs = params;
    Status s = Count(x) != n || (nw != 0 && nw != n) ? EqSamplesErr : 0;
    if (s == 0) s = f.In(y, &ys);
    if (s == 0) s = f.In(x, &xs);
    if (s == 0 && nw != 0) s = f.In(w, &ws);
    if (s == 0 && poly) s = f.In(coef, &cs);
    double *upper = nullptr, *lower = nullptr, *up = nullptr, *lo = nullptr, *dp = nullptr;
    if (s == 0 && (f.Resize(*o.upper, n, &upper) != 0 || f.Resize(*o.lower, n, &lower) != 0 ||
                   (o.upperParams != nullptr && f.Resize(*o.upperParams, p, &up) != 0) ||
                   (o.lowerParams != nullptr && f.Resize(*o.lowerParams, p, &lo) != 0) ||
                   (o.deltaArray != nullptr && f.Resize(*o.deltaArray, p, &dp) != 0)))
        s = OutOfMemoryErr;
    double d[3] = {0, 0, 0};
    if (o.deltaArray == nullptr && o.upperParams != nullptr) dp = d;  // the fixed models' delta scalars
    if (s == 0)
        s = FitBoundsCore({kind, cs, p, base}, xs, ys, ws, n, level, prediction, upper, lower, up, lo, dp);
    s = f.Finish(s);
    // Unlike the rest of the fitting exports, the deltas of a failed call are 0, not NaN.
    for (int j = 0; j < 3; ++j)
        if (o.deltas[j] != nullptr) *o.deltas[j] = s < 0 ? 0.0 : d[j];
    return s;
}

Status TwoParam(BoundModel kind, Handle y, Handle x, Handle w, double base, double a, double b, double level,
                bool prediction, const BoundOutputs& o) {
    const double params[2] = {a, b};
    return BoundsFrame(kind, y, x, w, params, nullptr, base, level, prediction, o);
}

}  // namespace

TW_API int32_t ConfBndLinear_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double a, double b,
                                  double level, Array1DHandle upper, Array1DHandle lower,
                                  Array1DHandle upperParams, Array1DHandle lowerParams, double* deltaA,
                                  double* deltaB) {
    return TwoParam(BoundModel::Line, y, x, weights, 0, a, b, level, false,
                    Confidence(upper, lower, upperParams, lowerParams, deltaA, deltaB));
}

TW_API int32_t ConfBndExp_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double a, double b,
                               double level, Array1DHandle upper, Array1DHandle lower,
                               Array1DHandle upperParams, Array1DHandle lowerParams, double* deltaA,
                               double* deltaB) {
    return TwoParam(BoundModel::Exp, y, x, weights, 0, a, b, level, false,
                    Confidence(upper, lower, upperParams, lowerParams, deltaA, deltaB));
}

TW_API int32_t ConfBndPower_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double a, double b,
                                 double level, Array1DHandle upper, Array1DHandle lower,
                                 Array1DHandle upperParams, Array1DHandle lowerParams, double* deltaA,
                                 double* deltaB) {
    return TwoParam(BoundModel::Power, y, x, weights, 0, a, b, level, false,
                    Confidence(upper, lower, upperParams, lowerParams, deltaA, deltaB));
}

TW_API int32_t ConfBndLog_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double base, double a,
                               double b, double level, Array1DHandle upper, Array1DHandle lower,
                               Array1DHandle upperParams, Array1DHandle lowerParams, double* deltaA,
                               double* deltaB) {
    return TwoParam(BoundModel::Log, y, x, weights, base, a, b, level, false,
                    Confidence(upper, lower, upperParams, lowerParams, deltaA, deltaB));
}

TW_API int32_t ConfBndGauss_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double amplitude,
                                 double centre, double deviation, double level, Array1DHandle upper,
                                 Array1DHandle lower, Array1DHandle upperParams, Array1DHandle lowerParams,
                                 double* deltaAmplitude, double* deltaCentre, double* deltaDeviation) {
    const double params[3] = {amplitude, centre, deviation};
    return BoundsFrame(
        BoundModel::Gauss, y, x, weights, params, nullptr, 0, level, false,
        Confidence(upper, lower, upperParams, lowerParams, deltaAmplitude, deltaCentre, deltaDeviation));
}

TW_API int32_t ConfBndPoly_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights,
                                Array1DHandle coefficients, double level, Array1DHandle upper,
                                Array1DHandle lower, Array1DHandle upperCoefficients,
                                Array1DHandle lowerCoefficients, Array1DHandle deltaCoefficients) {
    const BoundOutputs o{&upper,
                         &lower,
                         &upperCoefficients,
                         &lowerCoefficients,
                         &deltaCoefficients,
                         {nullptr, nullptr, nullptr}};
    return BoundsFrame(BoundModel::Poly, y, x, weights, nullptr, coefficients, 0, level, false, o);
}

TW_API int32_t PredBndLinear_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double a, double b,
                                  double level, Array1DHandle upper, Array1DHandle lower) {
    return TwoParam(BoundModel::Line, y, x, weights, 0, a, b, level, true, Prediction(upper, lower));
}

TW_API int32_t PredBndExp_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double a, double b,
                               double level, Array1DHandle upper, Array1DHandle lower) {
    return TwoParam(BoundModel::Exp, y, x, weights, 0, a, b, level, true, Prediction(upper, lower));
}

TW_API int32_t PredBndPower_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double a, double b,
                                 double level, Array1DHandle upper, Array1DHandle lower) {
    return TwoParam(BoundModel::Power, y, x, weights, 0, a, b, level, true, Prediction(upper, lower));
}

TW_API int32_t PredBndLog_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double base, double a,
                               double b, double level, Array1DHandle upper, Array1DHandle lower) {
    return TwoParam(BoundModel::Log, y, x, weights, base, a, b, level, true, Prediction(upper, lower));
}

TW_API int32_t PredBndGauss_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double amplitude,
                                 double centre, double deviation, double level, Array1DHandle upper,
                                 Array1DHandle lower) {
    const double params[3] = {amplitude, centre, deviation};
    return BoundsFrame(BoundModel::Gauss, y, x, weights, params, nullptr, 0, level, true,
                       Prediction(upper, lower));
}

TW_API int32_t PredBndPoly_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights,
                                Array1DHandle coefficients, double level, Array1DHandle upper,
                                Array1DHandle lower) {
    return BoundsFrame(BoundModel::Poly, y, x, weights, nullptr, coefficients, 0, level, true,
                       Prediction(upper, lower));
}
