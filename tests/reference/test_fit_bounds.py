"""Confidence and prediction bounds against a NumPy rendering of the linearised bands: J, G, C by
scipy.linalg.pinv (or the SVD of the scaled Vandermonde matrix for the polynomial confidence band),
with t taken from InvTdist_head so that the comparison can be tight, and that t checked against
scipy.stats.t.ppf within the bisection's bracket."""
import ctypes
import sys
import unittest

import numpy as np
import scipy.linalg
import scipy.stats

import twanlys as tw

D, I32, P = ctypes.c_double, ctypes.c_int32, ctypes.c_void_p
DP, IP = ctypes.POINTER(ctypes.c_double), ctypes.POINTER(ctypes.c_int32)
LN_LITERAL = 2.71828

# name: (parameter count, takes a base, parameter names)
MODELS = {"Linear": 2, "Exp": 2, "Power": 2, "Log": 2, "Gauss": 3}
for m, p in MODELS.items():
    base = [D] if m == "Log" else []
    getattr(tw.lib, f"ConfBnd{m}_head").argtypes = [P, P, P] + base + [D] * p + [D, P, P, P, P] + [DP] * p
    getattr(tw.lib, f"PredBnd{m}_head").argtypes = [P, P, P] + base + [D] * p + [D, P, P]
tw.lib.ConfBndPoly_head.argtypes = [P, P, P, P, D, P, P, P, P, P]
tw.lib.PredBndPoly_head.argtypes = [P, P, P, P, D, P, P]
tw.lib.InvTdist_head.argtypes = [DP, IP, DP, IP]

WORST = {}


def note(key, err):
    WORST[key] = max(WORST.get(key, 0.0), float(err))


def rel(got, want):
    return np.max(np.abs(np.asarray(got) - want)) / max(np.max(np.abs(want)), 1e-300)


def log_base(v, base):
    if base == LN_LITERAL:
        return np.log(v)
    if base == 10:
        return np.log10(v)
    return np.log(v) / np.log(base)


def model(name, x, params, base=None):
    """Model values and Jacobian (n by p, parameters in fit order)."""
    if name == "Linear":
        a, b = params
        return a * x + b, np.c_[np.ones_like(x), x]
    if name == "Exp":
        a, b = params
        e = np.exp(b * x)
        return a * e, np.c_[e, a * x * e]
    if name == "Power":
        a, b = params
        q = x**b
        return a * q, np.c_[q, a * q * np.log(x)]
    if name == "Log":
        a, b = params
        l = log_base(b * x, base)
        slope = a / b if base == LN_LITERAL else a / (b * np.log(base))
        return a * l, np.c_[l, np.full_like(x, slope)]
    if name == "Gauss":
        a, c, s = params
        z = (x - c) / s
        e = np.exp(-0.5 * z * z)
        return a * e, np.c_[e, a * z * e / s, a * z * z * e / s]
    v = np.vander(x, len(params), increasing=True)
    return v @ params, v


def lib_t(level, dof):
    p, df, t, st = D(1 - (1 - level) * 0.5), I32(dof), D(), I32()
    tw.lib.InvTdist_head(p, df, t, st)
    assert st.value == 0
    return t.value


def reference(name, x, y, w, params, level, base=None):
    """Curves (confidence, prediction) and deltas in fit order."""
    f, j = model(name, x, params, base)
    n, p = j.shape
    aw = np.ones(n) if w is None else np.abs(w)
    s2 = np.sum(((f - 2 * y) * f + y * y) * aw) / (n - p)
    t = lib_t(level, n - p)
    c = scipy.linalg.pinv(j.T @ (aw[:, None] * j))
    q = np.einsum("ij,jk,ik->i", j, c, j)
    pred = np.sqrt((q + (1 if w is None else 1 / aw)) * s2) * t
    if name == "Poly":
        _, s, vt = np.linalg.svd(j * np.sqrt(aw)[:, None], full_matrices=False)
        c = vt.T @ np.diag(np.where(s > 0, 1 / s**2, 0)) @ vt
        q = np.einsum("ij,jk,ik->i", j, c, j)
        delta = np.sqrt(np.diag(c) * s2) * t
    else:
        delta = np.sqrt(np.diag(c)) * t * np.sqrt(s2)
    conf = np.sqrt(q * s2) * t
    return f, conf, pred, delta


def conf_bounds(name, y, x, w, params, level, base=None):
    """Status, upper, lower, upper params, lower params, deltas (argument order)."""
    up, lo, upp, lop = tw.empty(), tw.empty(), tw.empty(), tw.empty()
    if name == "Poly":
        dh = tw.empty()
        s = tw.lib.ConfBndPoly_head(tw.array(y), tw.array(x), tw.array(w), tw.array(params), level, up, lo, upp,
                                    lop, dh)
        deltas = dh.numpy()
    else:
        d = [tw.f64(np.nan) for _ in params]
        args = ([base] if name == "Log" else []) + list(params) + [level]
        s = getattr(tw.lib, f"ConfBnd{name}_head")(tw.array(y), tw.array(x), tw.array(w), *args, up, lo, upp, lop,
                                                    *(v.ref for v in d))
        deltas = np.array([v.value for v in d])
    return s, up.numpy(), lo.numpy(), upp.numpy(), lop.numpy(), deltas


def pred_bounds(name, y, x, w, params, level, base=None):
    up, lo = tw.empty(), tw.empty()
    if name == "Poly":
        s = tw.lib.PredBndPoly_head(tw.array(y), tw.array(x), tw.array(w), tw.array(params), level, up, lo)
    else:
        args = ([base] if name == "Log" else []) + list(params) + [level]
        s = getattr(tw.lib, f"PredBnd{name}_head")(tw.array(y), tw.array(x), tw.array(w), *args, up, lo)
    return s, up.numpy(), lo.numpy()


def data(name, rng, n):
    """x, y and parameters near the least-squares fit of a noisy model (any parameters serve)."""
    if name == "Gauss":
        x = np.linspace(-3, 5, n)
        params = np.array([2.5, 0.8, 1.3])
    elif name == "Poly":
        x = np.linspace(-1.5, 2, n)
        params = np.array([0.5, -1.0, 0.3, 0.2])
    else:
        x = np.linspace(0.2, 4, n)
        params = np.array({"Linear": [1.7, -0.4], "Exp": [2.0, -0.6], "Power": [1.5, 1.3], "Log": [2.0, 3.0]}[name])
    f, _ = model(name, x, params, 10.0)
    y = f + rng.normal(0, 0.05, n)
    return x, y, params * (1 + rng.normal(0, 1e-3, len(params)))


class Bounds(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(34)

    def test_against_numpy(self):
        for name in list(MODELS) + ["Poly"]:
            for aligned in (0, 1):
                tw.placement(aligned)
                for weighted in (False, True):
                    for level in (0.9, 0.95):
                        for base in ((10.0, LN_LITERAL, 2.0) if name == "Log" else (None,)):
                            n = 40 + 17 * aligned
                            x, y, params = data(name, self.rng, n)
                            if name == "Log":
                                y = model(name, x, params, base)[0] + self.rng.normal(0, 0.05, n)
                            w = self.rng.uniform(0.2, 3, n) * self.rng.choice([-1, 1], n) if weighted else None
                            wl = [] if w is None else w
                            f, conf, pred, delta = reference(name, x, y, w, params, level, base)
                            key = (name, aligned, weighted, level, base)
                            s, up, lo, upp, lop, deltas = conf_bounds(name, y, x, wl, params, level, base)
                            self.assertEqual(s, 0, key)
                            if name == "Linear":
                                delta = delta[::-1]  # slope first among the outputs
                            note(f"{name} confidence", max(rel(up, f + conf), rel(lo, f - conf)))
                            note(f"{name} deltas", rel(deltas, delta))
                            np.testing.assert_allclose(up, f + conf, rtol=1e-9, err_msg=str(key))
                            np.testing.assert_allclose(lo, f - conf, rtol=1e-9, atol=1e-12, err_msg=str(key))
                            np.testing.assert_allclose(deltas, delta, rtol=1e-9, err_msg=str(key))
                            np.testing.assert_allclose(upp, params + delta, rtol=1e-12, err_msg=str(key))
                            np.testing.assert_allclose(lop, params - delta, rtol=1e-12, err_msg=str(key))
                            s, up, lo = pred_bounds(name, y, x, wl, params, level, base)
                            self.assertEqual(s, 0, key)
                            note(f"{name} prediction", max(rel(up, f + pred), rel(lo, f - pred)))
                            np.testing.assert_allclose(up, f + pred, rtol=1e-9, atol=1e-12, err_msg=str(key))
                            np.testing.assert_allclose(lo, f - pred, rtol=1e-9, atol=1e-12, err_msg=str(key))
        tw.placement(0)

    def test_library_t_brackets_scipy(self):
        # The bands use the bisected quantile: its bracket's lower end, within 1e-4 of the exact one.
        for level in (0.5, 0.9, 0.95, 0.99):
            for dof in (1, 2, 5, 30, 997):
                exact = scipy.stats.t.ppf(1 - (1 - level) / 2, dof)
                t = lib_t(level, dof)
                note("t below ppf", exact - t)
                self.assertTrue(0 <= exact - t <= 1e-4 + 1e-9, (level, dof, t, exact))

    def test_line_band_is_the_classical_one(self):
        # Unweighted line: q = 1/n + (x - mean)^2 / Sxx, the textbook band, with s2 over n - 2.
        n = 25
        x = np.linspace(-2, 3, n)
        y = 0.7 * x + 1.2 + self.rng.normal(0, 0.2, n)
        fit = scipy.stats.linregress(x, y)
        s, up, lo, upp, lop, d = conf_bounds("Linear", y, x, [], [fit.slope, fit.intercept], 0.95)
        f = fit.slope * x + fit.intercept
        s2 = np.sum((y - f) ** 2) / (n - 2)
        sxx = np.sum((x - x.mean()) ** 2)
        t = lib_t(0.95, n - 2)
        self.assertEqual(s, 0)
        np.testing.assert_allclose(up - f, t * np.sqrt(s2 * (1 / n + (x - x.mean()) ** 2 / sxx)), rtol=1e-9)
        # The slope's and intercept's standard errors of linregress, slope first.
        np.testing.assert_allclose(d, [t * fit.stderr, t * fit.intercept_stderr], rtol=1e-9)


def tearDownModule():
    for key, err in sorted(WORST.items()):
        print(f"worst {key}: {err:.3g}", file=sys.stderr)


if __name__ == "__main__":
    unittest.main()
