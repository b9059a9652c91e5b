#include <cstdint>
#include <cstring>
#include <type_traits>

#include "filter/iir_design.hpp"
#include "filter/iir_filter.hpp"
#include "frame/frame.hpp"
#include "frame/status_styles.hpp"
#include "twanlys/filter.h"

namespace {

using tw::cdouble;
using tw::Cells;
using tw::Frame;
using tw::Handle;
using tw::Status;

// Element cells of a 1-D block, read in place whatever its alignment.
template <class T>
Cells<T> Elements(Handle h) {
    return Cells<T>(h != nullptr && *h != nullptr ? static_cast<unsigned char*>(*h) + 4 : nullptr);
}

// A state block brought to n elements: resized and zeroed when its size is wrong, zeroed when the
// caller does not continue.
template <class T>
Status PrepareState(Handle& h, int32_t n, bool keep, Cells<T>* cells) {
    if (tw::Count(h) != n) {
        if (h == nullptr) return n == 0 ? 0 : OutOfMemoryErr;
        if (tw::HostResize(tw::kTypeCode<T>, 1, &h, n) != 0) return OutOfMemoryErr;
        std::memcpy(*h, &n, sizeof n);
        keep = false;
    }
    *cells = Elements<T>(h);
    if (!keep)
        for (int32_t i = 0; i < n; ++i) cells->Set(i, T{});
    return 0;
}

bool Byte(const uint8_t* p, uint8_t value) { return p != nullptr && *p == value; }

// Checks shared by the direct-form exports; *idle when neither a nor b is given.
Status DirectChecks(int32_t n, int32_t na, int32_t nb, bool* idle) {
    *idle = false;
    if (n < 1) return EmptyArrayErr;
    if (na > 0 && nb < 1) return SizeMismatchErr;
    *idle = na < 1 && nb < 1;
    return 0;
}

// Direct-form filtering of x into y with separate x and y states (or one state holding both);
// na 0 ignores a.
template <class In, class Out, class C>
Status RunDirect(Cells<In> x, Cells<Out> y, int32_t n, Handle a, int32_t na, Handle b, Handle& xs, Handle* ys,
                 bool keep) {
    const int32_t nb = tw::Count(b);
    Cells<In> xc;
    Cells<Out> yc;
    Status s = 0;
    if (ys != nullptr) {
        s = PrepareState(xs, nb - 1, keep, &xc);
        if (s == 0 && na > 0) s = PrepareState(*ys, na - 1, keep, &yc);
    } else if constexpr (std::is_same_v<In, Out>) {
        s = PrepareState(xs, nb - 1 + (na > 0 ? na - 1 : 0), keep, &xc);
        if (s == 0) yc = Cells<Out>(xc.p + static_cast<int64_t>(nb - 1) * static_cast<int64_t>(sizeof(In)));
    }
    if (s == 0) s = tw::IirDirectFilter(x, y, n, Elements<C>(a), na, Elements<C>(b), nb, xc, yc);
    return s;
}

// IIR_Filter and its twins: x filtered in place, x shrunk on failure.
template <class T, class C>
Status DirectInPlace(Handle& x, Handle a, Handle b, Handle& xs, Handle& ys, const uint8_t* cont) {
    Frame f;
    f.Output<T>(x);
    const int32_t n = tw::Count(x);
    bool idle = false;
    Status s = DirectChecks(n, tw::Count(a), tw::Count(b), &idle);
    if (s == 0 && !idle)
        s = RunDirect<T, T, C>(Elements<T>(x), Elements<T>(x), n, a, tw::Count(a), b, xs, &ys, Byte(cont, 1));
    return f.Finish(s);
}

// The one-state twins: x and the state shrunk on failure.
template <class T>
Status DirectOneState(Handle& x, Handle a, Handle b, Handle& state, const uint8_t* cont) {
    Frame f;
    f.Output<T>(x);
    f.Output<T>(state);
    const int32_t n = tw::Count(x);
    bool idle = false;
    Status s = DirectChecks(n, tw::Count(a), tw::Count(b), &idle);
    if (s == 0 && !idle)
        s = RunDirect<T, T, double>(Elements<T>(x), Elements<T>(x), n, a, tw::Count(a), b, state, nullptr,
                                    Byte(cont, 1));
    return f.Finish(s);
}

// Form and layout of a cascade: the section count, or a status.
Status CascadeLayout(int32_t form, int32_t na, int32_t nb, int32_t* sections) {
    if (form != 0 && form != 1) return InvalidSelectorErr;
    const int32_t m = form == 0 ? 2 : 4;
    const int32_t s = form == 0 ? (na + 1) >> 1 : ((na >> 1) + 1) >> 1;
    if (int64_t{na} != int64_t{m} * s || int64_t{nb} != int64_t{m + 1} * s) return CoefLayoutErr;
    *sections = s;
    return 0;
}

// Checks of the cascade exports in their order; *idle when neither a nor b is given.
Status CascadeChecks(int32_t n, const int32_t* form, int32_t na, int32_t nb, int32_t* sections, bool* idle) {
    *idle = false;
    if (n < 1) return EmptyArrayErr;
    if ((na > 0) != (nb > 0)) return SizeMismatchErr;
    if (na < 1) {
        *idle = true;
        return 0;
    }
    return CascadeLayout(form != nullptr ? *form : -1, na, nb, sections);
}

template <class T>
Status Cascade(Handle& x, const int32_t* form, Handle a, Handle b, Handle& state, const uint8_t* cont) {
    Frame f;
    f.Output<T>(x);
    const int32_t n = tw::Count(x), na = tw::Count(a), nb = tw::Count(b);
    int32_t sections = 0;
    bool idle = false;
    Status s = CascadeChecks(n, form, na, nb, &sections, &idle);
    if (s != 0 || idle) return f.Finish(s);
    Cells<T> st;
    s = PrepareState(state, na, Byte(cont, 1), &st);
    if (s == 0)
        tw::IirCascadeFilter(Elements<T>(x), n, Elements<double>(a), Elements<double>(b), *form, sections,
                             st);
    return f.Finish(s);
}

// One sample through any of the four structures; on failure the state is shrunk and x is 0.
template <class T>
Status PointByPoint(T* x, int32_t structure, Handle a, Handle b, Handle& state, const uint8_t* reset) {
    Frame f;
    f.Output<T>(state);
    const bool cascade = structure == 0 || structure == 1;
    const int32_t na = structure == 3 ? 0 : tw::Count(a), nb = tw::Count(b);
    const bool keep = !(reset != nullptr && *reset != 0);
    Status s = 0;
    int32_t sections = 0;
    if ((na > 0 && nb < 1) || (cascade && nb > 0 && na < 1))
        s = SizeMismatchErr;
    else if (static_cast<uint32_t>(structure) > 3)
        s = InvalidSelectorErr;
    else if (na < 1 && nb < 1)
        return f.Finish(0);
    else if (cascade)
        s = CascadeLayout(structure, na, nb, &sections);
    if (s == 0 && x == nullptr) s = EmptyArrayErr;
    if (s == 0 && cascade) {
        Cells<T> st;
        s = PrepareState(state, na, keep, &st);
        if (s == 0)
            tw::IirCascadeFilter(Cells<T>(x), 1, Elements<double>(a), Elements<double>(b), structure,
                                 sections, st);
    } else if (s == 0) {
        s = RunDirect<T, T, double>(Cells<T>(x), Cells<T>(x), 1, a, na, b, state, nullptr, keep);
    }
    s = f.Finish(s);
    if (s < 0 && x != nullptr) *x = T{};
    return s;
}

// Real signal x into a complex y through complex coefficients; only y shrinks on failure.
Status RealSignalComplexFilter(Handle x, Handle& y, Handle a, Handle b, Handle& xs, Handle& ys,
                               const uint8_t* cont) {
    Frame f;
    f.Output<cdouble>(y);
    const int32_t n = tw::Count(x);
    bool idle = false;
    Status s = DirectChecks(n, tw::Count(a), tw::Count(b), &idle);
    if (s != 0 || idle) return f.Finish(s);
    if (y == nullptr || tw::HostResize(tw::kTypeCode<cdouble>, 1, &y, n) != 0)
        return f.Finish(OutOfMemoryErr);
    std::memcpy(*y, &n, sizeof n);
    s = RunDirect<double, cdouble, cdouble>(Elements<double>(x), Elements<cdouble>(y), n, a, tw::Count(a), b,
                                            xs, &ys, Byte(cont, 1));
    return f.Finish(s);
}

Status ZeroPhase(Handle x, Handle a, Handle b, Handle& xf, Handle& xb, Handle& yf, Handle& yb, int32_t cont) {
    Frame f;
    f.Output<double>(xf);
    f.Output<double>(xb);
    f.Output<double>(yf);
    f.Output<double>(yb);
    const int32_t n = tw::Count(x), na = tw::Count(a), nb = tw::Count(b);
    bool idle = false;
    Status s = DirectChecks(n, na, nb, &idle);
    if (s != 0 || idle) return f.Finish(s);
    const bool keep = cont != 0;
    Cells<double> xfc, xbc, yfc, ybc;
    s = PrepareState(xf, nb - 1, keep, &xfc);
    if (s == 0) s = PrepareState(xb, nb - 1, keep, &xbc);
    if (s == 0 && na > 0) s = PrepareState(yf, na - 1, keep, &yfc);
    if (s == 0 && na > 0) s = PrepareState(yb, na - 1, keep, &ybc);
    if (s == 0)
        s = tw::ZeroPhaseFilter(Elements<double>(x), n, Elements<double>(a), na, Elements<double>(b), nb, xfc,
                                yfc, xbc, ybc);
    return f.Finish(s);
}

Status ZeroPhaseCascade(Handle x, const int32_t* form, Handle a, Handle b, Handle& forward, Handle& backward,
                        int32_t cont) {
    Frame f;
    f.Output<double>(forward);
    f.Output<double>(backward);
    const int32_t n = tw::Count(x), na = tw::Count(a), nb = tw::Count(b);
    int32_t sections = 0;
    bool idle = false;
    Status s = CascadeChecks(n, form, na, nb, &sections, &idle);
    if (s != 0 || idle) return f.Finish(s);
    Cells<double> fc, bc;
    s = PrepareState(forward, na, cont != 0, &fc);
    if (s == 0) s = PrepareState(backward, na, cont != 0, &bc);
    if (s == 0)
        s = tw::ZeroPhaseCascadeFilter(Elements<double>(x), n, Elements<double>(a), Elements<double>(b),
                                       *form, sections, fc, bc);
    return f.Finish(s);
}

double Value(const double* p) { return p != nullptr ? *p : tw::kNaN; }

// The design frame: order, sizes and resizes, then the checks in their order, then the design.
Status Design(tw::IirPrototype prototype, const double* fs, const double* fl, const double* fh, double ripple,
              double attenuation, const int32_t* order, const int32_t* type, int32_t form, bool formGiven,
              Handle& a, Handle& b) {
    Frame f;
    f.Output<double>(a);
    f.Output<double>(b);
    tw::IirParams sp{prototype,
                     Value(fs),
                     Value(fl),
                     Value(fh),
                     ripple,
                     attenuation,
                     order != nullptr ? *order : 0,
                     type != nullptr ? *type : -1,
                     form};
    if (!formGiven) sp.form = sp.type == 2 || sp.type == 3 ? 1 : 0;
    if (sp.order < 1) return f.Finish(OrderNotPositiveErr);
    int32_t na = 0, nb = 0;
    double *ad = nullptr, *bd = nullptr;
    Status s = tw::IirDesignSizes(sp.order, sp.type, sp.form, &na, &nb) ? 0 : OutOfMemoryErr;
    if (s == 0 && (f.Resize(a, na, &ad) != 0 || f.Resize(b, nb, &bd) != 0)) s = OutOfMemoryErr;
    if (s == 0) s = tw::IirDesignCheck(sp);
    if (s == 0 && (tw::Count(a) < na || tw::Count(b) < nb)) s = CoefLayoutErr;
    if (s == 0) s = tw::IirDesign(sp, ad, bd);
    return f.Finish(s);
}

constexpr auto kBW = tw::IirPrototype::Butterworth;
constexpr auto kBessel = tw::IirPrototype::Bessel;
constexpr auto kCheb = tw::IirPrototype::Chebyshev;
constexpr auto kInvCheb = tw::IirPrototype::InvChebyshev;
constexpr auto kEllip = tw::IirPrototype::Elliptic;

}  // namespace

TW_API int32_t BWCoefs(double* fs, double* fl, double* fh, int32_t* order, int32_t* type, Array1DHandle a,
                       Array1DHandle b, int32_t* status) {
    return tw::ToPointer(status, Design(kBW, fs, fl, fh, 0, 0, order, type, 0, false, a, b));
}
TW_API int32_t BWCoefs90(double* fs, double* fl, double* fh, int32_t* order, int32_t* type, int32_t form,
                         Array1DHandle a, Array1DHandle b, int32_t* status) {
    return tw::ToPointer(status, Design(kBW, fs, fl, fh, 0, 0, order, type, form, true, a, b));
}
TW_API int32_t BesselCoefs(double* fs, double* fl, double* fh, int32_t* order, int32_t* type, Array1DHandle a,
                           Array1DHandle b, int32_t* status) {
    return tw::ToPointer(status, Design(kBessel, fs, fl, fh, 0, 0, order, type, 0, false, a, b));
}
TW_API int32_t BesselCoefs90(double* fs, double* fl, double* fh, int32_t* order, int32_t* type, int32_t form,
                             Array1DHandle a, Array1DHandle b, int32_t* status) {
    return tw::ToPointer(status, Design(kBessel, fs, fl, fh, 0, 0, order, type, form, true, a, b));
}
TW_API int32_t ChebyshevCoefs(double* fs, double* fl, double* fh, double* ripple, int32_t* order,
                              int32_t* type, Array1DHandle a, Array1DHandle b, int32_t* status) {
    return tw::ToPointer(status, Design(kCheb, fs, fl, fh, Value(ripple), 0, order, type, 0, false, a, b));
}
TW_API int32_t ChebyshevCoefs90(double* fs, double* fl, double* fh, double* ripple, int32_t* order,
                                int32_t* type, int32_t form, Array1DHandle a, Array1DHandle b,
                                int32_t* status) {
    return tw::ToPointer(status, Design(kCheb, fs, fl, fh, Value(ripple), 0, order, type, form, true, a, b));
}
TW_API int32_t InvChebyshevCoefs(double* fs, double* fl, double* fh, double* attenuation, int32_t* order,
                                 int32_t* type, Array1DHandle a, Array1DHandle b, int32_t* status) {
    return tw::ToPointer(status,
                         Design(kInvCheb, fs, fl, fh, 0, Value(attenuation), order, type, 0, false, a, b));
}
TW_API int32_t InvChebyshevCoefs90(double* fs, double* fl, double* fh, double* attenuation, int32_t* order,
                                   int32_t* type, int32_t form, Array1DHandle a, Array1DHandle b,
                                   int32_t* status) {
    return tw::ToPointer(status,
                         Design(kInvCheb, fs, fl, fh, 0, Value(attenuation), order, type, form, true, a, b));
}
TW_API int32_t EllipticCoefs(double* fs, double* fl, double* fh, double* ripple, double* attenuation,
                             int32_t* order, int32_t* type, Array1DHandle a, Array1DHandle b,
                             int32_t* status) {
    return tw::ToPointer(
        status, Design(kEllip, fs, fl, fh, Value(ripple), Value(attenuation), order, type, 0, false, a, b));
}
TW_API int32_t EllipticCoefs90(double* fs, double* fl, double* fh, double* ripple, double* attenuation,
                               int32_t* order, int32_t* type, int32_t form, Array1DHandle a, Array1DHandle b,
                               int32_t* status) {
    return tw::ToPointer(
        status, Design(kEllip, fs, fl, fh, Value(ripple), Value(attenuation), order, type, form, true, a, b));
}

TW_API int32_t IIR_Filter(Array1DHandle x, Array1DHandle a, Array1DHandle b, Array1DHandle xState,
                          Array1DHandle yState, uint8_t* cont, int32_t* status) {
    return tw::ToPointer(status, DirectInPlace<double, double>(x, a, b, xState, yState, cont));
}
TW_API int32_t IIR_Filter_OneState(Array1DHandle x, Array1DHandle a, Array1DHandle b, Array1DHandle state,
                                   uint8_t* cont) {
    return DirectOneState<double>(x, a, b, state, cont);
}
TW_API int32_t IIR_Filter2(Array1DHandle x, int32_t* form, Array1DHandle a, Array1DHandle b,
                           Array1DHandle state, uint8_t* cont, int32_t* status) {
    return tw::ToPointer(status, Cascade<double>(x, form, a, b, state, cont));
}
TW_API int32_t IIR_Filter_PtbyPt(double* x, int32_t structure, Array1DHandle a, Array1DHandle b,
                                 Array1DHandle state, uint8_t* reset) {
    return PointByPoint<double>(x, structure, a, b, state, reset);
}
TW_API int32_t CxSigIIR_Filter(Array1DHandle x, Array1DHandle a, Array1DHandle b, Array1DHandle xState,
                               Array1DHandle yState, uint8_t* cont, int32_t* status) {
    return tw::ToPointer(status, DirectInPlace<cdouble, double>(x, a, b, xState, yState, cont));
}
TW_API int32_t CxSigIIR_Filter_OneState(Array1DHandle x, Array1DHandle a, Array1DHandle b,
                                        Array1DHandle state, uint8_t* cont) {
    return DirectOneState<cdouble>(x, a, b, state, cont);
}
TW_API int32_t CxSigIIR_Filter2(Array1DHandle x, int32_t* form, Array1DHandle a, Array1DHandle b,
                                Array1DHandle state, uint8_t* cont, int32_t* status) {
    return tw::ToPointer(status, Cascade<cdouble>(x, form, a, b, state, cont));
}
TW_API int32_t CxSigIIR_Filter_PtbyPt(ComplexDouble* x, int32_t structure, Array1DHandle a, Array1DHandle b,
                                      Array1DHandle state, uint8_t* reset) {
    return PointByPoint<cdouble>(reinterpret_cast<cdouble*>(x), structure, a, b, state, reset);
}
TW_API int32_t CxIIR_Filter_H(Array1DHandle x, Array1DHandle a, Array1DHandle b, Array1DHandle xState,
                              Array1DHandle yState, uint8_t* cont, int32_t* status) {
    return tw::ToPointer(status, DirectInPlace<cdouble, cdouble>(x, a, b, xState, yState, cont));
}
TW_API int32_t CxIIRReSig_Filter_H(Array1DHandle x, Array1DHandle y, Array1DHandle a, Array1DHandle b,
                                   Array1DHandle xState, Array1DHandle yState, uint8_t* cont) {
    return RealSignalComplexFilter(x, y, a, b, xState, yState, cont);
}
TW_API int32_t zeroPhaseFiltH(Array1DHandle x, Array1DHandle a, Array1DHandle b, Array1DHandle xStateForward,
                              Array1DHandle xStateBackward, Array1DHandle yStateForward,
                              Array1DHandle yStateBackward, int32_t cont) {
    return ZeroPhase(x, a, b, xStateForward, xStateBackward, yStateForward, yStateBackward, cont);
}
TW_API int32_t zeroPhaseCascadeFiltH(Array1DHandle x, int32_t* form, Array1DHandle a, Array1DHandle b,
                                     Array1DHandle stateForward, Array1DHandle stateBackward, int32_t cont) {
    return ZeroPhaseCascade(x, form, a, b, stateForward, stateBackward, cont);
}
