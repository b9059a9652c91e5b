"""Descriptive statistics against NumPy and SciPy, in both block placements."""
import ctypes
import unittest

import numpy as np
import scipy.stats

from twanlys import lowlevel as tw

EPS = 2.0**-52


def call_scalar(name, x, *extra):
    out, status = tw.f64(), tw.i32()
    getattr(tw.lib, name)(x, *extra, out.ref, status.ref)
    return out.value, status.value


class Descriptive(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(20261121)

    def each_placement(self):
        for aligned in (0, 1):
            tw.placement(aligned)
            yield aligned
        tw.placement(0)

    def test_mean_rms_moment(self):
        for _ in self.each_placement():
            for n in (1, 2, 7, 1000, 65537):
                v = self.rng.normal(3.0, 2.0, n)
                x = tw.array(v)
                mean, s = call_scalar("Mean_head", x)
                self.assertEqual(s, 0)
                self.assertLessEqual(abs(mean - np.mean(v)), n * EPS * np.mean(np.abs(v)))
                rms, s = call_scalar("RMS_head", x)
                self.assertAlmostEqual(rms / np.sqrt(np.mean(v * v)), 1.0, delta=n * EPS)
                for order in (1, 2, 3, 4, 5, 8):
                    m, s = call_scalar("Moment_head", x, ctypes.byref(ctypes.c_int32(order)))
                    ref = scipy.stats.moment(v, moment=order)
                    scale = np.mean(np.abs(v - np.mean(v)) ** order)
                    self.assertLessEqual(abs(m - ref), 8 * n * EPS * scale, (n, order))

    def test_complex_rms(self):
        z = self.rng.normal(size=999) + 1j * self.rng.normal(size=999)
        rms = tw.f64()
        self.assertEqual(tw.lib.CxRMS_head(tw.array(z, np.complex128), rms.ref), 0)
        self.assertAlmostEqual(rms.value, np.sqrt(np.mean(np.abs(z) ** 2)), delta=1e-13)

    def test_mse(self):
        x, y = self.rng.normal(size=500), self.rng.normal(size=300)
        mse, s = call_scalar("MSE_head", tw.array(x), tw.array(y))
        self.assertEqual(s, 20004)
        ref = np.mean((x[:300] - y) ** 2)
        self.assertLessEqual(abs(mse - ref), 4 * EPS * max(np.max(x * x), np.max(y * y)) * 10)

    def test_median_is_exact(self):
        for _ in self.each_placement():
            for n in (1, 2, 3, 4, 10, 101, 1000, 4097):
                for v in (self.rng.normal(size=n), self.rng.integers(0, 5, n).astype(float)):
                    med, s = call_scalar("Median_head", tw.array(v))
                    self.assertEqual(s, 0)
                    self.assertEqual(med, np.median(v), (n, v[:5]))

    def test_histogram_on_continuous_data(self):
        for _ in self.each_placement():
            for n, bins in ((1000, 10), (5000, 37), (3, 1)):
                v = self.rng.normal(size=n)
                counts, centres = tw.empty(np.int32), tw.empty()
                s = tw.i32()
                tw.lib.histgran_head(tw.array(v), ctypes.byref(ctypes.c_int32(bins)), counts,
                                     centres, s.ref)
                self.assertEqual(s.value, 0)
                ref_counts, edges = np.histogram(v, bins=bins)
                np.testing.assert_array_equal(counts.numpy(), ref_counts)
                np.testing.assert_allclose(centres.numpy(), (edges[:-1] + edges[1:]) / 2,
                                           rtol=0, atol=bins * 4 * EPS * np.max(np.abs(v)))

    def test_exact_mode(self):
        for _ in range(20):
            v = self.rng.integers(-20, 20, 60).astype(float)
            modes = tw.empty()
            self.assertEqual(tw.lib.ModeH(tw.array(v), 0, modes), 0)
            values, counts = np.unique(v, return_counts=True)
            expected = values[counts == counts.max()] if counts.max() > 1 else []
            np.testing.assert_array_equal(modes.numpy(), expected)


if __name__ == "__main__":
    unittest.main()
