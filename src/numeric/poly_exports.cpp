// Frames of the polynomial exports: evaluation, products, root refinement, all roots, the
// multiple-root finder and the greatest common divisor.
#include <algorithm>
#include <cstdint>
#include <cstring>

#include "frame/frame.hpp"
#include "numeric/poly.hpp"
#include "twanlys/numeric.h"

using namespace tw;

namespace {

size_t Sz(int32_t n) { return static_cast<size_t>(std::max(n, 0)); }

template <class T>
void CopyOut(T* dst, const T* src, int32_t count) {
    if (count > 0) std::memcpy(static_cast<void*>(dst), src, Sz(count) * sizeof(T));
}

// Any failed resize, the host's own status or a failed staging copy, is out of memory.
template <class T>
Status Out(Frame& f, Handle& h, int32_t n, T** data) {
    return f.Resize(h, n, data) != 0 ? OutOfMemoryErr : 0;
}

template <bool TwoD>
Status Evaluate(Handle& x, Handle c) {
    Frame f;
    if constexpr (TwoD)
        f.Output2D<double>(x);
    else
        f.Output<double>(x);
    const int32_t n = TwoD ? Elements(Dims(x)) : Count(x), nc = Count(c);
    Status s = (n < 1 || nc < 1) ? EmptyArrayErr : 0;
    const double* pc = nullptr;
    double* px = nullptr;
    if (s == 0) s = f.In(c, &pc);
    if (s == 0) s = TwoD ? f.InPlace2D(x, &px) : f.InPlace(x, &px);
    if (s == 0) PolyEvaluate(pc, nc, px, n);
    return f.Finish(s);
}

// Both products are resized as complex elements; the real one fills only the first half.
template <class T>
Status Multiply(Handle a, Handle b, Handle& product) {
    Frame f;
    f.Output<cdouble>(product);
    const int32_t na = Count(a), nb = Count(b);
    Status s = (na < 1 || nb < 1) ? EmptyArrayErr : int64_t{na} + nb - 1 > INT32_MAX ? OutOfMemoryErr : 0;
    const T *pa = nullptr, *pb = nullptr;
    if (s == 0) s = f.In(a, &pa);
    if (s == 0) s = f.In(b, &pb);
    cdouble* out = nullptr;
    if (s == 0) s = Out(f, product, na + nb - 1, &out);
    if (s == 0) PolyMultiply<T>(pa, na, pb, nb, reinterpret_cast<T*>(out));
    return f.Finish(s);
}

Status Refine(Handle c, Handle real, int32_t newtonLimit, double newtonTol, Handle cx, int32_t bairstowLimit,
              double bairstowTol, Handle& roots) {
    Frame f;
    f.Output<cdouble>(roots);
    const int32_t n = Count(c), nr = std::max(Count(real), 0), nx = std::max(Count(cx), 0);
    cdouble* out = nullptr;
    if (n < 1) {
        const Status s = Out(f, roots, 0, &out);
        return f.Finish(s != 0 ? s : EmptyInputWarn);
    }
    const double *pc = nullptr, *pr = nullptr;
    const cdouble* px = nullptr;
    Status s = f.In(c, &pc);
    if (s == 0) s = f.In(real, &pr);
    if (s == 0) s = f.In(cx, &px);
    if (s == 0 && int64_t{nr} + nx > INT32_MAX) s = OutOfMemoryErr;
    if (s == 0) s = Out(f, roots, nr + nx, &out);
    if (s == 0)
        s = PolyRootsRefine(pc, n, pr, nr, newtonLimit, newtonTol, px, nx, bairstowLimit, bairstowTol, out);
    return f.Finish(s);
}

Status AllRoots(Handle& c, const int32_t* option) {
    Frame f;
    f.Output<cdouble>(c);
    const int32_t n = Count(c);
    const cdouble* pc = nullptr;
    Scratch<cdouble> work;
    int32_t count = 0;
    Status s = n < 2 ? TermsBelowOneErr : f.In(c, &pc);
    if (s == 0) s = work.Allocate(Sz(n));
    if (s == 0) {
        CopyOut(work.get(), pc, n);
        s = CxPolyRoots(work.get(), n, option != nullptr ? *option : 100, &count);
    }
    cdouble* out = nullptr;
    if (s == 0) s = Out(f, c, count, &out);
    if (s == 0) CopyOut(out, work.get(), count);
    return f.Finish(MergeRelease(s, work.Release()));
}

template <class T>
Status MultipleRoots(Handle c, int32_t option, double tol, Handle& roots, double* residual, Handle& mult) {
    Frame f;
    f.Output<cdouble>(roots);
    f.Output<int32_t>(mult);
    f.Result(residual);
    const int32_t n = Count(c);
    const T* pc = nullptr;
    Scratch<cdouble> r;
    Scratch<int32_t> m;
    int32_t count = 0;
    double res = kNaN;
    Status s = n < 1 ? EmptyArrayErr : f.In(c, &pc);
    if (s == 0) s = r.Allocate(Sz(n));
    if (s == 0) s = m.Allocate(Sz(n));
    if (s == 0) s = MultPolyRoots<T>(pc, n, option, tol, r.get(), m.get(), &count, &res);
    cdouble* pr = nullptr;
    int32_t* pm = nullptr;
    if (s == 0) s = Out(f, roots, count, &pr);
    if (s == 0) s = Out(f, mult, count, &pm);
    if (s == 0) {
        CopyOut(pr, r.get(), count);
        CopyOut(pm, m.get(), count);
        if (residual != nullptr) *residual = res;
    }
    return f.Finish(MergeRelease(MergeRelease(s, r.Release()), m.Release()));
}

template <class T>
Status Divisor(Handle a, Handle b, double tol, Handle& gcd, Handle& qa, Handle& qb, double* residual) {
    Frame f;
    f.Output<T>(gcd);
    f.Output<T>(qa);
    f.Output<T>(qb);
    f.Result(residual);
    const int32_t na = Count(a), nb = Count(b);
    const T *pa = nullptr, *pb = nullptr;
    Scratch<T> work;
    Status s = (na < 1 || nb < 1) ? EmptyArrayErr : f.In(a, &pa);
    if (s == 0) s = f.In(b, &pb);
    if (s == 0) s = work.Allocate(Sz(std::max(na, nb)) + Sz(na) + Sz(nb));
    int32_t ng = 0, nu = 0, nv = 0;
    double res = kNaN;
    T* g = s == 0 ? work.get() : nullptr;  // the parts exist only once the allocation stood
    T* u = g != nullptr ? g + std::max(na, nb) : nullptr;
    T* v = u != nullptr ? u + na : nullptr;
    if (s == 0) s = PolyGcd<T>(pa, na, pb, nb, tol, g, &ng, u, &nu, v, &nv, &res);
    T *pg = nullptr, *pu = nullptr, *pv = nullptr;
    if (s == 0) s = Out(f, gcd, ng, &pg);
    if (s == 0) s = Out(f, qa, nu, &pu);
    if (s == 0) s = Out(f, qb, nv, &pv);
    if (s == 0) {
        CopyOut(pg, g, ng);
        CopyOut(pu, u, nu);
        CopyOut(pv, v, nv);
        if (residual != nullptr) *residual = res;
    }
    return f.Finish(MergeRelease(s, work.Release()));
}

}  // namespace

TW_API int32_t PolyEv(Array1DHandle x, Array1DHandle coefficients, int32_t* status) {
    return ToPointer(status, Evaluate<false>(x, coefficients));
}

TW_API int32_t EvPoly2D(Array2DHandle x, Array1DHandle coefficients, int32_t* status) {
    return ToPointer(status, Evaluate<true>(x, coefficients));
}

TW_API int32_t MultiplyPolyH(Array1DHandle a, Array1DHandle b, Array1DHandle product) {
    return Multiply<double>(a, b, product);
}

TW_API int32_t CxMultiplyPolyH(Array1DHandle a, Array1DHandle b, Array1DHandle product) {
    return Multiply<cdouble>(a, b, product);
}

TW_API int32_t PolyRootsNtBst_head(Array1DHandle coefficients, Array1DHandle realStarts,
                                   int32_t newtonIterations, double newtonTolerance,
                                   Array1DHandle complexStarts, int32_t bairstowIterations,
                                   double bairstowTolerance, Array1DHandle roots) {
    return Refine(coefficients, realStarts, newtonIterations, newtonTolerance, complexStarts,
                  bairstowIterations, bairstowTolerance, roots);
}

TW_API int32_t CxPolyRoots_head(Array1DHandle coefficients, int32_t* option, int32_t* status) {
    return ToPointer(status, AllRoots(coefficients, option));
}

TW_API int32_t MultPolyRoots_head(Array1DHandle coefficients, int32_t option, double tolerance,
                                  Array1DHandle roots, double* residual, Array1DHandle multiplicities) {
    return MultipleRoots<double>(coefficients, option, tolerance, roots, residual, multiplicities);
}

TW_API int32_t CxMultPolyRoots_head(Array1DHandle coefficients, int32_t option, double tolerance,
                                    Array1DHandle roots, double* residual, Array1DHandle multiplicities) {
    return MultipleRoots<cdouble>(coefficients, option, tolerance, roots, residual, multiplicities);
}

TW_API int32_t PolyGCD_H(Array1DHandle a, Array1DHandle b, double tolerance, Array1DHandle gcd,
                         Array1DHandle quotientA, Array1DHandle quotientB, double* residual) {
    return Divisor<double>(a, b, tolerance, gcd, quotientA, quotientB, residual);
}

TW_API int32_t CxPolyGCD_H(Array1DHandle a, Array1DHandle b, double tolerance, Array1DHandle gcd,
                           Array1DHandle quotientA, Array1DHandle quotientB, double* residual) {
    return Divisor<cdouble>(a, b, tolerance, gcd, quotientA, quotientB, residual);
}
