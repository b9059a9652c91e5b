"""Windows against scipy.signal.windows, in their periodic or symmetric forms."""
import ctypes
import unittest
import warnings

import numpy as np
from scipy.signal import windows

from twanlys import lowlevel as tw

LENGTHS = [2, 3, 4, 5, 8, 15, 16, 63, 64, 257, 1000]
D, I = ctypes.c_double, ctypes.c_int32


def declare(name, *argtypes):
    for prefix in ("", "Cx"):
        f = getattr(tw.lib, prefix + name)
        f.argtypes = [ctypes.c_void_p, *argtypes]
        f.restype = ctypes.c_int32


declare("TriangleWinH")
declare("BartHannWinH")
declare("BohmanWinH")
declare("ParzenWinH")
declare("WelchWinH")
declare("KaiserH", D)
declare("DolChebyWinH", D, I)
declare("GaussWinH", D, I)
declare("ForceWinH", D)
declare("ExpWinH", D)
declare("CosTaperedH", D)
declare("AllWinH", I, D, I, I)
declare("SymmWinH", I, D)
declare("AllCosWinH", I, I)
declare("GenCosWinH", ctypes.c_void_p)
for _name in ("ScaledWinH", "CxScaledWinH"):
    getattr(tw.lib, _name).argtypes = [ctypes.c_void_p, I, D, ctypes.c_void_p]
tw.lib.ScaledGenCosWinH.argtypes = [ctypes.c_void_p, ctypes.c_void_p]
tw.lib.ScaledCxGenCosWinH.argtypes = [ctypes.c_void_p, ctypes.c_void_p]
for _name in ("WinConstByNameH", "WinConstByNameH_2016"):
    getattr(tw.lib, _name).argtypes = [I, I, D, ctypes.c_void_p]
tw.lib.NumWinConstH.argtypes = [ctypes.c_void_p, ctypes.c_void_p]
tw.lib.NumWinConstH.restype = None

# Cosine-sum coefficients by window number.
COSINE_SUMS = {
    1: [0.5, 0.5],
    2: [0.54, 0.46],
    3: [0.42323, 0.49755, 0.07922],
    4: [0.4265907136715391, 0.4965606190885641, 0.07684866723989682],
    5: [0.42, 0.5, 0.08],
    6: [0.215578948, 0.41663158, 0.277263158, 0.083578947, 0.006947368],
    7: [0.35875, 0.48829, 0.14128, 0.01168],
    8: [0.27105140069342415, 0.43329793923448606, 0.21812299954311062, 0.0659254463880309,
        0.010811742098372268, 0.0007765848252250934, 1.3887217350903198e-05],
    9: [0.323215218, 0.471492057, 0.17553428, 0.028497078, 0.001261367],
    11: [0.3635819, 0.4891775, 0.1365995, 0.0106411],
}
SHORTCUTS = {1: windows.hann, 2: windows.hamming, 5: windows.blackman, 7: windows.blackmanharris,
             11: windows.nuttall}


class Constants(ctypes.Structure):
    _fields_ = [("enbw", ctypes.c_double), ("gain", ctypes.c_double)]


def numpy_constants(w):
    return len(w) * np.sum(w * w) / np.sum(w) ** 2, np.mean(w)


def window(name, n, *args, data=None):
    """The window applied to ones (or to data); returns (values, status)."""
    x = tw.array(np.ones(n) if data is None else data)
    s = getattr(tw.lib, name)(x.h, *args)
    return x.numpy(), s


def cx_window(name, z, *args):
    x = tw.array(z, np.complex128)
    s = getattr(tw.lib, "Cx" + name)(x.h, *args)
    return x.numpy(), s


class ParametricWindows(unittest.TestCase):
    def check(self, name, args, ref, atol):
        for aligned in (0, 1):
            tw.placement(aligned)
            for n in LENGTHS:
                w, s = window(name, n, *args)
                self.assertEqual(s, 0, (name, n))
                tol = atol(n) if callable(atol) else atol
                np.testing.assert_allclose(w, ref(n), rtol=0, atol=tol, err_msg="%s n=%d" % (name, n))
                z = np.linspace(-2, 3, n) + 1j * np.linspace(4, -1, n)
                wz, s = cx_window(name, z, *args)
                self.assertEqual(s, 0)
                np.testing.assert_array_equal(wz, z * w)

    def test_triangle_is_periodic_bartlett(self):
        self.check("TriangleWinH", (), lambda n: windows.bartlett(n, sym=False), 2.3e-16)

    def test_bartlett_hann_and_bohman(self):
        # Cosines by phasor rotation: the error grows slowly with n (measured 1.1e-15 at n = 1000).
        self.check("BartHannWinH", (), lambda n: windows.barthann(n, sym=False), lambda n: 1e-15 + 1e-18 * n)
        self.check("BohmanWinH", (), lambda n: windows.bohman(n, sym=False), lambda n: 1e-15 + 1e-18 * n)

    def test_welch_and_parzen_formulas(self):
        def welch(n):
            k = np.arange(n)
            return 1 - ((k - n / 2) / (n / 2)) ** 2

        def parzen(n):
            c = n / 2
            d = np.abs(np.arange(n) - c)
            u = 1 - d / c
            return np.where(d > c / 2, 2 * u ** 3, 1 - 6 * (d / c) ** 2 + 6 * (d / c) ** 3)

        self.check("WelchWinH", (), welch, 1e-15)
        self.check("ParzenWinH", (), parzen, 1e-15)

    def test_kaiser(self):
        for beta in (0.5, 3.0, 8.6, 14.0, 20.0):
            self.check("KaiserH", (beta,), lambda n: windows.kaiser(n, beta, sym=False), 1e-9)

    def test_kaiser_series_cut_off(self):
        # At beta 30 the series (at most 25 terms, ending after a term of at most 1e-8) is short of
        # I0: the window departs from SciPy's by about 3.5e-5 but equals the series.
        def i0(t):
            t2, total, term = t * t, 1.0, 1.0
            for i in range(1, 26):
                term = term * t2 / ((2.0 * i) * (2.0 * i))
                total += term
                if term <= 1e-8:
                    break
            return total

        beta, n = 30.0, 64
        d = 1 - np.arange(n) * (2.0 / n)
        ref = np.array([i0(beta * np.sqrt(1 - di * di)) for di in d]) / i0(beta)
        w, s = window("KaiserH", n, beta)
        self.assertEqual(s, 0)
        np.testing.assert_allclose(w, ref, rtol=1e-14, atol=0)
        departure = np.max(np.abs(w - windows.kaiser(n, beta, sym=False)))
        self.assertGreater(departure, 1e-5)
        self.assertLess(departure, 1e-4)

    def test_gaussian_scales(self):
        for sigma in (0.1, 0.2, 0.45):
            self.check("GaussWinH", (sigma, 0), lambda n: windows.gaussian(n, (n + 1) * sigma, sym=False), 1e-15)
            self.check("GaussWinH", (sigma, 1), lambda n: windows.gaussian(n, n * sigma, sym=True), 1e-15)

    def test_exponential(self):
        for f in (0.1, 0.5, 2.0):
            self.check("ExpWinH", (f,),
                       lambda n: windows.exponential(n, center=0, tau=-(n - 1) / np.log(f), sym=False),
                       4e-16 * 1000 * max(1, f))

    def test_cosine_taper(self):
        for fraction in (0.1, 0.3, 0.5, 0.99):
            def tukey(n):
                m = int(fraction * 0.5 * n)
                return np.ones(n) if m == 0 else windows.tukey(n, alpha=2 * m / (n - 1), sym=True)
            # The taper angle is accumulated, and SciPy's far end rounds its own argument:
            # measured 3.5e-15 at n = 257, 8.2e-15 at n = 1000.
            self.check("CosTaperedH", (fraction,), tukey, lambda n: 4e-15 + 1e-17 * n)
        self.check("CosTaperedH", (1.0,), lambda n: windows.hann(n, sym=False), 1e-15)

    def test_force(self):
        for duty in (0.0, 12.5, 50.0, 100.0):
            self.check("ForceWinH", (duty,), lambda n: (np.arange(n) < int(duty * 0.01 * n)).astype(float), 0)

    def test_dolph_chebyshev(self):
        with warnings.catch_warnings():
            warnings.simplefilter("ignore")
            for flag in (0, 1):
                for s_ratio in (10 ** 1.5, 1000.0, 1e5):
                    for n in (2, 3, 16, 17, 64, 65):
                        ref = windows.chebwin(n, at=20 * np.log10(s_ratio), sym=flag != 0)
                        w, s = window("DolChebyWinH", n, s_ratio, flag)
                        self.assertEqual(s, 0)
                        # Chebyshev-recursion cosines: error grows about as n cubed.
                        np.testing.assert_allclose(w, ref, rtol=0, atol=1e-14 + 2e-17 * n ** 3)
                        self.assertAlmostEqual(np.max(w), 1.0, delta=2.3e-16)
                        z = np.linspace(-2, 3, n) + 1j * np.linspace(4, -1, n)
                        wz, s = cx_window("DolChebyWinH", z, s_ratio, flag)
                        self.assertEqual(s, 0)
                        np.testing.assert_array_equal(wz, z * w)
                        wn, s = window("AllWinH", n, 61, 20 * np.log10(s_ratio), 0, flag)
                        self.assertEqual(s, 0)
                        np.testing.assert_allclose(wn, ref, rtol=0, atol=1e-14 + 2e-17 * n ** 3)
                w_low, _ = window("DolChebyWinH", 9, 0.25, flag)
                w_one, _ = window("DolChebyWinH", 9, 1.0, flag)
                np.testing.assert_array_equal(w_low, w_one)



class NumberedWindows(unittest.TestCase):
    def test_cosine_sums(self):
        for number, a in COSINE_SUMS.items():
            for n in LENGTHS:
                atol = 4e-16 * n * np.sum(a)
                ref = windows.general_cosine(n, a, sym=False)
                w, s = window("AllWinH", n, number, float("nan"), 0, 0)
                self.assertEqual(s, 0)
                np.testing.assert_allclose(w, ref, rtol=0, atol=atol, err_msg="number %d n=%d" % (number, n))
                if number in SHORTCUTS:
                    np.testing.assert_allclose(w, SHORTCUTS[number](n, sym=False), rtol=0, atol=atol)
                ws, s = window("AllCosWinH", n, number, 1)
                self.assertEqual(s, 0)
                np.testing.assert_allclose(ws, ref / a[0], rtol=0, atol=atol / a[0])
                if n > 2:
                    sym, s = window("SymmWinH", n, number, 0.0)
                    self.assertEqual(s, 0)
                    np.testing.assert_allclose(sym, windows.general_cosine(n, a, sym=True), rtol=0, atol=atol)

    def test_general_cosine_sum(self):
        rng = np.random.default_rng(11)
        for m in (1, 2, 3, 6, 9):
            a = rng.uniform(0.1, 1.0, m)
            c = tw.array(a)
            for n in (1, 2, 7, 64, 301):
                data = rng.standard_normal(n)
                w, s = window("GenCosWinH", n, c.h, data=data)
                self.assertEqual(s, 0)
                ref = data * windows.general_cosine(n, a, sym=False)
                np.testing.assert_allclose(w, ref, rtol=0, atol=4e-16 * n * np.sum(a) * np.max(np.abs(data)))
                z = data + 1j * rng.standard_normal(n)
                x = tw.array(z, np.complex128)
                self.assertEqual(tw.lib.ScaledCxGenCosWinH(x.h, c.h), 0)
                zr, zi = tw.array(z.real), tw.array(z.imag)
                tw.lib.ScaledGenCosWinH(zr.h, c.h)
                tw.lib.ScaledGenCosWinH(zi.h, c.h)
                np.testing.assert_array_equal(x.numpy(), zr.numpy() + 1j * zi.numpy())

    def test_symmetric_forms(self):
        # Length 2 is built from a periodic window of length 1, which is 1: both elements stay.
        for number in (1, 30, 60):
            self.assertEqual(window("SymmWinH", 2, number, 3.0)[0].tolist(), [1.0, 1.0])
        cases = [(30, 0.0, lambda n: windows.bartlett(n, sym=True), 2.3e-16),
                 (31, 0.0, lambda n: windows.barthann(n, sym=True), 2e-15),
                 (32, 0.0, lambda n: windows.bohman(n, sym=True), 2e-15),
                 (60, 6.0, lambda n: windows.kaiser(n, 6.0, sym=True), 1e-9),
                 (62, 0.25, lambda n: windows.gaussian(n, n * 0.25, sym=True), 1e-15)]
        for number, p, ref, atol in cases:
            for n in LENGTHS[1:]:
                w, s = window("SymmWinH", n, number, p)
                self.assertEqual(s, 0)
                np.testing.assert_allclose(w, ref(n), rtol=0, atol=atol, err_msg="number %d n=%d" % (number, n))
                w2, s = window("AllWinH", n, number, p, 0, 1)
                np.testing.assert_array_equal(w2, w)

    def test_scaled_windows_and_constants(self):
        rng = np.random.default_rng(3)
        for number, p in [(30, 0.0), (31, 0.0), (32, 0.0), (33, 0.0), (34, 0.0), (60, 4.0), (62, 0.3)]:
            for n in (2, 7, 64, 255):
                plain, _ = window("AllWinH", n, number, p, 0, 0)
                enbw, gain = numpy_constants(plain)
                data = rng.standard_normal(n)
                x = tw.array(data)
                c = Constants()
                self.assertEqual(tw.lib.ScaledWinH(x.h, number, p, ctypes.byref(c)), 0)
                # Sums in index order against NumPy's pairwise sums.
                np.testing.assert_allclose([c.enbw, c.gain], [enbw, gain], rtol=2e-16 * n)
                # The gain checked above scales the plain window, as x * w * (1 / gain).
                np.testing.assert_array_equal(x.numpy(), data * plain * (1 / c.gain))
                byname = Constants()
                self.assertEqual(tw.lib.WinConstByNameH(n, number, p, ctypes.byref(byname)), 0)
                self.assertEqual((byname.enbw, byname.gain), (c.enbw, c.gain))
                measured, held = Constants(), tw.array(plain)
                tw.lib.NumWinConstH(held.h, ctypes.byref(measured))
                self.assertEqual((measured.enbw, measured.gain), (byname.enbw, byname.gain))
        # Hann of length 1000: the table's ENBW 1.5 and coherent gain 0.5 match the measured ones.
        hann, _ = window("AllWinH", 1000, 1, 0.0, 0, 0)
        np.testing.assert_allclose(numpy_constants(hann), [1.5, 0.5], rtol=1e-12)

    def test_dB_translation(self):
        a, b = Constants(), Constants()
        s1 = tw.lib.WinConstByNameH_2016(32, 61, 40.0, ctypes.byref(a))
        s2 = tw.lib.WinConstByNameH(32, 61, 100.0, ctypes.byref(b))
        self.assertEqual((s1, s2), (0, 0))
        self.assertEqual((a.enbw, a.gain), (b.enbw, b.gain))
        w = windows.chebwin(33, at=40.0, sym=True)[:-1]
        np.testing.assert_allclose([a.enbw, a.gain], numpy_constants(w), rtol=1e-12)


if __name__ == "__main__":
    unittest.main()
