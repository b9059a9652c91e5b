"""Patterns, pulses and shuffles against NumPy/SciPy, the stated formulas and a Python rendering of
the shuffles' draws."""
import ctypes
import math
import os
import sys
import unittest

import numpy as np
from scipy import signal, special

from twanlys import lowlevel as tw

sys.path.insert(0, os.path.join(os.path.dirname(os.path.abspath(__file__)), "..", "generate"))
import wichmann_hill_reference as wh  # noqa: E402

D, I32, U32, P = ctypes.c_double, ctypes.c_int32, ctypes.c_uint32, ctypes.c_void_p
lib = tw.lib
lib.RampPtrn80.argtypes = [P, I32, D, D, I32]
lib.RampPtrn85.argtypes = [P, I32, D, D, I32, U32]
lib.AperiodTriangleH.argtypes = [P, I32, D, D, D, D, D]
lib.GaussPulseH.argtypes = [P, I32, D, D, D, D, D, D]
lib.GaussMonopulseH.argtypes = [P, I32, D, D, D, D]
lib.PeriodicSincH.argtypes = [P, I32, D, I32, D, D]
for name in ("RiffleArrayDBL2012_head", "RiffleArrayInt2012_head", "RiffleArrayCDB2012_head"):
    getattr(lib, name).argtypes = [P, P, I32, P, I32]
lib.RiffleIntNum2012_head.argtypes = [P, I32, I32, P, I32]
for name in ("RiffleArrayDBL_head", "RiffleArrayInt_head", "RiffleArrayCDB_head"):
    getattr(lib, name).argtypes = [P, P, I32, P]
lib.RiffleIntNum_head.argtypes = [P, I32, I32, P]


class State(ctypes.Structure):
    _fields_ = [("s1", I32), ("s2", I32), ("s3", I32)]


def pulse(export, n, *args, times=None):
    """Grid when times is None, else the time-array form (the length argument is then a decoy)."""
    y = tw.empty() if times is None else tw.array(times)
    s = getattr(lib, export)(y, n if times is None else 3, *args)
    return y.numpy(), s


class Ramps(unittest.TestCase):
    def test_linear_bit_for_bit_against_linspace(self):
        for start, end, n, exclude in [(0.0, 1.0, 11, 0), (-3.7, 12.25, 1001, 0), (5.0, -2.0, 17, 1),
                                       (1e-3, 7.0, 100, 1), (2.5, 2.5, 1, 0), (3.0, 9.0, 1, 1), (0.1, 0.7, 9, 2),
                                       (1e300, -1e300, 4, 0), (7.0, 7.0, 5, 1)]:
            y = tw.empty()
            self.assertEqual(lib.RampPtrn85(y, n, start, end, exclude, 0), 0)
            ref = np.linspace(start, end, n, endpoint=(exclude == 0))
            np.testing.assert_array_equal(y.numpy(), ref, str((start, end, n, exclude)))
            if exclude == 0:
                y80, y0, status = tw.empty(), tw.empty(), tw.i32(-1)
                self.assertEqual(lib.RampPtrn80(y80, n, start, end, 0), 0)
                lib.RampPtrn(y0, tw.i32(n).ref, tw.f64(start).ref, tw.f64(end).ref, status.ref)
                self.assertEqual(status.value, 0)
                np.testing.assert_array_equal(y80.numpy(), ref)
                np.testing.assert_array_equal(y0.numpy(), ref)

    def test_logarithmic(self):
        for start, end, n, exclude in [(1.0, 1000.0, 31, 0), (0.3, 0.002, 50, 0), (2.0, 5e6, 40, 1)]:
            y = tw.empty()
            self.assertEqual(lib.RampPtrn85(y, n, start, end, exclude, 1), 0)
            y = y.numpy()
            steps = n - 1 if exclude == 0 else n
            a, b = math.log10(start), math.log10(end)
            direct = [start] + [math.pow(10.0, k * ((b - a) / steps) + a) for k in range(1, n)]
            if exclude == 0:
                direct[-1] = end
            np.testing.assert_array_equal(y, direct)
            np.testing.assert_allclose(y, np.logspace(a, b, n, endpoint=(exclude == 0)), rtol=1e-13)
            self.assertEqual(y[0], start)


class Pulses(unittest.TestCase):
    def test_gauss_pulse_against_scipy(self):
        for a, fc, bw, att, dt, delay in [(1.0, 5.0, 0.5, 6.0, 0.002, 0.5), (2.5, 1e3, 0.2, 20.0, 1e-5, 3e-3),
                                          (-0.7, 0.1, 1.5, 3.0, 0.25, 20.0)]:
            n = 1000
            t = np.arange(n) * dt - delay
            y, s = pulse("GaussPulseH", n, a, delay, dt, fc, bw, att)
            self.assertEqual(s, 0)
            ref = a * signal.gausspulse(t, fc, bw, bwr=-att)
            np.testing.assert_allclose(y, ref, rtol=0, atol=1e-14 * abs(a))
            tt = np.array([-0.3, 0.0, 0.01, 7.0]) / fc
            y, s = pulse("GaussPulseH", 0, a, 99.0, -1.0, fc, bw, att, times=tt)
            self.assertEqual(s, 0)
            np.testing.assert_allclose(y, a * signal.gausspulse(tt, fc, bw, bwr=-att), rtol=0, atol=1e-14 * abs(a))

    def test_periodic_sinc_against_diric(self):
        t = np.linspace(-20, 20, 4001)
        for order in (1, 2, 3, 6, 7):
            y, s = pulse("PeriodicSincH", len(t), 1.5, order, 0.01, 20.0)
            self.assertEqual(s, 0)
            away = np.abs(np.sin(t / 2)) >= 1e-6
            np.testing.assert_allclose(y[away], 1.5 * special.diric(t[away], order), rtol=0, atol=4e-15)
            # At 0 and 2 pi the shape is 1 for every order: the absolute test, not the limit.
            y, s = pulse("PeriodicSincH", 0, 1.5, order, 0.0, 0.0, times=[0.0, 2 * np.pi, 1.0])
            self.assertEqual(s, 0)
            np.testing.assert_array_equal(y[:2], [1.5, 1.5])
            self.assertAlmostEqual(y[2], 1.5 * special.diric(1.0, order), delta=1e-15)

    def test_sinc_against_numpy(self):
        for a, delay, dt in [(1.0, 0.75, 0.25), (3.0, 10.3, 0.1), (-2.0, -4.0, 1.0)]:
            n = 400
            y, s = self.sinc(n, a, delay, dt)
            self.assertEqual(s, 0)
            np.testing.assert_allclose(y, a * np.sinc(np.arange(n) * dt - delay), rtol=0, atol=4e-16 * abs(a))
            if delay == 0.75:
                self.assertEqual(y[3], a)  # x exactly 0

    @staticmethod
    def sinc(n, a, delay, dt):
        y, status = tw.empty(), tw.i32(-1)
        lib.SincWave(y, tw.i32(n).ref, tw.f64(a).ref, tw.f64(delay).ref, tw.f64(dt).ref, status.ref)
        return y.numpy(), status.value

    def test_triangle_formula_grid_and_times(self):
        a, w = 2.0, 3.0
        t = np.arange(-2.0, 5.0, 0.125)
        for skew in (0.0, 1.0, 0.25, 0.5):  # peaks on the grid
            m = skew * w
            with np.errstate(divide="ignore", invalid="ignore"):
                rise = np.where((t >= 0) & (t <= m), a / m * t, 0.0) if m > 0 else 0 * t
                fall = np.where((t > m) & (t <= w), (w - t) * (a / (w - m)), 0.0) if m < w else 0 * t
            expected = rise + fall
            if skew == 0:
                expected = np.where((t >= 0) & (t <= w), (w - t) * (a / w), 0.0)
            y, s = pulse("AperiodTriangleH", len(t), a, 2.0, 0.125, w, skew)
            self.assertEqual(s, 0)
            np.testing.assert_allclose(y, expected, rtol=1e-15, atol=0)
            self.assertEqual(np.max(y), a)
            # Given times are centred: t - w/2 lands where t did on the grid.
            y, s = pulse("AperiodTriangleH", 0, a, 0.0, -1.0, w, skew, times=t - w / 2)
            self.assertEqual(s, 0)
            np.testing.assert_allclose(y, expected, rtol=1e-15, atol=0)

    def test_monopulse_formula_and_peak(self):
        a, fc, dt, delay = 1.75, 2.0, 1 / 2000, 1.0
        n = 4000
        y, s = pulse("GaussMonopulseH", n, dt, delay, fc, a)
        self.assertEqual(s, 0)
        u = (np.arange(n) * dt - delay) * fc * np.pi
        np.testing.assert_allclose(y, u * (2 * a * np.sqrt(np.e)) * np.exp(-2 * u * u), rtol=1e-14, atol=1e-300)
        # The extremes +-a at u = +-1/2, i.e. t = +-1 / (2 pi fc).
        tt = np.array([1, -1]) / (2 * np.pi * fc)
        y, s = pulse("GaussMonopulseH", 0, 0.0, 0.0, fc, a, times=tt)
        np.testing.assert_allclose(y, [a, -a], rtol=1e-15)
        self.assertLessEqual(np.max(np.abs(pulse("GaussMonopulseH", n, dt, delay, fc, a)[0])), a * (1 + 1e-15))


def ref_riffle(ref, n, algorithm):
    perm = list(range(n))
    order = range(n) if algorithm == 0 else range(n - 1, 0, -1)
    for i in order:
        j = int(math.floor(wh.uniform(ref) * (n if algorithm == 0 else i + 1)))
        perm[i], perm[j] = perm[j], perm[i]
    return perm


class Riffle(unittest.TestCase):
    def test_permutation_draws_and_data(self):
        rng = np.random.default_rng(3)
        kinds = [("DBL", np.float64, lambda n: rng.standard_normal(n)),
                 ("Int", np.int32, lambda n: rng.integers(-1000, 1000, n)),
                 ("CDB", np.complex128, lambda n: rng.standard_normal(n) + 1j * rng.standard_normal(n))]
        for n in (1, 2, 7, 1000):
            for algorithm in (0, 1, -3):
                for kind, dtype, make in kinds:
                    x = np.asarray(make(n), dtype=dtype)
                    data, perm, st = tw.array(x, dtype), tw.empty(np.int32), State(5, 6, 7)
                    seed = 40 + n
                    if algorithm == 0 and n == 7:  # the old form forwards with algorithm 0
                        s = getattr(lib, "RiffleArray%s_head" % kind)(data, perm, seed, ctypes.byref(st))
                    else:
                        s = getattr(lib, "RiffleArray%s2012_head" % kind)(data, perm, seed, ctypes.byref(st),
                                                                         algorithm)
                    self.assertEqual(s, 0)
                    ref = wh.seed(seed)
                    expected = ref_riffle(ref, n, algorithm)
                    np.testing.assert_array_equal(perm.numpy(), expected)
                    np.testing.assert_array_equal(data.numpy(), x[expected])
                    self.assertEqual([st.s1, st.s2, st.s3], ref)  # n draws, or n - 1
                perm, st = tw.empty(np.int32), State(5, 6, 7)
                self.assertEqual(lib.RiffleIntNum2012_head(perm, n, -1, ctypes.byref(st), algorithm), 0)
                ref = [5, 6, 7]
                np.testing.assert_array_equal(perm.numpy(), ref_riffle(ref, n, algorithm))
                self.assertEqual([st.s1, st.s2, st.s3], ref)
        perm = tw.empty(np.int32)
        self.assertEqual(lib.RiffleIntNum_head(perm, 50, 9, ctypes.byref(State())), 0)
        np.testing.assert_array_equal(perm.numpy(), ref_riffle(wh.seed(9), 50, 0))


if __name__ == "__main__":
    unittest.main()
