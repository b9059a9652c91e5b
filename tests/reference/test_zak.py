"""Discrete Zak transform against a direct NumPy rendering: fold from x[N], DFT of each phase,
phase factors exp(-2 pi i m (q0 + q) / T)."""
import ctypes
import sys
import unittest

import numpy as np

from twanlys import lowlevel as tw

lib = tw.lib
EPS = 2.0 ** -52
WORST = [0.0]


def fold(x, M, N):
    x = np.array(x)
    n, T = len(x), M * N
    if n > T:
        src = N
        for _ in range(n // T - 1):
            x[:T] = x[:T] + x[src:src + T]  # the right side is read before the pass writes
            src += T
        rest = n % T
        x[:rest] = x[:rest] + x[src:src + rest]
    return x


def zak(x, M, N, offset, L):
    T = M * N
    x = fold(x, M, N)
    p, q0 = offset % N, offset % T  # Python's % is the non-negative remainder
    q = np.arange(L)
    y = np.zeros(L, complex)
    for m in range(M):
        s = np.zeros(N, x.dtype)
        taken = x[m::M][:N]
        s[:len(taken)] = taken
        H = np.fft.fft(s)
        y += H[(p + q) % N] * np.exp(-2j * np.pi * m * ((q0 + q) % T) / T)
    return y


def call(x, M, N, offset, L, cx=False, idp=False, cell=None):
    a = tw.array(x, np.complex128 if cx else np.float64)
    y = tw.array(np.ones(3), np.complex128)
    name = ("CxDZTH" if cx else "ReDZTH") + ("_IDP" if idp else "")
    s = getattr(lib, name)(a, M, N, offset, L, y, ctypes.byref(cell) if cell is not None else None)
    return s, y.numpy(), a.numpy()


class Zak(unittest.TestCase):
    def test_against_numpy(self):
        rng = np.random.default_rng(40)
        # (M, N, n, offset, outLength): n below, equal to and above M N, several folds, negative
        # offsets (also multiples of N), outputs longer than N.
        cases = [(1, 8, 8, 0, 8), (1, 8, 20, 3, 8), (1, 7, 30, -2, 15), (3, 4, 12, 0, 4),
                 (3, 4, 7, 5, 9), (3, 4, 40, -5, 6), (4, 5, 20, -20, 5), (4, 5, 61, 7, 23),
                 (5, 3, 100, -1, 3), (2, 16, 31, 11, 40), (6, 10, 200, -123, 10), (8, 9, 1000, 35, 30),
                 (3, 1, 10, 4, 5), (1, 1, 1, -7, 3), (7, 64, 448, 1000, 64), (16, 128, 5000, -3, 200)]
        for M, N, n, offset, L in cases:
            for cx in (False, True):
                x = rng.standard_normal(n) + (1j * rng.standard_normal(n) if cx else 0)
                want = zak(x, M, N, offset, L)
                for idp in (False, True):
                    cell = ctypes.c_void_p(None)
                    s, y, xout = call(x, M, N, offset, L, cx, idp, cell)
                    label = "M=%d N=%d n=%d offset=%d L=%d cx=%s" % (M, N, n, offset, L, cx)
                    self.assertEqual(s, 0, label)
                    # Bound: FFT rounding of each phase plus the phase recurrence over L steps.
                    scale = np.sum(np.abs(fold(x, M, N)))
                    err = np.max(np.abs(y - want)) / scale
                    WORST[0] = max(WORST[0], err)
                    self.assertLess(err, 16 * EPS * (np.log2(2 * N) + L), label)
                    self.assertTrue(np.array_equal(xout, fold(x, M, N)), "x folded in place: " + label)
                    if idp:
                        self.assertEqual(lib.TransformUnreserveProc(ctypes.byref(cell)), 0)

    def test_single_phase_is_the_dft_from_index_p(self):
        x = np.cos(np.arange(12.0)) + 0.25
        X = np.fft.fft(x)
        for offset in (0, 5, 12, 13, -1, -12, -13):
            s, y, _ = call(x, 1, 12, offset, 12)
            np.testing.assert_allclose(y, np.roll(X, -(offset % 12)), rtol=0, atol=64 * EPS)

    def test_statuses(self):
        x = np.arange(6.0)
        for args, status in (((0, 3, 0, 3), -20021), ((0, 0, 0, 0), -20021), ((-2, 3, 0, 3), -20021),
                             ((2, 0, 0, 3), -20115), ((2, 3, 0, 0), -20115), ((2, -1, 0, -1), -20115)):
            for cx in (False, True):
                s, y, xout = call(x, *args, cx=cx)
                self.assertEqual((s, len(y)), (status, 0), args)
                self.assertTrue(np.array_equal(xout, x))
        for cx in (False, True):
            s, y, _ = call([], 2, 3, 0, 3, cx=cx)
            self.assertEqual((s, len(y)), (0, 0))
            s, y, _ = call([], 0, 3, 0, 3, cx=cx)
            self.assertEqual((s, len(y)), (-20021, 0))


def tearDownModule():
    sys.stderr.write("\nworst error relative to sum |x| (folded): %.2e (%.1f eps)\n" % (WORST[0], WORST[0] / EPS))


if __name__ == "__main__":
    unittest.main()
