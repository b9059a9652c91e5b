#include <gtest/gtest.h>

#include <cmath>
#include <complex>
#include <functional>
#include <vector>

#include "twanlys/windows.h"
#include "twrt.hpp"

namespace {

using cd = std::complex<double>;
using Real = twrt::Array1D<double>;
using Cx = twrt::Array1D<cd>;

// A window export by its real and complex entries, bound to its parameters.
struct Export {
    const char* name;
    std::function<int32_t(void**)> real;
    std::function<int32_t(void**)> cx;
    int32_t fewest;          // the shortest length the window accepts
    int32_t tooShortStatus;  // the status below that length
};

const std::vector<Export>& Exports() {
    static const std::vector<Export> all = {
        {"triangle", TriangleWinH, CxTriangleWinH, 1, EmptyArrayErr},
        {"bartlett-hann", BartHannWinH, CxBartHannWinH, 1, EmptyArrayErr},
        {"bohman", BohmanWinH, CxBohmanWinH, 1, EmptyArrayErr},
        {"parzen", ParzenWinH, CxParzenWinH, 1, EmptyArrayErr},
        {"welch", WelchWinH, CxWelchWinH, 1, EmptyArrayErr},
        {"kaiser", [](void** x) { return KaiserH(x, 6.5); }, [](void** x) { return CxKaiserH(x, 6.5); }, 1,
         EmptyArrayErr},
        {"gauss periodic", [](void** x) { return GaussWinH(x, 0.3, 0); },
         [](void** x) { return CxGaussWinH(x, 0.3, 0); }, 1, EmptyArrayErr},
        {"gauss symmetric", [](void** x) { return GaussWinH(x, 0.3, 1); },
         [](void** x) { return CxGaussWinH(x, 0.3, 1); }, 1, EmptyArrayErr},
        {"force", [](void** x) { return ForceWinH(x, 37); }, [](void** x) { return CxForceWinH(x, 37); }, 2,
         TooFewSamples2Err},
        {"exponential", [](void** x) { return ExpWinH(x, 0.05); },
         [](void** x) { return CxExpWinH(x, 0.05); }, 2, TooFewSamples2Err},
        {"cosine taper", [](void** x) { return CosTaperedH(x, 0.45); },
         [](void** x) { return CxCosTaperedH(x, 0.45); }, 1, EmptyArrayErr},
    };
    return all;
}

std::vector<double> Ramp(int32_t n, double scale) {
    std::vector<double> v(static_cast<size_t>(n));
    for (int32_t i = 0; i < n; ++i) v[i] = scale * (i + 1) - 0.5 * i * i;
    return v;
}

// The complex twin scales both parts exactly as the real window scales each part alone, for
// odd and even lengths and both placements of the host's blocks.
TEST(ParametricWindows, ComplexTwinMatchesTheRealWindow) {
    for (bool aligned : {false, true}) {
        const twrt::Placement place(aligned);
        for (const Export& e : Exports()) {
            for (int32_t n : {1, 2, 7, 10}) {
                SCOPED_TRACE(::testing::Message() << e.name << " n " << n << " aligned " << aligned);
                Real re(Ramp(n, 1.25)), im(Ramp(n, -0.75));
                std::vector<cd> z(static_cast<size_t>(n));
                for (int32_t i = 0; i < n; ++i) z[i] = {re[i], im[i]};
                Cx cz(z);
                const int32_t s = e.real(re.h());
                EXPECT_EQ(e.real(im.h()), s);
                EXPECT_EQ(e.cx(cz.h()), s);
                if (s != 0) continue;
                for (int32_t i = 0; i < n; ++i) {
                    EXPECT_EQ(cz[i].real(), re[i]) << i;
                    EXPECT_EQ(cz[i].imag(), im[i]) << i;
                }
            }
        }
    }
}

TEST(ParametricWindows, TooShortInputIsRefusedAndEmptied) {
    for (const Export& e : Exports()) {
        SCOPED_TRACE(e.name);
        for (int32_t n = 0; n < e.fewest; ++n) {
            Real x(std::vector<double>(static_cast<size_t>(n), 2.0));
            Cx z(std::vector<cd>(static_cast<size_t>(n), cd{2.0, 1.0}));
            EXPECT_EQ(e.real(x.h()), e.tooShortStatus);
            EXPECT_EQ(e.cx(z.h()), e.tooShortStatus);
            EXPECT_EQ(x.size(), 0);
            EXPECT_EQ(z.size(), 0);
        }
        // One sample is left alone by every window that takes it.
        if (e.fewest == 1) {
            Real x{3.5};
            EXPECT_EQ(e.real(x.h()), 0);
            EXPECT_EQ(x.vec(), std::vector<double>{3.5});
        }
    }
}

std::vector<double> Window(const std::function<int32_t(void**)>& call, int32_t n, int32_t expected = 0) {
    Real x(std::vector<double>(static_cast<size_t>(n), 1.0));
    EXPECT_EQ(call(x.h()), expected);
    return x.vec();
}

void ExpectNear(const std::vector<double>& got, const std::vector<double>& want, double tol = 1e-15) {
    ASSERT_EQ(got.size(), want.size());
    for (size_t i = 0; i < want.size(); ++i) EXPECT_NEAR(got[i], want[i], tol) << "element " << i;
}

// Values derived by hand from the window definitions.
TEST(ParametricWindows, HandDerivedValues) {
    ExpectNear(Window(TriangleWinH, 4), {0, 0.5, 1, 0.5});
    ExpectNear(Window(TriangleWinH, 5), {0, 0.4, 0.8, 0.8, 0.4});
    ExpectNear(Window(WelchWinH, 4), {0, 0.75, 1, 0.75});
    ExpectNear(Window(WelchWinH, 5), {0, 0.64, 0.96, 0.96, 0.64});
    ExpectNear(Window(ParzenWinH, 8), {0, 0.03125, 0.25, 0.71875, 1, 0.71875, 0.25, 0.03125});
    ExpectNear(Window(ParzenWinH, 5), {0, 0.128, 0.808, 0.808, 0.128});
    ExpectNear(Window(BartHannWinH, 2), {0, 1});
    ExpectNear(Window(BohmanWinH, 2), {0, 1});
    // Bartlett-Hanning at n = 4, k = 1: 0.62 - 0.48 * 0.25 - 0.38 * cos(pi / 2).
    ExpectNear(Window(BartHannWinH, 4), {0, 0.5, 1, 0.5});
    // Exponential: x[0] stays, x[n-1] takes the final value, geometric in between.
    ExpectNear(Window([](void** x) { return ExpWinH(x, 0.25); }, 3), {1, 0.5, 0.25});
    ExpectNear(Window([](void** x) { return ExpWinH(x, 1); }, 6), std::vector<double>(6, 1.0), 0);
    // Cosine taper over m = trunc(0.5 * 0.5 * 10) = 2 samples at each end.
    ExpectNear(Window([](void** x) { return CosTaperedH(x, 0.5); }, 10), {0, 0.5, 1, 1, 1, 1, 1, 1, 0.5, 0});
    ExpectNear(Window([](void** x) { return CosTaperedH(x, 1); }, 4), {0, 0.5, 1, 0.5});
    ExpectNear(Window([](void** x) { return CosTaperedH(x, 3); }, 4), {0, 0.5, 1, 0.5});
    ExpectNear(Window([](void** x) { return CosTaperedH(x, 0); }, 4), {1, 1, 1, 1}, 0);
    ExpectNear(Window([](void** x) { return CosTaperedH(x, 0.1); }, 10), std::vector<double>(10, 1.0), 0);
    // Kaiser with beta 0 leaves x alone; even n keeps its middle element as it is.
    ExpectNear(Window([](void** x) { return KaiserH(x, 0); }, 7), std::vector<double>(7, 1.0), 0);
    EXPECT_EQ(Window([](void** x) { return KaiserH(x, 9); }, 8)[4], 1.0);
}

TEST(ParametricWindows, ForceDutyRules) {
    struct Case {
        double duty;
        int32_t n;
        int32_t kept;
    } cases[] = {{100, 6, 6}, {250, 6, 6}, {0, 6, 0}, {-10, 6, 0}, {50, 5, 2}, {37, 10, 3}, {99.9, 10, 9}};
    for (const Case& c : cases) {
        const std::vector<double> w = Window([&](void** x) { return ForceWinH(x, c.duty); }, c.n);
        for (int32_t k = 0; k < c.n; ++k) EXPECT_EQ(w[k], k < c.kept ? 1.0 : 0.0) << c.duty << " " << k;
    }
}

TEST(ParametricWindows, ParameterFallbacks) {
    // Gaussian sigma at most 0 behaves as 0.2, in both forms.
    for (int32_t flag : {0, 1}) {
        const auto ref = Window([&](void** x) { return GaussWinH(x, 0.2, flag); }, 9);
        EXPECT_EQ(Window([&](void** x) { return GaussWinH(x, 0, flag); }, 9), ref);
        EXPECT_EQ(Window([&](void** x) { return GaussWinH(x, -4, flag); }, 9), ref);
    }
    // A final value of 0 or below cannot be reached by an exponential.
    for (double f : {0.0, -1.0}) {
        Real x{1, 2, 3};
        EXPECT_EQ(ExpWinH(x.h(), f), WindowSumZeroErr);
        EXPECT_EQ(x.size(), 0);
    }
}

TEST(ParametricWindows, StatusPointerForwarders) {
    struct Case {
        const char* name;
        std::function<int32_t(void**, int32_t*)> forwarder;
        std::function<int32_t(void**)> export_;
    } cases[] = {
        {"TriangleWin", TriangleWin, TriangleWinH},
        {"CosTapered", [](void** x, int32_t* s) { return CosTapered(x, 0.3, s); },
         [](void** x) { return CosTaperedH(x, 0.3); }},
        {"Kaiser_Bessel", [](void** x, int32_t* s) { return Kaiser_Bessel(x, 4.0, s); },
         [](void** x) { return KaiserH(x, 4.0); }},
        {"ForceWindCIN", [](void** x, int32_t* s) { return ForceWindCIN(x, 60, s); },
         [](void** x) { return ForceWinH(x, 60); }},
        {"ExpWindCIN", [](void** x, int32_t* s) { return ExpWindCIN(x, 0.3, s); },
         [](void** x) { return ExpWinH(x, 0.3); }},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        for (int32_t n : {0, 9}) {
            Real a(std::vector<double>(static_cast<size_t>(n), 1.5)),
                b(std::vector<double>(static_cast<size_t>(n), 1.5));
            int32_t status = 12345;
            EXPECT_EQ(c.forwarder(a.h(), &status), 0);
            EXPECT_EQ(status, c.export_(b.h()));
            EXPECT_EQ(a.vec(), b.vec());
            EXPECT_EQ(n == 0, status != 0);
        }
    }
}

}  // namespace
