// K(fnu, z) in the right half plane, after Amos, TOMS 644: Temme's series for |z| <= 2, Miller's
// algorithm on the confluent hypergeometric function above, forward recurrence with three scale
// levels. Labels keep the published numbers.
#include <algorithm>
#include <cmath>

#include "special/amos/amos.hpp"
#include "special/amos/common.hpp"

namespace tw::amos {

namespace {

// Temme's series for |z| <= r1 from the coefficients' starting values f, p, q: s1 += ck f until the
// terms fall below tol (K(dnu, z)) and, with both, s2 += ck (p - k f) (K(dnu + 1, z)), where
// ck = (z^2/4)^k / k!.
void TemmeSums(double zr, double zi, double caz, double dnu, double dnu2, double tol, bool both, double fr,
               double fi, double pr, double pi_, double qr, double qi, double* s1r, double* s1i, double* s2r,
               double* s2i) {
    if (!(caz >= tol)) return;
    double ak = 1.0, a1 = 1.0, ckr = 1.0, cki = 0.0, bk = 1.0 - dnu2, czr = 0.0, czi = 0.0;
    zmlt(zr, zi, zr, zi, &czr, &czi);
    czr = 0.25 * czr;
    czi = 0.25 * czi;
    const double t1 = 0.25 * caz * caz;
    do {
        fr = (fr * ak + pr + qr) / bk;
        fi = (fi * ak + pi_ + qi) / bk;
        double str = 1.0 / (ak - dnu);
        pr = pr * str;
        pi_ = pi_ * str;
        str = 1.0 / (ak + dnu);
        qr = qr * str;
        qi = qi * str;
        str = ckr * czr - cki * czi;
        const double rak = 1.0 / ak;
        cki = (ckr * czi + cki * czr) * rak;
        ckr = str * rak;
        *s1r = ckr * fr - cki * fi + *s1r;
        *s1i = ckr * fi + cki * fr + *s1i;
        if (both) {
            str = pr - fr * ak;
            const double sti = pi_ - fi * ak;
            *s2r = ckr * str - cki * sti + *s2r;
            *s2i = ckr * sti + cki * str + *s2i;
        }
        a1 = a1 * t1 * rak;
        bk = bk + ak + ak + 1.0;
        ak = ak + 1.0;
    } while (a1 > tol);
}

}  // namespace

void zbknu(double zr, double zi, double fnu, int kode, int n, double* yr, double* yi, int* nz, double tol,
           double elim, double alim) {
    using namespace data::zbknu;
    constexpr int kmax = static_cast<int>(KMAX);
    double cssr[3], csrr[3], bry[3];
    double cyr[2] = {0.0, 0.0}, cyi[2] = {0.0, 0.0};
    int i = 0, iflag = 0, inu = 0, k = 0, kflag = 0, kk = 0, koded = 0, idum = 0, j = 0, ic = 0, inub = 0;
    double aa = 0, ak = 0, ascle = 0, a1 = 0, a2 = 0, bb = 0, caz = 0, cbi = 0, cbr = 0, cchi = 0;
    double cchr = 0, cki = 0, ckr = 0, coefi = 0, coefr = 0, cshi = 0, cshr = 0, csi = 0;
    double csr = 0, dnu = 0, dnu2 = 0, etest = 0, fc = 0, fhs = 0, fi = 0, fk = 0, fks = 0;
    double fmui = 0, fmur = 0, fr = 0, g1 = 0, g2 = 0, pi_ = 0, pr = 0, pti = 0, ptr = 0, p1i = 0, p1r = 0;
    double p2i = 0, p2r = 0, qi = 0, qr = 0, rak = 0, rzi = 0, rzr = 0, s = 0, smui = 0;
    double smur = 0, sti = 0, str = 0, s1i = 0, s1r = 0, s2i = 0, s2r = 0, tm = 0, t1 = 0, t2 = 0, elm = 0;
    double celmr = 0, zdr = 0, zdi = 0, as = 0, alas = 0, helim = 0;

    caz = zabs(zr, zi);
    ScaleTriplets(tol, cssr, csrr, bry);
    *nz = 0;
    iflag = 0;
    koded = kode;
    TwoOverZ(zr, zi, &rzr, &rzi);
    inu = static_cast<int>(fnu + 0.5);
    dnu = fnu - static_cast<double>(inu);
    if (std::fabs(dnu) == 0.5) goto L110;
    dnu2 = 0.0;
    if (std::fabs(dnu) > tol) dnu2 = dnu * dnu;
    if (caz > R1) goto L110;
    // Series for |z| <= r1.
    fc = 1.0;
    zlog(rzr, rzi, &smur, &smui, &idum);
    fmur = smur * dnu;
    fmui = smui * dnu;
    zshch(fmur, fmui, &cshr, &cshi, &cchr, &cchi);
    if (dnu != 0.0) {
        fc = dnu * DPI;
        fc = fc / std::sin(fc);
        smur = cshr / dnu;
        smui = cshi / dnu;
    }
    a2 = 1.0 + dnu;
    // gam(1 - z) * gam(1 + z) = pi*z/sin(pi*z), t1 = 1/gam(1 - dnu), t2 = 1/gam(1 + dnu).
    t2 = std::exp(-dgamln(a2, &idum));
    t1 = 1.0 / (t2 * fc);
    if (std::fabs(dnu) > 0.1) {
        g1 = (t1 - t2) / (dnu + dnu);
    } else {
        // Series for f0 to resolve indeterminacy for small |dnu|.
        ak = 1.0;
        s = CC[0];
        for (k = 2; k <= 8; ++k) {
            ak = ak * dnu2;
            tm = CC[k - 1] * ak;
            s = s + tm;
            if (std::fabs(tm) < tol) break;
        }
        g1 = -s;
    }
    g2 = (t1 + t2) * 0.5;
    fr = fc * (cchr * g1 + smur * g2);
    fi = fc * (cchi * g1 + smui * g2);
    zexp(fmur, fmui, &str, &sti);
    pr = 0.5 * str / t2;
    pi_ = 0.5 * sti / t2;
    zdiv(0.5, 0.0, str, sti, &ptr, &pti);
    qr = ptr / t1;
    qi = pti / t1;
    s1r = fr;
    s1i = fi;
    s2r = pr;
    s2i = pi_;
    if (inu > 0 || n > 1) goto L80;
    // Generate K(fnu, z), 0 <= fnu < 0.5 and n = 1.
    TemmeSums(zr, zi, caz, dnu, dnu2, tol, false, fr, fi, pr, pi_, qr, qi, &s1r, &s1i, &s2r, &s2i);
    yr[0] = s1r;
    yi[0] = s1i;
    if (koded == 1) return;
    zexp(zr, zi, &str, &sti);
    zmlt(s1r, s1i, str, sti, &yr[0], &yi[0]);
    return;
    // Generate K(dnu, z) and K(dnu + 1, z) for forward recurrence.
L80:
    TemmeSums(zr, zi, caz, dnu, dnu2, tol, true, fr, fi, pr, pi_, qr, qi, &s1r, &s1i, &s2r, &s2i);
    kflag = 2;
    a1 = fnu + 1.0;
    ak = a1 * std::fabs(smur);
    if (ak > alim) kflag = 3;
    str = cssr[kflag - 1];
    p2r = s2r * str;
    p2i = s2i * str;
    zmlt(p2r, p2i, rzr, rzi, &s2r, &s2i);
    s1r = s1r * str;
    s1i = s1i * str;
    if (koded == 1) goto L210;
    zexp(zr, zi, &fr, &fi);
    zmlt(s1r, s1i, fr, fi, &s1r, &s1i);
    zmlt(s2r, s2i, fr, fi, &s2r, &s2i);
    goto L210;
    // iflag = 0 means no underflow occurred; iflag = 1 means an underflow occurred and the scaled
    // sequence is tested; koded = 2 then selects the scaled computation.
L110:
    zsqrt(zr, zi, &str, &sti);
    zdiv(RTHPI, CZEROI, str, sti, &coefr, &coefi);
    kflag = 2;
    if (koded == 2) goto L120;
    if (zr > alim) goto L290;
    str = std::exp(-zr) * cssr[kflag - 1];
    sti = -str * std::sin(zi);
    str = str * std::cos(zi);
    zmlt(coefr, coefi, str, sti, &coefr, &coefi);
L120:
    if (std::fabs(dnu) == 0.5) goto L300;
    // Miller's algorithm for |z| > r1.
    ak = std::cos(DPI * dnu);
    ak = std::fabs(ak);
    if (ak == CZEROR) goto L300;
    fhs = std::fabs(0.25 - dnu2);
    if (fhs == CZEROR) goto L300;
    // Compute r2 = f(e). If |z| >= r2 use the forward recurrence to determine the backward index
    // k; r2 = f(e) is valid for 0 <= dnu <= 0.5.
    t1 = static_cast<double>(kI1Mach14 - 1);
    t1 = t1 * kD1Mach5 * 3.321928094;
    t1 = std::max(t1, 12.0);
    t1 = std::min(t1, 60.0);
    t2 = TTH * t1 - 6.0;
    if (zr != 0.0) {
        t1 = std::atan(zi / zr);
        t1 = std::fabs(t1);
    } else {
        t1 = HPI;
    }
    if (t2 > caz) goto L170;
    // Forward recurrence loop when |z| >= r2.
    etest = ak / (DPI * caz * tol);
    fk = CONER;
    if (etest < CONER) goto L180;
    fks = CTWOR;
    ckr = caz + caz + CTWOR;
    p1r = CZEROR;
    p2r = CONER;
    for (i = 1; i <= kmax; ++i) {
        ak = fhs / fks;
        cbr = ckr / (fk + CONER);
        ptr = p2r;
        p2r = cbr * p2r - p1r * ak;
        p1r = ptr;
        ckr = ckr + CTWOR;
        fks = fks + fk + fk + CTWOR;
        fhs = fhs + fk + fk;
        fk = fk + CONER;
        str = std::fabs(p2r) * fk;
        if (etest < str) goto L160;
    }
    goto L310;
L160:
    fk = fk + SPI * t1 * std::sqrt(t2 / caz);
    fhs = std::fabs(0.25 - dnu2);
    goto L180;
L170:
    // Compute the backward index k for |z| < r2.
    a2 = std::sqrt(caz);
    ak = FPI * ak / (tol * std::sqrt(a2));
    aa = 3.0 * t1 / (1.0 + caz);
    bb = 14.7 * t1 / (28.0 + caz);
    ak = (std::log(ak) + caz * std::cos(aa) / (1.0 + 0.008 * caz)) / std::cos(bb);
    fk = 0.12125 * ak * ak / caz + 1.5;
L180:
    // Backward recurrence loop for Miller's algorithm.
    k = static_cast<int>(fk);
    fk = static_cast<double>(k);
    fks = fk * fk;
    p1r = CZEROR;
    p1i = CZEROI;
    p2r = tol;
    p2i = CZEROI;
    csr = p2r;
    csi = p2i;
    for (i = 1; i <= k; ++i) {
        a1 = fks - fk;
        ak = (fks + fk) / (a1 + fhs);
        rak = 2.0 / (fk + CONER);
        cbr = (fk + zr) * rak;
        cbi = zi * rak;
        ptr = p2r;
        pti = p2i;
        p2r = (ptr * cbr - pti * cbi - p1r) * ak;
        p2i = (pti * cbr + ptr * cbi - p1i) * ak;
        p1r = ptr;
        p1i = pti;
        csr = csr + p2r;
        csi = csi + p2i;
        fks = a1 - fk + CONER;
        fk = fk - CONER;
    }
    // Compute (p2/cs) = (p2/|cs|) * (conjg(cs)/|cs|) for better scaling.
    tm = zabs(csr, csi);
    ptr = 1.0 / tm;
    s1r = p2r * ptr;
    s1i = p2i * ptr;
    csr = csr * ptr;
    csi = -csi * ptr;
    zmlt(coefr, coefi, s1r, s1i, &str, &sti);
    zmlt(str, sti, csr, csi, &s1r, &s1i);
    if (inu > 0 || n > 1) goto L200;
    zdr = zr;
    zdi = zi;
    if (iflag == 1) goto L270;
    goto L240;
L200:
    // Compute p1/p2 = (p1/|p2|) * (conjg(p2)/|p2|) for scaling.
    tm = zabs(p2r, p2i);
    ptr = 1.0 / tm;
    p1r = p1r * ptr;
    p1i = p1i * ptr;
    p2r = p2r * ptr;
    p2i = -p2i * ptr;
    zmlt(p1r, p1i, p2r, p2i, &ptr, &pti);
    str = dnu + 0.5 - ptr;
    sti = -pti;
    zdiv(str, sti, zr, zi, &str, &sti);
    str = str + 1.0;
    zmlt(str, sti, s1r, s1i, &s2r, &s2i);
    // Forward recursion on the three-term recursion with relation with scaling near exponent
    // extremes on kflag = 1 or kflag = 3.
L210:
    str = dnu + 1.0;
    ckr = str * rzr;
    cki = str * rzi;
    if (n == 1) inu = inu - 1;
    if (inu > 0) goto L220;
    if (n <= 1) {
        s1r = s2r;
        s1i = s2i;
    }
    zdr = zr;
    zdi = zi;
    if (iflag == 1) goto L270;
    goto L240;
L220:
    inub = 1;
    if (iflag == 1) goto L261;
L225:
    p1r = csrr[kflag - 1];
    ascle = bry[kflag - 1];
    for (i = inub; i <= inu; ++i) {
        str = s2r;
        sti = s2i;
        s2r = ckr * str - cki * sti + s1r;
        s2i = ckr * sti + cki * str + s1i;
        s1r = str;
        s1i = sti;
        ckr = ckr + rzr;
        cki = cki + rzi;
        Rescale<Larger>(s2r * p1r, s2i * p1r, bry, cssr, csrr, &kflag, &ascle, &p1r, &s1r, &s1i, &s2r, &s2i);
    }
    if (n == 1) {
        s1r = s2r;
        s1i = s2i;
    }
L240:
    str = csrr[kflag - 1];
    yr[0] = s1r * str;
    yi[0] = s1i * str;
    if (n == 1) return;
    yr[1] = s2r * str;
    yi[1] = s2i * str;
    if (n == 2) return;
    kk = 2;
L250:
    kk = kk + 1;
    if (kk > n) return;
    RecurKForward<Larger>(kk, n, s1r, s1i, s2r, s2i, ckr, cki, rzr, rzi, kflag, bry, cssr, csrr, yr, yi);
    return;
    // iflag = 1 cases, forward recurrence on the scaled values on underflow.
L261:
    helim = 0.5 * elim;
    elm = std::exp(-elim);
    celmr = elm;
    ascle = bry[0];
    zdr = zr;
    zdi = zi;
    ic = -1;
    j = 2;
    for (i = 1; i <= inu; ++i) {
        str = s2r;
        sti = s2i;
        s2r = str * ckr - sti * cki + s1r;
        s2i = sti * ckr + str * cki + s1i;
        s1r = str;
        s1i = sti;
        ckr = ckr + rzr;
        cki = cki + rzi;
        as = zabs(s2r, s2i);
        alas = std::log(as);
        p2r = alas - zdr;
        if (p2r < (-elim)) goto L263;
        if (!ThroughLogOnScale(s2r, s2i, zdr, zdi, ascle, tol, &p1r, &p1i)) goto L263;
        j = 3 - j;
        cyr[j - 1] = p1r;
        cyi[j - 1] = p1i;
        if (ic == i - 1) goto L264;
        ic = i;
        continue;
    L263:
        if (alas < helim) continue;
        zdr = zdr - elim;
        s1r = s1r * celmr;
        s1i = s1i * celmr;
        s2r = s2r * celmr;
        s2i = s2i * celmr;
    }
    if (n == 1) {
        s1r = s2r;
        s1i = s2i;
    }
    goto L270;
L264:
    kflag = 1;
    inub = i + 1;
    s2r = cyr[j - 1];
    s2i = cyi[j - 1];
    j = 3 - j;
    s1r = cyr[j - 1];
    s1i = cyi[j - 1];
    if (inub <= inu) goto L225;
    if (n == 1) {
        s1r = s2r;
        s1i = s2i;
    }
    goto L240;
L270:
    yr[0] = s1r;
    yi[0] = s1i;
    if (n != 1) {
        yr[1] = s2r;
        yi[1] = s2i;
    }
    ascle = bry[0];
    zkscl(zdr, zdi, fnu, n, yr, yi, nz, rzr, rzi, ascle, tol, elim);
    inu = n - *nz;
    if (inu <= 0) return;
    kk = *nz + 1;
    s1r = yr[kk - 1];
    s1i = yi[kk - 1];
    yr[kk - 1] = s1r * csrr[0];
    yi[kk - 1] = s1i * csrr[0];
    if (inu == 1) return;
    kk = *nz + 2;
    s2r = yr[kk - 1];
    s2i = yi[kk - 1];
    yr[kk - 1] = s2r * csrr[0];
    yi[kk - 1] = s2i * csrr[0];
    if (inu == 2) return;
    t2 = fnu + static_cast<double>(kk - 1);
    ckr = t2 * rzr;
    cki = t2 * rzi;
    kflag = 1;
    goto L250;
    // Scale by exp(z), iflag = 1 cases.
L290:
    koded = 2;
    iflag = 1;
    kflag = 2;
    goto L120;
    // fnu = half odd integer case, dnu = -0.5.
L300:
    s1r = coefr;
    s1i = coefi;
    s2r = coefr;
    s2i = coefi;
    goto L210;
L310:
    *nz = -2;
}

}  // namespace tw::amos
