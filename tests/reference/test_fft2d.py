"""2-D FFT against numpy.fft: the window x[rs:rs+rows, cs:cs+cols] zero-padded to (rows, cols), centred
with fftshift on both axes; inverses against ifft2 and irfft(ifft(x, axis=1), n=rows, axis=0)."""
import ctypes
import sys
import unittest

import numpy as np

from twanlys import lowlevel as tw

lib = tw.lib
EPS = 2.0 ** -52
I = ctypes.c_int32
WORST = {}

# (shape of x, rowStart, colStart, rows, cols): both parities, padding, cutting, vectors, primes.
CASES = [
    ((53, 47), 0, 0, 53, 47),
    ((53, 47), 3, 5, 40, 64),
    ((8, 6), 0, 0, 8, 6),
    ((8, 6), 2, 1, 9, 7),
    ((1, 30), 0, 0, 1, 30),
    ((1, 30), 0, 4, 1, 31),
    ((25, 1), 0, 0, 25, 1),
    ((25, 1), 5, 0, 32, 1),
    ((12, 10), 11, 9, 4, 6),
    ((3, 4), 2, 1, 1, 1),  # one element: x[2, 1] itself
    ((16, 24), 0, 0, 16, 24),
    ((97, 64), 0, 0, 97, 64),
]


class Cell:
    def __init__(self):
        self.c = ctypes.c_void_p(None)
        self.ref = ctypes.byref(self.c)


def window(x, rs, cs, rows, cols):
    w = np.zeros((rows, cols), dtype=x.dtype)
    part = x[rs:rs + rows, cs:cs + cols]
    w[:part.shape[0], :part.shape[1]] = part
    return w


def forward(name, x, rs, cs, rows, cols, shift, idp=False):
    y = tw.empty(np.complex128, dims=2)
    cells = (Cell(),) if idp else (Cell(), Cell())
    s = getattr(lib, name + ("_IDP" if idp else ""))(tw.matrix(x, x.dtype), I(rs), I(cs), I(rows), I(cols), I(shift),
                                                    y, *(c.ref for c in cells))
    if idp:
        lib.TransformUnreserveProc(cells[0].ref)
    return s, y.numpy()


def inverse(name, x, shift, idp=False):
    y = tw.empty(np.float64 if name.startswith("Re") else np.complex128, dims=2)
    cells = (Cell(),) if idp else (Cell(), Cell())
    s = getattr(lib, name + ("_IDP" if idp else ""))(tw.matrix(x, np.complex128), I(shift), y,
                                                    *(c.ref for c in cells))
    if idp:
        lib.TransformUnreserveProc(cells[0].ref)
    return s, y.numpy()


def tolerance(rows, cols):
    return 8 * EPS * max(2.0, np.log2(rows * cols))


class Fft2D(unittest.TestCase):
    def check(self, name, got, want, rows, cols):
        self.assertEqual(got.shape, want.shape, name)
        scale = np.max(np.abs(want))
        err = np.max(np.abs(got - want)) / (scale if scale > 0 else 1.0)
        WORST[name] = max(WORST.get(name, 0.0), err / tolerance(rows, cols))
        self.assertLess(err, tolerance(rows, cols), "%s %dx%d" % (name, rows, cols))

    def test_forward_against_fft2(self):
        rng = np.random.default_rng(41)
        for shape, rs, cs, rows, cols in CASES:
            x = rng.standard_normal(shape)
            z = x + 1j * rng.standard_normal(shape)
            for shift in (0, 1):
                order = np.fft.fftshift if shift else (lambda a: a)
                for idp in (False, True):
                    s, y = forward("ReFFT2D_H", x, rs, cs, rows, cols, shift, idp)
                    self.assertEqual(s, 0)
                    self.check("ReFFT2D_H", y, order(np.fft.fft2(window(x, rs, cs, rows, cols))), rows, cols)
                    s, y = forward("CxFFT2D_H", z, rs, cs, rows, cols, shift, idp)
                    self.assertEqual(s, 0)
                    self.check("CxFFT2D_H", y, order(np.fft.fft2(window(z, rs, cs, rows, cols))), rows, cols)

    def test_real_spectra_are_exactly_hermitian(self):
        rng = np.random.default_rng(42)
        for rows, cols in ((53, 47), (8, 6), (7, 10), (6, 9), (1, 8), (9, 1), (2, 2)):
            x = rng.standard_normal((rows, cols))
            for shift in (0, 1):
                s, y = forward("ReFFT2D_H", x, 0, 0, rows, cols, shift)
                if shift:
                    y = np.fft.ifftshift(y)
                mirror = np.conj(np.roll(y[::-1, ::-1], (1, 1), axis=(0, 1)))
                self.assertTrue(np.array_equal(y, mirror), (rows, cols, shift))

    def test_inverses(self):
        rng = np.random.default_rng(43)
        for rows, cols in ((53, 47), (8, 6), (7, 10), (1, 30), (25, 1), (64, 97)):
            # Any complex x: the real inverse reads only the non-negative frequencies of the columns.
            x = rng.standard_normal((rows, cols)) + 1j * rng.standard_normal((rows, cols))
            for shift in (0, 1):
                spectrum = np.fft.fftshift(x) if shift else x
                for idp in (False, True):
                    s, y = inverse("CxInvFFT2D_H", spectrum, shift, idp)
                    self.assertEqual(s, 0)
                    self.check("CxInvFFT2D_H", y, np.fft.ifft2(x), rows, cols)
                    s, y = inverse("ReInvFFT2D_H", spectrum, shift, idp)
                    self.assertEqual(s, 0)
                    self.check("ReInvFFT2D_H", y, np.fft.irfft(np.fft.ifft(x, axis=1), n=rows, axis=0), rows, cols)

def tearDownModule():
    if WORST:
        sys.stderr.write("\nworst error as a fraction of 8 eps log2(rows cols), relative to the largest value:\n")
        for name, r in sorted(WORST.items()):
            sys.stderr.write("  %-14s %.3f\n" % (name, r))


if __name__ == "__main__":
    unittest.main()
