#include "frame/frame.hpp"
#include "twanlys/windows.h"
#include "window/dolph_chebyshev.hpp"
#include "window/parametric.hpp"

using namespace tw;

namespace {

// The frame of every window export: x is worked on in place and emptied on failure.
template <class T, class Core>
Status InPlaceWindow(Handle x, Core core) {
    Frame f;
    T* p = nullptr;
    Status s = f.InPlace(x, &p);
    if (s == 0) s = core(p, Count(x));
    return f.Finish(s);
}

}  // namespace

#define TW_WINDOW_PAIR(Name, Core)                                                     \
    TW_API int32_t Name(Array1DHandle x) {                                             \
        return InPlaceWindow<double>(x, [](auto* p, int32_t n) { return Core(p, n); }); \
    }                                                                                  \
    TW_API int32_t Cx##Name(Array1DHandle x) {                                         \
        return InPlaceWindow<cdouble>(x, [](auto* p, int32_t n) { return Core(p, n); }); \
    }

TW_WINDOW_PAIR(TriangleWinH, TriangleWindow)
TW_WINDOW_PAIR(BartHannWinH, BartlettHannWindow)
TW_WINDOW_PAIR(BohmanWinH, BohmanWindow)
TW_WINDOW_PAIR(ParzenWinH, ParzenWindow)
TW_WINDOW_PAIR(WelchWinH, WelchWindow)
#undef TW_WINDOW_PAIR

#define TW_WINDOW_PAIR_1(Name, Core)                                                                  \
    TW_API int32_t Name(Array1DHandle x, double p1) {                                                 \
        return InPlaceWindow<double>(x, [p1](auto* p, int32_t n) { return Core(p, n, p1); });        \
    }                                                                                                 \
    TW_API int32_t Cx##Name(Array1DHandle x, double p1) {                                             \
        return InPlaceWindow<cdouble>(x, [p1](auto* p, int32_t n) { return Core(p, n, p1); });       \
    }

TW_WINDOW_PAIR_1(KaiserH, KaiserWindow)
TW_WINDOW_PAIR_1(ForceWinH, ForceWindow)
TW_WINDOW_PAIR_1(ExpWinH, ExponentialWindow)
TW_WINDOW_PAIR_1(CosTaperedH, CosineTaper)
#undef TW_WINDOW_PAIR_1

#define TW_WINDOW_PAIR_2(Name, Core)                                                                  \
    TW_API int32_t Name(Array1DHandle x, double p1, int32_t p2) {                                     \
        return InPlaceWindow<double>(x, [=](auto* p, int32_t n) { return Core(p, n, p1, p2); });     \
    }                                                                                                 \
    TW_API int32_t Cx##Name(Array1DHandle x, double p1, int32_t p2) {                                 \
        return InPlaceWindow<cdouble>(x, [=](auto* p, int32_t n) { return Core(p, n, p1, p2); });    \
    }

TW_WINDOW_PAIR_2(GaussWinH, GaussianWindow)
TW_WINDOW_PAIR_2(DolChebyWinH, DolphChebyshevWindow)
#undef TW_WINDOW_PAIR_2

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
