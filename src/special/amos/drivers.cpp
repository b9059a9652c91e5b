// The drivers of the complex Bessel and Airy package, after Amos, TOMS 644: argument checks, the
// machine-dependent limits, and the reduction of J, Y, H, Ai, Bi to I and K.
//
// Integer parts of orders and moduli are taken in double precision throughout, as in the revised
// form of the package: rounding to single precision first would make 3 - 1e-7 an order 3 with a
// fractional part of the wrong sign, which costs about 1e-7 of accuracy just below an integer.
#include <algorithm>
#include <cmath>
#include <cstdlib>

#include "special/amos/amos.hpp"

namespace tw::amos {

namespace {

// The limits every driver derives from the machine constants: elim and alim bound exp()
// arguments (underflow and precision), rl the |z| of the asymptotic expansion, fnul the order of
// the uniform expansions.
struct Limits {
    double tol, elim, alim, dig, rl, fnul;
};

Limits MachineLimits() {
    Limits m{};
    m.tol = std::max(kD1Mach4, 1.0e-18);
    int k1 = kI1Mach15;
    const int k2 = kI1Mach16;
    const double r1m5 = kD1Mach5;
    const int k = std::min(std::abs(k1), std::abs(k2));
    m.elim = 2.303 * (static_cast<double>(k) * r1m5 - 3.0);
    k1 = kI1Mach14 - 1;
    double aa = r1m5 * static_cast<double>(k1);
    m.dig = std::min(aa, 18.0);
    aa = aa * 2.303;
    m.alim = m.elim + std::max(-aa, -41.45);
    m.rl = 1.2 * m.dig + 3.0;
    m.fnul = 10.0 + 6.0 * (m.dig - 3.0);
    return m;
}

// ierr = 1 for arguments out of their sets; bad is the caller's own test (z = 0, the kind).
bool Refused(bool bad, double fnu, int kode, int n, int* nz, int* ierr) {
    *ierr = 0;
    *nz = 0;
    if (bad) *ierr = 1;
    if (fnu < 0.0) *ierr = 1;
    if (kode < 1 || kode > 2) *ierr = 1;
    if (n < 1) *ierr = 1;
    return *ierr != 0;
}

// The largest |z| and order the drivers accept: half the precision's reciprocal, or half the
// largest integer.
double ArgumentLimit(double tol) { return std::min(0.5 / tol, static_cast<double>(kI1Mach9) * 0.5); }

// false when |z| or the order passes the limit; ierr = 3 past its square root (half the digits
// are lost there).
bool InRange(double az, double fn, double tol, int* ierr) {
    double aa = ArgumentLimit(tol);
    if (az > aa) return false;
    if (fn > aa) return false;
    aa = std::sqrt(aa);
    if (az > aa) *ierr = 3;
    if (fn > aa) *ierr = 3;
    return true;
}

// p = y * c. A y near underflow is first brought up by 1/tol and the product taken down again, so
// its digits are not lost to denormals on the way.
void TimesGuarded(double yr, double yi, double cr, double ci, double ascle, double tol, double* pr,
                  double* pi) {
    const double rtol = 1.0 / tol;
    double aa = yr, bb = yi, atol = 1.0;
    if (!(std::max(std::fabs(aa), std::fabs(bb)) > ascle)) {
        aa = aa * rtol;
        bb = bb * rtol;
        atol = tol;
    }
    *pr = (aa * cr - bb * ci) * atol;
    *pi = (aa * ci + bb * cr) * atol;
}

// How K or H gets the last member of the sequence: zero (overflow) at a tiny |z| or when it would
// overflow at a small one, the uniform expansions past fnul, or directly; for orders above 2 zuoik
// first zeroes the members that underflow (at zn), adding them to nz: kUnderflow when all do.
enum class Route { kOverflow, kUniform, kUnderflow, kDirect };

Route LastMemberRoute(double az, double fnu, double fn, double fnul, double tol, double elim, double alim,
                      double znr, double zni, int kode, int* nn, double* cyr, double* cyi, int* nz) {
    const double ufl = kD1Mach1 * 1.0e+3;
    if (az < ufl) return Route::kOverflow;
    if (fnu > fnul) return Route::kUniform;
    if (fn <= 1.0) return Route::kDirect;
    if (fn > 2.0) {
        int nuf = 0;
        zuoik(znr, zni, fnu, kode, 2, *nn, cyr, cyi, &nuf, tol, elim, alim);
        if (nuf < 0) return Route::kOverflow;
        *nz = *nz + nuf;
        *nn = *nn - nuf;
        // Here nn = n or nn = 0 since nuf = 0, nn, or -1 on return from zuoik; if nuf = nn the
        // sequence underflowed.
        return *nn == 0 ? Route::kUnderflow : Route::kDirect;
    }
    if (az > tol) return Route::kDirect;
    const double arg = 0.5 * az;
    const double aln = -fn * std::log(arg);
    if (aln > elim) return Route::kOverflow;
    return Route::kDirect;
}

// ierr = 1 for a selector or scaling out of its set.
bool AiryRefused(int id, int kode, int* ierr) {
    *ierr = 0;
    if (id < 0 || id > 1) *ierr = 1;
    if (kode < 1 || kode > 2) *ierr = 1;
    return *ierr != 0;
}

// zeta = (2/3) z^(3/2) of the Airy functions, with csq = z^(1/2).
void AiryZeta(double zr, double zi, double tth, double* csqr, double* csqi, double* ztar, double* ztai) {
    zsqrt(zr, zi, csqr, csqi);
    *ztar = tth * (zr * *csqr - zi * *csqi);
    *ztai = tth * (zr * *csqi + zi * *csqr);
}

// The Airy power series for |z| <= 1: s1 and s2 sum the terms in z^3 of the two solutions (id = 0)
// or of their derivatives (id = 1, fid = 1), both starting from 1; they stay 1 when |z|^3 < tol.
void AiryPowerSeries(double zr, double zi, double az, double fid, double tol, double* s1r, double* s1i,
                     double* s2r, double* s2i) {
    *s1r = 1.0;
    *s1i = 0.0;
    *s2r = 1.0;
    *s2i = 0.0;
    const double aa = az * az;
    if (aa < tol / az) return;
    double trm1r = 1.0, trm1i = 0.0, trm2r = 1.0, trm2i = 0.0, atrm = 1.0;
    double str = zr * zr - zi * zi;
    double sti = zr * zi + zi * zr;
    const double z3r = str * zr - sti * zi;
    const double z3i = str * zi + sti * zr;
    const double az3 = az * aa;
    double ak = 2.0 + fid;
    double bk = 3.0 - fid - fid;
    const double ck = 4.0 - fid;
    const double dk = 3.0 + fid + fid;
    double d1 = ak * dk;
    double d2 = bk * ck;
    double ad = std::min(d1, d2);
    ak = 24.0 + 9.0 * fid;
    bk = 30.0 - 9.0 * fid;
    for (int k = 1; k <= 25; ++k) {
        str = (trm1r * z3r - trm1i * z3i) / d1;
        trm1i = (trm1r * z3i + trm1i * z3r) / d1;
        trm1r = str;
        *s1r = *s1r + trm1r;
        *s1i = *s1i + trm1i;
        str = (trm2r * z3r - trm2i * z3i) / d2;
        trm2i = (trm2r * z3i + trm2i * z3r) / d2;
        trm2r = str;
        *s2r = *s2r + trm2r;
        *s2i = *s2i + trm2i;
        atrm = atrm * az3 / ad;
        d1 = d1 + ak;
        d2 = d2 + bk;
        ad = std::min(d1, d2);
        if (atrm < tol * ad) break;
        ak = ak + 18.0;
        bk = bk + 18.0;
    }
}

// Ai scaled by exp(zeta) (kode 2).
void TimesExpZeta(double zr, double zi, double tth, double* air, double* aii) {
    double str = 0.0, sti = 0.0, ztar = 0.0, ztai = 0.0;
    AiryZeta(zr, zi, tth, &str, &sti, &ztar, &ztai);
    zexp(ztar, ztai, &str, &sti);
    const double ptr = *air * str - *aii * sti;
    *aii = *air * sti + *aii * str;
    *air = ptr;
}

// Bi scaled by exp(-|Re zeta|) (kode 2).
void TimesExpMinusAbsReZeta(double zr, double zi, double tth, double* bir, double* bii) {
    double str = 0.0, sti = 0.0, ztar = 0.0, ztai = 0.0;
    AiryZeta(zr, zi, tth, &str, &sti, &ztar, &ztai);
    const double eaa = std::exp(-std::fabs(ztar));
    *bir = *bir * eaa;
    *bii = *bii * eaa;
}

// |z| past this is refused (ierr 4) by the Airy drivers, past its square root flagged (ierr 3).
bool AiryInRange(double az, double tol, double tth, int* ierr) {
    double aa = std::pow(ArgumentLimit(tol), tth);
    if (az > aa) return false;
    aa = std::sqrt(aa);
    if (az > aa) *ierr = 3;
    return true;
}

// Re zeta <= 0 when Re z < 0, most of all when Im z is small, where the square root's rounding
// could leave it positive. (z is finite here: a NaN never reaches |z| > 1.)
void AiryZetaLeft(double zr, double zi, double* ztar, double* ztai) {
    const double ak = *ztai;
    if (zr < 0.0) {
        *ztar = -std::fabs(*ztar);
        *ztai = ak;
    }
    if (zi == 0.0 && zr <= 0.0) {
        *ztar = 0.0;
        *ztai = ak;
    }
}

}  // namespace

// J(fnu, z) = exp(fnu*pi*i/2) * I(fnu, -i*z) for Im z >= 0 and its mirror for Im z < 0.
void zbesj(double zr, double zi, double fnu, int kode, int n, double* cyr, double* cyi, int* nz, int* ierr) {
    using namespace data::zbesj;
    int i = 0, inu = 0, inuh = 0, ir = 0, nl = 0;
    double arg = 0, cii = 0, csgni = 0, csgnr = 0, str = 0, zni = 0, znr = 0, fn = 0, az = 0;
    double ascle = 0, rtol = 0;

    if (Refused(false, fnu, kode, n, nz, ierr)) return;
    const Limits lim = MachineLimits();
    const double tol = lim.tol, elim = lim.elim, alim = lim.alim, rl = lim.rl, fnul = lim.fnul;
    // Test for proper range.
    az = zabs(zr, zi);
    fn = fnu + static_cast<double>(n - 1);
    if (!InRange(az, fn, tol, ierr)) goto L260;
    // Calculate csgn = exp(fnu*hpi*i) to minimise losses of significance when fnu is large.
    cii = 1.0;
    inu = static_cast<int>(fnu);
    inuh = inu / 2;
    ir = inu - 2 * inuh;
    arg = (fnu - static_cast<double>(inu - ir)) * HPI;
    csgnr = std::cos(arg);
    csgni = std::sin(arg);
    if (inuh % 2 != 0) {
        csgnr = -csgnr;
        csgni = -csgni;
    }
    // zn is in the right half plane.
    znr = zi;
    zni = -zr;
    if (zi < 0.0) {
        znr = -znr;
        zni = -zni;
        csgni = -csgni;
        cii = -cii;
    }
    zbinu(znr, zni, fnu, kode, n, cyr, cyi, nz, rl, fnul, tol, elim, alim);
    if (*nz < 0) goto L130;
    nl = n - *nz;
    if (nl == 0) return;
    rtol = 1.0 / tol;
    ascle = kD1Mach1 * rtol * 1.0e+3;
    for (i = 1; i <= nl; ++i) {
        TimesGuarded(cyr[i - 1], cyi[i - 1], csgnr, csgni, ascle, tol, &cyr[i - 1], &cyi[i - 1]);
        str = -csgni * cii;
        csgni = csgnr * cii;
        csgnr = str;
    }
    return;
L130:
    if (*nz == -2) {
        *nz = 0;
        *ierr = 5;
        return;
    }
    *nz = 0;
    *ierr = 2;
    return;
L260:
    *nz = 0;
    *ierr = 4;
}

// Y(fnu, z) = (H1(fnu, z) - H2(fnu, z)) / (2i); cwrk holds H2.
void zbesy(double zr, double zi, double fnu, int kode, int n, double* cyr, double* cyi, int* nz, double* cwrkr,
           double* cwrki, int* ierr) {
    int i = 0, nz1 = 0, nz2 = 0;
    double c1i = 0, c1r = 0, c2i = 0, c2r = 0, exi = 0, exr = 0, ey = 0, hcii = 0, sti = 0, str = 0, tay = 0;
    double ascle = 0, rtol = 0, ptr = 0, pti = 0, tol = 0, elim = 0;

    if (Refused((zr == 0.0 && zi == 0.0), fnu, kode, n, nz, ierr)) return;
    hcii = 0.5;
    zbesh(zr, zi, fnu, kode, 1, n, cyr, cyi, &nz1, ierr);
    if (*ierr != 0 && *ierr != 3) goto L170;
    zbesh(zr, zi, fnu, kode, 2, n, cwrkr, cwrki, &nz2, ierr);
    if (*ierr != 0 && *ierr != 3) goto L170;
    *nz = std::min(nz1, nz2);
    if (kode == 2) goto L60;
    for (i = 1; i <= n; ++i) {
        str = cwrkr[i - 1] - cyr[i - 1];
        sti = cwrki[i - 1] - cyi[i - 1];
        cyr[i - 1] = -sti * hcii;
        cyi[i - 1] = str * hcii;
    }
    return;
L60:
    {
        const Limits lim = MachineLimits();
        tol = lim.tol;
        elim = lim.elim;
    }
    exr = std::cos(zr);
    exi = std::sin(zr);
    ey = 0.0;
    tay = std::fabs(zi + zi);
    if (tay < elim) ey = std::exp(-tay);
    if (zi < 0.0) {
        c1r = exr;
        c1i = exi;
        c2r = exr * ey;
        c2i = -exi * ey;
    } else {
        c1r = exr * ey;
        c1i = exi * ey;
        c2r = exr;
        c2i = -exi;
    }
    *nz = 0;
    rtol = 1.0 / tol;
    ascle = kD1Mach1 * rtol * 1.0e+3;
    for (i = 1; i <= n; ++i) {
        TimesGuarded(cwrkr[i - 1], cwrki[i - 1], c2r, c2i, ascle, tol, &str, &sti);
        TimesGuarded(cyr[i - 1], cyi[i - 1], c1r, c1i, ascle, tol, &ptr, &pti);
        str = str - ptr;
        sti = sti - pti;
        cyr[i - 1] = -sti * hcii;
        cyi[i - 1] = str * hcii;
        if (str == 0.0 && sti == 0.0 && ey == 0.0) *nz = *nz + 1;
    }
    return;
L170:
    *nz = 0;
}

// I(fnu, z), with the continuation I(fnu, -z) = exp(+-fnu*pi*i) I(fnu, z) for Re z < 0.
void zbesi(double zr, double zi, double fnu, int kode, int n, double* cyr, double* cyi, int* nz, int* ierr) {
    using namespace data::zbesi;
    int i = 0, inu = 0, nn = 0;
    double arg = 0, csgni = 0, csgnr = 0, zni = 0, znr = 0, az = 0, fn = 0, ascle = 0;
    double rtol = 0;

    if (Refused(false, fnu, kode, n, nz, ierr)) return;
    const Limits lim = MachineLimits();
    const double tol = lim.tol, elim = lim.elim, alim = lim.alim, rl = lim.rl, fnul = lim.fnul;
    az = zabs(zr, zi);
    fn = fnu + static_cast<double>(n - 1);
    if (!InRange(az, fn, tol, ierr)) goto L260;
    znr = zr;
    zni = zi;
    csgnr = CONER;
    csgni = CONEI;
    if (zr < 0.0) {
        znr = -zr;
        zni = -zi;
        // Calculate csgn = exp(fnu*pi*i) to minimise losses of significance when fnu is large.
        inu = static_cast<int>(fnu);
        arg = (fnu - static_cast<double>(inu)) * PI;
        if (zi < 0.0) arg = -arg;
        csgnr = std::cos(arg);
        csgni = std::sin(arg);
        if (inu % 2 != 0) {
            csgnr = -csgnr;
            csgni = -csgni;
        }
    }
    zbinu(znr, zni, fnu, kode, n, cyr, cyi, nz, rl, fnul, tol, elim, alim);
    if (*nz < 0) goto L120;
    if (zr >= 0.0) return;
    // Analytic continuation to the left half plane.
    nn = n - *nz;
    if (nn == 0) return;
    rtol = 1.0 / tol;
    ascle = kD1Mach1 * rtol * 1.0e+3;
    for (i = 1; i <= nn; ++i) {
        TimesGuarded(cyr[i - 1], cyi[i - 1], csgnr, csgni, ascle, tol, &cyr[i - 1], &cyi[i - 1]);
        csgnr = -csgnr;
        csgni = -csgni;
    }
    return;
L120:
    if (*nz == -2) {
        *nz = 0;
        *ierr = 5;
        return;
    }
    *nz = 0;
    *ierr = 2;
    return;
L260:
    *nz = 0;
    *ierr = 4;
}

// K(fnu, z): zbknu in the right half plane, zacon to the left, zbunk for large order.
void zbesk(double zr, double zi, double fnu, int kode, int n, double* cyr, double* cyi, int* nz, int* ierr) {
    int mr = 0, nn = 0, nw = 0;
    double az = 0, fn = 0;

    if (Refused((zi == 0.0 && zr == 0.0), fnu, kode, n, nz, ierr)) return;
    nn = n;
    const Limits lim = MachineLimits();
    const double tol = lim.tol, elim = lim.elim, alim = lim.alim, rl = lim.rl, fnul = lim.fnul;
    az = zabs(zr, zi);
    fn = fnu + static_cast<double>(nn - 1);
    if (!InRange(az, fn, tol, ierr)) goto L260;
    // Overflow test on the last member of the sequence.
    switch (LastMemberRoute(az, fnu, fn, fnul, tol, elim, alim, zr, zi, kode, &nn, cyr, cyi, nz)) {
        case Route::kOverflow:
            goto L180;
        case Route::kUniform:
            goto L80;
        case Route::kUnderflow:
            goto L100;
        case Route::kDirect:
            break;
    }
    if (zr < 0.0) goto L70;
    // Right half plane computation, Re z >= 0.
    zbknu(zr, zi, fnu, kode, nn, cyr, cyi, &nw, tol, elim, alim);
    if (nw < 0) goto L200;
    *nz = nw;
    return;
L70:
    // Left half plane computation: Pi/2 < arg(z) <= Pi and -Pi < arg(z) < -Pi/2.
    if (*nz != 0) goto L180;
    mr = 1;
    if (zi < 0.0) mr = -1;
    zacon(zr, zi, fnu, kode, mr, nn, cyr, cyi, &nw, rl, fnul, tol, elim, alim);
    if (nw < 0) goto L200;
    *nz = nw;
    return;
L80:
    // Uniform asymptotic expansions for fnu > fnul.
    mr = 0;
    if (zr < 0.0) {
        mr = 1;
        if (zi < 0.0) mr = -1;
    }
    zbunk(zr, zi, fnu, kode, mr, nn, cyr, cyi, &nw, tol, elim, alim);
    if (nw < 0) goto L200;
    *nz = *nz + nw;
    return;
L100:
    if (zr < 0.0) goto L180;
    return;
L180:
    *nz = 0;
    *ierr = 2;
    return;
L200:
    if (nw == -1) goto L180;
    *nz = 0;
    *ierr = 5;
    return;
L260:
    *nz = 0;
    *ierr = 4;
}

// H(m, fnu, z) = (1/mp) exp(-mp*fnu) K(fnu, z*exp(-mp)), mp = m*pi*i/2 with m = 1 or 2.
void zbesh(double zr, double zi, double fnu, int kode, int m, int n, double* cyr, double* cyi, int* nz, int* ierr) {
    using namespace data::zbesh;
    int i = 0, inu = 0, inuh = 0, ir = 0, mm = 0, mr = 0, nn = 0, nw = 0;
    double arg = 0, az = 0, fmm = 0, fn = 0, rhpi = 0, sgn = 0, str = 0, zni = 0;
    double znr = 0, zti = 0, ascle = 0, rtol = 0, csgnr = 0, csgni = 0;

    if (Refused((zr == 0.0 && zi == 0.0) || (m < 1 || m > 2), fnu, kode, n, nz, ierr)) return;
    nn = n;
    const Limits lim = MachineLimits();
    const double tol = lim.tol, elim = lim.elim, alim = lim.alim, rl = lim.rl, fnul = lim.fnul;
    fn = fnu + static_cast<double>(nn - 1);
    mm = 3 - m - m;
    fmm = static_cast<double>(mm);
    znr = fmm * zi;
    zni = -fmm * zr;
    // Test for proper range.
    az = zabs(zr, zi);
    if (!InRange(az, fn, tol, ierr)) goto L260;
    // Overflow test on the last member of the sequence.
    switch (LastMemberRoute(az, fnu, fn, fnul, tol, elim, alim, znr, zni, kode, &nn, cyr, cyi, nz)) {
        case Route::kOverflow:
            goto L230;
        case Route::kUniform:
            goto L90;
        case Route::kUnderflow:
            goto L140;
        case Route::kDirect:
            break;
    }
    if ((znr < 0.0) || (znr == 0.0 && zni < 0.0 && m == 2)) goto L80;
    // Right half plane computation, xn >= 0 (and not xn = 0, yn < 0 for m = 2).
    zbknu(znr, zni, fnu, kode, nn, cyr, cyi, nz, tol, elim, alim);
    goto L110;
L80:
    // Left half plane computation.
    mr = -mm;
    zacon(znr, zni, fnu, kode, mr, nn, cyr, cyi, &nw, rl, fnul, tol, elim, alim);
    if (nw < 0) goto L240;
    *nz = nw;
    goto L110;
L90:
    // Uniform asymptotic expansions for fnu > fnul.
    mr = 0;
    if ((znr >= 0.0) && (znr != 0.0 || zni >= 0.0 || m != 2)) goto L100;
    mr = -mm;
    if (znr != 0.0 || zni >= 0.0) goto L100;
    znr = -znr;
    zni = -zni;
L100:
    zbunk(znr, zni, fnu, kode, mr, nn, cyr, cyi, &nw, tol, elim, alim);
    if (nw < 0) goto L240;
    *nz = *nz + nw;
L110:
    // H(m, fnu, z) = -fmm*(i/hpi)*(zt**fnu)*K(fnu, -z*zt) with zt = exp(-fmm*hpi*i) = cmplx(0, -fmm),
    // fmm = 3 - 2m.
    sgn = std::copysign(HPI, -fmm);
    // Calculate exp(fnu*hpi*i) to minimise losses of significance when fnu is large.
    inu = static_cast<int>(fnu);
    inuh = inu / 2;
    ir = inu - 2 * inuh;
    arg = (fnu - static_cast<double>(inu - ir)) * sgn;
    rhpi = 1.0 / sgn;
    csgni = rhpi * std::cos(arg);
    csgnr = -rhpi * std::sin(arg);
    if (inuh % 2 != 0) {
        csgnr = -csgnr;
        csgni = -csgni;
    }
    zti = -fmm;
    rtol = 1.0 / tol;
    ascle = kD1Mach1 * 1.0e+3 * rtol;
    for (i = 1; i <= nn; ++i) {
        TimesGuarded(cyr[i - 1], cyi[i - 1], csgnr, csgni, ascle, tol, &cyr[i - 1], &cyi[i - 1]);
        str = -csgni * zti;
        csgni = csgnr * zti;
        csgnr = str;
    }
    return;
L140:
    if (znr < 0.0) goto L230;
    return;
L230:
    *nz = 0;
    *ierr = 2;
    return;
L240:
    if (nw == -1) goto L230;
    *nz = 0;
    *ierr = 5;
    return;
L260:
    *nz = 0;
    *ierr = 4;
}

// Ai(z) (id = 0) or Ai'(z) (id = 1): power series for |z| <= 1, otherwise from K(1/3, zeta) or
// K(2/3, zeta), zeta = (2/3) z^(3/2), continued to the left half plane by zacai.
void zairy(double zr, double zi, int id, int kode, double* air, double* aii, int* nz, int* ierr) {
    using namespace data::zairy;
    double cyr[1] = {0.0}, cyi[1] = {0.0};
    int iflag = 0, mr = 0, nn = 0;
    double aa = 0, alim = 0, az = 0, cc = 0, csqi = 0;
    double csqr = 0, elim = 0, fid = 0, fnu = 0, rl = 0;
    double sfac = 0, sti = 0, str = 0, s1i = 0, s1r = 0, s2i = 0, s2r = 0, tol = 0;
    double ztai = 0, ztar = 0, alaz = 0;

    *nz = 0;
    if (AiryRefused(id, kode, ierr)) return;
    az = zabs(zr, zi);
    tol = std::max(kD1Mach4, 1.0e-18);
    fid = static_cast<double>(id);
    if (az > 1.0) goto L70;
    // Power series for |z| <= 1.
    if (az < tol) goto L170;
    AiryPowerSeries(zr, zi, az, fid, tol, &s1r, &s1i, &s2r, &s2i);
    if (id == 1) goto L50;
    *air = s1r * C1 - C2 * (zr * s2r - zi * s2i);
    *aii = s1i * C1 - C2 * (zr * s2i + zi * s2r);
    if (kode != 1) TimesExpZeta(zr, zi, TTH, air, aii);
    return;
L50:
    *air = -s2r * C2;
    *aii = -s2i * C2;
    if (az > tol) {
        str = zr * s1r - zi * s1i;
        sti = zr * s1i + zi * s1r;
        cc = C1 / (1.0 + fid);
        *air = *air + cc * (str * zr - sti * zi);
        *aii = *aii + cc * (str * zi + sti * zr);
    }
    if (kode != 1) TimesExpZeta(zr, zi, TTH, air, aii);
    return;
    // Case for |z| > 1.
L70:
    fnu = (1.0 + fid) / 3.0;
    {
        const Limits lim = MachineLimits();
        elim = lim.elim;
        alim = lim.alim;
        rl = lim.rl;
    }
    alaz = std::log(az);
    if (!AiryInRange(az, tol, TTH, ierr)) goto L260;
    AiryZeta(zr, zi, TTH, &csqr, &csqi, &ztar, &ztai);
    iflag = 0;
    sfac = 1.0;
    AiryZetaLeft(zr, zi, &ztar, &ztai);
    aa = ztar;
    if (aa >= 0.0 && zr > 0.0) goto L110;
    if (kode == 2) goto L100;
    // Overflow test.
    if (aa > (-alim)) goto L100;
    aa = 0.25 * alaz - aa;
    iflag = 1;
    sfac = tol;
    if (aa > elim) goto L270;
L100:
    // cy = I(fnu, zta) for fnu = 1/3 and 2/3 via the continuation: mr = +-1 by the sign of Im z.
    mr = 1;
    if (zi < 0.0) mr = -1;
    zacai(ztar, ztai, fnu, kode, mr, 1, cyr, cyi, &nn, rl, tol, elim, alim);
    if (nn < 0) goto L280;
    *nz = *nz + nn;
    goto L130;
L110:
    if (kode == 2) goto L120;
    // Underflow test.
    if (aa < alim) goto L120;
    aa = -0.25 * alaz - aa;
    iflag = 2;
    sfac = 1.0 / tol;
    if (aa < (-elim)) goto L210;
L120:
    zbknu(ztar, ztai, fnu, kode, 1, cyr, cyi, nz, tol, elim, alim);
L130:
    s1r = cyr[0] * COEF;
    s1i = cyi[0] * COEF;
    if (iflag != 0) goto L150;
    if (id == 1) goto L140;
    *air = csqr * s1r - csqi * s1i;
    *aii = csqr * s1i + csqi * s1r;
    return;
L140:
    *air = -(zr * s1r - zi * s1i);
    *aii = -(zr * s1i + zi * s1r);
    return;
L150:
    s1r = s1r * sfac;
    s1i = s1i * sfac;
    if (id == 1) goto L160;
    str = s1r * csqr - s1i * csqi;
    s1i = s1r * csqi + s1i * csqr;
    s1r = str;
    *air = s1r / sfac;
    *aii = s1i / sfac;
    return;
L160:
    str = -(s1r * zr - s1i * zi);
    s1i = -(s1r * zi + s1i * zr);
    s1r = str;
    *air = s1r / sfac;
    *aii = s1i / sfac;
    return;
L170:
    aa = 1.0e+3 * kD1Mach1;
    s1r = ZEROR;
    s1i = ZEROI;
    if (id == 1) goto L190;
    if (az > aa) {
        s1r = C2 * zr;
        s1i = C2 * zi;
    }
    *air = C1 - s1r;
    *aii = -s1i;
    return;
L190:
    *air = -C2;
    *aii = 0.0;
    aa = std::sqrt(aa);
    if (az > aa) {
        s1r = 0.5 * (zr * zr - zi * zi);
        s1i = zr * zi;
    }
    *air = *air + C1 * s1r;
    *aii = *aii + C1 * s1i;
    return;
L210:
    *nz = 1;
    *air = ZEROR;
    *aii = ZEROI;
    return;
L270:
    *nz = 0;
    *ierr = 2;
    return;
L280:
    if (nn == -1) goto L270;
    *nz = 0;
    *ierr = 5;
    return;
L260:
    *ierr = 4;
    *nz = 0;
}

// Bi(z) (id = 0) or Bi'(z) (id = 1): power series for |z| <= 1, otherwise from I(1/3, zeta),
// I(2/3, zeta) and I(4/3, zeta) through zbinu.
void zbiry(double zr, double zi, int id, int kode, double* bir, double* bii, int* ierr) {
    using namespace data::zbiry;
    double cyr[2] = {0.0, 0.0}, cyi[2] = {0.0, 0.0};
    int nz = 0;
    double aa = 0, alim = 0, az = 0, bb = 0, cc = 0;
    double csqi = 0, csqr = 0, elim = 0, fid = 0, fmr = 0, fnu = 0;
    double fnul = 0, rl = 0, sfac = 0, sti = 0, str = 0, s1i = 0, s1r = 0, s2i = 0, s2r = 0, tol = 0;
    double ztai = 0, ztar = 0, z3r = 0;

    if (AiryRefused(id, kode, ierr)) return;
    az = zabs(zr, zi);
    tol = std::max(kD1Mach4, 1.0e-18);
    fid = static_cast<double>(id);
    if (az > 1.0) goto L70;
    // Power series for |z| <= 1.
    if (az < tol) goto L130;
    AiryPowerSeries(zr, zi, az, fid, tol, &s1r, &s1i, &s2r, &s2i);
    if (id == 1) goto L50;
    *bir = C1 * s1r + C2 * (zr * s2r - zi * s2i);
    *bii = C1 * s1i + C2 * (zr * s2i + zi * s2r);
    if (kode != 1) TimesExpMinusAbsReZeta(zr, zi, TTH, bir, bii);
    return;
L50:
    *bir = s2r * C2;
    *bii = s2i * C2;
    if (az > tol) {
        cc = C1 / (1.0 + fid);
        str = s1r * zr - s1i * zi;
        sti = s1r * zi + s1i * zr;
        *bir = *bir + cc * (str * zr - sti * zi);
        *bii = *bii + cc * (str * zi + sti * zr);
    }
    if (kode != 1) TimesExpMinusAbsReZeta(zr, zi, TTH, bir, bii);
    return;
    // Case for |z| > 1.
L70:
    fnu = (1.0 + fid) / 3.0;
    {
        const Limits lim = MachineLimits();
        elim = lim.elim;
        alim = lim.alim;
        rl = lim.rl;
        fnul = lim.fnul;
    }
    if (!AiryInRange(az, tol, TTH, ierr)) goto L260;
    AiryZeta(zr, zi, TTH, &csqr, &csqi, &ztar, &ztai);
    sfac = 1.0;
    AiryZetaLeft(zr, zi, &ztar, &ztai);
    aa = ztar;
    if (kode != 2) {
        // Overflow test.
        bb = std::fabs(aa);
        if (bb >= alim) {
            bb = bb + 0.25 * std::log(az);
            sfac = tol;
            if (bb > elim) goto L190;
        }
    }
    fmr = 0.0;
    if (!(aa >= 0.0 && zr > 0.0)) {
        fmr = PI;
        if (zi < 0.0) fmr = -PI;
        ztar = -ztar;
        ztai = -ztai;
    }
    // aa = factor for the analytic continuation of I(fnu, zta); kode = 2 returns
    // exp(-|Re zta|) * I(fnu, zta) from zbinu.
    zbinu(ztar, ztai, fnu, kode, 1, cyr, cyi, &nz, rl, fnul, tol, elim, alim);
    if (nz < 0) goto L200;
    aa = fmr * fnu;
    z3r = sfac;
    str = std::cos(aa);
    sti = std::sin(aa);
    s1r = (str * cyr[0] - sti * cyi[0]) * z3r;
    s1i = (str * cyi[0] + sti * cyr[0]) * z3r;
    fnu = (2.0 - fid) / 3.0;
    zbinu(ztar, ztai, fnu, kode, 2, cyr, cyi, &nz, rl, fnul, tol, elim, alim);
    cyr[0] = cyr[0] * z3r;
    cyi[0] = cyi[0] * z3r;
    cyr[1] = cyr[1] * z3r;
    cyi[1] = cyi[1] * z3r;
    // Backward recur one step for orders -1/3 or -2/3.
    zdiv(cyr[0], cyi[0], ztar, ztai, &str, &sti);
    s2r = (fnu + fnu) * str + cyr[1];
    s2i = (fnu + fnu) * sti + cyi[1];
    aa = fmr * (fnu - 1.0);
    str = std::cos(aa);
    sti = std::sin(aa);
    s1r = COEF * (s1r + s2r * str - s2i * sti);
    s1i = COEF * (s1i + s2r * sti + s2i * str);
    if (id == 1) goto L120;
    str = csqr * s1r - csqi * s1i;
    s1i = csqr * s1i + csqi * s1r;
    s1r = str;
    *bir = s1r / sfac;
    *bii = s1i / sfac;
    return;
L120:
    str = zr * s1r - zi * s1i;
    s1i = zr * s1i + zi * s1r;
    s1r = str;
    *bir = s1r / sfac;
    *bii = s1i / sfac;
    return;
L130:
    aa = C1 * (1.0 - fid) + fid * C2;
    *bir = aa;
    *bii = 0.0;
    return;
L190:
    *ierr = 2;
    nz = 0;
    return;
L200:
    if (nz == -1) goto L190;
    nz = 0;
    *ierr = 5;
    return;
L260:
    *ierr = 4;
    nz = 0;
}

}  // namespace tw::amos
