"""Noise generators: sample for sample against a Python rendering of the stated draws (with the
record left behind), then their laws at fixed seeds, and the line spectrum of the periodic noise."""
import ctypes
import math
import os
import sys
import unittest

import numpy as np
from scipy import stats

from twanlys import lowlevel as tw

sys.path.insert(0, os.path.join(os.path.dirname(os.path.abspath(__file__)), "..", "generate"))
import wichmann_hill_reference as wh  # noqa: E402

D, I32, P = ctypes.c_double, ctypes.c_int32, ctypes.c_void_p
U = wh.uniform


class State(ctypes.Structure):
    _fields_ = [("s1", I32), ("s2", I32), ("s3", I32)]


class Spare(ctypes.Structure):
    _pack_ = 4
    _fields_ = [("haveSpare", I32), ("spare", D)]


CACHE_FIELDS = ("p", "q", "lnP", "lnQ", "trialsF", "lnGammaTrials", "trials")


class Cache(ctypes.Structure):
    _pack_ = 4
    _fields_ = [(f, D) for f in CACHE_FIELDS[:-1]] + [("trials", I32)]


tw.lib.GammaNoiseH.argtypes = [P, I32, I32, I32, P]
tw.lib.PoissonNoiseH.argtypes = [P, I32, D, I32, P]
tw.lib.BinomialNoiseH.argtypes = [P, I32, I32, D, I32, P, P]
tw.lib.TW_LnGamma.argtypes = [D, ctypes.POINTER(D)]
tw.lib.TW_LnGamma.restype = None


def ln_gamma(x):
    # The draws are stated on the library's own log gamma (checked against SciPy elsewhere).
    out = D()
    tw.lib.TW_LnGamma(x, ctypes.byref(out))
    return out.value


# --- the reference, on st = [s1, s2, s3] as Python ints (math.* is the same libm as the library) ---

def reseed(st, seed):
    if seed > 0:
        st[:] = wh.seed(seed)


def polar(st, accept):
    while True:
        v1, v2 = 2.0 * U(st) - 1.0, 2.0 * U(st) - 1.0
        if accept(v1 * v1 + v2 * v2):
            return v1, v2


def tangent(st, sq, mean, reject):
    # The candidate and its y of the tangent envelope, already floored.
    while True:
        y = math.tan(math.pi * U(st))
        em = sq * y + mean
        if not reject(em):
            return float(math.floor(em)), y


def ref_white(st, n, a):
    return [(U(st) - 0.5) * (a + a) for _ in range(n)]


def ref_gauss(st, spare, n, sd):
    out = []
    for _ in range(n):
        if spare[0] == 0:
            v1, v2 = polar(st, lambda r: r < 1.0 and r != 0.0)
            r = v1 * v1 + v2 * v2
            f = math.sqrt(-2.0 * math.log(r) / r)
            spare[1], sample = v1 * f, v2 * f
        else:
            sample = spare[1]
        spare[0] ^= 1
        out.append(sample * sd)
    return out


def ref_gamma(st, n, a):
    out = []
    for _ in range(n):
        if a < 6:
            t = 1.0
            for _ in range(a):
                t *= U(st)
            out.append(-math.log(t))
            continue
        am = float(a - 1)
        s = math.sqrt(2.0 * am + 1.0)
        while True:
            v1, v2 = polar(st, lambda r: r <= 1.0)
            y = v2 / v1
            x = s * y + am
            if x > 0.0 and not U(st) > (1.0 + y * y) * math.exp(am * math.log(x / am) - s * y):
                break
        out.append(x)
    return out


def ref_poisson(st, n, m):
    out = []
    sq, lnm = math.sqrt(2.0 * m), math.log(m) if m > 0 else 0.0
    g = m * lnm - ln_gamma(m + 1.0)
    for _ in range(n):
        if m < 12:
            count, t = -1, 1.0
            while True:
                count, t = count + 1, t * U(st)
                if not math.exp(-m) < t:
                    break
            out.append(float(count))
            continue
        while True:
            em, y = tangent(st, sq, m, lambda e: e < 0.0)
            if not U(st) > 0.9 * (1.0 + y * y) * math.exp(em * lnm - ln_gamma(em + 1.0) - g):
                break
        out.append(em)
    return out


def ref_binomial(st, c, n, trials, p):
    pp = p if p <= 0.5 else 1.0 - p
    en = float(trials)
    am = en * pp
    out = []
    for _ in range(n):
        if trials < 25:
            count = sum(1 for _ in range(trials) if U(st) < pp)
        elif am < 1.0:
            t, count = 1.0, trials
            for j in range(trials + 1):
                t *= U(st)
                if t < math.exp(-am):
                    count = min(j, trials)
                    break
        else:
            if c["trials"] != trials:
                c.update(trialsF=en, lnGammaTrials=ln_gamma(en + 1.0), trials=trials)
            if c["p"] != pp:
                c.update(p=pp, q=1.0 - pp, lnP=math.log(pp), lnQ=math.log(1.0 - pp))
            sq = math.sqrt(2.0 * am * c["q"])
            while True:
                em, y = tangent(st, sq, am, lambda e: e < 0.0 or e >= en + 1.0)
                t = 1.2 * sq * (1.0 + y * y) * math.exp(
                    c["lnGammaTrials"] - ln_gamma(em + 1.0) - ln_gamma(c["trialsF"] - em + 1.0)
                    + em * c["lnP"] + (c["trialsF"] - em) * c["lnQ"])
                if not U(st) > t:
                    break
            count = em
        out.append(int(en - count if pp != p else count))
    return out


# --- calls ---------------------------------------------------------------------------------------

def by_pointer(export, n, scalar, seed, state, *extra):
    y, status = tw.empty(), tw.i32(-1)
    args = [tw.i32(n).ref, tw.f64(scalar).ref, tw.i32(seed).ref]
    if export == "PeriodNoise":
        rc = tw.lib.PeriodNoise(*args, y, status.ref, ctypes.byref(state))
    else:
        rc = getattr(tw.lib, export)(y, *args, status.ref, ctypes.byref(state), *extra)
    assert rc == 0
    return y.numpy(), status.value


def returned(export, n, *args, dtype=np.float64):
    y = tw.empty(dtype)
    s = getattr(tw.lib, export)(y, n, *args)
    return y.numpy(), s


def record(st):
    return [st.s1, st.s2, st.s3]


class Streams(unittest.TestCase):
    def test_every_generator_with_the_record_left_behind(self):
        # (generator, parameter, length, seeds of successive calls on one record): restarts,
        # continuations (0 and negative), a seed whose s1 overflows at the first draw.
        cases = [("white", 2.5, 1000, [7, -1, 0]), ("white", -1.0, 300, [12558384, -5]),
                 ("Gauss", 1.5, 7, [5, 0, -3, 9, 0]), ("Gauss", 1.0, 1, [1, 0, 0])]
        cases += [("gamma", a, 300, [a * 101, -1]) for a in (1, 2, 5, 6, 10, 37)]
        cases += [("Poisson", m, 300, [31, 0]) for m in (0.0, 0.7, 11.99, 12.0, 40.0, 1e4)]
        # Binomial: below 25 with and without the fold, the small-mean branch on both sides, the
        # rejection branch on both sides (the cache carried across), p = 1, p = 0, no trials.
        cases += [("binomial", tp, 200, [1000 + i, -1]) for i, tp in enumerate(
            [(0, 0.3), (10, 0.3), (24, 0.8), (100, 0.005), (1000, 0.9995), (25, 0.5), (100, 0.3), (100, 0.7),
             (5000, 0.02), (5000, 0.98), (60, 1.0), (60, 0.0)])]
        st, spare, cache = State(11, 22, 33), Spare(), Cache()
        ref, ref_spare, ref_cache = [11, 22, 33], [0, 0.0], dict.fromkeys(CACHE_FIELDS, 0)
        for kind, par, n, seeds in cases:
            for seed in seeds:
                if kind == "Gauss":
                    y, s = by_pointer("Gauss", n, par, seed, st, ctypes.byref(spare))
                    if seed > 0:
                        ref_spare[:] = [0, 0.0]
                elif kind == "white":
                    y, s = by_pointer("white", n, par, seed, st)
                elif kind == "binomial":
                    y, s = returned("BinomialNoiseH", n, *par, seed, ctypes.byref(st), ctypes.byref(cache),
                                    dtype=np.uint32)
                else:
                    y, s = returned(kind.capitalize() + "NoiseH", n, par, seed, ctypes.byref(st))
                reseed(ref, seed)  # seed 0 is a no-op of the source itself
                expected = {"white": lambda: ref_white(ref, n, par),
                            "Gauss": lambda: ref_gauss(ref, ref_spare, n, par),
                            "gamma": lambda: ref_gamma(ref, n, par),
                            "Poisson": lambda: ref_poisson(ref, n, par),
                            "binomial": lambda: ref_binomial(ref, ref_cache, n, *par)}[kind]()
                what = "%s %s seed %d" % (kind, par, seed)
                self.assertEqual(s, 0, what)
                np.testing.assert_array_equal(y, np.array(expected, dtype=y.dtype), what)
                self.assertEqual(record(st), ref, what)
                self.assertEqual([spare.haveSpare, spare.spare], ref_spare, what)
                self.assertEqual({f: getattr(cache, f) for f in CACHE_FIELDS}, ref_cache, what)
        # A record of zeros stays at 0.0: -amplitude everywhere.
        np.testing.assert_array_equal(by_pointer("white", 5, 1.5, -1, State(0, 0, 0))[0], [-1.5] * 5)


class Laws(unittest.TestCase):
    """The sampled laws at fixed seeds; every p-value must stay above 1e-3."""
    N = 20000

    def assert_p(self, name, p):
        print("%-28s p = %.4f" % (name, p))
        self.assertGreater(p, 1e-3, name)

    def test_continuous(self):
        st = State()
        y, _ = by_pointer("white", self.N, 2.0, 123, st)
        self.assert_p("white uniform(-2, 2)", stats.kstest(y, "uniform", args=(-2.0, 4.0)).pvalue)
        y, _ = by_pointer("Gauss", self.N, 1.5, 321, st, ctypes.byref(Spare()))
        self.assert_p("Gauss normal(0, 1.5)", stats.kstest(y, "norm", args=(0.0, 1.5)).pvalue)
        for order in (1, 3, 5, 6, 10, 50):
            y, _ = returned("GammaNoiseH", self.N, order, 55 + order, ctypes.byref(st))
            self.assert_p("gamma order %d" % order, stats.kstest(y, "gamma", args=(order,)).pvalue)

    def chi_square(self, name, y, dist):
        # Cells of an expectation of at least 5; the two tails are pooled into the end cells.
        k = np.arange(dist.ppf(1e-12), dist.ppf(1 - 1e-12) + 1)
        keep = k[dist.pmf(k) * len(y) >= 5]
        lo, hi = keep[0], keep[-1]
        inner = np.arange(lo + 1, hi)
        counts = np.r_[np.sum(y <= lo), [np.sum(y == j) for j in inner], np.sum(y >= hi)]
        expected = len(y) * np.r_[dist.cdf(lo), dist.pmf(inner), dist.sf(hi - 1)]
        self.assert_p(name, stats.chisquare(counts, expected).pvalue)

    def test_discrete(self):
        st = State()
        for m in (0.5, 5.0, 11.9, 12.0, 40.0, 300.0):
            y, _ = returned("PoissonNoiseH", self.N, m, 7, ctypes.byref(st))
            self.chi_square("Poisson mean %g" % m, y, stats.poisson(m))
        for trials, p in [(20, 0.3), (20, 0.9), (400, 0.001), (400, 0.9991), (100, 0.3), (100, 0.8), (2000, 0.45)]:
            y, _ = returned("BinomialNoiseH", self.N, trials, p, 8, ctypes.byref(st), None, dtype=np.uint32)
            self.chi_square("binomial %d, %g" % (trials, p), y, stats.binom(trials, p))


class PeriodicNoise(unittest.TestCase):
    def test_against_irfft_of_the_reference_spectrum(self):
        worst = 0.0
        for n, a, seed in [(1, 1.0, 3), (2, 1.0, 3), (3, 2.0, 4), (4, 1.0, 5), (7, 0.5, 6), (48, 1.0, 7),
                           (1000, 3.0, 8), (1001, 1.0, 9), (48, 1.0, 12558390), (48000, 0.25, 11)]:
            st = State(1, 2, 3)
            y, s = by_pointer("PeriodNoise", n, a, seed, st)
            self.assertEqual(s, 0)
            ref = [1, 2, 3]
            reseed(ref, seed)
            lines = n // 2 - 1 if n % 2 == 0 else (n - 1) // 2
            phi = np.array([wh.int15(ref) for _ in range(max(lines, 0))], dtype=float)
            self.assertEqual(record(st), ref)
            if n < 3:
                np.testing.assert_array_equal(y, np.zeros(n))
                continue
            spectrum = np.zeros(n // 2 + 1, dtype=complex)
            spectrum[1:lines + 1] = n * a * 0.5 * (np.cos(phi) + 1j * np.sin(phi))
            expected = np.fft.irfft(spectrum, n)
            rel = np.max(np.abs(y - expected)) / np.max(np.abs(expected))
            worst = max(worst, rel)
            self.assertLess(rel, 1e-12, n)
            # Every line has amplitude n A / 2; no DC and, for even n, no Nyquist line.
            mag = np.abs(np.fft.fft(y))
            np.testing.assert_allclose(mag[1:lines + 1], n * a / 2, rtol=1e-12)
            self.assertLess(mag[0], 1e-12 * n * a)
            if n % 2 == 0:
                self.assertLess(mag[n // 2], 1e-12 * n * a)
        print("PeriodNoise: worst rel error against irfft %.3g" % worst)


if __name__ == "__main__":
    unittest.main()
