#include "transform/fft2d.hpp"

#include <algorithm>
#include <utility>

namespace tw {
namespace {

using cdouble = std::complex<double>;

// Columns transformed together: gathered row by row into unit-stride buffers, so each pass over
// the matrix reads a run of neighbours instead of one strided element.
constexpr int32_t kBatch = 8;

double* Lanes(cdouble* p) { return reinterpret_cast<double*>(p); }
const double* Lanes(const cdouble* p) { return reinterpret_cast<const double*>(p); }

size_t Idx(int32_t r, int32_t c, int32_t ld) {
    return static_cast<size_t>(r) * static_cast<size_t>(ld) + static_cast<size_t>(c);
}

// The placement of a column pass: column element i is read from row (i + readOffset) mod rows of
// src if i < present (else zero); column c is written to row (i + writeOffset) mod rows, column
// (c + colOffset) mod ldOut of dst.
struct ColumnPlan {
    int32_t ldIn, ldOut;
    int32_t present, readOffset, writeOffset, colOffset;
};

// Complex transforms of the first `ncols` columns of src into dst; src and dst may be the same
// matrix when nothing moves between columns.
template <bool Inverse>
Status ColumnPass(const FftTable* t, const cdouble* src, cdouble* dst, int32_t rows, int32_t ncols,
                  const ColumnPlan& p) {
    Scratch<cdouble> work;
    if (const Status s = work.Allocate(2 * static_cast<size_t>(kBatch) * static_cast<size_t>(rows))) return s;
    cdouble* in = work.get();
    cdouble* out = in + static_cast<size_t>(kBatch) * static_cast<size_t>(rows);
    for (int32_t c0 = 0; c0 < ncols; c0 += kBatch) {
        const int32_t nb = std::min(kBatch, ncols - c0);
        for (int32_t i = 0; i < p.present; ++i) {
            const cdouble* from = src + Idx((i + p.readOffset) % rows, c0, p.ldIn);
            for (int32_t b = 0; b < nb; ++b) in[Idx(b, i, rows)] = from[b];
        }
        for (int32_t b = 0; b < nb; ++b)
            std::fill(in + Idx(b, p.present, rows), in + Idx(b, rows, rows), cdouble{});
        for (int32_t b = 0; b < nb; ++b) {
            double* bi = Lanes(in + Idx(b, 0, rows));
            double* bo = Lanes(out + Idx(b, 0, rows));
            const Status s = Inverse ? FftComplexInverse(t, bi, bi + 1, bo, bo + 1, 2, 2, rows)
                                     : FftComplexForward(t, bi, bi + 1, bo, bo + 1, 2, 2, rows);
            if (s != 0) return MergeRelease(s, work.Release());
        }
        const int32_t d0 = (c0 + p.colOffset) % p.ldOut;
        const int32_t run = std::min(nb, p.ldOut - d0);  // the rest wraps to column 0
        for (int32_t i = 0; i < rows; ++i) {
            cdouble* row = dst + Idx((i + p.writeOffset) % rows, 0, p.ldOut);
            for (int32_t b = 0; b < run; ++b) row[d0 + b] = out[Idx(b, i, rows)];
            for (int32_t b = run; b < nb; ++b) row[b - run] = out[Idx(b, i, rows)];
        }
    }
    return work.Release();
}

// Rows actually present in the window, and its columns present in x.
int32_t PresentRows(const Fft2DWindow& w) { return std::min(w.rows, w.xRows - w.rowStart); }
int32_t PresentCols(const Fft2DWindow& w) { return w.xCols - w.colStart; }

bool BadStart(const Fft2DWindow& w) { return w.rowStart < 0 || w.colStart < 0; }

// Row r of the window, zero-padded to cols when the matrix ends first.
template <class T>
const T* WindowRow(const T* x, const Fft2DWindow& w, int32_t r, T* pad) {
    const T* row = x + Idx(w.rowStart + r, w.colStart, w.xCols);
    const int32_t avail = PresentCols(w);
    if (w.cols <= avail) return row;
    std::copy(row, row + avail, pad);
    std::fill(pad + avail, pad + w.cols, T{});
    return pad;
}

}  // namespace

namespace {

// The real transforms of the window's present rows, cut to their frequencies 0 .. cols/2: the
// rows of `half` (leading dimension cols/2 + 1).
Status RealRows(const FftTable* rowTable, const double* x, const Fft2DWindow& w, cdouble* half) {
    const int32_t cols = w.cols, width = cols / 2 + 1;
    Scratch<double> rowWork;
    Scratch<cdouble> unpacked;
    Status s = rowWork.Allocate(2 * static_cast<size_t>(cols));
    if (s == 0) s = unpacked.Allocate(static_cast<size_t>(cols));
    for (int32_t r = 0; s == 0 && r < PresentRows(w); ++r) {
        const double* row = WindowRow(x, w, r, rowWork.get() + cols);
        s = FftRealForward(rowTable, row, rowWork.get(), 1, 1, cols);
        if (s == 0) {
            FftUnpackHalfComplex(rowWork.get(), cols, 0, unpacked.get());
            std::copy(unpacked.get(), unpacked.get() + width, half + Idx(r, 0, width));
        }
    }
    s = MergeRelease(s, unpacked.Release());
    return MergeRelease(s, rowWork.Release());
}

}  // namespace

Status Fft2DRealForwardHalf(const FftTable* rowTable, const FftTable* colTable, const double* x,
                            const Fft2DWindow& w, cdouble* half) {
    if (BadStart(w)) return IndexRangeErr;
    const int32_t width = w.cols / 2 + 1;
    Status s = RealRows(rowTable, x, w, half);
    if (s == 0)
        s = ColumnPass<false>(colTable, half, half, w.rows, width, {width, width, PresentRows(w), 0, 0, 0});
    return s;
}

Status Fft2DRealInverseHalf(const FftTable* rowTable, const FftTable* colTable, const cdouble* half,
                            int32_t rows, int32_t cols, double* y) {
    const int32_t width = cols / 2 + 1;
    Scratch<cdouble> columns;
    Scratch<double> packed;
    Status s = columns.Allocate(static_cast<size_t>(rows) * static_cast<size_t>(width));
    if (s == 0) s = packed.Allocate(static_cast<size_t>(cols));
    if (s == 0)
        s = ColumnPass<true>(colTable, half, columns.get(), rows, width, {width, width, rows, 0, 0, 0});
    // Each row is Hermitian now: its frequencies 0 .. cols/2 make the packing of a real inverse.
    for (int32_t r = 0; s == 0 && r < rows; ++r) {
        FftPackHalfComplex(columns.get() + Idx(r, 0, width), cols, 0, packed.get());
        s = FftRealInverse(rowTable, packed.get(), y + Idx(r, 0, cols), 1, 1, cols);
    }
    s = MergeRelease(s, packed.Release());
    return MergeRelease(s, columns.Release());
}

Status Fft2DRealForward(const FftTable* rowTable, const FftTable* colTable, const double* x,
                        const Fft2DWindow& w, int32_t shift, cdouble* y) {
    if (BadStart(w)) return IndexRangeErr;
    const int32_t rows = w.rows, cols = w.cols, half = cols / 2 + 1, present = PresentRows(w);
    // Only the non-negative row frequencies 0 .. cols/2 are transformed down the columns.
    Scratch<cdouble> spectrum;
    Status s = spectrum.Allocate(static_cast<size_t>(rows) * static_cast<size_t>(half));
    if (s == 0) s = RealRows(rowTable, x, w, spectrum.get());
    const int32_t ro = shift != 0 ? rows / 2 : 0, co = shift != 0 ? cols / 2 : 0;
    if (s == 0)
        s = ColumnPass<false>(colTable, spectrum.get(), y, rows, half, {half, cols, present, 0, ro, co});
    if (s == 0) {
        // The rest by conjugate symmetry, Y[r][c] = conj Y[-r][-c], in place in y (in centred
        // order when shifted). Columns above cols/2 mirror transformed ones. The DC and (even
        // cols) Nyquist columns pair with themselves: their lower half is mirrored too, and their
        // self-paired entries are made real, so the result is exactly Hermitian.
        const auto col = [&](int32_t c) { return c + co < cols ? c + co : c + co - cols; };
        const int32_t nyquist = cols % 2 == 0 ? cols / 2 : -1;
        for (int32_t r = 0; r < rows; ++r) {
            const int32_t mr = r == 0 ? 0 : rows - r;
            cdouble* out = y + Idx((r + ro) % rows, 0, cols);
            const cdouble* mirror = y + Idx((mr + ro) % rows, 0, cols);
            // Runs of c in which neither the target nor the mirrored column wraps around.
            int32_t cuts[4] = {half, std::clamp(cols - co, half, cols), std::clamp(co + 1, half, cols), cols};
            if (cuts[1] > cuts[2]) std::swap(cuts[1], cuts[2]);
            for (int k = 0; k < 3; ++k) {
                cdouble* to = out + col(cuts[k]);
                const cdouble* from = mirror + col(cols - cuts[k]);
                for (int32_t j = 0; j < cuts[k + 1] - cuts[k]; ++j) to[j] = std::conj(from[-j]);
            }
            for (const int32_t c : {0, nyquist}) {
                if (c < 0 || r < mr) continue;
                const cdouble v = mirror[col(c)];
                out[col(c)] = r == mr ? cdouble{v.real(), 0.0} : std::conj(v);
            }
        }
    }
    return MergeRelease(s, spectrum.Release());
}

Status Fft2DComplexForward(const FftTable* rowTable, const FftTable* colTable, const cdouble* x,
                           const Fft2DWindow& w, int32_t shift, cdouble* y) {
    if (BadStart(w)) return IndexRangeErr;
    const int32_t rows = w.rows, cols = w.cols, present = PresentRows(w);
    Scratch<cdouble> pad;
    Status s = pad.Allocate(static_cast<size_t>(cols));
    for (int32_t r = 0; s == 0 && r < present; ++r) {
        const cdouble* row = WindowRow(x, w, r, pad.get());
        cdouble* out = y + Idx(r, 0, cols);
        s = FftComplexForward(rowTable, Lanes(row), Lanes(row) + 1, Lanes(out), Lanes(out) + 1, 2, 2, cols);
        if (s == 0 && shift != 0) std::rotate(out, out + (cols - cols / 2), out + cols);
    }
    if (s == 0)
        s = ColumnPass<false>(colTable, y, y, rows, cols,
                              {cols, cols, present, 0, shift != 0 ? rows / 2 : 0, 0});
    return MergeRelease(s, pad.Release());
}

namespace {

// The row pass of both inverses: S[r] = inverse transform of row r of x, rotation undone first.
Status InverseRows(const FftTable* rowTable, const cdouble* x, int32_t rows, int32_t cols, int32_t shift,
                   cdouble* S) {
    Scratch<cdouble> unrotated;
    Status s = shift != 0 ? unrotated.Allocate(static_cast<size_t>(cols)) : 0;
    for (int32_t r = 0; s == 0 && r < rows; ++r) {
        const cdouble* row = x + Idx(r, 0, cols);
        if (shift != 0) {
            std::rotate_copy(row, row + cols / 2, row + cols, unrotated.get());
            row = unrotated.get();
        }
        cdouble* out = S + Idx(r, 0, cols);
        s = FftComplexInverse(rowTable, Lanes(row), Lanes(row) + 1, Lanes(out), Lanes(out) + 1, 2, 2, cols);
    }
    return MergeRelease(s, unrotated.Release());
}

}  // namespace

Status Fft2DComplexInverse(const FftTable* rowTable, const FftTable* colTable, const cdouble* x, int32_t rows,
                           int32_t cols, int32_t shift, cdouble* y) {
    Scratch<cdouble> S;
    Status s = S.Allocate(static_cast<size_t>(rows) * static_cast<size_t>(cols));
    if (s == 0) s = InverseRows(rowTable, x, rows, cols, shift, S.get());
    if (s == 0)
        s = ColumnPass<true>(colTable, S.get(), y, rows, cols,
                             {cols, cols, rows, shift != 0 ? rows / 2 : 0, 0, 0});
    return MergeRelease(s, S.Release());
}

Status Fft2DRealInverse(const FftTable* rowTable, const FftTable* colTable, const cdouble* x, int32_t rows,
                        int32_t cols, int32_t shift, double* y) {
    Scratch<cdouble> S;
    Scratch<double> work;
    Status s = S.Allocate(static_cast<size_t>(rows) * static_cast<size_t>(cols));
    if (s == 0) s = InverseRows(rowTable, x, rows, cols, shift, S.get());
    // Per batch: the gathered columns (complex), their packings and the real results.
    const size_t n = static_cast<size_t>(rows), batch = static_cast<size_t>(kBatch);
    if (s == 0) s = work.Allocate(batch * n * 4);
    for (int32_t c0 = 0; s == 0 && c0 < cols; c0 += kBatch) {
        const int32_t nb = std::min(kBatch, cols - c0);
        auto* column = reinterpret_cast<cdouble*>(work.get());
        double* packed = work.get() + 2 * batch * n;
        double* real = packed + batch * n;
        for (int32_t i = 0; i < rows; ++i)
            for (int32_t b = 0; b < nb; ++b) column[Idx(b, i, rows)] = S.get()[Idx(i, c0 + b, cols)];
        for (int32_t b = 0; s == 0 && b < nb; ++b) {
            FftPackHalfComplex(column + Idx(b, 0, rows), rows, shift, packed + Idx(b, 0, rows));
            s = FftRealInverse(colTable, packed + Idx(b, 0, rows), real + Idx(b, 0, rows), 1, 1, rows);
        }
        for (int32_t i = 0; s == 0 && i < rows; ++i)
            for (int32_t b = 0; b < nb; ++b) y[Idx(i, c0 + b, cols)] = real[Idx(b, i, rows)];
    }
    s = MergeRelease(s, work.Release());
    return MergeRelease(s, S.Release());
}

}  // namespace tw
