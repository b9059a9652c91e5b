// Direct-form and cascade filtering on caller-held state. The filters read and write the host's
// packed blocks in place, so every element goes through Cells (a memcpy, free once compiled)
// instead of a staged aligned copy: a filter call then allocates nothing except the FIR tail and
// the zero-phase buffer.
#pragma once

#include <complex>
#include <cstdint>
#include <cstring>

#include "frame/memory.hpp"

namespace tw {

// Elements of type T at any byte address.
template <class T>
struct Cells {
    unsigned char* p = nullptr;

    Cells() = default;
    explicit Cells(const void* at) : p(static_cast<unsigned char*>(const_cast<void*>(at))) {}
    T operator[](int64_t i) const {
        T v;
        std::memcpy(&v, p + i * static_cast<int64_t>(sizeof(T)), sizeof(T));
        return v;
    }
    void Set(int64_t i, const T& v) const {
        std::memcpy(p + i * static_cast<int64_t>(sizeof(T)), &v, sizeof(T));
    }
    Cells operator+(int64_t i) const { return Cells(p + i * static_cast<int64_t>(sizeof(T))); }
};

// y[i] = (sum b[j] x[i-j] - sum_{j>=1} a[j] y[i-j]) / a[0] over n samples; y may be x itself.
// xState holds the nb - 1 previous inputs and yState the na - 1 previous outputs, oldest first.
// na == 0 is the FIR mode (no recursion, no flush; needs a scratch tail of min(nb - 1, n)
// inputs); otherwise the sums run from the oldest term down, and every output at or below the
// smallest normal is flushed to 0 before it enters yState. nb >= 1.
// In/Out/C: (double, double, double), (cdouble, cdouble, double), (cdouble, cdouble, cdouble)
// and (double, cdouble, cdouble).
template <class In, class Out, class C>
Status IirDirectFilter(Cells<In> x, Cells<Out> y, int32_t n, Cells<C> a, int32_t na, Cells<C> b, int32_t nb,
                       Cells<In> xState, Cells<Out> yState);

// Cascade of sections of order m = 2 (form 0) or 4 (form 1), direct form II each, in place on n
// samples. Section k has a[m k .. m k + m - 1] (no leading 1), b[(m + 1) k ..] and the internal
// values state[m k ..], newest first. T is double or cdouble.
template <class T>
void IirCascadeFilter(Cells<T> x, int32_t n, Cells<double> a, Cells<double> b, int32_t form, int32_t sections,
                      Cells<T> state);

// Forward-backward filtering of n samples padded with P zeros on both sides, P = max(na, nb).
Status ZeroPhaseFilter(Cells<double> x, int32_t n, Cells<double> a, int32_t na, Cells<double> b, int32_t nb,
                       Cells<double> xForward, Cells<double> yForward, Cells<double> xBackward,
                       Cells<double> yBackward);

// The same with a cascade; the padding follows from the first section's true order.
Status ZeroPhaseCascadeFilter(Cells<double> x, int32_t n, Cells<double> a, Cells<double> b, int32_t form,
                              int32_t sections, Cells<double> forward, Cells<double> backward);

}  // namespace tw
