"""Convolution, correlation and deconvolution against NumPy/SciPy. Error models: direct below
2 eps min(size x, size y) conv(|x|, |y|) per output (4 eps for complex), frequency domain below
4 eps log2(N) |x|_2 |y|_2, N the transform size."""
import sys
import unittest

import numpy as np
import scipy.signal as ss

from twanlys import lowlevel as tw

lib = tw.lib
EPS = 2.0 ** -52
FAST = [2, 3, 5, 7, 11, 13, 17, 19, 29, 31, 37, 41, 43]
WORST = {}


def fast_length(m):
    while True:
        r = m
        for p in FAST:
            while r % p == 0:
                r //= p
        if r == 1:
            return m
        m += 1


def unbiased(nx, ny):
    return np.convolve(np.ones(nx), np.ones(ny))


def random(rng, shape, complex_):
    v = rng.standard_normal(shape)
    return v + 1j * rng.standard_normal(shape) if complex_ else v


class Case(unittest.TestCase):
    def within(self, name, algorithm, got, want, x, y, cut=Ellipsis, divisor=1.0):
        """got against want (the full result cut by `cut`, divided by `divisor`) under the error
        model of the path."""
        self.assertEqual(got.shape, want.shape, name)
        ax, ay = np.abs(x), np.abs(y)
        err = np.abs(got - want / divisor) * divisor
        if algorithm == 0:
            factor = 4 if np.iscomplexobj(got) else 2
            bound = (factor * EPS * min(ax.size, ay.size) * ss.convolve(ax, ay, method="direct"))[cut]
            ratio = np.max(err / np.maximum(bound, 1e-300))
        else:
            full = np.add(ax.shape, ay.shape) - 1
            n = fast_length(full[0]) if ax.ndim == 1 else np.prod(full)
            ratio = np.max(err) / (4 * EPS * max(1.0, np.log2(n)) * np.linalg.norm(ax) * np.linalg.norm(ay))
        WORST[(name, algorithm)] = max(WORST.get((name, algorithm), 0.0), ratio)
        self.assertLessEqual(ratio, 1.0, "%s algorithm %d" % (name, algorithm))


def real_call(name, x, y, algorithm, *extra, same=False):
    xa = tw.array(x)
    z, status = tw.empty(), tw.i32(7)
    ret = getattr(lib, name)(xa, xa if same else tw.array(y), z, tw.i32(algorithm).ref, *extra, status.ref)
    return ret, status.value, z.numpy()


def cx_call(x, y, algorithm, correlate, normalization):
    z = tw.empty(np.complex128)
    s = lib.CxConvolution(tw.array(x, np.complex128), tw.array(y, np.complex128), z, algorithm, correlate,
                          normalization)
    return s, z.numpy()


class OneD(Case):
    def test_against_convolve_and_correlate(self):
        rng = np.random.default_rng(31)
        sizes = [(1, 1), (1, 7), (7, 1), (2, 3), (12, 12), (23, 1), (40, 9), (97, 64), (300, 1009), (4096, 33)]
        for nx, ny in sizes:
            x, y = rng.standard_normal(nx), rng.standard_normal(ny)
            cx, cy = random(rng, nx, True), random(rng, ny, True)
            corr, ccorr = ss.correlate(y, x, "full"), ss.correlate(cy, cx, "full")
            for algorithm in (0, 1):
                ret, s, z = real_call("Convolution", x, y, algorithm)
                self.assertEqual((ret, s), (0, 0))
                self.within("Convolution", algorithm, z, np.convolve(x, y), x, y)
                self.within("Rxy", algorithm, real_call("Rxy", x, y, algorithm)[2], corr, x, y)
                s, z = cx_call(cx, cy, algorithm, 0, 2)  # the normalization is ignored without correlate
                self.assertEqual(s, 0)
                self.within("CxConvolution", algorithm, z, np.convolve(cx, cy), cx, cy)
                for norm, divisor in ((0, 1.0), (1, unbiased(nx, ny)), (2, max(nx, ny))):
                    ret, s, z = real_call("Rxy80", x, y, algorithm, norm)
                    self.assertEqual(s, 0)
                    self.within("Rxy80", algorithm, z, corr, x, y, divisor=divisor)
                    s, z = cx_call(cx, cy, algorithm, 1, norm)
                    self.assertEqual(s, 0)
                    self.within("CxConvolution corr", algorithm, z, ccorr, cx, cy, divisor=divisor)

    def test_auto_correlation_paths(self):
        rng = np.random.default_rng(32)
        for n in (1, 2, 5, 24, 100, 1000):
            x = rng.standard_normal(n)
            want = ss.correlate(x, x, "full")
            for norm, divisor in ((0, 1.0), (1, unbiased(n, n)), (2, n)):
                # One block passed twice takes the single-transform path of Rxy80.
                ret, s, z = real_call("Rxy80", x, None, 1, norm, same=True)
                self.assertEqual(s, 0)
                self.within("Rxy80 same block", 1, z, want, x, x, divisor=divisor)
                a, status = tw.array(x), tw.i32(7)
                self.assertEqual((lib.AutoCorrelation80(a, norm, status.ref), status.value), (0, 0))
                self.within("AutoCorrelation80", 1, a.numpy(), want, x, x, divisor=divisor)
        # Biased lag 0 of x with itself is the mean square.
        x = np.array([1.0, -2.0, 3.0, 0.5])
        self.assertAlmostEqual(real_call("Rxy80", x, x, 0, 2)[2][3], np.mean(x * x), delta=4 * EPS * 14.25)

    def test_selector_rules(self):
        x, y = np.arange(1.0, 4.0), np.array([2.0, -1.0])
        # An unknown real algorithm computes nothing and succeeds; the normalization is then unread.
        for name, extra in (("Convolution", ()), ("Rxy", ()), ("Rxy80", (9,))):
            ret, s, z = real_call(name, x, y, 5, *extra)
            self.assertEqual((ret, s, len(z)), (0, 0, 4), name)
        for algorithm, norm in ((0, 3), (1, -1)):  # z computed, then refused and emptied
            ret, s, z = real_call("Rxy80", x, y, algorithm, norm)
            self.assertEqual((s, len(z)), (-20061, 0))
        a, status = tw.array(x), tw.i32()
        lib.AutoCorrelation80(a, 4, status.ref)
        self.assertEqual((status.value, a.shape()), (-20061, (0,)))
        rows = [  # (x, y, algorithm, correlate, normalization, status), tested in this order
            ([], [1], 9, 0, 9, -20003),
            ([1], [1], 2, 0, 9, -20061),
            ([1], [1], 0, 0, -1, -20061),  # refused even without correlate
            ([1], [1], 1, 1, 3, -20061),
        ]
        for a, b, algorithm, correlate, norm, want in rows:
            s, z = cx_call(a, b, algorithm, correlate, norm)
            self.assertEqual((s, len(z)), (want, 0))


def deconvolution(x, y):
    xa, status = tw.array(x), tw.i32(7)
    ret = lib.Deconvolution(xa, tw.array(y), status.ref)
    return ret, status.value, xa.numpy()


class Deconvolution(unittest.TestCase):
    def test_frequency_path_of_exact_products(self):
        rng = np.random.default_rng(34)
        for ny, nq in ((1, 1), (1, 9), (3, 5), (8, 57), (33, 100), (200, 1000)):
            y = rng.standard_normal(ny)
            y[0] += 3 * np.sign(y[0])  # keeps the divisor's transform away from zero
            q = rng.standard_normal(nq)
            x = np.convolve(y, q)
            ret, s, got = deconvolution(x, y)
            self.assertEqual((ret, s), (0, 0))
            # The quotient itself is the reference: SciPy's long division grows its rounding
            # geometrically once y has a root inside the unit circle (3e-7 at 33 by 100 here).
            n = 1 << (len(x) - 1).bit_length()
            spectrum = np.abs(np.fft.rfft(y, n))
            tol = 16 * EPS * max(1, np.log2(n)) * np.max(spectrum) / np.min(spectrum) * np.max(np.abs(q))
            np.testing.assert_allclose(got, q, rtol=0, atol=tol)
            if ny <= 8:
                np.testing.assert_allclose(got, ss.deconvolve(x, y)[0], rtol=0, atol=tol)

    def test_long_division_where_a_tested_bin_vanishes(self):
        # Integer data divide exactly: sum of y 0 (bin 0), alternating sum 0 (Nyquist), both, and
        # leading zeros of y, which shift the quotient.
        q = np.array([3.0, -1.0, 4.0, 1.0, -5.0, 9.0, 2.0])
        for y in ([1.0, -3.0, 2.0], [1.0, 3.0, 2.0], [2.0, 0.0, -2.0], [0.0, 0.0, 1.0, -1.0], [0.0, 1.0, 1.0]):
            ret, s, got = deconvolution(np.convolve(y, q), y)
            self.assertEqual((ret, s), (0, 0), y)
            np.testing.assert_array_equal(got, q)

    def test_singular_test_misses_other_bins(self):
        # y = 1 - sqrt(2) z + z^2 vanishes at bin 2 of 16, which the pairing with index 10 does not
        # catch: the division runs in the frequency domain and misses the quotient.
        y = np.array([1.0, -np.sqrt(2.0), 1.0])
        q = np.random.default_rng(35).standard_normal(12)
        ret, s, got = deconvolution(np.convolve(y, q), y)
        self.assertEqual((s, len(got)), (0, 12))
        self.assertGreater(np.max(np.abs(got - q)), 1e-3)

    def test_statuses_in_their_order(self):
        big = np.zeros(8388609)
        rows = [([], big, -20010), (big, [], -20010),  # the size limit comes first
                ([], [1.0], -20003), ([1.0, 2.0], [1.0, 2.0, 3.0], -20008), ([1.0, 2.0], [0.0, 0.0], -20010)]
        for x, y, want in rows:
            ret, s, got = deconvolution(x, y)
            self.assertEqual((ret, s, len(got)), (want, want, 0))


def two_d(name, x, y, *args):
    dtype = np.complex128 if name.startswith("Cx") else np.float64
    z = tw.empty(dtype, dims=2)
    s = getattr(lib, name)(tw.matrix(x, dtype), tw.matrix(y, dtype), z, *args)
    return s, z.numpy()


class TwoD(Case):
    def test_against_convolve2d_and_correlate2d(self):
        rng = np.random.default_rng(36)
        shapes = [((1, 1), (1, 1)), ((5, 7), (3, 2)), ((6, 4), (2, 4)), ((9, 8), (4, 3)), ((3, 3), (7, 5)),
                  ((1, 12), (1, 5)), ((12, 1), (4, 1)), ((30, 20), (5, 6))]
        for (r1, c1), (r2, c2) in shapes:
            for cx in ("", "Cx"):
                x, y = random(rng, (r1, c1), cx), random(rng, (r2, c2), cx)
                full = ss.convolve2d(x, y)
                # sizeMode 1 starts at (r2/2, c2/2): not SciPy's "same" for even kernel sizes.
                cuts = {0: Ellipsis, 1: np.s_[r2 // 2:r2 // 2 + r1, c2 // 2:c2 // 2 + c1],
                        2: np.s_[r2 - 1:r1, c2 - 1:c1]}
                for algorithm in (0, 1):
                    for mode, cut in cuts.items():
                        if mode == 2 and (r2 > r1 or c2 > c1 or (cx and (r1 < c1 or r2 < c2))):
                            continue
                        s, z = two_d(cx + "Convolve_2DH", x, y, mode, algorithm)
                        self.assertEqual(s, 0)
                        self.within(cx + "Convolve_2DH", algorithm, z, full[cut], x, y, cut)
                    s, z = two_d(cx + "Correlation_2DH", x, y, algorithm)
                    self.assertEqual(s, 0)
                    self.within(cx + "Correlation_2DH", algorithm, z, ss.correlate2d(y, x), x, y)

    def test_statuses_in_their_order(self):
        x, y = np.ones((4, 3)), np.ones((2, 2))
        rows = [  # (x, y, sizeMode, algorithm, real status, complex status)
            (np.ones((0, 3)), y, 5, 5, -20003, -20003),
            (x, y, 3, 5, -20061, -20061),
            (x, y, -1, 0, -20061, -20061),
            (x, y, 2, 2, -20061, -20061),
            (y, x, 2, 0, -20008, -20008),
            (x, np.ones((1, 4)), 2, 0, -20008, -20008),
            (np.ones((2, 3)), np.ones((1, 1)), 2, 0, 0, -20008),  # only the complex twin refuses wide x
            (x, np.ones((1, 2)), 2, 1, 0, -20008),  # or a wide y
            (y, np.ones((3, 3)), 1, 0, 0, 0),  # sizeMode 1 keeps the size of x
        ]
        for a, b, mode, algorithm, real, complex_ in rows:
            valid = (a.shape[0] - b.shape[0] + 1, a.shape[1] - b.shape[1] + 1)
            for name, want in (("Convolve_2DH", real), ("CxConvolve_2DH", complex_)):
                s, z = two_d(name, a, b, mode, algorithm)
                self.assertEqual((s, z.shape), (want, (0, 0) if want else a.shape if mode == 1 else valid))
        for name in ("Correlation_2DH", "CxCorrelation_2DH"):
            for b, algorithm, want in ((np.ones((0, 0)), 0, -20003), (y, 2, -20061)):
                s, z = two_d(name, x, b, algorithm)
                self.assertEqual((s, z.shape), (want, (0, 0)))


def tearDownModule():
    if WORST:
        sys.stderr.write("\nworst error as a fraction of its model bound:\n")
        for (name, algorithm), r in sorted(WORST.items()):
            sys.stderr.write("  %-20s algorithm %d  %.3f\n" % (name, algorithm, r))


if __name__ == "__main__":
    unittest.main()
