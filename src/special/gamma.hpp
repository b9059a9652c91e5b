// The gamma family: gamma, log gamma, Stirling's formula, factorials, digamma, the complete and
// incomplete beta, the regularised incomplete gammas, erf and erfc. Each routine is the published
// Cephes routine of the same role with its coefficient tables, with this library's treatment of
// NaN, infinities, poles and a few thresholds. None reports a status: the value says it all.
#pragma once

#include <cstdint>

namespace tw {

double GammaFunc(double x);
double StirlingGamma(double x);
double LnGammaFunc(double x);  // NaN below 0: no reflection
double FactorialFunc(int32_t n);
double LnFactorialFunc(int32_t n);
double DigammaFunc(double x);
double BetaFunc(double a, double b);
double IncBeta(double a, double b, double x);  // regularised
double IncGamma(double a, double x);           // lower regularised P(a, x)
double IncGammaC(double a, double x);          // upper regularised Q(a, x)
double ErfFunc(double x);
double ErfcFunc(double x);

}  // namespace tw
