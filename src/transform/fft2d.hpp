// Two-dimensional FFT: row transforms on a table of length cols, then column transforms on a table
// of length rows. Centred order (shift non-zero) puts the DC term at (rows/2, cols/2) for both
// parities; the inverses undo exactly that.
#pragma once

#include <complex>
#include <cstdint>

#include "frame/memory.hpp"
#include "transform/fft/fft.hpp"

namespace tw {

// Where the forward transforms read: the rows x cols window of a matrix of xRows x xCols starting
// at (rowStart, colStart), zero outside the matrix. A negative start is IndexRangeErr.
struct Fft2DWindow {
    int32_t xRows, xCols;
    int32_t rowStart, colStart;
    int32_t rows, cols;
};

// y (rows x cols) is the spectrum of the real window; exactly conjugate-symmetric.
Status Fft2DRealForward(const FftTable* rowTable, const FftTable* colTable, const double* x,
                        const Fft2DWindow& w, int32_t shift, std::complex<double>* y);
Status Fft2DComplexForward(const FftTable* rowTable, const FftTable* colTable, const std::complex<double>* x,
                           const Fft2DWindow& w, int32_t shift, std::complex<double>* y);

// Inverses of a rows x cols spectrum x (scaled by 1/(rows cols)). The real one reads only the
// non-negative frequencies of each column after the row transforms: for any x it gives
// irfft(ifft(x, axis 1), axis 0).
Status Fft2DComplexInverse(const FftTable* rowTable, const FftTable* colTable, const std::complex<double>* x,
                           int32_t rows, int32_t cols, int32_t shift, std::complex<double>* y);
Status Fft2DRealInverse(const FftTable* rowTable, const FftTable* colTable, const std::complex<double>* x,
                        int32_t rows, int32_t cols, int32_t shift, double* y);

// The half spectrum of a real window, unshifted: frequencies 0 .. cols/2 along the rows, all
// rows, as rows x (cols/2 + 1); and the real rows x cols inverse of such a half spectrum (columns
// first, then the rows' real inverses). The convolutions of real data work on these.
Status Fft2DRealForwardHalf(const FftTable* rowTable, const FftTable* colTable, const double* x,
                            const Fft2DWindow& w, std::complex<double>* half);
Status Fft2DRealInverseHalf(const FftTable* rowTable, const FftTable* colTable,
                            const std::complex<double>* half, int32_t rows, int32_t cols, double* y);

}  // namespace tw
