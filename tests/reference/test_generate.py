"""Periodic waveforms against direct NumPy evaluation and SciPy's waveform functions."""
import ctypes
import unittest

import numpy as np
from scipy import signal

from twanlys import lowlevel as tw


def fold(p):
    x = np.fmod(p, 360.0)
    return np.where(x < 0, x + 360.0, x)


def run(export, n, *args):
    """Calls a generator. Each argument after the length is ('d', value), ('i', value) or a host
    array; returns y, the status and the scalars after the call."""
    y = tw.empty()
    length, status = tw.i32(n), tw.i32(-1)
    cells = [a if isinstance(a, tw.Array) else tw.f64(a[1]) if a[0] == "d" else tw.i32(a[1]) for a in args]
    refs = [c.h if isinstance(c, tw.Array) else c.ref for c in cells]
    getattr(tw.lib, export)(y.h, length.ref, *refs, status.ref)
    return y.numpy(), status.value, [c.value for c in cells if not isinstance(c, tw.Array)]


class Waveforms(unittest.TestCase):
    def setUp(self):
        tw.placement(0)

    def test_sine_against_numpy(self):
        # The reference is sin(p + k w) in extended precision with the same f64 w = 2 pi f and
        # p = phase pi / 180 that the recurrence starts from, so what is measured is the drift of
        # the recurrence itself. Bound: atol = 4e-16 |A| (k + 8).
        worst = 0.0
        for n, a, f, p in [(100000, 1.0, 0.0123, 0.0), (100000, 2.5, 0.31, -47.0), (20000, -3.0, 1.7, 400.0),
                           (100000, 1.0, 1e-5, 90.0)]:
            y, s, (_, _, p_out) = run("SineWaveCIN", n, ("d", a), ("d", f), ("d", p))
            self.assertEqual(s, 0)
            k = np.arange(n)
            w = f * 2 * np.pi
            p_rad = p * (np.pi / 180)
            ref = (a * np.sin(np.longdouble(p_rad) + k * np.longdouble(w))).astype(np.float64)
            scaled = np.abs(y - ref) / (abs(a) * (k + 8))
            worst = max(worst, float(np.max(scaled)))
            print("sine n=%d f=%g: max |err| = %.3g, at the end %.3g" % (n, f, np.max(np.abs(y - ref)),
                                                                         np.max(np.abs(y - ref)[-100:])))
            self.assertLess(np.max(scaled), 4e-16, (n, f))
            self.assertTrue(np.all(np.abs(y) <= abs(a)))
            self.assertAlmostEqual(p_out, float(fold(p + n * f * 360)), places=9)
            # Against the plain f64 formula the reference's own argument rounding dominates.
            np.testing.assert_allclose(y, a * np.sin(2 * np.pi * f * k + np.deg2rad(p)), rtol=0,
                                       atol=1e-15 * abs(a) * n * max(1.0, abs(f) * 2 * np.pi))
        print("sine: max |err| / (|A| (k+8)) = %.3g" % worst)

    def test_stepped_waves_exact(self):
        # Direct evaluation of the same expressions: bit-equal.
        n, a, f, p0 = 5000, 1.75, 0.0371, -123.0
        k = np.arange(n, dtype=np.float64)
        x = fold(k * 360.0 * f + p0)
        inv180 = 1.0 / 180.0
        u = x * inv180
        expected = {
            "SawtoothWaveCIN": a * np.where(x >= 180, u - 2, u),
            "TriangleWaveCIN": a * np.where(u < 0.5, 2 * u, np.where(u < 1.5, 2 * (1 - u), 2 * (u - 2))),
        }
        for export, ref in expected.items():
            y, s, (_, _, p_out) = run(export, n, ("d", a), ("d", f), ("d", p0))
            self.assertEqual(s, 0)
            np.testing.assert_array_equal(y, ref, err_msg=export)
            self.assertEqual(p_out, float(fold(n * 360.0 * f + p0)))
        for duty in [0.0, 12.5, 50.0, 99.0, 100.0, 150.0, -3.0]:
            y, s, _ = run("SquareWaveCIN", n, ("d", a), ("d", f), ("d", p0), ("d", duty))
            self.assertEqual(s, 0)
            np.testing.assert_array_equal(y, a * np.where(x < np.clip(duty, 0, 100) * 3.6, 1.0, -1.0))

    def test_stepped_waves_against_scipy(self):
        n, a, f, p0 = 4000, 0.8, 0.0173, 33.0
        x = np.deg2rad(fold(np.arange(n) * 360.0 * f + p0))
        saw, s1, _ = run("SawtoothWaveCIN", n, ("d", a), ("d", f), ("d", p0))
        tri, s2, _ = run("TriangleWaveCIN", n, ("d", a), ("d", f), ("d", p0))
        sq, s3, _ = run("SquareWaveCIN", n, ("d", a), ("d", f), ("d", p0), ("d", 30.0))
        self.assertEqual((s1, s2, s3), (0, 0, 0))
        np.testing.assert_allclose(saw, a * signal.sawtooth(x + np.pi), rtol=0, atol=1e-14)
        np.testing.assert_allclose(tri, a * signal.sawtooth(x + np.pi / 2, width=0.5), rtol=0, atol=1e-14)
        np.testing.assert_array_equal(sq, a * signal.square(x, 0.3))

    def test_chirp_against_scipy(self):
        for n, a, f0, f1 in [(1000, 1.0, 0.01, 0.2), (4096, 2.0, 0.3, 0.05), (7, 1.0, 0.0, 0.5)]:
            y, s, _ = run("ChirpCIN", n, ("d", a), ("d", f0), ("d", f1))
            self.assertEqual(s, 0)
            k = np.arange(n)
            np.testing.assert_allclose(y, a * signal.chirp(k, f0=f0, t1=n, f1=f1, phi=-90),
                                       rtol=0, atol=1e-12 * a * max(1, n * n * abs(f1 - f0) / n))

    def test_arbitrary_wave(self):
        rng = np.random.default_rng(5)
        table = rng.standard_normal(37)
        n, a, f, p0 = 3000, 1.5, 0.0917, -61.0
        m = len(table)
        pos = np.empty(n)
        end, step = (m / 360.0) * p0, m * f
        for k in range(n):  # accumulated by repeated addition, as the generator does
            pos[k] = end
            end += step
        for interp in [1, 0, 2]:
            t = tw.array(table)
            y, s, (_, _, p_out, _) = run("ArbitraryWaveCIN", n, ("d", a), ("d", f), ("d", p0), t, ("i", interp))
            self.assertEqual(s, 0)
            r = np.mod(pos, m)
            if interp == 1:
                i = np.trunc(r).astype(int)
                direct = table[i] + (r - np.floor(r)) * (table[(i + 1) % m] - table[i])
                np.testing.assert_array_equal(y, a * direct)
                ref = a * np.interp(r, np.arange(m + 1), np.r_[table, table[0]])
                np.testing.assert_allclose(y, ref, rtol=0, atol=1e-13)
            else:
                np.testing.assert_array_equal(y, a * table[np.trunc(r).astype(int) % m])
            self.assertAlmostEqual(p_out, float(fold(end * 360 / m)), places=9)

    def test_packed_and_aligned_blocks_agree(self):
        out = []
        for aligned in (0, 1):
            tw.placement(aligned)
            out.append(run("SineWaveCIN", 999, ("d", 1.0), ("d", 0.01), ("d", 5.0))[0])
        np.testing.assert_array_equal(out[0], out[1])


if __name__ == "__main__":
    unittest.main()
