#include "special/gamma.hpp"
#include "special/special_frame.hpp"
#include "twanlys/special.h"

using namespace tw;

namespace {

void Store(double* out, double value) {
    if (out != nullptr) *out = value;
}

}  // namespace

TW_API void TW_Gamma(double a, double x, double* out) {
    Store(out, IsNaN(x) ? GammaFunc(a) : IncGamma(a, x));
}

TW_API void TW_Gamma_85(double a, double x, double* out, int32_t selector) {
    Store(out, SelectsComplete(selector) ? GammaFunc(a) : IncGamma(a, x));
}

TW_API void TW_GammaC(double a, double x, double* out) { Store(out, IncGammaC(a, x)); }
TW_API void TW_LnGamma(double x, double* out) { Store(out, LnGammaFunc(x)); }
TW_API void TW_Stirling(double x, double* out) { Store(out, StirlingGamma(x)); }
TW_API void TW_Fact(int32_t n, double* out) { Store(out, FactorialFunc(n)); }
TW_API void TW_LnFact(int32_t n, double* out) { Store(out, LnFactorialFunc(n)); }
TW_API void TW_Psi(double x, double* out) { Store(out, DigammaFunc(x)); }

TW_API void TW_Beta(double a, double b, double x, double* out) {
    Store(out, IsNaN(x) ? BetaFunc(a, b) : IncBeta(a, b, x));
}

TW_API void TW_Beta_85(double a, double b, double x, double* out, int32_t selector) {
    Store(out, SelectsComplete(selector) ? BetaFunc(a, b) : IncBeta(a, b, x));
}

TW_API void TW_Erf(double x, double* out) { Store(out, ErfFunc(x)); }
TW_API void TW_ErfC(double x, double* out) { Store(out, ErfcFunc(x)); }
