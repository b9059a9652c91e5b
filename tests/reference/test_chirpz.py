"""Chirp-Z transform against an extended-precision sum (np.longdouble), the inverse by round trips.

The powers z^t are defined as (|z|^2)^(t/2) (cos t theta, sin t theta) with |z|^2 and theta formed
in double, so the reference forms those two in double too and all the rest in long double.
scipy.signal.czt is no reference here: it is itself about 7e-12 off at n = 1000 on the unit circle.
"""
import ctypes
import sys
import unittest

import numpy as np

from twanlys import lowlevel as tw

lib = tw.lib
EPS = 2.0 ** -52
L = np.longdouble
WORST = {}


def note(key, value):
    WORST[key] = max(WORST.get(key, 0.0), float(value))


def scalar(z):
    return (ctypes.c_double * 2)(z.real, z.imag)


def czt(x, A, W, m, method, cx=False):
    y = tw.array(np.ones(2), np.complex128)
    f = lib.CxChirpZT_head if cx else lib.ChirpZT_head
    s = f(tw.array(x, np.complex128 if cx else np.float64), scalar(A), scalar(W), m, method, y)
    return s, y.numpy()


def iczt(x, A, W, m):
    y = tw.array(np.ones(2), np.complex128)
    s = lib.InvChirpZT_head(tw.array(x, np.complex128), scalar(A), scalar(W), m, y)
    return s, y.numpy()


def polar(z):
    return L(z.real * z.real + z.imag * z.imag), L(np.arctan2(z.imag, z.real))


def reference(x, A, W, m):
    """y[j] = sum x[k] A^-k W^jk in long double, and sum |x[k] A^-k W^jk| for the error bound."""
    (na, ta), (nw, tw_) = polar(A), polar(W)
    k = np.arange(len(x)).astype(L)
    xr, xi = np.real(x).astype(L), np.imag(x).astype(L)
    y, size = np.zeros(m, complex), np.zeros(m)
    for j in range(m):
        t = L(j) * k
        mag = na ** (-k / 2) * nw ** (t / 2)
        ang = t * tw_ - k * ta
        cr, ci = mag * np.cos(ang), mag * np.sin(ang)
        y[j] = complex(np.sum(xr * cr - xi * ci), np.sum(xr * ci + xi * cr))
        size[j] = float(np.sum(np.abs(x) * mag))
    return y, size


class ChirpZ(unittest.TestCase):
    def check(self, key, got, want, bound):
        ratio = np.max(np.abs(got - want) / bound)
        note(key, ratio)
        self.assertLess(ratio, 1.0, key)

    def test_forward_against_extended_precision(self):
        rng = np.random.default_rng(50)
        unit = lambda n: np.exp(-2j * np.pi / n)
        # (n, m, A, W, methods): the DFT, arcs of the unit circle, spirals (direct only), m != n.
        cases = [(1, 1, 1 + 0j, unit(1), (0, 1)), (5, 5, 1 + 0j, unit(5), (0, 1)),
                 (64, 64, 1 + 0j, unit(64), (0, 1)), (1000, 1000, 1 + 0j, unit(1000), (0, 1)),
                 (37, 80, np.exp(0.4j), np.exp(-0.01j), (0, 1)), (120, 17, np.exp(-2.0j), np.exp(0.3j), (0, 1)),
                 (60, 40, 1.1 * np.exp(0.2j), 0.995 * np.exp(-0.05j), (0,)),
                 (25, 30, 0.9 * np.exp(-1j), 1.02 * np.exp(0.7j), (0,)),
                 (9, 9, -1 + 0j, -1 + 0j, (0, 1))]
        for n, m, A, W, methods in cases:
            for cx in (False, True):
                x = rng.standard_normal(n) + (1j * rng.standard_normal(n) if cx else 0)
                want, size = reference(x, A, W, m)
                ta, tw_ = abs(np.angle(A)), abs(np.angle(W))
                j = np.arange(m)
                for method in methods:
                    s, y = czt(x, A, W, 0 if m == n else m, method, cx)  # m = 0 stands for n
                    self.assertEqual((s, len(y)), (0, m), (n, m, method))
                    if method == 0:
                        bound = 8 * EPS * (1 + j * (n - 1) * tw_ + (n - 1) * ta + n) * size
                    else:  # chirps W^(-t^2/2) for t up to n + m
                        bound = 8 * EPS * (1 + (n + m) ** 2 * tw_ + (n - 1) * ta + n) * size
                    self.check("method %d" % method, y, want, bound)

    def test_statuses(self):
        nan, inf = float("nan"), float("inf")
        for cx in (False, True):
            for x, A, W, m, method, status in (
                    ([], 0j, 0j, 3, 7, -20003), ([1.0], 0j, 0j, 3, 2, -20061), ([1.0], 0j, 0j, 3, -1, -20061),
                    ([1.0, 2.0], complex(nan, 0), 0j, 3, 1, -20068), ([1.0], 1 + 0j, complex(0, inf), 3, 0, -20068),
                    ([1.0], 0j, 1 + 0j, 3, 0, -20141), ([1.0], 1 + 0j, 0j, 3, 1, -20141),
                    ([1.0], 1e-170 + 0j, 1 + 0j, 3, 0, -20141), ([1.0], 1 + 0j, 1e-170j, 3, 1, -20141)):
                s, y = czt(x, A, W, m, method, cx)
                self.assertEqual((s, len(y)), (status, 0), (x, A, W, method))
        s, y = czt([1.0], 1e-150 + 0j, 1 + 0j, 2, 0)
        self.assertEqual((s, len(y)), (0, 2))

    def test_inverse_round_trips(self):
        rng = np.random.default_rng(52)
        # m = n on the DFT nodes, |A| not 1: through the forward export, and from exact data.
        for n in (1, 2, 7, 64, 100, 1000, 4096):
            W, A = np.exp(-2j * np.pi / n), 1.0002 * np.exp(0.3j)
            x = rng.standard_normal(n) + 1j * rng.standard_normal(n)
            for method in (0, 1) if n <= 1000 else (1,):
                s, X = czt(x, A, W, 0, method, cx=True)
                s2, back = iczt(X, A, W, 0)
                self.assertEqual((s, s2, len(back)), (0, 0, n))
                err = np.max(np.abs(back - x))
                note("inverse m=n (forward export)", err)
                self.assertLess(err, 1e-10, (n, method))
            if n <= 1000:
                X, _ = reference(x, A, W, n)
                s, back = iczt(X, A, W, n)
                err = np.max(np.abs(back - x)) / np.max(np.abs(x))
                note("inverse m=n (exact data), /eps", err / EPS)
                self.assertLess(err, 64 * EPS * np.log2(2 * n) * abs(A) ** n, n)

    def test_inverse_of_fewer_samples_to_cond_eps(self):
        rng = np.random.default_rng(53)
        for n, m, A, W in ((24, 20, 1 + 0j, np.exp(-2j * np.pi / 24)), (40, 12, np.exp(0.5j), np.exp(-2j * np.pi / 40)),
                           (20, 12, 1.05 + 0j, 0.98 * np.exp(-0.3j)), (30, 30, 0.95 + 0j, 1.01 * np.exp(0.25j)),
                           (16, 9, 1 + 0j, np.exp(0.05j))):
            x = rng.standard_normal(m) + 1j * rng.standard_normal(m)
            X, _ = reference(x, A, W, n)
            s, back = iczt(X, A, W, m)
            self.assertEqual((s, len(back)), (0, m))
            nw, tw_ = polar(W)
            j = np.arange(m).astype(L)
            nodes = (nw ** (j / 2) * np.exp(1j * (j * tw_).astype(float))).astype(complex)
            V = (nodes[:, None] / A) ** np.arange(m)[None, :]  # the system in the samples
            cond = np.linalg.cond(V)
            err = np.max(np.abs(back - x)) / np.max(np.abs(x))
            note("inverse m<n, error/(cond eps)", err / (cond * EPS))
            self.assertLess(err, 16 * m * cond * EPS, (n, m, cond))

    def test_inverse_statuses(self):
        for x, A, W, m, status in (([], 1 + 0j, 1j, 5, -20003), ([1, 2], 1 + 0j, 1j, 3, -20008),
                                   ([1, 2], complex(float("nan"), 0), 0j, 2, -20068), ([1, 2], 0j, 1j, 2, -20141),
                                   ([1, 2], 1 + 0j, 1e-170 + 0j, 2, -20141),
                                   ([1, 2, 3], 1 + 0j, -1 + 0j, 3, -20060),  # W^2 = 1: nodes 1, -1, 1
                                   ([1, 2, 3, 4], 1 + 0j, np.exp(2j * np.pi / 3), 4, -20060)):
            s, y = iczt(x, A, W, m)
            self.assertEqual((s, len(y)), (status, 0), (x, A, W, m))
        # Two of the three points of W = -1 are distinct nodes: solvable.
        s, y = iczt([3.0, -1.0, 3.0], 1 + 0j, -1 + 0j, 2)
        self.assertEqual(s, 0)
        np.testing.assert_allclose(y, [1, 2], rtol=0, atol=4 * EPS)


def tearDownModule():
    sys.stderr.write("\nworst error (forward: as a fraction of the error bound):\n")
    for key, v in sorted(WORST.items()):
        sys.stderr.write("  %-34s %.3g\n" % (key, v))


if __name__ == "__main__":
    unittest.main()
