"""Confidence and prediction bounds against a NumPy rendering of the linearised bands (J, G, C by
scipy.linalg.pinv, or by the SVD of the scaled Vandermonde matrix for the polynomial confidence
band), with t from InvTdist_head so that the comparison can be tight, that t checked against
scipy.stats.t.ppf within its bisection bracket; and the bands' properties on cases worked by hand."""
import ctypes
import sys
import unittest

import numpy as np
import scipy.linalg
import scipy.stats

from twanlys import lowlevel as tw

D, I32, P = ctypes.c_double, ctypes.c_int32, ctypes.c_void_p
DP, IP = ctypes.POINTER(ctypes.c_double), ctypes.POINTER(ctypes.c_int32)
LN_LITERAL = 2.71828
for m, p in {"Linear": 2, "Exp": 2, "Power": 2, "Log": 2, "Gauss": 3}.items():
    base = [D] if m == "Log" else []
    getattr(tw.lib, f"ConfBnd{m}_head").argtypes = [P, P, P] + base + [D] * p + [D, P, P, P, P] + [DP] * p
    getattr(tw.lib, f"PredBnd{m}_head").argtypes = [P, P, P] + base + [D] * p + [D, P, P]
tw.lib.ConfBndPoly_head.argtypes = [P, P, P, P, D, P, P, P, P, P]
tw.lib.PredBndPoly_head.argtypes = [P, P, P, P, D, P, P]
tw.lib.InvTdist_head.argtypes = [DP, IP, DP, IP]
MODELS = ("Linear", "Exp", "Power", "Log", "Gauss", "Poly")
WORST = {}


def note(key, err):
    WORST[key] = max(WORST.get(key, 0.0), float(err))


def log_base(v, base):
    return np.log(v) if base == LN_LITERAL else np.log10(v) if base == 10 else np.log(v) / np.log(base)


def model(name, x, p, base=None):
    """Model values and Jacobian (n by p, parameters in fit order: the line's intercept first)."""
    if name == "Linear":
        return p[0] * x + p[1], np.c_[np.ones_like(x), x]
    if name == "Exp":
        e = np.exp(p[1] * x)
        return p[0] * e, np.c_[e, p[0] * x * e]
    if name == "Power":
        q = x ** p[1]
        return p[0] * q, np.c_[q, p[0] * q * np.log(x)]
    if name == "Log":
        slope = p[0] / p[1] if base == LN_LITERAL else p[0] / (p[1] * np.log(base))
        return p[0] * log_base(p[1] * x, base), np.c_[log_base(p[1] * x, base), np.full_like(x, slope)]
    if name == "Gauss":
        z = (x - p[1]) / p[2]
        e = np.exp(-0.5 * z * z)
        return p[0] * e, np.c_[e, p[0] * z * e / p[2], p[0] * z * z * e / p[2]]
    v = np.vander(x, len(p), increasing=True)
    return v @ p, v


def lib_t(level, dof):
    t, st = D(), I32()
    tw.lib.InvTdist_head(D(1 - (1 - level) * 0.5), I32(dof), t, st)
    exact = scipy.stats.t.ppf(1 - (1 - level) / 2, dof)
    note("t below ppf", exact - t.value)
    assert st.value == 0 and 0 <= exact - t.value <= 1e-4 + 1e-9, (level, dof, t.value, exact)
    return t.value


def reference(name, x, y, w, p, level, base=None):
    """f, confidence and prediction half-widths, deltas in argument order."""
    f, j = model(name, x, p, base)
    n, k = j.shape
    aw = np.ones(n) if w is None else np.abs(w)
    s2 = np.sum(((f - 2 * y) * f + y * y) * aw) / (n - k)
    t = lib_t(level, n - k)
    c = scipy.linalg.pinv(j.T @ (aw[:, None] * j))
    pred = np.sqrt((np.einsum("ij,jk,ik->i", j, c, j) + 1 / aw) * s2) * t
    if name == "Poly":
        _, s, vt = np.linalg.svd(j * np.sqrt(aw)[:, None], full_matrices=False)
        c = vt.T @ np.diag(np.where(s > 0, 1 / s**2, 0)) @ vt
        delta = np.sqrt(np.diag(c) * s2) * t
    else:
        delta = np.sqrt(np.diag(c)) * t * np.sqrt(s2)
    conf = np.sqrt(np.einsum("ij,jk,ik->i", j, c, j) * s2) * t
    return f, conf, pred, delta[::-1] if name == "Linear" else delta


def bounds(prediction, name, y, x, w, p, level, base=None):
    """Status, upper, lower and, for confidence, upper and lower parameters and deltas."""
    kind = "PredBnd" if prediction else "ConfBnd"
    outs = [tw.empty() for _ in range(2 if prediction else 4 + (name == "Poly"))]
    d = [tw.f64(np.nan) for _ in p]
    head = [tw.array(y), tw.array(x), tw.array([] if w is None else w)]
    if name == "Poly":
        s = getattr(tw.lib, kind + "Poly_head")(*head, tw.array(p), level, *outs)
    else:
        s = getattr(tw.lib, f"{kind}{name}_head")(*head, *([base] if name == "Log" else []), *p, level, *outs,
                                                   *([] if prediction else [v.ref for v in d]))
    res = [s] + [o.numpy() for o in outs]
    return res if prediction or name == "Poly" else res + [np.array([v.value for v in d])]


class Bounds(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(34)

    def data(self, name, n, base):
        x = np.linspace(-3, 5, n) if name == "Gauss" else np.linspace(0.2, 4, n)
        p = {"Linear": [1.7, -0.4], "Exp": [2.0, -0.6], "Power": [1.5, 1.3], "Log": [2.0, 3.0],
             "Gauss": [2.5, 0.8, 1.3], "Poly": [0.5, -1.0, 0.3, 0.2]}[name]
        y = model(name, x, p, base)[0] + self.rng.normal(0, 0.05, n)
        return x, y, np.array(p) * (1 + self.rng.normal(0, 1e-3, len(p)))

    def test_against_numpy(self):
        for name in MODELS:
            for aligned in (0, 1):
                tw.placement(aligned)
                for weighted in (False, True):
                    for level in (0.9, 0.95):
                        for base in ((10.0, LN_LITERAL, 2.0) if name == "Log" else (None,)):
                            n = 40 + 17 * aligned
                            x, y, p = self.data(name, n, base)
                            w = self.rng.uniform(0.2, 3, n) * self.rng.choice([-1, 1], n) if weighted else None
                            f, conf, pred, delta = reference(name, x, y, w, p, level, base)
                            key = str((name, aligned, weighted, level, base))
                            s, up, lo, upp, lop, d = bounds(False, name, y, x, w, p, level, base)
                            self.assertEqual(s, 0, key)
                            note(f"{name} confidence", np.max(np.abs([up - f - conf, lo - f + conf]) / conf))
                            note(f"{name} deltas", np.max(np.abs(d / delta - 1)))
                            np.testing.assert_allclose([up, lo], [f + conf, f - conf], rtol=1e-9, atol=1e-12,
                                                       err_msg=key)
                            np.testing.assert_allclose(d, delta, rtol=1e-9, err_msg=key)
                            np.testing.assert_allclose([upp, lop], [p + delta, p - delta], rtol=1e-12, err_msg=key)
                            s, pu, pl = bounds(True, name, y, x, w, p, level, base)
                            self.assertEqual(s, 0, key)
                            note(f"{name} prediction", np.max(np.abs([pu - f - pred, pl - f + pred]) / pred))
                            np.testing.assert_allclose([pu, pl], [f + pred, f - pred], rtol=1e-9, atol=1e-12,
                                                       err_msg=key)
                            # Centred on the curve, the prediction band outside the confidence band.
                            np.testing.assert_allclose(up + lo, 2 * f, rtol=1e-12, atol=1e-12, err_msg=key)
                            self.assertTrue(np.all(pu - pl > up - lo), key)
        tw.placement(0)

    def test_three_points_have_one_degree_of_freedom(self):
        # (0, 0), (1, 1), (2, 0) and their line y = 1/3: s2 = 2/3 over n - 2 = 1, C = [[5, -3], [-3, 3]] / 6
        # in J order, so delta slope = t / sqrt(3), delta intercept = t sqrt(5) / 3, slope first.
        x, y = np.array([0.0, 1, 2]), np.array([0.0, 1, 0])
        t = lib_t(0.95, 1)
        self.assertAlmostEqual(t, 12.7062047, delta=1e-4)
        s, up, lo, upp, lop, d = bounds(False, "Linear", y, x, None, [0.0, 1 / 3], 0.95)
        self.assertEqual(s, 0)
        np.testing.assert_allclose(d, [t / np.sqrt(3), t * np.sqrt(5) / 3], rtol=1e-14)
        np.testing.assert_allclose([upp, lop], [[d[0], 1 / 3 + d[1]], [-d[0], 1 / 3 - d[1]]], rtol=1e-14)
        q = np.array([5, 2, 5]) / 6
        np.testing.assert_allclose(up - 1 / 3, np.sqrt(q * 2 / 3) * t, rtol=1e-14)
        s, pu, pl = bounds(True, "Linear", y, x, None, [0.0, 1 / 3], 0.95)
        np.testing.assert_allclose(pu - 1 / 3, np.sqrt((q + 1) * 2 / 3) * t, rtol=1e-14)

    def test_perfect_fit_gives_the_curve(self):
        x = np.arange(-2.0, 4)
        for name, p, y in (("Linear", [2.0, 1.0], 2 * x + 1), ("Poly", [1.0, -1, 0, 1], 1 - x + x**3)):
            for w in (None, [1, 2, 3, 0.5, 1, 4]):
                s, up, lo, upp, lop, d = bounds(False, name, y, x, w, p, 0.95)
                self.assertEqual(s, 0)
                self.assertTrue(np.array_equal(up, y) and np.array_equal(lo, y) and np.array_equal(upp, p))
                self.assertFalse(np.any(d))
                s, pu, pl = bounds(True, name, y, x, w, p, 0.9)
                self.assertTrue(s == 0 and np.array_equal(pu, y) and np.array_equal(pl, y))

    def test_polynomial_confidence_has_no_cut_off(self):
        # Two distinct x make a rank-2 Vandermonde of 3 columns: its third singular value is rounding
        # noise, kept by the confidence export's SVD and dropped by the prediction's pseudo-inverse.
        x, y = np.repeat([1.0, 2.0], 3), np.array([1.0, 1.1, 0.9, 2, 2.1, 1.9])
        s, up, lo, upp, lop, d = bounds(False, "Poly", y, x, None, [0.0, 1.0, 0.0], 0.95)
        self.assertEqual(s, 0)
        self.assertTrue(np.all(d > 1e8) and np.all(up - lo > 1e4), d)
        s, pu, pl = bounds(True, "Poly", y, x, None, [0.0, 1.0, 0.0], 0.95)
        self.assertTrue(s == 0 and np.all(pu - pl < 2), pu - pl)

    def test_larger_weight_narrower_prediction(self):
        # Pairs of equal x, weights 1 and 4: J C J^T is the same in a pair, so only 1 / |w| differs.
        x = np.repeat(np.linspace(0.5, 3, 6), 2)
        y = 2 * np.exp(-0.7 * x) + 0.03 * np.sin(5 * np.arange(12))
        w = np.tile([1.0, -4.0], 6)
        for name, p in (("Linear", [-0.8, 1.9]), ("Exp", [2, -0.7]), ("Power", [0.9, -0.6]), ("Log", [-0.9, 1.5]),
                        ("Gauss", [2.2, -0.5, 1.4]), ("Poly", [2, -1.4, 0.3])):
            s, pu, pl = bounds(True, name, y, x, w, p, 0.95, LN_LITERAL)
            self.assertEqual(s, 0)
            self.assertTrue(np.all((pu - pl)[1::2] < (pu - pl)[::2]), name)


def tearDownModule():
    for key, err in sorted(WORST.items()):
        print(f"worst {key}: {err:.3g}", file=sys.stderr)


if __name__ == "__main__":
    unittest.main()
