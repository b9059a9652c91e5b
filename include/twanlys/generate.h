/* Waveform and noise generation. */
#ifndef TWANLYS_GENERATE_H
#define TWANLYS_GENERATE_H

#include "twanlys/types.h"

/* The caller-held state of the uniform random source shared by the noise generators and
 * shuffles: three congruential states, moduli 30269, 30307 and 30323. Three zeros are legal (the
 * stream then stays at 0). */
typedef struct {
    int32_t s1;
    int32_t s2;
    int32_t s3;
} RandomState;

/* Periodic waveforms. Frequency is in cycles per sample; the phase is in degrees, enters as the
 * phase of the first sample and leaves as that of the sample after the block, folded into
 * [0, 360). The status goes to the last argument; the result is 0, or the host's own code when
 * resizing the output failed. */
TW_API int32_t SineWaveCIN(Array1DHandle out, int32_t* length, double* amplitude, double* frequency,
                           double* phase, int32_t* status);
TW_API int32_t SquareWaveCIN(Array1DHandle out, int32_t* length, double* amplitude, double* frequency,
                             double* phase, double* duty, int32_t* status);
TW_API int32_t TriangleWaveCIN(Array1DHandle out, int32_t* length, double* amplitude, double* frequency,
                               double* phase, int32_t* status);
TW_API int32_t SawtoothWaveCIN(Array1DHandle out, int32_t* length, double* amplitude, double* frequency,
                               double* phase, int32_t* status);
/* One period of the wave is the table; interpolation 1 is linear, any other value takes the
 * sample at or below the position. */
TW_API int32_t ArbitraryWaveCIN(Array1DHandle out, int32_t* length, double* amplitude, double* frequency,
                                double* phase, Array1DHandle table, int32_t* interpolation, int32_t* status);
/* A linear chirp from start to end frequency over the block; no phase is carried. */
TW_API int32_t ChirpCIN(Array1DHandle out, int32_t* length, double* amplitude, double* start, double* end,
                        int32_t* status);

#endif
