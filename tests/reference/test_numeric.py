"""Numerical utilities against NumPy/SciPy: scaling and norms (bit for bit against the stated
forms), integration and coordinates, in both block placements."""
import ctypes
import math
import unittest

import numpy as np
import scipy.integrate
from scipy.spatial.transform import Rotation

import twanlys as tw

EPS = 2.0**-52
D = ctypes.c_double
P = ctypes.c_void_p


def seqsum(v):
    """Left-to-right sum, the order the library adds in."""
    return np.cumsum(v)[-1] if len(v) else 0.0


def placements():
    for aligned in (0, 1):
        tw.placement(aligned)
        yield aligned
    tw.placement(0)


def data_sets(rng):
    for n in (1, 2, 7, 1000, 100003):
        yield rng.normal(3.0, 2.0, n)
    v = rng.uniform(-5, 5, 257)
    v[[3, 100, 200]] = np.nan
    yield v
    yield np.full(9, 0.1)
    yield np.zeros(4)


class Scaling(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(3312)
        tw.lib.unitVector80_head.argtypes = [P, D, P]
        tw.lib.CxUnitVector80_head.argtypes = [P, D, P]

    def run_in_place(self, name, v, *scalars, two_d=False):
        h = tw.matrix(v.reshape(1, -1)) if two_d else tw.array(v)
        outs = [tw.f64(np.pi) for _ in range(scalars[0])] if scalars else []
        st = tw.i32(-1)
        getattr(tw.lib, name)(h, *[o.ref for o in outs], *scalars[1:], st.ref)
        self.assertEqual(st.value, 0, name)
        return h.numpy().ravel(), [o.value for o in outs]

    def test_range_peak_linear_normalise(self):
        for _ in placements():
            for v in data_sets(self.rng):
                n = len(v)
                for two_d in (False, True):
                    with np.errstate(all="ignore"):
                        hi, lo = np.nanmax(v), np.nanmin(v)
                        half = (hi - lo) * 0.5
                        off = half + lo
                        if np.isfinite(1 / half):
                            ref, scale = (v - off) * (1 / half), half
                        else:
                            ref, scale = v - off, 1.0
                        out, (o, s) = self.run_in_place("Scale" if two_d else "Scale1DCIN", v, 2, two_d=two_d)
                        np.testing.assert_array_equal(out, ref)
                        self.assertEqual((o, s), (off, scale))

                        p = np.nanmax(np.abs(v))
                        out, (peak,) = self.run_in_place("QScale" if two_d else "QS1D", v, 1, two_d=two_d)
                        np.testing.assert_array_equal(out, v * (1 / p) if p != 0 else v)
                        self.assertEqual(peak, p)

                        mult, add = ctypes.c_double(-1.7), ctypes.c_double(0.3)
                        if two_d:
                            out, _ = self.run_in_place("LinEv", v, 0, ctypes.byref(mult), ctypes.byref(add), two_d=True)
                        else:
                            out, _ = self.run_in_place("Line1", v, 0, ctypes.byref(add), ctypes.byref(mult))
                        np.testing.assert_array_equal(out, v * -1.7 + 0.3)

                        mean = seqsum(v) / n
                        sd = np.sqrt(seqsum((v - mean) * (v - mean)) / n)
                        out, (s, m) = self.run_in_place("Norm2" if two_d else "Norm1", v, 2, two_d=two_d)
                        np.testing.assert_array_equal(out, (v - mean) * (1 / sd))
                        np.testing.assert_array_equal([s, m], [sd, mean])
                        if not np.isnan(v).any():
                            self.assertLessEqual(abs(sd - np.std(v)), 8 * n * EPS * np.max(np.abs(v)))

    def test_constant_mean(self):
        # sum/n returns the constant for 2.0 but not for 0.1 three times: the stated form stays.
        _, (sd, mean) = self.run_in_place("Norm1", np.full(3, 2.0), 2)
        self.assertEqual((sd, mean), (0.0, 2.0))
        out, (sd, mean) = self.run_in_place("Norm1", np.full(3, 0.1), 2)
        self.assertEqual(mean, (0.1 + 0.1 + 0.1) / 3)
        self.assertNotEqual(mean, 0.1)
        self.assertTrue(np.all(np.isfinite(out)) and sd > 0)

    def test_polar(self):
        for _ in placements():
            x, y = self.rng.normal(size=5001), self.rng.normal(size=5001)
            x[:4], y[:4] = [0.0, -0.0, 0.0, -2.0], [0.0, 0.0, -0.0, 0.0]
            hx, hy, st = tw.array(x), tw.array(y), tw.i32(-1)
            tw.lib.RectToPolar1D_head(hx, hy, st.ref)
            self.assertEqual(st.value, 0)
            mag, ph = hx.numpy(), hy.numpy()
            origin = (x == 0) & (y == 0)
            np.testing.assert_array_equal(mag, np.where(origin, 0.0, np.sqrt(x * x + y * y)))
            # NumPy's own arctan2 differs from the C library's in the last bit; math.atan2 is the C one.
            atan2 = np.array([math.atan2(b, a) for a, b in zip(x, y)])
            np.testing.assert_array_equal(ph, np.where(origin, 0.0, atan2))
            np.testing.assert_allclose(ph[~origin], np.arctan2(y, x)[~origin], rtol=2 * EPS, atol=0)
            tw.lib.PolarToRect1D_head(hx, hy, st.ref)
            np.testing.assert_array_equal(hx.numpy(), mag * np.array([math.cos(t) for t in ph]))
            np.testing.assert_array_equal(hy.numpy(), mag * np.array([math.sin(t) for t in ph]))
            self.assertTrue(np.all(np.abs(hx.numpy() - x) <= 4 * EPS * mag))

    def test_unit_vectors(self):
        for _ in placements():
            for n in (1, 5, 4099):
                v = self.rng.normal(size=n)
                z = v + 1j * self.rng.normal(size=n)
                for y in (2.0, 1.0, 3.0, 0.5, -1.5, np.inf, -np.inf):
                    for cx, a in ((False, v), (True, z)):
                        mag2 = (a * np.conj(a)).real
                        mag = np.sqrt(mag2) if cx else np.abs(a)  # |z| as sqrt(re^2 + im^2), not hypot
                        if np.isinf(y):
                            ref = np.max(mag) if y > 0 else np.min(mag)
                        elif y == 1:
                            ref = seqsum(mag)
                        elif y == 2:
                            ref = np.sqrt(seqsum(mag2))
                        else:
                            terms = mag2 ** (y / 2) if cx else np.abs(a) ** y
                            ref = seqsum(terms) ** (1 / y)
                        h, norm = tw.array(a, np.complex128 if cx else np.float64), tw.f64()
                        fn = tw.lib.CxUnitVector80_head if cx else tw.lib.unitVector80_head
                        self.assertEqual(fn(h, y, norm.ref), 0)
                        # pow against NumPy's fast paths (** 0.5 is sqrt): a last-bit difference
                        if y in (1.0, 2.0) or np.isinf(y):
                            self.assertEqual(norm.value, ref, (n, y, cx))
                            np.testing.assert_array_equal(h.numpy(), a * (1 / ref))
                        else:
                            self.assertLessEqual(abs(norm.value - ref), 4 * EPS * ref, (n, y, cx))
                            np.testing.assert_allclose(h.numpy(), a * (1 / ref), rtol=8 * EPS)
                        self.assertLessEqual(abs(norm.value - np.linalg.norm(a, y)), 4 * n * EPS * ref)
                h, norm, st = tw.array(v), tw.f64(), tw.i32(-1)
                tw.lib.unitVector_head(h, norm.ref, st.ref)
                self.assertEqual(norm.value, np.sqrt(seqsum(v * v)))
                np.testing.assert_array_equal(h.numpy(), v * (1 / norm.value))


# Leftover rules, in units of h: at the end (older), at the start (later) by method and leftover.
END_RULES = {1: [0.5, 0.5], 2: [1 / 3, 4 / 3, 1 / 3], 3: [3 / 8, 9 / 8, 9 / 8, 3 / 8]}
START_RULES = {(1, 1): [5 / 12, 8 / 12, -1 / 12], (2, 1): [9 / 24, 19 / 24, -5 / 24, 1 / 24],
               (2, 2): [1 / 3, 4 / 3, 1 / 3], (3, 1): np.array([251, 646, -264, 106, -19]) / 720,
               (3, 2): np.array([29, 124, 24, 4, -1]) / 90, (3, 3): np.array([27, 102, 72, 42, -3]) / 80}


def weights(n, method, later):
    """Integration weights in units of h: whole panels of newton_cotes, then the leftover."""
    w = np.zeros(n)
    if method == 0:
        w[:] = 1
        w[[0, -1]] = 0.5
        return w
    if method in (4, 5):
        w[:-1] = 1 if method == 4 else 0
        w[1:] += 0 if method == 4 else 1
        return w
    width = method + 1
    panel = scipy.integrate.newton_cotes(width, 1)[0]
    r = (n - 1) % width
    start = r if later else 0
    for p in range((n - 1) // width):
        w[start + p * width:start + (p + 1) * width + 1] += panel
    if r and later:
        rule = START_RULES[(method, r)]
        w[:len(rule)] += rule
    elif r:
        w[n - r - 1:] += END_RULES[r]
    return w


def integrate(x, dt, method, later):
    w = weights(len(x), method, later)
    return abs(dt) * np.dot(w, x), abs(dt) * np.dot(np.abs(w), np.abs(x))


def block3d(a):
    """A host block of three i32 dimensions and the elements of a (d2 slabs of d0 x d1)."""
    d2, d0, d1 = a.shape
    tw.twrt.HostNewHandle.restype = P
    tw.twrt.HostNewHandle.argtypes = [ctypes.c_size_t]
    h = tw.twrt.HostNewHandle(12 + a.nbytes)
    block = ctypes.cast(h, ctypes.POINTER(P))[0]
    ctypes.memmove(block, np.array([d0, d1, d2], np.int32).ctypes.data, 12)
    ctypes.memmove(block + 12, np.ascontiguousarray(a, np.float64).ctypes.data, a.nbytes)
    return h


class Integration(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(1222)
        for name in ("NumerIntegration2D_head", "NumerIntegration2D_2017_head",
                     "NumerIntegration3D_head", "NumerIntegration3D_2017_head"):
            getattr(tw.lib, name).argtypes = [P, P, ctypes.c_uint16, P]

    def one_d(self, x, dt, method, later):
        out, st = tw.f64(), tw.i32(-1)
        d, m = ctypes.byref(D(dt)), ctypes.byref(ctypes.c_int32(method))
        if later:
            st.c.value = tw.lib.NumerIntegration_2017_head(tw.array(x), d, m, out.ref)
        else:
            tw.lib.NumerIntegration_head(tw.array(x), d, m, out.ref, st.ref)
        return out.value, st.value

    def test_one_dimension_against_weights_and_scipy(self):
        worst = 0.0
        for _ in placements():
            for later in (False, True):
                for method in (0, 1, 2, 3, 4, 5) if later else (0, 1, 2, 3):
                    low = 2 if method in (0, 4, 5) else method + 2
                    for n in list(range(low, 14)) + [100, 1001, 4096]:
                        x = self.rng.normal(size=n)
                        for dt in (0.37, -0.37):
                            got, st = self.one_d(x, dt, method, later)
                            self.assertEqual(st, 0)
                            ref, scale = integrate(x, dt, method, later)
                            err = abs(got - ref) / scale
                            worst = max(worst, err)
                            self.assertLess(err, 1e-14, (method, n, later))
                            if method == 0:
                                self.assertLess(abs(got - np.trapz(x, dx=0.37)), 1e-14 * scale)
                            if method == 1 and n % 2 == 1:
                                simpson = scipy.integrate.simpson(x, dx=0.37)
                                self.assertLess(abs(got - simpson), 1e-14 * scale)
        print(f"\n1-D worst relative error against the weights: {worst:.2e}")

    def test_exact_on_polynomials(self):
        # The later generation is exact on polynomials of the degree of its start terms, for
        # every leftover; the older one closes with lower rules and is not.
        t0, h = 0.25, 0.5
        for method, degree in ((1, 2), (2, 3), (3, 4)):
            for n in range(method + 2, 14):
                c = self.rng.normal(size=degree + 1)
                t = t0 + h * np.arange(n)
                x = np.polynomial.polynomial.polyval(t, c)
                antiderivative = np.polynomial.polynomial.polyint(c)
                exact = np.diff(np.polynomial.polynomial.polyval([t0, t[-1]], antiderivative))[0]
                got, _ = self.one_d(x, h, method, True)
                self.assertLess(abs(got - exact), 1e-13 * np.sum(np.abs(x)) * h, (method, n))
        t = np.arange(6.0)
        got_old, _ = self.one_d(t * t, 1.0, 1, False)
        got_new, _ = self.one_d(t * t, 1.0, 1, True)
        self.assertEqual(got_new, 125 / 3)
        self.assertNotEqual(got_old, 125 / 3)

    def test_two_and_three_dimensions(self):
        for _ in placements():
            for later in (False, True):
                for method in range(4):
                    m = 5 if later and method == 3 else max(3, method + 2)
                    for d0, d1, d2 in ((m, m + 2, m + 1), (m + 4, m, m + 2)):
                        a = self.rng.normal(size=(d2, d0, d1))
                        steps = np.array([0.3, -0.7, 1.9])

                        def nested2(plane):
                            rows = [integrate(r, steps[0], method, later)[0] for r in plane]
                            return integrate(np.array(rows), steps[1], method, later)[0]

                        scale = np.prod(np.abs(steps)) * np.sum(np.abs(a)) * 4
                        out = tw.f64()
                        name2 = "NumerIntegration2D_2017_head" if later else "NumerIntegration2D_head"
                        st = getattr(tw.lib, name2)(tw.matrix(a[0]), tw.array(steps[:2]), method, out.ref)
                        self.assertEqual(st, 0)
                        self.assertLess(abs(out.value - nested2(a[0])), 1e-14 * scale)
                        if method == 0:
                            self.assertLess(abs(out.value - np.trapz(np.trapz(a[0], dx=0.3, axis=1), dx=0.7)),
                                            1e-14 * scale)
                        h = block3d(a)
                        name3 = "NumerIntegration3D_2017_head" if later else "NumerIntegration3D_head"
                        st = getattr(tw.lib, name3)(h, tw.array(steps), method, out.ref)
                        tw.twrt.HostDisposeHandle(h)
                        self.assertEqual(st, 0)
                        ref = integrate(np.array([nested2(p) for p in a]), steps[2], method, later)[0]
                        self.assertLess(abs(out.value - ref), 1e-14 * scale, (method, d0, d1, d2))
                        if method == 1 and d0 % 2 and d1 % 2 and d2 % 2:
                            simpson = scipy.integrate.simpson
                            nested = simpson(simpson(simpson(a, dx=0.3, axis=2), dx=0.7, axis=1), dx=1.9)
                            self.assertLess(abs(out.value - nested), 1e-14 * scale)


SEQUENCES = ["XYZ", "XZY", "YXZ", "YZX", "ZXY", "ZYX", "XYX", "XZX", "YXY", "YZY", "ZXZ", "ZYZ"]


def frame_matrix(seq, angles):
    """The direction matrix of a rotated frame: the transpose of the intrinsic rotation."""
    return Rotation.from_euler(SEQUENCES[seq], angles).as_matrix().T


class Coordinates(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(1233)
        L = tw.lib
        L.Euler2Direction2011_head.argtypes = [D, D, D, ctypes.c_int32, P]
        L.Direction2Euler2011_head.argtypes = [P, ctypes.c_int32, P, P, P]
        L.CoordRotationEuler2011_head.argtypes = [P, P, P, D, D, D, ctypes.c_int32, P, P, P]
        L.CoordRotationEuler_head.argtypes = [P, P, P, D, D, D, P, P, P]
        L.CoordRotationDirect_head.argtypes = [P, P, P, P, ctypes.c_uint16, P, P, P]
        L.CoordRotation2D_head.argtypes = [P, P, D, P, P]
        L.CoordConversion_head.argtypes = [P, P, P, ctypes.c_uint16, ctypes.c_uint16, P, P, P]
        L.CartesianShift3D_head.argtypes = [P, P, P, D, D, D, P, P, P]

    def direction(self, seq, angles):
        m = tw.empty(dims=2)
        self.assertEqual(tw.lib.Euler2Direction2011_head(*angles, seq, m), 0)
        return m.numpy()

    def euler(self, seq, m):
        out = [tw.f64() for _ in range(3)]
        self.assertEqual(tw.lib.Direction2Euler2011_head(tw.matrix(m), seq, *[o.ref for o in out]), 0)
        return np.array([o.value for o in out])

    def principal(self, seq):
        a, g = self.rng.uniform(-3.1, 3.1, 2)
        b = self.rng.uniform(-1.5, 1.5) if seq < 6 else self.rng.uniform(0.05, 3.09)
        return np.array([a, b, g])

    def test_direction_matrix_and_round_trip(self):
        worst = 0.0
        for seq in range(12):
            for _ in range(50):
                angles = self.principal(seq)
                m = self.direction(seq, angles)
                err = np.max(np.abs(m - frame_matrix(seq, angles)))
                worst = max(worst, err)
                self.assertLess(err, 1e-15, (seq, angles))
                np.testing.assert_allclose(self.euler(seq, m), angles, rtol=0, atol=1e-13)
            # Any rotation, not only ones built here, decomposes as SciPy's does.
            for r in Rotation.random(20, random_state=seq):
                m = r.as_matrix().T
                np.testing.assert_allclose(self.euler(seq, m), r.as_euler(SEQUENCES[seq]), rtol=0, atol=1e-12)
        print(f"\ndirection matrix worst error against SciPy: {worst:.2e}")

    def test_gimbal_lock(self):
        for seq in range(12):
            for b in ((np.pi / 2, -np.pi / 2) if seq < 6 else (0.0, np.pi)):
                a, g = self.rng.uniform(-3, 3, 2)
                m = self.direction(seq, [a, b, g])
                got = self.euler(seq, m)
                self.assertEqual(got[1], b, seq)
                self.assertEqual(got[2], 0.0, seq)
                np.testing.assert_allclose(frame_matrix(seq, got), m, rtol=0, atol=1e-15)

    def points(self, n=1001):
        return [self.rng.normal(size=n) for _ in range(3)]

    def call_points(self, name, inputs, *args, outs=3):
        o = [tw.empty() for _ in range(outs)]
        st = getattr(tw.lib, name)(*[tw.array(v) for v in inputs], *args, *o)
        self.assertEqual(st, 0, name)
        return [h.numpy() for h in o]

    def test_rotations_and_shifts(self):
        for _ in placements():
            x, y, z = self.points()
            for seq in range(12):
                angles = self.principal(seq)
                got = self.call_points("CoordRotationEuler2011_head", (x, y, z), *angles, seq)
                ref = frame_matrix(seq, angles) @ np.vstack((x, y, z))
                np.testing.assert_allclose(np.vstack(got), ref, rtol=0, atol=4 * EPS * np.max(np.abs(ref)))
                m = self.direction(seq, angles)
                direct = self.call_points("CoordRotationDirect_head", (x, y, z), tw.matrix(m), 1)
                np.testing.assert_array_equal(direct, got)
                by_angles = self.call_points("CoordRotationDirect_head", (x, y, z), tw.matrix(np.arccos(m)), 0)
                np.testing.assert_allclose(by_angles, got, rtol=0, atol=1e-14 * np.max(np.abs(ref)))
            angles = self.principal(10)
            old = self.call_points("CoordRotationEuler_head", (x, y, z), *angles)
            np.testing.assert_array_equal(old, self.call_points("CoordRotationEuler2011_head", (x, y, z), *angles, 10))
            t = 0.7
            got = self.call_points("CoordRotation2D_head", (x, y), t, outs=2)
            np.testing.assert_allclose(got, [x * np.cos(t) + y * np.sin(t), y * np.cos(t) - x * np.sin(t)],
                                       rtol=0, atol=4 * EPS * np.max(np.abs(x) + np.abs(y)))
            got = self.call_points("CartesianShift3D_head", (x, y, z), 1.5, -2.0, 0.25)
            np.testing.assert_array_equal(got, [x + 1.5, y - 2.0, z + 0.25])

    def test_conversions(self):
        deg = 180 / 3.141592653589793
        x, y, z = self.points()
        x[0] = y[0] = z[0] = 0.0
        for _ in placements():
            for unit in (0, 1):
                k = deg if unit else 1.0
                r, th, ph = self.call_points("CoordConversion_head", (x, y, z), 0, unit)
                np.testing.assert_array_equal(r, np.sqrt(x * x + y * y + z * z))
                np.testing.assert_allclose(th, np.arctan2(y, x) * k, rtol=4 * EPS, atol=0)
                np.testing.assert_allclose(ph, np.arctan2(np.sqrt(x * x + y * y), z) * k, rtol=4 * EPS, atol=0)
                self.assertEqual((r[0], th[0], ph[0]), (0.0, 0.0, 0.0))
                back = self.call_points("CoordConversion_head", (r, th, ph), 1, unit)
                phr, thr = ph / k, th / k
                ref = [r * np.sin(phr) * np.cos(thr), r * np.sin(phr) * np.sin(thr), r * np.cos(phr)]
                np.testing.assert_allclose(back, ref, rtol=0, atol=8 * EPS * np.max(r))
                np.testing.assert_allclose(back, [x, y, z], rtol=0, atol=8 * EPS * np.max(r))
                rho, th, zz = self.call_points("CoordConversion_head", (x, y, z), 2, unit)
                np.testing.assert_array_equal(rho, np.sqrt(x * x + y * y))
                np.testing.assert_allclose(th, np.arctan2(y, x) * k, rtol=4 * EPS, atol=0)
                np.testing.assert_array_equal(zz, z)
                back = self.call_points("CoordConversion_head", (rho, th, zz), 3, unit)
                np.testing.assert_allclose(back, [x, y, z], rtol=0, atol=8 * EPS * np.max(rho))


if __name__ == "__main__":
    unittest.main()
