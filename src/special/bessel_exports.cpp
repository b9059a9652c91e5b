#include "special/bessel.hpp"
#include "special/special_frame.hpp"
#include "twanlys/special.h"

using namespace tw;

namespace {

void Store(double* out, double value) {
    if (out != nullptr) *out = value;
}

}  // namespace

TW_API void TW_BesselKn(int32_t n, double x, double* out) { Store(out, BesselKn(n, x)); }
TW_API void TW_BesselJr(double v, double x, double* out) { Store(out, BesselJ(v, x)); }
TW_API void TW_BesselYr(double v, double x, double* out) { Store(out, BesselY(v, x)); }
TW_API void TW_BesselIr(double v, double x, double* out) { Store(out, BesselI(v, x)); }
TW_API void TW_BesselJs(int32_t n, double x, double* out) { Store(out, SphericalBesselJ(n, x)); }
TW_API void TW_BesselYs(int32_t n, double x, double* out) { Store(out, SphericalBesselY(n, x)); }

TW_API void TW_Airy(double x, double* ai, double* bi, double* aip, double* bip) {
    AiryFunctions(x, ai, bi, aip, bip);
}

TW_API void TW_KelvinI(double x, int32_t n, double* ber, double* bei) { KelvinI(x, n, ber, bei); }
TW_API void TW_KelvinK(double x, int32_t n, double* ker, double* kei) { KelvinK(x, n, ker, kei); }
