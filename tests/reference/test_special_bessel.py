"""The real Bessel, Airy and Kelvin functions against scipy.special. Where the routine is the same
published method as SciPy's (orders 0 and 1, I0, I1, K0, K1, Airy on |x| <= 10) the tolerance is a
few ulp; elsewhere the error model of the method: the series of J between x ~ 8 and 14 loses
eps I_0(x) absolutely, Y divides both J errors by |sin v pi|, the Kelvin series lose eps I_n(x)
(and K a further (3 + 3 |ln x/2|)). Prints the worst error per function at the end: ulp, or the
error in units of its model.
"""
import ctypes
import math
import sys
import unittest

import numpy as np
import scipy
import scipy.special as sc

import twanlys as tw

EPS = 2.0 ** -52
D, I32 = ctypes.c_double, ctypes.c_int32
PD = ctypes.POINTER(D)
WORST = {}
RNG = np.random.default_rng(20261125)


def export(name, *argtypes, results=1):
    fn = getattr(tw.lib, name)
    fn.argtypes = list(argtypes) + [PD] * results
    fn.restype = None
    outs = [D() for _ in range(results)]

    def call(*args):
        fn(*args, *[ctypes.byref(o) for o in outs])
        return tuple(o.value for o in outs) if results > 1 else outs[0].value

    return np.vectorize(call, otypes=[float] * results)


kn_c = export("TW_BesselKn", I32, D)


def ulps(lib, ref):
    lib, ref = np.asarray(lib, float), np.asarray(ref, float)
    return np.abs(lib - ref) / np.spacing(np.abs(ref))


def record(name, value):
    WORST[name] = max(WORST.get(name, 0.0), float(value))
    return float(value)


def worst_ulp(name, lib, ref):
    lib, ref = np.broadcast_arrays(np.asarray(lib, float), np.asarray(ref, float))
    keep = np.abs(ref) >= 1e-290
    return record(name + " (ulp)", np.max(ulps(lib[keep], ref[keep])) if keep.any() else 0.0)


def worst_model(name, lib, ref, scale):
    """Worst |lib - ref| / scale: the error in units of the method's error model."""
    err = np.abs(np.asarray(lib, float) - np.asarray(ref, float)) / np.asarray(scale, float)
    return record(name + " (model units)", np.max(err))


def uniform(lo, hi, n=2000):
    return RNG.uniform(lo, hi, n)


def logspace(lo, hi, n=2000):
    return np.exp(RNG.uniform(math.log(lo), math.log(hi), n))


class ModifiedK(unittest.TestCase):
    def test_orders_0_and_1_are_the_published_series(self):
        x = np.concatenate([logspace(1e-300, 2), uniform(2, 700), [2.0, np.nextafter(2, 3)]])
        self.assertLessEqual(worst_ulp("K0", kn_c(0, x), sc.k0(x)), 4)
        self.assertLessEqual(worst_ulp("K1", kn_c(1, x), sc.k1(x)), 4)
        self.assertLessEqual(worst_ulp("K1 order -1", kn_c(-1, x), sc.k1(x)), 4)

    def test_upward_recurrence(self):
        n = RNG.integers(2, 60, 3000)
        x = logspace(1e-3, 600, 3000)
        ref = sc.kn(n, x)
        fin = np.isfinite(ref) & (ref > 1e-300)
        lib = kn_c(n, x)
        # K dominates upward, so the recurrence is stable, but each step adds its rounding: the
        # model is a few ulp per step.
        worst_ulp("Kn", lib[fin], ref[fin])
        per_step = ulps(lib[fin], ref[fin]) / n[fin]
        self.assertLessEqual(record("Kn (ulp per order)", per_step.max()), 8)
        self.assertTrue(np.all(lib[~fin & (ref == np.inf)] == np.inf))
        self.assertEqual(worst_ulp("Kn negative order", kn_c(-n, x)[fin], lib[fin]), 0)

    def test_edges(self):
        self.assertEqual(list(kn_c([0, 3], [0.0, 0.0])), [np.inf, np.inf])
        self.assertEqual(list(kn_c([0, 5], [np.inf, np.inf])), [0.0, 0.0])
        self.assertTrue(np.all(np.isnan(kn_c([0, 2, 2], [-1.0, -np.inf, np.nan]))))


def print_report(title, figures):
    print("\n%s (SciPy %s):" % (title, scipy.__version__), file=sys.stderr)
    for name, w in sorted(figures.items()):
        print("  %-48s %.4g" % (name, w), file=sys.stderr)


def tearDownModule():
    print_report("worst errors against scipy.special", WORST)


if __name__ == "__main__":
    unittest.main()
