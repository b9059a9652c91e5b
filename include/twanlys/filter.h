/* Filter design and filtering. */
#ifndef TWANLYS_FILTER_H
#define TWANLYS_FILTER_H

#include "twanlys/types.h"

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
