// Blocks the routines of the port repeat word for word in the published package, written once.
// Each keeps the published arithmetic in its order, so the routines that call it compute the same
// bits as when the block stood inline. Where two copies differed only in the order of the operands
// of one addition or multiplication (which rounds the same either way), one form serves both.
#pragma once

#include <algorithm>
#include <cmath>

#include "special/amos/amos.hpp"

namespace tw::amos {

// The three scales of a recurrence kept on range near the exponent extremes: cssr multiplies in,
// csrr takes it out again, bry holds the magnitudes at which the next scale takes over.
inline void ScaleTriplets(double tol, double* cssr, double* csrr, double* bry) {
    const double cscl = 1.0 / tol;
    const double crsc = tol;
    cssr[0] = cscl;
    cssr[1] = 1.0;
    cssr[2] = crsc;
    csrr[0] = crsc;
    csrr[1] = 1.0;
    csrr[2] = cscl;
    bry[0] = 1.0e+3 * kD1Mach1 / tol;
    bry[1] = 1.0 / bry[0];
    bry[2] = kD1Mach2;
}

inline void ZeroSequence(int n, double* yr, double* yi) {
    for (int i = 1; i <= n; ++i) {
        yr[i - 1] = 0.0;
        yi[i - 1] = 0.0;
    }
}

// rz = 2 / z.
inline void TwoOverZ(double zr, double zi, double* rzr, double* rzi) {
    const double raz = 1.0 / zabs(zr, zi);
    const double str = zr * raz;
    const double sti = -zi * raz;
    *rzr = (str + str) * raz;
    *rzi = (sti + sti) * raz;
}

// The zeta2 of a uniform expansion as the exponent zeta1 - zeta2 uses it. With kode 2 the factor
// exp(-zb) is taken out: zeta2 - zb, written fn^2 / (zb + zeta2) to avoid the cancellation.
inline void ExponentZeta2(int kode, double zbr, double zbi, double zeta2r, double zeta2i, double fn,
                          double* str, double* sti) {
    if (kode != 1) {
        double ar = zbr + zeta2r;
        double ai = zbi + zeta2i;
        const double rast = fn / zabs(ar, ai);
        ar = ar * rast * rast;
        ai = -ai * rast * rast;
        *str = ar;
        *sti = ai;
    } else {
        *str = zeta2r;
        *sti = zeta2i;
    }
}

// Over- and underflow test of a term exp(s1) * (the rest). rs1 = Re s1, refined near the limits by
// refine(rs1), the log of the rest's modulus added; false when it passes elim (the caller decides
// by the sign of rs1). On the first member of a sequence it also picks the scale: 1 near
// underflow, 3 near overflow, 2 between.
template <class Refine>
inline bool ExponentInRange(double s1r, double elim, double alim, bool first, int* flag, double* rs1,
                            Refine refine) {
    *rs1 = s1r;
    if (std::fabs(*rs1) > elim) return false;
    if (first) *flag = 2;
    if (std::fabs(*rs1) >= alim) {
        *rs1 = refine(*rs1);
        if (std::fabs(*rs1) > elim) return false;
        if (first) *flag = 1;
        if (*rs1 >= 0.0) {
            if (first) *flag = 3;
        }
    }
    return true;
}

// s2 = s2 * exp(s1) * css.
inline void TimesScaledExp(double s1r, double s1i, double css, double* s2r, double* s2i) {
    const double str = std::exp(s1r) * css;
    const double er = str * std::cos(s1i);
    const double ei = str * std::sin(s1i);
    const double pr = *s2r * er - *s2i * ei;
    *s2i = *s2r * ei + *s2i * er;
    *s2r = pr;
}

// The larger of two magnitudes. The routines compare with either form, and the two differ when a
// is a NaN (Larger keeps it, so the recurrence rescales; LargerNumber drops it): each keeps its own.
inline double Larger(double a, double b) { return std::max(a, b); }
inline double LargerNumber(double a, double b) { return std::fmax(a, b); }

// One step of a recurrence kept on scale: once p2 (the newest member with the scale taken out by
// csr) passes ascle, s1 and s2 move to the next scale (s2 restarting from p2).
template <double (*Max)(double, double)>
inline void Rescale(double p2r, double p2i, const double* bry, const double* cssr, const double* csrr,
                    int* flag, double* ascle, double* csr, double* s1r, double* s1i, double* s2r,
                    double* s2i) {
    if (*flag >= 3) return;
    const double p2m = Max(std::fabs(p2r), std::fabs(p2i));
    if (p2m <= *ascle) return;
    *flag = *flag + 1;
    *ascle = bry[*flag - 1];
    const double css = cssr[*flag - 1];
    *s1r = *s1r * *csr * css;
    *s1i = *s1i * *csr * css;
    *s2r = p2r * css;
    *s2i = p2i * css;
    *csr = csrr[*flag - 1];
}

// K forward recurrence s2 = ck * s2 + s1, ck stepping by rz, for members first..n (1-based) from
// the two below them (s1, s2 on scale flag); each is stored with the scale taken out.
template <double (*Max)(double, double)>
inline void RecurKForward(int first, int n, double s1r, double s1i, double s2r, double s2i, double ckr,
                          double cki, double rzr, double rzi, int flag, const double* bry, const double* cssr,
                          const double* csrr, double* yr, double* yi) {
    double csr = csrr[flag - 1];
    double ascle = bry[flag - 1];
    for (int i = first; i <= n; ++i) {
        const double c2r = s2r;
        const double c2i = s2i;
        s2r = ckr * c2r - cki * c2i + s1r;
        s2i = ckr * c2i + cki * c2r + s1i;
        s1r = c2r;
        s1i = c2i;
        ckr = ckr + rzr;
        cki = cki + rzi;
        const double p2r = s2r * csr;
        const double p2i = s2i * csr;
        yr[i - 1] = p2r;
        yi[i - 1] = p2i;
        Rescale<Max>(p2r, p2i, bry, cssr, csrr, &flag, &ascle, &csr, &s1r, &s1i, &s2r, &s2i);
    }
}

// I backward recurrence s2 = s1 + (fnu + k) * rz * s2 from the two top members cy (cy[0] member
// nd, cy[1] member nd - 1, on scale flag) down to member 1 of y.
inline void RecurIBackward(double zr, double zi, double fnu, int nd, const double* cyr, const double* cyi,
                           int flag, const double* bry, const double* cssr, const double* csrr, double* yr,
                           double* yi) {
    double rzr = 0.0, rzi = 0.0;
    TwoOverZ(zr, zi, &rzr, &rzi);
    double s1r = cyr[0], s1i = cyi[0], s2r = cyr[1], s2i = cyi[1];
    double csr = csrr[flag - 1];
    double ascle = bry[flag - 1];
    int k = nd - 2;
    double fn = static_cast<double>(k);
    for (int i = 3; i <= nd; ++i) {
        const double c2r = s2r;
        const double c2i = s2i;
        s2r = s1r + (fnu + fn) * (rzr * c2r - rzi * c2i);
        s2i = s1i + (fnu + fn) * (rzr * c2i + rzi * c2r);
        s1r = c2r;
        s1i = c2i;
        const double p2r = s2r * csr;
        const double p2i = s2i * csr;
        yr[k - 1] = p2r;
        yi[k - 1] = p2i;
        k = k - 1;
        fn = fn - 1.0;
        Rescale<LargerNumber>(p2r, p2i, bry, cssr, csrr, &flag, &ascle, &csr, &s1r, &s1i, &s2r, &s2i);
    }
}

// cspn = exp(i fnf sgn), negated for odd ifn: the phase of K in the continuation K(z e^{i pi mr})
// = K(z) e^{-i pi mr fnu} - i pi mr I(z), sgn = -pi sign(mr).
inline void ContinuationPhase(double sgn, double fnf, int ifn, double* cspnr, double* cspni) {
    const double ang = fnf * sgn;
    *cspnr = std::cos(ang);
    *cspni = std::sin(ang);
    if (ifn % 2 != 0) {
        *cspnr = -*cspnr;
        *cspni = -*cspni;
    }
}

// Adds the continuation's I terms to the K terms already in y, from the top member down:
// y = y * cspn + s, cspn changing sign from member to member; with kode 2 the pair first goes
// through the underflow check of zs1s2.
struct KPlusI {
    double zrr, zri;
    int kode;
    double asc, alim;
    double cspnr, cspni;
    int* iuf;
    int* nz;

    void Add(double sr, double si, double* yr, double* yi) {
        double kr = *yr, ki = *yi;
        if (kode != 1) {
            int nw = 0;
            zs1s2(zrr, zri, &kr, &ki, &sr, &si, &nw, asc, alim, iuf);
            *nz = *nz + nw;
        }
        *yr = kr * cspnr - ki * cspni + sr;
        *yi = kr * cspni + ki * cspnr + si;
        cspnr = -cspnr;
        cspni = -cspni;
    }
};

// The I terms below the ones the expansions gave (il of them), by backward recurrence from the
// two in cy on scale flag, added to the K terms of members kk, kk - 1, ...; fn = inu + il.
inline void RecurIBackwardAddToK(int il, const double* cyr, const double* cyi, int flag, double fn,
                                 double fnf, double rzr, double rzi, const double* bry, const double* cssr,
                                 const double* csrr, KPlusI* add, int kk, double* yr, double* yi) {
    double s1r = cyr[0], s1i = cyi[0], s2r = cyr[1], s2i = cyi[1];
    double csr = csrr[flag - 1];
    double ascle = bry[flag - 1];
    for (int i = 1; i <= il; ++i) {
        const double c2r = s2r;
        const double c2i = s2i;
        s2r = s1r + (fn + fnf) * (rzr * c2r - rzi * c2i);
        s2i = s1i + (fn + fnf) * (rzr * c2i + rzi * c2r);
        s1r = c2r;
        s1i = c2i;
        fn = fn - 1.0;
        const double p2r = s2r * csr;
        const double p2i = s2i * csr;
        add->Add(p2r, p2i, &yr[kk - 1], &yi[kk - 1]);
        kk = kk - 1;
        Rescale<LargerNumber>(p2r, p2i, bry, cssr, csrr, &flag, &ascle, &csr, &s1r, &s1i, &s2r, &s2i);
    }
}

// c = s exp(-zd) / tol, taken through the logarithm so that neither factor over- or underflows on
// its own; false when c is still below ascle (zuchk).
inline bool ThroughLogOnScale(double sr, double si, double zdr, double zdi, double ascle, double tol,
                              double* cr, double* ci) {
    double lr = 0.0, li = 0.0;
    int idum = 0;
    zlog(sr, si, &lr, &li, &idum);
    lr = lr - zdr;
    li = li - zdi;
    const double str = std::exp(lr) / tol;
    *cr = str * std::cos(li);
    *ci = str * std::sin(li);
    int nw = 0;
    zuchk(*cr, *ci, &nw, ascle, tol);
    return nw == 0;
}

// I backward recurrence in place, y(k) from y(k + 1) and y(k + 2) (1-based), for count members
// from member k down; ak is the order offset of member k.
inline void RecurIDownInPlace(double fnu, double rzr, double rzi, int count, int k, double ak, double* yr,
                              double* yi) {
    for (int i = 1; i <= count; ++i) {
        yr[k - 1] = (ak + fnu) * (rzr * yr[k] - rzi * yi[k]) + yr[k + 1];
        yi[k - 1] = (ak + fnu) * (rzr * yi[k] + rzi * yr[k]) + yi[k + 1];
        ak = ak - 1.0;
        k = k - 1;
    }
}

// The first member's exponent passes elim: overflow (nz = -1), or the whole sequence underflows
// (nz = n, all zero). true when the routine is done.
inline bool FirstMemberOutOfRange(double rs1, double elim, int n, double* yr, double* yi, int* nz) {
    if (!(std::fabs(rs1) > elim)) return false;
    if (rs1 > 0.0) {
        *nz = -1;
        return true;
    }
    *nz = n;
    ZeroSequence(n, yr, yi);
    return true;
}

// Member nd underflowed: it becomes zero, and zuoik zeroes those below it that underflow too.
// false when the routine is done (nothing left, or nz = -1 on overflow); otherwise nd members are
// left to compute.
inline bool DropUnderflowed(double zr, double zi, double fnu, int kode, double tol, double elim, double alim,
                            double* yr, double* yi, int* nd, int* nz) {
    yr[*nd - 1] = 0.0;
    yi[*nd - 1] = 0.0;
    *nz = *nz + 1;
    *nd = *nd - 1;
    if (*nd == 0) return false;
    int nuf = 0;
    zuoik(zr, zi, fnu, kode, 1, *nd, yr, yi, &nuf, tol, elim, alim);
    if (nuf < 0) {
        *nz = -1;
        return false;
    }
    *nd = *nd - nuf;
    *nz = *nz + nuf;
    return *nd != 0;
}

// phi (Ai(arg) asum + Ai'(arg) bsum): the Airy-type expansion's term, the Airy values scaled.
inline void AiryTypeTerm(double argr, double argi, double asumr, double asumi, double bsumr, double bsumi,
                         double phir, double phii, double* pr, double* pi) {
    double air = 0.0, aii = 0.0, dair = 0.0, daii = 0.0;
    int nai = 0, ndai = 0, idum = 0;
    zairy(argr, argi, 0, 2, &air, &aii, &nai, &idum);
    zairy(argr, argi, 1, 2, &dair, &daii, &ndai, &idum);
    double str = dair * bsumr - daii * bsumi;
    double sti = dair * bsumi + daii * bsumr;
    str = str + (air * asumr - aii * asumi);
    sti = sti + (air * asumi + aii * asumr);
    *pr = phir * str - phii * sti;
    *pi = phir * sti + phii * str;
}

// The last member's exponent, refined near the limits by log |phi|: true when it passes elim.
inline bool LastMemberOutOfRange(double s1r, double phir, double phii, double elim, double alim,
                                 double* rs1) {
    *rs1 = s1r;
    bool out = std::fabs(*rs1) > elim;
    if (!out && std::fabs(*rs1) >= alim) {
        *rs1 = *rs1 + std::log(zabs(phir, phii));
        out = !(std::fabs(*rs1) < elim);
    }
    return out;
}

// Member i (1-based) underflowed: zero it and, unless already zero, the one before, since the
// recurrence needs two neighbours on scale; nz counts them.
inline void ZeroWithPrevious(int i, double* yr, double* yi, int* nz) {
    yr[i - 1] = 0.0;
    yi[i - 1] = 0.0;
    *nz = *nz + 1;
    if (i == 1) return;
    if (yr[i - 2] == 0.0 && yi[i - 2] == 0.0) return;
    yr[i - 2] = 0.0;
    yi[i - 2] = 0.0;
    *nz = *nz + 1;
}

}  // namespace tw::amos
