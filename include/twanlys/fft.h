/* One-dimensional FFT of every length, and the shared table list behind it. */
#ifndef TWANLYS_FFT_H
#define TWANLYS_FFT_H

#include "twanlys/types.h"

/* The plan of one length, shared by all users through a reference count. */
typedef struct FftTable FftTable;

/* A table of length n with one reference added; null if n is below 1 or memory runs out. */
TW_API FftTable* create_qxfft_table(int32_t n);
/* Drops one reference; the table goes when none is left. Null is a no-op. */
TW_API void destroy_qxfft_table(FftTable* table);

/* Forward transforms of real data x (f64) from x[start], zero-padded or truncated to size; y gets
 * the full spectrum (complex), centred with the DC term at size/2 when shift is non-zero. cell is a
 * work cell holding the cached table (null before the first call). */
TW_API int32_t ReQXFFTH80(Array1DHandle x, Array1DHandle y, void** cell, int32_t start, int32_t size,
                          int32_t shift);
TW_API int32_t ReQXFFTH(Array1DHandle x, Array1DHandle y, void** cell);
/* y (f64) gets the half-complex packing of the transform of x. */
TW_API int32_t ReQXFFTHCH(Array1DHandle x, Array1DHandle y, void** cell);
/* Real inverse of a spectrum x (complex); only the non-negative frequencies are read. */
TW_API int32_t InvReQXFFTH80(Array1DHandle x, Array1DHandle y, void** cell, int32_t shift);
TW_API int32_t InvReQXFFTH(Array1DHandle x, Array1DHandle y, void** cell);
/* Real inverse of a half-complex packing x (f64), which is scaled and changed in place. */
TW_API int32_t InvReQXFFTHCH(Array1DHandle x, Array1DHandle y, void** cell);
/* Complex forward transform; start is not tested (a window outside x reads zeros). */
TW_API int32_t CxQXFFTH80(Array1DHandle x, Array1DHandle y, void** cell, int32_t start, int32_t size,
                          int32_t shift);
TW_API int32_t CxQXFFTH(Array1DHandle x, Array1DHandle y, void** cell);
TW_API int32_t InvCxQXFFTH80(Array1DHandle x, Array1DHandle y, void** cell, int32_t shift);
TW_API int32_t InvCxQXFFTH(Array1DHandle x, Array1DHandle y, void** cell);

/* Instance-data twins: cell is the host's instance-data cell, released by TransformUnreserveProc. */
TW_API int32_t ReQXFFTH80_IDP(Array1DHandle x, Array1DHandle y, void** cell, int32_t start,
                              int32_t size, int32_t shift);
TW_API int32_t ReQXFFTHCH_IDP(Array1DHandle x, Array1DHandle y, void** cell);
TW_API int32_t InvReQXFFTH80_IDP(Array1DHandle x, Array1DHandle y, void** cell, int32_t shift);
TW_API int32_t InvReQXFFTHCH_IDP(Array1DHandle x, Array1DHandle y, void** cell);
TW_API int32_t CxQXFFTH80_IDP(Array1DHandle x, Array1DHandle y, void** cell, int32_t start,
                              int32_t size, int32_t shift);
TW_API int32_t InvCxQXFFTH80_IDP(Array1DHandle x, Array1DHandle y, void** cell, int32_t shift);

#endif
