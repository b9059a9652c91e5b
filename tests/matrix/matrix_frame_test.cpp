// Check orders, failure contract and the stated quirks of the matrix frame exports.
#include <dlfcn.h>
#include <gtest/gtest.h>

#include <cmath>
#include <complex>
#include <cstring>
#include <limits>
#include <random>
#include <vector>

#include "twanlys/matrix.h"
#include "twrt.hpp"

namespace {

using cd = std::complex<double>;
constexpr double kInf = std::numeric_limits<double>::infinity();

template <class T>
void SetWord(const twrt::Array2D<T>& a, int index, int32_t value) {
    std::memcpy(static_cast<unsigned char*>(*a.h()) + 4 * index, &value, 4);
}

template <class T>
std::vector<T> Random(size_t n, unsigned seed) {
    std::mt19937_64 g(seed);
    std::uniform_real_distribution<double> u(-1, 1);
    std::vector<T> v(n);
    for (auto& x : v) {
        if constexpr (std::is_same_v<T, cd>)
            x = cd(u(g), u(g));
        else
            x = u(g);
    }
    return v;
}

// c = a b by the definition, summed in long double.
template <class T>
std::vector<T> Product(const std::vector<T>& a, const std::vector<T>& b, int m, int k, int p) {
    std::vector<T> c(size_t(m) * p);
    for (int i = 0; i < m; ++i)
        for (int j = 0; j < p; ++j) {
            std::complex<long double> s = 0;
            for (int l = 0; l < k; ++l)
                s += std::complex<long double>(a[size_t(i) * k + l]) * std::complex<long double>(b[size_t(l) * p + j]);
            if constexpr (std::is_same_v<T, cd>)
                c[size_t(i) * p + j] = cd(double(s.real()), double(s.imag()));
            else
                c[size_t(i) * p + j] = double(s.real());
        }
    return c;
}

template <class T>
void ExpectClose(const std::vector<T>& got, const std::vector<T>& want, double tol) {
    ASSERT_EQ(got.size(), want.size());
    for (size_t i = 0; i < got.size(); ++i) ASSERT_LE(std::abs(got[i] - want[i]), tol) << "element " << i;
}

TEST(MatrixMul, EmptyInnerDimensionGivesNaN) {
    twrt::Array2D<double> a(3, 0), b(0, 2), c;
    int32_t status = -1;
    EXPECT_EQ(MatrixMul_head(a.h(), b.h(), c.h(), &status), 0);
    EXPECT_EQ(status, 0);
    ASSERT_EQ(c.rows(), 3);
    ASSERT_EQ(c.cols(), 2);
    for (double v : c.vec()) EXPECT_TRUE(std::isnan(v));
}

TEST(MatrixMul, NoRowsGivesZeroRowsWithColumns) {
    twrt::Array2D<double> a(0, 4), b(4, 2, std::vector<double>(8, 1.0)), c(5, 5);
    int32_t status = -1;
    MatrixMul_head(a.h(), b.h(), c.h(), &status);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(c.rows(), 0);
    EXPECT_EQ(c.cols(), 2);
}

TEST(MatrixMul, InnerMismatchEmptiesTheOutput) {
    twrt::Array2D<double> a(2, 3), b(2, 3), c(4, 4);
    int32_t status = 0;
    EXPECT_EQ(MatrixMul_head(a.h(), b.h(), c.h(), &status), 0);
    EXPECT_EQ(status, InnerDimensionErr);
    EXPECT_EQ(c.rows(), 0);
    EXPECT_EQ(c.cols(), 0);
}

TEST(MatrixMul, FailedResizeStoresOutOfMemoryAndReturnsTheHostCode) {
    twrt::Array2D<double> a(2, 2, {1, 2, 3, 4}), b(2, 2, {1, 0, 0, 1}), c;
    int32_t status = 0;
    TWRTFailResizeAt(1);
    EXPECT_EQ(MatrixMul_head(a.h(), b.h(), c.h(), &status), TWRTResizeFailed);
    TWRTFailResizeAt(0);
    EXPECT_EQ(status, OutOfMemoryErr);
    EXPECT_EQ(c.rows(), 0);

    TWRTFailResizeAt(1);
    EXPECT_EQ(Transpose_head(a.h(), c.h()), TWRTResizeFailed);
    TWRTFailResizeAt(1);
    EXPECT_EQ(vectxA_head(twrt::Array1D<double>{1, 1}.h(), a.h(), twrt::Array1D<double>().h()), OutOfMemoryErr);
    TWRTFailResizeAt(0);
}

// Every placement of the host, with and without private copies, and the panelled shape (more
// than 1530 rows, inner at least 257, at least 3 columns) against the product by definition.
TEST(MatrixMul, ShapesPlacementsAndPanels) {
    struct Case {
        int m, k, p;
    };
    for (const Case& cs : {Case{1, 1, 1}, Case{7, 5, 3}, Case{64, 33, 17}, Case{1600, 260, 3}, Case{3061, 257, 4}})
        for (int placement : {0, 1})
            for (int copies : {0, 1}) {
                twrt::Placement where(placement != 0);
                const auto va = Random<double>(size_t(cs.m) * cs.k, 1), vb = Random<double>(size_t(cs.k) * cs.p, 2);
                twrt::Array2D<double> a(cs.m, cs.k, va), b(cs.k, cs.p, vb), c;
                int32_t status = -1;
                MatrixMulAligned_head(a.h(), b.h(), c.h(), copies, &status);
                ASSERT_EQ(status, 0);
                ASSERT_EQ(c.rows(), cs.m);
                ASSERT_EQ(c.cols(), cs.p);
                ExpectClose(c.vec(), Product(va, vb, cs.m, cs.k, cs.p), 1e-14 * cs.k);
            }
}

TEST(MatrixMul, ComplexProductAndTwins) {
    const auto va = Random<cd>(6 * 4, 3), vb = Random<cd>(4 * 5, 4);
    twrt::Array2D<cd> a(6, 4, va), b(4, 5, vb), c, d;
    int32_t status = -1;
    AxBCxCIN(a.h(), b.h(), c.h(), &status);
    ASSERT_EQ(status, 0);
    ExpectClose(c.vec(), Product(va, vb, 6, 4, 5), 1e-14);
    AxBCxAlignedCIN(a.h(), b.h(), d.h(), 1, &status);
    EXPECT_EQ(d.vec(), c.vec());

    // Row vector times matrix is the one-row product; matrix times vector the plain loop.
    twrt::Array1D<cd> x(std::vector<cd>(va.begin(), va.begin() + 4)), y;
    EXPECT_EQ(CxVectxA_head(x.h(), b.h(), y.h()), 0);
    ExpectClose(y.vec(), Product(x.vec(), vb, 1, 4, 5), 1e-14);
    twrt::Array1D<cd> z(std::vector<cd>(vb.begin(), vb.begin() + 4));
    AxVectorCx(a.h(), z.h(), y.h(), &status);
    EXPECT_EQ(status, 0);
    ExpectClose(y.vec(), Product(va, z.vec(), 6, 4, 1), 1e-14);
}

TEST(Transpose, PlainForRealAndComplexWithoutConjugation) {
    twrt::Array2D<double> a(2, 3, {1, 2, 3, 4, 5, 6}), b;
    EXPECT_EQ(Transpose_head(a.h(), b.h()), 0);
    EXPECT_EQ(b.rows(), 3);
    EXPECT_EQ(b.vec(), (std::vector<double>{1, 4, 2, 5, 3, 6}));
    twrt::Array2D<cd> c(1, 2, {cd(1, 2), cd(3, -4)}), d;
    int32_t status = -1;
    CxTranspose_head(c.h(), d.h(), &status);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(d.rows(), 2);
    EXPECT_EQ(d.vec(), c.vec());
    twrt::Array2D<double> empty(0, 3);
    EXPECT_EQ(Transpose_head(empty.h(), b.h()), EmptyArrayErr);
    EXPECT_EQ(b.rows(), 0);
}

// Matrix times vector: the sign test, then the length test that overrides it.
TEST(AxVect, CheckOrder) {
    struct Case {
        int rows, cols, len, storedRows;
        int32_t status;
        int32_t outLength;
    };
    const Case cases[] = {
        {2, 3, 3, 2, 0, 2},
        {2, 3, 2, 2, InnerDimensionErr, 0},
        {2, 3, 3, -1, NegativeSizeErr, 0},
        {2, 3, 2, -1, InnerDimensionErr, 0},  // both faults: the later test wins
        {0, 3, 3, 0, 0, 0},                   // no elements: empty y, success
        {3, 0, 0, 3, 0, 0},
    };
    for (const Case& c : cases) {
        twrt::Array2D<double> a(c.rows, c.cols, std::vector<double>(size_t(c.rows) * c.cols, 1.0));
        if (c.storedRows != c.rows) SetWord(a, 0, c.storedRows);
        twrt::Array1D<double> x(std::vector<double>(size_t(c.len), 2.0)), y(7);
        int32_t status = 1;
        AxVect_head(a.h(), x.h(), y.h(), &status);
        EXPECT_EQ(status, c.status) << c.rows << "x" << c.cols << " len " << c.len;
        ASSERT_EQ(y.size(), c.outLength);
        for (double v : y.vec()) EXPECT_EQ(v, 2.0 * c.cols);
        if (c.storedRows != c.rows) SetWord(a, 0, c.rows);
    }
}

TEST(VectxA, CheckOrder) {
    twrt::Array2D<double> a(2, 3, {1, 2, 3, 4, 5, 6});
    twrt::Array1D<double> y(9);
    EXPECT_EQ(vectxA_head(twrt::Array1D<double>{1, 1, 1}.h(), a.h(), y.h()), InnerDimensionErr);
    EXPECT_EQ(y.size(), 0);
    SetWord(a, 1, -3);
    EXPECT_EQ(vectxA_head(twrt::Array1D<double>{1, 1, 1}.h(), a.h(), y.h()), NegativeSizeErr);
    SetWord(a, 1, 3);
    EXPECT_EQ(vectxAAligned_head(twrt::Array1D<double>{1, -1}.h(), a.h(), y.h(), 1), 0);
    EXPECT_EQ(y.vec(), (std::vector<double>{-3, -3, -3}));
    twrt::Array2D<double> empty(0, 3);
    EXPECT_EQ(vectxA_head(twrt::Array1D<double>().h(), empty.h(), y.h()), 0);
    EXPECT_EQ(y.size(), 0);
}

TEST(Dot, LengthsThenEmptinessAndNoConjugation) {
    double r = 0;
    int32_t status = 0;
    DotProduct_head(twrt::Array1D<double>().h(), twrt::Array1D<double>{1}.h(), &r, &status);
    EXPECT_EQ(status, EqSamplesErr);
    EXPECT_TRUE(std::isnan(r));
    DotProduct_head(twrt::Array1D<double>().h(), twrt::Array1D<double>().h(), &r, &status);
    EXPECT_EQ(status, EmptyArrayErr);
    DotProduct_head(twrt::Array1D<double>{1, 2, 3}.h(), twrt::Array1D<double>{4, 5, 6}.h(), &r, &status);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(r, 32);
    ComplexDouble z{};
    const twrt::Array1D<cd> i{cd(0, 1)};
    DotprodCx(i.h(), i.h(), &z, &status);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(z.re, -1);
    EXPECT_EQ(z.im, 0);
    DotprodCx(i.h(), twrt::Array1D<cd>().h(), &z, &status);
    EXPECT_TRUE(std::isnan(z.re) && std::isnan(z.im));
}

TEST(OuterAndTrace, ShapesAndEmptyInputs) {
    twrt::Array2D<cd> m;
    int32_t status = -1;
    OuterProdCx_head(twrt::Array1D<cd>{cd(0, 1), 2}.h(), twrt::Array1D<cd>{cd(0, 1), 1, 3}.h(), m.h(), &status);
    EXPECT_EQ(status, 0);
    ASSERT_EQ(m.rows(), 2);
    ASSERT_EQ(m.cols(), 3);
    EXPECT_EQ(m.at(0, 0), cd(-1, 0));
    EXPECT_EQ(m.at(1, 2), cd(6, 0));
    OuterProdCx_head(twrt::Array1D<cd>{1}.h(), twrt::Array1D<cd>().h(), m.h(), &status);
    EXPECT_EQ(status, EmptyArrayErr);
    EXPECT_EQ(m.rows(), 0);

    double t = 0;
    Trace_head(twrt::Array2D<double>(2, 5, {1, 9, 9, 9, 9, 9, 2, 9, 9, 9}).h(), &t, &status);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(t, 3);
    ComplexDouble z{};
    CxTrace_head(twrt::Array2D<cd>(0, 2).h(), &z, &status);
    EXPECT_EQ(status, EmptyArrayErr);
    EXPECT_TRUE(std::isnan(z.re) && std::isnan(z.im));
}

// The screen's two bounds differ: the largest double fails, a slightly smaller negative passes,
// and the most negative double fails.
TEST(Screen, AsymmetricBounds) {
    struct Case {
        double value;
        int32_t status;
    };
    const double lowest = -std::numeric_limits<double>::max();
    for (const Case& c : {Case{1.7976931348623157e308, NanInfErr}, Case{-1.7976931348622e+308, 0},
                          Case{lowest, NanInfErr}, Case{std::nextafter(lowest, 0.0), NanInfErr},
                          Case{1.7976931348623155e308, 0}, Case{kInf, NanInfErr},
                          Case{std::numeric_limits<double>::quiet_NaN(), NanInfErr}}) {
        twrt::Array2D<double> a(2, 2, {1, 0, 0, c.value});
        MatrixNormType type = 1;
        double r = 0;
        int32_t status = 1;
        Norm_head(a.h(), &type, &r, &status);
        EXPECT_EQ(status, c.status) << c.value;
        EXPECT_EQ(std::isnan(r), c.status != 0);
    }
    twrt::Array2D<cd> z(1, 2, {cd(1, 0), cd(0, 1.7976931348623157e308)});
    MatrixNormType type = 2;
    double r = 0;
    int32_t status = 0;
    CxNorm_head(z.h(), &type, &r, &status);
    EXPECT_EQ(status, NanInfErr);
}

TEST(Norm, SelectorAndEmpty) {
    double r = 0;
    int32_t status = 0;
    MatrixNormType type = 4;
    Norm_head(twrt::Array2D<double>(1, 1, {2}).h(), &type, &r, &status);
    EXPECT_EQ(status, InvalidSelectorErr);
    EXPECT_TRUE(std::isnan(r));
    type = 0;
    Norm_head(twrt::Array2D<double>(0, 1).h(), &type, &r, &status);
    EXPECT_EQ(status, EmptyArrayErr);
}

TEST(Rank, ToleranceZeroIsAbsolute) {
    // Singular values 1 and 1e-17: tol 0 counts both, the default formula (2 * 1 * eps) one.
    twrt::Array2D<double> a(2, 2, {1, 0, 0, 1e-17});
    int32_t rank = 0, status = 1;
    double tol = 0;
    Rank_head(a.h(), &tol, &rank, &status);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(rank, 2);
    tol = -1;
    Rank_head(a.h(), &tol, &rank, &status);
    EXPECT_EQ(rank, 1);
    tol = 0.5;
    CxRank_head(twrt::Array2D<cd>(2, 2, {cd(0, 1), 0, 0, 0.25}).h(), &tol, &rank, &status);
    EXPECT_EQ(rank, 1);
    twrt::Array2D<double> bad(1, 2, {1, std::nan("")});
    Rank_head(bad.h(), &tol, &rank, &status);
    EXPECT_EQ(status, NanInfErr);
    EXPECT_EQ(rank, -1);
}

TEST(Cond, TypesShapesAndSingularMatrices) {
    struct Case {
        int rows, cols;
        std::vector<double> a;
        int32_t type;
        int32_t status;
        double cond;  // NaN: check only that it is NaN
    };
    const double nan = std::nan("");
    const Case cases[] = {
        {2, 3, {3, 0, 0, 0, 1, 0}, 0, 0, 3},
        {2, 3, {3, 0, 0, 0, 1, 0}, 1, NotSquareErr, nan},
        {2, 3, {3, 0, 0, 0, 1, 0}, 4, InvalidSelectorErr, nan},  // selector before squareness
        {2, 2, {1, 2, 0, 0}, 0, 0, kInf},  // a zero row gives an exact zero singular value
        {2, 2, {1, 2, 2, 4}, 1, 0, kInf},  // the LU meets an exactly zero pivot
        {2, 2, {1, 2, 3, 4}, 1, 0, 21},  // |A|_1 = 6, |A^-1|_1 = 3.5
        {2, 2, {1, 2, 3, 4}, 3, 0, 21},  // |A|_inf = 7, |A^-1|_inf = 3
        {2, 2, {2, 0, 0, 0.5}, 2, 0, std::sqrt(4.25) * std::sqrt(4.25)},
    };
    for (const Case& c : cases) {
        twrt::Array2D<double> a(c.rows, c.cols, c.a);
        int32_t type = c.type, status = 1;
        double cond = 0;
        CondNumber_head(a.h(), &type, &cond, &status);
        EXPECT_EQ(status, c.status) << "type " << c.type;
        if (std::isnan(c.cond))
            EXPECT_TRUE(std::isnan(cond));
        else
            EXPECT_TRUE(cond == c.cond || std::fabs(cond - c.cond) <= 1e-14 * c.cond) << "type " << c.type;
    }
}

TEST(VectorNorm, OrdersAndFailures) {
    const twrt::Array1D<double> x{3, -4, 1};
    struct Case {
        double p;
        int32_t status;
        double want;
    };
    for (const Case& c : {Case{1, 0, 8}, Case{2, 0, std::sqrt(26.0)}, Case{kInf, 0, 4}, Case{-kInf, 0, 1},
                          Case{3, 0, std::cbrt(92.0)}, Case{0, DegenerateDataErr, std::nan("")},
                          Case{std::nan(""), NanInfErr, std::nan("")}}) {
        double r = 0;
        EXPECT_EQ(vectorNormH(x.h(), c.p, &r), c.status) << c.p;
        if (c.status == 0)
            EXPECT_NEAR(r, c.want, 4e-16 * c.want) << c.p;
        else
            EXPECT_TRUE(std::isnan(r));
    }
    double r = 0;
    EXPECT_EQ(vectorNormH(twrt::Array1D<double>().h(), 2, &r), EmptyArrayErr);
    // |3+4i| = 5 and |1| = 1: (5^3 + 1)^(1/3).
    EXPECT_EQ(CxVectorNormH(twrt::Array1D<cd>{cd(3, 4), cd(0, 1)}.h(), 3, &r), 0);
    EXPECT_NEAR(r, std::cbrt(126.0), 1e-15 * r);
}

TEST(InitialMatrix, ZerosOrEmpty) {
    twrt::Array2D<cd> m(1, 1, {cd(5, 5)});
    EXPECT_EQ(CxInitialMatrixH(2, 3, m.h()), 0);
    EXPECT_EQ(m.rows(), 2);
    EXPECT_EQ(m.cols(), 3);
    for (const cd& v : m.vec()) EXPECT_EQ(v, cd(0, 0));
    twrt::Array2D<double> r(2, 2);
    EXPECT_EQ(InitialMatrixH(0, 3, r.h()), EmptyArrayErr);
    EXPECT_EQ(r.rows(), 0);
    EXPECT_EQ(r.cols(), 0);
}

// An illegal argument handed to LAPACK or CBLAS reaches the library's own report routines, which
// print the stated line and return, so that the caller goes on.
TEST(ErrorRoutines, ReportAndReturn) {
    using Getrf = void (*)(const int*, const int*, double*, const int*, int*, int*);
    using Gemm = void (*)(int, int, int, int, int, int, double, const double*, int, const double*, int, double,
                          double*, int);
    void* lapack = dlopen("liblapack.so.3", RTLD_NOW);
    ASSERT_NE(lapack, nullptr);
    auto getrf = reinterpret_cast<Getrf>(dlsym(lapack, "dgetrf_"));
    auto gemm = reinterpret_cast<Gemm>(dlsym(RTLD_DEFAULT, "cblas_dgemm"));
    ASSERT_NE(getrf, nullptr);
    ASSERT_NE(gemm, nullptr);

    const int m = 2, n = 2, lda = 1;
    int ipiv[2], info = 0;
    double a[4] = {1, 2, 3, 4}, c[4] = {0, 0, 0, 0};
    testing::internal::CaptureStderr();
    getrf(&m, &n, a, &lda, ipiv, &info);
    EXPECT_EQ(testing::internal::GetCapturedStderr(),
              "** On entry to DGETRF, parameter number  4 had an illegal value\n");
    EXPECT_EQ(info, -4);

    testing::internal::CaptureStderr();
    gemm(101, 111, 111, 2, 2, 2, 1.0, a, 1, a, 2, 0.0, c, 2);
    const std::string line = testing::internal::GetCapturedStderr();
    EXPECT_NE(line.find("** On entry to "), std::string::npos) << line;
    EXPECT_NE(line.find("had an illegal value\n"), std::string::npos) << line;
    EXPECT_EQ(c[0], 0.0);  // nothing computed

    // The direct call reaches the same line format.
    testing::internal::CaptureStderr();
    xerbla_("DGGSVD", &info, 6);
    cblas_xerbla(12, "cblas_zgemm", "");
    EXPECT_EQ(testing::internal::GetCapturedStderr(),
              "** On entry to DGGSVD, parameter number -4 had an illegal value\n"
              "** On entry to cblas_zgemm, parameter number 12 had an illegal value\n");
    dlclose(lapack);
}

}  // namespace
