// Rules shared by the real special functions: fixed machine constants, the argument screen by bit
// pattern, the silent fault report, polynomial and Chebyshev evaluation, the selector of the `_85`
// generation, and the translation of the complex routines' error flag into a status.
#pragma once

#include <bit>
#include <cstdint>

#include "frame/frame.hpp"

namespace tw {

// Tolerances use 2^-52 throughout, not the 2^-53 of the published routines.
inline constexpr double kEps = 2.220446049250313e-16;
inline constexpr double kMaxLog = 709.782712893384;  // largest argument of exp
// Continued fractions are rescaled by 2^-57 once a convergent grows past 2^57.
inline constexpr double kBig = 1.4411518807585587e+17;
inline constexpr double kBigInv = 6.938893903907228e-18;
inline constexpr double kPi = 3.141592653589793;
inline constexpr double kPiOver2 = 1.5707963267948966;
inline constexpr double kPiOver4 = 0.7853981633974483;
inline constexpr double kEuler = 0.5772156649015329;
inline constexpr double kInf = std::bit_cast<double>(uint64_t{0x7FF0000000000000});

// Classification by bit pattern: the comparisons of a NaN are never trusted for a screen.
inline bool IsNaN(double x) { return (std::bit_cast<uint64_t>(x) & 0x7FFFFFFFFFFFFFFF) > 0x7FF0000000000000; }
inline bool IsPosInf(double x) { return std::bit_cast<uint64_t>(x) == 0x7FF0000000000000; }
inline bool IsNegInf(double x) { return std::bit_cast<uint64_t>(x) == 0xFFF0000000000000; }
inline bool IsFinite(double x) {
    return (std::bit_cast<uint64_t>(x) & 0x7FF0000000000000) != 0x7FF0000000000000;
}

// The argument screen every real function starts with: NaN gives NaN, an infinity the limit the
// function states for it (NaN where it is not defined). True when the screen decided the result.
inline bool Screened(double x, double atPosInf, double atNegInf, double* result) {
    if (IsFinite(x)) return false;
    *result = IsNaN(x) ? kNaN : IsPosInf(x) ? atPosInf : atNegInf;
    return true;
}

// Identities and kinds of the fault report.
enum class SpecialFunction : int32_t {
    Gamma,
    Stirling,
    LnGamma,
    Factorial,
    Digamma,
    Beta,
    IncBeta,
    IncGamma,
    IncGammaC,
    Erf,
    Erfc,
    BesselJ,
    BesselY,
    BesselI,
    BesselK,
    Airy,
    Kelvin,
    Hyp1F1,
    Elliptic,
    EllipticJ,
    Hyp2F1,
    Tricomi,
    Zeta,
    Spence,
    Struve,
    ParabolicCylinder,
    ExpN,
    ShiChi,
};
enum class SpecialFault : int32_t { Domain = 0, Pole = 1, Overflow = 2, Underflow = 3, Precision = 4 };

// Every error site of the published routines reports here. The entry does nothing: the caller sees
// only the value the routine goes on to return. It is kept out of line so that a build can hook it.
void SpecialReport(SpecialFunction function, SpecialFault kind);

// Horner's rule over degree + 1 coefficients, the highest power first.
inline double EvalPoly(double x, const double* table, int32_t degree) {
    if (degree < 0) return kNaN;
    double r = table[0];
    for (int32_t i = 1; i <= degree; ++i) r = r * x + table[i];
    return r;
}

// The same with a leading coefficient 1 that is not stored: degree coefficients in the table.
inline double EvalPolyMonic(double x, const double* table, int32_t degree) {
    if (degree < 0) return kNaN;
    if (degree == 0) return 1.0;
    double r = x + table[0];
    for (int32_t i = 1; i < degree; ++i) r = r * x + table[i];
    return r;
}

// Clenshaw's rule for the Chebyshev tables of the modified Bessel functions: the table holds the
// coefficients of T_k(x/2) from the highest order down, and the last one (T_0) counts half.
inline double EvalChebyshev(double x, const double* table, int32_t terms) {
    if (terms < 1) return kNaN;
    double b0 = table[0], b1 = 0.0, b2 = 0.0;
    for (int32_t i = 1; i < terms; ++i) {
        b2 = b1;
        b1 = b0;
        b0 = x * b1 - b2 + table[i];
    }
    return 0.5 * (b0 - b2);
}

// The `_85` generation selects the complete function by an explicit selector: 1, and only 1.
inline bool SelectsComplete(int32_t selector) { return selector == 1; }

// The status of a complex routine's error flag (IERR of the published Bessel package).
Status AmosStatus(int32_t ierr);

}  // namespace tw
