"""Distribution functions and their inverses against scipy.special / scipy.stats.

The normal pair are deliberate short approximations: absolute errors below 1.2e-5 and 4.5e-4. The
t, F and chi-square functions rest on the incomplete beta and gamma functions, whose logarithmic
prefactor sets their error (the tolerance models come from the gamma-family test). The inverses
are bisections: the result is the lower end of a bracket at most 1e-4 wide that holds the
quantile, which is checked through SciPy's distribution functions rather than its quantiles
(stats.t.ppf is itself off by 1e-9 relative in the far tails).
"""
import ctypes
import unittest

import numpy as np
import scipy.special as sc
import scipy.stats as st

from twanlys import lowlevel as tw
from test_special_gamma import EPS, incbeta_tolerance, incgamma_tolerance, print_report

D, I32 = ctypes.c_double, ctypes.c_int32
WIDTH = 1e-4
REPORT = {}


def export(name, nargs):
    """A vectorised caller of an export whose nargs leading arguments are scalars by pointer."""
    fn = getattr(tw.lib, name)

    def call(*args):
        cells = [D(a) if isinstance(a, float) else I32(a) for a in args[:nargs]]
        out, status = D(), I32(-1)
        fn(*[ctypes.byref(c) for c in cells], ctypes.byref(out), ctypes.byref(status))
        return out.value, status.value

    def vectorised(*args):
        args = np.broadcast_arrays(*[np.asarray(a) for a in args])
        res = [call(*(a.item() for a in row)) for row in zip(*(a.ravel() for a in args))]
        values = np.array([r[0] for r in res]).reshape(args[0].shape)
        statuses = np.array([r[1] for r in res]).reshape(args[0].shape)
        return values, statuses

    return vectorised


norm_cdf_fn = tw.lib.NormDist_head
inv_norm = export("InvNdist_head", 1)
t_cdf, inv_t = export("TDist_head", 2), export("InvTdist_head", 2)
f_cdf, inv_f = export("FDist_head", 3), export("InvFDist_head", 3)
chi_cdf, inv_chi = export("ChiSquare_head", 2), export("InvChiSquare_head", 2)

RNG = np.random.default_rng(7)


def beta_tolerance(a, b, z):
    """Error of I_z(a, b) as the library forms it, plus its spread when z moves by two ulp."""
    i_ref = sc.betainc(a, b, z)
    up = np.minimum(np.nextafter(np.nextafter(z, 2), 2), 1)
    down = np.maximum(np.nextafter(np.nextafter(z, -1), -1), 0)
    spread = np.abs(sc.betainc(a, b, up) - sc.betainc(a, b, down))
    inner = (z > 0) & (z < 1)
    with np.errstate(all="ignore"):
        own = np.where(inner, incbeta_tolerance(a, b, np.where(inner, z, 0.5), i_ref), 0)
    return own + spread


def t_tolerance(t, df):
    # z = df / (t^2 + df) carries its own rounding; near t = 0 that dominates: 1 - z loses all
    # digits once t^2 is below eps * df.
    v = np.abs(t)
    return 0.5 * beta_tolerance(0.5 * df, 0.5, df / (v * v + df)) + EPS


def f_tolerance(f, d1, d2):
    return beta_tolerance(0.5 * d2, 0.5 * d1, d2 / (d1 * f + d2)) + EPS


def chi_tolerance(x, df):
    a, h = 0.5 * df, 0.5 * x
    return incgamma_tolerance(a, h, sc.gammainc(a, h)) + EPS


def note(name, value):
    REPORT[name] = max(REPORT.get(name, 0.0), float(value))


class Normal(unittest.TestCase):
    def test_cdf_within_the_approximation_error(self):
        x = np.concatenate([np.linspace(-12, 12, 24001), RNG.standard_normal(4000)])
        out = D()
        lib = np.array([(norm_cdf_fn(ctypes.byref(D(v)), ctypes.byref(out)), out.value)[1] for v in x])
        err = np.abs(lib - sc.ndtr(x))
        note("NormDist_head max abs error", err.max())
        self.assertLess(err.max(), 1.2e-5)

    def test_inverse_within_the_approximation_error(self):
        p = np.concatenate([np.linspace(0, 1, 20001)[1:-1], 10.0 ** RNG.uniform(-300, 0, 3000)])
        p = np.concatenate([p, 1 - p[p < 0.5]])
        p = p[p < 1]
        lib, status = inv_norm(p)
        self.assertTrue(np.all(status == 0))
        err = np.abs(lib - sc.ndtri(p))
        note("InvNdist_head max abs error", err.max())
        self.assertLess(err.max(), 4.5e-4)


class ForwardFunctions(unittest.TestCase):
    def check(self, name, lib, status, ref, tol):
        self.assertTrue(np.all(status == 0), name)
        bad = ~(np.abs(lib - ref) <= tol)
        self.assertFalse(bad.any(), (name, np.flatnonzero(bad)[:5]))
        note(name + " max abs error", np.max(np.abs(lib - ref)))

    def test_student_t(self):
        # Beyond about 2e5 degrees the fraction in x breaks down in double precision (its first
        # denominator cancels to about 1/df) and the library's t CDF is wrong in the third digit.
        for df in list(range(1, 41)) + [50, 75, 100, 200, 500, 1000, 10**4, 10**5]:
            t = np.concatenate([RNG.uniform(-12, 12, 300), RNG.standard_normal(300) * 3,
                                10.0 ** RNG.uniform(-12, 4, 100) * RNG.choice([-1, 1], 100)])
            lib, status = t_cdf(t, df)
            self.check("TDist_head", lib, status, sc.stdtr(df, t), t_tolerance(t, df))

    def test_fisher(self):
        for d1 in [1, 2, 3, 5, 10, 30, 100, 1000]:
            for d2 in [1, 2, 4, 7, 20, 60, 300, 1000]:
                f = np.exp(RNG.uniform(-8, 8, 150))
                lib, status = f_cdf(f, d1, d2)
                # fdtr loses up to 4e-13 in the upper tail (checked at high precision); its
                # complement is the well-conditioned side there.
                lower = sc.fdtr(d1, d2, f)
                ref = np.where(lower > 0.5, 1 - sc.fdtrc(d1, d2, f), lower)
                self.check("FDist_head", lib, status, ref, f_tolerance(f, d1, d2))

    def test_chi_square(self):
        for df in [1, 2, 3, 4, 5, 7, 10, 20, 50, 100, 300, 1000, 5000, 20000]:
            x = df * np.exp(RNG.uniform(-5, 2.5, 300))
            lib, status = chi_cdf(x, df)
            self.check("ChiSquare_head", lib, status, sc.chdtr(df, x), chi_tolerance(x, df))


class Inverses(unittest.TestCase):
    """The result lo is the lower end of the final bracket: the quantile lies in [lo, lo + 1e-4],
    up to the library's own CDF error, unless the fixed bracket held no quantile."""

    def probabilities(self):
        return np.concatenate([RNG.uniform(0, 1, 150), 10.0 ** RNG.uniform(-10, 0, 50),
                               1 - 10.0 ** RNG.uniform(-10, 0, 50), [0.5]])

    def check_bracket(self, name, p, lo, cdf, tol, bottom, top):
        moved = lo > bottom
        self.assertTrue(np.all(cdf(lo[moved]) - tol(lo[moved]) < p[moved]), name)
        open_top = lo + WIDTH < top
        hi = lo[open_top] + WIDTH
        self.assertTrue(np.all(cdf(hi) + tol(hi) >= p[open_top]), name)
        # Where the bracket's top was never reached it still bounds the result.
        self.assertTrue(np.all(lo[~open_top] <= top), name)

    def ppf_distance(self, name, lo, q, bottom, top):
        inside = (q > bottom) & (q < top)
        note(name + " max q_ref - q_lib", np.max(q[inside] - lo[inside]))

    def test_student_t(self):
        for df in [1, 2, 3, 5, 10, 30, 100, 1000, 100000]:
            p = self.probabilities()
            lo, status = inv_t(p, df)
            self.assertTrue(np.all(status == 0))
            self.check_bracket("t", p, lo, lambda x: sc.stdtr(df, x), lambda x: t_tolerance(x, df),
                               -10000.0, 10000.0)
            self.ppf_distance("InvTdist_head", lo, st.t.ppf(p, df), -1e4, 1e4)

    def test_student_t_beyond_the_bracket_ends_at_its_top(self):
        lo, _ = inv_t(np.array([1 - 1e-12, 1e-12]), 1)
        self.assertTrue(10000 - WIDTH <= lo[0] < 10000)
        self.assertEqual(lo[1], -10000.0)

    def test_fisher(self):
        for d1, d2 in [(1, 1), (1, 10), (2, 7), (5, 2), (10, 30), (30, 10), (100, 3), (3, 100)]:
            p = self.probabilities()
            lo, status = inv_f(p, d1, d2)
            self.assertTrue(np.all(status == 0))
            self.check_bracket("F", p, lo, lambda x: sc.fdtr(d1, d2, x),
                               lambda x: f_tolerance(x, d1, d2), 1e-6, 10000.0)
            self.ppf_distance("InvFDist_head", lo, st.f.ppf(p, d1, d2), 1e-6, 1e4)

    def test_chi_square(self):
        for df in [1, 2, 3, 5, 10, 30, 200, 5000, 100000]:
            p = self.probabilities()
            lo, status = inv_chi(p, df)
            self.assertTrue(np.all(status == 0))
            self.check_bracket("chi-square", p, lo, lambda x: sc.chdtr(df, x),
                               lambda x: chi_tolerance(x, df), 0.0, np.inf)
            self.ppf_distance("InvChiSquare_head", lo, st.chi2.ppf(p, df), 0, np.inf)

    def test_chi_square_with_a_million_degrees_terminates(self):
        lo, status = inv_chi(np.array([0.5, 0.99]), 10**6)
        self.assertTrue(np.all(status == 0))
        q = st.chi2.ppf([0.5, 0.99], 10**6)
        self.assertTrue(np.all((q - lo >= -1e-6) & (q - lo <= WIDTH + 1e-6)), (q, lo))


def tearDownModule():
    print_report("distributions against scipy.special and scipy.stats", REPORT)


if __name__ == "__main__":
    unittest.main()
