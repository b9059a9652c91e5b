// The complex Bessel and Airy exports: every argument by pointer, one value (N = 1) from the
// package in special/amos, its error flag translated into a status. The value stays in out as the
// package left it, whatever the flag, so a warning (precision reduced) still carries its value.
//
// Refusals made here, before the package is reached, leave out untouched as the package's own
// refusals do: a null pointer or a NaN in the order or in z is SpecialFunctionInputErr (the package
// itself has no NaN test and would convert a NaN order to an integer); an infinite part of z is
// SpecialFunctionDomainErr, the flag the package gives any |z| beyond its range (its modulus
// would make a NaN of |z| when both parts are infinite).
#include <cstdint>
#include <cstring>

#include "special/amos/amos.hpp"
#include "special/special_frame.hpp"
#include "twanlys/special.h"

using namespace tw;

namespace {

// Arguments come as pointers into host memory that need not be aligned for a double: copy.
double LoadF64(const double* p) {
    double v;
    std::memcpy(&v, p, sizeof v);
    return v;
}
int32_t LoadI32(const int32_t* p) {
    int32_t v;
    std::memcpy(&v, p, sizeof v);
    return v;
}
struct Cx {
    double re, im;
};
Cx LoadCx(const ComplexDouble* p) {
    Cx v;
    std::memcpy(&v, p, sizeof v);
    return v;
}
void StoreCx(ComplexDouble* p, Cx v) { std::memcpy(p, &v, sizeof v); }

// KODE = scaling + 1 and M = kind + 1; a value outside 0..1 becomes 0, which the package refuses
// (and which cannot overflow on the addition).
int PlusOne(int32_t v) { return (v == 0 || v == 1) ? static_cast<int>(v) + 1 : 0; }

enum class Fn { J, Y, I, K, H };

// One Bessel value of real order: the package's driver and the status of its flag.
Status Bessel(Fn fn, double v, Cx z, int kode, int m, ComplexDouble* out) {
    if (IsNaN(v) || IsNaN(z.re) || IsNaN(z.im)) return SpecialFunctionInputErr;
    if (!IsFinite(z.re) || !IsFinite(z.im)) return SpecialFunctionDomainErr;
    double cyr[1] = {0.0}, cyi[1] = {0.0};
    Cx old = LoadCx(out);
    cyr[0] = old.re;
    cyi[0] = old.im;
    int nz = 0, ierr = 0;
    switch (fn) {
        case Fn::J: amos::zbesj(z.re, z.im, v, kode, 1, cyr, cyi, &nz, &ierr); break;
        case Fn::Y: {
            // The second Hankel function is work space of the Y driver, kept here.
            double cwrkr[1] = {0.0}, cwrki[1] = {0.0};
            amos::zbesy(z.re, z.im, v, kode, 1, cyr, cyi, &nz, cwrkr, cwrki, &ierr);
            break;
        }
        case Fn::I: amos::zbesi(z.re, z.im, v, kode, 1, cyr, cyi, &nz, &ierr); break;
        case Fn::K: amos::zbesk(z.re, z.im, v, kode, 1, cyr, cyi, &nz, &ierr); break;
        case Fn::H: amos::zbesh(z.re, z.im, v, kode, m, 1, cyr, cyi, &nz, &ierr); break;
    }
    StoreCx(out, Cx{cyr[0], cyi[0]});
    return AmosStatus(ierr);
}

Status RealOrder(Fn fn, const double* v, const ComplexDouble* z, const int32_t* kind, const int32_t* scaling,
                 ComplexDouble* out) {
    if (v == nullptr || z == nullptr || scaling == nullptr || out == nullptr) return SpecialFunctionInputErr;
    int m = 1;
    if (fn == Fn::H) {
        if (kind == nullptr) return SpecialFunctionInputErr;
        m = PlusOne(LoadI32(kind));
    }
    return Bessel(fn, LoadF64(v), LoadCx(z), PlusOne(LoadI32(scaling)), m, out);
}

// Smith's division a / b: the ratio taken is the one of magnitude at most 1.
Cx SmithDivide(Cx a, Cx b) {
    if (std::fabs(b.im) >= std::fabs(b.re)) {
        const double r = b.re / b.im, den = b.re * r + b.im;
        return {(a.re * r + a.im) / den, (a.im * r - a.re) / den};
    }
    const double r = b.im / b.re, den = b.re + b.im * r;
    return {(a.re + a.im * r) / den, (a.im - a.re * r) / den};
}

// Spherical forms: order + 1/2 and the factor (pi/2)/z as it stands (no square root). The inner
// status has already been translated once; a non-zero one goes through the translation again
// (and so ends as InternalErr), and out keeps the value without the factor.
Status Spherical(Fn fn, const double* order, const ComplexDouble* z, const int32_t* kind, const int32_t* scaling,
                 ComplexDouble* out) {
    if (order == nullptr || z == nullptr || scaling == nullptr || out == nullptr) return SpecialFunctionInputErr;
    if (fn == Fn::H && kind == nullptr) return SpecialFunctionInputErr;
    const Cx zz = LoadCx(z);
    // j and y refuse z = 0; h has no such test and lets the package refuse it.
    if (fn != Fn::H && zz.re == 0.0 && zz.im == 0.0) return SpecialFunctionInputErr;
    const Cx c = SmithDivide(Cx{kPiOver2, 0.0}, zz);
    const double v = LoadF64(order) + 0.5;
    const int m = fn == Fn::H ? PlusOne(LoadI32(kind)) : 1;
    const Status inner = Bessel(fn, v, zz, PlusOne(LoadI32(scaling)), m, out);
    if (inner != 0) return AmosStatus(inner);
    const Cx w = LoadCx(out);
    StoreCx(out, Cx{w.re * c.re - w.im * c.im, w.re * c.im + w.im * c.re});
    return 0;
}

}  // namespace

TW_API AnalysisStatus TW_CxBesselJr(const double* v, const ComplexDouble* z, const int32_t* scaling,
                                    ComplexDouble* out) {
    return RealOrder(Fn::J, v, z, nullptr, scaling, out);
}
TW_API AnalysisStatus TW_CxBesselYr(const double* v, const ComplexDouble* z, const int32_t* scaling,
                                    ComplexDouble* out) {
    return RealOrder(Fn::Y, v, z, nullptr, scaling, out);
}
TW_API AnalysisStatus TW_CxBesselIr(const double* v, const ComplexDouble* z, const int32_t* scaling,
                                    ComplexDouble* out) {
    return RealOrder(Fn::I, v, z, nullptr, scaling, out);
}
TW_API AnalysisStatus TW_CxBesselKr(const double* v, const ComplexDouble* z, const int32_t* scaling,
                                    ComplexDouble* out) {
    return RealOrder(Fn::K, v, z, nullptr, scaling, out);
}
TW_API AnalysisStatus TW_CxBesselHr(const double* v, const ComplexDouble* z, const int32_t* kind,
                                    const int32_t* scaling, ComplexDouble* out) {
    return RealOrder(Fn::H, v, z, kind, scaling, out);
}
TW_API AnalysisStatus TW_CxBesselJs(const double* order, const ComplexDouble* z, const int32_t* scaling,
                                    ComplexDouble* out) {
    return Spherical(Fn::J, order, z, nullptr, scaling, out);
}
TW_API AnalysisStatus TW_CxBesselYs(const double* order, const ComplexDouble* z, const int32_t* scaling,
                                    ComplexDouble* out) {
    return Spherical(Fn::Y, order, z, nullptr, scaling, out);
}
TW_API AnalysisStatus TW_CxBesselHs(const double* order, const ComplexDouble* z, const int32_t* kind,
                                    const int32_t* scaling, ComplexDouble* out) {
    return Spherical(Fn::H, order, z, kind, scaling, out);
}

// function 1 Ai, 2 Ai', 3 Bi, 4 Bi'; checked before anything else.
TW_API AnalysisStatus TW_CxAiry(const ComplexDouble* z, const int32_t* function, const int32_t* scaling,
                                ComplexDouble* out) {
    if (function == nullptr) return SpecialFunctionInputErr;
    const int32_t f = LoadI32(function);
    if (f < 1 || f > 4) return InvalidSelectorErr;
    if (z == nullptr || scaling == nullptr || out == nullptr) return SpecialFunctionInputErr;
    const Cx zz = LoadCx(z);
    if (IsNaN(zz.re) || IsNaN(zz.im)) return SpecialFunctionInputErr;
    if (!IsFinite(zz.re) || !IsFinite(zz.im)) return SpecialFunctionDomainErr;
    const int id = (f - 1) % 2, kode = PlusOne(LoadI32(scaling));
    const Cx old = LoadCx(out);
    double re = old.re, im = old.im;
    int nz = 0, ierr = 0;
    if (f <= 2) amos::zairy(zz.re, zz.im, id, kode, &re, &im, &nz, &ierr);
    else amos::zbiry(zz.re, zz.im, id, kode, &re, &im, &ierr);
    StoreCx(out, Cx{re, im});
    return AmosStatus(ierr);
}
