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

from twanlys import lowlevel as tw

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
jv_c = export("TW_BesselJr", D, D)
yv_c = export("TW_BesselYr", D, D)
iv_c = export("TW_BesselIr", D, D)
js_c = export("TW_BesselJs", I32, D)
ys_c = export("TW_BesselYs", I32, D)
airy_c = export("TW_Airy", D, results=4)
keli_c = export("TW_KelvinI", D, I32, results=2)
kelk_c = export("TW_KelvinK", D, I32, results=2)


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


def modulus(v, x):
    """sqrt(J^2 + Y^2): the envelope an oscillating J or Y is measured against."""
    return np.hypot(sc.jv(v, x), sc.yv(v, x))


def j_model(v, x):
    """Error model of J: rounding of the phase (grows with x), of the logarithmic route for huge or
    tiny values (grows with |ln M|), and the series' loss of eps I_0(x) where it runs to x ~ 14."""
    m = modulus(v, x)
    return EPS * (m * (1 + x + np.abs(np.log(m))) + np.where((x > 8) & (x < 15), sc.i0(x), 0.0))


def order_grid(vlo, vhi, xlo, xhi, n=1500, integer=False):
    v = uniform(vlo, vhi, n)
    v = np.round(v) if integer else v[np.abs(v - np.round(v)) > 1e-3]  # SciPy's jv errs just off an integer
    return v, uniform(xlo, xhi, v.size)


J_REGIONS = {
    "recurrence, small x": (0, 17, 0.01, 8),
    "recurrence, series to 14": (-17, 17, 8, 14),
    "recurrence, Hankel": (-17, 17, 14, 300),
    "ascending series": (17, 200, 0.05, 40),
    "orders to 200": (17, 200, 40, 3000),
    "negative orders": (-200, -17, 0.05, 100),
}


class BesselJY(unittest.TestCase):
    def test_orders_0_and_1_are_the_published_rational_forms(self):
        # Same routine as SciPy's: a few ulp of the envelope (near a zero the value's own ulp shrinks).
        x = np.concatenate([uniform(0, 5), uniform(5, 200), logspace(1e-300, 1e-4), [5.0, 1e-5]])
        for name, lib, ref, order in [("J0", jv_c(0.0, x), sc.j0(x), 0), ("J1", jv_c(1.0, x), sc.j1(x), 1),
                                      ("J1 at -x, order -1", jv_c(-1.0, -x), sc.j1(x), 1),
                                      ("Y0", yv_c(0.0, x), sc.y0(x), 0), ("Y1", yv_c(1.0, x), sc.y1(x), 1)]:
            env = np.maximum(np.abs(ref), modulus(order, x))
            err = np.abs(lib - ref) / (EPS * env)
            self.assertLessEqual(record(name + " (ulp of the envelope)", err.max()), 4, name)

    def test_j_every_region_within_its_error_model(self):
        for name, box in J_REGIONS.items():
            for integer in (False, True):
                with self.subTest(region=name, integer=integer):
                    v, x = order_grid(*box, integer=integer)
                    ref = sc.jv(v, x)
                    fin = np.isfinite(ref)
                    lib = jv_c(v, x)
                    self.assertTrue(np.all(np.isinf(lib[~fin])))
                    err = np.abs(lib - ref)[fin] / j_model(v, x)[fin]
                    self.assertLessEqual(record("J (model units)", np.max(err)), 128, name)

    def test_y_divides_both_j_errors_by_sin(self):
        for name, box in J_REGIONS.items():
            with self.subTest(region=name):
                v, x = order_grid(*box)
                ref = sc.yv(v, x)
                lib = yv_c(v, x)
                # The reflection needs J(-v), which overflows to NaN where Y is beyond ~1e300.
                fin = np.abs(ref) < 1e290
                model = (j_model(v, x) + j_model(-v, x)) / np.abs(np.sin(np.pi * v))
                err = np.abs(lib - ref)[fin] / model[fin]
                self.assertLessEqual(record("Y (model units)", np.max(err)), 128, name)

    def test_integer_y_is_the_upward_recurrence(self):
        n = RNG.integers(-40, 40, 2000)
        x = logspace(0.05, 500, 2000)
        ref = sc.yn(n, x)
        fin = np.abs(ref) < 1e300
        err = np.abs(yv_c(n.astype(float), x) - ref)[fin] / (EPS * modulus(n, x)[fin] * (np.abs(n[fin]) + 1))
        self.assertLessEqual(record("Yn (model units: eps M per order)", err.max()), 16)

    def test_large_orders_by_the_uniform_expansions(self):
        v = uniform(250, 420, 1500)
        x = v * uniform(0.2, 3.0, 1500)  # both sides of the turning point, and through it
        x = np.concatenate([x, v + uniform(-0.7, 0.7, 1500) * np.cbrt(v)])
        v = np.concatenate([v, v])
        ref, m = sc.jv(v, x), modulus(v, x)
        # jnt stops after the n^-8/3 term of the transitional expansion.
        model = j_model(v, x) + 1e-3 * m * v ** (-10 / 3)
        err = np.abs(jv_c(v, x) - ref) / model
        self.assertLessEqual(record("J orders 250-420 (model units)", np.max(err)), 16)

    def test_integer_orders_far_beyond_the_order(self):
        v = np.round(uniform(-17, 17, 400))
        x = logspace(5e3, 1e9, 400)
        err = np.abs(jv_c(v, x) - sc.jv(v, x)) / j_model(v, x)
        self.assertLessEqual(record("J integer order, x to 1e9 (model units)", err.max()), 128)

    def test_parity_and_screens(self):
        v = np.array([2.0, 3.0, 10.0, 11.0, 250.0, 251.0])
        x = np.array([1.0, 1.0, 7.5, 30.0, 260.0, 240.0])
        parity = np.where(v % 2 == 1, -1.0, 1.0)
        np.testing.assert_array_equal(jv_c(v, -x), parity * jv_c(v, x))
        np.testing.assert_array_equal(jv_c(-v, x), parity * jv_c(v, x))
        nan = [(0.5, -1.0), (np.nan, 1.0), (np.inf, 1.0), (-np.inf, 1.0), (2.0, np.inf), (2.0, np.nan),
               (-200.5, 10.0)]
        self.assertTrue(all(np.isnan(jv_c(a, b)) for a, b in nan))
        self.assertTrue(all(np.isnan(yv_c(a, b)) for a, b in nan + [(0.5, 0.0), (2.0, 0.0), (0.0, -1.0),
                                                                    (200.5, 10.0), (-200.5, 10.0),
                                                                    (150.5, 0.5), (300.0, 1.0)]))
        self.assertEqual(list(jv_c([2.5, -2.5, 3.0], [1e-17, 1e-17, -1e-17])), [0.0, 0.0, 0.0])


class BesselI(unittest.TestCase):
    def test_real_orders_through_kummers_function(self):
        v, x = order_grid(-200, 200, 0.01, 60, n=3000)
        v2, x2 = order_grid(-20, 20, 60, 300, n=1000)  # beyond, M(2x) may overflow (ruled: +Infinity)
        v, x = np.concatenate([v, v2]), np.concatenate([x, x2])
        ref = sc.iv(v, x)
        keep = np.isfinite(ref) & (np.abs(ref) > 1e-290) & (np.abs(ref) < 1e290)
        # Summing n ~ 2x + |v| terms of 1F1, and the factor exp(v ln(x/2) - x) (its argument's
        # rounding is relative in the result). For b = 2v + 1 < 0 the series divides by b + n, whose
        # rounding of b is relative to its distance from an integer.
        lg = np.abs(v * np.log(x / 2) - x)
        b = 2 * v + 1
        near = np.where(b < 0, np.abs(b) / np.abs(b - np.round(b)), 0.0)
        model = EPS * (2 * x + np.abs(v) + lg + near + 50) * np.abs(ref)
        err = np.abs(iv_c(v, x) - ref)[keep] / model[keep]
        self.assertLessEqual(record("I (model units)", err.max()), 4)

    def test_integer_orders_by_miller_recurrence(self):
        n = RNG.integers(-60, 60, 3000)
        x = np.concatenate([logspace(1e-6, 700, 2500), -logspace(1e-3, 50, 500)])
        ref = sc.iv(n, x)
        keep = np.isfinite(ref) & (np.abs(ref) > 1e-290)
        # I0 times a ratio of recurrence values: each step from the start index rounds.
        a = np.abs(n[keep])
        steps = np.maximum(2 * (a + np.floor(np.sqrt(100 * a))), np.sqrt(a * a + 78 * np.abs(x[keep])))
        err = ulps(iv_c(n.astype(float), x)[keep], ref[keep]) / (steps + 4)
        self.assertLessEqual(record("In (ulp per recurrence step)", err.max()), 8)
        self.assertLessEqual(worst_ulp("I0", iv_c(0.0, x), sc.i0(x)), 4)
        self.assertLessEqual(worst_ulp("I1", iv_c(1.0, x), sc.i1(x)), 4)

    def test_rulings(self):
        cases = [  # (v, x, reference, ulp)
            (2.7, 80.0, sc.iv(2.7, 80.0), 300),   # no term cap in 1F1
            (20.5, 40.0, sc.iv(20.5, 40.0), 300),
            (3.0, 600.0, sc.iv(3, 600.0), 1e4),   # Miller start past the turning point
            (5.0, 2e-8, sc.iv(5, 2e-8), 4),        # leading term, where the recurrence overflows
            (-4.0, -1e-9, sc.iv(4, 1e-9), 4),
            (-0.5, 1.0, 1.2312002145929677, 8),   # b = 2v + 1 <= 0: downward recurrence
        ]
        for v, x, ref, tol in cases:
            with self.subTest(v=v, x=x):
                self.assertLessEqual(worst_ulp("I rulings", iv_c(v, x), ref), tol)
        # The same recurrence at other half-integers. Its K part grows downward, so the rounding of
        # the start values, eps I_1/2(x), is carried up with it; each step rounds too.
        v = -0.5 - RNG.integers(0, 60, 800)
        x = logspace(0.01, 40, 800)
        ref = sc.iv(v, x)
        carried = sc.iv(0.5, x) * sc.kv(-v, x) / sc.kv(0.5, x)
        err = np.abs(iv_c(v, x) - ref) / (EPS * (np.abs(v) + 1) * (np.abs(ref) + carried))
        self.assertLessEqual(record("I negative half-integer (model units)", err.max()), 16)
        # 1F1(2x) overflows: +Infinity, never NaN.
        np.testing.assert_array_equal(iv_c([2.5, 30.5, 0.5], [400.0, 600.0, 1000.0]), np.inf)

    def test_edges(self):
        v = [-0.5, -1.5, -2.5, 2.5, 0.0, -3.0, np.inf, np.inf, 2.5]
        x = [0.0, 0.0, 0.0, 0.0, 0.0, 0.0, 0.0, 3.0, np.inf]
        np.testing.assert_array_equal(iv_c(v, x), [np.inf, -np.inf, np.inf, 0.0, 1.0, 0.0, 0.0, 0.0, np.inf])
        nan = [(np.nan, 1.0), (1.0, np.nan), (-np.inf, 1.0), (1.0, -np.inf), (np.inf, np.inf), (-200.5, 1.0),
               (0.5, -1.0)]
        self.assertTrue(all(np.isnan(iv_c(a, b)) for a, b in nan))
        self.assertEqual(iv_c(3.0, -2.0), -iv_c(3.0, 2.0))


class Spherical(unittest.TestCase):
    def test_half_integer_orders_scaled(self):
        n = RNG.integers(-30, 30, 3000)
        x = np.concatenate([logspace(1e-3, 1e3, 2500), uniform(8, 14, 500)])
        f = np.sqrt(np.pi / (2 * x))
        v = n + 0.5
        jref, yref = f * sc.jv(v, x), f * sc.yv(v, x)
        err = np.abs(js_c(n, x) - jref) / (f * j_model(v, x))
        self.assertLessEqual(record("spherical j (model units)", err.max()), 128)
        fin = np.abs(yref) < 1e290
        model = f * (j_model(v, x) + j_model(-v, x))  # |sin (n + 1/2) pi| = 1
        err = np.abs(ys_c(n, x) - yref)[fin] / model[fin]
        self.assertLessEqual(record("spherical y (model units)", err.max()), 128)

    def test_edges(self):
        np.testing.assert_array_equal(js_c([0, 3, 0, -2], [0.0, 0.0, np.inf, np.inf]), [1.0, 0.0, 0.0, 0.0])
        np.testing.assert_array_equal(ys_c([0, 3, 1], [0.0, 0.0, np.inf]), [-np.inf, -np.inf, 0.0])
        self.assertTrue(np.all(np.isnan(js_c([0, 1, 2], [-1.0, np.nan, -np.inf]))))
        self.assertTrue(np.all(np.isnan(ys_c([0, 1, 2], [-1.0, np.nan, -np.inf]))))


class Airy(unittest.TestCase):
    def test_against_scipy(self):
        # |x| <= 10: the same published routine, a few ulp of the envelope sqrt(Ai^2 + Bi^2);
        # beyond, SciPy uses AMOS.
        for lo, hi, tol in [(-10, 10, 4), (-300, -10, 16), (10, 103.892, 16)]:
            x = uniform(lo, hi, 3000)
            lib, ref = airy_c(x), sc.airy(x)
            env_f = np.hypot(ref[0], ref[2])
            env_d = np.hypot(ref[1], ref[3])
            # zeta = 2/3 |x|^(3/2) is rounded: it is a phase for x < 0 and the argument of exp for x > 0.
            phase = 1 + np.abs(x) ** 1.5
            # Ai, Ai' against the envelope of (Ai, Bi), (Ai', Bi'); Bi, Bi' likewise (they dominate
            # where Ai decays, and are then measured in their own ulp).
            for name, k, r, env in [("Ai", 0, 0, env_f), ("Bi", 1, 2, env_f), ("Ai'", 2, 1, env_d),
                                    ("Bi'", 3, 3, env_d)]:
                keep = (env > 1e-300) & np.isfinite(ref[r])
                err = np.abs(lib[k] - ref[r])[keep] / (EPS * env[keep] * phase[keep])
                self.assertLessEqual(record("%s (ulp of envelope x phase)" % name, err.max()), tol, name)

    def test_limits(self):
        big = 1.7976931348623157e308
        self.assertEqual(airy_c(200.0), (0.0, np.inf, big, big))
        self.assertEqual(airy_c(-np.inf), (0.0, 0.0, big, big))
        self.assertTrue(all(np.isnan(airy_c(np.nan))))


def kelvin_refs(n, x):
    """ber + i bei = J_n(x e^(3 pi i/4)); ker + i kei = e^(-n pi i/2) K_n(x e^(pi i/4))."""
    i = sc.jv(n, x * np.exp(3j * np.pi / 4))
    k = np.exp(-1j * n * np.pi / 2) * sc.kv(n, x * np.exp(1j * np.pi / 4))
    return i, k


class Kelvin(unittest.TestCase):
    def test_series_within_eps_i_n(self):
        n = RNG.integers(-8, 9, 3000)
        x = np.concatenate([uniform(0, 20, 2000), uniform(20, 60, 1000)])
        ref, kref = kelvin_refs(n, x)
        ber, bei = keli_c(x, n)
        scale = EPS * sc.iv(n, x)
        for name, lib, r in [("ber", ber, ref.real), ("bei", bei, ref.imag)]:
            self.assertLessEqual(record(name + " (eps I_n units)", np.max(np.abs(lib - r) / scale)), 32, name)
        xs = -x
        np.testing.assert_array_equal(keli_c(xs, n)[0], np.where(n % 2 == 1, -1, 1) * ber)

    def test_k_within_its_model(self):
        n = RNG.integers(-8, 9, 3000)
        x = np.concatenate([logspace(1e-3, 10, 2000), uniform(10, 60, 1000)])
        _, ref = kelvin_refs(n, x)
        ker, kei = kelk_c(x, n)
        scale = EPS * (3 + 3 * np.abs(np.log(x / 2))) * np.maximum(sc.iv(n, x), np.abs(ref))
        for name, lib, r in [("ker", ker, ref.real), ("kei", kei, ref.imag)]:
            self.assertLessEqual(record(name + " (model units)", np.max(np.abs(lib - r) / scale)), 16, name)
        # Beyond the series, the expansion is good to rounding of its phase.
        far = x > 20
        err = np.abs(ker + 1j * kei - ref)[far] / (EPS * np.abs(ref[far]) * (1 + x[far]))
        self.assertLessEqual(record("ker + i kei beyond 20 (relative, eps (1 + x) units)", err.max()), 4)

    def test_edges(self):
        self.assertEqual(keli_c(0.0, 0), (1.0, 0.0))
        self.assertEqual(keli_c(0.0, 3), (0.0, 0.0))
        for f, x in [(keli_c, np.nan), (keli_c, np.inf), (keli_c, -np.inf), (kelk_c, 0.0), (kelk_c, -1.0),
                     (kelk_c, np.nan)]:
            self.assertTrue(all(np.isnan(f(x, 2))), (f, x))
        self.assertEqual(kelk_c(np.inf, 1), (0.0, 0.0))
        for x in (0.7, 12.0):
            pos, neg = kelk_c(x, 3), kelk_c(x, -3)
            self.assertEqual(neg, (-pos[0], -pos[1]))


def print_report(title, figures):
    print("\n%s (SciPy %s):" % (title, scipy.__version__), file=sys.stderr)
    for name, w in sorted(figures.items()):
        print("  %-48s %.4g" % (name, w), file=sys.stderr)


def tearDownModule():
    print_report("worst errors against scipy.special", WORST)


if __name__ == "__main__":
    unittest.main()
