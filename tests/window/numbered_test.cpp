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
const double kNaN = std::nan("");

std::vector<double> Ones(int32_t n) { return std::vector<double>(static_cast<size_t>(n), 1.0); }

// The window of length n by a call on an array of ones, with the status it gave.
std::pair<std::vector<double>, int32_t> Apply(const std::function<int32_t(void**)>& call, int32_t n) {
    Real x(Ones(n));
    const int32_t s = call(x.h());
    return {x.vec(), s};
}

void ExpectSameCall(const std::function<int32_t(void**)>& a, const std::function<int32_t(void**)>& b,
                    int32_t n) {
    const auto [wa, sa] = Apply(a, n);
    const auto [wb, sb] = Apply(b, n);
    EXPECT_EQ(sa, sb);
    EXPECT_EQ(wa, wb);
}

bool IsNaN(const WindowConstants& c) { return std::isnan(c.enbw) && std::isnan(c.coherentGain); }

TEST(NumberedWindows, SelectorAndFailureCases) {
    struct Case {
        const char* what;
        std::function<int32_t(void**)> call;
        int32_t n;
        int32_t status;
    } cases[] = {
        {"both flags", [](void** x) { return AllWinH(x, 1, kNaN, 1, 1); }, 8, InvalidSelectorErr},
        {"number 10", [](void** x) { return AllWinH(x, 10, 0, 0, 0); }, 8, InvalidSelectorErr},
        {"number 13", [](void** x) { return AllWinH(x, 13, 0, 0, 0); }, 8, InvalidSelectorErr},
        {"number 35", [](void** x) { return AllWinH(x, 35, 0, 0, 0); }, 8, InvalidSelectorErr},
        {"number 63", [](void** x) { return AllWinH(x, 63, 0, 0, 0); }, 8, InvalidSelectorErr},
        {"number -1", [](void** x) { return AllWinH(x, -1, 0, 0, 0); }, 8, InvalidSelectorErr},
        {"scaled 12", [](void** x) { return AllWinH(x, 12, 0.5, 1, 0); }, 8, InvalidSelectorErr},
        {"symmetric 12", [](void** x) { return SymmWinH(x, 12, 0.5); }, 8, InvalidSelectorErr},
        {"symmetric 64", [](void** x) { return SymmWinH(x, 64, 50); }, 8, InvalidSelectorErr},
        {"symmetric 65", [](void** x) { return AllWinH(x, 65, kNaN, 0, 1); }, 8, InvalidSelectorErr},
        {"symmetric empty", [](void** x) { return SymmWinH(x, 1, 0); }, 0, EmptyArrayErr},
        {"cosine sum empty", [](void** x) { return AllWinH(x, 3, 0, 0, 0); }, 0, EmptyArrayErr},
        {"cosine by number 12", [](void** x) { return AllCosWinH(x, 12, 0); }, 8, InvalidSelectorErr},
        {"cosine by number 30", [](void** x) { return AllCosWinH(x, 30, 1); }, 8, InvalidSelectorErr},
        {"cosine by number empty", [](void** x) { return AllCosWinH(x, 1, 0); }, 0, EmptyArrayErr},
        {"force too short", [](void** x) { return AllWinH(x, 64, kNaN, 0, 0); }, 1, TooFewSamples2Err},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.what);
        Real x(Ones(c.n));
        EXPECT_EQ(c.call(x.h()), c.status);
        EXPECT_EQ(x.size(), 0);
    }
    // The same through the complex entries.
    Cx z(std::vector<cd>(5, cd{1, 2}));
    EXPECT_EQ(CxAllWinH(z.h(), 1, 0, 1, 1), InvalidSelectorErr);
    EXPECT_EQ(z.size(), 0);
}

TEST(NumberedWindows, RectangularAndSmallCases) {
    // Number 0 leaves x alone, also with a NaN parameter and also when empty.
    for (int32_t n : {0, 5}) {
        Real x{};
        if (n) x = Real{1, -2, 3, -4, 5};
        const std::vector<double> before = x.vec();
        EXPECT_EQ(AllWinH(x.h(), 0, kNaN, 0, 0), 0);
        EXPECT_EQ(x.vec(), before);
    }
    WindowConstants c{0, 0};
    Real x{2, 3};
    EXPECT_EQ(ScaledWinH(x.h(), 0, kNaN, &c), 0);
    EXPECT_EQ(c.enbw, 1.0);
    EXPECT_EQ(c.coherentGain, 1.0);
    EXPECT_EQ(x.vec(), (std::vector<double>{2, 3}));

    // A Hann window of length 4 does not end in 0; its symmetric form of length 5 repeats w[0].
    // (The rotation recurrence rounds by up to an ulp.)
    const auto periodic = Apply([](void** p) { return AllWinH(p, 1, 0, 0, 0); }, 4).first;
    const auto symmetric = Apply([](void** p) { return SymmWinH(p, 1, 0); }, 5).first;
    const double hann4[] = {0, 0.5, 1, 0.5};
    ASSERT_EQ(periodic.size(), 4u);
    ASSERT_EQ(symmetric.size(), 5u);
    for (int i = 0; i < 4; ++i) {
        EXPECT_NEAR(periodic[i], hann4[i], 2.3e-16);
        EXPECT_EQ(symmetric[i], periodic[i]);
    }
    EXPECT_EQ(symmetric[4], periodic[0]);
    EXPECT_EQ(Apply([](void** p) { return SymmWinH(p, 7, 0); }, 1).first, Ones(1));
}

// AllWinH reaches the same functions as the direct exports, with its defaults and translation.
TEST(NumberedWindows, DispatchAndParameterDefaults) {
    for (int32_t n : {2, 9, 16}) {
        SCOPED_TRACE(n);
        ExpectSameCall([](void** x) { return AllWinH(x, 60, 7.5, 0, 0); },
                       [](void** x) { return KaiserH(x, 7.5); }, n);
        ExpectSameCall([](void** x) { return AllWinH(x, 60, kNaN, 0, 0); },
                       [](void** x) { return KaiserH(x, 0); }, n);
        ExpectSameCall([](void** x) { return AllWinH(x, 62, kNaN, 0, 0); },
                       [](void** x) { return GaussWinH(x, 0.2, 0); }, n);
        ExpectSameCall([](void** x) { return AllWinH(x, 62, -1, 0, 0); },
                       [](void** x) { return GaussWinH(x, 0.2, 0); }, n);
        ExpectSameCall([](void** x) { return AllWinH(x, 12, kNaN, 0, 0); },
                       [](void** x) { return CosTaperedH(x, 0.2); }, n);
        ExpectSameCall([](void** x) { return AllWinH(x, 64, kNaN, 0, 0); },
                       [](void** x) { return ForceWinH(x, 50); }, n);
        ExpectSameCall([](void** x) { return AllWinH(x, 65, kNaN, 0, 0); },
                       [](void** x) { return ExpWinH(x, 0.1); }, n);
        ExpectSameCall([](void** x) { return AllWinH(x, 61, 40, 0, 0); },
                       [](void** x) { return DolChebyWinH(x, 100, 0); }, n);
        ExpectSameCall([](void** x) { return AllWinH(x, 61, kNaN, 0, 0); },
                       [](void** x) { return DolChebyWinH(x, 1000, 0); }, n);
        ExpectSameCall([](void** x) { return AllWinH(x, 30, 123, 0, 0); }, TriangleWinH, n);
        ExpectSameCall([](void** x) { return AllWinH(x, 33, kNaN, 0, 0); }, ParzenWinH, n);
        // The flags lead to the scaled and symmetric paths with the defaulted parameter.
        ExpectSameCall([](void** x) { return AllWinH(x, 62, kNaN, 0, 1); },
                       [](void** x) { return SymmWinH(x, 62, 0.2); }, n);
        ExpectSameCall([](void** x) { return AllWinH(x, 60, kNaN, 1, 0); },
                       [](void** x) {
                           WindowConstants c;
                           return ScaledWinH(x, 60, 0, &c);
                       },
                       n);
        ExpectSameCall([](void** x) { return AllWinH(x, 7, 5, 1, 0); },
                       [](void** x) { return AllCosWinH(x, 7, 1); }, n);
        ExpectSameCall([](void** x) { return AllWinH(x, 9, 5, 0, 0); },
                       [](void** x) { return AllCosWinH(x, 9, 0); }, n);
    }
}

// The tabulated constants are read for the cosine sums; the other windows are measured.
TEST(NumberedWindows, Constants) {
    struct Row {
        int32_t number;
        double enbw, gain;
    } rows[] = {{0, 1, 1},
                {1, 1.5, 0.5},
                {2, 1.362826, 0.54},
                {4, 1.693699, 0.42659071367},
                {6, 3.770246506303, 0.215578948},
                {8, 2.631905, 0.27105140069342415},
                {11, 1.9761117, 0.3635819}};
    for (const Row& r : rows) {
        WindowConstants c{0, 0}, c2{0, 0};
        EXPECT_EQ(WinConstByNameH(100, r.number, kNaN, &c), 0);
        EXPECT_EQ(c.enbw, r.enbw);
        EXPECT_EQ(c.coherentGain, r.gain);
        // ScaledWinH reports the same record, but divides the cosine sum by a[0].
        Real x(Ones(16));
        EXPECT_EQ(ScaledWinH(x.h(), r.number, 0, &c2), 0);
        EXPECT_EQ(c2.enbw, r.enbw);
        EXPECT_EQ(c2.coherentGain, r.gain);
    }
    // Numbers 31 to 34 are measured on the window although the table has rows for them.
    for (int32_t number : {31, 32, 33, 34, 30, 60, 62, 64, 65, 12}) {
        SCOPED_TRACE(number);
        const double p = number == 60   ? 5.0
                         : number == 62 ? 0.3
                         : number == 64 ? 40
                         : number == 65 ? 0.2
                                        : 0.25;
        WindowConstants byName{0, 0}, measured{0, 0};
        EXPECT_EQ(WinConstByNameH(32, number, p, &byName), 0);
        Real w(Ones(32));
        ASSERT_EQ(AllWinH(w.h(), number, p, 0, 0), 0);
        NumWinConstH(w.h(), &measured);
        EXPECT_EQ(byName.enbw, measured.enbw);
        EXPECT_EQ(byName.coherentGain, measured.coherentGain);
    }
    WindowConstants bh{0, 0};
    WinConstByNameH(1000, 31, 0, &bh);
    EXPECT_NE(bh.enbw, 1.45584787);
    EXPECT_NEAR(bh.enbw, 1.45584787, 1e-3);

    // The 2016 form applies the defaults and the dB translation first.
    WindowConstants a{0, 0}, b{0, 0};
    EXPECT_EQ(WinConstByNameH_2016(20, 62, kNaN, &a), 0);
    EXPECT_EQ(WinConstByNameH(20, 62, 0.2, &b), 0);
    EXPECT_EQ(a.enbw, b.enbw);
    EXPECT_EQ(a.coherentGain, b.coherentGain);

    // Failures give NaN records.
    WindowConstants c{0, 0};
    EXPECT_EQ(WinConstByNameH(0, 1, 0, &c), EmptyArrayErr);
    EXPECT_TRUE(IsNaN(c));
    c = {0, 0};
    EXPECT_EQ(WinConstByNameH(8, 10, 0, &c), InvalidSelectorErr);
    EXPECT_TRUE(IsNaN(c));
    c = {0, 0};
    Real x(Ones(8));
    EXPECT_EQ(ScaledWinH(x.h(), 12, 0.3, &c), InvalidSelectorErr);
    EXPECT_TRUE(IsNaN(c));
    EXPECT_EQ(x.size(), 0);
    c = {0, 0};
    Real empty;
    NumWinConstH(empty.h(), &c);
    EXPECT_TRUE(IsNaN(c));
}

TEST(NumberedWindows, GeneralCosineSums) {
    // a = {1} leaves x as it is; an empty coefficient array or an empty x is refused.
    Real x{1, 2, 3}, one{1.0}, none;
    EXPECT_EQ(GenCosWinH(x.h(), one.h()), 0);
    EXPECT_EQ(x.vec(), (std::vector<double>{1, 2, 3}));
    EXPECT_EQ(GenCosWinH(x.h(), none.h()), EmptyArrayErr);
    EXPECT_EQ(x.size(), 0);
    Real y, hann{0.5, 0.5};
    EXPECT_EQ(ScaledGenCosWinH(y.h(), hann.h()), EmptyArrayErr);
    // A zero a[0] cannot be scaled away.
    Real z(Ones(4)), odd{0, 1};
    EXPECT_EQ(ScaledGenCosWinH(z.h(), odd.h()), WindowSumZeroErr);
    EXPECT_EQ(z.size(), 0);
    // The general form with the Hann coefficients is the Hann window, real and complex.
    ExpectSameCall([&](void** p) { return GenCosWinH(p, hann.h()); },
                   [](void** p) { return AllWinH(p, 1, 0, 0, 0); }, 9);
    std::vector<cd> data(9);
    for (int i = 0; i < 9; ++i) data[i] = {i * 0.5, 3.0 - i};
    Cx cz(data);
    Real re(std::vector<double>(9)), im(std::vector<double>(9));
    for (int i = 0; i < 9; ++i) {
        re.set(i, data[i].real());
        im.set(i, data[i].imag());
    }
    ASSERT_EQ(ScaledCxGenCosWinH(cz.h(), hann.h()), 0);
    ASSERT_EQ(ScaledGenCosWinH(re.h(), hann.h()), 0);
    ASSERT_EQ(ScaledGenCosWinH(im.h(), hann.h()), 0);
    for (int i = 0; i < 9; ++i) {
        EXPECT_EQ(cz[i].real(), re[i]);
        EXPECT_EQ(cz[i].imag(), im[i]);
    }
}

// Every numbered complex entry is its real twin applied to both parts.
TEST(NumberedWindows, ComplexTwins) {
    struct Pair {
        const char* name;
        std::function<int32_t(void**)> real, cx;
    } pairs[] = {
        {"AllWinH", [](void** x) { return AllWinH(x, 33, 0, 0, 0); },
         [](void** x) { return CxAllWinH(x, 33, 0, 0, 0); }},
        {"AllWinH scaled", [](void** x) { return AllWinH(x, 60, 3, 1, 0); },
         [](void** x) { return CxAllWinH(x, 60, 3, 1, 0); }},
        {"SymmWinH", [](void** x) { return SymmWinH(x, 8, 0); },
         [](void** x) { return CxSymmWinH(x, 8, 0); }},
        {"ScaledWinH",
         [](void** x) {
             WindowConstants c;
             return ScaledWinH(x, 31, 0, &c);
         },
         [](void** x) {
             WindowConstants c;
             return CxScaledWinH(x, 31, 0, &c);
         }},
        {"AllCosWinH", [](void** x) { return AllCosWinH(x, 6, 1); },
         [](void** x) { return CxAllCosWinH(x, 6, 1); }},
    };
    for (const Pair& p : pairs) {
        SCOPED_TRACE(p.name);
        std::vector<cd> data(11);
        for (int i = 0; i < 11; ++i) data[i] = {1.0 + i, -0.5 * i};
        Cx z(data);
        Real re(std::vector<double>(11)), im(std::vector<double>(11));
        for (int i = 0; i < 11; ++i) {
            re.set(i, data[i].real());
            im.set(i, data[i].imag());
        }
        ASSERT_EQ(p.cx(z.h()), 0);
        ASSERT_EQ(p.real(re.h()), 0);
        ASSERT_EQ(p.real(im.h()), 0);
        for (int i = 0; i < 11; ++i) {
            EXPECT_EQ(z[i].real(), re[i]);
            EXPECT_EQ(z[i].imag(), im[i]);
        }
    }
}

}  // namespace
