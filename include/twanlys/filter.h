/* Filter design and filtering. */
#ifndef TWANLYS_FILTER_H
#define TWANLYS_FILTER_H

#include "twanlys/types.h"

/* ---------------------------------------------------------------------------------------------
 * FIR design and filtering
 * ------------------------------------------------------------------------------------------- */

/* A two-stage narrowband filter, written by FIRNarrowCoef_head and read by the narrowband
 * filters. filterClass: 0 lowpass, 1 highpass (alternated lowpass), 2 bandpass, 3 bandstop
 * (complement of a bandpass), 4 lowpass (complement of a highpass), 5 highpass (complement of a
 * lowpass). interpolation is L, the stretch of the model filter (1: single stage, image empty). */
#pragma pack(push, 1)
typedef struct {
    int32_t filterClass;
    int32_t interpolation;
    Array1DHandle model;
    Array1DHandle image;
} NarrowFilterSpec;
#pragma pack(pop)

/* Windowless truncated-sinc design of `taps` coefficients into h. type: 0 lowpass, 1 highpass, 2
 * bandpass, 3 bandstop; clamped into 0..3 and written back. Lowpass and highpass use fl only. */
TW_API int32_t FIRCoefs(double* fs, double* fl, double* fh, int32_t* taps, Array1DHandle h, int32_t* type,
                        int32_t* status);

/* Equiripple (minimax) linear-phase design by the Remez exchange on a grid of density 16. bands:
 * records of four f64 (gain, lower edge, upper edge, weight), ascending. kind: 0 multiband, 1
 * differentiator (gain is the slope), 2 Hilbert transformer. limit below 1 means 100; at most
 * limit - 1 exchanges are made. deviation receives the weighted peak error (NaN on refusal, the
 * last value when the exchange did not settle). Returns 2 when out of memory, else 0. */
TW_API int32_t Parks(int32_t* taps, double* fs, Array1DHandle bands, int32_t* kind, Array1DHandle h,
                     double* deviation, int32_t* limit, int32_t* status);

/* Narrowband design as an interpolated FIR (an image filter and a model filter stretched by L).
 * Edges: the pass edge first, then the stop edge; for the band types full widths around centre.
 * ripple is linear (each stage keeps its pass band within ripple / 2 of 1), attenuation in dB.
 * type: 0 lowpass, 1 highpass, 2 bandpass, 3 bandstop. On failure both arrays are emptied and
 * interpolation is 0. */
TW_API int32_t FIRNarrowCoef_head(double* fs, double* firstEdge, double* secondEdge, double* centre,
                                  double* ripple, double* attenuation, int32_t* type, NarrowFilterSpec* spec,
                                  int32_t* status);

/* Runs a narrowband design over x (one block, full convolution). */
TW_API int32_t FIRnarrowFilter_head(Array1DHandle x, NarrowFilterSpec* spec, Array1DHandle y, int32_t* status);
TW_API int32_t CxSigFIRnarrowFilter_head(Array1DHandle x, NarrowFilterSpec* spec, Array1DHandle y,
                                         int32_t* status);

/* Streaming multirate FIR. mode: 0 plain, 1 interpolate by L, 2 decimate by M (gain unused), 3
 * rational L/M. The state (past inputs or running accumulators) lives in `state`; `delay` output
 * samples are still to be dropped, `phase` is the decimating counter. reset, or an empty state,
 * starts afresh; compensate then drops the group delay of an odd-length h. Empty x: +20002. */
TW_API int32_t ppMultiRateFIRH_DBL(Array1DHandle x, Array1DHandle y, Array1DHandle state, int32_t mode, int32_t L,
                                   int32_t M, Array1DHandle h, double gain, uint8_t* reset, uint8_t* compensate,
                                   int32_t* delay, int32_t* phase);
TW_API int32_t ppMultiRateFIRH_SGL(Array1DHandle x, Array1DHandle y, Array1DHandle state, int32_t mode, int32_t L,
                                   int32_t M, Array1DHandle h, float gain, uint8_t* reset, uint8_t* compensate,
                                   int32_t* delay, int32_t* phase);
TW_API int32_t ppMultiRateFIRH_CDB(Array1DHandle x, Array1DHandle y, Array1DHandle state, int32_t mode, int32_t L,
                                   int32_t M, Array1DHandle h, double gain, uint8_t* reset, uint8_t* compensate,
                                   int32_t* delay, int32_t* phase);
TW_API int32_t ppMultiRateFIRH_CSG(Array1DHandle x, Array1DHandle y, Array1DHandle state, int32_t mode, int32_t L,
                                   int32_t M, Array1DHandle h, float gain, uint8_t* reset, uint8_t* compensate,
                                   int32_t* delay, int32_t* phase);

/* Single-purpose f64 streams. An empty x returns 0 and an empty y. The interpolator keeps
 * ceil(taps / L) cells of state, the decimator ceil(taps / M) accumulators and its counter (as
 * f64) in one more cell, the interpolated (stretched-tap) filter (taps - 1) L past inputs. */
TW_API int32_t InterpolatorFIRH(Array1DHandle x, Array1DHandle y, double gain, int32_t L, Array1DHandle h,
                                Array1DHandle state, uint8_t reset, int32_t* delay);
TW_API int32_t DecimatorFIRH(Array1DHandle x, Array1DHandle y, double gain, int32_t M, Array1DHandle h,
                             Array1DHandle state, uint8_t reset, int32_t startPhase, int32_t* delay);
TW_API int32_t InterpolatedFIRH(Array1DHandle x, Array1DHandle y, int32_t L, double gain, Array1DHandle h,
                                Array1DHandle state, uint8_t reset, int32_t* delay);

#endif
