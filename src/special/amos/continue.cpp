// Analytic continuation of K (and of the Airy K form) into the left half plane, and the choice of
// method for I in the right half plane; after Amos, TOMS 644.
#include <algorithm>
#include <cmath>
#include <cstdlib>

#include "special/amos/amos.hpp"
#include "special/amos/common.hpp"

namespace tw::amos {

namespace {

// One of zacon's first two members: y = cspn K + csgn I with K given and I in y, the pair first
// through kode 2's underflow check, which also leaves K as checked in sc (the scaled restart of
// the recurrence).
void FirstMember(double znr, double zni, int kode, double ascle, double alim, int* iuf, int* nz, double kr,
                 double ki, double cspnr, double cspni, double csgnr, double csgni, double* yr, double* yi,
                 double* scr, double* sci) {
    double c1r = kr, c1i = ki, c2r = *yr, c2i = *yi;
    if (kode != 1) {
        int nw = 0;
        zs1s2(znr, zni, &c1r, &c1i, &c2r, &c2i, &nw, ascle, alim, iuf);
        *nz = *nz + nw;
        *scr = c1r;
        *sci = c1i;
    }
    double str = 0.0, sti = 0.0, ptr = 0.0, pti = 0.0;
    zmlt(cspnr, cspni, c1r, c1i, &str, &sti);
    zmlt(csgnr, csgni, c2r, c2i, &ptr, &pti);
    *yr = str + ptr;
    *yi = sti + pti;
}

}  // namespace

// K(fnu, zn * exp(mp)) = K(fnu, zn) * exp(-mp*fnu) - mp*I(fnu, zn), mp = pi*mr*i, mr = +1 or -1,
// Re zn < 0; the result is returned through the continuation of z = -zn.
void zacon(double zr, double zi, double fnu, int kode, int mr, int n, double* yr, double* yi, int* nz, double rl,
           double fnul, double tol, double elim, double alim) {
    using namespace data::zacon;
    double cyr[2] = {0.0, 0.0}, cyi[2] = {0.0, 0.0};
    double cssr[3], csrr[3], bry[3];
    int i = 0, inu = 0, iuf = 0, kflag = 0, nn = 0, nw = 0;
    double ascle = 0, as2 = 0, bscle = 0, cki = 0, ckr = 0, cpn = 0;
    double csgni = 0, csgnr = 0, cspni = 0, cspnr = 0, csr = 0, c1i = 0, c1m = 0, c1r = 0, c2i = 0, c2r = 0;
    double fmr = 0, fn = 0, pti = 0, ptr = 0, rzi = 0, rzr = 0, sc1i = 0, sc1r = 0, sc2i = 0, sc2r = 0;
    double sgn = 0, spn = 0, sti = 0, str = 0, s1i = 0, s1r = 0, s2i = 0, s2r = 0, yy = 0, zni = 0, znr = 0;

    *nz = 0;
    znr = -zr;
    zni = -zi;
    nn = n;
    zbinu(znr, zni, fnu, kode, nn, yr, yi, &nw, rl, fnul, tol, elim, alim);
    if (nw < 0) goto L90;
    // Analytic continuation to the left half plane for the K function.
    nn = std::min(2, n);
    zbknu(znr, zni, fnu, kode, nn, cyr, cyi, &nw, tol, elim, alim);
    if (nw != 0) goto L90;
    s1r = cyr[0];
    s1i = cyi[0];
    fmr = static_cast<double>(mr);
    sgn = -std::copysign(PI, fmr);
    csgnr = ZEROR;
    csgni = sgn;
    if (kode != 1) {
        yy = -zni;
        cpn = std::cos(yy);
        spn = std::sin(yy);
        zmlt(csgnr, csgni, cpn, spn, &csgnr, &csgni);
    }
    // Calculate cspn = exp(fnu*pi*i) to minimise losses of significance when fnu is large.
    inu = static_cast<int>(fnu);
    ContinuationPhase(sgn, fnu - static_cast<double>(inu), inu, &cspnr, &cspni);
    iuf = 0;
    ascle = 1.0e+3 * kD1Mach1 / tol;
    FirstMember(znr, zni, kode, ascle, alim, &iuf, nz, s1r, s1i, cspnr, cspni, csgnr, csgni, &yr[0], &yi[0],
                &sc1r, &sc1i);
    if (n == 1) return;
    cspnr = -cspnr;
    cspni = -cspni;
    s2r = cyr[1];
    s2i = cyi[1];
    FirstMember(znr, zni, kode, ascle, alim, &iuf, nz, s2r, s2i, cspnr, cspni, csgnr, csgni, &yr[1], &yi[1],
                &sc2r, &sc2i);
    if (n == 2) return;
    cspnr = -cspnr;
    cspni = -cspni;
    TwoOverZ(znr, zni, &rzr, &rzi);
    fn = fnu + 1.0;
    ckr = fn * rzr;
    cki = fn * rzi;
    // Scale near exponent extremes during the recurrence on K functions.
    ScaleTriplets(tol, cssr, csrr, bry);
    as2 = zabs(s2r, s2i);
    kflag = 2;
    if (as2 > bry[0]) {
        if (as2 >= bry[1]) kflag = 3;
    } else {
        kflag = 1;
    }
    bscle = bry[kflag - 1];
    s1r = s1r * cssr[kflag - 1];
    s1i = s1i * cssr[kflag - 1];
    s2r = s2r * cssr[kflag - 1];
    s2i = s2i * cssr[kflag - 1];
    csr = csrr[kflag - 1];
    for (i = 3; i <= n; ++i) {
        str = s2r;
        sti = s2i;
        s2r = ckr * str - cki * sti + s1r;
        s2i = ckr * sti + cki * str + s1i;
        s1r = str;
        s1i = sti;
        c1r = s2r * csr;
        c1i = s2i * csr;
        str = c1r;
        sti = c1i;
        c2r = yr[i - 1];
        c2i = yi[i - 1];
        if (kode != 1 && iuf >= 0) {
            zs1s2(znr, zni, &c1r, &c1i, &c2r, &c2i, &nw, ascle, alim, &iuf);
            *nz = *nz + nw;
            sc1r = sc2r;
            sc1i = sc2i;
            sc2r = c1r;
            sc2i = c1i;
            if (iuf == 3) {
                iuf = -4;
                s1r = sc1r * cssr[kflag - 1];
                s1i = sc1i * cssr[kflag - 1];
                s2r = sc2r * cssr[kflag - 1];
                s2i = sc2i * cssr[kflag - 1];
                str = sc2r;
                sti = sc2i;
            }
        }
        ptr = cspnr * c1r - cspni * c1i;
        pti = cspnr * c1i + cspni * c1r;
        yr[i - 1] = ptr + csgnr * c2r - csgni * c2i;
        yi[i - 1] = pti + csgnr * c2i + csgni * c2r;
        ckr = ckr + rzr;
        cki = cki + rzi;
        cspnr = -cspnr;
        cspni = -cspni;
        if (kflag >= 3) continue;
        ptr = std::fabs(c1r);
        pti = std::fabs(c1i);
        c1m = std::max(ptr, pti);
        if (c1m <= bscle) continue;
        kflag = kflag + 1;
        bscle = bry[kflag - 1];
        s1r = s1r * csr;
        s1i = s1i * csr;
        s2r = str;
        s2i = sti;
        s1r = s1r * cssr[kflag - 1];
        s1i = s1i * cssr[kflag - 1];
        s2r = s2r * cssr[kflag - 1];
        s2i = s2i * cssr[kflag - 1];
        csr = csrr[kflag - 1];
    }
    return;
L90:
    *nz = -1;
    if (nw == -2) *nz = -2;
}

// The same continuation for the Airy functions, one member: K(fnu, zn*exp(mp)) with the I part
// from the series, asymptotic or Miller route chosen here, Re zn < 0.
void zacai(double zr, double zi, double fnu, int kode, int mr, int n, double* yr, double* yi, int* nz, double rl,
           double tol, double elim, double alim) {
    using namespace data::zacai;
    double cyr[2] = {0.0, 0.0}, cyi[2] = {0.0, 0.0};
    int inu = 0, iuf = 0, nn = 0, nw = 0;
    double ascle = 0, az = 0, csgnr = 0, csgni = 0, cspnr = 0, cspni = 0, c1r = 0, c1i = 0, c2r = 0;
    double c2i = 0, dfnu = 0, fmr = 0, sgn = 0, yy = 0, znr = 0, zni = 0;

    *nz = 0;
    znr = -zr;
    zni = -zi;
    az = zabs(zr, zi);
    nn = n;
    dfnu = fnu + static_cast<double>(n - 1);
    if (az <= 2.0 || !(az * az * 0.25 > dfnu + 1.0)) {
        // Power series for the I function.
        zseri(znr, zni, fnu, kode, nn, yr, yi, &nw, tol, elim, alim);
    } else if (az >= rl) {
        // Asymptotic expansion for large z for the I function.
        zasyi(znr, zni, fnu, kode, nn, yr, yi, &nw, rl, tol, elim, alim);
        if (nw < 0) goto L80;
    } else {
        // Miller algorithm normalised by the series for the I function.
        zmlri(znr, zni, fnu, kode, nn, yr, yi, &nw, tol);
        if (nw < 0) goto L80;
    }
    // Analytic continuation to the left half plane for the K function.
    zbknu(znr, zni, fnu, kode, 1, cyr, cyi, &nw, tol, elim, alim);
    if (nw != 0) goto L80;
    fmr = static_cast<double>(mr);
    sgn = -std::copysign(PI, fmr);
    csgnr = 0.0;
    csgni = sgn;
    if (kode != 1) {
        yy = -zni;
        csgnr = -csgni * std::sin(yy);
        csgni = csgni * std::cos(yy);
    }
    // Calculate cspn = exp(fnu*pi*i) to minimise losses of significance when fnu is large.
    inu = static_cast<int>(fnu);
    ContinuationPhase(sgn, fnu - static_cast<double>(inu), inu, &cspnr, &cspni);
    c1r = cyr[0];
    c1i = cyi[0];
    c2r = yr[0];
    c2i = yi[0];
    if (kode != 1) {
        iuf = 0;
        ascle = 1.0e+3 * kD1Mach1 / tol;
        zs1s2(znr, zni, &c1r, &c1i, &c2r, &c2i, &nw, ascle, alim, &iuf);
        *nz = *nz + nw;
    }
    yr[0] = cspnr * c1r - cspni * c1i + csgnr * c2r - csgni * c2i;
    yi[0] = cspnr * c1i + cspni * c1r + csgnr * c2i + csgni * c2r;
    return;
L80:
    *nz = -1;
    if (nw == -2) *nz = -2;
}

// I(fnu, z) for Re z >= 0: series, asymptotic expansion, Miller's algorithm, the Wronskian or the
// uniform expansions, by the size of |z| against the order.
void zbinu(double zr, double zi, double fnu, int kode, int n, double* cyr, double* cyi, int* nz, double rl,
           double fnul, double tol, double elim, double alim) {
    using namespace data::zbinu;
    double cwr[2] = {0.0, 0.0}, cwi[2] = {0.0, 0.0};
    int i = 0, inw = 0, nlast = 0, nn = 0, nui = 0, nw = 0;
    double az = 0, dfnu = 0;

    *nz = 0;
    az = zabs(zr, zi);
    nn = n;
    dfnu = fnu + static_cast<double>(n - 1);
    if (az <= 2.0) goto L10;
    if (az * az * 0.25 > dfnu + 1.0) goto L20;
L10:
    // Power series.
    zseri(zr, zi, fnu, kode, nn, cyr, cyi, &nw, tol, elim, alim);
    inw = std::abs(nw);
    *nz = *nz + inw;
    nn = nn - inw;
    if (nn == 0) return;
    if (nw >= 0) return;
    dfnu = fnu + static_cast<double>(nn - 1);
L20:
    if (az < rl) goto L40;
    if (dfnu <= 1.0) goto L30;
    if (az + az < dfnu * dfnu) goto L50;
L30:
    // Asymptotic expansion for large z.
    zasyi(zr, zi, fnu, kode, nn, cyr, cyi, &nw, rl, tol, elim, alim);
    if (nw < 0) goto L130;
    return;
L40:
    if (dfnu <= 1.0) goto L70;
L50:
    // Overflow and underflow test on the I sequence for Miller's algorithm.
    zuoik(zr, zi, fnu, kode, 1, nn, cyr, cyi, &nw, tol, elim, alim);
    if (nw < 0) goto L130;
    *nz = *nz + nw;
    nn = nn - nw;
    if (nn == 0) return;
    dfnu = fnu + static_cast<double>(nn - 1);
    if (dfnu > fnul) goto L110;
    if (az > fnul) goto L110;
L60:
    if (az > rl) goto L80;
L70:
    // Miller algorithm normalised by the series.
    zmlri(zr, zi, fnu, kode, nn, cyr, cyi, &nw, tol);
    if (nw < 0) goto L130;
    return;
L80:
    // Miller algorithm normalised by the Wronskian; overflow test on K functions used in it.
    zuoik(zr, zi, fnu, kode, 2, 2, cwr, cwi, &nw, tol, elim, alim);
    if (nw >= 0) goto L100;
    *nz = nn;
    for (i = 1; i <= nn; ++i) {
        cyr[i - 1] = ZEROR;
        cyi[i - 1] = ZEROI;
    }
    return;
L100:
    if (nw > 0) goto L130;
    zwrsk(zr, zi, fnu, kode, nn, cyr, cyi, &nw, cwr, cwi, tol, elim, alim);
    if (nw < 0) goto L130;
    return;
L110:
    // Increment fnu + nn - 1 up to fnul, compute and recur backward. nui is the integer part of
    // fnul - dfnu + 1, so no step is taken once dfnu is above fnul.
    nui = static_cast<int>(fnul - dfnu + 1.0);
    nui = std::max(nui, 0);
    zbuni(zr, zi, fnu, kode, nn, cyr, cyi, &nw, nui, &nlast, fnul, tol, elim, alim);
    if (nw < 0) goto L130;
    *nz = *nz + nw;
    if (nlast == 0) return;
    nn = nlast;
    goto L60;
L130:
    *nz = -1;
    if (nw == -2) *nz = -2;
}

}  // namespace tw::amos
