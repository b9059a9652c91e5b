// Orders 0 and 1: J, Y by rational forms (phase and amplitude in 25/x^2 above x = 5), I, K by
// Chebyshev series. After Cephes `j0`, `j1`, `i0`, `i1`, `k0`, `k1`.
#include <cmath>

#include "special/bessel.hpp"
#include "special/bessel_tables.hpp"
#include "special/special_frame.hpp"

namespace tw {

namespace {

constexpr double kSqrt2OverPi = 7.9788456080286535587989E-1;
constexpr double kTwoOverPi = 6.36619772367581343075535E-1;
constexpr double kThreePiOver4 = 2.35619449019234492885;

// Amplitude p and phase correction q of order 0 (tables PP/PQ, QP/QQ) above x = 5.
template <class T>
void AmplitudePhase(double x, double* p, double* q) {
    const double z = 25.0 / (x * x);
    *p = EvalPoly(z, T::PP, 6) / EvalPoly(z, T::PQ, 6);
    *q = EvalPoly(z, T::QP, 7) / EvalPolyMonic(z, T::QQ, 7);
}

struct Order0 {
    static constexpr const double* PP = cephes::j0::PP;
    static constexpr const double* PQ = cephes::j0::PQ;
    static constexpr const double* QP = cephes::j0::QP;
    static constexpr const double* QQ = cephes::j0::QQ;
};
struct Order1 {
    static constexpr const double* PP = cephes::j1::PP;
    static constexpr const double* PQ = cephes::j1::PQ;
    static constexpr const double* QP = cephes::j1::QP;
    static constexpr const double* QQ = cephes::j1::QQ;
};

}  // namespace

double BesselJ0(double x) {
    if (x < 0.0) x = -x;
    if (x <= 5.0) {
        const double z = x * x;
        if (x < 1.0e-5) return 1.0 - z / 4.0;
        const double p = (z - cephes::j0::DR1) * (z - cephes::j0::DR2);
        return p * EvalPoly(z, cephes::j0::RP, 3) / EvalPolyMonic(z, cephes::j0::RQ, 8);
    }
    double p, q;
    AmplitudePhase<Order0>(x, &p, &q);
    const double w = 5.0 / x;
    const double xn = x - kPiOver4;
    p = p * std::cos(xn) - w * q * std::sin(xn);
    return p * kSqrt2OverPi / std::sqrt(x);
}

double BesselY0(double x) {
    if (x <= 5.0) {
        if (x == 0.0) {
            SpecialReport(SpecialFunction::BesselY, SpecialFault::Pole);
            return -kInf;
        }
        if (x < 0.0) {
            SpecialReport(SpecialFunction::BesselY, SpecialFault::Domain);
            return kNaN;
        }
        const double z = x * x;
        const double w = EvalPoly(z, cephes::j0::YP, 7) / EvalPolyMonic(z, cephes::j0::YQ, 7);
        return w + kTwoOverPi * std::log(x) * BesselJ0(x);
    }
    double p, q;
    AmplitudePhase<Order0>(x, &p, &q);
    const double w = 5.0 / x;
    const double xn = x - kPiOver4;
    p = p * std::sin(xn) + w * q * std::cos(xn);
    return p * kSqrt2OverPi / std::sqrt(x);
}

double BesselJ1(double x) {
    if (x <= 5.0) {
        const double z = x * x;
        double w = EvalPoly(z, cephes::j1::RP, 3) / EvalPolyMonic(z, cephes::j1::RQ, 8);
        return w * x * (z - cephes::j1::Z1) * (z - cephes::j1::Z2);
    }
    double p, q;
    AmplitudePhase<Order1>(x, &p, &q);
    const double w = 5.0 / x;
    const double xn = x - kThreePiOver4;
    p = p * std::cos(xn) - w * q * std::sin(xn);
    return p * kSqrt2OverPi / std::sqrt(x);
}

double BesselY1(double x) {
    if (x <= 5.0) {
        if (x == 0.0) {
            SpecialReport(SpecialFunction::BesselY, SpecialFault::Pole);
            return -kInf;
        }
        if (x < 0.0) {
            SpecialReport(SpecialFunction::BesselY, SpecialFault::Domain);
            return kNaN;
        }
        const double z = x * x;
        double w = x * (EvalPoly(z, cephes::j1::YP, 5) / EvalPolyMonic(z, cephes::j1::YQ, 8));
        return w + kTwoOverPi * (BesselJ1(x) * std::log(x) - 1.0 / x);
    }
    double p, q;
    AmplitudePhase<Order1>(x, &p, &q);
    const double w = 5.0 / x;
    const double xn = x - kThreePiOver4;
    p = p * std::sin(xn) + w * q * std::cos(xn);
    return p * kSqrt2OverPi / std::sqrt(x);
}

double BesselI0(double x) {
    if (x < 0.0) x = -x;
    if (x <= 8.0) return std::exp(x) * EvalChebyshev(x / 2.0 - 2.0, cephes::i0::A, 30);
    return std::exp(x) * EvalChebyshev(32.0 / x - 2.0, cephes::i0::B, 25) / std::sqrt(x);
}

double BesselI1(double x) {
    double z = std::fabs(x);
    if (z <= 8.0)
        z = EvalChebyshev(z / 2.0 - 2.0, cephes::i1::A, 29) * z * std::exp(z);
    else
        z = std::exp(z) * EvalChebyshev(32.0 / z - 2.0, cephes::i1::B, 25) / std::sqrt(z);
    return x < 0.0 ? -z : z;
}

double BesselK0(double x) {
    if (x == 0.0) {
        SpecialReport(SpecialFunction::BesselK, SpecialFault::Overflow);
        return kInf;
    }
    if (x < 0.0) {
        SpecialReport(SpecialFunction::BesselK, SpecialFault::Domain);
        return kNaN;
    }
    if (x <= 2.0)
        return EvalChebyshev(x * x - 2.0, cephes::k0::A, 10) - std::log(0.5 * x) * BesselI0(x);
    return std::exp(-x) * EvalChebyshev(8.0 / x - 2.0, cephes::k0::B, 25) / std::sqrt(x);
}

double BesselK1(double x) {
    if (x == 0.0) {
        SpecialReport(SpecialFunction::BesselK, SpecialFault::Overflow);
        return kInf;
    }
    if (x < 0.0) {
        SpecialReport(SpecialFunction::BesselK, SpecialFault::Domain);
        return kNaN;
    }
    if (x <= 2.0)
        return std::log(0.5 * x) * BesselI1(x) + EvalChebyshev(x * x - 2.0, cephes::k1::A, 11) / x;
    return std::exp(-x) * EvalChebyshev(8.0 / x - 2.0, cephes::k1::B, 25) / std::sqrt(x);
}

}  // namespace tw
