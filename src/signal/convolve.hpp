// Linear convolution and correlation of sequences, the cores behind the convolution exports and
// every polynomial product of the filter code. All outputs hold the full nx + ny - 1 samples;
// lengths are at least 1 and outputs never alias inputs.
#pragma once

#include <complex>
#include <cstdint>

#include "frame/memory.hpp"
#include "transform/fft/fft.hpp"

namespace tw {

// The table of length n for one call, from the shared list. The last two lengths a thread used
// (up to 2^20 points) stay referenced until the thread ends, so that repeated calls of one size
// do not rebuild their twiddles each time.
class CallTable {
public:
    explicit CallTable(int32_t n);
    CallTable(const CallTable&) = delete;
    CallTable& operator=(const CallTable&) = delete;
    ~CallTable() { DestroyFftTable(t_); }
    FftTable* get() const { return t_; }

private:
    FftTable* t_;
};

// z = x * y directly: z zeroed, then z[i + j] += x[i] * y[j] with i outer and j inner. The loop
// order fixes the rounding, which callers (section merging, narrowband filters) rely on.
void ConvolveDirect(const double* x, int32_t nx, const double* y, int32_t ny, double* z);

// z = reverse(x) * y directly (full lags, z[nx - 1] the lag-0 sum), y outer and x inner.
void CorrelateDirect(const double* x, int32_t nx, const double* y, int32_t ny, double* z);

// Length of the frequency-domain 1-D work for an output of m samples.
int32_t ConvolutionFftLength(int32_t m);

// z = x * y through real transforms of length ConvolutionFftLength(nx + ny - 1).
Status ConvolveFrequency(const double* x, int32_t nx, const double* y, int32_t ny, double* z);

// z = reverse(x) * y through the same transforms (reverse(x) is formed in the padding).
Status CorrelateFrequency(const double* x, int32_t nx, const double* y, int32_t ny, double* z);

// The auto-correlation of x (2n - 1 lags, lag 0 at n - 1) from one transform and its power.
Status AutoCorrelateFrequency(const double* x, int32_t n, double* z);

// Complex z = x * y directly: each output a dot product over the overlap of the two sequences.
void CxConvolveDirect(const std::complex<double>* x, int32_t nx, const std::complex<double>* y, int32_t ny,
                      std::complex<double>* z);

// Complex z = x * y through complex transforms of length ConvolutionFftLength(nx + ny - 1).
Status CxConvolveFrequency(const std::complex<double>* x, int32_t nx, const std::complex<double>* y,
                           int32_t ny, std::complex<double>* z);

// Normalization of a full correlation of lengths nx and ny in place: 0 none, 1 unbiased (each
// lag divided by its count of overlapping terms), 2 biased (all divided by max(nx, ny)). Any
// other value leaves z as it is and gives InvalidSelectorErr.
template <class T>
Status NormalizeCorrelation(T* z, int32_t nx, int32_t ny, int32_t normalization);

// q of nx - ny + 1 samples with y * q = x (1 <= ny <= nx, y not all zero): divided in the
// frequency domain on a power-of-two length, or by long division when the divisor's transform
// has a (near) zero at one of the bin pairs tested.
Status Deconvolve(const double* x, int32_t nx, const double* y, int32_t ny, double* q);

// Full 2-D convolution of x (r1 x c1) and y (r2 x c2) into z of (r1 + r2 - 1) x (c1 + c2 - 1),
// row-major, T double or std::complex<double>. Direct: the input with fewer elements is the
// kernel, every term bounds-tested. Frequency: both padded to exactly the full size (no length
// rule) and multiplied under 2-D complex transforms; the real form keeps the real part.
template <class T>
void Convolve2DDirect(const T* x, int32_t r1, int32_t c1, const T* y, int32_t r2, int32_t c2, T* z);
template <class T>
Status Convolve2DFrequency(const T* x, int32_t r1, int32_t c1, const T* y, int32_t r2, int32_t c2, T* z);

}  // namespace tw
