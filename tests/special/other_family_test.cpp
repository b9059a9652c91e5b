// Edges and closed forms of the elliptic, hypergeometric and other special functions: the stated
// edge results, the selectors of the later generations and values known exactly. The reference
// suite compares the ordinary paths with SciPy.
#include <gtest/gtest.h>

#include <cmath>
#include <functional>
#include <limits>
#include <string>
#include <vector>

#include "twanlys/special.h"
#include "twrt.h"

namespace {

constexpr double kInf = std::numeric_limits<double>::infinity();
const double kNaN = std::numeric_limits<double>::quiet_NaN();
const double kPi = std::acos(-1.0);

template <class F, class... A>
double Call(F f, A... args) {
    double out = -12345.0;
    f(args..., &out);
    return out;
}

// The later generations take the selector after the result pointer.
double Selected(void (*f)(double, double, double*, int32_t), double m, double phi, int32_t selector) {
    double out = -12345.0;
    f(m, phi, &out, selector);
    return out;
}

struct Case {
    std::string what;
    std::function<double()> call;
    double expected;     // NaN: any NaN
    double tolerance;    // relative; 0: bit for bit (with the sign of zero)
};

void Check(const std::vector<Case>& cases) {
    for (const Case& c : cases) {
        const double got = c.call();
        if (std::isnan(c.expected)) {
            EXPECT_TRUE(std::isnan(got)) << c.what << " gave " << got;
        } else if (c.tolerance == 0.0) {
            EXPECT_EQ(got, c.expected) << c.what;
            EXPECT_EQ(std::signbit(got), std::signbit(c.expected)) << c.what;
        } else {
            EXPECT_NEAR(got, c.expected, c.tolerance * std::fabs(c.expected)) << c.what;
        }
    }
}

TEST(OtherFamily, StatedEdges) {
    Check({
        {"K(1) selected by NaN", [] { return Call(TW_Elliptic1, 1.0, kNaN); }, kInf, 0},
        {"K(1) by selector", [] { return Selected(TW_Elliptic1_85, 1.0, 0.3, 1); }, kInf, 0},
        {"F(pi/2 | 1)", [] { return Call(TW_Elliptic1, 1.0, kPi / 2); }, kInf, 0},
        {"F(NaN | m), selector 0", [] { return Selected(TW_Elliptic1_85, 0.5, kNaN, 0); }, kNaN, 0},
        {"zeta(1)", [] { return Call(TW_Zeta, 1.0); }, kInf, 0},
        {"zeta(200)", [] { return Call(TW_Zeta, 200.0); }, 1.0, 0},
        {"zeta below -30.8148", [] { return Call(TW_Zeta, -31.0); }, kNaN, 0},
        {"E_1(0)", [] { return Call(TW_ExpI, 0.0, 1); }, kInf, 0},
        {"E_3(0)", [] { return Call(TW_ExpI, 0.0, 3); }, 0.5, 0},
        {"Ci(0)", [] { return Call(TW_CosI, 0.0); }, -kInf, 0},
        {"Shi(1000)", [] { return Call(TW_SinhI, 1000.0); }, kInf, 0},
        {"Chi(-1) is Chi(1)", [] { return Call(TW_CoshI, -1.0); }, Call(TW_CoshI, 1.0), 0},
        {"Diln(+Inf)", [] { return Call(TW_Diln, kInf); }, -kInf, 0},
        {"Kummer(5, 0, 1)", [] { return Call(TW_Kummer, 5.0, 0.0, 1.0); }, 1.0, 0},
        {"Tricomi(0, 1, 1)", [] { return Call(TW_Tricomi, 0.0, 1.0, 1.0); }, kInf, 0},
        {"Gauss beyond |x| = 1", [] { return Call(TW_Gauss, -1.5, 1.0, 1.0, 3.0); }, kNaN, 0},
        {"Gauss, c a pole", [] { return Call(TW_Gauss, 0.5, 1.0, 1.0, -3.0); }, kInf, 0},
        {"Struve(0, -2)", [] { return Call(TW_Struve, 0.0, -2.0); }, kNaN, 0},
        {"D_0.5(-Inf): sign of 1/Gamma(-0.5)", [] { return Call(TW_ParabolicCylinder, -kInf, 0.5); }, -kInf, 0},
        {"D_3(-Inf)", [] { return Call(TW_ParabolicCylinder, -kInf, 3.0); }, -0.0, 0},
        {"D_v(+Inf)", [] { return Call(TW_ParabolicCylinder, kInf, -2.5); }, 0.0, 0},
    });
}

TEST(OtherFamily, ClosedForms) {
    Check({
        {"K(0) = pi/2", [] { return Call(TW_Elliptic1, 0.0, kNaN); }, kPi / 2, 2e-16},
        {"E(0) = pi/2", [] { return Selected(TW_Elliptic2_85, 0.0, 9.0, 1); }, kPi / 2, 2e-16},
        {"F(phi | 0) = phi", [] { return Call(TW_Elliptic1, 0.0, 7.25); }, 7.25, 0},
        {"E(4 | 1) = 2 + sin(4 - pi)", [] { return Call(TW_Elliptic2, 1.0, 4.0); }, 2 + std::sin(4 - kPi), 4e-16},
        {"F(1 | 1) = atanh(sin 1)", [] { return Call(TW_Elliptic1, 1.0, 1.0); }, std::atanh(std::sin(1.0)), 4e-16},
        {"zeta(2)", [] { return Call(TW_Zeta, 2.0); }, kPi * kPi / 6, 2e-16},
        {"zeta(4)", [] { return Call(TW_Zeta, 4.0); }, std::pow(kPi, 4) / 90, 4e-16},
        {"zeta(-1) = -1/12", [] { return Call(TW_Zeta, -1.0); }, -1.0 / 12, 8e-16},
        {"zeta(0.5)", [] { return Call(TW_Zeta, 0.5); }, -1.4603545088095868, 4e-16},
        // The rational form of the dilogarithm is good to some 8 ulp.
        {"Diln(2) = -pi^2/12", [] { return Call(TW_Diln, 2.0); }, -kPi * kPi / 12, 2e-15},
        {"Diln(1/2) = pi^2/12 - ln^2 2 / 2", [] { return Call(TW_Diln, 0.5); },
         kPi * kPi / 12 - 0.5 * std::log(2.0) * std::log(2.0), 2e-15},
        {"E_0(2) = exp(-2)/2", [] { return Call(TW_ExpI, 2.0, 0); }, std::exp(-2.0) / 2, 2e-16},
        {"E_2(1) = 1/e - E_1(1)", [] { return Call(TW_ExpI, 1.0, 2); },
         std::exp(-1.0) - 0.21938393439552027, 4e-15},
        {"Si(inf)", [] { return Call(TW_SinI, kInf); }, kPi / 2, 0},
        // 2F1(1, 1; 2; x) = -ln(1 - x)/x; the 2011 generation reaches it through Pfaff.
        {"Gauss(0.1, 1, 1, 2)", [] { return Call(TW_Gauss, 0.1, 1.0, 1.0, 2.0); }, -std::log1p(-0.1) / 0.1, 4e-16},
        {"Gauss_2011(0.1, 1, 1, 2)", [] { return Call(TW_Gauss_2011, 0.1, 1.0, 1.0, 2.0); }, -std::log1p(-0.1) / 0.1, 4e-16},
        {"Kummer(x, 1, 2) = (e^x - 1)/x", [] { return Call(TW_Kummer, 3.0, 1.0, 2.0); }, std::expm1(3.0) / 3, 1e-15},
        {"Tricomi(x, a, a + 1) = x^-a", [] { return Call(TW_Tricomi, 2.5, 1.5, 2.5); }, std::pow(2.5, -1.5), 4e-16},
        {"D_2(x) = (x^2 - 1) e^(-x^2/4)", [] { return Call(TW_ParabolicCylinder, 3.0, 2.0); }, 8 * std::exp(-2.25), 4e-16},
        {"D_-1(x) = e^(x^2/4) sqrt(pi/2) erfc(x/sqrt 2)", [] { return Call(TW_ParabolicCylinder, 1.5, -1.0); },
         std::exp(0.5625) * std::sqrt(kPi / 2) * std::erfc(1.5 / std::sqrt(2.0)), 1e-14},
        {"Struve H_1/2(40)", [] { return Call(TW_Struve, 40.0, 0.5); },
         std::sqrt(2 / (kPi * 40)) * (1 - std::cos(40.0)), 1e-14},
    });
}

TEST(OtherFamily, PairsAndNullPointers) {
    double s = 0, c = 0, sn = 0, cn = 0, dn = 0;
    TW_FresnelIntegrals(-kInf, &s, &c);
    EXPECT_EQ(s, -0.5);
    EXPECT_EQ(c, -0.5);
    TW_EllipticJ(0.7, 0.0, &sn, &cn, &dn, nullptr);  // the amplitude pointer may be null
    EXPECT_NEAR(sn, std::sin(0.7), 1e-16);
    EXPECT_NEAR(cn, std::cos(0.7), 1e-16);
    EXPECT_EQ(dn, 1.0);
    double ph = 0;
    TW_EllipticJ(kNaN, 0.5, &sn, &cn, &dn, &ph);
    EXPECT_TRUE(std::isnan(sn) && std::isnan(cn) && std::isnan(dn) && std::isnan(ph));
}

}  // namespace
