"""Splines, tableau interpolation and outlier removal against SciPy, NumPy masks and plain
transcriptions of the documented tableau and band forms."""
import ctypes
import sys
import unittest

import numpy as np
import scipy.interpolate as si

from twanlys import lowlevel as tw

D, P = ctypes.c_double, ctypes.c_void_p
DP, IP, PP = ctypes.POINTER(D), ctypes.POINTER(ctypes.c_int32), ctypes.POINTER(P)
for name, args in {
    "Spline_head": [P, P, DP, DP, P, IP], "SpInterp_head": [PP, PP, PP, DP, DP, IP],
    "PolyInterp_head": [P, P, DP, DP, DP, IP], "RatInterp_head": [P, P, DP, DP, DP, IP],
    "CubicSplineFit_head": [P, P, P, P, D, DP],
    "BSplineFit_head": [P, P, P, ctypes.c_int32, ctypes.c_int32, ctypes.c_uint16, P, DP],
    "RmvOutlierRng_head": [P, P, P, P, ctypes.c_uint16, P, P, P, P],
}.items():
    getattr(tw.lib, name).argtypes = args
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


def spline_values(y, x, yp1, ypn, probes):
    y2, st, hs = tw.empty(), tw.i32(), [tw.array(y), tw.array(x)]
    tw.lib.Spline_head(*hs, tw.f64(yp1).ref, tw.f64(ypn).ref, y2, st.ref)
    refs = [ctypes.byref(P(h.h.value)) for h in hs + [y2]]
    out = []
    for xi in probes:
        yi, s2 = tw.f64(), tw.i32()
        tw.lib.SpInterp_head(*refs, tw.f64(xi).ref, yi.ref, s2.ref)
        out.append(yi.value if s2.value == 0 else None)
    return st.value, y2.numpy(), np.array(out)


def tableau(name, y, x, xi):
    yi, dy, st = tw.f64(), tw.f64(), tw.i32()
    getattr(tw.lib, name)(tw.array(y), tw.array(x), tw.f64(xi).ref, yi.ref, dy.ref, st.ref)
    return st.value, yi.value, dy.value


def smoothing(y, x, p, w=None, balance=None):
    yh, err = tw.array(y), tw.f64()
    opt = [tw.array(() if a is None else a) for a in (w, balance)]
    s = tw.lib.CubicSplineFit_head(yh, tw.array(x), *opt, p, err.ref)
    return s, yh.numpy(), err.value


def neville(x, y, xi, rational=False):
    """The tableau walk as documented; the rational d column starts at y + 1e-10, and the rational
    form returns a table entry hit exactly."""
    if rational and np.any(xi == x):
        return y[np.argmax(xi == x)], 0.0
    n, ns = len(x), int(np.argmin(np.abs(xi - x)))
    c, d = list(y), list(y + 1e-10 if rational else y)
    yi, dy, ns = y[ns], 0.0, ns - 1
    for m in range(1, n):
        for i in range(n - m):
            if rational:
                t = (x[i] - xi) * d[i] / (x[i + m] - xi)
                dd = (c[i + 1] - d[i]) / (t - c[i + 1])
                d[i], c[i] = c[i + 1] * dd, t * dd
            else:
                ho, hp = x[i] - xi, x[i + m] - xi
                f = (c[i + 1] - d[i]) / (ho - hp)
                d[i], c[i] = hp * f, ho * f
        dy = c[ns + 1] if 2 * (ns + 1) < n - m else d[ns]
        ns -= 0 if 2 * (ns + 1) < n - m else 1
        yi += dy
    return yi, dy


def reinsch(x, y, p, w=None, balance=None):
    """Dense rendering: (Q^T S^2 Q + R) g = Q^T y, fit y - S^2 Q g, S^2 = 6 (1 - p) / |w|; and cond."""
    n, h = len(x), np.diff(x)
    hr = h if balance is None else h / np.abs(balance)
    s2 = 6 * (1 - p) / (np.ones(n) if w is None else np.abs(w))
    q = np.zeros((n - 2, n))
    for i in range(n - 2):
        q[i, i:i + 3] = 1 / h[i], -(1 / h[i] + 1 / h[i + 1]), 1 / h[i + 1]
    r = p * (np.diag(2 * (hr[:-1] + hr[1:])) + np.diag(hr[1:-1], 1) + np.diag(hr[1:-1], -1))
    a = q @ np.diag(s2) @ q.T + r
    return y - s2 * (q.T @ np.linalg.solve(a, q @ y)), np.linalg.cond(a)


def error_of(x, y, fit, p, balance=None):
    """p sum (y - f)^2 plus (1 - p) times the exact integral of the squared (linear) second
    derivative of the natural spline through the fit, per interval times |balance|."""
    c = si.CubicSpline(x, fit, bc_type="natural").derivative(2)(x)
    per = np.diff(x) * (c[:-1] ** 2 + c[:-1] * c[1:] + c[1:] ** 2) / 3
    return p * np.sum((y - fit) ** 2) + (1 - p) * np.sum(per * (1 if balance is None else np.abs(balance)))


def parameters(data, kind):
    dist = np.sqrt(np.sum(np.diff(data, axis=0) ** 2, axis=1))
    run = np.r_[0, np.cumsum(np.sqrt(dist) if kind == 2 else dist)]
    if kind == 0 or run[-1] == 0:
        return np.linspace(0, 1, len(data))
    return np.r_[np.minimum(run[:-1] / run[-1], 1), 1.0]


def averaged_knots(u, d, m):
    t, step = np.r_[np.zeros(m), np.ones(d + 1)], len(u) / (m - d)
    for j in range(1, m - d):
        i = int(j * step)
        t[d + j] = (1 - (j * step - i)) * u[i - 1] + (j * step - i) * u[i]
    return t


class Interpolation(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(20261125)

    def test_spline_against_cubic_spline(self):
        x = np.sort(self.rng.uniform(-3, 5, 40))
        y = np.sin(x) + 0.1 * x**2
        probes = np.r_[x[0] - 1.5, self.rng.uniform(x[0], x[-1], 30), x[[0, 7, -1]], x[-1] + 2.0]
        # Slopes at or above 9.9e29 mean a natural end; 9.8e29 is a slope.
        for _ in placements():
            for yp1, ypn in ((1e30, 1e30), (0.7, -1.2), (1e30, 2.5), (-0.4, 5e30), (9.8e29, 1e30)):
                ref = si.CubicSpline(x, y, bc_type=tuple((2, 0.0) if v >= 9.9e29 else (1, v) for v in (yp1, ypn)))
                for sl in (slice(None), slice(None, None, -1)):  # descending: the same spline backwards
                    ends = (yp1, ypn) if sl.step is None else (ypn, yp1)
                    s, y2, values = spline_values(y[sl], x[sl], *ends, probes)
                    self.assertEqual(s, 0)
                    note("spline y2", rel(y2, ref.derivative(2)(x[sl])))
                    self.assertLess(rel(y2, ref.derivative(2)(x[sl])), 1e-12)
                    if yp1 != 9.8e29:
                        note("spline values", rel(values, ref(probes)))
                        self.assertLess(rel(values, ref(probes)), 1e-12)

    def test_tableaux_against_barycentric_rational_data_and_transcription(self):
        # Rational data away from zeros of y: near one the 1e-10 of the d column is no longer small.
        f = lambda t: (2 + t + t**2) / (3 + t + 0.5 * t**2)
        runs = [("PolyInterp_head", n) for n in (2, 5, 9, 14)] + [("RatInterp_head", n) for n in (5, 6, 9)]
        for _, (name, n) in ((a, r) for a in placements() for r in runs):
            rational = name == "RatInterp_head"
            x = np.linspace(-2, 2, n) + self.rng.uniform(-0.4, 0.4, n) / n
            y = f(x) if rational else np.exp(x) * np.cos(x)
            scale = np.max(np.abs(y))
            for xi in np.r_[self.rng.uniform(-2.2, 2.2, 6), x[n // 2]]:
                s, yi, dy = tableau(name, y, x, xi)
                ry, rdy = neville(x, y, xi, rational)
                if rational:
                    want, bound, transcribed = f(xi), 1e-8 * scale, 1e-12 * scale
                else:  # either form rounds within eps times the Lebesgue function at xi
                    leb = sum(abs(np.prod([(xi - x[k]) / (x[j] - x[k]) for k in range(n) if k != j])) for j in range(n))
                    want = si.BarycentricInterpolator(x, y)(xi)
                    bound = transcribed = 16 * n * EPS * leb * scale
                self.assertEqual(s, 0)
                note(name + " / bound", abs(yi - want) / bound)
                self.assertLess(abs(yi - want), bound)
                self.assertLess(abs(yi - ry), transcribed)
                self.assertLess(abs(dy - rdy), 1e-9 * scale if rational else 1e-12 * max(abs(rdy), 1e-3))
        # The 1e-10 of the d column biases a reciprocal's values by more than rounding.
        x = np.linspace(0.5, 3.0, 6)
        s, yi, _ = tableau("RatInterp_head", 1 / x - 0.5, x, 1.7)
        self.assertLess(abs(yi - neville(x, 1 / x - 0.5, 1.7, rational=True)[0]), 1e-15)
        self.assertGreater(abs(yi - (1 / 1.7 - 0.5)), 1e-13)


class FittingSplines(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(11)

    def data(self, n):
        x = np.linspace(0, 6, n) + self.rng.uniform(-0.3, 0.3, n) * 6 / n
        return x, np.sin(x) + self.rng.normal(0, 0.1, n), self.rng.uniform(0.2, 3, n)

    def test_smoothing_against_scipy_and_dense_rendering(self):
        # Up to six points the dense solve, from seven the band solve; n < 5 is beyond SciPy.
        for _ in placements():
            for n in (3, 4, 5, 7, 40, 400):
                x, y, w = self.data(n)
                b = self.rng.uniform(0.5, 2, n - 1) * np.where(np.arange(n - 1) % 2, -1, 1)
                for p, weights, balance in ((0.05, None, None), (0.5, w, None), (0.97, w, None), (0.6, w, b)):
                    s, fit, err = smoothing(y, x, p, weights, balance)
                    dense, cond = reinsch(x, y, p, weights, balance)
                    ref = dense if n < 5 or balance is not None else \
                        si.make_smoothing_spline(x, y, w=weights, lam=(1 - p) / p)(x)
                    self.assertEqual(s, 0)
                    note("smoothing fit / cond", rel(fit, ref) / cond)
                    self.assertLess(rel(fit, ref), 1e-15 * cond + 1e-13, (n, p))
                    note("smoothing error", abs(err / error_of(x, y, fit, p, balance) - 1))
                    self.assertLess(abs(err / error_of(x, y, fit, p, balance) - 1), 1e-11, (n, p))

    def test_smoothness_limits(self):
        x, y, w = self.data(25)
        s, fit, err = smoothing(y, x, 0.0, w)  # the weighted least-squares line
        c = np.polynomial.polynomial.polyfit(x, y, 1, w=np.sqrt(w))
        self.assertLess(rel(fit, c[0] + c[1] * x), 1e-15 * reinsch(x, y, 0.0, w)[1] + 1e-13)
        self.assertLess(abs(err), 1e-20)
        p = 8 / (8 + ((x[-1] - x[0]) / 25) ** 3)  # the automatic choice
        ref = si.make_smoothing_spline(x, y, w=w, lam=(1 - p) / p)(x)
        for outside in (-1.0, 1.5, float("nan")):
            s, fit, _ = smoothing(y, x, outside, w)
            self.assertLess(rel(fit, ref), 1e-15 * reinsch(x, y, p, w)[1] + 1e-13)

    def test_bspline_against_make_lsq_spline(self):
        n = 300
        th = np.linspace(0, 3, n)
        curve = np.c_[np.cos(th), np.sin(2 * th), th] + self.rng.normal(0, 0.01, (n, 3))
        t = np.cumsum(self.rng.uniform(0.1, 1, n)) + 5
        cases = [(curve, d, m, kind, None, None) for kind in (0, 1, 2) for d, m in ((1, 2), (3, 4), (2, 30), (5, 60))]
        cases += [(curve, 3, 12, 1, self.rng.uniform(-2, 2, n), None), (curve[:, :1], 3, 9, 1, None, None),
                  (curve[:80], 3, 10, 2, None, t[:80]),  # parameters given
                  (np.repeat(curve[::4], 2, axis=0), 3, 8, 1, None, None),  # repeated points, repeated u
                  (np.ones((20, 2)), 2, 5, 1, None, None)]  # no chord at all: uniform
        for _ in placements():
            for data, d, m, kind, w, tt in cases:
                dh, cp, mse = tw.matrix(data), tw.empty(dims=2), tw.f64()
                opt = [tw.array(() if a is None else a) for a in (w, tt)]
                s = tw.lib.BSplineFit_head(dh, *opt, d, m, kind, cp, mse.ref)
                u = parameters(data, kind) if tt is None else (tt - tt[0]) / (tt[-1] - tt[0])
                aw = np.ones(len(u)) if w is None else np.abs(w)
                # SciPy wants rising parameters: a repeated one (a repeated point) is one row of summed weight.
                uu, first, group = np.unique(u, return_index=True, return_inverse=True)
                ref = si.make_lsq_spline(uu, data[first], averaged_knots(u, d, m), k=d,
                                         w=np.sqrt(np.bincount(group, aw)))
                self.assertEqual(s, 0)
                note("bspline control points", rel(cp.numpy(), ref.c))
                self.assertLess(rel(cp.numpy(), ref.c), 1e-12, (d, m, kind))
                self.assertLess(rel(dh.numpy(), ref(u)), 1e-12)
                self.assertAlmostEqual(mse.value, np.sum(np.sum((ref(u) - data) ** 2, axis=1) * aw) / len(u),
                                       delta=1e-13)


class Outliers(unittest.TestCase):
    def test_ranges_against_masks(self):
        rng = np.random.default_rng(5)
        y, x = np.round(rng.normal(0, 2, 200), 1), np.round(rng.uniform(-5, 5, 200), 1)
        y[[3, 50]], x[7] = np.nan, np.nan  # NaN samples leave
        y[10], x[11], y[12], x[13] = 1.5, 2.0, -1.0, -3.0  # values at the limits
        w = rng.uniform(0, 1, 200)
        inside = lambda v, lo, hi: (v > lo) & (v < hi)
        for _ in placements():
            for sel, lim, keep in ((0, (-1.0, 1.5), inside(y, -1, 1.5)), (1, (-3.0, 2.0), inside(x, -3, 2)),
                                   (2, (-3.0, 2.0, -1.0, 1.5), inside(x, -3, 2) & (y > -1) & (y <= 1.5))):
                for order, weights in ((1, w), (-1, np.array([]))):  # limit pairs in both orders
                    r = np.r_[np.array(lim).reshape(-1, 2)[:, ::order].ravel(), 99.0]
                    outs = [tw.empty(), tw.empty(), tw.empty(), tw.empty(np.int32)]
                    s = tw.lib.RmvOutlierRng_head(tw.array(y), tw.array(x), tw.array(weights), tw.array(r), sel, *outs)
                    self.assertEqual(s, 0)
                    for got, want in zip(outs, (y[keep], x[keep], weights[keep] if weights.size else [],
                                                np.flatnonzero(~keep))):
                        np.testing.assert_array_equal(got.numpy(), want)


def tearDownModule():
    for key, err in sorted(WORST.items()):
        print(f"worst {key}: {err:.3g}", file=sys.stderr)


if __name__ == "__main__":
    unittest.main()
