// Kelvin functions of integer order. ber + i bei by their power series (Abramowitz and Stegun
// 9.9.9), ker + i kei by 9.9.11 up to x = 10 and by the large-argument expansion of
// e^(-n pi i/2) K_n(x e^(pi i/4)) beyond, where the series cancels (7e-2 relative at x = 20).
#include <cmath>
#include <complex>
#include <cstdint>

#include "special/bessel.hpp"
#include "special/gamma.hpp"
#include "special/special_frame.hpp"

namespace tw {

namespace {

constexpr double kRootHalf = 0.7071067811865476;
// cos and sin of i pi/4: the phases (3n/4 + k/2) pi are multiples of pi/4.
constexpr double kCos8[8] = {1.0, kRootHalf, 0.0, -kRootHalf, -1.0, -kRootHalf, 0.0, kRootHalf};
constexpr double kSin8[8] = {0.0, kRootHalf, 1.0, kRootHalf, 0.0, -kRootHalf, -1.0, -kRootHalf};
constexpr double kTwiceEuler = 1.1544313298030657;
constexpr double kSeriesLimit = 10.0;

double BlockChange(double before, double after) { return std::fabs(before - after) / (std::fabs(before) + 1.0); }

// Sums over k of phase_k w_k (x/2)^(n+2k) / (k! (n+k)!), phase_k = e^(i (3n + 2k) pi/4), with
// weight w_k = 1 (ber, bei) or psi(k + 1) + psi(n + k + 1) (the last sum of ker, kei), four terms
// per block until a block changes both sums by less than eps relative. False on a non-finite change.
template <bool Digamma>
bool KelvinSeries(double ax, int64_t n, double* re, double* im) {
    double term = 1.0;
    // An infinite term stays infinite and a zero one zero: either way the rest of the product is known.
    for (int64_t j = 1; j <= n && term != 0.0 && IsFinite(term); ++j) term *= 0.5 * ax / static_cast<double>(j);
    if (term == 0.0) {  // (x/2)^n / n! underflows: so does every term
        *re = *im = 0.0;
        return true;
    }
    const double q = 0.25 * ax * ax;
    const double dn = static_cast<double>(n);
    double hk = 0.0, hnk = 0.0;  // harmonic numbers H_k and H_(n+k)
    if (Digamma)
        for (int64_t j = 1; j <= n; ++j) hnk += 1.0 / static_cast<double>(j);
    const int phase0 = static_cast<int>((3 * n) % 8);
    double sr = 0.0, si = 0.0;
    for (int64_t k = 0;; k += 4) {
        const double oldr = sr, oldi = si;
        for (int64_t j = k; j < k + 4; ++j) {
            const int p = (phase0 + 2 * static_cast<int>(j % 4)) % 8;
            const double w = Digamma ? (hk + hnk - kTwiceEuler) * term : term;
            sr += kCos8[p] * w;
            si += kSin8[p] * w;
            const double kk = static_cast<double>(j) + 1.0;
            term *= q / (kk * (dn + kk));
            if (Digamma) {
                hk += 1.0 / kk;
                hnk += 1.0 / (dn + kk);
            }
        }
        const double change = std::fmax(BlockChange(oldr, sr), BlockChange(oldi, si));
        if (!IsFinite(change)) return false;
        if (change < kEps) break;
    }
    *re = sr;
    *im = si;
    return true;
}

void Put(double* p, double v) {
    if (p != nullptr) *p = v;
}

// K_n(z) at z = x e^(i pi/4) for x above the series limit: sqrt(pi / 2z) e^-z sum a_k(n) / z^k.
// False when the expansion does not reach eps before its terms grow again (order large against x).
bool KLargeArgument(std::complex<double> z, int64_t n, std::complex<double>* k) {
    const double mu = 4.0 * static_cast<double>(n) * static_cast<double>(n);
    std::complex<double> term = 1.0, sum = 1.0;
    double last = kInf;
    bool converged = false;
    for (int j = 1; j < 400; ++j) {
        const double odd = 2.0 * j - 1.0;
        term *= ((mu - odd * odd) / (8.0 * j)) / z;
        const double size = std::abs(term);
        if (size > last && size < 1.0) break;  // shrinking had begun: the expansion is exhausted
        sum += term;
        last = size;
        if (size <= kEps * std::abs(sum)) {
            converged = true;
            break;
        }
    }
    *k = std::sqrt(kPi / (2.0 * z)) * std::exp(-z) * sum;
    return converged;
}

// ker + i kei = e^(-n pi i/2) K_n(x e^(i pi/4)) beyond the series limit. Where the expansion of
// order n does not converge, K_n comes from orders 0 and 1 by the upward recurrence, in which K
// dominates.
std::complex<double> KelvinKLarge(double x, int64_t n) {
    const std::complex<double> z = std::polar(x, kPiOver4);
    std::complex<double> k;
    if (!KLargeArgument(z, n, &k)) {
        std::complex<double> km, kn;
        KLargeArgument(z, 0, &km);
        KLargeArgument(z, 1, &kn);
        for (int64_t j = 1; j < n && IsFinite(std::abs(kn)); ++j) {
            const std::complex<double> kp = km + (2.0 * static_cast<double>(j) / z) * kn;
            km = kn;
            kn = kp;
        }
        k = n == 0 ? km : kn;
    }
    return k * std::polar(1.0, -kPiOver2 * static_cast<double>(n % 4));
}

}  // namespace

void KelvinI(double x, int32_t order, double* ber, double* bei) {
    if (!IsFinite(x)) {
        Put(ber, kNaN);
        Put(bei, kNaN);
        return;
    }
    const int64_t n = order < 0 ? -static_cast<int64_t>(order) : order;
    double sign = 1.0;
    if (order < 0 && (n & 1)) sign = -sign;
    if (x < 0.0 && (n & 1)) sign = -sign;
    double re, im;
    if (!KelvinSeries<false>(std::fabs(x), n, &re, &im)) re = im = kNaN;
    Put(ber, sign * re);
    Put(bei, sign * im);
}

void KelvinK(double x, int32_t order, double* ker, double* kei) {
    double re = kNaN, im = kNaN;
    if (IsPosInf(x)) {
        re = im = 0.0;
    } else if (IsFinite(x) && x > 0.0) {
        const int64_t n = order < 0 ? -static_cast<int64_t>(order) : order;
        if (x > kSeriesLimit) {
            const std::complex<double> k = KelvinKLarge(x, n);
            re = k.real();
            im = k.imag();
        } else {
            double br, bi, sr, si;
            if (KelvinSeries<false>(x, n, &br, &bi) && KelvinSeries<true>(x, n, &sr, &si)) {
                const double lg = std::log(x / 2.0);
                re = -lg * br + kPiOver4 * bi + 0.5 * sr;
                im = -lg * bi - kPiOver4 * br + 0.5 * si;
                if (n > 0) {
                    // The finite sum of k below n, with (n - k - 1)! / k! (x/2)^(2k - n).
                    const double q = 0.25 * x * x;
                    const int phase0 = static_cast<int>((3 * n) % 8);
                    double fr = 0.0, fi = 0.0, power = 1.0;
                    for (int64_t k = 0; k < n && (IsFinite(fr) || IsFinite(fi)); ++k) {
                        const int p = (phase0 + 2 * static_cast<int>(k % 4)) % 8;
                        const double w = FactorialFunc(static_cast<int32_t>(n - k - 1)) /
                                         FactorialFunc(static_cast<int32_t>(k)) * power;
                        // Zero phases are skipped: an overflowing factorial must not turn 0 into NaN.
                        if (kCos8[p] != 0.0) fr += kCos8[p] * w;
                        if (kSin8[p] != 0.0) fi += kSin8[p] * w;
                        power *= q;
                    }
                    // For orders so large that (x/2)^-n underflows, an overflowing sum wins.
                    const double scale = 0.5 * std::pow(x / 2.0, -static_cast<double>(n));
                    re += (scale == 0.0 && !IsFinite(fr)) ? fr : scale * fr;
                    im -= (scale == 0.0 && !IsFinite(fi)) ? fi : scale * fi;
                }
            }
        }
        if (order < 0 && (n & 1)) {
            re = -re;
            im = -im;
        }
    } else {
        SpecialReport(SpecialFunction::Kelvin, SpecialFault::Domain);
    }
    Put(ker, re);
    Put(kei, im);
}

}  // namespace tw
