// The drivers of the complex Bessel package with n > 1 members: the exports ask for one value,
// but the routines behind them recur over sequences (second members in the Wronskian, the
// continuation and Bi; longer ones in the recurrences of the series, the asymptotic expansion,
// K's forward recurrence and its underflow scaling). Each member of a sequence of orders v, v+1,
// v+2, v+3 must equal the single value computed at its own order, whose method (and accuracy
// against SciPy) the reference test covers. Members and single values often come from different
// methods (a recurrence across the order of the uniform expansions against the expansion itself),
// each good to about 1e-13, so they agree to a few times that; an index or recurrence fault would
// not.
#include <gtest/gtest.h>

#include <cmath>
#include <complex>
#include <cstdio>
#include <functional>
#include <vector>

#include "special/amos/amos.hpp"

namespace {

using namespace tw::amos;
using Driver = std::function<void(double zr, double zi, double fnu, int kode, int n, double* yr, double* yi,
                                  int* nz, int* ierr)>;

constexpr int kN = 4;

struct Named {
    const char* name;
    Driver call;
};

const std::vector<Named>& Drivers() {
    static const std::vector<Named> d = {
        {"J", zbesj},
        {"I", zbesi},
        {"K", zbesk},
        {"H1", [](double zr, double zi, double v, int kode, int n, double* yr, double* yi, int* nz,
                  int* ierr) { zbesh(zr, zi, v, kode, 1, n, yr, yi, nz, ierr); }},
        {"H2", [](double zr, double zi, double v, int kode, int n, double* yr, double* yi, int* nz,
                  int* ierr) { zbesh(zr, zi, v, kode, 2, n, yr, yi, nz, ierr); }},
        {"Y", [](double zr, double zi, double v, int kode, int n, double* yr, double* yi, int* nz, int* ierr) {
             double wr[kN], wi[kN];
             zbesy(zr, zi, v, kode, n, yr, yi, nz, wr, wi, ierr);
         }},
    };
    return d;
}

TEST(AmosSequence, MembersEqualTheSingleValues) {
    // Series (|z| small), Miller and Wronskian (moderate), asymptotic (|z| >= 21.8), the left half
    // plane, the imaginary axis, near-underflow K (Re z ~ 650) and the uniform expansions.
    const double orders[] = {0.0, 0.3, 2.7, 10.5, 40.25, 84.6, 95.0};
    const std::complex<double> points[] = {{0.5, 0.3},  {0.02, -0.01}, {5.0, -3.0},  {-4.0, 2.0},  {0.0, 8.0},
                                           {30.0, 10.0}, {-20.0, -15.0}, {-0.2, -60.0}, {120.0, 3.0}, {655.0, 2.0},
                                           {-60.0, 0.5}, {3.0, 0.0}};
    double worst = 0.0;
    int compared = 0;
    for (const Named& d : Drivers())
        for (double v : orders)
            for (std::complex<double> z : points)
                for (int kode : {1, 2}) {
                    double yr[kN], yi[kN];
                    int nz = -1, ierr = -1;
                    d.call(z.real(), z.imag(), v, kode, kN, yr, yi, &nz, &ierr);
                    if (ierr != 0) continue;
                    for (int k = 0; k < kN; ++k) {
                        if (nz > 0 && yr[k] == 0.0 && yi[k] == 0.0) continue;  // counted underflow
                        double sr = 0, si = 0;
                        int nz1 = -1, ierr1 = -1;
                        d.call(z.real(), z.imag(), v + k, kode, 1, &sr, &si, &nz1, &ierr1);
                        if (ierr1 != 0 || nz1 != 0) continue;
                        const std::complex<double> seq(yr[k], yi[k]), one(sr, si);
                        if (!std::isfinite(std::abs(one)) || std::abs(one) == 0.0) continue;
                        const double e = std::abs(seq - one) / std::abs(one);
                        worst = std::fmax(worst, e);
                        ++compared;
                        EXPECT_LE(e, 4e-13) << d.name << " order " << v + k << " at " << z << " kode " << kode
                                            << ": " << seq << " vs " << one;
                    }
                }
    std::printf("sequences: %d members compared, worst relative difference %.2g\n", compared, worst);
    EXPECT_GT(compared, 1500);
}

TEST(AmosSequence, UnderflowedMembersAreCountedAndZero) {
    // K_v(705 + i) ~ sqrt(pi/1410) exp(-705) ~ 2e-308 for v = 0..3: below the underflow limit of
    // the unscaled function (log |K| < -elim = -700.9), all four.
    double yr[kN], yi[kN];
    int nz = -1, ierr = -1;
    zbesk(705.0, 1.0, 0.0, 1, kN, yr, yi, &nz, &ierr);
    EXPECT_EQ(ierr, 0);
    EXPECT_EQ(nz, kN);
    for (int k = 0; k < kN; ++k) EXPECT_TRUE(yr[k] == 0.0 && yi[k] == 0.0) << k;
    // I_v(1e-3) ~ (5e-4)^v / Gamma(v + 1): 10^-297.8, 10^-302.9, 10^-308, 10^-313 for v = 63.5..66.5;
    // the two highest orders fall below exp(-elim) and are zero from the top of the sequence.
    zbesi(1e-3, 0.0, 63.5, 1, kN, yr, yi, &nz, &ierr);
    EXPECT_EQ(ierr, 0);
    EXPECT_EQ(nz, 2);
    for (int k = 0; k < kN; ++k) EXPECT_EQ(yr[k] == 0.0, k >= 2) << k;
}

}  // namespace
