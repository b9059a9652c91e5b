// Cosine and sine transforms on the real and complex FFT.
//
// The cosine transform is the orthonormal type II, its inverse the orthonormal type III. The sine
// transform is type I, unscaled forward (y[k-1] = sum of x[j-1] sin(pi j k / (n+1))), and its
// inverse is the same sum times 2 / (n+1).
#pragma once

#include <cstddef>
#include <cstdint>

#include "frame/memory.hpp"
#include "transform/fft/fft.hpp"

namespace tw {

enum class TrigKind { CosForward, CosInverse, SinForward, SinInverse };

// Length of the FFT table that a transform of length n runs on; 0 when it would not fit an i32.
int32_t TrigTableLength(TrigKind kind, int32_t n);

// f64 working values that one transform of length n needs.
size_t TrigWorkLength(TrigKind kind, int32_t n);

// One transform of length n on a table of TrigTableLength(kind, n). x holds count values at stride
// inStride; beyond them it counts as zeros, and values beyond n are ignored. y gets n values at
// stride outStride and may be x itself. work holds TrigWorkLength(kind, n) values.
Status TrigTransformStrided(TrigKind kind, const FftTable* table, const double* x, int32_t count,
                            ptrdiff_t inStride, double* y, ptrdiff_t outStride, int32_t n, double* work);

// The same with its own scratch, contiguous.
Status TrigTransform(TrigKind kind, const FftTable* table, const double* x, int32_t count, double* y,
                     int32_t n);

// Separable 2-D form: the rows of x (xRows x xCols, cut or zero-padded to cols) transformed into y
// (rows x cols), then the columns of y in place. rowTable belongs to length cols, colTable to rows.
Status TrigTransform2D(TrigKind kind, const FftTable* rowTable, const FftTable* colTable, const double* x,
                       int32_t xRows, int32_t xCols, double* y, int32_t rows, int32_t cols);

}  // namespace tw
