"""Derivative, integrals, unwrap and modulators against NumPy/SciPy and sequential renderings."""
import ctypes
import math
import unittest

import numpy as np
import scipy.integrate

from twanlys import lowlevel as tw

EPS = 2.0**-52
D, I32 = ctypes.c_double, ctypes.c_int32
tw.lib.Derivative85.argtypes = [ctypes.c_void_p] * 3 + [ctypes.POINTER(D), I32]
tw.lib.Integral90.argtypes = [ctypes.c_void_p] * 3 + [D, I32]
tw.lib.Integral_2017.argtypes = [ctypes.c_void_p, D, I32]
tw.lib.unWrap85.argtypes = [ctypes.c_void_p, I32]
tw.lib.CxComplexModulatorH.argtypes = [ctypes.c_void_p, D, D, ctypes.POINTER(D)]
tw.lib.ReComplexModulatorH.argtypes = [ctypes.c_void_p, D, D, ctypes.POINTER(D), ctypes.c_void_p]
for name in ("PhasMod", "FreqMod"):
    getattr(tw.lib, name).argtypes = [I32, D, ctypes.POINTER(D), D, ctypes.c_void_p,
                                      ctypes.POINTER(D), ctypes.POINTER(D)]
for name in ("CxComplexModulatorH", "ReComplexModulatorH", "PhasMod", "FreqMod"):
    getattr(tw.lib, name).restype = None

# Boundary samples each method reads: (init, final).
DERIVATIVE_REACH = [(1, 1), (2, 2), (0, 1), (1, 0)]
INTEGRAL_REACH = [(1, 0), (1, 1), (2, 1), (2, 2), (0, 0), (0, 0)]


def each_placement():
    for aligned in (0, 1):
        tw.placement(aligned)
        yield aligned
    tw.placement(0)


def derivative(x, init, final, dt, method):
    h = tw.array(x)
    s = tw.lib.Derivative85(h, tw.array(init), tw.array(final), ctypes.byref(D(dt)), method)
    return h.numpy(), s


def in_place(name, x, *args):
    h = tw.array(x)
    s = getattr(tw.lib, name)(h, *args)
    return h.numpy(), s


def integral_terms(ext, dt, method):
    """The terms of the boundary form on ext = [x[-2], x[-1], x..., x[n], x[n+1]]."""
    a = lambda d: ext[2 + d: len(ext) - 2 + d]  # noqa: E731  x[i + d] for i in 0..n-1
    if method == 0:
        return (a(0) + a(-1)) * dt * 0.5
    if method == 1:
        return (a(1) + 4 * a(0) + a(-1)) * dt / 6
    if method == 2:
        return (3 * (a(0) + a(-1)) + a(-2) + a(1)) * dt * 0.125
    if method == 3:
        return (12 * a(0) + 32 * (a(-1) + a(1)) + 7 * (a(-2) + a(2))) * dt / 90
    t = (a(-1) if method == 4 else a(0)) * dt
    t[0] = 0.0
    return t


class Calculus(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(2026112529)

    def test_derivative_central_against_gradient(self):
        for _ in each_placement():
            for n in (1, 2, 9, 1000):
                x = self.rng.normal(size=n)
                init, final = self.rng.normal(size=1), self.rng.normal(size=1)
                dt = 0.37
                y, s = derivative(x, init, final, dt, 0)
                self.assertEqual(s, 0)
                ref = np.gradient(np.r_[init, x, final], dt)[1:-1]
                np.testing.assert_allclose(y, ref, rtol=0, atol=4 * EPS * np.max(np.abs(x)) / dt)

    def test_stencils_exact_for_their_polynomials(self):
        # Degree 4 for the fourth-order stencil, degree 1 for the one-sided ones, on a grid of
        # binary fractions so that the samples themselves are exact.
        dt, n = 0.25, 40
        t = dt * np.arange(-2, n + 2)
        for method, coef in ((0, [0.5, -1.5, 2.0]), (1, [1.0, -0.5, 0.75, 0.125, -0.0625]),
                             (2, [3.0, -2.5]), (3, [-1.0, 4.0])):
            p = np.polynomial.Polynomial(coef)
            v = p(t)
            y, s = derivative(v[2:-2], v[:2] if method == 1 else v[1:2],
                              v[-2:] if method == 1 else v[-2:-1], dt, method)
            self.assertEqual(s, 0)
            ref = p.deriv()(t[2:-2])
            np.testing.assert_allclose(y, ref, rtol=0, atol=8 * EPS * np.max(np.abs(v)) / dt,
                                       err_msg=f"method {method}")

    def test_blocks_with_neighbours_as_boundaries_equal_one_call(self):
        x = self.rng.normal(size=103)
        init, final = self.rng.normal(size=2), self.rng.normal(size=2)
        full = np.r_[init, x, final]
        cuts = [0, 1, 2, 40, 41, 97, 103]
        for method, (r0, r1) in enumerate(DERIVATIVE_REACH):
            def call(a, b):
                y, s = derivative(x[a:b], full[a + 2 - r0:a + 2], full[b + 2:b + 2 + r1], 0.5, method)
                self.assertEqual(s, 0)
                return y
            parts = [call(a, b) for a, b in zip(cuts[:-1], cuts[1:])]
            np.testing.assert_array_equal(np.concatenate(parts), call(0, len(x)), err_msg=f"method {method}")

    def test_integrals_against_scipy_and_a_sequential_rendering(self):
        for _ in each_placement():
            for n in (1, 2, 500):
                x, init = self.rng.normal(size=n), self.rng.normal(size=1)
                y, s = in_place("Integral90", x, tw.array(init), tw.empty(), 0.1, 0)
                self.assertEqual(s, 0)
                ref = scipy.integrate.cumulative_trapezoid(np.r_[init, x], dx=0.1)
                np.testing.assert_allclose(y, ref, rtol=0, atol=n * EPS * 0.1 * np.sum(np.abs(x)))
        # Each term in its stated form, summed in sequence, gives the same bits.
        x, init, final = self.rng.normal(size=257), self.rng.normal(size=2), self.rng.normal(size=2)
        for method, (r0, r1) in enumerate(INTEGRAL_REACH):
            y, s = in_place("Integral90", x, tw.array(init[2 - r0:]), tw.array(final[:r1]), 0.3, method)
            self.assertEqual(s, 0)
            ref = np.cumsum(integral_terms(np.r_[init, x, final], 0.3, method))
            np.testing.assert_array_equal(y, ref, err_msg=f"method {method}")
        # The older export is method 1.
        h, s = tw.array(x), tw.i32()
        tw.lib.Integral(h, tw.array(init[1:]), tw.array(final[:1]), ctypes.byref(D(0.3)), s.ref)
        self.assertEqual(s.value, 0)
        np.testing.assert_array_equal(h.numpy(), np.cumsum(integral_terms(np.r_[init, x, final], 0.3, 1)))

    def test_integral_from_start_exact_for_polynomials(self):
        dt, n = 0.5, 23
        t = dt * np.arange(n)
        for method, degree in ((1, 2), (2, 3), (3, 4)):
            p = np.polynomial.Polynomial([1.0, -2.0, 0.5, 0.25, -0.125][:degree + 1])
            y, s = in_place("Integral_2017", p(t), dt, method)
            self.assertEqual(s, 0)
            ref = p.integ()(t) - p.integ()(0.0)
            np.testing.assert_allclose(y, ref, rtol=0, atol=16 * EPS * np.max(np.abs(ref)),
                                       err_msg=f"method {method}")
        x = self.rng.normal(size=300)
        y, s = in_place("Integral_2017", x, 0.2, 0)
        np.testing.assert_allclose(y, scipy.integrate.cumulative_trapezoid(x, dx=0.2, initial=0),
                                   rtol=0, atol=300 * EPS * 0.2 * np.sum(np.abs(x)))
        y, _ = in_place("Integral_2017", x, 0.2, 4)
        np.testing.assert_array_equal(y, np.r_[0, np.cumsum(x[:-1] * 0.2)])
        y, _ = in_place("Integral_2017", x, 0.2, 5)
        np.testing.assert_array_equal(y, np.r_[0, np.cumsum(x[1:] * 0.2)])

    def test_integral_from_start_at_the_shortest_lengths(self):
        x = np.array([1.0, 3.0, -2.0, 5.0, 0.5, 4.0])
        for method in range(6):
            least = method + 2 if method <= 3 else 2
            _, s = in_place("Integral_2017", x[:least - 1], 1.0, method)
            self.assertEqual(s, -20008, method)
            y, s = in_place("Integral_2017", x[:least], 1.0, method)
            self.assertEqual(s, 0, method)
            self.assertEqual(y[0], 0.0)
        # n = 3, method 1: y[1] from its start formula, y[2] from the recursion.
        y, _ = in_place("Integral_2017", x[:3], 0.5, 1)
        np.testing.assert_array_equal(y, [0.0, (5 * 1 + 8 * 3 - (-2)) * 0.5 / 12,
                                          0.0 + (1 + 4 * 3 + (-2)) * (0.5 / 3)])


class Unwrap(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(20261125)

    def unwrap(self, x, units):
        h = tw.array(x)
        s = tw.lib.unWrap85(h, units)
        return h.numpy(), s

    def test_against_numpy(self):
        for _ in each_placement():
            true = np.cumsum(self.rng.normal(0, 1.2, 2000))
            wrapped = np.angle(np.exp(1j * true))
            for units, scale, period, out in ((0, 1, 2 * np.pi, 1), (1, 1, 2 * np.pi, 180 / np.pi),
                                              (2, 180 / np.pi, 360.0, 1), (3, 180 / np.pi, 360.0, np.pi / 180),
                                              (7, 1, 2 * np.pi, 1), (-1, 1, 2 * np.pi, 1)):
                x = wrapped * scale
                y, s = self.unwrap(x, units)
                self.assertEqual(s, 0)
                ref = np.unwrap(x, period=period) * out
                np.testing.assert_allclose(y, ref, rtol=0, atol=16 * EPS * np.max(np.abs(ref)),
                                           err_msg=f"units {units}")
                first = {1: x[0] * 360 / (2 * np.pi), 3: x[0] * (2 * np.pi) / 360}.get(units, x[0])
                self.assertEqual(y[0], first)

    def test_half_period_ties_and_empty(self):
        # floor(0.5 + 0.5) = 1: a jump of +P/2 is reduced by P, a jump of -P/2 stays.
        for units, p in ((0, 2 * np.pi), (2, 360.0)):
            # The second step is 1.5 P from the unwrapped -P/2: floor(2) takes off 2 P.
            y, _ = self.unwrap([0.0, p / 2, p], units)
            np.testing.assert_array_equal(y, [0.0, -p / 2, -p])
            y, _ = self.unwrap([0.0, -p / 2, -p], units)
            np.testing.assert_array_equal(y, [0.0, -p / 2, -p])
            # np.unwrap keeps the +P/2 jump where the rounding here reduces it.
            self.assertEqual(np.unwrap([0.0, p / 2], period=p)[1], p / 2)
        self.assertEqual(self.unwrap([], 0)[1], -20008)
        s = tw.i32()
        tw.lib.unWrap(tw.empty(), s.ref)
        self.assertEqual(s.value, -20008)


def rotation(n, w, phase):
    """The stated oscillator, step by step."""
    cw, sw = math.cos(w), math.sin(w)
    c, s = math.cos(phase), math.sin(phase)
    out = np.empty(n, complex)
    for k in range(n):
        out[k] = complex(c, s)
        c, s = cw * c - sw * s, c * sw + cw * s
    p = phase + n * w
    return out, p - 2 * math.pi * math.floor(p / (2 * math.pi))


def modulate(name, n, k, carrier, x, peak, acc, offset=0):
    """PhasMod or FreqMod on a bare pointer placed at `offset` bytes into a buffer."""
    raw = (ctypes.c_char * (8 * n + 8))()
    base = ctypes.addressof(raw) + offset
    ctypes.memmove(base, np.ascontiguousarray(x, float).ctypes.data, 8 * n)
    phase, pk, ac = D(-1.0), D(peak), D(acc)
    getattr(tw.lib, name)(n, k, ctypes.byref(phase), carrier, base, ctypes.byref(pk), ctypes.byref(ac))
    out = np.empty(n)
    ctypes.memmove(out.ctypes.data, base, 8 * n)
    return out, phase.value, pk.value, ac.value


def modulate_reference(frequency, k, carrier, x, peak, acc):
    limit = 2 * math.pi / k
    out = []
    for v in x:
        if abs(math.trunc(v)) > abs(math.trunc(peak)):
            peak = v
        acc = v * (2 * math.pi) + carrier * (2 * math.pi) + acc if frequency else acc + carrier * (2 * math.pi)
        acc = acc - limit if acc >= limit else acc + limit
        out.append(math.sin(acc * k) if frequency else math.sin(acc * k + v * math.pi / 180))
    phase = acc * k * 180 / math.pi
    if not frequency:
        phase = phase + out[-1]
    return np.array(out), phase, peak, acc


class Modulators(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(202611)

    def test_complex_modulators(self):
        for _ in each_placement():
            for n, f, fs, phase in ((1, 3.0, 100.0, 0.5), (1000, 1.7, 64.0, 5.9), (4099, -250.0, 1000.0, 0.0)):
                w = 2 * math.pi * (f / fs)
                z = self.rng.normal(size=n) + 1j * self.rng.normal(size=n)
                osc, next_phase = rotation(n, w, phase)
                k = np.arange(n)
                bound = 4 * (k + 4) * EPS

                h, p = tw.array(z, np.complex128), D(phase)
                tw.lib.CxComplexModulatorH(h, f, fs, ctypes.byref(p))
                y = h.numpy()
                self.assertTrue(np.all(np.abs(y - z * np.exp(1j * (phase + w * k))) <= bound * np.abs(z)))
                self.assertTrue(np.all(np.abs(y - z * osc) <= 4 * EPS * np.abs(z)))
                self.assertEqual(p.value, next_phase)
                self.assertTrue(0 <= p.value < 2 * math.pi)

                out, p = tw.empty(np.complex128), D(phase)
                tw.lib.ReComplexModulatorH(tw.array(z.real), f, fs, ctypes.byref(p), out)
                y = out.numpy()
                self.assertTrue(np.all(np.abs(y - z.real * np.exp(1j * (phase + w * k))) <= bound * np.abs(z.real)))
                self.assertTrue(np.all(np.abs(y - z.real * osc) <= 4 * EPS * np.abs(z.real)))
                self.assertEqual(p.value, next_phase)

    def test_frequency_zero_ignores_the_phase(self):
        # A null phase pointer: it must be neither read nor written.
        z = np.array([1 + 2j, -3 + 0.5j])
        h = tw.array(z, np.complex128)
        tw.lib.CxComplexModulatorH(h, 0.0, 10.0, None)
        np.testing.assert_array_equal(h.numpy(), z)
        out = tw.empty(np.complex128)
        tw.lib.ReComplexModulatorH(tw.array(z.real), 0.0, 10.0, None, out)
        np.testing.assert_array_equal(out.numpy(), z.real + 0j)
        # An empty x does nothing, not even to y.
        out = tw.array([5 + 5j], np.complex128)
        p = D(2.0)
        tw.lib.ReComplexModulatorH(tw.empty(), 3.0, 10.0, ctypes.byref(p), out)
        self.assertEqual(out.numpy().tolist(), [5 + 5j])
        self.assertEqual(p.value, 2.0)

    def test_phase_and_frequency_modulators_against_their_steps(self):
        for name, frequency in (("PhasMod", False), ("FreqMod", True)):
            for offset in (0, 4):
                for k, carrier, peak, acc in ((1.0, 0.05, 0.0, 0.3), (0.25, -0.013, 2.9, -40.0), (3.0, 1.3, -7.5, 2.0)):
                    x = self.rng.normal(0, 4, 200)
                    out, phase, pk, ac = modulate(name, len(x), k, carrier, x, peak, acc, offset)
                    r_out, r_phase, r_peak, r_acc = modulate_reference(frequency, k, carrier, x, peak, acc)
                    np.testing.assert_array_equal(out, r_out, err_msg=name)
                    self.assertEqual((phase, pk, ac), (r_phase, r_peak, r_acc), name)

    def test_frequency_modulator_at_rest(self):
        k, acc = 0.5, 1.1
        out, phase, _, ac = modulate("FreqMod", 9, k, 0.0, np.zeros(9), 0.0, acc)
        limit = 2 * math.pi / k
        # acc + limit is at least limit: the walk goes up and down by limit, alternately.
        self.assertAlmostEqual(ac, acc + limit, delta=1e-14 * limit)
        np.testing.assert_allclose(out, math.sin(acc * k), rtol=0, atol=1e-14)
        self.assertAlmostEqual(phase, (acc + limit) * k * 180 / math.pi, delta=1e-12)
        # n of 0 returns at once: nothing is read or written.
        phase, pk, ac = D(7.0), D(8.0), D(9.0)
        tw.lib.PhasMod(0, 1.0, ctypes.byref(phase), 1.0, None, ctypes.byref(pk), ctypes.byref(ac))
        self.assertEqual((phase.value, pk.value, ac.value), (7.0, 8.0, 9.0))


if __name__ == "__main__":
    unittest.main()
