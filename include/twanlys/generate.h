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

/* Caller-held records, packed as the host lays them out. GaussSpare keeps the second value of a
 * polar pair between calls of Gauss (12 bytes); BinomialCache keeps what BinomialNoiseH derives
 * from the folded probability and the trial count (52 bytes). Zeros are a valid start for both. */
#pragma pack(push, 4)
typedef struct {
    int32_t haveSpare;
    double spare;
} GaussSpare;

typedef struct {
    double p;
    double q;
    double lnP;
    double lnQ;
    double trialsF;
    double lnGammaTrials;
    int32_t trials;
} BinomialCache;
#pragma pack(pop)

/* Noise. Every generator reseeds when its seed is at least 0 (Gauss: above 0, which also drops
 * the spare) and otherwise continues the caller's stream; the record is left after the last draw.
 * white, Gauss and PeriodNoise report through the status pointer and return 0 or the host's own
 * resize code; the others return the status. A rejection sampler that rejects 100000 times in a
 * row (a record stuck at zero, a mean beyond what f64 resolves) gives NoConvergenceErr. */
TW_API int32_t white(Array1DHandle out, int32_t* length, double* amplitude, int32_t* seed, int32_t* status,
                     RandomState* state);
TW_API int32_t Gauss(Array1DHandle out, int32_t* length, double* deviation, int32_t* seed, int32_t* status,
                     RandomState* state, GaussSpare* spare);
/* Period n, a flat line spectrum of amplitude A per line, integer phases in radians. */
TW_API int32_t PeriodNoise(int32_t* length, double* amplitude, int32_t* seed, Array1DHandle out,
                           int32_t* status, RandomState* state);
TW_API AnalysisStatus GammaNoiseH(Array1DHandle out, int32_t length, int32_t order, int32_t seed,
                                  RandomState* state);
TW_API AnalysisStatus PoissonNoiseH(Array1DHandle out, int32_t length, double mean, int32_t seed,
                                    RandomState* state);
/* u32 output. */
TW_API AnalysisStatus BinomialNoiseH(Array1DHandle out, int32_t length, int32_t trials, double probability,
                                     int32_t seed, RandomState* state, BinomialCache* cache);

/* Patterns: one-shot sequences, status through the pointer; the result is 0, or the host's own
 * code when resizing the output failed. Phase in degrees, duty in percent. */
TW_API int32_t SinePtrn(Array1DHandle out, int32_t* length, double* amplitude, double* phase, double* cycles,
                        int32_t* status);
/* Unipolar: amplitude for the high part of each period, 0 otherwise. Duty not positive gives
 * PeriodNotPositiveErr; cycles not positive or above length/2 DutyRangeErr. */
TW_API int32_t Square(Array1DHandle out, int32_t* length, double* amplitude, double* duty, double* cycles,
                      int32_t* status);
TW_API int32_t PulsePtrn(Array1DHandle out, int32_t* length, double* amplitude, int32_t* delay,
                         int32_t* width, int32_t* status);
TW_API int32_t ImpulsePtrn(Array1DHandle out, int32_t* length, double* amplitude, int32_t* delay,
                           int32_t* status);
TW_API int32_t SincWave(Array1DHandle out, int32_t* length, double* amplitude, double* delay, double* dt,
                        int32_t* status);
TW_API int32_t RampPtrn(Array1DHandle out, int32_t* length, double* start, double* end, int32_t* status);
TW_API AnalysisStatus RampPtrn80(Array1DHandle out, int32_t length, double start, double end,
                                 int32_t excludeEnd);
/* scale 0 linear, 1 logarithmic. excludeEnd 0 ends on end exactly; 1 stops a step short of it. */
TW_API AnalysisStatus RampPtrn85(Array1DHandle out, int32_t length, double start, double end,
                                 int32_t excludeEnd, uint32_t scale);

/* Pulses. An out array that arrives non-empty holds the times to evaluate at (its count replaces
 * the length; dt and delay are then ignored) and is overwritten with the shape; an empty one is
 * sampled at t = k dt - delay. */
TW_API AnalysisStatus AperiodTriangleH(Array1DHandle out, int32_t length, double amplitude, double delay,
                                       double dt, double width, double skew);
/* bandwidth is fractional, measured at attenuation dB below the peak. */
TW_API AnalysisStatus GaussPulseH(Array1DHandle out, int32_t length, double amplitude, double delay,
                                  double dt, double centerFrequency, double bandwidth, double attenuation);
TW_API AnalysisStatus GaussMonopulseH(Array1DHandle out, int32_t length, double dt, double delay,
                                      double centerFrequency, double amplitude);
TW_API AnalysisStatus PeriodicSincH(Array1DHandle out, int32_t length, double amplitude, int32_t order,
                                    double dt, double delay);

/* Shuffles in place and reports the permutation applied (data out = data in [permutation]).
 * algorithm 0 is the older non-uniform shuffle kept for unchanged results; any other value is
 * Fisher-Yates. The forms without an algorithm use 0. */
TW_API AnalysisStatus RiffleArrayDBL2012_head(Array1DHandle data, Array1DHandle permutation, int32_t seed,
                                              RandomState* state, int32_t algorithm);
TW_API AnalysisStatus RiffleArrayInt2012_head(Array1DHandle data, Array1DHandle permutation, int32_t seed,
                                              RandomState* state, int32_t algorithm);
TW_API AnalysisStatus RiffleArrayCDB2012_head(Array1DHandle data, Array1DHandle permutation, int32_t seed,
                                              RandomState* state, int32_t algorithm);
/* A shuffled permutation of 0 .. n-1 alone. */
TW_API AnalysisStatus RiffleIntNum2012_head(Array1DHandle permutation, int32_t n, int32_t seed,
                                            RandomState* state, int32_t algorithm);
TW_API AnalysisStatus RiffleArrayDBL_head(Array1DHandle data, Array1DHandle permutation, int32_t seed,
                                          RandomState* state);
TW_API AnalysisStatus RiffleArrayInt_head(Array1DHandle data, Array1DHandle permutation, int32_t seed,
                                          RandomState* state);
TW_API AnalysisStatus RiffleArrayCDB_head(Array1DHandle data, Array1DHandle permutation, int32_t seed,
                                          RandomState* state);
TW_API AnalysisStatus RiffleIntNum_head(Array1DHandle permutation, int32_t n, int32_t seed,
                                        RandomState* state);

#endif
