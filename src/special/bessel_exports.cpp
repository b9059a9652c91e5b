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
