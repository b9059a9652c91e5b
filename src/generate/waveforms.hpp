// Periodic waveforms on plain arrays. Phases are in degrees; *phase enters as the phase of y[0]
// and leaves as that of the sample after the block, folded into [0, 360).
#pragma once

#include <cstdint>

#include "frame/memory.hpp"

namespace tw {

// fmod into [0, 360).
double FoldDegrees(double p);

void SineWave(double* y, int32_t n, double amplitude, double frequency, double* phase);
void SquareWave(double* y, int32_t n, double amplitude, double frequency, double* phase, double duty);
void TriangleWave(double* y, int32_t n, double amplitude, double frequency, double* phase);
void SawtoothWave(double* y, int32_t n, double amplitude, double frequency, double* phase);
// NanInfErr, leaving y and *phase alone, when the phase or the frequency is not finite.
Status ArbitraryWave(double* y, int32_t n, double amplitude, double frequency, double* phase,
                     const double* table, int32_t m, int32_t interpolation);
void Chirp(double* y, int32_t n, double amplitude, double start, double end);

}  // namespace tw
