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

/* Two-dimensional transforms, rows first, then columns. The forward exports transform the rows x
 * cols window of x starting at (rowStart, colStart), zero-padded where x ends; y is rows x cols,
 * centred with the DC term at (rows/2, cols/2) when shift is non-zero. The spectrum of real data
 * is exactly conjugate-symmetric. rowCell holds the table of length cols, colCell that of length
 * rows; the _IDP twins keep them in slots 0 and 1 of one instance-data record. */
TW_API int32_t ReFFT2D_H(Array2DHandle x, int32_t rowStart, int32_t colStart, int32_t rows, int32_t cols,
                         int32_t shift, Array2DHandle y, void** rowCell, void** colCell);
TW_API int32_t CxFFT2D_H(Array2DHandle x, int32_t rowStart, int32_t colStart, int32_t rows, int32_t cols,
                         int32_t shift, Array2DHandle y, void** rowCell, void** colCell);
/* Inverses of a complex x of the same size; shift undoes the centred order. The real inverse
 * reads only the non-negative frequencies of each column after the row transforms. */
TW_API int32_t ReInvFFT2D_H(Array2DHandle x, int32_t shift, Array2DHandle y, void** rowCell, void** colCell);
TW_API int32_t CxInvFFT2D_H(Array2DHandle x, int32_t shift, Array2DHandle y, void** rowCell, void** colCell);
TW_API int32_t ReFFT2D_H_IDP(Array2DHandle x, int32_t rowStart, int32_t colStart, int32_t rows, int32_t cols,
                             int32_t shift, Array2DHandle y, void** cell);
TW_API int32_t CxFFT2D_H_IDP(Array2DHandle x, int32_t rowStart, int32_t colStart, int32_t rows, int32_t cols,
                             int32_t shift, Array2DHandle y, void** cell);
TW_API int32_t ReInvFFT2D_H_IDP(Array2DHandle x, int32_t shift, Array2DHandle y, void** cell);
TW_API int32_t CxInvFFT2D_H_IDP(Array2DHandle x, int32_t shift, Array2DHandle y, void** cell);

#endif
