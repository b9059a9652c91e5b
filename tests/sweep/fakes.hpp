// Exports with one fault each, for the sweep's self-tests (defined in selftest_internal_test.cpp).
#pragma once

#include "twanlys/types.h"

TW_EXTERN_C int32_t SweepFakeGood(Array1DHandle x, Array1DHandle y);
TW_EXTERN_C int32_t SweepFakeLeaky(Array1DHandle x, Array1DHandle y);
TW_EXTERN_C int32_t SweepFakeNoShrink(Array1DHandle x, Array1DHandle y);
TW_EXTERN_C int32_t SweepFakeWritesInput(Array1DHandle x, double* mean, int32_t* status);
TW_EXTERN_C int32_t SweepFakeNoNaN(Array1DHandle x, double* mean, int32_t* status);
TW_EXTERN_C int32_t SweepFakeHalfZero(Array1DHandle x, ComplexDouble* z, int32_t* status);
TW_EXTERN_C int32_t SweepFakeStrangeStatus(Array1DHandle x);
TW_EXTERN_C int32_t SweepFakeCounter(Array1DHandle x, Array1DHandle y);
TW_EXTERN_C int32_t SweepFakeIgnoresFlag(Array1DHandle y, double* mse, int32_t coefficientsOnly);
TW_EXTERN_C void SweepFakeBufAlignment(int32_t n, double* x);
TW_EXTERN_C int32_t SweepFakeCubeWrites(NumericHandle data, double* sum);
TW_EXTERN_C int32_t SweepFakeOffSet(Array1DHandle x);
