// The library's inverse transforms for the Dolph-Chebyshev window, each on a table of its own for
// the call: a window is computed once, not in a loop, so caching would buy nothing.
#include <algorithm>

#include "transform/dct.hpp"
#include "window/dolph_chebyshev.hpp"

namespace tw {
namespace {

class CallTable {
public:
    explicit CallTable(int32_t n) : table(n > 0 ? CreateFftTable(n) : nullptr) {}
    CallTable(const CallTable&) = delete;
    CallTable& operator=(const CallTable&) = delete;
    ~CallTable() { DestroyFftTable(table); }
    FftTable* const table;
};

// v[0..h-1] as a half-complex sequence of length N with zero imaginary parts.
Status InverseReal(double* v, int32_t N, double* out) {
    const CallTable t(N);
    if (t.table == nullptr) return OutOfMemoryErr;
    Scratch<double> packed;
    Status s = packed.Allocate(static_cast<size_t>(N));
    if (s == 0) {
        const int32_t h = (N + 1) / 2;
        std::copy(v, v + h, packed.get());
        std::fill(packed.get() + h, packed.get() + N, 0.0);
        s = FftRealInverse(t.table, packed.get(), out, 1, 1, N);
    }
    return MergeRelease(s, packed.Release());
}

Status InverseCosine(double* v, int32_t h, double* out) {
    const CallTable t(TrigTableLength(TrigKind::CosInverse, h));
    if (t.table == nullptr) return OutOfMemoryErr;
    return TrigTransform(TrigKind::CosInverse, t.table, v, h, out, h);
}

}  // namespace

const ChebyshevTransforms kChebyshevTransforms = {InverseReal, InverseCosine};

}  // namespace tw
