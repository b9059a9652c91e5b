// Check orders and failure statuses of the matrix functions and equations, and a few analytic values.
#include <gtest/gtest.h>

#include <cmath>
#include <complex>
#include <vector>

#include "twanlys/matrix_functions.h"
#include "twrt.hpp"

namespace {

using cd = std::complex<double>;
using D2 = twrt::Array2D<double>;
using D1 = twrt::Array1D<double>;

D2 Filled(int rows, int cols) {
    std::vector<double> v(size_t(rows) * size_t(cols), 0.25);
    for (int i = 0; i < rows && i < cols; ++i) v[size_t(i) * cols + i] = 2;
    return D2(rows, cols, v);
}

TEST(CheckOrder, SquareFunctions) {
    // Exponential, logarithm and square root: the square test comes after the empty test and wins;
    // the power and the characteristic polynomial test squareness first.
    struct Case {
        int rows, cols;
        int32_t want;
    };
    const Case cases[] = {{0, 0, EmptyArrayErr}, {0, 3, NotSquareErr}, {2, 3, NotSquareErr}, {3, 3, 0}};
    for (const Case& c : cases) {
        int32_t status = 1;
        D2 a = Filled(c.rows, c.cols);
        MatrixExp_head(a.h(), &status);
        EXPECT_EQ(status, c.want) << c.rows << "x" << c.cols;
        EXPECT_EQ(a.rows(), c.want == 0 ? 3 : 0);
        D2 l = Filled(c.rows, c.cols);
        twrt::Array2D<cd> b(1, 1);
        MatrixLn_head(l.h(), b.h(), &status);
        EXPECT_EQ(status, c.want);
        EXPECT_EQ(b.rows(), c.want == 0 ? 3 : 0);
        D2 p = Filled(c.rows, c.cols);
        EXPECT_EQ(MatrixPower_head(p.h(), 3), c.want);
        D2 q = Filled(c.rows, c.cols);
        D1 poly(2);
        MatrixCharacteristicPoly_head(q.h(), poly.h(), &status);
        EXPECT_EQ(status, c.want);
        EXPECT_EQ(poly.size(), c.want == 0 ? 4 : 0);
    }
}

TEST(Exp, RotationAndComplexDiagonal) {
    // exp([[0, t], [-t, 0]]) is the rotation by t, to the accuracy the Pade order is chosen for
    // (scaled norm 0.625); the diagonal path takes exp(i pi) = -1.
    const double t = 2.5;
    D2 a(2, 2, {0, t, -t, 0});
    int32_t status = 1;
    MatrixExp_head(a.h(), &status);
    ASSERT_EQ(status, 0);
    const double want[4] = {std::cos(t), std::sin(t), -std::sin(t), std::cos(t)};
    for (int i = 0; i < 4; ++i) EXPECT_NEAR(a.at(i / 2, i % 2), want[i], 1e-11);
    twrt::Array2D<cd> z(2, 2, {cd(0, M_PI), 0, 0, cd(std::log(2.0), 0)});
    CxMatrixExp_head(z.h(), &status);
    ASSERT_EQ(status, 0);
    EXPECT_NEAR(z.at(0, 0).real(), -1, 1e-15);
    EXPECT_NEAR(z.at(0, 0).imag(), 0, 1e-15);
    EXPECT_NEAR(z.at(1, 1).real(), 2, 4e-16);
    // A nilpotent matrix of norm 1e308 needs 1025 halvings, more than one power of 2 can hold.
    D2 big(2, 2, {0, 1e308, 0, 0});
    MatrixExp_head(big.h(), &status);
    ASSERT_EQ(status, 0);
    EXPECT_EQ(big.at(0, 0), 1);
    EXPECT_NEAR(big.at(0, 1), 1e308, 1e293);
    EXPECT_EQ(big.at(1, 0), 0);
    // An infinite element would leave the number of squarings undefined.
    D2 inf(2, 2, {1, INFINITY, 0, 1});
    MatrixExp_head(inf.h(), &status);
    EXPECT_EQ(status, NanInfErr);
    EXPECT_EQ(inf.rows(), 0);
}

TEST(SpecialMatrix, Statuses) {
    struct Case {
        int32_t type, size, nx, ny, want;
    };
    const Case cases[] = {
        {0, 0, 3, 3, EmptyArrayErr},       {0, 2, 0, 0, 0},           {1, 5, 0, 3, EmptyArrayErr},
        {2, 1, 3, 0, EmptyArrayErr},       {4, 1, 1, 0, TooFewSamples2Err}, {4, 1, 0, 0, TooFewSamples2Err},
        {5, 3, 3, 3, InvalidSelectorErr}, {-1, 3, 3, 3, InvalidSelectorErr}, {4, 0, 2, 0, 0},
    };
    for (const Case& c : cases) {
        D1 x(std::vector<double>(size_t(c.nx), 2.0)), y(std::vector<double>(size_t(c.ny), 1.0));
        D2 m(2, 2);
        int32_t type = c.type, size = c.size, status = 1;
        SpecialMatrix_head(&type, &size, x.h(), y.h(), m.h(), &status);
        EXPECT_EQ(status, c.want) << "type " << c.type;
        if (c.want != 0) {
            EXPECT_EQ(m.rows(), 0);
        }
    }
}

TEST(AutoCorrelation, CheckOrder) {
    struct Case {
        int32_t n, m, prev, type, want;
    };
    const Case cases[] = {
        {0, -1, 5, 9, EmptyArrayErr},          {4, -1, 5, 9, NegativeArgumentErr},
        {3, 3, 1, 3, PolyOrderErr},            {3, 3, 1, 4, PolyOrderErr},
        {3, 3, 1, 2, InternalErr},             {3, 3, 3, 9, InvalidSelectorErr},
        {3, 3, 3, 0, 0},                       {4, 0, 0, 4, 0},
    };
    for (const Case& c : cases) {
        D1 x(std::vector<double>(size_t(c.n), 1.0)), prev(std::vector<double>(size_t(c.prev), 0.0));
        D2 r(1, 1), xm(1, 1);
        int32_t count = 0, reset = 0;
        EXPECT_EQ(AutoCorrMtrxH(x.h(), prev.h(), r.h(), xm.h(), c.m, c.type, &count, &reset), c.want) << c.n << " " << c.m;
        if (c.want != 0) {
            EXPECT_EQ(r.rows(), 0);
            EXPECT_EQ(xm.rows(), 0);
            EXPECT_EQ(count, 0);
            EXPECT_EQ(prev.size(), c.prev);  // the input keeps its length
        } else {
            EXPECT_EQ(r.rows(), c.m + 1);
            EXPECT_EQ(count, c.n);
        }
    }
}

TEST(Equations, StatusesLeaveScaleAtOne) {
    struct Case {
        int an, qr, qc, form, type;
        int32_t want;
    };
    // The discrete case with eigenvalue -1 has a singular A + I.
    const Case lyapunov[] = {
        {2, 2, 2, 0, 2, InvalidSelectorErr}, {2, 2, 2, 2, 0, InvalidSelectorErr}, {2, 3, 2, 0, 0, EqSamplesErr},
        {0, 0, 0, 0, 0, EmptyArrayErr},      {2, 2, 2, 0, 0, 0},
    };
    for (const Case& c : lyapunov) {
        D2 a = Filled(c.an, c.an), q = Filled(c.qr, c.qc);
        double scale = 0;
        EXPECT_EQ(Lyapunov85_head(a.h(), q.h(), c.form, c.type, &scale), c.want);
        EXPECT_EQ(scale, 1.0);
        EXPECT_EQ(q.rows(), c.want == 0 ? 2 : 0);
    }
    D2 a(2, 2, {-1, 3, 0, 0.5}), q = Filled(2, 2);
    double scale = 0;
    EXPECT_EQ(Lyapunov85_head(a.h(), q.h(), 1, 1, &scale), SingularMatrixErr);
    EXPECT_EQ(scale, 1.0);
    EXPECT_EQ(q.rows(), 0);

    struct Sylv {
        int ta, tb, sign, form, crow;
        int32_t want;
    };
    const Sylv sylvester[] = {
        {0, 0, 2, 0, 2, InvalidSelectorErr}, {2, 0, 1, 0, 2, InvalidSelectorErr}, {0, -1, 1, 0, 2, InvalidSelectorErr},
        {0, 0, 1, 3, 2, InvalidSelectorErr}, {0, 0, 1, 0, 3, EqSamplesErr},        {1, 1, -1, 0, 2, 0},
    };
    for (const Sylv& c : sylvester) {
        D2 sa = Filled(2, 2), sb = Filled(3, 3), sc = Filled(c.crow, 3);
        double s = 0;
        int32_t perturbed = -1;
        EXPECT_EQ(Sylvester81_head(sa.h(), sb.h(), sc.h(), c.ta, c.tb, c.sign, c.form, &s, &perturbed), c.want);
        EXPECT_EQ(s, 1.0);
        EXPECT_EQ(sc.rows(), c.want == 0 ? 2 : 0);
    }
}

}  // namespace
