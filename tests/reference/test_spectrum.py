"""Power and cross spectra against NumPy's FFT: |X|^2 / n^2 and conj(X) Y / n^2, two-sided."""
import ctypes
import sys
import unittest

import numpy as np

from twanlys import lowlevel as tw

lib = tw.lib
EPS = 2.0 ** -52
LENGTHS = list(range(1, 40)) + [64, 97, 100, 106, 1000, 1009, 4096, 10007]
WORST = {}


class Cell:
    def __init__(self):
        self.c = ctypes.c_void_p(None)
        self.ref = ctypes.byref(self.c)


def tolerance(n):
    # Relative to the largest bin. Measured worst: 36 eps at n = 10007 (two Rader stages).
    return 8 * EPS * max(2.0, np.log2(n))


def spectrum(x, cell=None, idp=False):
    a = tw.array(x)
    s = getattr(lib, "SpectrumH" + ("_IDP" if idp else ""))(a, cell.ref if cell else None)
    return s, a.numpy()


def cx_spectrum(z, cell=None, idp=False):
    y = tw.empty()
    s = getattr(lib, "CxSpectrumH" + ("_IDP" if idp else ""))(tw.array(z, np.complex128), y,
                                                             cell.ref if cell else None)
    return s, y.numpy()


def cross(name, x, y, cell=None, idp=False, dtype=np.float64):
    z = tw.empty(np.complex128)
    s = getattr(lib, name + ("_IDP" if idp else ""))(tw.array(x, dtype), tw.array(y, dtype), z,
                                                     cell.ref if cell else None)
    return s, z.numpy()


class Spectra(unittest.TestCase):
    def check(self, name, n, got, want):
        scale = np.max(np.abs(want))
        err = np.max(np.abs(got - want)) / (scale if scale > 0 else 1.0)
        key = (name, "n<=64" if n <= 64 else "large")
        if err >= WORST.get(key, (-1.0, 0))[0]:
            WORST[key] = (err, n)
        self.assertLess(err, tolerance(n), "%s n=%d" % (name, n))

    def test_against_numpy(self):
        rng = np.random.default_rng(12)
        cells = [Cell() for _ in range(4)]
        for n in LENGTHS:
            x, y = rng.standard_normal(n), rng.standard_normal(n)
            z, w = x + 1j * rng.standard_normal(n), y + 1j * rng.standard_normal(n)
            X, Y, Z, W = (np.fft.fft(v) for v in (x, y, z, w))
            s, got = spectrum(x, cells[0])
            self.assertEqual(s, 0)
            self.check("SpectrumH", n, got, np.abs(X) ** 2 / n ** 2)
            s, got = cx_spectrum(z, cells[1])
            self.assertEqual(s, 0)
            self.check("CxSpectrumH", n, got, np.abs(Z) ** 2 / n ** 2)
            s, got = cross("CrossSpectrumH", x, y, cells[2])
            self.assertEqual(s, 0)
            self.check("CrossSpectrumH", n, got, np.conj(X) * Y / n ** 2)
            s, got = cross("CxCrossSpectrumH", z, w, cells[3], dtype=np.complex128)
            self.assertEqual(s, 0)
            self.check("CxCrossSpectrumH", n, got, np.conj(Z) * W / n ** 2)

    def test_length_one_and_constants(self):
        self.assertEqual(spectrum([-3.0]), (0, [9.0]))
        self.assertEqual(cx_spectrum([3 - 4j])[1].tolist(), [25.0])
        self.assertEqual(cross("CrossSpectrumH", [2.0], [-1.5])[1].tolist(), [-3 + 0j])
        s, z = cross("CxCrossSpectrumH", [1 + 2j], [3 - 1j], dtype=np.complex128)
        self.assertEqual(z.tolist(), [np.conj(1 + 2j) * (3 - 1j)])
        for n in (2, 7, 64, 97):
            s, got = spectrum(np.full(n, -1.25))
            self.assertEqual(s, 0)
            self.assertAlmostEqual(got[0], 1.5625, delta=4 * EPS * np.log2(2 * n))
            self.assertLess(np.max(got[1:]), 1e-30)

    def test_cross_spectrum_of_itself_is_the_power_spectrum(self):
        rng = np.random.default_rng(13)
        for n in (2, 3, 10, 53, 128, 1000):
            x = rng.standard_normal(n)
            s, power = spectrum(x)
            s, z = cross("CrossSpectrumH", x, x)
            self.assertEqual(s, 0)
            self.assertTrue(np.array_equal(z.real, power), n)
            self.assertTrue(np.all(z.imag == 0), n)
            c = x + 1j * rng.standard_normal(n)
            s, cpower = cx_spectrum(c)
            s, cz = cross("CxCrossSpectrumH", c, c, dtype=np.complex128)
            np.testing.assert_allclose(cz.real, cpower, rtol=0, atol=4 * EPS * np.max(cpower))
            self.assertTrue(np.all(cz.imag == 0), n)

    def test_instance_data_twins_match(self):
        rng = np.random.default_rng(14)
        x, y = rng.standard_normal(30), rng.standard_normal(30)
        z = x + 1j * y
        runs = [(spectrum, (x,), {}), (cx_spectrum, (z,), {}),
                (cross, ("CrossSpectrumH", x, y), {}), (cross, ("CxCrossSpectrumH", z, z * 1j), {"dtype": np.complex128})]
        for f, args, kw in runs:
            cell = Cell()
            plain = f(*args, **kw)
            twin = f(*args, cell=cell, idp=True, **kw)
            self.assertEqual((plain[0], twin[0]), (0, 0))
            self.assertTrue(np.array_equal(plain[1], twin[1]))
            self.assertEqual(lib.TransformUnreserveProc(cell.ref), 0)
            self.assertEqual(cell.c.value, None)

    def test_unequal_lengths(self):
        for name, dtype in (("CrossSpectrumH", np.float64), ("CxCrossSpectrumH", np.complex128)):
            z = tw.array(np.ones(3), np.complex128)
            self.assertEqual(getattr(lib, name)(tw.array([1.0, 2.0], dtype), tw.array([1.0], dtype), z, None), -20002)


def tearDownModule():
    if WORST:
        sys.stderr.write("\nworst relative error (max |error| / max |reference|):\n")
        for (name, cls), (err, n) in sorted(WORST.items()):
            sys.stderr.write("  %-18s %-6s %.2e (n=%d, %.1f eps)\n" % (name, cls, err, n, err / EPS))


if __name__ == "__main__":
    unittest.main()
