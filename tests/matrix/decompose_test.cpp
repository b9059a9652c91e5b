// Stated quirks of the decomposition exports.
#include <gtest/gtest.h>

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

}  // namespace
