// Check orders, failure contract and the stated quirks of the solver, inverse and determinant exports.
#include <gtest/gtest.h>

#include <cmath>
#include <complex>
#include <functional>
#include <limits>
#include <string>
#include <vector>

#include "common/helpers.hpp"
#include "twanlys/matrix_solve.h"
#include "twanlys/workspace.h"
#include "twrt.hpp"

namespace {

using cd = std::complex<double>;
using D2 = twrt::Array2D<double>;
using D1 = twrt::Array1D<double>;

// A well-conditioned symmetric positive definite filling of any shape: 4 on the diagonal, 1 elsewhere.
std::vector<double> Filling(int rows, int cols) {
    std::vector<double> v(size_t(rows > 0 ? rows : 0) * size_t(cols > 0 ? cols : 0), 1.0);
    for (int i = 0; i < rows && i < cols; ++i) v[size_t(i) * cols + i] = 4;
    return v;
}

D2 Matrix(int rows, int cols) { return D2(rows, cols, Filling(rows, cols)); }
D1 Vector(int n) { return D1(std::vector<double>(size_t(n), 1.0)); }

// --- Check orders ------------------------------------------------------------------------------

// The single right-hand-side drivers: (rows, cols, length of b) and the status of each route.
TEST(CheckOrder, SingleRightHandSideDrivers) {
    struct Case {
        int rows, cols, nb;
        int32_t svd, lu, cholesky;
    };
    const Case cases[] = {
        {0, 0, 0, EmptyArrayErr, EmptyArrayErr, EmptyArrayErr},
        // The length test of the LU driver comes last and overrides the empty test.
        {0, 3, 2, EmptyArrayErr, EqSamplesErr, EmptyArrayErr},
        {3, 3, 2, EqSamplesErr, EqSamplesErr, EqSamplesErr},
        {2, 3, 3, EqSamplesErr, EqSamplesErr, NotSquareErr},
        // The LU order is the column count: extra rows are not read, missing ones make it singular.
        {3, 2, 3, 0, 0, NotSquareErr},
        {2, 3, 2, 0, SingularMatrixErr, NotSquareErr},
        {3, 3, 3, 0, 0, 0},
    };
    using Export = int32_t (*)(Array2DHandle, Array1DHandle, Array1DHandle, int32_t*);
    for (const Case& c : cases) {
        const std::pair<Export, int32_t> routes[] = {
            {GenLinEqs_head, c.svd}, {EqsByLUDri_head, c.lu}, {EqsByCholeskyDri_head, c.cholesky}};
        for (const auto& [call, want] : routes) {
            D2 a = Matrix(c.rows, c.cols);
            D1 b = Vector(c.nb), x(7);
            int32_t status = 1;
            EXPECT_EQ(call(a.h(), b.h(), x.h(), &status), 0);
            EXPECT_EQ(status, want) << c.rows << "x" << c.cols << " b " << c.nb;
            EXPECT_EQ(x.size(), want == 0 ? c.cols : 0);
        }
    }
}

// The several right-hand-side drivers: (A, B, selector) and the status of each route.
TEST(CheckOrder, SeveralRightHandSideDrivers) {
    struct Case {
        int rows, cols, brows, bcols, selector;
        int32_t svd, lu, cholesky, tri;
    };
    const Case cases[] = {
        {0, 0, 3, 1, 0, EmptyArrayErr, EmptyArrayErr, EmptyArrayErr, EmptyArrayErr},
        {3, 3, 3, 0, 0, EmptyArrayErr, EmptyArrayErr, EmptyArrayErr, EmptyArrayErr},
        {2, 3, 2, 1, 0, 0, NotSquareErr, NotSquareErr, NotSquareErr},
        {3, 3, 2, 1, 0, EqSamplesErr, EqSamplesErr, EqSamplesErr, EqSamplesErr},
        {3, 3, 3, 2, 2, 0, NoSuchCaseErr, InvalidSelectorErr, InvalidSelectorErr},
        {3, 3, 3, 2, -1, 0, NoSuchCaseErr, InvalidSelectorErr, InvalidSelectorErr},
        {3, 3, 3, 2, 1, 0, NoSuchCaseErr, 0, 0},
    };
    for (const Case& c : cases) {
        const std::pair<std::function<int32_t(Array2DHandle, Array2DHandle, Array2DHandle)>, int32_t> routes[] = {
            {EqsSetBySVDDri_head, c.svd},
            {EqsSetByLUDri_head, c.lu},
            {[&](Array2DHandle a, Array2DHandle b, Array2DHandle x) { return EqsSetByCholeskyDri_head(a, c.selector, b, x); },
             c.cholesky},
            {[&](Array2DHandle a, Array2DHandle b, Array2DHandle x) { return TriEqsSetDri_head(a, c.selector, b, x); },
             c.tri}};
        for (const auto& [call, want] : routes) {
            D2 a = Matrix(c.rows, c.cols), b = Matrix(c.brows, c.bcols), x(5, 5);
            EXPECT_EQ(call(a.h(), b.h(), x.h()), want) << c.rows << "x" << c.cols << " B " << c.brows << "x" << c.bcols;
            EXPECT_EQ(x.rows(), want == 0 ? c.cols : 0);
            EXPECT_EQ(x.cols(), want == 0 ? c.bcols : 0);
        }
    }
}

// In-place inversions: not square is tested after empty and wins.
TEST(CheckOrder, InPlaceInverses) {
    struct Case {
        int rows, cols;
        int32_t status;
    };
    int32_t kind = 0;
    const std::function<int32_t(Array2DHandle, int32_t*)> calls[] = {
        InvMatrixLUDri_head, InvMatrixChoDri_head,
        [&](Array2DHandle a, int32_t* s) { return InvMatrixTriDri_head(a, &kind, s); }};
    for (const Case& c : {Case{0, 0, EmptyArrayErr}, Case{0, 3, NotSquareErr}, Case{2, 3, NotSquareErr}, Case{3, 3, 0}})
        for (const auto& call : calls) {
            D2 a = Matrix(c.rows, c.cols);
            int32_t status = 1;
            EXPECT_EQ(call(a.h(), &status), 0);
            EXPECT_EQ(status, c.status) << c.rows << "x" << c.cols;
            EXPECT_EQ(a.rows(), c.status == 0 ? c.rows : 0);
        }
    kind = 2;
    D2 a = Matrix(3, 3);
    int32_t status = 1;
    InvMatrixTriDri_head(a.h(), &kind, &status);
    EXPECT_EQ(status, InvalidSelectorErr);
    EXPECT_EQ(a.cols(), 0);
}

// Solves and inverses from factors: the LU, its exchange list and the right-hand side.
TEST(CheckOrder, FromLuFactors) {
    struct Case {
        int rows, cols, nperm, nb, badEntry;
        int32_t solve, inverse;
    };
    const Case cases[] = {
        {0, 0, 0, 0, 0, EmptyArrayErr, EmptyArrayErr},
        {2, 3, 2, 2, 0, NotSquareErr, NotSquareErr},
        {3, 3, 2, 3, 0, EqSamplesErr, EqSamplesErr},
        {3, 3, 3, 2, 0, EqSamplesErr, 0},
        // An exchange list naming a row outside the matrix is refused rather than followed.
        {3, 3, 3, 3, 1, IndexRangeErr, IndexRangeErr},
        {3, 3, 3, 3, 0, 0, 0},
    };
    for (const Case& c : cases) {
        std::vector<int32_t> p(size_t(c.nperm));
        for (int i = 0; i < c.nperm; ++i) p[size_t(i)] = i;
        if (c.badEntry) p[1] = 7;
        twrt::Array1D<int32_t> perm(p);
        D2 lu = Matrix(c.rows, c.cols);
        D1 b = Vector(c.nb);
        int32_t status = 1;
        LULinEqs_head(lu.h(), perm.h(), b.h(), &status);
        EXPECT_EQ(status, c.solve);
        EXPECT_EQ(b.size(), c.solve == 0 ? c.nb : 0);
        LUInvMatrix_head(lu.h(), perm.h(), &status);
        EXPECT_EQ(status, c.inverse);
        EXPECT_EQ(lu.rows(), c.inverse == 0 ? c.rows : 0);
    }
}

// The compact exports: empty, not triangular, then the length of b.
TEST(CheckOrder, CompactInputs) {
    struct Case {
        int length, nb;
        int32_t status;
    };
    for (const Case& c : {Case{0, 0, EmptyArrayErr}, Case{5, 3, NotSquareErr}, Case{6, 2, EqSamplesErr}, Case{6, 3, 0}}) {
        const auto compact = [&] {
            std::vector<double> v(size_t(c.length), 0.5);
            for (int j = 0, k = 0; k < c.length; k += 3 - j, ++j) v[size_t(k)] = 4;  // lower diagonal of order 3
            return D1(v);
        };
        const std::function<int32_t(Array1DHandle, Array1DHandle, int32_t*)> solves[] = {
            CholeskyLinEqs_head,
            [](Array1DHandle t, Array1DHandle b, int32_t* s) {
                CompactMatrix m{t, 0};
                return TriLinEqs_head(&m, b, s);
            }};
        for (const auto& call : solves) {
            D1 t = compact(), b = Vector(c.nb);
            int32_t status = 1;
            call(t.h(), b.h(), &status);
            EXPECT_EQ(status, c.status) << c.length;
            EXPECT_EQ(b.size(), c.status == 0 ? c.nb : 0);
        }
        const int32_t inverse = c.status == EqSamplesErr ? 0 : c.status;
        const std::function<int32_t(Array1DHandle, int32_t*)> inverses[] = {
            Cholesky_head, Cholesky_InvMatrix_head, [](Array1DHandle t, int32_t* s) {
                CompactMatrix m{t, 1};
                return Tri_InvMatrix_head(&m, s);
            }};
        for (const auto& call : inverses) {
            D1 t = compact();
            int32_t status = 1;
            call(t.h(), &status);
            EXPECT_EQ(status, inverse) << c.length;
            EXPECT_EQ(t.size(), inverse == 0 ? c.length : 0);
        }
    }
}

TEST(CheckOrder, Band) {
    struct Case {
        int rows, cols, nb, bcols, kl, ku;
        int32_t status;
    };
    const Case cases[] = {
        {3, 5, 5, 1, 1, 2, SizeMismatchErr},   // rows unequal kl + 1 + ku
        {4, 5, 4, 1, 1, 2, BandStructureErr},  // b does not fit the columns
        {4, 5, 5, 0, 1, 2, SizeMismatchErr},   // B without columns (set form only)
        {4, 0, 0, 1, 1, 2, EmptyArrayErr},
        {5, 3, 3, 1, 2, 2, SizeMismatchErr},   // fewer columns than the band is wide
        {4, 5, 5, 1, -1, 4, SizeMismatchErr},
        {4, 5, 5, 1, 1, 2, 0},
    };
    for (const Case& c : cases) {
        // A diagonally dominant band: the row of the diagonal (ku) holds 4.
        std::vector<double> band(size_t(c.rows) * size_t(c.cols), 1.0);
        if (c.ku >= 0 && c.ku < c.rows)
            for (int j = 0; j < c.cols; ++j) band[size_t(c.ku) * c.cols + j] = 4;
        D2 ab(c.rows, c.cols, band);
        if (c.bcols == 1) {
            D1 b = Vector(c.nb);
            EXPECT_EQ(BandEqsDriH(ab.h(), b.h(), c.kl, c.ku), c.status) << c.rows << " " << c.cols;
            EXPECT_EQ(b.size(), c.status == 0 ? c.nb : 0);
        }
        D2 b = Matrix(c.nb, c.bcols);
        EXPECT_EQ(BandEqsSetDriH(ab.h(), b.h(), c.kl, c.ku), c.status) << c.rows << " " << c.cols;
        EXPECT_EQ(b.rows(), c.status == 0 ? c.nb : 0);
    }
}

TEST(CheckOrder, Tridiagonal) {
    struct Case {
        int n, ndl, ndu, ndu2, nipiv, nb;
        int32_t factor, solve;
    };
    const Case cases[] = {
        {2, 1, 1, 0, 2, 2, TooFewSamples3Err, TooFewSamples3Err},
        {4, 2, 3, 2, 4, 4, SizeMismatchErr, SizeMismatchErr},
        {4, 3, 3, 1, 4, 4, 0, SizeMismatchErr},
        {4, 3, 3, 2, 3, 4, 0, SizeMismatchErr},
        {4, 3, 3, 2, 4, 3, 0, SizeMismatchErr},
        {4, 3, 3, 2, 4, 4, 0, 0},
    };
    for (const Case& c : cases) {
        D1 dl = Vector(c.ndl), d(std::vector<double>(size_t(c.n), 4.0)), du = Vector(c.ndu), du2;
        twrt::Array1D<int32_t> ipiv;
        EXPECT_EQ(TriDiagLU_head(dl.h(), d.h(), du.h(), du2.h(), ipiv.h()), c.factor) << c.n;
        EXPECT_EQ(ipiv.size(), c.factor == 0 ? c.n : 0);
        EXPECT_EQ(du2.size(), c.factor == 0 ? c.n - 2 : 0);
        D1 f2(std::vector<double>(size_t(c.ndu2), 0.0)), b = Vector(c.nb);
        twrt::Array1D<int32_t> p(std::vector<int32_t>(size_t(c.nipiv), 0));
        for (int i = 0; i < c.nipiv; ++i) p.set(i, i + 1);
        D1 sdl = Vector(c.ndl), sd(std::vector<double>(size_t(c.n), 4.0)), sdu = Vector(c.ndu);
        EXPECT_EQ(TriDiagEqsByLU_head(0, sdl.h(), sd.h(), sdu.h(), f2.h(), p.h(), b.h()), c.solve) << c.n;
        EXPECT_EQ(b.size(), c.solve == 0 ? c.nb : 0);
    }
    // Interchanges other than "this row" or "the next" are refused: the solve would follow them.
    D1 dl{1, 1, 1}, d{4, 4, 4, 4}, du{1, 1, 1}, du2{0, 0}, b{1, 1, 1, 1};
    twrt::Array1D<int32_t> ipiv{1, 4, 3, 4};
    EXPECT_EQ(TriDiagEqsByLU_head(1, dl.h(), d.h(), du.h(), du2.h(), ipiv.h(), b.h()), IndexRangeErr);
}

TEST(CheckOrder, DeterminantAndPseudoInverse) {
    struct Case {
        int rows, cols, type;
        double value;
        int32_t status;
    };
    const double nan = std::nan("");
    const Case cases[] = {
        {0, 0, 0, nan, EmptyArrayErr},
        {2, 3, 0, nan, NotSquareErr},
        {3, 3, 4, nan, InvalidSelectorErr},
        {3, 3, -1, nan, InvalidSelectorErr},
        {3, 3, 0, 54, 0},  // det of 3I + ones
        {3, 3, 1, 54, 0},
        {3, 3, 2, 64, 0},  // the diagonal as it stands
        {3, 3, 3, 64, 0},
    };
    for (const Case& c : cases) {
        D2 a = Matrix(c.rows, c.cols);
        double result = 0;
        int32_t type = c.type, status = 1;
        Determinant_head(a.h(), &type, &result, &status);
        EXPECT_EQ(status, c.status) << c.rows << " " << c.type;
        if (c.status != 0)
            EXPECT_TRUE(twtest::IsFailureNaN(result));
        else
            EXPECT_NEAR(result, c.value, 1e-12 * c.value);
    }
    D2 bad(3, 3, {1, 0, 0, 0, std::nan(""), 0, 0, 0, 1});
    double result = 0;
    int32_t type = 4, status = 0;
    Determinant_head(bad.h(), &type, &result, &status);
    EXPECT_EQ(status, InvalidSelectorErr);  // the type before the screen
    type = 0;
    Determinant_head(bad.h(), &type, &result, &status);
    EXPECT_EQ(status, NanInfErr);

    D2 empty(0, 4);
    double tol = -1;
    PseudoInverse_head(empty.h(), &tol, &status);
    EXPECT_EQ(status, EmptyArrayErr);
    EXPECT_EQ(empty.cols(), 0);
}

// The drivers that hand data to the SVD or to a factorisation screen it first; the loops on
// factors the caller made do not.
TEST(CheckOrder, NonFiniteInput) {
    const double inf = std::numeric_limits<double>::infinity();
    int32_t status = 0;
    D2 a = Matrix(3, 3), x;
    D1 nanB{1, std::nan(""), 1}, xv;
    GenLinEqs_head(a.h(), nanB.h(), xv.h(), &status);
    EXPECT_EQ(status, NanInfErr);
    EXPECT_EQ(xv.size(), 0);
    D2 infA(3, 3, {4, 1, inf, 1, 4, 1, 1, 1, 4});
    D1 b = Vector(3);
    EqsByCholeskyDri_head(infA.h(), b.h(), xv.h(), &status);
    EXPECT_EQ(status, NanInfErr);
    // Only the triangle that is read is screened: the lower one here.
    EXPECT_EQ(EqsSetByCholeskyDri_head(infA.h(), 0, a.h(), x.h()), 0);
    EXPECT_EQ(EqsSetBySVDDri_head(infA.h(), a.h(), x.h()), NanInfErr);
    D2 big(1, 1, {1.7976931348623157e308});
    double tol = -1;
    PseudoInverse_head(big.h(), &tol, &status);
    EXPECT_EQ(status, NanInfErr);
    // A compact factor with Infinity is substituted as it stands.
    D1 l{1, 0, inf}, rhs{1, 1};
    CholeskyLinEqs_head(l.h(), rhs.h(), &status);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(rhs[1], 0.0);
}

// --- Quirks ------------------------------------------------------------------------------------

// Rank 1: the minimum-norm solution of A x = b is (0.2, 0.4).
TEST(Quirks, RankDeficientWarningOnlyFromTheSetExports) {
    const std::vector<double> va{1, 2, 2, 4, 3, 6};
    D2 a(3, 2, va), bm(3, 1, {1, 2, 3}), x;
    D1 b{1, 2, 3}, xv;
    int32_t status = 1;
    GenLinEqs_head(a.h(), b.h(), xv.h(), &status);
    EXPECT_EQ(status, 0);
    ASSERT_EQ(xv.size(), 2);
    EXPECT_NEAR(xv[0], 0.2, 1e-14);
    EXPECT_NEAR(xv[1], 0.4, 1e-14);
    EXPECT_EQ(EqsSetBySVDDri_head(a.h(), bm.h(), x.h()), RankDeficientWarn);
    ASSERT_EQ(x.rows(), 2);
    EXPECT_NEAR(x.at(0, 0), 0.2, 1e-14);
    EXPECT_NEAR(x.at(1, 0), 0.4, 1e-14);
    twrt::Array2D<cd> ca(3, 2, {1, 2, 2, 4, 3, 6}), cb(3, 1, {1, 2, 3}), cx;
    EXPECT_EQ(CxEqsSetBySVDDri82_head(ca.h(), cb.h(), cx.h(), -1.0), RankDeficientWarn);
    EXPECT_NEAR(std::abs(cx.at(1, 0) - cd(0.4)), 0, 1e-14);
}

TEST(Quirks, EqsSetByLuAlwaysRefuses) {
    D2 a = Matrix(3, 3), b = Matrix(3, 2), x(3, 2);
    EXPECT_EQ(EqsSetByLUDri_head(a.h(), b.h(), x.h()), NoSuchCaseErr);
    EXPECT_EQ(x.rows(), 0);
    twrt::Array2D<cd> ca(3, 3, {4, 1, 1, 1, 4, 1, 1, 1, 4}), cb(3, 1, {1, 1, 1}), cx(3, 1);
    EXPECT_EQ(CxEqsSetByLUDri_head(ca.h(), cb.h(), cx.h()), NoSuchCaseErr);
    EXPECT_EQ(cx.cols(), 0);
}

TEST(Quirks, SingularMatricesByRoute) {
    const std::vector<double> singular{1, 2, 3, 2, 4, 6, 1, 1, 1};
    D2 a(3, 3, singular);
    D1 b{1, 2, 3}, x(3);
    int32_t status = 0;
    EqsByLUDri_head(a.h(), b.h(), x.h(), &status);
    EXPECT_EQ(status, SingularMatrixErr);
    EXPECT_EQ(x.size(), 0);
    D2 inv(3, 3, singular);
    InvMatrixLUDri_head(inv.h(), &status);
    EXPECT_EQ(status, SingularMatrixErr);
    EXPECT_EQ(inv.rows(), 0);

    // The determinant of a singular matrix is an answer with type 0, a failure with type 1.
    double det = 1;
    int32_t type = 0;
    Determinant_head(a.h(), &type, &det, &status);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(det, 0.0);
    type = 1;
    Determinant_head(a.h(), &type, &det, &status);
    EXPECT_EQ(status, NotPositiveDefiniteErr);
    EXPECT_TRUE(twtest::IsFailureNaN(det));
    // Order 2 uses the formula whatever the type: an indefinite matrix has its determinant.
    D2 two(2, 2, {1, 2, 2, 1});
    Determinant_head(two.h(), &type, &det, &status);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(det, -3.0);
}

// R = 0 cuts at max(m, n) s0 tol, R >= 1 at s0 tol: a value between the two is kept only at R >= 1.
TEST(Quirks, RefinementChangesOnlyTheCutOff) {
    D2 a(4, 4, {1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 2e-10});
    D1 b{1, 1, 1, 1}, x, work;
    EXPECT_EQ(GenLinEqsbySVD2011_head(a.h(), b.h(), x.h(), 1e-10, 0, work.h()), 0);
    ASSERT_EQ(x.size(), 4);
    EXPECT_NEAR(x[0], 1, 1e-15);
    EXPECT_EQ(x[3], 0.0);
    EXPECT_EQ(GenLinEqsbySVD2011_head(a.h(), b.h(), x.h(), 1e-10, 1, work.h()), 0);
    ASSERT_EQ(x.size(), 4);
    EXPECT_NEAR(x[3], 5e9, 5e9 * 1e-14);
    EXPECT_NEAR(x[0], 1, 1e-15);
    // R = 0 is the 2010 route exactly.
    D1 y, work2;
    EXPECT_EQ(GenLinEqs2010_head(a.h(), b.h(), y.h(), 1e-10, work2.h()), 0);
    GenLinEqsbySVD2011_head(a.h(), b.h(), x.h(), 1e-10, 0, work.h());
    EXPECT_EQ(y.vec(), x.vec());
    EXPECT_EQ(work2.size(), work.size());
}

// The caller's work handle is the only memory the 2010 route takes, in both placements of the
// host's blocks: with a workspace arena too small for any scratch block, it still succeeds, and the
// host sees only the two resizes.
class WorkRoute : public ::testing::TestWithParam<bool> {};

TEST_P(WorkRoute, AllocatesOnlyItsOutputs) {
    if (twtest::WorkspaceMode()) GTEST_SKIP() << "the suite's own workspace is in use";
    twrt::Placement where(GetParam());
    D2 a(5, 3, {2, 1, 0, 1, 3, 1, 0, 1, 4, 1, 0, 1, 2, 2, 2});
    D1 b{1, 2, 3, 4, 5}, x, work, reference;
    int32_t status = 1;
    GenLinEqs_head(a.h(), b.h(), reference.h(), &status);
    ASSERT_EQ(status, 0);

    ErrorCluster e{};
    InitializeAnalysisWorkspaceH(64, &e);
    EnableAnalysisWorkspaceH(&e);
    ASSERT_EQ(int32_t{e.code}, 0);
    const int64_t allocs = TWRTAllocCount(), resizes = TWRTResizeCount();
    const int32_t first = GenLinEqs2010_head(a.h(), b.h(), x.h(), -1.0, work.h());
    const int32_t refined = GenLinEqsbySVD2011_head(a.h(), b.h(), x.h(), -1.0, 2, work.h());
    const int64_t allocsAfter = TWRTAllocCount(), resizesAfter = TWRTResizeCount();
    // The control: the allocating route cannot run in the same arena.
    D1 y;
    GenLinEqs_head(a.h(), b.h(), y.h(), &status);
    DisableAnalysisWorkspaceH(&e);
    UninitializeAnalysisWorkspaceH(&e);
    EXPECT_EQ(int32_t{e.code}, 0);

    EXPECT_EQ(first, 0);
    EXPECT_EQ(refined, 0);
    EXPECT_EQ(resizesAfter - resizes, 4);
    EXPECT_EQ(allocsAfter - allocs, resizesAfter - resizes);
    ASSERT_EQ(x.size(), 3);
    for (int i = 0; i < 3; ++i) EXPECT_NEAR(x[i], reference[i], 1e-14);
    EXPECT_GT(work.size(), 0);
    EXPECT_EQ(status, OutOfMemoryErr);

    GenLinEqs2010_head(a.h(), b.h(), x.h(), -1.0, work.h());
    EXPECT_EQ(x.vec(), reference.vec());
    // Failure empties the work handle as well.
    D1 shortB{1, 2};
    EXPECT_EQ(GenLinEqs2010_head(a.h(), shortB.h(), x.h(), -1.0, work.h()), EqSamplesErr);
    EXPECT_EQ(work.size(), 0);
    EXPECT_EQ(x.size(), 0);
}

INSTANTIATE_TEST_SUITE_P(Placements, WorkRoute, ::testing::Bool(), twtest::PlacementName);

TEST(Quirks, TriangularKindsAndThresholds) {
    // Kind 2: the real export leaves b alone and reports 0, the complex one refuses it.
    D1 t{2, 1, 2}, b{1, 1};
    CompactMatrix m{t.h(), 2};
    int32_t status = 1;
    TriLinEqs_head(&m, b.h(), &status);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(b.vec(), (std::vector<double>{1, 1}));
    twrt::Array1D<cd> ct{2, 1, 2}, cb{1, 1};
    CompactMatrix cm{ct.h(), 2};
    CxTriLinEqs_head(&cm, cb.h(), &status);
    EXPECT_EQ(status, InvalidSelectorErr);
    EXPECT_EQ(cb.size(), 0);

    // Complex diagonals are judged by |t|^2: against eps in the solve, eps^2 in the inverse.
    struct Case {
        double small;
        int32_t realSolve, realInverse, complexSolve, complexInverse;
    };
    // |t|^2 against eps^2 judges as |t| against eps does, so the complex inverse agrees with the real tests.
    for (const Case& c : {Case{1e-9, 0, 0, SingularMatrixErr, 0},
                          Case{1e-17, SingularMatrixErr, SingularMatrixErr, SingularMatrixErr, SingularMatrixErr}}) {
        D1 rt{1, 0, c.small}, rb{1, 1};
        twrt::Array1D<cd> zt{1, 0, c.small}, zb{1, 1};
        CompactMatrix rm{rt.h(), 0}, zm{zt.h(), 0};
        TriLinEqs_head(&rm, rb.h(), &status);
        EXPECT_EQ(status, c.realSolve) << c.small;
        CxTriLinEqs_head(&zm, zb.h(), &status);
        EXPECT_EQ(status, c.complexSolve) << c.small;
        Tri_InvMatrix_head(&rm, &status);
        EXPECT_EQ(status, c.realInverse) << c.small;
        CxTri_InvMatrix_head(&zm, &status);
        EXPECT_EQ(status, c.complexInverse) << c.small;
        if (c.complexInverse == 0) {
            EXPECT_EQ(zt[2], cd(1 / c.small));
        }
    }
}

TEST(Quirks, CholeskyPivotsAndTheSqrtEpsTest) {
    struct Case {
        std::vector<double> lower;  // compact lower layout of an order-2 matrix
        int32_t real, complex;
    };
    const Case cases[] = {
        {{1, 0, 1e-15}, 0, 0},                                   // sqrt 3.2e-8 is above sqrt(eps)
        {{1, 0, 1e-20}, NotPositiveDefiniteErr, 0},              // only the real form tests it
        {{1, 2, 1}, NotPositiveDefiniteErr, NotPositiveDefiniteErr},  // indefinite
        {{-1, 0, 1}, NotPositiveDefiniteErr, NotPositiveDefiniteErr},
        {{std::nan(""), 0, 1}, NotPositiveDefiniteErr, NotPositiveDefiniteErr},
    };
    for (const Case& c : cases) {
        D1 r(c.lower);
        twrt::Array1D<cd> z(std::vector<cd>(c.lower.begin(), c.lower.end()));
        int32_t status = 1;
        Cholesky_head(r.h(), &status);
        EXPECT_EQ(status, c.real) << c.lower[2];
        EXPECT_EQ(r.size(), c.real == 0 ? 3 : 0);
        CxCholesky_head(z.h(), &status);
        EXPECT_EQ(status, c.complex) << c.lower[2];
        if (c.complex == 0) {
            EXPECT_EQ(z[2], cd(std::sqrt(c.lower[2])));
        }
    }

    // The full form: not square before empty, the status both stored and returned.
    D2 wide(2, 3), none(0, 0);
    twrt::Array2D<cd> indefinite(2, 2, {1, 2, 2, 1});
    int32_t status = 1;
    EXPECT_EQ(FullCholesky_head(wide.h(), &status), NotSquareErr);
    EXPECT_EQ(status, NotSquareErr);
    EXPECT_EQ(FullCholesky_head(none.h(), &status), EmptyArrayErr);
    EXPECT_EQ(CxFullCholesky_head(indefinite.h(), &status), NotPositiveDefiniteErr);
    EXPECT_EQ(indefinite.rows(), 0);

    // The inner-loop form goes on through a negative pivot and leaves NaN where it went.
    D2 a(2, 2, {1, 2, 2, 1});
    D1 w1(3), w2(2);
    EXPECT_EQ(PreallocInvMatrixChoDri_H(a.h(), w1.h(), w2.h()), NotPositiveDefiniteErr);
    ASSERT_EQ(a.rows(), 2);
    EXPECT_TRUE(std::isnan(a.at(1, 1)));
    // Storage too short for the matrix is refused untouched.
    D2 b = Matrix(3, 3);
    EXPECT_EQ(PreallocInvMatrixChoDri_H(b.h(), w1.h(), w2.h()), SizeMismatchErr);
    EXPECT_EQ(b.vec(), Filling(3, 3));
}

TEST(Quirks, TridiagonalZeroPivotKeepsTheInput) {
    // The second pivot vanishes: +20003, dl, d, du as given, du2 and ipiv as written.
    D1 dl{1, 0}, d{1, 1, 1}, du{1, 0}, du2;
    twrt::Array1D<int32_t> ipiv;
    EXPECT_EQ(TriDiagLU_head(dl.h(), d.h(), du.h(), du2.h(), ipiv.h()), SingularPivotWarn);
    EXPECT_EQ(d.vec(), (std::vector<double>{1, 1, 1}));
    EXPECT_EQ(dl.vec(), (std::vector<double>{1, 0}));
    EXPECT_EQ(du2.size(), 1);
    EXPECT_EQ(ipiv.size(), 3);
}

TEST(FailedResize, StatusCellAndHostCode) {
    D2 a = Matrix(3, 3), x;
    D1 b = Vector(3), xv;
    int32_t status = 0;
    TWRTFailResizeAt(1);
    EXPECT_EQ(GenLinEqs_head(a.h(), b.h(), xv.h(), &status), TWRTResizeFailed);
    EXPECT_EQ(status, OutOfMemoryErr);
    TWRTFailResizeAt(1);
    EXPECT_EQ(EqsSetBySVDDri_head(a.h(), a.h(), x.h()), OutOfMemoryErr);
    TWRTFailResizeAt(2);  // the work handle of the 2010 route
    D1 work;
    EXPECT_EQ(GenLinEqs2010_head(a.h(), b.h(), xv.h(), -1.0, work.h()), OutOfMemoryErr);
    EXPECT_EQ(xv.size(), 0);
    TWRTFailResizeAt(0);
}

}  // namespace
