"""Splines, tableau interpolation and outlier removal against SciPy's splines and interpolators,
NumPy masks, analytic cases, and plain transcriptions of the documented tableau and band forms."""
import ctypes
import sys
import unittest

import numpy as np
import scipy.interpolate as si

import twanlys as tw

D, I32, U16, P = ctypes.c_double, ctypes.c_int32, ctypes.c_uint16, ctypes.c_void_p
DP, IP, PP = ctypes.POINTER(D), ctypes.POINTER(I32), ctypes.POINTER(P)
for name, args in {
    "Spline_head": [P, P, DP, DP, P, IP],
    "SpInterp_head": [PP, PP, PP, DP, DP, IP],
    "PolyInterp_head": [P, P, DP, DP, DP, IP],
    "RatInterp_head": [P, P, DP, DP, DP, IP],
    "CubicSplineFit_head": [P, P, P, P, D, DP],
    "BSplineFit_head": [P, P, P, I32, I32, U16, P, DP],
    "RmvOutlierRng_head": [P, P, P, P, U16, P, P, P, P],
    "RmvOutlierIndx_head": [P, P, P, P, P, P, P, P],
}.items():
    getattr(tw.lib, name).argtypes = args

NATURAL = 1e30
EPS = 2.0**-52
WORST = {}


def note(key, err):
    WORST[key] = max(WORST.get(key, 0.0), float(err))


def rel(got, want):
    return np.max(np.abs(np.asarray(got) - want)) / max(np.max(np.abs(want)), 1e-300)


def placements():
    for aligned in (0, 1):
        tw.placement(aligned)
        yield aligned
    tw.placement(0)


def spline(y, x, yp1=NATURAL, ypn=NATURAL):
    y2, st = tw.empty(), tw.i32()
    tw.lib.Spline_head(tw.array(y), tw.array(x), tw.f64(yp1).ref, tw.f64(ypn).ref, y2, st.ref)
    return st.value, y2.numpy()


def sp_interp(y, x, y2, xs):
    hs = [tw.array(a) for a in (y, x, y2)]
    ptrs = [P(h.h.value) for h in hs]
    out, st = [], tw.i32()
    for xi in xs:
        yi = tw.f64()
        tw.lib.SpInterp_head(*(ctypes.byref(p) for p in ptrs), tw.f64(xi).ref, yi.ref, st.ref)
        assert st.value == 0, st.value
        out.append(yi.value)
    return np.array(out)


def tableau(name, y, x, xi):
    yi, dy, st = tw.f64(), tw.f64(), tw.i32()
    getattr(tw.lib, name)(tw.array(y), tw.array(x), tw.f64(xi).ref, yi.ref, dy.ref, st.ref)
    return st.value, yi.value, dy.value


def smoothing(y, x, p, w=(), balance=()):
    yh, err = tw.array(y), tw.f64()
    s = tw.lib.CubicSplineFit_head(yh, tw.array(x), tw.array(w), tw.array(balance), p, err.ref)
    return s, yh.numpy(), err.value


def bspline(data, degree, m, kind=0, w=(), t=()):
    dh, cp, mse = tw.matrix(data), tw.empty(dims=2), tw.f64()
    s = tw.lib.BSplineFit_head(dh, tw.array(w), tw.array(t), degree, m, kind, cp, mse.ref)
    return s, cp.numpy(), dh.numpy(), mse.value


def neville(x, y, xi, rational=False):
    """The tableau walk as documented, with the d column offset by 1e-10 for the rational form."""
    n = len(x)
    hit = np.flatnonzero(xi - x == 0)
    if rational and hit.size:
        return y[hit[0]], 0.0
    ns = int(np.argmin(np.abs(xi - x)))
    c, d = list(y), list(y + 1e-10) if rational else list(y)
    yi, dy = y[ns], 0.0
    ns -= 1
    for m in range(1, n):
        for i in range(n - m):
            if rational:
                h = x[i + m] - xi
                t = (x[i] - xi) * d[i] / h
                dd = (c[i + 1] - d[i]) / (t - c[i + 1])
                d[i], c[i] = c[i + 1] * dd, t * dd
            else:
                ho, hp = x[i] - xi, x[i + m] - xi
                f = (c[i + 1] - d[i]) / (ho - hp)
                d[i], c[i] = hp * f, ho * f
        if 2 * (ns + 1) < n - m:
            dy = c[ns + 1]
        else:
            dy = d[ns]
            ns -= 1
        yi += dy
    return yi, dy


def reinsch(x, y, p, w=None, balance=None):
    """Dense rendering of the smoothing spline: (Q^T S^2 Q + R) sol = Q^T y, fit = y - S^2 Q sol."""
    n = len(x)
    h = np.diff(x)
    hr = h if balance is None else h / np.abs(balance)
    s2 = 6 * (1 - p) * (np.ones(n) if w is None else 1 / np.abs(w))
    q = np.zeros((n - 2, n))
    r = np.zeros((n - 2, n - 2))
    for i in range(n - 2):
        q[i, i:i + 3] = 1 / h[i], -(1 / h[i] + 1 / h[i + 1]), 1 / h[i + 1]
        r[i, i] = 2 * (hr[i] + hr[i + 1]) * p
        if i + 1 < n - 2:
            r[i, i + 1] = r[i + 1, i] = hr[i + 1] * p
    a = q @ np.diag(s2) @ q.T + r
    sol = np.linalg.solve(a, q @ y)
    return y - s2 * (q.T @ sol), np.linalg.cond(a)


def roughness(x, f, weight=None):
    """Integral of the squared second derivative of the natural spline through (x, f), per interval
    times weight: exact, the second derivative being linear on each interval."""
    c = si.CubicSpline(x, f, bc_type="natural").derivative(2)(x)
    per = np.diff(x) * (c[:-1] ** 2 + c[:-1] * c[1:] + c[1:] ** 2) / 3
    return np.sum(per if weight is None else per * np.abs(weight))


def chord_parameters(data, kind):
    n = len(data)
    if kind == 0:
        return np.linspace(0, 1, n)
    dist = np.sqrt(np.sum(np.diff(data, axis=0) ** 2, axis=1))
    run = np.r_[0, np.cumsum(np.sqrt(dist) if kind == 2 else dist)]
    if run[-1] == 0:
        return np.linspace(0, 1, n)
    u = np.minimum(run / run[-1], 1)
    u[-1] = 1
    return u


def averaged_knots(u, d, m):
    n, top = len(u), m - 1
    t = np.r_[np.zeros(d + 1), np.zeros(top - d), np.ones(d + 1)]
    step = n / (top - d + 1)
    for j in range(1, top - d + 1):
        i = int(j * step)
        a = j * step - i
        t[d + j] = (1 - a) * u[i - 1] + a * u[i]
    return t


class InterpolatingSpline(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(20261125)

    def test_second_derivatives_and_values_against_cubic_spline(self):
        n = 40
        x = np.sort(self.rng.uniform(-3, 5, n))
        y = np.sin(x) + 0.1 * x**2
        probes = np.r_[x[0] - 1.5, self.rng.uniform(x[0], x[-1], 30), x[[0, 7, -1]], x[-1] + 2.0]
        # (start slope, end slope) -> SciPy boundary conditions; 9.8e29 is a slope, 1e30 natural.
        ends = [(NATURAL, NATURAL), (0.7, -1.2), (NATURAL, 2.5), (-0.4, 5e30), (9.8e29, NATURAL)]
        for _ in placements():
            for yp1, ypn in ends:
                bc = tuple((2, 0.0) if v >= 9.9e29 else (1, v) for v in (yp1, ypn))
                for flip in (False, True):  # a descending table is the same spline read backwards
                    xs, ys = (x[::-1], y[::-1]) if flip else (x, y)
                    s, y2 = spline(ys, xs, *((ypn, yp1) if flip else (yp1, ypn)))
                    self.assertEqual(s, 0)
                    ref = si.CubicSpline(x, y, bc_type=bc)
                    want = ref.derivative(2)(xs)
                    note("spline y2", rel(y2, want))
                    self.assertLess(rel(y2, want), 1e-12, (yp1, ypn, flip))
                    if yp1 == 9.8e29:
                        continue  # values of that size say nothing more
                    got = sp_interp(ys, xs, y2, probes)
                    note("spline values", rel(got, ref(probes)))
                    np.testing.assert_allclose(got, ref(probes), rtol=1e-12, atol=1e-12 * np.max(np.abs(y)))

    def test_two_points_and_exact_cubics(self):
        # Two points: the natural spline is the chord; a clamped cubic is reproduced exactly.
        s, y2 = spline([1.0, 3.0], [0.0, 2.0])
        self.assertEqual((s, list(y2)), (0, [0.0, 0.0]))
        x = np.array([0.0, 0.5, 1.7, 2.0, 3.5])
        f = lambda t: 2 - t + 0.5 * t**2 - 0.25 * t**3
        s, y2 = spline(f(x), x, -1 + x[0] - 0.75 * x[0] ** 2, -1 + x[-1] - 0.75 * x[-1] ** 2)
        np.testing.assert_allclose(y2, 1 - 1.5 * x, atol=1e-13)
        np.testing.assert_allclose(sp_interp(f(x), x, y2, [-1.0, 0.3, 2.9, 4.0]), f(np.array([-1.0, 0.3, 2.9, 4.0])),
                                   rtol=1e-13)


class Tableaux(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(7)

    def test_polynomial_against_barycentric_and_transcription(self):
        for _ in placements():
            for n in (2, 5, 9, 14):
                x = np.sort(self.rng.uniform(-2, 2, n))
                y = np.exp(x) * np.cos(x)
                ref = si.BarycentricInterpolator(x, y)
                for xi in np.r_[self.rng.uniform(-2.2, 2.2, 6), x[n // 2]]:
                    s, yi, dy = tableau("PolyInterp_head", y, x, xi)
                    ry, rdy = neville(x, y, xi)
                    # Both forms round to within the Lebesgue function at xi times eps.
                    lebesgue = sum(abs(np.prod([(xi - x[k]) / (x[j] - x[k]) for k in range(n) if k != j]))
                                   for j in range(n))
                    bound = 16 * n * EPS * lebesgue * np.max(np.abs(y))
                    self.assertEqual(s, 0)
                    note("poly vs barycentric / bound", abs(yi - ref(xi)) / bound)
                    self.assertLess(abs(yi - ref(xi)), bound)
                    self.assertLess(abs(yi - ry), 1e-14 * np.max(np.abs(y)))
                    self.assertLess(abs(dy - rdy), 1e-12 * max(abs(rdy), 1e-3))
            s, yi, dy = tableau("PolyInterp_head", [5.0], [1.0], 3.0)
            self.assertEqual((s, yi, dy), (0, 5.0, 0.0))

    def test_rational_reproduces_rational_data(self):
        f = lambda t: (1 + 2 * t - t**2) / (3 + t + 0.5 * t**2)
        for _ in placements():
            for n in (5, 6, 9):
                x = np.linspace(-1.5, 2.5, n) + self.rng.uniform(-0.05, 0.05, n)
                for xi in self.rng.uniform(-1.6, 2.6, 8):
                    s, yi, dy = tableau("RatInterp_head", f(x), x, xi)
                    ry, rdy = neville(x, f(x), xi, rational=True)
                    self.assertEqual(s, 0)
                    note("rational vs function", abs(yi - f(xi)) / np.max(np.abs(f(x))))
                    self.assertLess(abs(yi - f(xi)), 1e-8 * np.max(np.abs(f(x))))
                    self.assertLess(abs(yi - ry), 1e-12 * abs(ry) + 1e-14)
                    self.assertLess(abs(dy - rdy), 1e-9 * abs(ry) + 1e-14)
            s, yi, dy = tableau("RatInterp_head", f(x), x, x[3])
            self.assertEqual((s, yi, dy), (0, f(x)[3], 0.0))
        # The offset of the d column shows as a bias of about 1e-10 on data near 0.
        x = np.linspace(0.5, 3.0, 6)
        s, yi, _ = tableau("RatInterp_head", 1 / x - 0.5, x, 1.7)
        ry, _ = neville(x, 1 / x - 0.5, 1.7, rational=True)
        self.assertEqual(s, 0)
        self.assertLess(abs(yi - ry), 1e-15)
        self.assertGreater(abs(yi - (1 / 1.7 - 0.5)), 1e-13)


class SmoothingSpline(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(11)

    def data(self, n):
        x = np.linspace(0, 6, n) + self.rng.uniform(-0.3, 0.3, n) * 6 / n
        return x, np.sin(x) + self.rng.normal(0, 0.1, n), self.rng.uniform(0.2, 3, n)

    def test_against_make_smoothing_spline_and_error_terms(self):
        # Five and six points take the dense solve, seven and more the band solve.
        for _ in placements():
            for n in (5, 6, 7, 40, 400):
                x, y, w = self.data(n)
                for p in (0.05, 0.5, 0.97):
                    for weights in (None, w):
                        s, fit, err = smoothing(y, x, p, () if weights is None else weights)
                        ref = si.make_smoothing_spline(x, y, w=weights, lam=(1 - p) / p)(x)
                        _, cond = reinsch(x, y, p, weights)
                        self.assertEqual(s, 0)
                        note("smoothing fit / cond", rel(fit, ref) / cond)
                        self.assertLess(rel(fit, ref), 1e-15 * cond + 1e-13, (n, p))
                        # The error output is checked on the library's own fit: data term plus
                        # roughness, both formed independently here.
                        want = p * np.sum((y - fit) ** 2) + (1 - p) * roughness(x, fit)
                        note("smoothing error", abs(err - want) / want)
                        self.assertLess(abs(err - want), 1e-11 * want, (n, p))

    def test_short_tables_and_balance_against_dense_rendering(self):
        for n in (3, 4, 12):
            x, y, w = self.data(n)
            b = self.rng.uniform(0.5, 2, n - 1) * np.where(np.arange(n - 1) % 2, -1, 1)
            for balance in (None, b):
                s, fit, err = smoothing(y, x, 0.6, w, () if balance is None else balance)
                ref, cond = reinsch(x, y, 0.6, w, balance)
                self.assertEqual(s, 0)
                note("smoothing vs dense rendering", rel(fit, ref) / cond)
                self.assertLess(rel(fit, ref), 1e-15 * cond + 1e-13)
                want = 0.6 * np.sum((y - fit) ** 2) + 0.4 * roughness(x, fit, balance)
                self.assertLess(abs(err - want), 1e-11 * want)
        # A constant balance b is the unbalanced spline with lam = b (1 - p) / p.
        x, y, _ = self.data(30)
        s, fit, _ = smoothing(y, x, 0.3, (), np.full(29, 4.0))
        cond = reinsch(x, y, 0.3, None, np.full(29, 4.0))[1]
        self.assertLess(rel(fit, si.make_smoothing_spline(x, y, lam=4 * 0.7 / 0.3)(x)), 1e-15 * cond + 1e-13)

    def test_limits_of_the_smoothness(self):
        x, y, w = self.data(25)
        # p = 0: the weighted least-squares line, no roughness left.
        s, fit, err = smoothing(y, x, 0.0, w)
        c = np.polynomial.polynomial.polyfit(x, y, 1, w=np.sqrt(w))
        self.assertEqual(s, 0)
        self.assertLess(rel(fit, c[0] + c[1] * x), 1e-15 * reinsch(x, y, 0.0, w)[1] + 1e-13)
        self.assertLess(abs(err), 1e-20)
        # p = 1: y unchanged, error 0.
        s, fit, err = smoothing(y, x, 1.0, w)
        self.assertEqual((s, err), (0, 0.0))
        np.testing.assert_array_equal(fit, y)
        # Outside 0..1: p from the data span, whatever the value passed.
        span = (x[-1] - x[0]) / len(x)
        p = 8 / (8 + span**3)
        ref = si.make_smoothing_spline(x, y, w=w, lam=(1 - p) / p)(x)
        cond = reinsch(x, y, p, w)[1]
        for outside in (-1.0, 1.5, float("nan")):
            s, fit, _ = smoothing(y, x, outside, w)
            self.assertEqual(s, 0)
            self.assertLess(rel(fit, ref), 1e-15 * cond + 1e-13)


class BSplineFit(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(3)

    def check(self, data, d, m, kind=0, w=None, t=None, u=None):
        s, cp, fit, mse = bspline(data, d, m, kind, () if w is None else w, () if t is None else t)
        u = chord_parameters(data, kind) if u is None else u
        knots = averaged_knots(u, d, m)
        col = data if data.ndim == 2 else data[:, None]
        aw = np.ones(len(u)) if w is None else np.abs(w)
        # SciPy wants strictly rising parameters: repeated ones (always repeated points here)
        # merge into one row carrying their summed weight.
        uu, first, group = np.unique(u, return_index=True, return_inverse=True)
        ref = si.make_lsq_spline(uu, col[first], knots, k=d, w=np.sqrt(np.bincount(group, aw)))
        want = ref(u)
        wmse = np.sum(np.sum((want - col) ** 2, axis=1) * (1 if w is None else np.abs(w))) / len(u)
        self.assertEqual(s, 0)
        scale = np.max(np.abs(col))
        note("bspline control points", rel(cp, ref.c))
        np.testing.assert_allclose(cp, ref.c, rtol=0, atol=1e-11 * scale)
        np.testing.assert_allclose(fit, want, rtol=0, atol=1e-11 * scale)
        self.assertLess(abs(mse - wmse), 1e-12 * scale**2)

    def test_against_make_lsq_spline(self):
        n = 300
        th = np.linspace(0, 3, n)
        curve = np.c_[np.cos(th), np.sin(2 * th), th] + self.rng.normal(0, 0.01, (n, 3))
        w = self.rng.uniform(-2, 2, n)
        for _ in placements():
            for kind in (0, 1, 2):
                for d, m in ((1, 2), (3, 4), (3, 12), (2, 30), (5, 60)):
                    self.check(curve, d, m, kind, w=w if d == 3 else None)
            self.check(curve[:, :1], 3, 9, 1)  # one coordinate: distances are |differences|

    def test_parameters_given_and_degenerate_chords(self):
        n = 80
        t = np.cumsum(self.rng.uniform(0.1, 1, n)) + 5
        data = np.c_[np.sin(t), t**0.5]
        self.check(data, 3, 10, kind=2, t=t, u=(t - t[0]) / (t[-1] - t[0]))
        # Repeated points give repeated parameter values under the chord length.
        rep = np.repeat(data[::4], 2, axis=0)
        self.check(rep, 3, 8, kind=1)
        # All points equal: no chord, the parameters fall back to uniform.
        self.check(np.ones((20, 2)), 2, 5, kind=1)


class Outliers(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(5)

    def by_range(self, y, x, w, rng_, sel):
        outs = [tw.empty(), tw.empty(), tw.empty(), tw.empty(np.int32)]
        s = tw.lib.RmvOutlierRng_head(tw.array(y), tw.array(x), tw.array(w), tw.array(rng_), sel, *outs)
        return (s, *(o.numpy() for o in outs))

    def test_ranges_against_masks(self):
        n = 200
        y = np.round(self.rng.normal(0, 2, n), 1)
        x = np.round(self.rng.uniform(-5, 5, n), 1)
        y[[3, 50]] = np.nan
        x[7] = np.nan
        y[10], x[11], y[12], x[13] = 1.5, 2.0, -1.0, -3.0  # exactly at the limits
        w = self.rng.uniform(0, 1, n)
        for _ in placements():
            for sel, lim in ((0, (-1.0, 1.5)), (1, (-3.0, 2.0)), (2, (-3.0, 2.0, -1.0, 1.5))):
                for order in (1, -1):
                    r = np.array(lim).reshape(-1, 2)[:, ::order].ravel()
                    if sel == 0:
                        keep = (y > -1) & (y < 1.5)
                    else:
                        keep = (x > -3) & (x < 2)
                        if sel == 2:
                            keep &= (y > -1) & (y <= 1.5)  # y at the high limit stays
                    for weights in (w, np.array([])):
                        s, yk, xk, wk, removed = self.by_range(y, x, weights, np.r_[r, 99.0], sel)
                        self.assertEqual(s, 0)
                        np.testing.assert_array_equal(yk, y[keep])
                        np.testing.assert_array_equal(xk, x[keep])
                        np.testing.assert_array_equal(wk, weights[keep] if weights.size else [])
                        np.testing.assert_array_equal(removed, np.flatnonzero(~keep))
            self.assertIn(10, np.flatnonzero(keep))

    def test_indices_against_masks(self):
        n = 50
        y, x, w = self.rng.normal(size=(3, n))
        for _ in placements():
            for idx in ([0], [49, 3, 3, 17, 0], list(range(n))):
                outs = [tw.empty(), tw.empty(), tw.empty(), tw.empty(np.uint8)]
                s = tw.lib.RmvOutlierIndx_head(tw.array(y), tw.array(x), tw.array(w), tw.array(idx, np.int32), *outs)
                mask = np.zeros(n, np.uint8)
                mask[idx] = 1
                keep = mask == 0
                self.assertEqual(s, 0)
                for got, want in zip((o.numpy() for o in outs), (y[keep], x[keep], w[keep], mask)):
                    np.testing.assert_array_equal(got, want)


def tearDownModule():
    for key, err in sorted(WORST.items()):
        print(f"worst {key}: {err:.3g}", file=sys.stderr)


if __name__ == "__main__":
    unittest.main()
