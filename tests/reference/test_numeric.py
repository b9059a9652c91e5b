"""Numerical utilities against NumPy/SciPy in both block placements: scaling and norms bit for bit
against the stated forms, integration against weights built from scipy's newton_cotes, np.trapz
and simpson, coordinates against scipy.spatial.transform.Rotation."""
import ctypes
import math
import unittest

import numpy as np
import scipy.integrate
from scipy.spatial.transform import Rotation

from twanlys import lowlevel as tw

EPS = 2.0**-52
D, P, U16, I32 = ctypes.c_double, ctypes.c_void_p, ctypes.c_uint16, ctypes.c_int32
L = tw.lib
for name, types in {"unitVector80_head": [P, D, P], "CxUnitVector80_head": [P, D, P],
                    "Euler2Direction2011_head": [D, D, D, I32, P],
                    "Direction2Euler2011_head": [P, I32, P, P, P],
                    "CoordRotationEuler2011_head": [P, P, P, D, D, D, I32, P, P, P],
                    "CoordRotationEuler_head": [P, P, P, D, D, D, P, P, P],
                    "CoordRotationDirect_head": [P, P, P, P, U16, P, P, P],
                    "CoordRotation2D_head": [P, P, D, P, P],
                    "CoordConversion_head": [P, P, P, U16, U16, P, P, P]}.items():
    getattr(L, name).argtypes = types
for name in ("2D_head", "2D_2017_head", "3D_head", "3D_2017_head"):
    getattr(L, "NumerIntegration" + name).argtypes = [P, P, U16, P]


def seqsum(v):
    """Left-to-right sum, the order the library adds in."""
    return np.cumsum(v)[-1]


def placements():
    for aligned in (0, 1):
        tw.placement(aligned)
        yield aligned
    tw.placement(0)


def in_place(name, v, n_results, *extra, two_d=False):
    h = tw.matrix(v.reshape(-1, 2 if len(v) % 2 == 0 else 1)) if two_d else tw.array(v)
    outs, st = [tw.f64() for _ in range(n_results)], tw.i32(-1)
    getattr(L, name)(h, *[o.ref for o in outs], *extra, st.ref)
    assert st.value == 0, name
    return h.numpy().ravel(), [o.value for o in outs]


class Scaling(unittest.TestCase):
    def test_range_peak_linear_normalise(self):
        rng = np.random.default_rng(3312)
        with_nan = rng.uniform(-5, 5, 256)
        with_nan[[3, 100]] = np.nan
        sets = [rng.normal(3.0, 2.0, n) for n in (1, 2, 7, 100000)] + [with_nan, np.full(9, 0.1), np.zeros(4)]
        m, a = D(-1.7), D(0.3)
        for _, v, two_d in ((p, v, t) for p in placements() for v in sets for t in (False, True)):
            with np.errstate(all="ignore"):
                lo, hi = np.nanmin(v), np.nanmax(v)
                half = (hi - lo) * 0.5
                finite = np.isfinite(1 / half)
                out, res = in_place("Scale" if two_d else "Scale1DCIN", v, 2, two_d=two_d)
                np.testing.assert_array_equal(out, (v - (half + lo)) * (1 / half) if finite else v - (half + lo))
                self.assertEqual(res, [half + lo, half if finite else 1.0])

                p = np.nanmax(np.abs(v))
                out, res = in_place("QScale" if two_d else "QS1D", v, 1, two_d=two_d)
                np.testing.assert_array_equal(out, v * (1 / p) if p else v)
                self.assertEqual(res, [p])

                args = (ctypes.byref(m), ctypes.byref(a)) if two_d else (ctypes.byref(a), ctypes.byref(m))
                out, _ = in_place("LinEv" if two_d else "Line1", v, 0, *args, two_d=two_d)
                np.testing.assert_array_equal(out, v * -1.7 + 0.3)

                mean = seqsum(v) / len(v)
                sd = np.sqrt(seqsum((v - mean) * (v - mean)) / len(v))
                out, res = in_place("Norm2" if two_d else "Norm1", v, 2, two_d=two_d)
                np.testing.assert_array_equal(out, (v - mean) * (1 / sd))
                np.testing.assert_array_equal(res, [sd, mean])
                if not np.isnan(v).any():
                    self.assertLessEqual(abs(sd - np.std(v)), 8 * len(v) * EPS * np.max(np.abs(v)))
        # sum/n gives back the constant 2.0 but not 0.1 three times: the stated form stays.
        self.assertEqual(in_place("Norm1", np.full(3, 2.0), 2)[1], [0.0, 2.0])
        self.assertNotEqual(in_place("Norm1", np.full(3, 0.1), 2)[1][1], 0.1)

    def test_polar(self):
        rng = np.random.default_rng(7)
        x, y = rng.normal(size=5001), rng.normal(size=5001)
        x[:3], y[:3] = [0.0, -0.0, -2.0], [0.0, 0.0, 0.0]
        origin = (x == 0) & (y == 0)
        for _ in placements():
            hx, hy, st = tw.array(x), tw.array(y), tw.i32(-1)
            L.RectToPolar1D_head(hx, hy, st.ref)
            mag, ph = hx.numpy(), hy.numpy()
            np.testing.assert_array_equal(mag, np.where(origin, 0.0, np.sqrt(x * x + y * y)))
            # math.atan2 is the C library's; NumPy's own differs in the last bit.
            np.testing.assert_array_equal(ph, np.where(origin, 0.0, [math.atan2(b, a) for a, b in zip(x, y)]))
            L.PolarToRect1D_head(hx, hy, st.ref)
            self.assertEqual(st.value, 0)
            np.testing.assert_array_equal(hx.numpy(), mag * np.array([math.cos(t) for t in ph]))
            np.testing.assert_array_equal(hy.numpy(), mag * np.array([math.sin(t) for t in ph]))
            self.assertTrue(np.all(np.abs(hx.numpy() - x) <= 4 * EPS * mag))

    def test_unit_vectors(self):
        rng = np.random.default_rng(11)
        for _, n, y, cx in ((p, n, y, c) for p in placements() for n in (1, 4099)
                            for y in (2.0, 1.0, 3.0, 0.5, np.inf, -np.inf) for c in (False, True)):
            a = rng.normal(size=n) + (1j * rng.normal(size=n) if cx else 0)
            mag2 = (a * np.conj(a)).real
            mag = np.sqrt(mag2)  # |z| as sqrt(re^2 + im^2), not hypot
            ref = (np.max(mag) if y > 0 else np.min(mag)) if np.isinf(y) else seqsum(mag2 ** (y / 2)) ** (1 / y)
            if y in (1.0, 2.0):
                ref = seqsum(mag) if y == 1 else np.sqrt(seqsum(mag2))
            h, norm = tw.array(a, np.complex128 if cx else np.float64), tw.f64()
            self.assertEqual((L.CxUnitVector80_head if cx else L.unitVector80_head)(h, y, norm.ref), 0)
            # Exact where no pow is involved; pow and NumPy's power may differ in the last bit.
            tol = 0 if y in (1.0, 2.0) or np.isinf(y) else 4 * EPS
            self.assertLessEqual(abs(norm.value - ref), tol * ref, (n, y, cx))
            np.testing.assert_allclose(h.numpy(), a * (1 / ref), rtol=2 * tol, atol=0)
            self.assertLessEqual(abs(norm.value - np.linalg.norm(a, y)), 4 * n * EPS * ref)


# Start rules of the later generation by (method, leftover): coefficients, then the divisor.
START_RULES = {(1, 1): [5, 8, -1, 12], (2, 1): [9, 19, -5, 1, 24], (2, 2): [1, 4, 1, 3],
               (3, 1): [251, 646, -264, 106, -19, 720], (3, 2): [29, 124, 24, 4, -1, 90],
               (3, 3): [27, 102, 72, 42, -3, 80]}


def weights(n, method, later):
    """Weights in units of h: whole panels of newton_cotes, and the leftover at the end (older:
    the newton_cotes rule of the leftover's width) or at the start (later: START_RULES)."""
    w = np.zeros(n)
    if method in (0, 4, 5):
        w[:-1] += method in (0, 4)
        w[1:] += method in (0, 5)
        return w / 2 if method == 0 else w
    r, start = (n - 1) % (method + 1), 0
    if r and later:
        rule = START_RULES[(method, r)]
        w[:len(rule) - 1] = np.array(rule[:-1]) / rule[-1]
        start = r
    elif r:
        w[n - r - 1:] = scipy.integrate.newton_cotes(r, 1)[0]
    for p in range(start, n - method - 1, method + 1):
        w[p:p + method + 2] += scipy.integrate.newton_cotes(method + 1, 1)[0]
    return w


def integrate(x, dt, method, later):
    w = weights(len(x), method, later)
    return abs(dt) * np.dot(w, x), abs(dt) * np.dot(np.abs(w), np.abs(x))


def block3d(a):
    """A host block of i32 d0, d1, d2 and the elements of a, shaped (d2, d0, d1)."""
    L3 = tw.twrt.HostNewHandle
    L3.restype, L3.argtypes = P, [ctypes.c_size_t]
    h = L3(12 + a.nbytes)
    block = ctypes.cast(h, ctypes.POINTER(P))[0]
    ctypes.memmove(block, np.array(a.shape, np.int32)[[1, 2, 0]].ctypes.data, 12)
    ctypes.memmove(block + 12, a.ctypes.data, a.nbytes)
    return h


class Integration(unittest.TestCase):
    def one_d(self, x, dt, method, later):
        out, st, d, m = tw.f64(), tw.i32(-1), ctypes.byref(D(dt)), ctypes.byref(I32(method))
        if later:
            st.c.value = L.NumerIntegration_2017_head(tw.array(x), d, m, out.ref)
        else:
            L.NumerIntegration_head(tw.array(x), d, m, out.ref, st.ref)
        self.assertEqual(st.value, 0)
        return out.value

    def test_one_dimension(self):
        rng, worst = np.random.default_rng(1222), 0.0
        for _, later, method in ((p, t, m) for p in placements() for t in (False, True) for m in range(6 if t else 4)):
            for n in list(range(2 if method in (0, 4, 5) else method + 2, 14)) + [100, 1001, 4096]:
                x = rng.normal(size=n)
                for dt in (0.37, -0.37):
                    got = self.one_d(x, dt, method, later)
                    ref, scale = integrate(x, dt, method, later)
                    worst = max(worst, abs(got - ref) / scale)
                    if method == 0:
                        self.assertLess(abs(got - np.trapz(x, dx=0.37)), 1e-14 * scale)
                    if method == 1 and n % 2:
                        self.assertLess(abs(got - scipy.integrate.simpson(x, dx=0.37)), 1e-14 * scale)
        self.assertLess(worst, 1e-14)
        print(f"\n1-D worst error against the weights: {worst:.2e} of the sum of magnitudes")

    def test_start_terms_exact_on_polynomials(self):
        rng, t0, h = np.random.default_rng(5), 0.25, 0.5
        for method, degree in ((1, 2), (2, 3), (3, 4)):
            for n in range(method + 2, 14):
                c = rng.normal(size=degree + 1)
                t = t0 + h * np.arange(n)
                x = np.polynomial.polynomial.polyval(t, c)
                exact = np.diff(np.polynomial.polynomial.polyval([t0, t[-1]], np.polynomial.polynomial.polyint(c)))[0]
                self.assertLess(abs(self.one_d(x, h, method, True) - exact), 1e-13 * np.sum(np.abs(x)) * h)
        t = np.arange(6.0)  # a parabola over an odd number of intervals
        self.assertEqual(self.one_d(t * t, 1.0, 1, True), 125 / 3)
        self.assertNotEqual(self.one_d(t * t, 1.0, 1, False), 125 / 3)

    def test_two_and_three_dimensions(self):
        rng, steps = np.random.default_rng(9), np.array([0.3, -0.7, 1.9])
        for _, later, method in ((p, t, m) for p in placements() for t in (False, True) for m in range(4)):
            m = 5 if later and method == 3 else 3  # the later Bode rule reads five samples
            for d0, d1, d2 in ((m, m + 2, m + 1), (m + 4, m, m + 2)):
                a = rng.normal(size=(d2, d0, d1))
                plane = lambda s: integrate(np.array([integrate(r, steps[0], method, later)[0] for r in s]),
                                            steps[1], method, later)[0]
                scale, out = np.prod(np.abs(steps)) * np.sum(np.abs(a)) * 4, tw.f64()
                suffix = "_2017_head" if later else "_head"
                self.assertEqual(getattr(L, "NumerIntegration2D" + suffix)(tw.matrix(a[0]), tw.array(steps[:2]),
                                                                         method, out.ref), 0)
                self.assertLess(abs(out.value - plane(a[0])), 1e-14 * scale)
                if method == 0:
                    self.assertLess(abs(out.value - np.trapz(np.trapz(a[0], dx=0.3), dx=0.7)), 1e-14 * scale)
                h = block3d(a)
                st = getattr(L, "NumerIntegration3D" + suffix)(h, tw.array(steps), method, out.ref)
                tw.twrt.HostDisposeHandle(h)
                self.assertEqual(st, 0)
                ref = integrate(np.array([plane(s) for s in a]), steps[2], method, later)[0]
                self.assertLess(abs(out.value - ref), 1e-14 * scale, (method, d0, d1, d2))
                if method == 1 and d0 % 2 and d1 % 2 and d2 % 2:
                    simpson = scipy.integrate.simpson
                    nested = simpson(simpson(simpson(a, dx=0.3, axis=2), dx=0.7, axis=1), dx=1.9)
                    self.assertLess(abs(out.value - nested), 1e-14 * scale)


SEQUENCES = ["XYZ", "XZY", "YXZ", "YZX", "ZXY", "ZYX", "XYX", "XZX", "YXY", "YZY", "ZXZ", "ZYZ"]


def frame_matrix(seq, angles):
    """The direction matrix of a rotated frame: the transpose of the intrinsic rotation."""
    return Rotation.from_euler(SEQUENCES[seq], angles).as_matrix().T


def direction(seq, angles):
    m = tw.empty(dims=2)
    assert L.Euler2Direction2011_head(*angles, seq, m) == 0
    return m.numpy()


def euler(seq, m):
    out = [tw.f64() for _ in range(3)]
    assert L.Direction2Euler2011_head(tw.matrix(m), seq, *[o.ref for o in out]) == 0
    return np.array([o.value for o in out])


def points(name, inputs, *args, outs=3):
    o = [tw.empty() for _ in range(outs)]
    assert getattr(L, name)(*[tw.array(v) for v in inputs], *args, *o) == 0, name
    return np.array([h.numpy() for h in o])


class Coordinates(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(1233)

    def principal(self, seq):
        a, g = self.rng.uniform(-3.1, 3.1, 2)
        return np.array([a, self.rng.uniform(-1.5, 1.5) if seq < 6 else self.rng.uniform(0.05, 3.09), g])

    def test_direction_matrix_round_trip_and_lock(self):
        worst = 0.0
        for seq in range(12):
            for _ in range(50):
                angles = self.principal(seq)
                m = direction(seq, angles)
                worst = max(worst, np.max(np.abs(m - frame_matrix(seq, angles))))
                np.testing.assert_allclose(euler(seq, m), angles, rtol=0, atol=1e-13)
            # Any rotation, not only ones built here, decomposes as SciPy's does.
            for r in Rotation.random(20, random_state=seq):
                np.testing.assert_allclose(euler(seq, r.as_matrix().T), r.as_euler(SEQUENCES[seq]), rtol=0, atol=1e-12)
            # At the lock the second angle takes its limit, the third 0, and the matrix is rebuilt.
            for b in ((np.pi / 2, -np.pi / 2) if seq < 6 else (0.0, np.pi)):
                m = direction(seq, [self.rng.uniform(-3, 3), b, self.rng.uniform(-3, 3)])
                got = euler(seq, m)
                self.assertEqual(list(got[1:]), [b, 0.0], seq)
                np.testing.assert_allclose(frame_matrix(seq, got), m, rtol=0, atol=1e-15)
        self.assertLess(worst, 1e-15)
        print(f"\ndirection matrix worst error against SciPy: {worst:.2e}")

    def test_rotations_and_shifts(self):
        x = self.rng.normal(size=(3, 1001))
        for _ in placements():
            for seq in range(12):
                angles = self.principal(seq)
                got = points("CoordRotationEuler2011_head", x, *angles, seq)
                ref = frame_matrix(seq, angles) @ x
                np.testing.assert_allclose(got, ref, rtol=0, atol=4 * EPS * np.max(np.abs(ref)))
                m = direction(seq, angles)
                np.testing.assert_array_equal(points("CoordRotationDirect_head", x, tw.matrix(m), 1), got)
                by_angles = points("CoordRotationDirect_head", x, tw.matrix(np.arccos(m)), 0)
                np.testing.assert_allclose(by_angles, got, rtol=0, atol=1e-14 * np.max(np.abs(ref)))
            np.testing.assert_array_equal(points("CoordRotationEuler_head", x, *angles),
                                          points("CoordRotationEuler2011_head", x, *angles, 10))
            c, s = np.cos(0.7), np.sin(0.7)
            np.testing.assert_allclose(points("CoordRotation2D_head", x[:2], 0.7, outs=2),
                                       [x[0] * c + x[1] * s, x[1] * c - x[0] * s], rtol=0, atol=8 * EPS)
            d = np.array([[1.5], [-2.0], [0.25]])
            np.testing.assert_array_equal(points("CartesianShift3D_head", x, *map(D, d[:, 0])), x + d)
            np.testing.assert_array_equal(points("CartesianShift2D_head", x[:2], *map(D, d[:2, 0]), outs=2), x[:2] + d[:2])

    def test_conversions(self):
        x, y, z = self.rng.normal(size=(3, 1001))
        x[0] = y[0] = z[0] = 0.0
        for _, unit in ((p, u) for p in placements() for u in (0, 1)):
            k = 180 / 3.141592653589793 if unit else 1.0
            r, th, ph = points("CoordConversion_head", (x, y, z), 0, unit)
            np.testing.assert_array_equal(r, np.sqrt(x * x + y * y + z * z))
            np.testing.assert_allclose([th, ph], [np.arctan2(y, x) * k, np.arctan2(np.sqrt(x * x + y * y), z) * k],
                                       rtol=4 * EPS, atol=0)
            self.assertEqual((r[0], th[0], ph[0]), (0.0, 0.0, 0.0))
            back = points("CoordConversion_head", (r, th, ph), 1, unit)
            np.testing.assert_allclose(back, [x, y, z], rtol=0, atol=8 * EPS * np.max(r))
            rho, th, zz = points("CoordConversion_head", (x, y, z), 2, unit)
            np.testing.assert_array_equal([rho, zz], [np.sqrt(x * x + y * y), z])
            np.testing.assert_allclose(th, np.arctan2(y, x) * k, rtol=4 * EPS, atol=0)
            back = points("CoordConversion_head", (rho, th, zz), 3, unit)
            np.testing.assert_allclose(back, [x, y, z], rtol=0, atol=8 * EPS * np.max(rho))


if __name__ == "__main__":
    unittest.main()
