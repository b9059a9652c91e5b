// The complex Bessel and Airy routines after Amos's published package (ACM TOMS 644), routine for
// routine. Each routine keeps the published argument list in its order: INTEGER and DOUBLE inputs by
// value, every argument the routine assigns by pointer, arrays as 0-based pointers (element 1 of the
// published routine is element 0 here). Nothing keeps state between calls: every table is constant.
#pragma once

#include <cmath>

#include "special/amos/amos_tables.hpp"

namespace tw::amos {

// Machine constants, fixed rather than read from the machine.
inline constexpr double kD1Mach1 = 2.23e-308;           // smallest normal number
inline constexpr double kD1Mach2 = 1.79e+308;           // largest number
inline constexpr double kD1Mach3 = 1.11e-16;            // 2^-53
inline constexpr double kD1Mach4 = 2.22e-16;            // 2^-52
inline constexpr double kD1Mach5 = 0.3010299956639812;  // log10(2)
inline constexpr int kI1Mach9 = 2147483647;             // largest integer
inline constexpr int kI1Mach14 = 53;                    // digits of a double
inline constexpr int kI1Mach15 = -1021;                 // smallest exponent
inline constexpr int kI1Mach16 = 1024;                  // largest exponent
inline constexpr double kTol = kD1Mach4 > 1.0e-18 ? kD1Mach4 : 1.0e-18;

// Complex helpers on (real, imaginary) pairs.

inline double zabs(double zr, double zi) {
    const double u = std::fabs(zr), v = std::fabs(zi);
    const double s = u + v;
    if (s == 0.0) return 0.0;
    if (u > v) {
        const double q = v / u;
        return u * std::sqrt(1.0 + q * q);
    }
    const double q = u / v;
    return v * std::sqrt(1.0 + q * q);
}

// c = a / b by scaling with 1/|b|.
inline void zdiv(double ar, double ai, double br, double bi, double* cr, double* ci) {
    const double bm = 1.0 / zabs(br, bi);
    const double cc = br * bm, cd = bi * bm;
    const double ca = (ar * cc + ai * cd) * bm;
    const double cb = (ai * cc - ar * cd) * bm;
    *cr = ca;
    *ci = cb;
}

inline void zexp(double ar, double ai, double* br, double* bi) {
    const double zm = std::exp(ar);
    const double ca = zm * std::cos(ai), cb = zm * std::sin(ai);
    *br = ca;
    *bi = cb;
}

inline void zmlt(double ar, double ai, double br, double bi, double* cr, double* ci) {
    const double ca = ar * br - ai * bi;
    const double cb = ar * bi + ai * br;
    *cr = ca;
    *ci = cb;
}

// arg(a) for a off both axes, from atan(ai/ar) moved into (-pi, pi].
inline double ArgOffAxes(double ar, double ai) {
    double dtheta = std::atan(ai / ar);
    if (dtheta <= 0.0) {
        if (ar < 0.0) dtheta = dtheta + data::zlog::DPI;
    } else if (ar < 0.0) {
        dtheta = dtheta - data::zlog::DPI;
    }
    return dtheta;
}

// Principal logarithm; ierr = 1 for a = 0 (b is then left alone).
inline void zlog(double ar, double ai, double* br, double* bi, int* ierr) {
    *ierr = 0;
    if (ar == 0.0) {
        if (ai == 0.0) {
            *ierr = 1;
            return;
        }
        *bi = ai < 0.0 ? -data::zlog::DHPI : data::zlog::DHPI;
        *br = std::log(std::fabs(ai));
        return;
    }
    if (ai == 0.0) {
        if (ar > 0.0) {
            *br = std::log(ar);
            *bi = 0.0;
        } else {
            *br = std::log(std::fabs(ar));
            *bi = data::zlog::DPI;
        }
        return;
    }
    double dtheta = ArgOffAxes(ar, ai);
    const double zm = zabs(ar, ai);
    *br = std::log(zm);
    *bi = dtheta;
}

// Principal square root.
inline void zsqrt(double ar, double ai, double* br, double* bi) {
    double zm = zabs(ar, ai);
    zm = std::sqrt(zm);
    if (ar == 0.0) {
        if (ai > 0.0) {
            *br = zm * data::zsqrt::DRT;
            *bi = zm * data::zsqrt::DRT;
        } else if (ai < 0.0) {
            *br = zm * data::zsqrt::DRT;
            *bi = -zm * data::zsqrt::DRT;
        } else {
            *br = 0.0;
            *bi = 0.0;
        }
        return;
    }
    if (ai == 0.0) {
        if (ar > 0.0) {
            *br = std::sqrt(ar);
            *bi = 0.0;
        } else {
            *br = 0.0;
            *bi = std::sqrt(std::fabs(ar));
        }
        return;
    }
    double dtheta = ArgOffAxes(ar, ai);
    dtheta = dtheta * 0.5;
    *br = zm * std::cos(dtheta);
    *bi = zm * std::sin(dtheta);
}

// sinh(z) and cosh(z).
inline void zshch(double zr, double zi, double* cshr, double* cshi, double* cchr, double* cchi) {
    const double sh = std::sinh(zr), ch = std::cosh(zr);
    const double sn = std::sin(zi), cn = std::cos(zi);
    *cshr = sh * cn;
    *cshi = ch * sn;
    *cchr = ch * cn;
    *cchi = sh * sn;
}

// ln Gamma(z) for z > 0; ierr = 1 otherwise.
double dgamln(double z, int* ierr);

// Underflow and scaling checks.
void zuchk(double yr, double yi, int* nz, double ascle, double tol);
void zs1s2(double zrr, double zri, double* s1r, double* s1i, double* s2r, double* s2i, int* nz, double ascle,
           double alim, int* iuf);
void zkscl(double zrr, double zri, double fnu, int n, double* yr, double* yi, int* nz, double rzr, double rzi,
           double ascle, double tol, double elim);

// Series, ratios, Miller and Wronskian normalisations, asymptotics for large |z|.
void zseri(double zr, double zi, double fnu, int kode, int n, double* yr, double* yi, int* nz, double tol,
           double elim, double alim);
void zrati(double zr, double zi, double fnu, int n, double* cyr, double* cyi, double tol);
void zmlri(double zr, double zi, double fnu, int kode, int n, double* yr, double* yi, int* nz, double tol);
void zwrsk(double zrr, double zri, double fnu, int kode, int n, double* yr, double* yi, int* nz, double* cwr,
           double* cwi, double tol, double elim, double alim);
void zasyi(double zr, double zi, double fnu, int kode, int n, double* yr, double* yi, int* nz, double rl,
           double tol, double elim, double alim);

// K in the right half plane, and the analytic continuations to the left half plane.
void zbknu(double zr, double zi, double fnu, int kode, int n, double* yr, double* yi, int* nz, double tol,
           double elim, double alim);
void zacon(double zr, double zi, double fnu, int kode, int mr, int n, double* yr, double* yi, int* nz, double rl,
           double fnul, double tol, double elim, double alim);
void zacai(double zr, double zi, double fnu, int kode, int mr, int n, double* yr, double* yi, int* nz, double rl,
           double tol, double elim, double alim);

// I in the right half plane, choosing among the methods above.
void zbinu(double zr, double zi, double fnu, int kode, int n, double* cyr, double* cyi, int* nz, double rl,
           double fnul, double tol, double elim, double alim);

// Uniform asymptotic expansions for large order.
void zunik(double zrr, double zri, double fnu, int ikflg, int ipmtr, double tol, int* init, double* phir,
           double* phii, double* zeta1r, double* zeta1i, double* zeta2r, double* zeta2i, double* sumr,
           double* sumi, double* cwrkr, double* cwrki);
void zunhj(double zr, double zi, double fnu, int ipmtr, double tol, double* phir, double* phii, double* argr,
           double* argi, double* zeta1r, double* zeta1i, double* zeta2r, double* zeta2i, double* asumr,
           double* asumi, double* bsumr, double* bsumi);
void zuoik(double zr, double zi, double fnu, int kode, int ikflg, int n, double* yr, double* yi, int* nuf,
           double tol, double elim, double alim);
void zuni1(double zr, double zi, double fnu, int kode, int n, double* yr, double* yi, int* nz, int* nlast,
           double fnul, double tol, double elim, double alim);
void zuni2(double zr, double zi, double fnu, int kode, int n, double* yr, double* yi, int* nz, int* nlast,
           double fnul, double tol, double elim, double alim);
void zbuni(double zr, double zi, double fnu, int kode, int n, double* yr, double* yi, int* nz, int nui,
           int* nlast, double fnul, double tol, double elim, double alim);
void zunk1(double zr, double zi, double fnu, int kode, int mr, int n, double* yr, double* yi, int* nz, double tol,
           double elim, double alim);
void zunk2(double zr, double zi, double fnu, int kode, int mr, int n, double* yr, double* yi, int* nz, double tol,
           double elim, double alim);
void zbunk(double zr, double zi, double fnu, int kode, int mr, int n, double* yr, double* yi, int* nz, double tol,
           double elim, double alim);

// The drivers.
void zbesj(double zr, double zi, double fnu, int kode, int n, double* cyr, double* cyi, int* nz, int* ierr);
void zbesy(double zr, double zi, double fnu, int kode, int n, double* cyr, double* cyi, int* nz, double* cwrkr,
           double* cwrki, int* ierr);
void zbesi(double zr, double zi, double fnu, int kode, int n, double* cyr, double* cyi, int* nz, int* ierr);
void zbesk(double zr, double zi, double fnu, int kode, int n, double* cyr, double* cyi, int* nz, int* ierr);
void zbesh(double zr, double zi, double fnu, int kode, int m, int n, double* cyr, double* cyi, int* nz, int* ierr);
void zairy(double zr, double zi, int id, int kode, double* air, double* aii, int* nz, int* ierr);
void zbiry(double zr, double zi, int id, int kode, double* bir, double* bii, int* ierr);

}  // namespace tw::amos
