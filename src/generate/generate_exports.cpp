#include "frame/frame.hpp"
#include "generate/block_frame.hpp"
#include "generate/waveforms.hpp"
#include "twanlys/generate.h"

using namespace tw;

namespace {

template <class Core>
int32_t Generate(Handle out, const int32_t* length, int32_t* status, Core core) {
    return FillByPointer<double>(out, *length, *length < 1 ? EmptyArrayErr : 0, status, core);
}

// The generators that cannot fail once the output stands.
template <class Fill>
int32_t Block(Handle out, const int32_t* length, int32_t* status, Fill fill) {
    return Generate(out, length, status, [&](Frame&, double* y, int32_t n) {
        fill(y, n);
        return Status{0};
    });
}

}  // namespace

TW_API int32_t SineWaveCIN(Array1DHandle out, int32_t* length, double* amplitude, double* frequency,
                           double* phase, int32_t* status) {
    return Block(out, length, status,
                 [&](double* y, int32_t n) { SineWave(y, n, *amplitude, *frequency, phase); });
}

TW_API int32_t SquareWaveCIN(Array1DHandle out, int32_t* length, double* amplitude, double* frequency,
                             double* phase, double* duty, int32_t* status) {
    return Block(out, length, status,
                 [&](double* y, int32_t n) { SquareWave(y, n, *amplitude, *frequency, phase, *duty); });
}

TW_API int32_t TriangleWaveCIN(Array1DHandle out, int32_t* length, double* amplitude, double* frequency,
                               double* phase, int32_t* status) {
    return Block(out, length, status,
                 [&](double* y, int32_t n) { TriangleWave(y, n, *amplitude, *frequency, phase); });
}

TW_API int32_t SawtoothWaveCIN(Array1DHandle out, int32_t* length, double* amplitude, double* frequency,
                               double* phase, int32_t* status) {
    return Block(out, length, status,
                 [&](double* y, int32_t n) { SawtoothWave(y, n, *amplitude, *frequency, phase); });
}

TW_API int32_t ArbitraryWaveCIN(Array1DHandle out, int32_t* length, double* amplitude, double* frequency,
                                double* phase, Array1DHandle table, int32_t* interpolation, int32_t* status) {
    return Generate(out, length, status, [&](Frame& f, double* y, int32_t n) {
        const double* wave = nullptr;
        if (const Status s = f.In(table, &wave)) return s;
        return ArbitraryWave(y, n, *amplitude, *frequency, phase, wave, Count(table), *interpolation);
    });
}

TW_API int32_t ChirpCIN(Array1DHandle out, int32_t* length, double* amplitude, double* start, double* end,
                        int32_t* status) {
    return Block(out, length, status, [&](double* y, int32_t n) { Chirp(y, n, *amplitude, *start, *end); });
}
