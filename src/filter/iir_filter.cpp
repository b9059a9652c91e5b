#include "filter/iir_filter.hpp"

#include <algorithm>
#include <cmath>
#include <type_traits>

namespace tw {
namespace {

using cdouble = std::complex<double>;

constexpr double kSmallestNormal = 2.2250738585072014e-308;

// Products and quotients written out: the library's complex arithmetic has no special-value
// recovery and no scaling, and a real factor scales the two parts separately.
inline double Mul(double c, double v) { return c * v; }
inline cdouble Mul(double c, cdouble v) { return {c * v.real(), c * v.imag()}; }
inline cdouble Mul(cdouble c, double v) { return {c.real() * v, c.imag() * v}; }
inline cdouble Mul(cdouble c, cdouble v) {
    return {c.real() * v.real() - c.imag() * v.imag(), c.real() * v.imag() + c.imag() * v.real()};
}
inline double Div(double v, double c) { return v / c; }
inline cdouble Div(cdouble v, double c) { return {v.real() / c, v.imag() / c}; }
inline cdouble Div(cdouble v, cdouble c) {
    const double d = c.real() * c.real() + c.imag() * c.imag();
    return {(v.real() * c.real() + v.imag() * c.imag()) / d, (v.imag() * c.real() - v.real() * c.imag()) / d};
}
inline double Flush(double v) {
    if (std::fabs(v) <= kSmallestNormal) [[unlikely]]
        return 0.0;
    return v;
}
// The same flush; in the direct-form loop GCC keeps this spelling as a predicted branch.
inline double FlushBranch(double v) {
    if (v <= kSmallestNormal && v >= -kSmallestNormal) [[unlikely]]
        return 0.0;
    return v;
}

inline cdouble Flush(cdouble v) { return {Flush(v.real()), Flush(v.imag())}; }

// A complex value under real coefficients is two independent lanes: one vector operation does the
// work of the two scalar ones, with the same rounding.
using Lanes = double __attribute__((vector_size(16)));
inline Lanes Mul(double c, Lanes v) { return c * v; }
inline Lanes Div(Lanes v, double c) { return v / c; }
inline Lanes Flush(Lanes v) {
    const Lanes t = {kSmallestNormal, kSmallestNormal};
    const auto tiny = v <= t && v >= -t;
    // A predicted branch keeps the compare off the recursion's critical path.
    if (tiny[0] != 0 || tiny[1] != 0) [[unlikely]]
        return tiny ? Lanes{} : v;
    return v;
}
template <class T>
Cells<Lanes> AsLanes(Cells<T> c) {
    return Cells<Lanes>(c.p);
}
inline cdouble FlushBranch(cdouble v) { return Flush(v); }
inline Lanes FlushBranch(Lanes v) { return Flush(v); }
constexpr bool kLanesMatch = sizeof(Lanes) == sizeof(cdouble);

// Elements of an ordinary array, for the stack copies of short states.
template <class T>
struct Plain {
    T* p;
    T operator[](int64_t i) const { return p[i]; }
    void Set(int64_t i, const T& v) const { p[i] = v; }
};

// With a0 exactly 1 the division is an identity and leaves the recursion's critical path.
template <bool UnitLead, class In, class Out, class A, class X, class Y>
void RecursiveLoop(Cells<In> x, Cells<Out> y, int32_t n, A a, int32_t na, A b, int32_t nb, X xs, Y ys) {
    const auto a0 = a[0];
    // The newest output also stays in a register: the recursion does not wait for its store.
    Out last = na > 1 ? ys[na - 2] : Out{};
    for (int32_t i = 0; i < n; ++i) {
        const In xi = x[i];
        Out acc{};
        for (int32_t j = nb - 1; j >= 2; --j) {
            const int32_t k = nb - 1 - j;
            acc += Mul(b[j], xs[k]);
            xs.Set(k, xs[k + 1]);
        }
        if (nb > 1) {
            acc += Mul(b[1], xs[nb - 2]);
            xs.Set(nb - 2, xi);
        }
        acc += Mul(b[0], xi);
        for (int32_t j = na - 1; j >= 2; --j) {
            const int32_t k = na - 1 - j;
            acc -= Mul(a[j], ys[k]);
            ys.Set(k, ys[k + 1]);
        }
        Out v = na < 2 ? acc : acc - Mul(a[1], last);
        if constexpr (!UnitLead) v = Div(v, a0);
        v = FlushBranch(v);
        if (na > 1) ys.Set(na - 2, v);
        last = v;
        y.Set(i, v);
    }
}

constexpr int32_t kLocalOrder = 32;

// Short filters run on stack copies of their coefficients and states, written back at the end.
template <class In, class Out, class C>
void RecursiveFilter(Cells<In> x, Cells<Out> y, int32_t n, Cells<C> a, int32_t na, Cells<C> b, int32_t nb,
                     Cells<In> xs, Cells<Out> ys) {
    const bool unit = std::is_same_v<C, double> && a[0] == C(1);
    if (na > kLocalOrder || nb > kLocalOrder) {
        if (unit)
            RecursiveLoop<true>(x, y, n, a, na, b, nb, xs, ys);
        else
            RecursiveLoop<false>(x, y, n, a, na, b, nb, xs, ys);
        return;
    }
    C ca[kLocalOrder]{}, cb[kLocalOrder]{};
    In sx[kLocalOrder]{};
    Out sy[kLocalOrder]{};
    for (int32_t j = 0; j < na; ++j) ca[j] = a[j];
    for (int32_t j = 0; j < nb; ++j) cb[j] = b[j];
    for (int32_t j = 0; j + 1 < nb; ++j) sx[j] = xs[j];
    for (int32_t j = 0; j + 1 < na; ++j) sy[j] = ys[j];
    const Plain<const C> pa{ca}, pb{cb};
    if (unit)
        RecursiveLoop<true>(x, y, n, pa, na, pb, nb, Plain<In>{sx}, Plain<Out>{sy});
    else
        RecursiveLoop<false>(x, y, n, pa, na, pb, nb, Plain<In>{sx}, Plain<Out>{sy});
    for (int32_t j = 0; j + 1 < nb; ++j) xs.Set(j, sx[j]);
    for (int32_t j = 0; j + 1 < na; ++j) ys.Set(j, sy[j]);
}

// Outputs from the last backward, so that y may overwrite x; indices before 0 read the state.
template <class In, class Out, class C>
Status FirFilter(Cells<In> x, Cells<Out> y, int32_t n, Cells<C> b, int32_t nb, Cells<In> xs) {
    if (nb == 1) {
        const C b0 = b[0];
        for (int32_t i = 0; i < n; ++i) y.Set(i, Mul(b0, x[i]));
        return 0;
    }
    // A short tail (always so for one sample) stays on the stack.
    const int32_t keep = std::min(nb - 1, n);
    In local[16];
    Scratch<In> heap;
    In* tail = local;
    if (keep > 16) {
        if (const Status s = heap.Allocate(static_cast<size_t>(keep))) return s;
        tail = heap.get();
    }
    for (int32_t k = 0; k < keep; ++k) tail[k] = x[n - keep + k];
    // Four outputs at a time where only x is read: four independent sums, each in its own order.
    int32_t i = n - 1;
    for (; i - 3 >= nb - 1; i -= 4) {
        Out s0{}, s1{}, s2{}, s3{};
        for (int32_t j = nb - 1; j >= 0; --j) {
            const C c = b[j];
            s0 += Mul(c, x[i - j]);
            s1 += Mul(c, x[i - 1 - j]);
            s2 += Mul(c, x[i - 2 - j]);
            s3 += Mul(c, x[i - 3 - j]);
        }
        y.Set(i, s0);
        y.Set(i - 1, s1);
        y.Set(i - 2, s2);
        y.Set(i - 3, s3);
    }
    for (; i >= 0; --i) {
        Out acc{};
        int32_t j = nb - 1;
        for (; j > i; --j) acc += Mul(b[j], xs[nb - 1 + i - j]);
        for (; j >= 0; --j) acc += Mul(b[j], x[i - j]);
        y.Set(i, acc);
    }
    const int32_t m = nb - 1;
    for (int32_t k = 0; k + keep < m; ++k) xs.Set(k, xs[k + keep]);
    for (int32_t k = 0; k < keep; ++k) xs.Set(m - keep + k, tail[k]);
    return heap.Release();
}

// One section over the whole block (the block result equals the sample-by-sample order, since a
// section sees only its own input sequence); its values stay in registers.
template <class T, int M>
void CascadeSection(Cells<T> x, int32_t n, Cells<double> a, Cells<double> b, Cells<T> state, bool last) {
    double ak[M], bk[M + 1];
    T st[M];
    for (int j = 0; j < M; ++j) ak[j] = a[j], st[j] = state[j];
    for (int j = 0; j <= M; ++j) bk[j] = b[j];
    for (int32_t i = 0; i < n; ++i) {
        T w = x[i];
        for (int j = 0; j < M; ++j) w -= Mul(ak[j], st[j]);
        T v = Mul(bk[0], w);
        for (int j = 0; j < M; ++j) v += Mul(bk[j + 1], st[j]);
        for (int j = M - 1; j > 0; --j) st[j] = st[j - 1];
        st[0] = Flush(w);
        x.Set(i, last ? Flush(v) : v);
    }
    for (int j = 0; j < M; ++j) state.Set(j, st[j]);
}

constexpr int32_t kLocalSections = 32;

// Sample by sample through all sections, on stack copies: the sections' recursions are
// independent chains that the processor overlaps.
template <class T, int M>
void CascadeSamples(Cells<T> x, int32_t n, Cells<double> a, Cells<double> b, int32_t sections,
                    Cells<T> state) {
    double ca[M * kLocalSections], cb[(M + 1) * kLocalSections];
    T st[M * kLocalSections];
    for (int32_t j = 0; j < M * sections; ++j) ca[j] = a[j], st[j] = state[j];
    for (int32_t j = 0; j < (M + 1) * sections; ++j) cb[j] = b[j];
    for (int32_t i = 0; i < n; ++i) {
        T v = x[i];
        for (int32_t k = 0; k < sections; ++k) {
            const double* ak = ca + M * k;
            const double* bk = cb + (M + 1) * k;
            T* s = st + M * k;
            T w = v;
            for (int j = 0; j < M; ++j) w -= Mul(ak[j], s[j]);
            v = Mul(bk[0], w);
            for (int j = 0; j < M; ++j) v += Mul(bk[j + 1], s[j]);
            for (int j = M - 1; j > 0; --j) s[j] = s[j - 1];
            s[0] = Flush(w);
        }
        x.Set(i, Flush(v));
    }
    for (int32_t j = 0; j < M * sections; ++j) state.Set(j, st[j]);
}

void Reverse(double* p, int64_t n) { std::reverse(p, p + n); }

}  // namespace

template <class In, class Out, class C>
Status IirDirectFilter(Cells<In> x, Cells<Out> y, int32_t n, Cells<C> a, int32_t na, Cells<C> b, int32_t nb,
                       Cells<In> xState, Cells<Out> yState) {
    if constexpr (std::is_same_v<Out, cdouble> && std::is_same_v<In, cdouble> && std::is_same_v<C, double>) {
        static_assert(kLanesMatch);
        if (na == 0) return FirFilter(AsLanes(x), AsLanes(y), n, b, nb, AsLanes(xState));
        RecursiveFilter(AsLanes(x), AsLanes(y), n, a, na, b, nb, AsLanes(xState), AsLanes(yState));
    } else {
        if (na == 0) return FirFilter(x, y, n, b, nb, xState);
        RecursiveFilter(x, y, n, a, na, b, nb, xState, yState);
    }
    return 0;
}

template <class T>
void IirCascadeFilter(Cells<T> x, int32_t n, Cells<double> a, Cells<double> b, int32_t form, int32_t sections,
                      Cells<T> state) {
    if constexpr (std::is_same_v<T, cdouble>) {
        IirCascadeFilter(AsLanes(x), n, a, b, form, sections, AsLanes(state));
        return;
    } else if (sections <= kLocalSections) {
        if (form == 0)
            CascadeSamples<T, 2>(x, n, a, b, sections, state);
        else
            CascadeSamples<T, 4>(x, n, a, b, sections, state);
        return;
    }
    for (int32_t k = 0; k < sections; ++k) {
        const bool last = k == sections - 1;
        if (form == 0)
            CascadeSection<T, 2>(x, n, a + 2 * k, b + 3 * k, state + 2 * k, last);
        else
            CascadeSection<T, 4>(x, n, a + 4 * k, b + 5 * k, state + 4 * k, last);
    }
}

Status ZeroPhaseFilter(Cells<double> x, int32_t n, Cells<double> a, int32_t na, Cells<double> b, int32_t nb,
                       Cells<double> xForward, Cells<double> yForward, Cells<double> xBackward,
                       Cells<double> yBackward) {
    const int32_t pad = std::max(na, nb);
    const int64_t len = int64_t{n} + 2 * int64_t{pad};
    if (len > INT32_MAX) return OutOfMemoryErr;
    Scratch<double> work;
    if (const Status s = work.Allocate(static_cast<size_t>(len))) return s;
    double* w = work.get();
    std::fill(w, w + len, 0.0);
    for (int32_t i = 0; i < n; ++i) w[pad + i] = x[i];
    const Cells<double> buf(w);
    const auto m = static_cast<int32_t>(len);
    Status s = IirDirectFilter(buf, buf, m, a, na, b, nb, xForward, yForward);
    if (s == 0) {
        Reverse(w, len);
        s = IirDirectFilter(buf, buf, m, a, na, b, nb, xBackward, yBackward);
    }
    if (s == 0)
        for (int32_t k = 0; k < n; ++k) x.Set(k, w[pad + n - 1 - k]);
    return MergeRelease(s, work.Release());
}

Status ZeroPhaseCascadeFilter(Cells<double> x, int32_t n, Cells<double> a, Cells<double> b, int32_t form,
                              int32_t sections, Cells<double> forward, Cells<double> backward) {
    const int32_t m = form == 0 ? 2 : 4, half = m / 2, base = m * sections - half;
    bool fullA = false, fullB = false;
    for (int32_t j = m - half; j <= m - 1; ++j) fullA = fullA || a[j] != 0.0;
    for (int32_t j = m - half + 1; j <= m; ++j) fullB = fullB || b[j] != 0.0;
    const int32_t pad = std::max(base + (fullA ? half : 0), base + (fullB ? half : 0)) + 1;
    const int64_t len = int64_t{n} + 2 * int64_t{pad};
    if (len > INT32_MAX) return OutOfMemoryErr;
    Scratch<double> work;
    if (const Status s = work.Allocate(static_cast<size_t>(len))) return s;
    double* w = work.get();
    std::fill(w, w + len, 0.0);
    for (int32_t i = 0; i < n; ++i) w[pad + i] = x[i];
    const Cells<double> buf(w);
    const auto count = static_cast<int32_t>(len);
    IirCascadeFilter(buf, count, a, b, form, sections, forward);
    Reverse(w, len);
    IirCascadeFilter(buf, count, a, b, form, sections, backward);
    for (int32_t k = 0; k < n; ++k) x.Set(k, w[pad + n - 1 - k]);
    return work.Release();
}

template Status IirDirectFilter(Cells<double>, Cells<double>, int32_t, Cells<double>, int32_t, Cells<double>,
                                int32_t, Cells<double>, Cells<double>);
template Status IirDirectFilter(Cells<cdouble>, Cells<cdouble>, int32_t, Cells<double>, int32_t,
                                Cells<double>, int32_t, Cells<cdouble>, Cells<cdouble>);
template Status IirDirectFilter(Cells<cdouble>, Cells<cdouble>, int32_t, Cells<cdouble>, int32_t,
                                Cells<cdouble>, int32_t, Cells<cdouble>, Cells<cdouble>);
template Status IirDirectFilter(Cells<double>, Cells<cdouble>, int32_t, Cells<cdouble>, int32_t,
                                Cells<cdouble>, int32_t, Cells<double>, Cells<cdouble>);
template void IirCascadeFilter(Cells<double>, int32_t, Cells<double>, Cells<double>, int32_t, int32_t,
                               Cells<double>);
template void IirCascadeFilter(Cells<cdouble>, int32_t, Cells<double>, Cells<double>, int32_t, int32_t,
                               Cells<cdouble>);

}  // namespace tw
