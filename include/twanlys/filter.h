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

/* ---- IIR design and filtering ---- */

/* IIR designs as cascades of sections with no stored leading 1: form 0 holds a1 a2 / b0 b1 b2 per
 * second-order section, form 1 a1..a4 / b0..b4 per fourth-order section. Filter type: 0 lowpass,
 * 1 highpass (cut-off fl, fh ignored), 2 bandpass, 3 bandstop. With s = (order + 1) / 2 sections
 * of the prototype, a and b receive 2s and 3s values (types 0, 1, form 0), 4t and 5t with
 * t = (s + 1) / 2 (types 0, 1, form 1), 4s and 6s (types 2, 3, form 0), 4s and 5s (types 2, 3,
 * form 1). Exports without the 90 use form 0 for types 0 and 1 and form 1 for types 2 and 3.
 * Ripple and attenuation are in dB; the inverse Chebyshev cut-off is the stop-band edge. */
TW_API int32_t BWCoefs(double* fs, double* fl, double* fh, int32_t* order, int32_t* type, Array1DHandle a,
                       Array1DHandle b, int32_t* status);
TW_API int32_t BWCoefs90(double* fs, double* fl, double* fh, int32_t* order, int32_t* type, int32_t form,
                         Array1DHandle a, Array1DHandle b, int32_t* status);
TW_API int32_t BesselCoefs(double* fs, double* fl, double* fh, int32_t* order, int32_t* type, Array1DHandle a,
                           Array1DHandle b, int32_t* status);
TW_API int32_t BesselCoefs90(double* fs, double* fl, double* fh, int32_t* order, int32_t* type, int32_t form,
                             Array1DHandle a, Array1DHandle b, int32_t* status);
TW_API int32_t ChebyshevCoefs(double* fs, double* fl, double* fh, double* ripple, int32_t* order,
                              int32_t* type, Array1DHandle a, Array1DHandle b, int32_t* status);
TW_API int32_t ChebyshevCoefs90(double* fs, double* fl, double* fh, double* ripple, int32_t* order,
                                int32_t* type, int32_t form, Array1DHandle a, Array1DHandle b,
                                int32_t* status);
TW_API int32_t InvChebyshevCoefs(double* fs, double* fl, double* fh, double* attenuation, int32_t* order,
                                 int32_t* type, Array1DHandle a, Array1DHandle b, int32_t* status);
TW_API int32_t InvChebyshevCoefs90(double* fs, double* fl, double* fh, double* attenuation, int32_t* order,
                                   int32_t* type, int32_t form, Array1DHandle a, Array1DHandle b,
                                   int32_t* status);
TW_API int32_t EllipticCoefs(double* fs, double* fl, double* fh, double* ripple, double* attenuation,
                             int32_t* order, int32_t* type, Array1DHandle a, Array1DHandle b,
                             int32_t* status);
TW_API int32_t EllipticCoefs90(double* fs, double* fl, double* fh, double* ripple, double* attenuation,
                               int32_t* order, int32_t* type, int32_t form, Array1DHandle a, Array1DHandle b,
                               int32_t* status);

/* Direct-form filtering in place: a = a0 a1 ..., b = b0 b1 ...; xState holds the nb - 1 previous
 * inputs and yState the na - 1 previous outputs, oldest first. No a: FIR. A state of the wrong
 * size is resized and zeroed; the state is zeroed unless *cont is 1. */
TW_API int32_t IIR_Filter(Array1DHandle x, Array1DHandle a, Array1DHandle b, Array1DHandle xState,
                          Array1DHandle yState, uint8_t* cont, int32_t* status);
/* One state array: the xState, then the yState. */
TW_API int32_t IIR_Filter_OneState(Array1DHandle x, Array1DHandle a, Array1DHandle b, Array1DHandle state,
                                   uint8_t* cont);
/* Cascade of the sections of the design exports, form 0 or 1; the state holds 2 or 4 internal
 * values per section, newest first. */
TW_API int32_t IIR_Filter2(Array1DHandle x, int32_t* form, Array1DHandle a, Array1DHandle b,
                           Array1DHandle state, uint8_t* cont, int32_t* status);
/* One sample. structure: 0, 1 cascade of form 0, 1; 2 direct form; 3 direct form with b alone
 * (FIR). The state is zeroed when *reset is not 0. */
TW_API int32_t IIR_Filter_PtbyPt(double* x, int32_t structure, Array1DHandle a, Array1DHandle b,
                                 Array1DHandle state, uint8_t* reset);

/* Complex signals and states, real coefficients. */
TW_API int32_t CxSigIIR_Filter(Array1DHandle x, Array1DHandle a, Array1DHandle b, Array1DHandle xState,
                               Array1DHandle yState, uint8_t* cont, int32_t* status);
TW_API int32_t CxSigIIR_Filter_OneState(Array1DHandle x, Array1DHandle a, Array1DHandle b,
                                        Array1DHandle state, uint8_t* cont);
TW_API int32_t CxSigIIR_Filter2(Array1DHandle x, int32_t* form, Array1DHandle a, Array1DHandle b,
                                Array1DHandle state, uint8_t* cont, int32_t* status);
TW_API int32_t CxSigIIR_Filter_PtbyPt(ComplexDouble* x, int32_t structure, Array1DHandle a, Array1DHandle b,
                                      Array1DHandle state, uint8_t* reset);

/* Complex direct-form coefficients: complex signal in place, or a real signal x into complex y. */
TW_API int32_t CxIIR_Filter_H(Array1DHandle x, Array1DHandle a, Array1DHandle b, Array1DHandle xState,
                              Array1DHandle yState, uint8_t* cont, int32_t* status);
TW_API int32_t CxIIRReSig_Filter_H(Array1DHandle x, Array1DHandle y, Array1DHandle a, Array1DHandle b,
                                   Array1DHandle xState, Array1DHandle yState, uint8_t* cont);

/* Forward-backward filtering with zero padding; the states are zeroed when cont is 0. */
TW_API int32_t zeroPhaseFiltH(Array1DHandle x, Array1DHandle a, Array1DHandle b, Array1DHandle xStateForward,
                              Array1DHandle xStateBackward, Array1DHandle yStateForward,
                              Array1DHandle yStateBackward, int32_t cont);
TW_API int32_t zeroPhaseCascadeFiltH(Array1DHandle x, int32_t* form, Array1DHandle a, Array1DHandle b,
                                     Array1DHandle stateForward, Array1DHandle stateBackward, int32_t cont);

/* ---- end of IIR ---- */

#endif
