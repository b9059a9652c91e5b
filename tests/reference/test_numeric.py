"""Numerical utilities against NumPy/SciPy: scaling and norms (bit for bit against the stated
forms), integration and coordinates, in both block placements."""
import ctypes
import math
import unittest

import numpy as np

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


if __name__ == "__main__":
    unittest.main()
