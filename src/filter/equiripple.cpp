// The Remez exchange after the McClellan-Parks-Rabiner program: dense grid, Lagrange interpolation
// in barycentric form through the current extremals, the extremal search of the program, and the
// coefficients by an inverse cosine transform of the interpolant.
#include "filter/equiripple.hpp"

#include <algorithm>
#include <cmath>

namespace tw {

namespace {

constexpr double kPi = 3.14159265358979323846;
constexpr double kTwoPi = 2.0 * kPi;
constexpr int32_t kGridDensity = 16;
constexpr int32_t kMaxFunctions = 2047;

struct Interpolant {
    const double* x;   // cosines of the extremal frequencies, r + 1 of them (r + 2 with a sentinel)
    const double* ad;  // barycentric weights
    const double* y;   // values at the extremals
    int32_t nz;
};

// Barycentric value at c = cos(2 pi f). The denominator is Kahan-summed: long designs cancel
// heavily there, and the compensation decides how they converge.
double Evaluate(const Interpolant& p, double c) {
    double num = 0.0, den = 0.0, carry = 0.0;
    for (int32_t j = 0; j < p.nz; ++j) {
        const double diff = c - p.x[j];
        if (diff == 0.0) return p.y[j];
        const double t = p.ad[j] / diff;
        num += t * p.y[j];
        const double term = t - carry;
        const double sum = den + term;
        carry = (sum - den) - term;
        den = sum;
    }
    return num / den;
}

// Evaluate at several points at once, each summed exactly as Evaluate sums it: the compensated
// denominator is a chain of dependent additions, and interleaving independent chains hides it.
constexpr int kBatch = 4;

void EvaluateBatch(const Interpolant& p, const double* c, double* out) {
    double num[kBatch] = {}, den[kBatch] = {}, carry[kBatch] = {};
    for (int32_t j = 0; j < p.nz; ++j) {
        const double xj = p.x[j], aj = p.ad[j], yj = p.y[j];
        for (int u = 0; u < kBatch; ++u) {
            const double t = aj / (c[u] - xj);
            num[u] += t * yj;
            const double term = t - carry[u];
            const double sum = den[u] + term;
            carry[u] = (sum - den[u]) - term;
            den[u] = sum;
        }
    }
    for (int u = 0; u < kBatch; ++u) {
        out[u] = num[u] / den[u];
        // A point on an extremal divided by zero on the way: its value is the extremal's.
        if (!std::isfinite(out[u]))
            for (int32_t j = 0; j < p.nz; ++j)
                if (c[u] == p.x[j]) {
                    out[u] = p.y[j];
                    break;
                }
    }
}

// 1 / product of 2 (x_k - x_j), taken in strides so that neighbours do not meet in a row; the
// factor 2 keeps products of up to 2047 differences of cosines clear of underflow.
bool BarycentricWeights(const double* x, int32_t nz, int32_t r, double* ad) {
    const int32_t stride = (r - 1) / 15 + 1;
    for (int32_t k = 0; k < nz; ++k) {
        double d = 1.0;
        const double q = x[k];
        for (int32_t l = 0; l < stride; ++l)
            for (int32_t j = l; j < nz; j += stride)
                if (j != k) d = 2.0 * d * (q - x[j]);
        if (d == 0.0) return false;
        ad[k] = 1.0 / d;
    }
    return true;
}

struct Grid {
    double* f;
    double* c;    // cos(2 pi f)
    double* des;
    double* wt;
    int32_t n;
};

// Fills the grid (or only counts it when g.f is null), in normalised frequency.
int32_t BuildGrid(const EquirippleBand* bands, int32_t nBands, double fs, int32_t kind, double delta, Grid* g) {
    int32_t j = 0;
    auto put = [&](int32_t at, double f, const EquirippleBand& b) {
        if (g->f == nullptr) return;
        g->f[at] = f;
        if (kind == kDifferentiator) {
            g->des[at] = b.gain * f;
            g->wt[at] = b.gain >= 0.0001 ? b.weight / f : b.weight;
        } else {
            g->des[at] = b.gain;
            g->wt[at] = b.weight;
        }
    };
    double start = bands[0].lower / fs;
    if (kind != kMultiband && start < delta) start = delta;
    for (int32_t b = 0; b < nBands; ++b) {
        const double up = bands[b].upper / fs;
        double f = b == 0 ? start : bands[b].lower / fs;
        for (;;) {
            put(j++, f, bands[b]);
            const double next = f + delta;
            if (next > up) break;
            f = next;
        }
        put(j - 1, up, bands[b]);
    }
    return j;
}

// The extremal search of one exchange. Returns the number of changes.
struct Search {
    const Grid& g;
    const Interpolant& p;
    double nut = 1.0;
    // Errors of a few neighbouring grid points, computed together: the search mostly walks the
    // grid point by point. Valid for one interpolant, that is one exchange.
    int32_t first = -1, last = -2, previous = -2;
    double cached[kBatch] = {};

    double Raw(int32_t l) {
        if (l < first || l > last) {
            // Ahead in the direction of the walk; after a jump (a new extremal's first test, next
            // to it the first steps up and down) around the point.
            int32_t lo = l < previous ? l - (kBatch - 1) : l == previous + 1 ? l : l - 2;
            lo = std::max(0, std::min(lo, g.n - kBatch));
            double c[kBatch];
            for (int u = 0; u < kBatch; ++u) c[u] = g.c[std::min(lo + u, g.n - 1)];
            EvaluateBatch(p, c, cached);
            first = lo;
            last = std::min(lo + kBatch - 1, g.n - 1);
        }
        previous = l;
        const double a = cached[l - first];
        return (a - g.des[l]) * g.wt[l];
    }
    double E(int32_t l) { return nut * Raw(l); }
    // Climbs upward from l (E(l) = comp already taken) while E strictly rises below kup; returns
    // the last index reached.
    int32_t Up(int32_t l, int32_t kup, double* comp) {
        for (;;) {
            ++l;
            if (l >= kup) break;
            const double v = E(l);
            if (!(v > *comp)) break;
            *comp = v;
        }
        return l - 1;
    }
    int32_t Down(int32_t l, int32_t klow, double* comp) {
        for (;;) {
            --l;
            if (l <= klow) break;
            const double v = E(l);
            if (!(v > *comp)) break;
            *comp = v;
        }
        return l + 1;
    }
};

}  // namespace

Status EquirippleDesign(int32_t taps, double fs, const EquirippleBand* bands, int32_t nBands, int32_t kind,
                        int32_t limit, double* h, double* deviation, bool* ranOut) {
    *ranOut = false;
    if (limit < 1) limit = 100;
    if (taps < 3) return DesignParameterErr;
    if (!(fs > 0.0)) return CutoffInvalidErr;
    for (int32_t b = 0; b < nBands; ++b)
        if (bands[b].lower < 0.0 || bands[b].upper < 0.0 || bands[b].gain < 0.0 || !(bands[b].weight > 0.0))
            return CutoffInvalidErr;
    const double half = fs / 2.0, first = bands[0].lower, last = bands[nBands - 1].upper;
    if (last > half) return CutoffAboveNyquistErr;
    for (int32_t b = 0; b < nBands; ++b)
        if (!(bands[b].lower < bands[b].upper) || (b > 0 && !(bands[b - 1].upper < bands[b].lower)))
            return CutoffInvalidErr;
    const bool odd = (taps & 1) != 0;
    // Distances from fs / 2 are in units of fs.
    const double near = 0.001 * fs, clear = 0.01 * fs;
    switch (kind) {
    case kMultiband:
        if (first != 0.0 || half - last > near) return DesignParameterErr;
        if (!odd && bands[nBands - 1].gain != 0.0) return EvenTapsErr;
        break;
    case kDifferentiator:
        if (first != 0.0) return DesignParameterErr;
        if (!odd && half - last > near) return DesignParameterErr;
        if (odd && half - last < clear) return DesignParameterErr;
        break;
    case kHilbert:
        if (first == 0.0) return DesignParameterErr;
        if (!odd && half - last > near) return DesignParameterErr;
        if (odd && half - last < near) return DesignParameterErr;
        break;
    default:
        return DesignParameterErr;
    }
    const bool symmetric = kind == kMultiband;
    const int32_t r = (taps >> 1) + (odd && symmetric ? 1 : 0);
    if (r + 2 > kMaxFunctions) return OutOfMemoryErr;
    const double delta = 0.5 / (kGridDensity * r);

    Grid g{nullptr, nullptr, nullptr, nullptr, 0};
    const int32_t G = BuildGrid(bands, nBands, fs, kind, delta, &g);
    const size_t m = static_cast<size_t>(r) + 2;
    Scratch<double> work;
    Scratch<int32_t> ext;
    if (work.Allocate(4 * static_cast<size_t>(G) + 7 * m) != 0 || ext.Allocate(m) != 0) return OutOfMemoryErr;
    g.f = work.get();
    g.c = g.f + G;
    g.des = g.c + G;
    g.wt = g.des + G;
    double* x = g.wt + G;
    double* ad = x + m;
    double* y = ad + m;
    double* A = y + m;
    double* alpha = A + m;
    double* P = alpha + m;
    double* Q = P + m;
    int32_t* e = ext.get();
    BuildGrid(bands, nBands, fs, kind, delta, &g);
    g.n = G;
    if (odd == !symmetric && g.f[g.n - 1] > 0.5 - delta) --g.n;
    for (int32_t j = 0; j < g.n; ++j) {
        double change = 1.0;
        if (symmetric && !odd)
            change = std::cos(kPi * g.f[j]);
        else if (!symmetric && !odd)
            change = std::sin(kPi * g.f[j]);
        else if (!symmetric)
            change = std::sin(kTwoPi * g.f[j]);
        if (!(symmetric && odd)) {
            g.des[j] /= change;
            g.wt[j] *= change;
        }
        g.c[j] = std::cos(kTwoPi * g.f[j]);
    }
    const int32_t ng = g.n;
    const double step = static_cast<double>(ng - 1) / r;
    for (int32_t i = 0; i < r; ++i) e[i] = static_cast<int32_t>(i * step);
    e[r] = ng - 1;

    const int32_t nz = r + 1;
    const Interpolant p{x, ad, y, nz};
    double dev = 0.0, previous = -1.0;
    for (int32_t count = limit;;) {
        if (--count < 1) {
            *deviation = dev;
            *ranOut = true;
            return DesignParameterErr;
        }
        e[r + 1] = ng;
        for (int32_t j = 0; j < nz; ++j) x[j] = g.c[e[j]];
        if (!BarycentricWeights(x, nz, r, ad)) return DesignParameterErr;
        double num = 0.0, even = 0.0, oddSum = 0.0;
        for (int32_t j = 0; j < nz; ++j) {
            num += g.des[e[j]] * ad[j];
            if (j % 2 == 0)
                even += ad[j] / g.wt[e[j]];
            else
                oddSum += ad[j] / g.wt[e[j]];
        }
        const double levelled = num / (even - oddSum);
        const double nu = levelled > 0.0 ? -1.0 : 1.0;
        dev = std::fabs(levelled);
        for (int32_t j = 0; j < nz; ++j) {
            const double s = j % 2 == 0 ? 1.0 : -1.0;
            y[j] = g.des[e[j]] - s * levelled / g.wt[e[j]];
        }
        // The levelled error never falls in a sound exchange.
        if (dev < previous) return DesignParameterErr;
        const double before = previous;
        previous = dev;

        Search s{g, p, -nu};
        int32_t changes = 0, klow = -1, k1 = e[0], knz = e[r];
        double comp = 0.0, y1 = 0.0;
        for (int32_t j = 0; j < nz; ++j) {
            const int32_t kup = e[j + 1];
            int32_t l = e[j] + 1;
            s.nut = -s.nut;
            if (j == 1) y1 = comp;
            comp = dev;
            if (l < kup) {
                const double v = s.E(l);
                if (v > comp) {
                    comp = v;
                    e[j] = klow = s.Up(l, kup, &comp);
                    ++changes;
                    continue;
                }
            }
            bool found = false, exhausted = false;
            for (l = e[j] - 1;; --l) {
                if (l <= klow) {
                    exhausted = true;
                    break;
                }
                const double v = s.E(l);
                if (v > comp) {
                    comp = v;
                    found = true;
                    break;
                }
                if (changes > 0) break;
            }
            if (found) {
                const int32_t at = s.Down(l, klow, &comp);
                klow = e[j];
                e[j] = at;
                ++changes;
                continue;
            }
            if (exhausted && changes == 0) {
                for (l = e[j] + 2; l < kup; ++l) {
                    const double v = s.E(l);
                    if (v > comp) {
                        comp = v;
                        found = true;
                        break;
                    }
                }
                if (found) {
                    e[j] = klow = s.Up(l, kup, &comp);
                    changes = 1;
                    continue;
                }
            }
            klow = e[j];
        }
        // The ends: a new extremal below the first one, else above the last one.
        k1 = std::min(k1, e[0]);
        knz = std::max(knz, e[r]);
        const double lastSign = s.nut;
        s.nut = -nu;
        comp *= 1.00001;
        int32_t at = -1;
        for (int32_t l = 0; l < k1; ++l) {
            const double v = s.E(l);
            if (v > comp) {
                comp = v;
                at = s.Up(l, k1, &comp);
                break;
            }
        }
        if (at >= 0) {
            for (int32_t j = r; j > 0; --j) e[j] = e[j - 1];
            e[0] = at;
            ++changes;
        } else {
            comp = std::max(y1, comp) * 1.00001;
            s.nut = -lastSign;
            for (int32_t l = ng - 1; l > knz; --l) {
                const double v = s.E(l);
                if (v > comp) {
                    comp = v;
                    at = s.Down(l, knz, &comp);
                    break;
                }
            }
            if (at >= 0) {
                for (int32_t j = 0; j < r; ++j) e[j] = e[j + 1];
                e[r] = at;
                ++changes;
            }
        }
        if (changes == 0 && std::fabs(dev - before) < 1e-09) break;
    }
    *deviation = dev;

    // Samples of the interpolant at r equally spaced frequencies, then the cosine transform.
    const bool reexpand = kind == kHilbert && r >= 4;
    double aa = 0.0, bb = 0.0;
    if (reexpand) {
        const double c0 = std::cos(kTwoPi * g.f[0]), c1 = std::cos(kTwoPi * g.f[ng - 1]);
        aa = 2.0 / (c0 - c1);
        bb = -(c0 + c1) / (c0 - c1);
    }
    const double cn = 2 * r - 1;
    x[nz] = -2.0;
    for (int32_t j = 0, l = 0; j < r; ++j) {
        double ft = j / cn;
        double xt = std::cos(kTwoPi * ft);
        if (reexpand) {
            xt = (xt - bb) / aa;
            ft = std::acos(xt) / kTwoPi;
        }
        for (;;) {
            const double xe = x[l];
            if (xt > xe) {
                A[j] = xt - xe < 1e-06 ? y[l] : Evaluate(p, std::cos(kTwoPi * ft));
                break;
            }
            if (xe - xt < 1e-06) {
                A[j] = y[l];
                break;
            }
            ++l;
        }
        if (l > 0) --l;
    }
    const double dden = kTwoPi / cn;
    for (int32_t j = 0; j < r; ++j) {
        double sum = 0.0;
        const double dnum = j * dden;
        for (int32_t k = 1; k < r; ++k) sum += A[k] * std::cos(dnum * k);
        alpha[j] = 2.0 * sum + A[0];
    }
    for (int32_t j = 1; j < r; ++j) alpha[j] = 2.0 * alpha[j] / cn;
    alpha[0] /= cn;
    if (reexpand) {
        // Chebyshev re-expansion undoing the map of [c1, c0] onto [-1, 1].
        P[0] = 2.0 * alpha[r - 1] * bb + alpha[r - 2];
        P[1] = 2.0 * aa * alpha[r - 1];
        Q[0] = alpha[r - 3] - alpha[r - 1];
        for (int32_t J = 2; J <= r - 1; ++J) {
            if (J == r - 1) {
                aa *= 0.5;
                bb *= 0.5;
            }
            P[J] = 0.0;
            for (int32_t k = 0; k < J; ++k) {
                A[k] = P[k];
                P[k] = 2.0 * bb * A[k];
            }
            P[1] += A[0] * 2.0 * aa;
            for (int32_t k = 0; k <= J - 2; ++k) P[k] = P[k] + Q[k] + aa * A[k + 1];
            for (int32_t k = 2; k <= J; ++k) P[k] += aa * A[k - 1];
            if (J == r - 1) break;
            for (int32_t k = 0; k < J; ++k) Q[k] = -A[k];
            Q[0] += alpha[r - 2 - J];
        }
        for (int32_t j = 0; j < r; ++j) alpha[j] = P[j];
    }
    if (r < 4) alpha[r] = alpha[r + 1] = 0.0;

    const double* a = alpha;
    const int32_t n = taps;
    if (symmetric) {
        if (odd) {
            for (int32_t j = 0; j < r - 1; ++j) h[j] = a[r - 1 - j] / 2.0;
            h[r - 1] = a[0];
        } else {
            h[0] = a[r - 1] / 4.0;
            for (int32_t j = 1; j <= r - 2; ++j) h[j] = (a[r - 1 - j] + a[r - j]) / 4.0;
            h[r - 1] = a[0] / 2.0 + a[1] / 4.0;
        }
        for (int32_t j = 0; j < n / 2; ++j) h[n - 1 - j] = h[j];
    } else {
        if (odd) {
            h[0] = a[r - 1] / 4.0;
            if (r >= 2) h[1] = a[r - 2] / 4.0;
            for (int32_t j = 2; j <= r - 2; ++j) h[j] = (a[r - 1 - j] - a[r + 1 - j]) / 4.0;
            h[r - 1] = a[0] / 2.0 - a[2] / 4.0;
            h[r] = 0.0;
        } else {
            h[0] = a[r - 1] / 4.0;
            for (int32_t j = 1; j <= r - 2; ++j) h[j] = (a[r - 1 - j] - a[r - j]) / 4.0;
            h[r - 1] = (a[0] - a[1] / 2.0) / 2.0;
        }
        for (int32_t j = 0; j < n / 2; ++j) h[n - 1 - j] = -h[j];
    }
    return 0;
}

}  // namespace tw
