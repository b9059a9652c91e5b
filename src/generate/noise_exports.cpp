#include <cmath>

#include "frame/frame.hpp"
#include "generate/block_frame.hpp"
#include "generate/noise.hpp"
#include "generate/random.hpp"
#include "twanlys/generate.h"

using namespace tw;

namespace {

Status Length(int32_t n) { return n < 1 ? EmptyArrayErr : 0; }

// The record a generator draws from; a missing one is a fresh record of zeros for this call.
struct Source {
    explicit Source(RandomState* caller) : st(caller != nullptr ? caller : &local) {}
    RandomState local{0, 0, 0};
    RandomState* st;
};

// Validation comes first, so a refused call leaves the record as it was; the seed applies only
// once the output stands.
template <class T, class Draw>
Status Noise(Handle out, int32_t n, Status checked, int32_t seed, RandomState* state, Draw draw) {
    return FillReturned<T>(out, n, checked == 0 ? Length(n) : checked, [&](Frame&, T* y, int32_t m) {
        Source src(state);
        ApplySeed(seed, src.st);
        return draw(y, m, src.st);
    });
}

}  // namespace

TW_API int32_t white(Array1DHandle out, int32_t* length, double* amplitude, int32_t* seed, int32_t* status,
                     RandomState* state) {
    return FillByPointer<double>(out, *length, Length(*length), status, [&](Frame&, double* y, int32_t n) {
        Source src(state);
        ApplySeed(*seed, src.st);
        WhiteNoise(y, n, *amplitude, src.st);
        return Status{0};
    });
}

TW_API int32_t Gauss(Array1DHandle out, int32_t* length, double* deviation, int32_t* seed, int32_t* status,
                     RandomState* state, GaussSpare* spare) {
    return FillByPointer<double>(out, *length, Length(*length), status, [&](Frame&, double* y, int32_t n) {
        Source src(state);
        GaussSpare local{0, 0.0};
        GaussSpare* rec = spare != nullptr ? spare : &local;
        if (*seed > 0) {
            RandomSeed(*seed, src.st);
            rec->haveSpare = 0;
            rec->spare = 0.0;
        }
        return GaussNoise(y, n, *deviation, src.st, rec);
    });
}

TW_API int32_t PeriodNoise(int32_t* length, double* amplitude, int32_t* seed, Array1DHandle out,
                           int32_t* status, RandomState* state) {
    return FillByPointer<double>(out, *length, Length(*length), status, [&](Frame&, double* y, int32_t n) {
        Source src(state);
        ApplySeed(*seed, src.st);
        return PeriodicNoise(y, n, *amplitude, src.st);
    });
}

TW_API AnalysisStatus GammaNoiseH(Array1DHandle out, int32_t length, int32_t order, int32_t seed,
                                  RandomState* state) {
    const Status checked = order < 1 ? InvalidSelectorErr : 0;
    return Noise<double>(out, length, checked, seed, state,
                         [&](double* y, int32_t n, RandomState* st) { return GammaNoise(y, n, order, st); });
}

TW_API AnalysisStatus PoissonNoiseH(Array1DHandle out, int32_t length, double mean, int32_t seed,
                                    RandomState* state) {
    const Status checked = mean < 0 || std::isnan(mean) ? InvalidSelectorErr : 0;
    return Noise<double>(out, length, checked, seed, state,
                         [&](double* y, int32_t n, RandomState* st) { return PoissonNoise(y, n, mean, st); });
}

TW_API AnalysisStatus BinomialNoiseH(Array1DHandle out, int32_t length, int32_t trials, double probability,
                                     int32_t seed, RandomState* state, BinomialCache* cache) {
    const Status checked = trials < 0 || !(probability >= 0 && probability <= 1) ? InvalidSelectorErr : 0;
    return Noise<uint32_t>(out, length, checked, seed, state, [&](uint32_t* y, int32_t n, RandomState* st) {
        BinomialCache local{0, 0, 0, 0, 0, 0, 0};
        return BinomialNoise(y, n, trials, probability, st, cache != nullptr ? cache : &local);
    });
}
