#include "generate/noise.hpp"

#include <algorithm>
#include <atomic>
#include <cmath>
#include <cstddef>
#include <numbers>

#include "generate/random.hpp"
#include "special/gamma.hpp"
#include "transform/fft/fft.hpp"

namespace tw {

static_assert(sizeof(GaussSpare) == 12 && offsetof(GaussSpare, spare) == 4);
static_assert(sizeof(BinomialCache) == 52 && offsetof(BinomialCache, trials) == 48);

namespace {

constexpr double kPi = std::numbers::pi;

bool Stuck(const RandomState* st) { return st->s1 == 0 && st->s2 == 0 && st->s3 == 0; }

// Counts the rejections of one sample: past the limit, or once the stream is a constant 0 (where
// every attempt repeats the last), the sampler gives up.
class Rejections {
public:
    explicit Rejections(const RandomState* st) : st_(st) {}
    bool GiveUp() { return ++count_ >= kMaxRejections || Stuck(st_); }
    void Reset() { count_ = 0; }

private:
    const RandomState* st_;
    int32_t count_ = 0;
};

// The classic tangent-comparison sampler for integer orders of 6 and above.
bool GammaLarge(double am, double s, RandomState* st, Rejections& rej, double* out) {
    for (;;) {
        double v1, v2;
        do {
            v1 = 2.0 * RandomUniform(st) - 1.0;
            v2 = 2.0 * RandomUniform(st) - 1.0;
            if (v1 * v1 + v2 * v2 <= 1.0) break;
            if (rej.GiveUp()) return false;
        } while (true);
        const double y = v2 / v1;
        const double x = s * y + am;
        if (!(x > 0.0)) {
            if (rej.GiveUp()) return false;
            continue;
        }
        const double e = (1.0 + y * y) * std::exp(am * std::log(x / am) - s * y);
        if (RandomUniform(st) > e) {
            if (rej.GiveUp()) return false;
            continue;
        }
        *out = x;
        return true;
    }
}

// The periodic noise has no work cell, yet building a table costs more than the transform: the
// last table used keeps one reference in the shared list, for the next call of the same length.
std::atomic<FftTable*> gPeriodTable{nullptr};

FftTable* TakePeriodTable(int32_t n) {
    FftTable* t = gPeriodTable.exchange(nullptr, std::memory_order_acq_rel);
    if (t != nullptr && t->size == n) return t;
    DestroyFftTable(t);
    return CreateFftTable(n);
}

void KeepPeriodTable(FftTable* t) { DestroyFftTable(gPeriodTable.exchange(t, std::memory_order_acq_rel)); }

// cos and sin of the integer phases 0 .. 32767, the values std::cos and std::sin give: at tens of
// nanoseconds a pair, the trigonometry would otherwise cost more than the transform.
constexpr int32_t kPhases = 32768;
struct PhaseTable {
    double cs[kPhases][2];  // side by side: one cache line per phase
};

const PhaseTable& Phases() {
    static PhaseTable table;
    static const bool ready = [] {
        for (int32_t k = 0; k < kPhases; ++k) {
            table.cs[k][0] = std::cos(static_cast<double>(k));
            table.cs[k][1] = std::sin(static_cast<double>(k));
        }
        return true;
    }();
    (void)ready;
    return table;
}

}  // namespace

void WhiteNoise(double* y, int32_t n, double amplitude, RandomState* st) {
    const double span = amplitude + amplitude;
    for (int32_t k = 0; k < n; ++k) y[k] = (RandomUniform(st) - 0.5) * span;
}

Status GaussNoise(double* y, int32_t n, double deviation, RandomState* st, GaussSpare* spare) {
    Rejections rej(st);
    for (int32_t k = 0; k < n; ++k) {
        double sample;
        if (spare->haveSpare == 0) {
            double v1, v2, r;
            for (rej.Reset();;) {
                v1 = 2.0 * RandomUniform(st) - 1.0;
                v2 = 2.0 * RandomUniform(st) - 1.0;
                r = v1 * v1 + v2 * v2;
                if (r < 1.0 && r != 0.0) break;
                if (rej.GiveUp()) return NoConvergenceErr;
            }
            const double f = std::sqrt(-2.0 * std::log(r) / r);
            spare->spare = v1 * f;
            sample = v2 * f;
        } else {
            sample = spare->spare;
        }
        spare->haveSpare = spare->haveSpare == 0 ? 1 : 0;
        y[k] = sample * deviation;
    }
    return 0;
}

Status GammaNoise(double* y, int32_t n, int32_t order, RandomState* st) {
    if (order < 6) {
        for (int32_t k = 0; k < n; ++k) {
            double t = 1.0;
            for (int32_t i = 0; i < order; ++i) t *= RandomUniform(st);
            y[k] = -std::log(t);
        }
        return 0;
    }
    const double am = order - 1;
    const double s = std::sqrt(2.0 * am + 1.0);
    Rejections rej(st);
    for (int32_t k = 0; k < n; ++k) {
        rej.Reset();
        if (!GammaLarge(am, s, st, rej, &y[k])) return NoConvergenceErr;
    }
    return 0;
}

Status PoissonNoise(double* y, int32_t n, double mean, RandomState* st) {
    if (mean < 12.0) {
        const double g = std::exp(-mean);
        for (int32_t k = 0; k < n; ++k) {
            double count = -1.0, t = 1.0;
            do {
                count += 1.0;
                t *= RandomUniform(st);
            } while (g < t);
            y[k] = count;
        }
        return 0;
    }
    const double sq = std::sqrt(2.0 * mean);
    const double lnM = std::log(mean);
    const double g = mean * lnM - LnGammaFunc(mean + 1.0);
    // Past about 1e305 (and at infinity) the envelope overflows: t turns NaN, which the test
    // below would accept, giving inf or NaN samples as if they were draws.
    if (!std::isfinite(sq) || !std::isfinite(g)) return NoConvergenceErr;
    Rejections rej(st);
    for (int32_t k = 0; k < n; ++k) {
        double em, yt, t;
        for (rej.Reset();;) {
            do {
                yt = std::tan(kPi * RandomUniform(st));
                em = sq * yt + mean;
                if (!(em < 0.0)) break;
                if (rej.GiveUp()) return NoConvergenceErr;
            } while (true);
            em = std::floor(em);
            t = 0.9 * (1.0 + yt * yt) * std::exp(em * lnM - LnGammaFunc(em + 1.0) - g);
            if (!(RandomUniform(st) > t)) break;
            if (rej.GiveUp()) return NoConvergenceErr;
        }
        y[k] = em;
    }
    return 0;
}

Status BinomialNoise(uint32_t* y, int32_t n, int32_t trials, double probability, RandomState* st,
                     BinomialCache* cache) {
    const double pp = probability <= 0.5 ? probability : 1.0 - probability;
    const bool folded = pp != probability;
    const double en = trials;
    const double am = en * pp;
    const auto store = [&](int32_t k, double count) {
        y[k] = static_cast<uint32_t>(folded ? en - count : count);
    };
    if (trials < 25) {
        for (int32_t k = 0; k < n; ++k) {
            int32_t count = 0;
            for (int32_t j = 0; j < trials; ++j)
                if (RandomUniform(st) < pp) ++count;
            store(k, count);
        }
        return 0;
    }
    if (am < 1.0) {
        const double g = std::exp(-am);
        for (int32_t k = 0; k < n; ++k) {
            double t = 1.0;
            int64_t j = 0;  // may pass the largest trial count
            for (; j <= trials; ++j) {
                t *= RandomUniform(st);
                if (t < g) break;
            }
            store(k, static_cast<double>(std::min<int64_t>(j, trials)));
        }
        return 0;
    }
    if (cache->trials != trials) {
        cache->trialsF = en;
        cache->lnGammaTrials = LnGammaFunc(en + 1.0);
        cache->trials = trials;
    }
    if (cache->p != pp) {
        cache->p = pp;
        cache->q = 1.0 - pp;
        cache->lnP = std::log(pp);
        cache->lnQ = std::log(cache->q);
    }
    const double trialsF = cache->trialsF, lnGammaTrials = cache->lnGammaTrials;
    const double lnP = cache->lnP, lnQ = cache->lnQ;
    const double sq = std::sqrt(2.0 * am * cache->q);
    Rejections rej(st);
    for (int32_t k = 0; k < n; ++k) {
        double em, yt, t;
        for (rej.Reset();;) {
            do {
                yt = std::tan(kPi * RandomUniform(st));
                em = sq * yt + am;
                if (!(em < 0.0 || em >= en + 1.0)) break;
                if (rej.GiveUp()) return NoConvergenceErr;
            } while (true);
            em = std::floor(em);
            t = 1.2 * sq * (1.0 + yt * yt) *
                std::exp(lnGammaTrials - LnGammaFunc(em + 1.0) - LnGammaFunc(trialsF - em + 1.0) + em * lnP +
                         (trialsF - em) * lnQ);
            if (!(RandomUniform(st) > t)) break;
            if (rej.GiveUp()) return NoConvergenceErr;
        }
        store(k, em);
    }
    return 0;
}

Status PeriodicNoise(double* y, int32_t n, double amplitude, RandomState* st) {
    if (n < 3) {  // no line between DC and Nyquist
        std::fill(y, y + n, 0.0);
        return 0;
    }
    FftTable* table = TakePeriodTable(n);
    if (table == nullptr) return OutOfMemoryErr;
    Scratch<double> hc;
    Status s = hc.Allocate(static_cast<size_t>(n));
    if (s == 0) {
        // Half-complex: Re X[k] at k, Im X[k] at n - k; DC and an even n's Nyquist line stay 0.
        double* h = hc.get();
        h[0] = 0.0;
        h[n / 2] = 0.0;  // the Nyquist line of an even n; for an odd n overwritten below
        const int32_t lines = n % 2 == 0 ? n / 2 - 1 : (n - 1) / 2;
        const double d = n * amplitude * 0.5;
        const PhaseTable& ph = Phases();
        for (int32_t k = 1; k <= lines; ++k) {
            // The integer itself is the phase in radians: reproducible, if not uniform on the
            // circle. Only records reached from seeds above 12558383 give negative phases.
            const int32_t phi = RandomInt15(st);
            const bool tabled = phi >= 0 && phi < kPhases;
            h[k] = d * (tabled ? ph.cs[phi][0] : std::cos(static_cast<double>(phi)));
            h[n - k] = d * (tabled ? ph.cs[phi][1] : std::sin(static_cast<double>(phi)));
        }
        s = FftRealInverse(table, h, y, 1, 1, n);
    }
    s = MergeRelease(s, hc.Release());
    KeepPeriodTable(table);
    return s;
}

}  // namespace tw
