// Stated quirks of the decomposition exports.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <complex>
#include <vector>

#include "twanlys/matrix.h"
#include "twrt.hpp"

namespace {

using cd = std::complex<double>;

TEST(LU, ZeroColumnWarnsAndKeepsTheFactors) {
    // Column 1 is zero: no pivot there, perm[1] stays 1, and the factors of the other columns stand.
    twrt::Array2D<double> a(3, 3, {1, 0, 2, 4, 0, 1, 2, 0, 3}), before(3, 3, {1, 0, 2, 4, 0, 1, 2, 0, 3});
    twrt::Array1D<int32_t> perm;
    int32_t parity = -1, status = 0;
    LU_head(a.h(), perm.h(), &parity, &status);
    EXPECT_EQ(status, SingularPivotWarn);
    ASSERT_EQ(perm.size(), 3);
    EXPECT_EQ(perm[0], 1);
    EXPECT_EQ(perm[1], 1);
    EXPECT_EQ(parity, 1);
    ASSERT_EQ(a.rows(), 3);
    EXPECT_EQ(a.at(0, 0), 4);    // the pivot row
    EXPECT_EQ(a.at(1, 0), 0.25); // 1 / 4, below the diagonal
    EXPECT_EQ(a.at(2, 0), 0.5);
}

TEST(LU, EmptyAndNonFiniteComplex) {
    twrt::Array2D<double> empty(0, 3);
    twrt::Array1D<int32_t> perm(2);
    int32_t parity = 0, status = 0;
    LU_head(empty.h(), perm.h(), &parity, &status);
    EXPECT_EQ(status, EmptyArrayErr);
    EXPECT_EQ(perm.size(), 0);
    twrt::Array2D<cd> z(1, 2, {cd(1, std::nan("")), 1});
    CxLU_head(z.h(), perm.h(), &parity, &status);
    EXPECT_EQ(status, NanInfErr);
    EXPECT_EQ(z.rows(), 0);  // the in-place matrix is emptied on failure
    EXPECT_EQ(z.cols(), 0);
}

TEST(Qrd, MethodRangeOnlyForRealData) {
    twrt::Array2D<double> a(2, 2, {1, 2, 3, 4});
    twrt::Array2D<double> q(2, 2), r(2, 2);
    int32_t method = 3, status = 0;
    qrd_head(a.h(), &method, q.h(), r.h(), &status);
    EXPECT_EQ(status, InvalidSelectorErr);
    EXPECT_EQ(q.rows(), 0);
    EXPECT_EQ(r.rows(), 0);
    twrt::Array2D<cd> c(2, 2, {1, 2, 3, 4}), cq, cr;
    Cxqrd_head(c.h(), &method, cq.h(), cr.h(), &status);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(cq.rows(), 2);
    EXPECT_EQ(cr.cols(), 2);
}

TEST(Svd, WideMatrixBecomesItsLeftFactor) {
    twrt::Array2D<double> a(2, 3, {3, 0, 0, 0, 0, 2});
    twrt::Array1D<double> s;
    twrt::Array2D<double> v;
    int32_t status = -1;
    SVD_head(a.h(), s.h(), v.h(), &status);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(a.rows(), 2);
    EXPECT_EQ(a.cols(), 2);
    EXPECT_EQ(v.rows(), 3);
    EXPECT_EQ(v.cols(), 2);
    EXPECT_EQ(s.vec(), (std::vector<double>{3, 2}));
}

TEST(Compact, ChecksAndUncheckedForms) {
    struct Case {
        int32_t length, kind, status;
    };
    for (const Case& c : {Case{6, 0, 0}, Case{5, 0, NotSquareErr}, Case{6, 3, InvalidSelectorErr},
                          Case{0, 1, EmptyArrayErr}, Case{6, -1, InvalidSelectorErr}}) {
        twrt::Array1D<double> data(std::vector<double>(size_t(c.length), 1.0));
        CompactMatrix cm{data.h(), c.kind};
        twrt::Array2D<double> m(4, 4);
        int32_t status = 1;
        Compact_to_Matrix_head(&cm, m.h(), &status);
        EXPECT_EQ(status, c.status) << c.length << " " << c.kind;
        EXPECT_EQ(m.rows(), c.status == 0 ? 3 : 0);
    }
    // Kind 1 expands column by column from the top, with zeros below the diagonal.
    twrt::Array1D<double> upper{1, 2, 3, 4, 5, 6};
    CompactMatrix cm{upper.h(), 1};
    twrt::Array2D<double> m;
    int32_t status = 1;
    Compact_to_Matrix_head(&cm, m.h(), &status);
    EXPECT_EQ(m.vec(), (std::vector<double>{1, 2, 4, 0, 3, 5, 0, 0, 6}));

    // The unchecked forms: lower layout, symmetric fill, result always 0.
    twrt::Array2D<double> full(3, 3, {1, 9, 9, 2, 4, 9, 3, 5, 6}), back(3, 3);
    twrt::Array1D<double> packed(6);
    EXPECT_EQ(MatrixToCompact_H(full.h(), packed.h()), 0);
    EXPECT_EQ(packed.vec(), (std::vector<double>{1, 2, 3, 4, 5, 6}));
    EXPECT_EQ(CompactToMatrix_H(back.h(), packed.h()), 0);
    EXPECT_EQ(back.vec(), (std::vector<double>{1, 2, 3, 2, 4, 5, 3, 5, 6}));
    twrt::Array2D<double> none(0, 0);
    EXPECT_EQ(MatrixToCompact_H(none.h(), packed.h()), 0);
}

TEST(QrDec, OptionsPivotAndChecks) {
    const std::vector<double> v{1, 5, 2, 4, 0, 3};
    struct Case {
        int32_t pivot, option, status, pSide, qRows, qCols, rRows;
    };
    // 2 by 3: economy keeps Q square; option 2 gives R alone.
    for (const Case& c : {Case{1, 0, 0, 3, 2, 2, 2}, Case{1, 1, 0, 3, 2, 2, 2}, Case{1, 2, 0, 3, 0, 0, 2},
                          Case{0, 2, 0, 0, 0, 0, 2}, Case{1, 3, InvalidSelectorErr, 0, 0, 0, 0},
                          Case{0, -1, InvalidSelectorErr, 0, 0, 0, 0}}) {
        twrt::Array2D<double> a(2, 3, v);
        twrt::Array2D<int32_t> p(1, 1);
        twrt::Array2D<double> q(1, 1), r;
        EXPECT_EQ(QRDecH(a.h(), c.pivot, c.option, p.h(), q.h(), r.h()), c.status) << c.pivot << " " << c.option;
        EXPECT_EQ(p.rows(), c.pSide);
        EXPECT_EQ(q.rows(), c.qRows);
        EXPECT_EQ(q.cols(), c.qCols);
        EXPECT_EQ(r.rows(), c.rRows);
        EXPECT_EQ(r.cols(), c.status == 0 ? 3 : 0);
        if (c.pSide == 3) {
            // The column of largest norm comes first: column 1 (5, 0).
            EXPECT_EQ(p.at(1, 0), 1);
            EXPECT_NEAR(std::fabs(r.at(0, 0)), 5, 1e-15);
        }
    }
    twrt::Array2D<cd> empty(0, 2), p, q, r;
    EXPECT_EQ(CxQRDecH(empty.h(), 1, 0, p.h(), q.h(), r.h()), EmptyArrayErr);
    twrt::Array2D<cd> bad(1, 2, {cd(1, std::nan("")), 1});
    EXPECT_EQ(CxQRDecH(bad.h(), 1, 0, p.h(), q.h(), r.h()), NanInfErr);
}

TEST(Gsvd, ValuesOnlyAndChecks) {
    twrt::Array2D<double> a(3, 2, {1, 2, 3, 4, 5, 6}), b(2, 2, {1, 0, 0, 2}), wide(2, 3), none(0, 2);
    std::vector<twrt::Array2D<double>> outs(5);
    for (auto& o : outs) o = twrt::Array2D<double>(2, 2);
    twrt::Array1D<double> s;
    const auto call = [&](twrt::Array2D<double>& x, twrt::Array2D<double>& y, int32_t valuesOnly) {
        return GSVD_head(x.h(), y.h(), valuesOnly, 0, s.h(), outs[0].h(), outs[1].h(), outs[2].h(), outs[3].h(),
                         outs[4].h());
    };
    EXPECT_EQ(call(a, b, 1), 0);
    ASSERT_EQ(s.size(), 2);
    for (auto& o : outs) {
        EXPECT_EQ(o.rows(), 0);
        EXPECT_EQ(o.cols(), 0);
    }
    // The ratios are the square roots of the eigenvalues of (A^T A, B^T B), here diag(1, 4):
    // A^T A = [[35, 44], [44, 56]], so the pencil's values solve det(A^T A - l B^T B) = 0.
    std::vector<double> got = s.vec();
    std::sort(got.begin(), got.end());
    const double p = 35 * 4 + 56, q = 35 * 56 - 44 * 44;  // 4 l^2 - p l + q = 0
    const double lo = (p - std::sqrt(p * p - 16 * q)) / 8, hi = (p + std::sqrt(p * p - 16 * q)) / 8;
    EXPECT_NEAR(got[0], std::sqrt(lo), 1e-13);
    EXPECT_NEAR(got[1], std::sqrt(hi), 1e-13);
    EXPECT_EQ(call(a, wide, 0), BandStructureErr);
    EXPECT_EQ(s.size(), 0);
    EXPECT_EQ(call(none, b, 0), EmptyArrayErr);
}

TEST(Hessenberg, IndexChecks) {
    struct Case {
        int rows, cols, ilo, ihi;
        int32_t status;
    };
    for (const Case& c : {Case{3, 3, 1, 0, IndexRangeErr}, Case{3, 3, -1, 2, IndexRangeErr}, Case{3, 3, 0, 3, IndexRangeErr},
                          Case{0, 3, 0, 0, NotSquareErr}, Case{2, 3, 0, 1, NotSquareErr}, Case{0, 0, 0, 0, EmptyArrayErr},
                          Case{3, 3, 1, 1, 0}, Case{1, 1, 0, 0, 0}, Case{3, 3, 0, 2, 0}}) {
        twrt::Array2D<double> a(c.rows, c.cols, std::vector<double>(size_t(c.rows) * c.cols, 1.0)), q;
        EXPECT_EQ(Hessenberg_head(a.h(), c.ilo, c.ihi, q.h()), c.status) << c.rows << " " << c.ilo << " " << c.ihi;
        EXPECT_EQ(q.rows(), c.status == 0 ? c.rows : 0);
        EXPECT_EQ(a.rows(), c.status == 0 ? c.rows : 0);
    }
}

TEST(Balance, ChecksAndOneBasedPermutations) {
    struct Case {
        int rows, cols, job;
        int32_t status;
    };
    for (const Case& c : {Case{0, 0, 0, EmptyArrayErr}, Case{2, 3, 0, NotSquareErr}, Case{0, 3, 9, EmptyArrayErr},
                          Case{3, 3, 4, InvalidSelectorErr}, Case{3, 3, -1, InvalidSelectorErr}}) {
        twrt::Array2D<double> a(c.rows, c.cols, std::vector<double>(size_t(c.rows) * c.cols, 1.0));
        twrt::Array1D<double> scale(3);
        int32_t ilo = 7, ihi = 7;
        EXPECT_EQ(MatrixBalance_head(a.h(), c.job, &ilo, &ihi, scale.h()), c.status);
        EXPECT_EQ(scale.size(), 0);
        EXPECT_EQ(a.rows(), 0);
    }
    // Row 0 holds only its diagonal: permuting moves it to the end, and scale records the
    // 1-based row it was exchanged with; ilo and ihi come back 0-based.
    twrt::Array2D<double> a(3, 3, {7, 0, 0, 2, 1, 3, 5, 4, 6});
    twrt::Array1D<double> scale;
    int32_t ilo = 7, ihi = 7;
    EXPECT_EQ(MatrixBalance_head(a.h(), 1, &ilo, &ihi, scale.h()), 0);
    EXPECT_EQ(ilo, 0);
    EXPECT_EQ(ihi, 1);
    EXPECT_EQ(scale[2], 1.0);
    EXPECT_EQ(a.at(2, 2), 7.0);
}

}  // namespace
