"""Least-squares fits and fit models against NumPy/SciPy, and against plain-loop replicas of the
documented forms where those round differently from the oracles."""
import ctypes
import math
import sys
import unittest

import numpy as np
import scipy.optimize
import scipy.stats

from twanlys import lowlevel as tw

EPS = 2.0**-52
D, I32, P = ctypes.c_double, ctypes.c_int32, ctypes.c_void_p
DP, IP = ctypes.POINTER(ctypes.c_double), ctypes.POINTER(ctypes.c_int32)
for name, args in {
    "LinFit_head": [P, P, P, DP, DP, DP],
    "PolyFit81_head": [P, P, I32, P, I32, P, P, P, P, DP],
    "GenLSFit_head": [P, P, P, I32, I32, P, P, P, DP],
    "GenLSFit80_head": [P, P, P, I32, I32, P, P, P, DP],
    "GoodnessOfFit_head": [P, P, P, I32, DP, DP, DP],
    "ExpFit80_head": [P, P, P, D, P, ctypes.c_uint16, DP, DP, DP, IP, D],
    "PowerFit_head": [P, P, P, D, P, DP, DP, DP, IP, D],
    "LogFit_head": [P, P, P, D, DP, DP, DP],
    "GaussianPeakFit_head": [P, P, P, D, P, DP, DP, DP, DP, IP, D],
}.items():
    getattr(tw.lib, name).argtypes = args

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


def lin_fit(y, x, w=()):
    yh, out = tw.array(y), [tw.f64() for _ in range(3)]
    s = tw.lib.LinFit_head(yh, tw.array(x), tw.array(w), *(o.ref for o in out))
    return s, [o.value for o in out], yh.numpy()


def poly_fit(x, y, order, w=(), method=0, powers=(), values=()):
    fit, coef, mse = tw.empty(), tw.empty(), tw.f64()
    s = tw.lib.PolyFit81_head(tw.array(x), tw.array(y), order, tw.array(w), method,
                              tw.array(powers, np.int32), tw.array(values), fit, coef, mse.ref)
    return s, coef.numpy(), fit.numpy(), mse.value


def gen_ls(h, y, third, method, cov=1, name="GenLSFit80_head"):
    coef, fit, c, mse = tw.empty(), tw.empty(), tw.empty(dims=2), tw.f64()
    s = getattr(tw.lib, name)(tw.matrix(h), tw.array(y), tw.array(third), method, cov, coef, fit, c, mse.ref)
    return s, coef.numpy(), fit.numpy(), c.numpy(), mse.value


def model(name, y, x, w, *args, guess=(), limit=100):
    """The y-in, fit-out model exports; returns status, parameters, fit, mse, iterations."""
    yh, it, mse = tw.array(y), tw.i32(limit), tw.f64()
    nparam = 3 if name.startswith("Gaussian") else 2
    out = [tw.f64() for _ in range(nparam)]
    if name == "ExpFit80_head":
        tol, method, floor = args
        s = tw.lib.ExpFit80_head(yh, tw.array(x), tw.array(w), tol, tw.array(guess), method,
                                 out[0].ref, out[1].ref, mse.ref, it.ref, floor)
    elif name == "LogFit_head":
        s = tw.lib.LogFit_head(yh, tw.array(x), tw.array(w), args[0], out[0].ref, out[1].ref, mse.ref)
    else:
        tol, floor = args
        s = getattr(tw.lib, name)(yh, tw.array(x), tw.array(w), tol, tw.array(guess),
                                  *(o.ref for o in out), mse.ref, it.ref, floor)
    return s, [o.value for o in out], yh.numpy(), mse.value, it.value


def mse_of(y, f, w=None):
    return np.sum(((f - y) ** 2) * (1 if w is None else np.abs(w))) / len(y)


class LeastSquares(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(20261125)

    def test_line_against_linregress_and_weighted_polyfit(self):
        for _ in placements():
            for n in (2, 3, 50, 1001):
                x = self.rng.uniform(-5, 5, n)
                y = 1.5 * x - 2 + self.rng.normal(0, 0.3, n)
                s, (m, c, mse), fit = lin_fit(y, x)
                ref = scipy.stats.linregress(x, y)
                self.assertEqual(s, 0)
                note("line coefficients", rel([m, c], [ref.slope, ref.intercept]))
                np.testing.assert_allclose([m, c], [ref.slope, ref.intercept], rtol=1e-11, atol=1e-12)
                np.testing.assert_allclose(fit, m * x + c, rtol=1e-15, atol=1e-14)
                self.assertLessEqual(abs(mse - mse_of(y, fit)), 4 * EPS * np.mean(y * y) + 1e-15)
                w = self.rng.uniform(-2, 2, n)
                s, (m, c, mse), fit = lin_fit(y, x, w)
                ref = np.polynomial.polynomial.polyfit(x, y, 1, w=np.sqrt(np.abs(w)))
                note("line weighted", rel([c, m], ref))
                np.testing.assert_allclose([c, m], ref, rtol=1e-10, atol=1e-12)
                self.assertLessEqual(abs(mse - mse_of(y, fit, w)), 8 * EPS * np.mean(np.abs(w) * y * y))

    def test_line_sums_bit_for_bit(self):
        # Far from the origin the uncentred sums and formulas decide the last digits.
        n = 2000
        x = 1e4 + 0.01 * np.arange(n)
        y = 3.0 * x + 7.0 + np.sin(np.arange(n))
        sx = sxx = sy = sxy = 0.0
        for a, b in zip(x.tolist(), y.tolist()):
            sx += a
            sxx += a * a
            sy += b
            sxy += a * b
        d = sx * sx - sxx * n
        slope, icept = (sy * sx - sxy * n) / d, (sxy * sx - sy * sxx) / d
        s, (m, c, _), fit = lin_fit(y, x)
        self.assertEqual((s, m, c), (0, slope, icept))
        ref = scipy.stats.linregress(x, y)
        self.assertGreater(abs(c - ref.intercept), 0)  # the uncentred form is not linregress

    def test_poly_against_numpy(self):
        for _ in placements():
            for order in (0, 1, 3, 6, 9):
                n = 60
                x = np.linspace(-1.5, 1.5, n)
                y = np.cos(2 * x) + self.rng.normal(0, 0.01, n)
                w = self.rng.uniform(0.1, 3, n)
                ref = np.polynomial.polynomial.polyfit(x, y, order, w=np.sqrt(w))
                for method in range(7):
                    s, coef, fit, mse = poly_fit(x, y, order, w, method)
                    self.assertEqual(s, 0)
                    tol = (1e-6 if method in (4, 5) else 1e-10) * np.linalg.cond(np.vander(x, order + 1))
                    note("poly coefficients / cond", rel(coef, ref) / np.linalg.cond(np.vander(x, order + 1)))
                    self.assertLess(rel(coef, ref), tol, (order, method))
                    np.testing.assert_allclose(fit, np.polynomial.polynomial.polyval(x, coef), rtol=1e-13,
                                               atol=1e-13)
                    self.assertAlmostEqual(mse, mse_of(y, fit, w), delta=1e-15)

    def test_poly_fixed_terms_against_reduced_fit(self):
        n = 40
        x = np.linspace(0, 2, n)
        y = 1 + 0.5 * x - 0.25 * x**3 + self.rng.normal(0, 0.01, n)
        # Powers 0 and 2 fixed (2 named twice: the later value holds, 7 lies outside 0..3).
        s, coef, fit, mse = poly_fit(x, y, 3, powers=[0, 2, 7, 2], values=[1.0, 9.0, 5.0, 0.0])
        ref = np.linalg.lstsq(np.c_[x, x**3], y - 1.0, rcond=None)[0]
        self.assertEqual(s, 0)
        np.testing.assert_allclose(coef, [1.0, ref[0], 0.0, ref[1]], rtol=1e-12, atol=1e-14)

    def test_general_methods_against_lstsq(self):
        # 20000 by 4 is reduced in several blocks of rows, the last one short; one size per placement.
        for aligned, (n, k) in enumerate(((200, 5), (20000, 4))):
            tw.placement(aligned)
            h = self.rng.normal(size=(n, k))
            y = h @ np.arange(1.0, k + 1) + self.rng.normal(0, 0.1, n)
            w = self.rng.uniform(0.2, 4, n)
            w[3] = -w[3]  # weights enter as |w|
            sw = np.sqrt(np.abs(w))
            ref = np.linalg.lstsq(h * sw[:, None], y * sw, rcond=0)[0]
            cov = np.linalg.inv(h.T @ (np.abs(w)[:, None] * h))
            results = {}
            for method in range(7):
                s, coef, fit, c, mse = gen_ls(h, y, w, method)
                self.assertEqual(s, 0, method)
                note("general coefficients", rel(coef, ref))
                note("general covariance", rel(c, cov))
                self.assertLess(rel(coef, ref), 1e-12, method)
                self.assertLess(rel(c, cov), 1e-11, method)
                np.testing.assert_allclose(fit, h @ coef, rtol=1e-14, atol=1e-13)
                self.assertAlmostEqual(mse, mse_of(y, fit, w), delta=4 * EPS * np.mean(np.abs(w) * y * y))
                results[method] = (coef.tobytes(), c.tobytes(), fit.tobytes())
            self.assertEqual(results[1], results[2])
            self.assertEqual(results[1], results[3])
        tw.placement(0)

    def test_deviations_and_rank_deficiency(self):
        n = 30
        x = np.arange(n, dtype=float)
        h = np.c_[np.ones(n), x, 2 * x + 1]  # third column dependent on the first two
        y = 0.5 + 0.2 * x + self.rng.normal(0, 0.05, n)
        s6, c6, *_ = gen_ls(h, y, [], 6, cov=0)
        ref = np.linalg.lstsq(h, y, rcond=n * EPS)[0]
        self.assertEqual(s6, 0)
        note("general rank-deficient (method 6)", rel(c6, ref))
        self.assertLess(rel(c6, ref), 1e-10)
        s0, c0, *_ = gen_ls(h, y, [], 0, cov=0)
        self.assertEqual(s0, 0)
        # The tiny singular value of the dependent column is kept and blows the solution up.
        self.assertGreater(np.linalg.norm(c0), 1e6 * np.linalg.norm(ref))
        sd = self.rng.uniform(0.5, 2, n)
        sd[4] = 0.0  # weight 1, not infinity
        w = np.where(sd == 0, 1.0, 1 / np.where(sd == 0, 1.0, sd) ** 2)
        hh = h[:, :2]
        s, coef, fit, c, mse = gen_ls(hh, y, sd, 0, name="GenLSFit_head")
        sw = np.sqrt(w)
        self.assertEqual(s, 0)
        self.assertLess(rel(coef, np.linalg.lstsq(hh * sw[:, None], y * sw, rcond=0)[0]), 1e-12)
        self.assertLess(rel(c, np.linalg.inv(hh.T @ (w[:, None] * hh))), 1e-11)

    def test_goodness_of_fit(self):
        n = 100
        y = self.rng.normal(5, 2, n)
        f = y + self.rng.normal(0, 0.5, n)
        for w in (None, self.rng.uniform(0, 2, n)):
            for dof in (0, 3, 97):
                sse, r2, rmse = tw.f64(), tw.f64(), tw.f64()
                s = tw.lib.GoodnessOfFit_head(tw.array(y), tw.array(f), tw.array([] if w is None else w), dof,
                                              sse.ref, r2.ref, rmse.ref)
                ww = np.ones(n) if w is None else w
                ref_sse = np.sum(ww * (f - y) ** 2)
                ref_sst = np.sum(ww * (y - np.mean(y)) ** 2)
                self.assertEqual(s, 0)
                self.assertAlmostEqual(sse.value / ref_sse, 1, delta=1e-12)
                self.assertAlmostEqual(r2.value, 1 - ref_sse / ref_sst, delta=1e-12)
                self.assertAlmostEqual(rmse.value, np.sqrt(ref_sse / (dof if dof > 0 else n - 2)), delta=1e-12)


def gauss_replica(x, y, w, a, c, s, tol, floor, limit):
    """The documented steepest descent, loop for loop in plain floats."""
    x, y = x.tolist(), y.tolist()
    q = [1.0] * len(x) if w is None else [abs(v) for v in w]
    n = len(x)

    def mse(a, c, s):
        total = 0.0
        for i in (range(n - 1, -1, -1) if w is None else range(n)):
            u = (x[i] - c) / s
            f = a * math.exp(-0.5 * (u * u))
            term = (f - 2 * y[i]) * f + y[i] * y[i]
            total += term if w is None else abs(term * w[i])
        return total / n

    cur = mse(a, c, s)
    start = (a, c, s, cur)
    prev, step, recompute, count = cur + 1.0, 1.0, True, 0
    g = [0.0, 0.0, 0.0]
    while True:
        if abs(prev - cur) <= prev * tol or cur <= floor:
            break
        if recompute:
            prev = cur
            g = [0.0, 0.0, 0.0]
            ss = s * s
            for i in range(n):
                v = x[i] - c
                u = v / s
                e = math.exp(-0.5 * (u * u))
                r = y[i] - a * e
                t = q[i] * r * a * v * e / ss
                g[0] += q[i] * r * e
                g[1] += t
                g[2] += t * v / s
        ta, tc, ts = a + g[0] * step, c + g[1] * step, s + g[2] * step
        cur = mse(ta, tc, ts)
        if prev < cur:
            step *= 0.5
            recompute = False
        else:
            a, c, s = ta, tc, ts
            recompute = True
        count += 1
        if count > limit:
            break
    if not start[3] > cur and not start[3] > prev:
        return start[0], start[1], abs(start[2]), start[3], count
    return a, c, abs(s), cur, count


class Models(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(7)

    def test_exponential_estimate_is_a_weighted_line(self):
        x = np.linspace(0, 2, 80)
        for sign in (1, -1):
            y = sign * 3 * np.exp(-1.2 * x) * (1 + self.rng.normal(0, 0.02, 80))
            y[5] = 0.0  # left out of the estimate, counted in the mse
            w = self.rng.uniform(0.5, 2, 80)
            s, (a, b), fit, mse, it = model("ExpFit80_head", y, x, w, -1.0, 0, 1e-12, guess=[9, 9], limit=17)
            m = sign * y > 0
            c = np.polynomial.polynomial.polyfit(x[m], np.log(sign * y[m]), 1, w=np.abs(y[m]) * np.sqrt(w[m]))
            self.assertEqual((s, it), (0, 17))
            note("exp estimate", rel([a, b], [sign * np.exp(c[0]), c[1]]))
            np.testing.assert_allclose([a, b], [sign * np.exp(c[0]), c[1]], rtol=1e-12)
            self.assertAlmostEqual(mse, mse_of(y, a * np.exp(b * x), w), delta=1e-14)

    def test_exponential_and_power_against_curve_fit(self):
        x = np.linspace(0.1, 3, 200)
        for name, f, p in (("ExpFit80_head", lambda x, a, b: a * np.exp(b * x), (2.0, -0.7)),
                           ("PowerFit_head", lambda x, a, b: a * x**b, (1.5, 1.3))):
            for weighted in (False, True):
                y = f(x, *p) + self.rng.normal(0, 0.02, x.size)
                w = self.rng.uniform(0.5, 2, x.size) if weighted else None
                ref, _ = scipy.optimize.curve_fit(f, x, y, p0=p, sigma=None if w is None else 1 / np.sqrt(w),
                                                  absolute_sigma=True)
                args = (1e-9, 1, 1e-14) if name == "ExpFit80_head" else (1e-9, 1e-14)
                s, par, fit, mse, it = model(name, y, x, [] if w is None else w, *args, limit=200)
                self.assertEqual(s, 0)
                ref_mse = mse_of(y, f(x, *ref), w)
                note("exp/power params vs curve_fit", rel(par, ref))
                np.testing.assert_allclose(par, ref, rtol=1e-3)
                self.assertLessEqual(ref_mse * (1 - 1e-9), mse)
                self.assertLessEqual(mse, ref_mse * (1 + 1e-3))
                np.testing.assert_allclose(fit, f(x, *par), rtol=1e-14)
                self.assertGreater(it, 0)

    def test_logarithm_is_a_line_on_the_log(self):
        x = np.linspace(0.5, 20, 60)
        y = 2.5 * np.log10(3.0 * x) + self.rng.normal(0, 0.01, 60)
        w = self.rng.uniform(0.5, 2, 60)
        for base, log in ((2.71828, np.log), (10.0, np.log10), (2.0, lambda v: np.log(v) / np.log(2.0))):
            for sign in (1, -1):
                s, (a, b), fit, mse, _ = model("LogFit_head", y, sign * x, w, base)
                c = np.polynomial.polynomial.polyfit(log(x), y, 1, w=np.sqrt(w))
                bb = sign * (np.exp(c[0] / c[1]) if base == 2.71828 else base ** (c[0] / c[1]))
                self.assertEqual(s, 0)
                note("log exact", rel([a, b], [c[1], bb]))
                np.testing.assert_allclose([a, b], [c[1], bb], rtol=1e-12)
                np.testing.assert_allclose(fit, a * log(sign * x * b), rtol=1e-13)

    def test_gaussian_follows_the_documented_descent(self):
        x = np.linspace(-4, 6, 121)
        for amp, centre, sd in ((3.0, 1.0, 1.3), (-2.0, 0.4, 0.8)):
            y = amp * np.exp(-0.5 * ((x - centre) / sd) ** 2) + self.rng.normal(0, 0.05, x.size)
            for tol, limit, w in ((1e-4, 1000, None), (1e-8, 300, None), (1e-6, 500, self.rng.uniform(-2, 2, x.size))):
                for aligned in placements():
                    start = [amp * 0.8, centre + 0.3, sd * 1.3]
                    s, (a, c, sdev), fit, mse, it = model("GaussianPeakFit_head", y, x, [] if w is None else w, tol,
                                                          1e-12, guess=start, limit=limit)
                    ra, rc, rs, rmse, rit = gauss_replica(x, y, w, *start, tol, 1e-12, limit)
                    self.assertEqual((s, it), (0, rit))
                    note("gaussian vs replica", rel([a, c, sdev, mse], [ra, rc, rs, rmse]))
                    np.testing.assert_allclose([a, c, sdev, mse], [ra, rc, rs, rmse], rtol=1e-12)
                    self.assertLess(abs(c - centre), 0.1)


def tearDownModule():
    for key, err in sorted(WORST.items()):
        print(f"worst {key}: {err:.3g}", file=sys.stderr)


if __name__ == "__main__":
    unittest.main()
