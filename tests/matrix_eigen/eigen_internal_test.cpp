// White-box checks of the eigen cores: closed-form spectra, the polynomial built from roots, and
// the retry of an ordered QZ by the one-call driver after a failed exchange.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <complex>
#include <numbers>
#include <vector>

#include "matrix/eigen.hpp"
#include "twanlys/matrix_eigen.h"
#include "twrt.hpp"

namespace {

using cd = std::complex<double>;

TEST(SymmetricEigen, SecondDifferenceMatrixHasItsClosedFormSpectrum) {
    // tridiag(-1, 2, -1): lambda_k = 2 - 2 cos(k pi / (n + 1)), ascending; the upper triangle is
    // never read.
    for (int32_t n : {1, 2, 9, 30}) {
        std::vector<double> a(size_t(n) * n, 1e300), v(size_t(n) * n), w(static_cast<size_t>(n));
        for (int32_t i = 0; i < n; ++i)
            for (int32_t j = 0; j <= i; ++j) a[size_t(i) * n + j] = i == j ? 2 : i == j + 1 ? -1 : 0;
        ASSERT_EQ(tw::SymmetricEigen(a.data(), n, 1, w.data(), v.data()), 0);
        for (int32_t k = 0; k < n; ++k)
            EXPECT_NEAR(w[size_t(k)], 2 - 2 * std::cos((k + 1) * std::numbers::pi / (n + 1)), 1e-14 * n) << n;
    }
}

TEST(PolyFromRoots, MonicProductKeepsZeroRoots) {
    struct Case {
        std::vector<cd> roots, coefficients;
    };
    const std::vector<Case> cases = {
        {{0.0, 2.0, -1.5}, {0.0, -3.0, -0.5, 1.0}},
        {{cd(0, 1), cd(0, -1)}, {1.0, 0.0, 1.0}},
        {{1e-9, 1e-9}, {1e-18, -2e-9, 1.0}},
        {{}, {1.0}},
    };
    for (const Case& c : cases) {
        const int32_t n = int32_t(c.roots.size());
        std::vector<cd> out(size_t(n) + 1, cd(7, 7));
        EXPECT_EQ(tw::PolyFromRoots(c.roots.data(), n, out.data()), n);
        for (size_t k = 0; k < out.size(); ++k) EXPECT_EQ(out[k], c.coefficients[k]) << n << " " << k;
    }
}

TEST(GeneralEigen, CompanionRoundTripAndExceptionalShift) {
    // The companion matrix of roots 1..6 gives them back; a cyclic permutation (all shifts
    // useless until the exceptional one) gives the sixth roots of unity.
    const int32_t n = 6;
    std::vector<cd> roots(n), c(n + 1), w(n), v(size_t(n) * n);
    for (int32_t i = 0; i < n; ++i) roots[size_t(i)] = i + 1;
    tw::PolyFromRoots(roots.data(), n, c.data());
    std::vector<double> m(size_t(n) * n, 0.0), cyc(size_t(n) * n, 0.0);
    for (int32_t i = 0; i + 1 < n; ++i) m[size_t(i) * n + i + 1] = 1;
    for (int32_t j = 0; j < n; ++j) m[size_t(n - 1) * n + j] = -c[size_t(j)].real();
    ASSERT_EQ(tw::GeneralEigen(m.data(), n, 0, w.data(), nullptr), 0);
    std::vector<double> re;
    for (cd x : w) re.push_back(x.real());
    std::sort(re.begin(), re.end());
    for (int32_t i = 0; i < n; ++i) EXPECT_NEAR(re[size_t(i)], i + 1, 1e-9);
    for (int32_t i = 0; i < n; ++i) cyc[size_t(i) * n + (i + 1) % n] = 1;
    ASSERT_EQ(tw::GeneralEigen(cyc.data(), n, 1, w.data(), v.data()), 0);
    for (cd x : w) EXPECT_NEAR(std::abs(std::pow(x, n) - 1.0), 0, 1e-13);
}

TEST(QzRetry, FailedExchangeIsRetriedByTheDriver) {
    const int32_t n = 4;
    const std::vector<double> a = {4, 1, 2, 0, 1, -3, 0, 1, 2, 0, 1, 5, 0, 1, 5, -2};
    const std::vector<double> b = {2, 0, 1, 0, 0, 1, 0, 1, 1, 0, 3, 0, 0, 1, 0, 2};
    std::vector<cd> alpha(n);
    std::vector<double> beta(n);
    // The core alone reports the failure.
    tw::gFailQzExchange = true;
    EXPECT_EQ(tw::GeneralisedSchur<double>(a.data(), b.data(), n, 1, 1, 1, 0, nullptr, nullptr, nullptr, nullptr,
                                           alpha.data(), beta.data(), nullptr, nullptr),
              FactorisationFailedErr);
    // The export retries once by the driver and still delivers an ascending order.
    tw::gFailQzExchange = true;
    twrt::Array2D<double> A(n, n, a), B(n, n, b);
    twrt::Array1D<cd> al;
    twrt::Array1D<double> be;
    twrt::Array2D<cd> vec;
    EXPECT_EQ(QZ80_head(A.h(), B.h(), 1, 1, al.h(), be.h(), vec.h()), 0);
    EXPECT_FALSE(tw::gFailQzExchange);
    ASSERT_EQ(al.size(), n);
    for (int32_t i = 0; i + 1 < n; ++i) EXPECT_LE(al[i].real() / be[i], al[i + 1].real() / be[i + 1] + 1e-12);
    // The complex twin of the Schur-form export has no retry.
    tw::gFailQzExchange = true;
    const std::vector<cd> ca(a.begin(), a.end()), cb(b.begin(), b.end());
    EXPECT_EQ(tw::GeneralisedSchur<cd>(ca.data(), cb.data(), n, 0, 1, 2, 0, nullptr, nullptr, nullptr,
                                       nullptr, alpha.data(), nullptr, nullptr, nullptr),
              FactorisationFailedErr);
    tw::gFailQzExchange = false;
}

}  // namespace

namespace {

// Undoing a permutation swaps rows by the entries outside ilo..ihi; an entry that names no row is
// refused, and limits the driver would refuse leave V as it is.
TEST(EigenVBack, PermutationEntriesAreScreened) {
    const std::vector<double> v0 = {1, 2, 3, 4, 5, 6, 7, 8, 9};
    struct Case {
        std::vector<double> scale;
        int32_t ilo, ihi, status;
        std::vector<int> rows;  // source row of each result row; empty: V emptied
    } cases[] = {
        {{3, 7, 3}, 1, 1, 0, {2, 1, 0}},                  // row 1 swaps with row 3, row 3 stays
        {{4, 1, 3}, 1, 1, -20017, {}},                     // row 4 of 3
        {{std::nan(""), 1, 3}, 1, 1, -20017, {}},          // not a row at all
        {{0.5, 1, 3}, 1, 1, -20017, {}},                   // row 0
        {{4, 1, 3}, 5, 5, 0, {0, 1, 2}},                   // ilo past the end: nothing done
        {{4, 1, 3}, 0, 2, 0, {0, 1, 2}},                   // every row balanced: no entry read
    };
    for (const Case& c : cases) {
        twrt::Array2D<double> v(3, 3, v0);
        twrt::Array1D<double> scale(c.scale);
        EXPECT_EQ(EigenVBack_head(v.h(), 1, 1, c.ilo, c.ihi, scale.h()), c.status) << c.scale[0];
        ASSERT_EQ(v.rows(), c.rows.empty() ? 0 : 3);
        for (size_t r = 0; r < c.rows.size(); ++r)
            for (int32_t j = 0; j < 3; ++j)
                EXPECT_EQ(v.at(int32_t(r), j), v0[size_t(c.rows[r]) * 3 + size_t(j)]) << r;
    }
}

}  // namespace
