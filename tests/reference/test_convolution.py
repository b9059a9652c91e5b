"""1-D convolution, correlation and deconvolution against NumPy/SciPy, with the error model of each
path: direct below 2 eps min(nx, ny) conv(|x|, |y|) per lag, frequency domain below
4 eps log2(N) |x|_2 |y|_2."""
import sys
import unittest

import numpy as np
import scipy.signal as ss

import twanlys as tw

lib = tw.lib
EPS = 2.0 ** -52
SIZES = [(1, 1), (1, 7), (7, 1), (2, 3), (12, 12), (23, 1), (40, 9), (97, 64), (300, 1009), (4096, 33)]
WORST = {}
FAST = [2, 3, 5, 7, 11, 13, 17, 19, 29, 31, 37, 41, 43]


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


class Model(unittest.TestCase):
    def within(self, name, algorithm, got, want, ax, ay):
        """got against want under the error model of the path, ax and ay the operands' moduli."""
        self.assertEqual(got.shape, want.shape, name)
        if algorithm == 0:
            bound = 2 * EPS * min(len(ax), len(ay)) * np.convolve(ax, ay)
            ratio = np.max(np.abs(got - want) / np.maximum(bound, 1e-300))
        else:
            n = fast_length(len(ax) + len(ay) - 1)
            bound = 4 * EPS * max(1.0, np.log2(n)) * np.linalg.norm(ax) * np.linalg.norm(ay)
            ratio = np.max(np.abs(got - want)) / bound
        key = (name, algorithm)
        WORST[key] = max(WORST.get(key, 0.0), ratio)
        self.assertLessEqual(ratio, 1.0, "%s algorithm %d" % (name, algorithm))


def real_call(name, x, y, algorithm, *extra, same=False):
    xa = tw.array(x)
    ya = xa if same else tw.array(y)
    z, status = tw.empty(), tw.i32(7)
    ret = getattr(lib, name)(xa, ya, z, tw.i32(algorithm).ref, *extra, status.ref)
    return ret, status.value, z.numpy()


def cx_call(x, y, algorithm, correlate, normalization):
    z = tw.empty(np.complex128)
    s = lib.CxConvolution(tw.array(x, np.complex128), tw.array(y, np.complex128), z, algorithm, correlate,
                          normalization)
    return s, z.numpy()


class OneD(Model):
    def test_real_convolution_and_correlation(self):
        rng = np.random.default_rng(31)
        for nx, ny in SIZES:
            x, y = rng.standard_normal(nx), rng.standard_normal(ny)
            full = np.convolve(x, y)
            corr = ss.correlate(y, x, "full")
            for algorithm in (0, 1):
                ret, s, z = real_call("Convolution", x, y, algorithm)
                self.assertEqual((ret, s), (0, 0))
                self.within("Convolution", algorithm, z, full, abs(x), abs(y))
                ret, s, z = real_call("Rxy", x, y, algorithm)
                self.assertEqual((ret, s), (0, 0))
                self.within("Rxy", algorithm, z, corr, abs(x), abs(y))
                for norm, divisor in ((1, unbiased(nx, ny)), (2, max(nx, ny))):
                    ret, s, z = real_call("Rxy80", x, y, algorithm, norm)
                    self.assertEqual(s, 0)
                    self.within("Rxy80", algorithm, z * divisor, corr, abs(x), abs(y))

    def test_auto_correlation_paths(self):
        rng = np.random.default_rng(32)
        for n in (1, 2, 5, 24, 100, 1000):
            x = rng.standard_normal(n)
            want = ss.correlate(x, x, "full")
            for norm, divisor in ((0, 1.0), (1, unbiased(n, n)), (2, n)):
                # One block passed twice: the single-transform path of Rxy80.
                ret, s, z = real_call("Rxy80", x, None, 1, norm, same=True)
                self.assertEqual(s, 0)
                self.within("Rxy80 same", 1, z * divisor, want, abs(x), abs(x))
                a, status = tw.array(x), tw.i32(7)
                self.assertEqual(lib.AutoCorrelation80(a, norm, status.ref), 0)
                self.assertEqual(status.value, 0)
                self.within("AutoCorrelation80", 1, a.numpy() * divisor, want, abs(x), abs(x))
        # Biased lag 0 of x with itself is the mean square.
        x = np.array([1.0, -2.0, 3.0, 0.5])
        ret, s, z = real_call("Rxy80", x, x, 0, 2)
        self.assertAlmostEqual(z[3], np.mean(x * x), delta=4 * EPS * 14.25)

    def test_complex_convolution_and_correlation(self):
        rng = np.random.default_rng(33)
        for nx, ny in SIZES:
            x = rng.standard_normal(nx) + 1j * rng.standard_normal(nx)
            y = rng.standard_normal(ny) + 1j * rng.standard_normal(ny)
            conv = np.convolve(x, y)
            corr = ss.correlate(y, x, "full")
            for algorithm in (0, 1):
                # The complex direct sums carry four products per term: twice the real bound.
                scale = 2.0 if algorithm == 0 else 1.0
                s, z = cx_call(x, y, algorithm, 0, 2)  # normalization ignored without correlate
                self.assertEqual(s, 0)
                self.within("CxConvolution", algorithm, z / scale, conv / scale, abs(x), abs(y))
                for norm, divisor in ((0, 1.0), (1, unbiased(nx, ny)), (2, max(nx, ny))):
                    s, z = cx_call(x, y, algorithm, 1, norm)
                    self.assertEqual(s, 0)
                    self.within("CxConvolution corr", algorithm, z * divisor / scale, corr / scale, abs(x), abs(y))

    def test_selector_and_size_rules(self):
        x, y = np.arange(1.0, 4.0), np.array([2.0, -1.0])
        # An unknown real algorithm computes nothing and succeeds; the normalization is then unread.
        for name, extra in (("Convolution", ()), ("Rxy", ()), ("Rxy80", (9,))):
            ret, s, z = real_call(name, x, y, 5, *extra)
            self.assertEqual((ret, s, len(z)), (0, 0, 4), name)
        rows = [  # (x, y, algorithm, normalization, status)
            ([], [1.0], 0, 0, -20003),
            ([1.0], [], 7, 9, -20003),
            (x, y, 0, 3, -20061),  # computed, then refused: z emptied
            (x, y, 1, -1, -20061),
        ]
        for a, b, algorithm, norm, want in rows:
            ret, s, z = real_call("Rxy80", a, b, algorithm, norm)
            self.assertEqual((ret, s, len(z)), (0, want, 0))
        a, status = tw.array(x), tw.i32()
        self.assertEqual(lib.AutoCorrelation80(a, 4, status.ref), 0)
        self.assertEqual((status.value, a.shape()), (-20061, (0,)))
        cx_rows = [  # (x, y, algorithm, correlate, normalization, status): tested in this order
            ([], [1], 9, 0, 9, -20003),
            ([1], [1], 2, 0, 9, -20061),
            ([1], [1], 0, 0, -1, -20061),  # refused even without correlate
            ([1], [1], 1, 1, 3, -20061),
        ]
        for a, b, algorithm, correlate, norm, want in cx_rows:
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
            cond = np.max(spectrum) / np.min(spectrum)
            tol = 16 * EPS * max(1, np.log2(n)) * cond * np.max(np.abs(q))
            np.testing.assert_allclose(got, q, rtol=0, atol=tol)
            if ny <= 8:
                np.testing.assert_allclose(got, ss.deconvolve(x, y)[0], rtol=0, atol=tol)

    def test_long_division_where_a_tested_bin_vanishes(self):
        # Integer data divide exactly: sum of y 0 (bin 0), alternating sum 0 (Nyquist), both, and
        # leading zeros of y, which shift the quotient.
        q = np.array([3.0, -1.0, 4.0, 1.0, -5.0, 9.0, 2.0])
        for y in ([1.0, -3.0, 2.0], [1.0, 3.0, 2.0], [2.0, 0.0, -2.0], [0.0, 0.0, 1.0, -1.0], [0.0, 1.0, 1.0]):
            y = np.array(y)
            ret, s, got = deconvolution(np.convolve(y, q), y)
            self.assertEqual((ret, s), (0, 0), y)
            np.testing.assert_array_equal(got, q)

    def test_singular_test_misses_other_bins(self):
        # y = 1 - sqrt(2) z + z^2 vanishes at bin 2 of 16, which the pairing with bin 10 does not
        # catch: the division runs in the frequency domain and misses the quotient.
        y = np.array([1.0, -np.sqrt(2.0), 1.0])
        q = np.random.default_rng(35).standard_normal(12)
        ret, s, got = deconvolution(np.convolve(y, q), y)
        self.assertEqual((s, len(got)), (0, 12))
        self.assertGreater(np.max(np.abs(got - q)), 1e-3)

    def test_statuses_in_their_order(self):
        big = np.zeros(8388609)
        rows = [  # (x, y, status)
            ([], big, -20010),  # the size limit comes first
            (big, [], -20010),
            ([], [1.0], -20003),
            ([1.0, 2.0], [1.0, 2.0, 3.0], -20008),
            ([1.0, 2.0], [0.0, 0.0], -20010),
        ]
        for x, y, want in rows:
            ret, s, got = deconvolution(x, y)
            self.assertEqual((ret, s, len(got)), (want, want, 0))


def two_d(name, x, y, *args):
    dtype = np.complex128 if name.startswith("Cx") else np.float64
    z = tw.empty(dtype, dims=2)
    s = getattr(lib, name)(tw.matrix(x, dtype), tw.matrix(y, dtype), z, *args)
    return s, z.numpy()


class TwoD(unittest.TestCase):
    def within(self, name, algorithm, got, want, ax, ay):
        self.assertEqual(got.shape, want.shape, name)
        if algorithm == 0:
            # Each term of a complex sum carries two products: twice the real bound.
            factor = 4 if np.iscomplexobj(got) else 2
            bound = factor * EPS * min(ax.size, ay.size) * ss.convolve2d(ax, ay)
            # The full bound, cut where the result is cut.
            bound = bound[self.cut] if self.cut is not None else bound
            ratio = np.max(np.abs(got - want) / np.maximum(bound, 1e-300))
        else:
            n = (ax.shape[0] + ay.shape[0] - 1) * (ax.shape[1] + ay.shape[1] - 1)
            bound = 4 * EPS * max(1.0, np.log2(n)) * np.linalg.norm(ax) * np.linalg.norm(ay)
            ratio = np.max(np.abs(got - want)) / bound
        key = (name, algorithm)
        WORST[key] = max(WORST.get(key, 0.0), ratio)
        self.assertLessEqual(ratio, 1.0, "%s algorithm %d" % (name, algorithm))

    def test_against_convolve2d_and_correlate2d(self):
        rng = np.random.default_rng(36)
        shapes = [((1, 1), (1, 1)), ((5, 7), (3, 2)), ((6, 4), (2, 4)), ((9, 8), (4, 3)), ((3, 3), (7, 5)),
                  ((1, 12), (1, 5)), ((12, 1), (4, 1)), ((30, 20), (5, 6))]
        for (r1, c1), (r2, c2) in shapes:
            for complex_ in (False, True):
                prefix = "Cx" if complex_ else ""
                x, y = rng.standard_normal((r1, c1)), rng.standard_normal((r2, c2))
                if complex_:
                    x = x + 1j * rng.standard_normal((r1, c1))
                    y = y + 1j * rng.standard_normal((r2, c2))
                full = ss.convolve2d(x, y)
                cuts = {0: (slice(None), slice(None)),
                        1: (slice(r2 // 2, r2 // 2 + r1), slice(c2 // 2, c2 // 2 + c1)),
                        2: (slice(r2 - 1, r1), slice(c2 - 1, c1))}
                for algorithm in (0, 1):
                    for mode, cut in cuts.items():
                        if mode == 2 and (r2 > r1 or c2 > c1 or (complex_ and (r1 < c1 or r2 < c2))):
                            continue
                        self.cut = cut
                        s, z = two_d(prefix + "Convolve_2DH", x, y, mode, algorithm)
                        self.assertEqual(s, 0, (prefix, mode, algorithm))
                        self.within(prefix + "Convolve_2DH", algorithm, z, full[cut], abs(x), abs(y))
                    self.cut = None
                    s, z = two_d(prefix + "Correlation_2DH", x, y, algorithm)
                    self.assertEqual(s, 0)
                    self.within(prefix + "Correlation_2DH", algorithm, z, ss.correlate2d(y, x), abs(x), abs(y))

    def test_statuses_in_their_order(self):
        x, y, wide = np.ones((4, 3)), np.ones((2, 2)), np.ones((2, 3))
        rows = [  # (x, y, sizeMode, algorithm, real status, complex status)
            (np.ones((0, 3)), y, 5, 5, -20003, -20003),
            (x, y, 3, 5, -20061, -20061),
            (x, y, -1, 0, -20061, -20061),
            (x, y, 2, 2, -20061, -20061),
            (y, x, 2, 0, -20008, -20008),
            (x, np.ones((1, 4)), 2, 0, -20008, -20008),
            (wide, np.ones((1, 1)), 2, 0, 0, -20008),  # only the complex twin refuses wide x
            (x, np.ones((1, 2)), 2, 1, 0, -20008),     # or a wide y
            (y, np.ones((3, 3)), 1, 0, 0, 0),          # sizeMode 1 keeps the size of x
        ]
        for a, b, mode, algorithm, real, cx in rows:
            for name, want in (("Convolve_2DH", real), ("CxConvolve_2DH", cx)):
                s, z = two_d(name, a, b, mode, algorithm)
                self.assertEqual(s, want, (name, a.shape, b.shape, mode, algorithm))
                valid = (a.shape[0] - b.shape[0] + 1, a.shape[1] - b.shape[1] + 1)
                self.assertEqual(z.shape, (0, 0) if want else a.shape if mode == 1 else valid)
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
