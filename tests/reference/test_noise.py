"""Noise generators: sample-for-sample against a Python rendering of the stated draws (with the
record left behind), then their laws at fixed seeds, and the line spectrum of the periodic noise."""
import ctypes
import math
import os
import sys
import unittest

import numpy as np
from scipy import stats

import twanlys as tw

sys.path.insert(0, os.path.join(os.path.dirname(os.path.abspath(__file__)), "..", "generate"))
import wichmann_hill_reference as wh  # noqa: E402

D, I32, P = ctypes.c_double, ctypes.c_int32, ctypes.c_void_p


class State(ctypes.Structure):
    _fields_ = [("s1", I32), ("s2", I32), ("s3", I32)]


class Spare(ctypes.Structure):
    _pack_ = 4
    _fields_ = [("haveSpare", I32), ("spare", D)]


class Cache(ctypes.Structure):
    _pack_ = 4
    _fields_ = [(f, D) for f in ("p", "q", "lnP", "lnQ", "trialsF", "lnGammaTrials")] + [("trials", I32)]


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


# --- the reference: st is [s1, s2, s3] as Python ints ---------------------------------------

def reseed(st, seed, threshold=0):
    if seed >= threshold and seed != 0:
        st[:] = wh.seed(seed)


def ref_white(st, n, a):
    return [(wh.uniform(st) - 0.5) * (a + a) for _ in range(n)]


def ref_gauss(st, spare, n, sd):
    out = []
    for _ in range(n):
        if spare[0] == 0:
            while True:
                v1 = 2.0 * wh.uniform(st) - 1.0
                v2 = 2.0 * wh.uniform(st) - 1.0
                r = v1 * v1 + v2 * v2
                if r < 1.0 and r != 0.0:
                    break
            f = math.sqrt(-2.0 * math.log(r) / r)
            spare[1] = v1 * f
            sample = v2 * f
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
                t *= wh.uniform(st)
            out.append(-math.log(t))
            continue
        am = float(a - 1)
        s = math.sqrt(2.0 * am + 1.0)
        while True:
            while True:
                v1 = 2.0 * wh.uniform(st) - 1.0
                v2 = 2.0 * wh.uniform(st) - 1.0
                if v1 * v1 + v2 * v2 <= 1.0:
                    break
            y = v2 / v1
            x = s * y + am
            if not x > 0.0:
                continue
            e = (1.0 + y * y) * math.exp(am * math.log(x / am) - s * y)
            if not wh.uniform(st) > e:
                break
        out.append(x)
    return out


def ref_poisson(st, n, m):
    out = []
    if m < 12:
        g = math.exp(-m)
        for _ in range(n):
            count, t = -1, 1.0
            while True:
                count += 1
                t *= wh.uniform(st)
                if not g < t:
                    break
            out.append(float(count))
        return out
    sq, lnm = math.sqrt(2.0 * m), math.log(m)
    g = m * lnm - ln_gamma(m + 1.0)
    for _ in range(n):
        while True:
            while True:
                y = math.tan(math.pi * wh.uniform(st))
                em = sq * y + m
                if not em < 0.0:
                    break
            em = float(math.floor(em))
            t = 0.9 * (1.0 + y * y) * math.exp(em * lnm - ln_gamma(em + 1.0) - g)
            if not wh.uniform(st) > t:
                break
        out.append(em)
    return out


def ref_binomial(st, cache, n, trials, p):
    pp = p if p <= 0.5 else 1.0 - p
    en = float(trials)
    am = en * pp
    out = []
    for _ in range(n):
        if trials < 25:
            count = sum(1 for _ in range(trials) if wh.uniform(st) < pp)
        elif am < 1.0:
            g, t, j = math.exp(-am), 1.0, 0
            while j <= trials:
                t *= wh.uniform(st)
                if t < g:
                    break
                j += 1
            count = min(j, trials)
        else:
            if cache["trials"] != trials:
                cache.update(trialsF=en, lnGammaTrials=ln_gamma(en + 1.0), trials=trials)
            if cache["p"] != pp:
                cache.update(p=pp, q=1.0 - pp, lnP=math.log(pp), lnQ=math.log(1.0 - pp))
            sq = math.sqrt(2.0 * am * cache["q"])
            while True:
                while True:
                    y = math.tan(math.pi * wh.uniform(st))
                    em = sq * y + am
                    if not (em < 0.0 or em >= en + 1.0):
                        break
                em = float(math.floor(em))
                t = 1.2 * sq * (1.0 + y * y) * math.exp(
                    cache["lnGammaTrials"] - ln_gamma(em + 1.0) - ln_gamma(cache["trialsF"] - em + 1.0)
                    + em * cache["lnP"] + (cache["trialsF"] - em) * cache["lnQ"])
                if not wh.uniform(st) > t:
                    break
            count = em
        out.append(int(en - count if pp != p else count))
    return out


# --- calls ----------------------------------------------------------------------------------

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
    """Each case: two calls on one record, the second continuing (seed -1 or 0) or restarting."""

    def check(self, lib_call, ref_call, seeds, start=(11, 22, 33)):
        st, ref = State(*start), list(start)
        for seed in seeds:
            y, s = lib_call(st, seed)
            self.assertEqual(s, 0)
            expected = ref_call(ref, seed)
            np.testing.assert_array_equal(y, np.array(expected, dtype=y.dtype), err_msg="seed %d" % seed)
            self.assertEqual(record(st), ref, "record after seed %d" % seed)

    def test_white(self):
        for n, a, seeds in [(1000, 2.5, [7, -1, 0]), (300, -1.0, [12558384, -5]), (17, 3.0, [2147483647, 4])]:
            def lib_call(st, seed):
                return by_pointer("white", n, a, seed, st)

            def ref_call(ref, seed):
                reseed(ref, seed)
                return ref_white(ref, n, a)

            self.check(lib_call, ref_call, seeds)
        # A record of zeros stays at 0.0: -amplitude everywhere.
        y, _ = by_pointer("white", 5, 1.5, -1, State(0, 0, 0))
        np.testing.assert_array_equal(y, [-1.5] * 5)

    def test_gauss_spare_between_calls(self):
        for seeds_lengths in [[(5, 7), (0, 4), (-3, 1), (9, 3), (0, 2)], [(1, 1), (0, 1), (0, 1)]]:
            st, spare = State(4, 5, 6), Spare(0, 0.0)
            ref, ref_spare = [4, 5, 6], [0, 0.0]
            for seed, n in seeds_lengths:
                sd = 1.0 + n
                y, s = by_pointer("Gauss", n, sd, seed, st, ctypes.byref(spare))
                self.assertEqual(s, 0)
                if seed > 0:
                    reseed(ref, seed)
                    ref_spare[:] = [0, 0.0]
                np.testing.assert_array_equal(y, ref_gauss(ref, ref_spare, n, sd))
                self.assertEqual(record(st), ref)
                self.assertEqual([spare.haveSpare, spare.spare], ref_spare)
        # Length 1 twice: the second call takes the spare and draws nothing.
        st, spare = State(), Spare(0, 0.0)
        a, _ = by_pointer("Gauss", 1, 1.0, 3, st, ctypes.byref(spare))
        before = record(st)
        b, _ = by_pointer("Gauss", 1, 1.0, 0, st, ctypes.byref(spare))
        self.assertEqual(record(st), before)
        pair, _ = by_pointer("Gauss", 2, 1.0, 3, State(), ctypes.byref(Spare(1, 99.0)))
        np.testing.assert_array_equal(np.r_[a, b], pair)

    def test_gamma(self):
        for order, n in [(1, 500), (2, 300), (5, 300), (6, 300), (10, 500), (37, 200)]:
            self.check(lambda st, seed: returned("GammaNoiseH", n, order, seed, ctypes.byref(st)),
                       lambda ref, seed: (reseed(ref, seed), ref_gamma(ref, n, order))[1], [order * 101, -1])

    def test_poisson(self):
        for m, n in [(0.0, 50), (0.7, 300), (11.99, 300), (12.0, 300), (40.0, 500), (1e4, 100)]:
            self.check(lambda st, seed: returned("PoissonNoiseH", n, m, seed, ctypes.byref(st)),
                       lambda ref, seed: (reseed(ref, seed), ref_poisson(ref, n, m))[1], [31, 0])
        # Mean 0: zeros, one draw per sample.
        st = State()
        y, _ = returned("PoissonNoiseH", 40, 0.0, 77, ctypes.byref(st))
        ref = wh.seed(77)
        for _ in range(40):
            wh.uniform(ref)
        np.testing.assert_array_equal(y, np.zeros(40))
        self.assertEqual(record(st), ref)

    def test_binomial_branches_fold_and_cache(self):
        # (trials, p): below 25 with and without the fold, the small-mean branch on both sides,
        # the rejection branch on both sides, p = 1, p = 0 and no trials at all.
        table = [(0, 0.3), (10, 0.3), (24, 0.8), (100, 0.005), (1000, 0.9995), (25, 0.5), (100, 0.3),
                 (100, 0.7), (5000, 0.02), (60, 1.0), (60, 0.0)]
        st, cache = State(), Cache()
        ref, ref_cache = [0, 0, 0], dict(p=0.0, q=0.0, lnP=0.0, lnQ=0.0, trialsF=0.0, lnGammaTrials=0.0, trials=0)
        for i, (trials, p) in enumerate(table):
            for seed in (1000 + i, -1):
                y, s = returned("BinomialNoiseH", 200, trials, p, seed, ctypes.byref(st), ctypes.byref(cache),
                                dtype=np.uint32)
                self.assertEqual(s, 0)
                reseed(ref, seed)
                np.testing.assert_array_equal(y, ref_binomial(ref, ref_cache, 200, trials, p), str((trials, p)))
                self.assertEqual(record(st), ref, (trials, p))
                self.assertEqual({f: getattr(cache, f) for f, _ in Cache._fields_}, ref_cache)
        # p = 1 gives n everywhere; no trials gives zeros without drawing.
        y, _ = returned("BinomialNoiseH", 30, 60, 1.0, 5, ctypes.byref(st), None, dtype=np.uint32)
        np.testing.assert_array_equal(y, np.full(30, 60))
        before = record(st)
        y, _ = returned("BinomialNoiseH", 30, 0, 0.4, -1, ctypes.byref(st), None, dtype=np.uint32)
        np.testing.assert_array_equal(y, np.zeros(30))
        self.assertEqual(record(st), before)


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
                           (1000, 3.0, 8), (1001, 1.0, 9), (4096, 1.0, 10), (48000, 0.25, 11)]:
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
