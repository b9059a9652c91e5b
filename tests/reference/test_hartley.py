"""Hartley and Hilbert transforms against NumPy's FFT and scipy.signal.hilbert."""
import ctypes
import sys
import unittest

import numpy as np
import scipy.signal

from twanlys import lowlevel as tw

lib = tw.lib
EPS = 2.0 ** -52
LENGTHS = list(range(1, 41)) + [97, 128, 1000, 1009, 4096, 10007]
WORST = {}


def run(name, x, cell=None):
    a = tw.array(x)
    s = getattr(lib, name)(a, ctypes.byref(cell) if cell is not None else None)
    return s, a.numpy()


def hartley(x):
    X = np.fft.fft(x)
    return X.real - X.imag


def hilbert(x):
    return np.imag(scipy.signal.hilbert(x))


class Transforms(unittest.TestCase):
    def check(self, name, n, got, want):
        scale = max(np.max(np.abs(want)), 1e-300)
        err = np.max(np.abs(got - want)) / scale
        if err >= WORST.get(name, (-1.0, 0))[0]:
            WORST[name] = (err, n)
        # Relative to the largest value. Measured worst: Hartley 8 eps; Hilbert (two transforms)
        # 212 eps at n = 10007, where both run through Rader stages.
        self.assertLess(err, 32 * EPS * max(2.0, np.log2(n)), "%s n=%d" % (name, n))

    def test_against_numpy_and_scipy(self):
        rng = np.random.default_rng(30)
        cases = (("FHTH", hartley), ("InvFHTH", lambda v: hartley(v) / len(v)),
                 ("FastHilbertTransformH", hilbert), ("InvFastHilbertTransformH", lambda v: -hilbert(v)))
        for n in LENGTHS:
            x = rng.standard_normal(n) + 0.5
            for name, ref in cases:
                cells = {"": ctypes.c_void_p(None), "_IDP": ctypes.c_void_p(None)}
                for idp, cell in cells.items():
                    s, got = run(name + idp, x, cell)
                    self.assertEqual(s, 0, name)
                    if n == 1 and name.endswith("TransformH"):
                        self.assertEqual(got.tolist(), [0.0])
                    else:
                        self.check(name, n, got, ref(x))
                self.assertEqual(lib.TransformUnreserveProc(ctypes.byref(cells["_IDP"])), 0)

    def test_round_trips_and_analytic_cases(self):
        rng = np.random.default_rng(31)
        for n in (1, 2, 7, 64, 100, 1009):
            x = rng.standard_normal(n)
            s, h = run("FHTH", x)
            s2, back = run("InvFHTH", h)
            self.assertEqual((s, s2), (0, 0))
            np.testing.assert_allclose(back, x, rtol=0, atol=32 * EPS * np.log2(2 * n) * np.max(np.abs(x)))
        for n, k in ((8, 1), (9, 4), (64, 5), (100, 49), (101, 50)):
            angle = 2 * np.pi * (k * np.arange(n) % n) / n  # reduced, so the reference is exact to an ulp
            s, got = run("FastHilbertTransformH", 2.5 * np.cos(angle))
            np.testing.assert_allclose(got, 2.5 * np.sin(angle), rtol=0, atol=64 * EPS)
            s, got = run("InvFastHilbertTransformH", 2.5 * np.sin(angle))
            np.testing.assert_allclose(got, 2.5 * np.cos(angle), rtol=0, atol=64 * EPS)
            s, got = run("FastHilbertTransformH", np.full(n, -3.0))
            self.assertLess(np.max(np.abs(got)), 16 * EPS * 3.0 * np.log2(2 * n), n)
        # Hilbert twice is minus the identity on a signal free of DC and Nyquist.
        x = rng.standard_normal(50)
        X = np.fft.rfft(x)
        X[0] = X[-1] = 0
        x = np.fft.irfft(X, 50)
        s, h = run("FastHilbertTransformH", x)
        s, hh = run("FastHilbertTransformH", h)
        np.testing.assert_allclose(hh, -x, rtol=0, atol=64 * EPS)


def tearDownModule():
    sys.stderr.write("\nworst relative error (max |error| / max |reference|):\n")
    for name, (err, n) in sorted(WORST.items()):
        sys.stderr.write("  %-26s %.2e (n=%d, %.1f eps)\n" % (name, err, n, err / EPS))


if __name__ == "__main__":
    unittest.main()
