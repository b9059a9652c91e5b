#include "frame/frame.hpp"
#include "twanlys/windows.h"
#include "window/cosine_sum.hpp"
#include "window/dolph_chebyshev.hpp"
#include "window/parametric.hpp"
#include "window/window_dispatch.hpp"

using namespace tw;

namespace {

// The frame of every window export: x is worked on in place and emptied on failure, and the
// constants record, if any, turns NaN.
template <class T, class Core>
Status InPlaceWindow(Handle x, Core core, WindowConstants* constants = nullptr) {
    Frame f;
    if (constants != nullptr) f.Result(&constants->enbw, 2);
    T* p = nullptr;
    Status s = f.InPlace(x, &p);
    if (s == 0) s = core(p, Count(x));
    return f.Finish(s);
}

// The cosine sum with coefficients from a host array.
template <class T>
Status GeneralCosineWindow(Handle x, Handle a, bool scaled) {
    Frame f;
    T* p = nullptr;
    const double* coefficients = nullptr;
    Status s = f.InPlace(x, &p);
    if (s == 0) s = f.In(a, &coefficients);
    if (s == 0) s = CosineSum(p, Count(x), coefficients, Count(a), scaled);
    return f.Finish(s);
}

Status ConstantsByNumber(int32_t n, int32_t window, double parameter, WindowConstants* constants) {
    Frame f;
    f.Result(&constants->enbw, 2);
    return f.Finish(WindowConstantsByNumber(n, window, parameter, constants));
}

}  // namespace

// A real export and its complex twin: the same core instantiated for both element types.
#define TW_WINDOW_PAIR(Name, Core, Params, Args)                                         \
    TW_API int32_t Name Params {                                                         \
        return InPlaceWindow<double>(x, [=](auto* p, int32_t n) { return Core Args; });  \
    }                                                                                    \
    TW_API int32_t Cx##Name Params {                                                     \
        return InPlaceWindow<cdouble>(x, [=](auto* p, int32_t n) { return Core Args; }); \
    }

TW_WINDOW_PAIR(TriangleWinH, TriangleWindow, (Array1DHandle x), (p, n))
TW_WINDOW_PAIR(BartHannWinH, BartlettHannWindow, (Array1DHandle x), (p, n))
TW_WINDOW_PAIR(BohmanWinH, BohmanWindow, (Array1DHandle x), (p, n))
TW_WINDOW_PAIR(ParzenWinH, ParzenWindow, (Array1DHandle x), (p, n))
TW_WINDOW_PAIR(WelchWinH, WelchWindow, (Array1DHandle x), (p, n))
TW_WINDOW_PAIR(KaiserH, KaiserWindow, (Array1DHandle x, double beta), (p, n, beta))
TW_WINDOW_PAIR(DolChebyWinH, DolphChebyshevWindow, (Array1DHandle x, double s, int32_t symmetric),
               (p, n, s, symmetric))
TW_WINDOW_PAIR(GaussWinH, GaussianWindow, (Array1DHandle x, double sigma, int32_t symmetric),
               (p, n, sigma, symmetric))
TW_WINDOW_PAIR(ForceWinH, ForceWindow, (Array1DHandle x, double duty), (p, n, duty))
TW_WINDOW_PAIR(ExpWinH, ExponentialWindow, (Array1DHandle x, double final), (p, n, final))
TW_WINDOW_PAIR(CosTaperedH, CosineTaper, (Array1DHandle x, double fraction), (p, n, fraction))
TW_WINDOW_PAIR(AllWinH, AllWindow,
               (Array1DHandle x, int32_t window, double parameter, int32_t scaled, int32_t symmetric),
               (p, n, window, parameter, scaled, symmetric))
TW_WINDOW_PAIR(SymmWinH, SymmetricWindow, (Array1DHandle x, int32_t window, double parameter),
               (p, n, window, parameter))
TW_WINDOW_PAIR(AllCosWinH, CosineSumByNumber, (Array1DHandle x, int32_t window, int32_t scaled),
               (p, n, window, scaled))
#undef TW_WINDOW_PAIR

TW_API int32_t TriangleWin(Array1DHandle x, int32_t* status) { return ToPointer(status, TriangleWinH(x)); }
TW_API int32_t CosTapered(Array1DHandle x, double fraction, int32_t* status) {
    return ToPointer(status, CosTaperedH(x, fraction));
}
TW_API int32_t Kaiser_Bessel(Array1DHandle x, double beta, int32_t* status) {
    return ToPointer(status, KaiserH(x, beta));
}
TW_API int32_t ForceWindCIN(Array1DHandle x, double duty, int32_t* status) {
    return ToPointer(status, ForceWinH(x, duty));
}
TW_API int32_t ExpWindCIN(Array1DHandle x, double final, int32_t* status) {
    return ToPointer(status, ExpWinH(x, final));
}

TW_API int32_t ScaledWinH(Array1DHandle x, int32_t window, double parameter, WindowConstants* constants) {
    return InPlaceWindow<double>(
        x, [=](auto* p, int32_t n) { return ScaledWindow(p, n, window, parameter, constants); }, constants);
}
TW_API int32_t CxScaledWinH(Array1DHandle x, int32_t window, double parameter, WindowConstants* constants) {
    return InPlaceWindow<cdouble>(
        x, [=](auto* p, int32_t n) { return ScaledWindow(p, n, window, parameter, constants); }, constants);
}

TW_API int32_t GenCosWinH(Array1DHandle x, Array1DHandle a) {
    return GeneralCosineWindow<double>(x, a, false);
}
TW_API int32_t CxGenCosWinH(Array1DHandle x, Array1DHandle a) {
    return GeneralCosineWindow<cdouble>(x, a, false);
}
TW_API int32_t ScaledGenCosWinH(Array1DHandle x, Array1DHandle a) {
    return GeneralCosineWindow<double>(x, a, true);
}
TW_API int32_t ScaledCxGenCosWinH(Array1DHandle x, Array1DHandle a) {
    return GeneralCosineWindow<cdouble>(x, a, true);
}

TW_API int32_t WinConstByNameH(int32_t n, int32_t window, double parameter, WindowConstants* constants) {
    return ConstantsByNumber(n, window, parameter, constants);
}

TW_API int32_t WinConstByNameH_2016(int32_t n, int32_t window, double parameter, WindowConstants* constants) {
    return ConstantsByNumber(n, window, WindowParameter(window, parameter), constants);
}

TW_API void NumWinConstH(Array1DHandle w, WindowConstants* constants) {
    Frame f;
    f.Result(&constants->enbw, 2);
    const int32_t n = Count(w);
    const double* values = nullptr;
    Status s = n < 1 ? EmptyArrayErr : f.In(w, &values);
    if (s == 0) NumericWindowConstants(values, n, constants);
    f.Finish(s);
}
