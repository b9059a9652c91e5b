"""The 1-D FFT exports against NumPy's FFT, and their frame rules."""
import ctypes
import sys
import unittest

import numpy as np

from twanlys import lowlevel as tw

lib = tw.lib
EPS = 2.0 ** -52
SMOOTH_PRIMES = (2, 3, 5, 7, 11, 13, 17, 19, 29, 31, 37, 41, 43)
RADER_LENGTHS = (53, 59, 61, 97, 2 * 53, 10 * 53, 53 * 53, 53 * 59, 23 * 23, 1009, 10007, 65537)
# Combines whose rows lie far apart go through a buffer in chunks of columns: whole chunks only,
# a partial last chunk, and the top levels of long transforms.
CHUNKED_LENGTHS = (10000, 8192, 3 * 2 ** 16, 2 ** 18)
WORST = {}


def is_smooth(n):
    for p in SMOOTH_PRIMES:
        while n % p == 0:
            n //= p
    return n == 1


def rel_error(got, want):
    scale = np.max(np.abs(want))
    return np.max(np.abs(got - want)) / (scale if scale > 0 else 1.0)


def size_class(n):
    bits = int(np.ceil(np.log2(max(n, 2))))
    top = 1 << (max(4, (bits + 3) // 4 * 4))
    return "%s n<=%d" % ("smooth" if is_smooth(n) else "other", top)


def tolerance(n):
    # Rounding grows with the number of passes; Rader stages add two nested transforms.
    return 64 * EPS * max(1.0, np.log2(n)) * (1 if is_smooth(n) else 4)


class Cell:
    """A work cell (null before the first call)."""

    def __init__(self):
        self.c = ctypes.c_void_p(None)
        self.ref = ctypes.byref(self.c)


def call(export, x, *args, x_dtype=np.complex128, y_dtype=np.complex128, cell=None):
    a = tw.array(x, x_dtype)
    y = tw.empty(y_dtype)
    status = getattr(lib, export)(a.h, y.h, cell.ref if cell else None, *args)
    return status, y.numpy(), a


class Differential(unittest.TestCase):
    def check(self, name, n, got, want):
        err = rel_error(got, want)
        key = (name, size_class(n))
        if err >= WORST.get(key, (-1.0, 0))[0]:
            WORST[key] = (err, n)
        self.assertLess(err, tolerance(n), "%s n=%d" % (name, n))

    def all_four(self, n, rng, cell=None):
        x = rng.standard_normal(n) + 1j * rng.standard_normal(n)
        r = x.real.copy()
        s, y, _ = call("CxQXFFTH", x, cell=cell)
        self.assertEqual(s, 0)
        self.check("complex forward", n, y, np.fft.fft(x))
        s, z, _ = call("InvCxQXFFTH", y, cell=cell)
        self.assertEqual(s, 0)
        self.check("complex round trip", n, z, x)
        s, y, _ = call("ReQXFFTH", r, x_dtype=np.float64, cell=cell)
        self.assertEqual(s, 0)
        self.check("real forward", n, y, np.fft.fft(r))
        s, z, _ = call("InvReQXFFTH", x, y_dtype=np.float64, cell=cell)
        self.assertEqual(s, 0)
        self.check("real inverse", n, z, np.fft.irfft(x[: n // 2 + 1], n))
        s, z, _ = call("InvReQXFFTH", y, y_dtype=np.float64, cell=cell)
        self.check("real round trip", n, z, r)

    def test_every_length_to_3000(self):
        rng = np.random.default_rng(1)
        cell = Cell()
        for n in range(1, 3001):
            self.all_four(n, rng, cell)

    def test_odd_and_rader_lengths(self):
        rng = np.random.default_rng(2)
        for n in RADER_LENGTHS:
            self.all_four(n, rng)

    def test_chunked_combine_lengths(self):
        rng = np.random.default_rng(5)
        for n in CHUNKED_LENGTHS:
            self.all_four(n, rng)

    def test_random_smooth_lengths_to_2_20(self):
        rng = np.random.default_rng(3)
        lengths = set()
        while len(lengths) < 300:
            n = int(np.exp(rng.uniform(np.log(2049), np.log(2 ** 20))))
            while not is_smooth(n):
                n += 1
            lengths.add(n)
        cell = Cell()
        for n in sorted(lengths):
            self.all_four(n, rng, cell)

    def test_random_lengths_to_10_6(self):
        rng = np.random.default_rng(4)
        for n in list(rng.integers(3001, 10 ** 6, 6)) + [999983]:
            self.all_four(int(n), rng)


class Centred(unittest.TestCase):
    def test_dc_position_and_round_trip(self):
        rng = np.random.default_rng(5)
        for n in (1, 2, 3, 4, 5, 8, 9, 53, 106):
            x = rng.standard_normal(n) + 1j * rng.standard_normal(n)
            s, y, _ = call("CxQXFFTH80", x, 0, n, 1)
            self.assertEqual(s, 0)
            np.testing.assert_allclose(y, np.fft.fftshift(np.fft.fft(x)), rtol=0, atol=1e-12 * n)
            self.assertEqual(np.argmax(np.abs(call("CxQXFFTH80", np.ones(n), 0, n, 1)[1])), n // 2)
            s, yr, _ = call("ReQXFFTH80", x.real, 0, n, 1, x_dtype=np.float64)
            np.testing.assert_allclose(yr, np.fft.fftshift(np.fft.fft(x.real)), rtol=0, atol=1e-12 * n)
            s, z, _ = call("InvCxQXFFTH80", y, 1)
            np.testing.assert_allclose(z, x, rtol=0, atol=1e-13 * n)
            s, zr, _ = call("InvReQXFFTH80", yr, 1, y_dtype=np.float64)
            np.testing.assert_allclose(zr, x.real, rtol=0, atol=1e-13 * n)


class Frame(unittest.TestCase):
    def test_statuses(self):
        x = np.arange(4.0)
        cases = [
            ("ReQXFFTH80", x, (4, 4, 0), np.float64, -20017),
            ("ReQXFFTH80", x, (-1, 4, 0), np.float64, -20017),
            ("ReQXFFTH80", x, (0, 0, 0), np.float64, -20115),
            ("CxQXFFTH80", x, (0, 0, 0), np.complex128, -20115),
        ]
        for export, data, args, dtype, want in cases:
            y = tw.array(np.ones(7), np.complex128)
            a = tw.array(data, dtype)
            self.assertEqual(getattr(lib, export)(a.h, y.h, None, *args), want, export)

    def test_padding_truncation_and_start(self):
        x = np.random.default_rng(6).standard_normal(10)
        for start, size in ((0, 16), (3, 16), (3, 4), (9, 1), (0, 10), (0, 53)):
            s, y, _ = call("ReQXFFTH80", x, start, size, 0, x_dtype=np.float64)
            self.assertEqual(s, 0)
            np.testing.assert_allclose(y, np.fft.fft(x[start:], n=size), rtol=0, atol=1e-13)
            s, y, _ = call("CxQXFFTH80", x + 1j, start, size, 0)
            np.testing.assert_allclose(y, np.fft.fft(x[start:] + 1j, n=size), rtol=0, atol=1e-13)
        s, y, _ = call("ReQXFFTH80", x, 4, 1, 0, x_dtype=np.float64)
        self.assertEqual(list(y), [x[4]])

    def test_real_spectrum_is_exactly_conjugate_symmetric(self):
        for n in (7, 8, 53, 100):
            x = np.random.default_rng(n).standard_normal(n)
            s, y, _ = call("ReQXFFTH", x, x_dtype=np.float64)
            self.assertTrue(np.array_equal(y[1:], np.conj(y[1:][::-1])))
            self.assertEqual(y[0].imag, 0.0)
            if n % 2 == 0:
                self.assertEqual(y[n // 2].imag, 0.0)

    def test_real_inverse_reads_only_non_negative_frequencies(self):
        rng = np.random.default_rng(7)
        for n in (6, 7):
            x = rng.standard_normal(n) + 1j * rng.standard_normal(n)
            spoiled = x.copy()
            spoiled[n // 2 + 1:] = 1e6
            spoiled[0] += 5j
            _, a, _ = call("InvReQXFFTH", x, y_dtype=np.float64)
            _, b, _ = call("InvReQXFFTH", spoiled, y_dtype=np.float64)
            self.assertTrue(np.array_equal(a, b))

    def test_half_complex_exports(self):
        rng = np.random.default_rng(8)
        for n in (1, 2, 9, 16, 53, 1000):
            x = rng.standard_normal(n)
            s, h, _ = call("ReQXFFTHCH", x, x_dtype=np.float64, y_dtype=np.float64)
            self.assertEqual(s, 0)
            X = np.fft.rfft(x)
            want = np.zeros(n)
            want[0] = X[0].real
            k = np.arange(1, (n - 1) // 2 + 1)
            want[k], want[n - k] = X[k].real, X[k].imag
            if n % 2 == 0:
                want[n // 2] = X[n // 2].real
            np.testing.assert_allclose(h, want, rtol=0, atol=1e-12 * n)
            s, z, a = call("InvReQXFFTHCH", h, x_dtype=np.float64, y_dtype=np.float64)
            self.assertEqual(s, 0)
            np.testing.assert_allclose(z, x, rtol=0, atol=1e-13 * n)
            if n > 1:
                self.assertFalse(np.array_equal(a.numpy(), h), "the packing is changed in place")


def tearDownModule():
    if WORST:
        sys.stderr.write("\nworst relative error (max |error| / max |X|):\n")
        for (name, cls), (err, n) in sorted(WORST.items()):
            sys.stderr.write("  %-20s %-16s %.2e (n=%d, %.1f eps)\n" % (name, cls, err, n, err / EPS))


if __name__ == "__main__":
    unittest.main()
