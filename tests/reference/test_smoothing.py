"""Smoothing filters in both block placements: the Savitzky-Golay matrices against exact rationals
(small frames), a least-squares projection on the scaled abscissa t/h (large frames) and
scipy.signal.savgol_coeffs / savgol_filter; the running median bit for bit against np.median over
zero-padded windows, scipy.signal.medfilt, and a NumPy rendering of the NaN-first window order."""
import ctypes
import math
import unittest
from fractions import Fraction

import numpy as np
import scipy.signal
from numpy.lib.stride_tricks import sliding_window_view

from twanlys import lowlevel as tw

EPS = 2.0**-52
I32, P = ctypes.c_int32, ctypes.c_void_p
L = tw.lib
L.SavitzkyGolayCoefH.argtypes = [I32, I32, P, I32, P, P]
L.SavitzkyGolayFiltH.argtypes = [P, I32, I32, P, P]
L.MedianFilter81_H.argtypes = [P, I32, I32]
L.MedianFilterCIN.argtypes = [P, P, P]


def placements():
    for aligned in (0, 1):
        tw.placement(aligned)
        yield aligned
    tw.placement(0)


def design(order, frame, weights=()):
    h, k = tw.empty(dims=2), tw.empty(dims=2)
    status = L.SavitzkyGolayCoefH(order, frame, tw.array(weights), 1, h, k)
    assert status == 0, status
    return h.numpy(), k.numpy()


def smooth(x, order, frame, weights=()):
    y = tw.empty()
    status = L.SavitzkyGolayFiltH(tw.array(x), order, frame, tw.array(weights), y)
    assert status == 0, status
    return y.numpy()


def exact_design(order, frame, weights=None):
    """H and K in rationals: G = (A^T D A)^-1 by Gauss-Jordan, K = G A^T D, H = A K."""
    half, c = (frame - 1) // 2, order + 1
    a = [[Fraction(t) ** r for r in range(c)] for t in range(-half, half + 1)]
    d = [Fraction(1)] * frame if weights is None else [abs(Fraction(w)) for w in weights]
    m = [[sum(a[i][r] * d[i] * a[i][s] for i in range(frame)) for s in range(c)] + [Fraction(int(r == s)) for s in range(c)]
         for r in range(c)]
    for col in range(c):
        pivot = next(r for r in range(col, c) if m[r][col] != 0)
        m[col], m[pivot] = m[pivot], m[col]
        m[col] = [v / m[col][col] for v in m[col]]
        for r in range(c):
            if r != col and m[r][col] != 0:
                m[r] = [v - m[r][col] * p for v, p in zip(m[r], m[col])]
    g = [row[c:] for row in m]
    k = [[sum(g[r][s] * a[j][s] for s in range(c)) * d[j] for j in range(frame)] for r in range(c)]
    h = [[sum(a[i][r] * k[r][j] for r in range(c)) for j in range(frame)] for i in range(frame)]
    return np.array(h, dtype=float), np.array(k, dtype=float)


def scaled_design(order, frame, weights=None):
    """The same projection fitted on u = t/h, where the Vandermonde matrix is well conditioned; the
    coefficient of t^r is that of u^r over h^r."""
    half = (frame - 1) // 2
    u = np.arange(-half, half + 1) / half
    a = np.vander(u, order + 1, increasing=True)
    root = np.ones(frame) if weights is None else np.sqrt(np.abs(weights))
    q, r = np.linalg.qr(root[:, None] * a)
    ku = np.linalg.solve(r, q.T) * root
    return a @ ku, ku / (float(half) ** np.arange(order + 1))[:, None]


def reference_design(order, frame, weights=None):
    return (exact_design if frame <= 25 else scaled_design)(order, frame, weights)


def stated_smoothing(x, h):
    """The rule as stated: the first and last frames' rows at the ends, the centre row inside."""
    f = len(h)
    half = f // 2
    inside = sliding_window_view(x, f) @ h[half]
    return np.concatenate([h[:half] @ x[:f], inside, h[half + 1:] @ x[-f:]])


def tolerance(order, frame):
    """The stated form squares the conditioning (G = R^-1 R^-T from the unscaled abscissa): measured
    errors stay below 0.1 eps k^2, k the condition number of A with unit columns; large frames add
    the length of the sums."""
    half = (frame - 1) // 2
    a = np.vander(np.arange(-half, half + 1.0), order + 1, increasing=True)
    return EPS * (np.linalg.cond(a / np.linalg.norm(a, axis=0)) ** 2 + frame)


def rel(lib, ref):
    return np.max(np.abs(lib - ref)) / np.max(np.abs(ref))


def row_rel(lib, ref):
    """Row-wise relative error: the rows of K differ in scale by powers of the half frame."""
    return np.max(np.max(np.abs(lib - ref), axis=1) / np.max(np.abs(ref), axis=1))


class SavitzkyGolay(unittest.TestCase):
    def test_design(self):
        # Rationals for small frames (order frame - 1 included, whose H is the identity), the scaled
        # abscissa beyond; weights with negative and zero entries.
        rng = np.random.default_rng(27)
        cases = [(1, 3), (2, 5), (4, 5), (3, 9), (6, 9), (10, 11), (5, 15), (8, 15), (6, 25), (8, 51), (4, 101),
                 (10, 201), (3, 1001), (6, 1001)]
        for _, (order, frame) in ((p, c) for p in placements() for c in cases):
            w = rng.uniform(-2, 2, frame)
            w[rng.choice(frame, (frame - order - 1) // 2, replace=False)] = 0
            for weights in (None, w):
                h, k = design(order, frame, () if weights is None else weights)
                hr, kr = reference_design(order, frame, weights)
                tol = tolerance(order, frame)
                self.assertLess(rel(h, hr), tol, (order, frame))
                self.assertLess(row_rel(k, kr), tol, (order, frame))
                # A constant stays constant, at the centre and at the ends.
                self.assertTrue(np.all(np.abs(h.sum(axis=1) - 1) <= tol * np.abs(h).sum(axis=1)), (order, frame))

    def test_design_against_savgol_coeffs(self):
        # savgol_coeffs itself loses digits as frame and order grow (2.7e-12 at 15 and 4, 2e-9 at
        # 31 and 5): small frames only.
        for order, frame in ((1, 3), (2, 7), (3, 11), (2, 21)):
            h, k = design(order, frame)
            ref_h = [scipy.signal.savgol_coeffs(frame, order, pos=i, use="dot") for i in range(frame)]
            ref_k = [scipy.signal.savgol_coeffs(frame, order, deriv=r, use="dot") / math.factorial(r)
                     for r in range(order + 1)]
            self.assertLess(rel(h, np.array(ref_h)), 1e-12)
            self.assertLess(row_rel(k, np.array(ref_k)), 1e-12)

    def test_filtering(self):
        rng = np.random.default_rng(2705)
        for _, (order, frame, n) in ((p, c) for p in placements()
                                     for c in ((1, 3, 3), (2, 5, 6), (3, 11, 200), (4, 21, 21), (5, 51, 1000),
                                               (3, 101, 5003))):
            x = np.cumsum(rng.normal(size=n))
            y = smooth(x, order, frame)
            hr = reference_design(order, frame)[0]
            self.assertLess(np.max(np.abs(y - stated_smoothing(x, hr))), 1e-12 * np.max(np.abs(x)))
            if frame <= 21:
                ref = scipy.signal.savgol_filter(x, frame, order, mode="interp")
                self.assertLess(np.max(np.abs(y - ref)), 1e-12 * np.max(np.abs(x)), (order, frame))
            w = rng.uniform(-1, 3, frame)
            w[frame // 3] = 0
            yw = smooth(x, order, frame, w)
            hw = reference_design(order, frame, w)[0]
            self.assertLess(np.max(np.abs(yw - stated_smoothing(x, hw))), 1e-11 * np.max(np.abs(x)))


def padded_median(x, left, right):
    return np.median(sliding_window_view(np.pad(x, (left, right)), left + right + 1), axis=1)


def nan_first_median(x, left, right):
    """The window sorted with NaN in front, then its middle element or the mean of the middle pair."""
    out = []
    w = left + right + 1
    for window in sliding_window_view(np.pad(x, (left, right)), w):
        s = np.concatenate([window[np.isnan(window)], np.sort(window[~np.isnan(window)])])
        out.append(s[w // 2] if w % 2 else (s[w // 2 - 1] + s[w // 2]) * 0.5)
    return np.array(out)


def median81(x, left, right):
    h = tw.array(x)
    status = L.MedianFilter81_H(h, left, right)
    assert status == 0, status
    return h.numpy()


class Median(unittest.TestCase):
    def test_against_padded_windows(self):
        rng = np.random.default_rng(5501)
        cases = [(1, 0, 0), (1, 3, 0), (2, 0, 1), (7, 1, 1), (50, 3, 3), (50, 1, 0), (50, 0, 4), (61, 5, 2),
                 (61, 2, 9), (200, 12, 13), (1000, 50, 50), (1000, 0, 101), (10, 17, 2), (10, 30, 9), (4000, 60, 41)]
        for _, (n, left, right) in ((p, c) for p in placements() for c in cases):
            for x in (rng.integers(-3, 4, n).astype(float), rng.normal(size=n), np.full(n, 2.5)):
                np.testing.assert_array_equal(median81(x, left, right), padded_median(x, left, right),
                                              str((n, left, right)))
                if right == left:
                    np.testing.assert_array_equal(median81(x, left, -1), padded_median(x, left, left))

    def test_half_width_against_medfilt(self):
        rng = np.random.default_rng(5502)
        for _, (n, half) in ((p, c) for p in placements() for c in ((5, 0), (5, 2), (100, 1), (999, 7), (10000, 50))):
            x = rng.integers(0, 5, n).astype(float) * 0.5 - 1
            h, half_width, status = tw.array(x), tw.i32(half), tw.i32(-1)
            self.assertEqual(L.MedianFilterCIN(h, half_width.ref, status.ref), 0)
            self.assertEqual(status.value, 0)
            np.testing.assert_array_equal(h.numpy(), scipy.signal.medfilt(x, 2 * half + 1))

    def test_nan_keeps_the_window_sorted(self):
        rng = np.random.default_rng(5503)
        for n, left, right in ((40, 2, 2), (300, 6, 3), (300, 0, 7), (300, 8, 0), (300, 5, 4)):
            x = rng.integers(-4, 5, n).astype(float)
            x[rng.choice(n, n // 6, replace=False)] = np.nan
            x[n // 2:n // 2 + left + right + 3] = np.nan  # a window of NaN only, and its way out
            np.testing.assert_array_equal(median81(x, left, right), nan_first_median(x, left, right))


if __name__ == "__main__":
    unittest.main()
