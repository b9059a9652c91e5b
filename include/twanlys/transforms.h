/* Transforms built on the FFT: cosine and sine transforms, power and cross spectra.
 *
 * Every export returns its status; on failure (a negative status) its output is emptied. A cell
 * is a work cell that keeps the FFT table between calls (null before the first call). The _IDP
 * twins take the host's instance-data cell instead, released by TransformUnreserveProc. */
#ifndef TWANLYS_TRANSFORMS_H
#define TWANLYS_TRANSFORMS_H

#include "twanlys/types.h"

/* Orthonormal cosine transform of type II of x (f64), cut or zero-padded to size (below 1: the
 * count of x), into y (f64). */
TW_API int32_t DCT_1DH(Array1DHandle x, Array1DHandle y, int32_t size, void** cell);
/* Its inverse, the orthonormal type III, of the length of x. */
TW_API int32_t InvDCT_1DH(Array1DHandle x, Array1DHandle y, void** cell);
/* Unscaled sine transform of type I: y[k-1] = sum over j of x[j-1] sin(pi j k / (size+1)). */
TW_API int32_t DST_1DH(Array1DHandle x, Array1DHandle y, int32_t size, void** cell);
/* Its inverse: the same sum times 2 / (n+1). */
TW_API int32_t InvDST_1DH(Array1DHandle x, Array1DHandle y, void** cell);

/* Separable 2-D forms on f64 matrices: rows first, then columns. The forward forms cut or pad x to
 * rows x cols (below 1: the size of x). The first cell keeps the table of the row transforms (of
 * length cols), the second that of the column transforms. */
TW_API int32_t DCT_2DH(Array2DHandle x, Array2DHandle y, int32_t rows, int32_t cols, void** rowCell,
                       void** colCell);
TW_API int32_t InvDCT_2DH(Array2DHandle x, Array2DHandle y, void** rowCell, void** colCell);
TW_API int32_t DST_2DH(Array2DHandle x, Array2DHandle y, int32_t rows, int32_t cols, void** rowCell,
                       void** colCell);
TW_API int32_t InvDST_2DH(Array2DHandle x, Array2DHandle y, void** rowCell, void** colCell);

/* Instance-data twins; the 2-D ones keep the row table in slot 0 and the column table in slot 1. */
TW_API int32_t DCT_1DH_IDP(Array1DHandle x, Array1DHandle y, int32_t size, void** cell);
TW_API int32_t InvDCT_1DH_IDP(Array1DHandle x, Array1DHandle y, void** cell);
TW_API int32_t DST_1DH_IDP(Array1DHandle x, Array1DHandle y, int32_t size, void** cell);
TW_API int32_t InvDST_1DH_IDP(Array1DHandle x, Array1DHandle y, void** cell);
TW_API int32_t DCT_2DH_IDP(Array2DHandle x, Array2DHandle y, int32_t rows, int32_t cols, void** cell);
TW_API int32_t InvDCT_2DH_IDP(Array2DHandle x, Array2DHandle y, void** cell);
TW_API int32_t DST_2DH_IDP(Array2DHandle x, Array2DHandle y, int32_t rows, int32_t cols, void** cell);
TW_API int32_t InvDST_2DH_IDP(Array2DHandle x, Array2DHandle y, void** cell);

/* Two-sided power spectrum |X[k]|^2 / n^2 in the order of the DFT. SpectrumH replaces x (f64) by
 * it; CxSpectrumH writes that of complex x to y (f64). */
TW_API int32_t SpectrumH(Array1DHandle x, void** cell);
TW_API int32_t CxSpectrumH(Array1DHandle x, Array1DHandle y, void** cell);
/* Cross spectrum conj(X[k]) Y[k] / n^2 of two records of one length, into complex z. */
TW_API int32_t CrossSpectrumH(Array1DHandle x, Array1DHandle y, Array1DHandle z, void** cell);
TW_API int32_t CxCrossSpectrumH(Array1DHandle x, Array1DHandle y, Array1DHandle z, void** cell);

TW_API int32_t SpectrumH_IDP(Array1DHandle x, void** cell);
TW_API int32_t CxSpectrumH_IDP(Array1DHandle x, Array1DHandle y, void** cell);
TW_API int32_t CrossSpectrumH_IDP(Array1DHandle x, Array1DHandle y, Array1DHandle z, void** cell);
TW_API int32_t CxCrossSpectrumH_IDP(Array1DHandle x, Array1DHandle y, Array1DHandle z, void** cell);

/* Hartley, Hilbert, chirp-Z and Zak transforms. */

/* Fast Hartley transform of x (f64) in place: H[k] = Re X[k] - Im X[k] of its DFT X. The inverse
 * is the same transform times 1/n; a failure to get its table leaves x as it is. */
TW_API int32_t FHTH(Array1DHandle x, void** cell);
TW_API int32_t InvFHTH(Array1DHandle x, void** cell);
/* Hilbert transform of x (f64) in place: the spectrum times -i with DC and Nyquist cleared, so a
 * cosine at a bin becomes the sine. The inverse is its negation. */
TW_API int32_t FastHilbertTransformH(Array1DHandle x, void** cell);
TW_API int32_t InvFastHilbertTransformH(Array1DHandle x, void** cell);
TW_API int32_t FHTH_IDP(Array1DHandle x, void** cell);
TW_API int32_t InvFHTH_IDP(Array1DHandle x, void** cell);
TW_API int32_t FastHilbertTransformH_IDP(Array1DHandle x, void** cell);
TW_API int32_t InvFastHilbertTransformH_IDP(Array1DHandle x, void** cell);

/* Discrete Zak transform into outLength complex values of y: for each phase m below M the
 * length-N DFT H_m of x[m + j M] (zeros past the end of x), summed as
 * y[q] = sum over m of H_m[(p + q) mod N] exp(-2 pi i m (q0 + q) / (M N)), with p = offset mod N
 * and q0 = offset mod M N, both taken non-negative. A record longer than M N is first folded into
 * its first M N samples in place (x is changed): the samples from x[N] on are added to x[0], x[1],
 * ... pass by pass. An empty x gives an empty y and status 0. */
TW_API int32_t ReDZTH(Array1DHandle x, int32_t M, int32_t N, int32_t offset, int32_t outLength,
                      Array1DHandle y, void** cell);
TW_API int32_t CxDZTH(Array1DHandle x, int32_t M, int32_t N, int32_t offset, int32_t outLength,
                      Array1DHandle y, void** cell);
TW_API int32_t ReDZTH_IDP(Array1DHandle x, int32_t M, int32_t N, int32_t offset, int32_t outLength,
                          Array1DHandle y, void** cell);
TW_API int32_t CxDZTH_IDP(Array1DHandle x, int32_t M, int32_t N, int32_t offset, int32_t outLength,
                          Array1DHandle y, void** cell);

/* Chirp-Z transform of x (f64, or complex for the Cx form): y[j] = sum over k of x[k] A^(-k) W^(jk)
 * for j below m (below 1: the count of x), the powers z^t taken as (|z|^2)^(t/2) times
 * (cos t theta, sin t theta) with theta the principal argument of z. method 0 sums directly,
 * method 1 runs Bluestein's convolution (fast; its chirps W^(-t^2/2) suit |W| = 1). A and W must be
 * finite and not zero (a null pointer reads as NaN). */
TW_API int32_t ChirpZT_head(Array1DHandle x, const ComplexDouble* A, const ComplexDouble* W, int32_t m,
                            int32_t method, Array1DHandle y);
TW_API int32_t CxChirpZT_head(Array1DHandle x, const ComplexDouble* A, const ComplexDouble* W, int32_t m,
                              int32_t method, Array1DHandle y);
/* The m samples y (m at most the count n of x; below 1: n) whose chirp-Z with A and W gives x at
 * its first m points: the Vandermonde system of the nodes W^j solved exactly. Nodes that coincide
 * (W a root of unity of order below m) give DivideByZeroErr. */
TW_API int32_t InvChirpZT_head(Array1DHandle x, const ComplexDouble* A, const ComplexDouble* W, int32_t m,
                               Array1DHandle y);

#endif
