// Power series, ratio recurrence, Miller's algorithm, Wronskian normalisation, the large-|z|
// expansion of I and the underflow-aware scaling of K; after Amos, TOMS 644. Labels keep the
// published numbers so the control flow can be compared statement for statement.
#include <algorithm>
#include <cmath>

#include "special/amos/amos.hpp"
#include "special/amos/common.hpp"

namespace tw::amos {

// I(fnu, z) by the power series for small |z|, n members of the sequence; nz counts underflows
// (negative when the last members are too small to continue).
void zseri(double zr, double zi, double fnu, int kode, int n, double* yr, double* yi, int* nz, double tol,
           double elim, double alim) {
    using namespace data::zseri;
    double wr[2] = {0.0, 0.0}, wi[2] = {0.0, 0.0};
    int i = 0, ib = 0, idum = 0, iflag = 0, il = 0, k = 0, l = 0, m = 0, nn = 0, nw = 0;
    double aa = 0, acz = 0, ak = 0, ak1i = 0, ak1r = 0, arm = 0, ascle = 0, atol = 0, az = 0, cki = 0, ckr = 0;
    double coefi = 0, coefr = 0, crscr = 0, czi = 0, czr = 0, dfnu = 0, fnup = 0, hzi = 0, hzr = 0;
    double rs = 0, rtr1 = 0, rzi = 0, rzr = 0, s = 0, ss = 0, sti = 0, str = 0, s1i = 0, s1r = 0, s2i = 0, s2r = 0;

    *nz = 0;
    az = zabs(zr, zi);
    if (az == 0.0) goto L160;
    arm = 1.0e+3 * kD1Mach1;
    rtr1 = std::sqrt(arm);
    crscr = 1.0;
    iflag = 0;
    if (az < arm) goto L150;
    hzr = 0.5 * zr;
    hzi = 0.5 * zi;
    czr = ZEROR;
    czi = ZEROI;
    if (az <= rtr1) goto L10;
    zmlt(hzr, hzi, hzr, hzi, &czr, &czi);
L10:
    acz = zabs(czr, czi);
    nn = n;
    zlog(hzr, hzi, &ckr, &cki, &idum);
L20:
    dfnu = fnu + static_cast<double>(nn - 1);
    fnup = dfnu + 1.0;
    // Underflow test.
    ak1r = ckr * dfnu;
    ak1i = cki * dfnu;
    ak = dgamln(fnup, &idum);
    ak1r = ak1r - ak;
    if (kode == 2) ak1r = ak1r - zr;
    if (ak1r > (-elim)) goto L40;
L30:
    *nz = *nz + 1;
    yr[nn - 1] = ZEROR;
    yi[nn - 1] = ZEROI;
    if (acz > dfnu) goto L190;
    nn = nn - 1;
    if (nn == 0) return;
    goto L20;
L40:
    if (ak1r > (-alim)) goto L50;
    iflag = 1;
    ss = 1.0 / tol;
    crscr = tol;
    ascle = arm * ss;
L50:
    aa = std::exp(ak1r);
    if (iflag == 1) aa = aa * ss;
    coefr = aa * std::cos(ak1i);
    coefi = aa * std::sin(ak1i);
    atol = tol * acz / fnup;
    il = std::min(2, nn);
    for (i = 1; i <= il; ++i) {
        dfnu = fnu + static_cast<double>(nn - i);
        fnup = dfnu + 1.0;
        s1r = CONER;
        s1i = CONEI;
        if (acz >= tol * fnup) {
            ak1r = CONER;
            ak1i = CONEI;
            ak = fnup + 2.0;
            s = fnup;
            aa = 2.0;
            do {
                rs = 1.0 / s;
                str = ak1r * czr - ak1i * czi;
                sti = ak1r * czi + ak1i * czr;
                ak1r = str * rs;
                ak1i = sti * rs;
                s1r = s1r + ak1r;
                s1i = s1i + ak1i;
                s = s + ak;
                ak = ak + 2.0;
                aa = aa * acz * rs;
            } while (aa > atol);
        }
        s2r = s1r * coefr - s1i * coefi;
        s2i = s1r * coefi + s1i * coefr;
        wr[i - 1] = s2r;
        wi[i - 1] = s2i;
        if (iflag != 0) {
            zuchk(s2r, s2i, &nw, ascle, tol);
            if (nw != 0) goto L30;
        }
        m = nn - i + 1;
        yr[m - 1] = s2r * crscr;
        yi[m - 1] = s2i * crscr;
        if (i == il) continue;
        zdiv(coefr, coefi, hzr, hzi, &str, &sti);
        coefr = str * dfnu;
        coefi = sti * dfnu;
    }
    if (nn <= 2) return;
    k = nn - 2;
    ak = static_cast<double>(k);
    TwoOverZ(zr, zi, &rzr, &rzi);
    if (iflag == 1) goto L120;
    ib = 3;
L100:
    RecurIDownInPlace(fnu, rzr, rzi, nn - ib + 1, k, ak, yr, yi);
    return;
    // Recurrence on scaled values while they stay near the underflow limit.
L120:
    s1r = wr[0];
    s1i = wi[0];
    s2r = wr[1];
    s2i = wi[1];
    for (l = 3; l <= nn; ++l) {
        ckr = s2r;
        cki = s2i;
        s2r = s1r + (ak + fnu) * (rzr * ckr - rzi * cki);
        s2i = s1i + (ak + fnu) * (rzr * cki + rzi * ckr);
        s1r = ckr;
        s1i = cki;
        ckr = s2r * crscr;
        cki = s2i * crscr;
        yr[k - 1] = ckr;
        yi[k - 1] = cki;
        ak = ak - 1.0;
        k = k - 1;
        if (zabs(ckr, cki) > ascle) goto L140;
    }
    return;
L140:
    ib = l + 1;
    if (ib > nn) return;
    goto L100;
L150:
    *nz = n;
    if (fnu == 0.0) *nz = *nz - 1;
L160:
    yr[0] = ZEROR;
    yi[0] = ZEROI;
    if (fnu == 0.0) {
        yr[0] = CONER;
        yi[0] = CONEI;
    }
    for (i = 2; i <= n; ++i) {
        yr[i - 1] = ZEROR;
        yi[i - 1] = ZEROI;
    }
    return;
    // Return with nz < 0 when |z*z/4| > fnu + n - nz - 1: the remaining members need another method.
L190:
    *nz = -*nz;
}

// Ratios I(fnu + i, z) / I(fnu + i - 1, z), i = 1..n, by backward recurrence started from the
// stable asymptotic ratio.
void zrati(double zr, double zi, double fnu, int n, double* cyr, double* cyi, double tol) {
    using namespace data::zrati;
    int i = 0, id = 0, idnu = 0, inu = 0, itime = 0, k = 0, kk = 0, magz = 0;
    double ak = 0, amagz = 0, ap1 = 0, ap2 = 0, arg = 0, az = 0, cdfnui = 0, cdfnur = 0, dfnu = 0, fdnu = 0;
    double flam = 0, fnup = 0, pti = 0, ptr = 0, p1i = 0, p1r = 0, p2i = 0, p2r = 0, rak = 0, rap1 = 0, rho = 0;
    double rzi = 0, rzr = 0, test = 0, test1 = 0, tti = 0, ttr = 0, t1i = 0, t1r = 0;

    az = zabs(zr, zi);
    inu = static_cast<int>(fnu);
    idnu = inu + n - 1;
    magz = static_cast<int>(az);
    amagz = static_cast<double>(magz + 1);
    fdnu = static_cast<double>(idnu);
    fnup = std::max(amagz, fdnu);
    id = idnu - magz - 1;
    itime = 1;
    k = 1;
    ptr = 1.0 / az;
    rzr = ptr * (zr + zr) * ptr;
    rzi = -ptr * (zi + zi) * ptr;
    t1r = rzr * fnup;
    t1i = rzi * fnup;
    p2r = -t1r;
    p2i = -t1i;
    p1r = CONER;
    p1i = CONEI;
    t1r = t1r + rzr;
    t1i = t1i + rzi;
    if (id > 0) id = 0;
    ap2 = zabs(p2r, p2i);
    ap1 = zabs(p1r, p1i);
    // The overflow test scales by 1/ap1 to keep the forward recurrence in range.
    arg = (ap2 + ap2) / (ap1 * tol);
    test1 = std::sqrt(arg);
    test = test1;
    rap1 = 1.0 / ap1;
    p1r = p1r * rap1;
    p1i = p1i * rap1;
    p2r = p2r * rap1;
    p2i = p2i * rap1;
    ap2 = ap2 * rap1;
    for (;;) {
        k = k + 1;
        ap1 = ap2;
        ptr = p2r;
        pti = p2i;
        p2r = p1r - (t1r * ptr - t1i * pti);
        p2i = p1i - (t1r * pti + t1i * ptr);
        p1r = ptr;
        p1i = pti;
        t1r = t1r + rzr;
        t1i = t1i + rzi;
        ap2 = zabs(p2r, p2i);
        if (ap1 <= test) continue;
        if (itime == 2) break;
        ak = zabs(t1r, t1i) * 0.5;
        flam = ak + std::sqrt(ak * ak - 1.0);
        rho = std::min(ap2 / ap1, flam);
        test = test1 * std::sqrt(rho / (rho * rho - 1.0));
        itime = 2;
    }
    kk = k + 1 - id;
    ak = static_cast<double>(kk);
    t1r = ak;
    t1i = CZEROI;
    dfnu = fnu + static_cast<double>(n - 1);
    p1r = 1.0 / ap2;
    p1i = CZEROI;
    p2r = CZEROR;
    p2i = CZEROI;
    for (i = 1; i <= kk; ++i) {
        ptr = p1r;
        pti = p1i;
        rap1 = dfnu + t1r;
        ttr = rzr * rap1;
        tti = rzi * rap1;
        p1r = (ptr * ttr - pti * tti) + p2r;
        p1i = (ptr * tti + pti * ttr) + p2i;
        p2r = ptr;
        p2i = pti;
        t1r = t1r - CONER;
    }
    if (p1r == CZEROR && p1i == CZEROI) {
        p1r = tol;
        p1i = tol;
    }
    zdiv(p2r, p2i, p1r, p1i, &cyr[n - 1], &cyi[n - 1]);
    if (n == 1) return;
    k = n - 1;
    ak = static_cast<double>(k);
    t1r = ak;
    t1i = CZEROI;
    cdfnur = fnu * rzr;
    cdfnui = fnu * rzi;
    for (i = 2; i <= n; ++i) {
        ptr = cdfnur + (t1r * rzr - t1i * rzi) + cyr[k];
        pti = cdfnui + (t1r * rzi + t1i * rzr) + cyi[k];
        ak = zabs(ptr, pti);
        if (ak == CZEROR) {
            ptr = tol;
            pti = tol;
            ak = tol * RT2;
        }
        rak = CONER / ak;
        cyr[k - 1] = rak * ptr * rak;
        cyi[k - 1] = -rak * pti * rak;
        t1r = t1r - CONER;
        k = k - 1;
    }
}

namespace {

// One step of zmlri's backward recurrence p2 = p1 + (fkk + fnf) rz p2 at k = fkk, the normalising
// sum gathering the new p1 with the weights bk, which step down with k.
void MillerStep(double rzr, double rzi, double fnf, double tfnf, double* p1r, double* p1i, double* p2r,
                double* p2i, double* sumr, double* sumi, double* bk, double* fkk) {
    const double ptr = *p2r;
    const double pti = *p2i;
    *p2r = *p1r + (*fkk + fnf) * (rzr * ptr - rzi * pti);
    *p2i = *p1i + (*fkk + fnf) * (rzi * ptr + rzr * pti);
    *p1r = ptr;
    *p1i = pti;
    const double ak = 1.0 - tfnf / (*fkk + tfnf);
    const double ack = *bk * ak;
    *sumr = *sumr + (ack + *bk) * *p1r;
    *sumi = *sumi + (ack + *bk) * *p1i;
    *bk = ack;
    *fkk = *fkk - 1.0;
}

}  // namespace

// I(fnu, z) for Re z >= 0 by Miller's backward recurrence, normalised by the Neumann series.
void zmlri(double zr, double zi, double fnu, int kode, int n, double* yr, double* yi, int* nz, double tol) {
    using namespace data::zmlri;
    int i = 0, iaz = 0, idum = 0, ifnu = 0, inu = 0, itime = 0, k = 0, kk = 0, km = 0, m = 0;
    double ack = 0, ak = 0, ap = 0, at = 0, az = 0, bk = 0, cki = 0, ckr = 0, cnormi = 0, cnormr = 0;
    double fkap = 0, fkk = 0, flam = 0, fnf = 0, pti = 0, ptr = 0, p1i = 0, p1r = 0, p2i = 0, p2r = 0, raz = 0;
    double rho = 0, rho2 = 0, rzi = 0, rzr = 0, scle = 0, sti = 0, str = 0, sumi = 0, sumr = 0, tfnf = 0, tst = 0;

    scle = kD1Mach1 / tol;
    *nz = 0;
    az = zabs(zr, zi);
    iaz = static_cast<int>(az);
    ifnu = static_cast<int>(fnu);
    inu = ifnu + n - 1;
    at = static_cast<double>(iaz) + 1.0;
    raz = 1.0 / az;
    str = zr * raz;
    sti = -zi * raz;
    ckr = str * at * raz;
    cki = sti * at * raz;
    rzr = (str + str) * raz;
    rzi = (sti + sti) * raz;
    p1r = ZEROR;
    p1i = ZEROI;
    p2r = CONER;
    p2i = CONEI;
    ack = (at + 1.0) * raz;
    rho = ack + std::sqrt(ack * ack - 1.0);
    rho2 = rho * rho;
    tst = (rho2 + rho2) / ((rho2 - 1.0) * (rho - 1.0));
    tst = tst / tol;
    // Start the recurrence near the order |z| where the sequence has settled.
    ak = at;
    for (i = 1; i <= 80; ++i) {
        ptr = p2r;
        pti = p2i;
        p2r = p1r - (ckr * ptr - cki * pti);
        p2i = p1i - (cki * ptr + ckr * pti);
        p1r = ptr;
        p1i = pti;
        ckr = ckr + rzr;
        cki = cki + rzi;
        ap = zabs(p2r, p2i);
        if (ap > tst * ak * ak) goto L20;
        ak = ak + 1.0;
    }
    goto L110;
L20:
    i = i + 1;
    k = 0;
    if (inu < iaz) goto L40;
    // Compute the relative truncation error for the ratios.
    p1r = ZEROR;
    p1i = ZEROI;
    p2r = CONER;
    p2i = CONEI;
    at = static_cast<double>(inu) + 1.0;
    str = zr * raz;
    sti = -zi * raz;
    ckr = str * at * raz;
    cki = sti * at * raz;
    ack = at * raz;
    tst = std::sqrt(ack / tol);
    itime = 1;
    for (k = 1; k <= 80; ++k) {
        ptr = p2r;
        pti = p2i;
        p2r = p1r - (ckr * ptr - cki * pti);
        p2i = p1i - (ckr * pti + cki * ptr);
        p1r = ptr;
        p1i = pti;
        ckr = ckr + rzr;
        cki = cki + rzi;
        ap = zabs(p2r, p2i);
        if (ap < tst) continue;
        if (itime == 2) goto L40;
        ack = zabs(ckr, cki);
        flam = ack + std::sqrt(ack * ack - 1.0);
        fkap = ap / zabs(p1r, p1i);
        rho = std::min(flam, fkap);
        tst = tst * std::sqrt(rho / (rho * rho - 1.0));
        itime = 2;
    }
    goto L110;
    // Backward recurrence and the sum normalising function.
L40:
    k = k + 1;
    kk = std::max(i + iaz, k + inu);
    fkk = static_cast<double>(kk);
    p1r = ZEROR;
    p1i = ZEROI;
    // Scale p2 and sum by scle.
    p2r = scle;
    p2i = ZEROI;
    fnf = fnu - static_cast<double>(ifnu);
    tfnf = fnf + fnf;
    bk = dgamln(fkk + tfnf + 1.0, &idum) - dgamln(fkk + 1.0, &idum) - dgamln(tfnf + 1.0, &idum);
    bk = std::exp(bk);
    sumr = ZEROR;
    sumi = ZEROI;
    km = kk - inu;
    for (i = 1; i <= km; ++i) {
        MillerStep(rzr, rzi, fnf, tfnf, &p1r, &p1i, &p2r, &p2i, &sumr, &sumi, &bk, &fkk);
    }
    yr[n - 1] = p2r;
    yi[n - 1] = p2i;
    for (i = 2; i <= n; ++i) {
        MillerStep(rzr, rzi, fnf, tfnf, &p1r, &p1i, &p2r, &p2i, &sumr, &sumi, &bk, &fkk);
        m = n - i + 1;
        yr[m - 1] = p2r;
        yi[m - 1] = p2i;
    }
    for (i = 1; i <= ifnu; ++i) {
        MillerStep(rzr, rzi, fnf, tfnf, &p1r, &p1i, &p2r, &p2i, &sumr, &sumi, &bk, &fkk);
    }
    ptr = zr;
    pti = zi;
    if (kode == 2) ptr = ZEROR;
    zlog(rzr, rzi, &str, &sti, &idum);
    p1r = -fnf * str + ptr;
    p1i = -fnf * sti + pti;
    ap = dgamln(1.0 + fnf, &idum);
    ptr = p1r - ap;
    pti = p1i;
    // The division cexp(pt)/(sum + p2) may overflow; scale by 1/|sum + p2|.
    p2r = p2r + sumr;
    p2i = p2i + sumi;
    ap = zabs(p2r, p2i);
    p1r = 1.0 / ap;
    zexp(ptr, pti, &str, &sti);
    ckr = str * p1r;
    cki = sti * p1r;
    ptr = p2r * p1r;
    pti = -p2i * p1r;
    zmlt(ckr, cki, ptr, pti, &cnormr, &cnormi);
    for (i = 1; i <= n; ++i) {
        str = yr[i - 1] * cnormr - yi[i - 1] * cnormi;
        yi[i - 1] = yr[i - 1] * cnormi + yi[i - 1] * cnormr;
        yr[i - 1] = str;
    }
    return;
L110:
    *nz = -2;
}

// I(fnu, z) for Re z >= 0 normalised by the Wronskian with K(fnu, z) and K(fnu + 1, z).
void zwrsk(double zrr, double zri, double fnu, int kode, int n, double* yr, double* yi, int* nz, double* cwr,
           double* cwi, double tol, double elim, double alim) {
    int i = 0, nw = 0;
    double act = 0, acw = 0, ascle = 0, cinui = 0, cinur = 0, csclr = 0, cti = 0, ctr = 0, c1i = 0, c1r = 0;
    double c2i = 0, c2r = 0, pti = 0, ptr = 0, ract = 0, sti = 0, str = 0;

    *nz = 0;
    zbknu(zrr, zri, fnu, kode, 2, cwr, cwi, &nw, tol, elim, alim);
    if (nw != 0) {
        *nz = -1;
        if (nw == -2) *nz = -2;
        return;
    }
    zrati(zrr, zri, fnu, n, yr, yi, tol);
    // Recur forward on i(fnu + 1, z) = r(fnu, z) * i(fnu, z) with r the ratios from zrati.
    cinur = 1.0;
    cinui = 0.0;
    if (kode != 1) {
        cinur = std::cos(zri);
        cinui = std::sin(zri);
    }
    // On a scaled K the Wronskian product may over- or underflow: rescale by the size of K.
    acw = zabs(cwr[1], cwi[1]);
    ascle = 1.0e+3 * kD1Mach1 / tol;
    csclr = 1.0;
    if (acw > ascle) {
        ascle = 1.0 / ascle;
        if (acw >= ascle) csclr = tol;
    } else {
        csclr = 1.0 / tol;
    }
    c1r = cwr[0] * csclr;
    c1i = cwi[0] * csclr;
    c2r = cwr[1] * csclr;
    c2i = cwi[1] * csclr;
    str = yr[0];
    sti = yi[0];
    // cinu for scaling: zrati divides by 1/(z (k(fnu+1) + r k(fnu))) without overflow.
    ptr = str * c1r - sti * c1i;
    pti = str * c1i + sti * c1r;
    ptr = ptr + c2r;
    pti = pti + c2i;
    ctr = zrr * ptr - zri * pti;
    cti = zrr * pti + zri * ptr;
    act = zabs(ctr, cti);
    ract = 1.0 / act;
    ctr = ctr * ract;
    cti = -cti * ract;
    ptr = cinur * ract;
    pti = cinui * ract;
    cinur = ptr * ctr - pti * cti;
    cinui = ptr * cti + pti * ctr;
    yr[0] = cinur * csclr;
    yi[0] = cinui * csclr;
    if (n == 1) return;
    for (i = 2; i <= n; ++i) {
        ptr = str * cinur - sti * cinui;
        cinui = str * cinui + sti * cinur;
        cinur = ptr;
        str = yr[i - 1];
        sti = yi[i - 1];
        yr[i - 1] = cinur * csclr;
        yi[i - 1] = cinui * csclr;
    }
}

// I(fnu, z) for large |z| (|z| >= rl) by the asymptotic expansion, Re z >= 0.
void zasyi(double zr, double zi, double fnu, int kode, int n, double* yr, double* yi, int* nz, double rl,
           double tol, double elim, double alim) {
    using namespace data::zasyi;
    int i = 0, il = 0, inu = 0, j = 0, jl = 0, k = 0, koded = 0, m = 0, nn = 0;
    double aa = 0, aez = 0, ak = 0, ak1i = 0, ak1r = 0, arg = 0, arm = 0, atol = 0, az = 0, bb = 0, bk = 0;
    double cki = 0, ckr = 0, cs1i = 0, cs1r = 0, cs2i = 0, cs2r = 0, czi = 0, czr = 0, dfnu = 0, dki = 0, dkr = 0;
    double dnu2 = 0, ezi = 0, ezr = 0, fdn = 0, p1i = 0, p1r = 0, raz = 0, rtr1 = 0, rzi = 0, rzr = 0, s = 0;
    double sgn = 0, sqk = 0, sti = 0, str = 0, s2i = 0, s2r = 0, tzi = 0, tzr = 0;

    *nz = 0;
    az = zabs(zr, zi);
    arm = 1.0e+3 * kD1Mach1;
    rtr1 = std::sqrt(arm);
    il = std::min(2, n);
    dfnu = fnu + static_cast<double>(n - il);
    // Overflow test.
    raz = 1.0 / az;
    str = zr * raz;
    sti = -zi * raz;
    ak1r = RTPI * str * raz;
    ak1i = RTPI * sti * raz;
    zsqrt(ak1r, ak1i, &ak1r, &ak1i);
    czr = zr;
    czi = zi;
    if (kode == 2) {
        czr = ZEROR;
        czi = zi;
    }
    if (std::fabs(czr) > elim) {
        *nz = -1;
        return;
    }
    dnu2 = dfnu + dfnu;
    koded = 1;
    if (!(std::fabs(czr) > alim && n > 2)) {
        koded = 0;
        zexp(czr, czi, &str, &sti);
        zmlt(ak1r, ak1i, str, sti, &ak1r, &ak1i);
    }
    fdn = 0.0;
    if (dnu2 > rtr1) fdn = dnu2 * dnu2;
    ezr = zr * 8.0;
    ezi = zi * 8.0;
    // When z is imaginary the error test must use |z| rather than Re z.
    aez = 8.0 * az;
    s = tol / aez;
    jl = static_cast<int>(rl + rl + 2.0);
    p1r = ZEROR;
    p1i = ZEROI;
    if (zi != 0.0) {
        // Calculate exp(pi*(0.5 + fnu + n - il)*i) to minimise losses of significance when fnu or
        // n is large.
        inu = static_cast<int>(fnu);
        arg = (fnu - static_cast<double>(inu)) * PI;
        inu = inu + n - il;
        ak = -std::sin(arg);
        bk = std::cos(arg);
        if (zi < 0.0) bk = -bk;
        p1r = ak;
        p1i = bk;
        if (inu % 2 != 0) {
            p1r = -p1r;
            p1i = -p1i;
        }
    }
    for (k = 1; k <= il; ++k) {
        sqk = fdn - 1.0;
        atol = s * std::fabs(sqk);
        sgn = 1.0;
        cs1r = CONER;
        cs1i = CONEI;
        cs2r = CONER;
        cs2i = CONEI;
        ckr = CONER;
        cki = CONEI;
        ak = 0.0;
        aa = 1.0;
        bb = aez;
        dkr = ezr;
        dki = ezi;
        for (j = 1; j <= jl; ++j) {
            zdiv(ckr, cki, dkr, dki, &str, &sti);
            ckr = str * sqk;
            cki = sti * sqk;
            cs2r = cs2r + ckr;
            cs2i = cs2i + cki;
            sgn = -sgn;
            cs1r = cs1r + ckr * sgn;
            cs1i = cs1i + cki * sgn;
            dkr = dkr + ezr;
            dki = dki + ezi;
            aa = aa * std::fabs(sqk) / bb;
            bb = bb + aez;
            ak = ak + 8.0;
            sqk = sqk - ak;
            if (aa <= atol) goto L50;
        }
        *nz = -2;
        return;
    L50:
        s2r = cs1r;
        s2i = cs1i;
        if (zr + zr < elim) {
            tzr = zr + zr;
            tzi = zi + zi;
            zexp(-tzr, -tzi, &str, &sti);
            zmlt(str, sti, p1r, p1i, &str, &sti);
            zmlt(str, sti, cs2r, cs2i, &str, &sti);
            s2r = s2r + str;
            s2i = s2i + sti;
        }
        fdn = fdn + 8.0 * dfnu + 4.0;
        p1r = -p1r;
        p1i = -p1i;
        m = n - il + k;
        yr[m - 1] = s2r * ak1r - s2i * ak1i;
        yi[m - 1] = s2r * ak1i + s2i * ak1r;
    }
    if (n <= 2) return;
    nn = n;
    k = nn - 2;
    ak = static_cast<double>(k);
    TwoOverZ(zr, zi, &rzr, &rzi);
    RecurIDownInPlace(fnu, rzr, rzi, nn - 2, k, ak, yr, yi);
    if (koded == 0) return;
    zexp(czr, czi, &ckr, &cki);
    for (i = 1; i <= nn; ++i) {
        str = yr[i - 1] * ckr - yi[i - 1] * cki;
        yi[i - 1] = yr[i - 1] * cki + yi[i - 1] * ckr;
        yr[i - 1] = str;
    }
}

// Scales the K sequence for kode = 1 near the underflow limit: members whose logarithm falls
// below -elim are set to zero and counted in nz.
void zkscl(double zrr, double zri, double fnu, int n, double* yr, double* yi, int* nz, double rzr, double rzi,
           double ascle, double tol, double elim) {
    using namespace data::zkscl;
    double cyr[2] = {0.0, 0.0}, cyi[2] = {0.0, 0.0};
    int i = 0, ic = 0, kk = 0, nn = 0;
    double acs = 0, as = 0, cki = 0, ckr = 0, csi = 0, csr = 0, fn = 0, s1i = 0, s1r = 0, s2i = 0, s2r = 0;
    double zdr = 0, zdi = 0, celmr = 0, elm = 0, helim = 0, alas = 0;

    *nz = 0;
    ic = 0;
    nn = std::min(2, n);
    for (i = 1; i <= nn; ++i) {
        s1r = yr[i - 1];
        s1i = yi[i - 1];
        cyr[i - 1] = s1r;
        cyi[i - 1] = s1i;
        as = zabs(s1r, s1i);
        acs = std::log(as) - zrr;
        *nz = *nz + 1;
        yr[i - 1] = ZEROR;
        yi[i - 1] = ZEROI;
        if (acs < (-elim)) continue;
        if (!ThroughLogOnScale(s1r, s1i, zrr, zri, ascle, tol, &csr, &csi)) continue;
        yr[i - 1] = csr;
        yi[i - 1] = csi;
        ic = i;
        *nz = *nz - 1;
    }
    if (n == 1) return;
    if (ic <= 1) {
        yr[0] = ZEROR;
        yi[0] = ZEROI;
        *nz = 2;
    }
    if (n == 2) return;
    if (*nz == 0) return;
    fn = fnu + 1.0;
    ckr = fn * rzr;
    cki = fn * rzi;
    s1r = cyr[0];
    s1i = cyi[0];
    s2r = cyr[1];
    s2i = cyi[1];
    helim = 0.5 * elim;
    elm = std::exp(-elim);
    celmr = elm;
    zdr = zrr;
    zdi = zri;
    // Find two consecutive members on scale, then hand the rest to the caller's recurrence.
    for (i = 3; i <= n; ++i) {
        kk = i;
        csr = s2r;
        csi = s2i;
        s2r = ckr * csr - cki * csi + s1r;
        s2i = cki * csr + ckr * csi + s1i;
        s1r = csr;
        s1i = csi;
        ckr = ckr + rzr;
        cki = cki + rzi;
        as = zabs(s2r, s2i);
        alas = std::log(as);
        acs = alas - zdr;
        *nz = *nz + 1;
        yr[i - 1] = ZEROR;
        yi[i - 1] = ZEROI;
        if (acs < (-elim)) goto L25;
        if (!ThroughLogOnScale(s2r, s2i, zdr, zdi, ascle, tol, &csr, &csi)) goto L25;
        yr[i - 1] = csr;
        yi[i - 1] = csi;
        *nz = *nz - 1;
        if (ic == kk - 1) goto L40;
        ic = kk;
        continue;
    L25:
        if (alas < helim) continue;
        zdr = zdr - elim;
        s1r = s1r * celmr;
        s1i = s1i * celmr;
        s2r = s2r * celmr;
        s2i = s2i * celmr;
    }
    *nz = n;
    if (ic == n) *nz = n - 1;
    goto L45;
L40:
    *nz = kk - 2;
L45:
    for (i = 1; i <= *nz; ++i) {
        yr[i - 1] = ZEROR;
        yi[i - 1] = ZEROI;
    }
}

}  // namespace tw::amos
