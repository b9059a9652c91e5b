#include <algorithm>
#include <cstring>

#include "frame/frame.hpp"
#include "stats/anova.hpp"
#include "twanlys/anova.h"

using namespace tw;

namespace {

// betweenSS, betweenMS, F, p, withinSS, withinMS, totalSS, critical F (null when not wanted).
int32_t OneWay(Handle data, Handle labels, int32_t k, double alpha, double* const (&out)[8],
               int32_t* status) {
    Frame f(FailOn::NonZero);
    for (double* r : out) f.Result(r);
    const int32_t n = Count(data);
    const double* xs = nullptr;
    const int32_t* ls = nullptr;
    Status s = n < 1 ? EmptyArrayErr : Count(labels) != n ? EqSamplesErr : f.In(data, &xs);
    if (s == 0) s = f.In(labels, &ls);
    OneWayResult r{};
    if (s == 0) s = OneWayAnova(xs, ls, n, k, alpha, &r);
    if (s == 0) {
        const double values[8] = {r.betweenSS, r.betweenMS, r.f,      r.p,
                                  r.withinSS,  r.withinMS,  r.totalSS, r.criticalF};
        for (int i = 0; i < 8; ++i)
            if (out[i] != nullptr) *out[i] = values[i];
    }
    return ToPointer(status, f.Finish(s));
}

// The frame of the factorial designs. The older exports ask for 4 columns: the table is computed
// in full (alpha 0) and its critical-F column dropped.
template <int Factors, class Core>
int32_t FactorialFrame(Handle data, Handle const (&labels)[Factors], int32_t cols, Handle table,
                       double* const (&p)[(1 << Factors) - 1], int32_t* status, Core core) {
    constexpr int kRows = 1 << Factors;
    Frame f(FailOn::NonZero);
    f.Output2D<double>(table);
    for (double* r : p) f.Result(r);
    const int32_t n = Count(data);
    const double* xs = nullptr;
    const int32_t* ls[Factors] = {};
    Status s = 0;
    for (Handle h : labels)
        if (Count(h) != n) s = EqSamplesErr;
    if (s == 0) s = f.In(data, &xs);
    for (int i = 0; i < Factors && s == 0; ++i) s = f.In(labels[i], &ls[i]);
    double full[kRows * kAnovaColumns];
    double tails[kRows - 1];
    if (s == 0) s = core(xs, ls, n, full, tails);
    double* out = nullptr;
    if (s == 0 && f.Resize2D(table, kRows, cols, &out) != 0) s = OutOfMemoryErr;
    if (s == 0) {
        for (int r = 0; r < kRows; ++r)
            std::memcpy(out + r * cols, full + r * kAnovaColumns, sizeof(double) * static_cast<size_t>(cols));
        for (int i = 0; i < kRows - 1; ++i)
            if (p[i] != nullptr) *p[i] = tails[i];
    }
    return ToPointer(status, f.Finish(s));
}

int32_t TwoWay(Handle data, Handle aLabels, Handle bLabels, int32_t repeats, int32_t a, int32_t b,
               double alpha, int32_t cols, Handle table, double* pA, double* pB, double* pAB,
               int32_t* status) {
    const int32_t levels[2] = {a, b};
    return FactorialFrame<2>(data, {aLabels, bLabels}, cols, table, {pA, pB, pAB}, status,
                             [&](const double* x, const int32_t* const* ls, int32_t n, double* t, double* pv) {
                                 return TwoWayAnova(x, ls, n, repeats, levels, alpha, t, pv);
                             });
}

int32_t ThreeWay(Handle data, Handle aLabels, Handle bLabels, Handle cLabels, int32_t repeats,
                 int32_t a, int32_t b, int32_t c, double alpha, int32_t cols, Handle table,
                 double* const (&p)[7], int32_t* status) {
    const int32_t levels[3] = {a, b, c};
    return FactorialFrame<3>(data, {aLabels, bLabels, cLabels}, cols, table, p, status,
                             [&](const double* x, const int32_t* const* ls, int32_t n, double* t, double* pv) {
                                 return ThreeWayAnova(x, ls, n, repeats, levels, alpha, t, pv);
                             });
}

}  // namespace

TW_API int32_t Anova1Way_head(Array1DHandle data, Array1DHandle labels, const int32_t* k,
                              double* betweenSS, double* betweenMS, double* f, double* p,
                              double* withinSS, double* withinMS, double* totalSS, int32_t* status) {
    return OneWay(data, labels, *k, 0.0,
                  {betweenSS, betweenMS, f, p, withinSS, withinMS, totalSS, nullptr}, status);
}

TW_API int32_t Anova1Way_head_2017(Array1DHandle data, Array1DHandle labels, const int32_t* k,
                                   double alpha, double* betweenSS, double* betweenMS, double* f,
                                   double* p, double* withinSS, double* withinMS, double* totalSS,
                                   double* criticalF, int32_t* status) {
    return OneWay(data, labels, *k, alpha,
                  {betweenSS, betweenMS, f, p, withinSS, withinMS, totalSS, criticalF}, status);
}

TW_API int32_t Anova2Way_head(Array1DHandle data, Array1DHandle aLabels, Array1DHandle bLabels,
                              const int32_t* repeats, const int32_t* a, const int32_t* b,
                              Array2DHandle table, double* pA, double* pB, double* pAB,
                              int32_t* status) {
    return TwoWay(data, aLabels, bLabels, *repeats, *a, *b, 0.0, kAnovaColumns - 1, table, pA, pB,
                  pAB, status);
}

TW_API int32_t Anova2Way_head_2017(Array1DHandle data, Array1DHandle aLabels, Array1DHandle bLabels,
                                   const int32_t* repeats, const int32_t* a, const int32_t* b,
                                   double alpha, Array2DHandle table, double* pA, double* pB,
                                   double* pAB, int32_t* status) {
    return TwoWay(data, aLabels, bLabels, *repeats, *a, *b, alpha, kAnovaColumns, table, pA, pB,
                  pAB, status);
}

TW_API int32_t ANOVA3Way_head(Array1DHandle data, Array1DHandle aLabels, Array1DHandle bLabels,
                              Array1DHandle cLabels, const int32_t* repeats, const int32_t* a,
                              const int32_t* b, const int32_t* c, Array2DHandle table, double* pA,
                              double* pB, double* pC, double* pAB, double* pAC, double* pBC,
                              double* pABC, int32_t* status) {
    return ThreeWay(data, aLabels, bLabels, cLabels, *repeats, *a, *b, *c, 0.0, kAnovaColumns - 1,
                    table, {pA, pB, pC, pAB, pAC, pBC, pABC}, status);
}

TW_API int32_t ANOVA3Way_head_2017(Array1DHandle data, Array1DHandle aLabels, Array1DHandle bLabels,
                                   Array1DHandle cLabels, const int32_t* repeats, const int32_t* a,
                                   const int32_t* b, const int32_t* c, double alpha,
                                   Array2DHandle table, double* pA, double* pB, double* pC,
                                   double* pAB, double* pAC, double* pBC, double* pABC,
                                   int32_t* status) {
    return ThreeWay(data, aLabels, bLabels, cLabels, *repeats, *a, *b, *c, alpha, kAnovaColumns,
                    table, {pA, pB, pC, pAB, pAC, pBC, pABC}, status);
}

TW_API int32_t Contingency_head(Array2DHandle table, double* chiSquare, double* p, int32_t* status) {
    Frame f(FailOn::NonZero);
    f.Result(chiSquare);
    f.Result(p);
    const Shape d = Dims(table);
    const int32_t* counts = nullptr;
    Status s = f.In2D(table, &counts);
    if (s == 0) s = ContingencyChiSquare(counts, d.rows, d.cols, chiSquare, p);
    return ToPointer(status, f.Finish(s));
}
