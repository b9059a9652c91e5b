"""Polynomials against NumPy in both block placements: the power form bit for bit against a NumPy
loop and against polyval, products against np.convolve, all roots against np.roots as multisets,
and the refinements, multiple roots and divisors on polynomials built from known factors."""
import ctypes
import math
import unittest

import numpy as np
from numpy.polynomial import polynomial as npp
from scipy.optimize import linear_sum_assignment

from twanlys import lowlevel as tw

EPS = 2.0**-52
D, P, I32 = ctypes.c_double, ctypes.c_void_p, ctypes.c_int32
L = tw.lib
L.PolyRootsNtBst_head.argtypes = [P, P, I32, D, P, I32, D, P]
for name in ("MultPolyRoots_head", "CxMultPolyRoots_head"):
    getattr(L, name).argtypes = [P, I32, D, P, P, P]
for name in ("PolyGCD_H", "CxPolyGCD_H"):
    getattr(L, name).argtypes = [P, P, D, P, P, P, P]


def placements():
    for aligned in (0, 1):
        tw.placement(aligned)
        yield aligned
    tw.placement(0)


def dtype_of(*arrays):
    return complex if any(np.iscomplexobj(a) for a in arrays) else float


def all_roots(c, limit=0):
    h, opt, st = tw.array(np.asarray(c, complex), complex), tw.i32(limit), tw.i32(1)
    L.CxPolyRoots_head(h, opt.ref, st.ref)
    return st.value, h.numpy()


def mult_roots(c, tol=0.0, limit=0):
    cx = np.iscomplexobj(c)
    roots, mult, res = tw.empty(complex), tw.empty(np.int32), tw.f64()
    st = (L.CxMultPolyRoots_head if cx else L.MultPolyRoots_head)(tw.array(c, dtype_of(c)), limit, tol, roots,
                                                                 res.ref, mult)
    return st, roots.numpy(), mult.numpy(), res.value


def divisor(a, b, tol=0.0):
    dt = dtype_of(a, b)
    g, u, v, res = tw.empty(dt), tw.empty(dt), tw.empty(dt), tw.f64()
    st = (L.CxPolyGCD_H if dt is complex else L.PolyGCD_H)(tw.array(a, dt), tw.array(b, dt), tol, g, u, v, res.ref)
    return st, g.numpy(), u.numpy(), v.numpy(), res.value


def match(got, ref):
    """Pairs two root multisets by least total distance; the worst error relative to max(1, |r|)."""
    got, ref = np.asarray(got), np.asarray(ref)
    assert len(got) == len(ref), (len(got), len(ref))
    i, j = linear_sum_assignment(np.abs(got[:, None] - ref[None, :]))
    return np.max(np.abs(got[i] - ref[j]) / np.maximum(1, np.abs(ref[j])))


def power_form(c, x):
    y, p = np.full_like(x, c[0]), np.ones_like(x)
    for ci in c[1:]:
        p = p * x
        y = y + ci * p
    return y


def bessel_search(n):
    """E^2 + O^2 - 2 with E, O the real and imaginary parts of the normalised Bessel polynomial at j w."""
    a = np.array([math.factorial(2 * n - k) / (2**(n - k) * math.factorial(k) * math.factorial(n - k))
                  for k in range(n + 1)])
    a /= a[0]
    e = np.array([a[k] * (-1)**(k // 2) if k % 2 == 0 else 0 for k in range(n + 1)])
    o = np.array([a[k] * (-1)**(k // 2) if k % 2 == 1 else 0 for k in range(n + 1)])
    q = np.convolve(e, e) + np.convolve(o, o)
    q[0] -= 2
    return q


class Evaluation(unittest.TestCase):
    def test_power_form_exact_and_near_polyval(self):
        rng = np.random.default_rng(12)
        x = np.concatenate([rng.uniform(-3, 3, 300), [0.0, -0.0, 1.0, -1.0]])
        for _, deg in ((p, d) for p in placements() for d in (0, 1, 4, 10, 25)):
            c = rng.normal(size=deg + 1)
            for two_d in (False, True):
                h = tw.matrix(x.reshape(8, -1)) if two_d else tw.array(x)
                st = tw.i32(1)
                (L.EvPoly2D if two_d else L.PolyEv)(h, tw.array(c), st.ref)
                self.assertEqual(st.value, 0)
                y = h.numpy().ravel()
                np.testing.assert_array_equal(y, power_form(c, x))
                bound = 2 * max(deg, 1) * EPS * npp.polyval(np.abs(x), np.abs(c))
                self.assertTrue(np.all(np.abs(y - npp.polyval(x, c)) <= bound))

    def test_constant_and_empty(self):
        h, st = tw.array([np.nan, np.inf, 2.0]), tw.i32(1)
        L.PolyEv(h, tw.array([-4.5]), st.ref)
        np.testing.assert_array_equal(h.numpy(), [-4.5] * 3)
        h = tw.array([1.0, 2.0])
        L.PolyEv(h, tw.empty(), st.ref)
        self.assertEqual((st.value, len(h.numpy())), (-20003, 0))


class Products(unittest.TestCase):
    def test_against_convolve(self):
        rng = np.random.default_rng(7)
        for _, (na, nb), cx in ((p, s, cx) for p in placements()
                                for s in ((1, 1), (1, 9), (9, 1), (5, 5), (17, 300), (1000, 1000)) for cx in (0, 1)):
            a, b = rng.normal(size=na), rng.normal(size=nb)
            if cx:
                a, b = a + 1j * rng.normal(size=na), b + 1j * rng.normal(size=nb)
            out = tw.empty(complex)
            st = (L.CxMultiplyPolyH if cx else L.MultiplyPolyH)(tw.array(a, a.dtype), tw.array(b, b.dtype), out)
            self.assertEqual(st, 0)
            got = out.numpy(complex if cx else float)
            self.assertEqual(len(got), na + nb - 1)
            bound = (4 if cx else 2) * min(na, nb) * EPS * np.convolve(np.abs(a), np.abs(b))
            self.assertTrue(np.all(np.abs(got - np.convolve(a, b)) <= bound))


class Refinement(unittest.TestCase):
    def refine(self, c, real, cx, n_iter=100, tol=1e-14):
        out = tw.empty(complex)
        st = L.PolyRootsNtBst_head(tw.array(c), tw.array(real), n_iter, tol, tw.array(cx, complex), n_iter, tol, out)
        return st, out.numpy()

    def test_newton_and_bairstow(self):
        c = npp.polyfromroots([1, -2, 3, -1 + 2j, -1 - 2j]).real
        st, r = self.refine(c, [2.6, 0.93, -2.2], [-0.99 + 1.99j, -0.99 - 1.99j])
        self.assertEqual(st, 0)
        np.testing.assert_allclose(r, [3, 1, -2, -1 - 2j, -1 + 2j], rtol=0, atol=1e-10)
        self.assertLess(r[3].imag, 0)
        cases = [  # coefficients, start, tolerance, expected, allowed error
            (c, 1.0, 1e-14, 1.0, 0),            # on a root: returned as it is
            ([-4.0, 0, 1], 0.0, 1e-14, -2.0, 1e-12),  # f' = 0: the first step is 1.0
            ([1.0, -2, 1], 3.0, 1e-15, 1.0, 1e-7),    # double root: stops by the stall rule
        ]
        for coef, start, tol, want, err in cases:
            st, r = self.refine(coef, [start], [], tol=tol)
            self.assertEqual(st, 0)
            self.assertLessEqual(abs(r[0] - want), err, (coef, start))

    def test_bairstow_real_pair_and_short_polynomials(self):
        c = npp.polyfromroots([0.5, 4, -3, 2]).real
        st, r = self.refine(c, [], [1.97, 4.1, -2.97, 0.49])  # both factors real
        np.testing.assert_allclose(r[:2], [4, 2], atol=1e-10)
        np.testing.assert_allclose(sorted(r[2:].real), [-3, 0.5], atol=1e-10)
        self.assertEqual(r.imag.tolist(), [0, 0, 0, 0])
        st, r = self.refine(c, [], [1 + 2j, 1 - 2j, 1.97, 4.1])  # a real factor is stored before a complex one
        np.testing.assert_allclose(r[:2], [4, 2], atol=1e-10)
        starts = [0.1 + 2j, 0.1 - 2j]
        for short in ([1.0, 0, 1], [1.0, 0, 1, 0, 0]):  # zero high coefficients do not count
            st, r = self.refine(short, [], starts)
            self.assertEqual((st, r.tolist()), (0, starts))
        st, r = self.refine([], [1.0], starts)
        self.assertEqual((st, len(r)), (20002, 0))


class AllRoots(unittest.TestCase):
    def test_against_np_roots(self):
        rng = np.random.default_rng(21)
        for _, deg, cx, low, high in ((p, d, cx, lo, hi) for p in placements() for d in (3, 4, 7, 12, 20, 35, 50)
                                      for cx in (0, 1) for lo, hi in ((0, 0), (2, 1))):
            c = rng.normal(size=deg + 1) + (1j * rng.normal(size=deg + 1) if cx else 0)
            full = np.concatenate([np.zeros(low), c, np.zeros(high)])
            st, r = all_roots(full)
            self.assertEqual(st, 0)
            self.assertEqual(r[:low].tolist(), [0] * low)
            self.assertLess(match(r[low:], np.roots(c[::-1])), 1e-10, (deg, cx))
            if not cx:
                self.assertEqual(np.sum(np.abs(r.imag) < 1e-8) - low, np.sum(np.abs(np.roots(c[::-1]).imag) < 1e-8))

    def test_wide_coefficient_ranges(self):
        # Known roots far apart in magnitude (np.roots loses them all here): each within 1e-13.
        for rts in ([7e-120 + 1e-120j, 7e-120 - 1e-120j, 3, -5], [1e-100, 2e-100, 1e100, -3e100], [1e-150, -2, 5e149],
                    [1e-30, 2e-30, 1, 1e30, 3e30]):
            want = np.array(rts, complex)
            st, r = all_roots(npp.polyfromroots(want).real * 1e-10)
            self.assertEqual(st, 0)
            self.assertLess(max(np.abs(r - w).min() / abs(w) for w in want), 1e-13, rts)

    def test_bessel_search_polynomials(self):
        for n in range(1, 26):
            q = bessel_search(n)
            st, r = all_roots(q)
            ref = np.roots(q[::-1])
            real = r[np.abs(r.imag) < 1e-8].real
            self.assertEqual((st, len(real)), (0, 2), n)
            top = ref[np.abs(ref.imag) < 1e-8].real.max()
            self.assertLessEqual(abs(real.max() - top), 1e-12 * top, n)

    def test_limit_and_statuses(self):
        c = np.random.default_rng(3).normal(size=30)
        st, r = all_roots(c, limit=1)  # past the limit the best iterate stands
        self.assertEqual((st, len(r)), (0, 29))
        for bad in ([3.0], [0.0, 0, 0], [1.0, np.nan, 2], []):
            self.assertEqual(all_roots(bad)[0], -20063, bad)


def structure(roots, mult):
    return sorted(zip(np.round(roots.real, 4), np.round(roots.imag, 4), mult.tolist()))


class MultipleRoots(unittest.TestCase):
    CASES = [  # distinct roots, multiplicities, complex coefficients
        ([1], [3], 0), ([0], [2], 0), ([1, -2], [2, 1], 0), ([1j, -1j, 3], [2, 2, 1], 1),
        ([1, -1], [2, 2], 0), ([0, 3], [2, 1], 0), ([1j, -2], [2, 1], 1),
        ([1 + 2j, 1 - 2j, -0.5 + 1j, -0.5 - 1j], [1, 1, 1, 1], 0), ([2 + 1j, 2 - 1j, -1], [2, 2, 1], 0),
        ([0.5, -1.5, 2j, -2j, 4], [3, 2, 1, 1, 1], 0),
    ]

    def test_structures(self):
        rng = np.random.default_rng(4)
        for _, (zs, ms, cx), noise in ((p, case, nz) for p in placements() for case in self.CASES for nz in (0, 1e-12)):
            c = npp.polyfromroots(np.repeat(np.array(zs, complex), ms)) * 3.0
            c = c if cx else c.real
            if noise:
                c = c + noise * np.abs(c) * rng.uniform(-1, 1, len(c))
            st, r, m, res = mult_roots(c)
            self.assertEqual(st, 0)
            self.assertEqual(structure(r, m), structure(np.array(zs, complex), np.array(ms)), (zs, noise))
            self.assertLess(match(np.repeat(r, m), np.repeat(np.array(zs, complex), ms)), 1e-6)
            self.assertLess(res, 1e-6)
            np.testing.assert_allclose(res, np.linalg.norm(c - c[-1] * npp.polyfromroots(np.repeat(r, m)))
                                       / np.linalg.norm(c), rtol=1e-6, atol=1e-15)
            if not cx:
                for i in np.nonzero(r.imag > 0)[0]:
                    self.assertEqual(r[i + 1], np.conj(r[i]))
                self.assertTrue(np.all((r.imag >= 0) | (np.roll(r.imag, 1) > 0)))

    def test_clustered_roots_keep_a_small_residual(self):
        # Doubles among close simple roots: whatever structure is found must reproduce the polynomial.
        rng = np.random.default_rng(0)
        for deg in (10, 20, 30):
            doubles = rng.uniform(-2, 2, deg // 3)
            roots = np.concatenate([np.repeat(doubles, 2), rng.uniform(-2, 2, deg - 2 * len(doubles))])
            c = npp.polyfromroots(roots)
            st, r, m, res = mult_roots(c)
            self.assertEqual((st, m.sum()), (0, deg))
            own = np.linalg.norm(c - c[-1] * npp.polyfromroots(np.repeat(r, m))) / np.linalg.norm(c)
            self.assertLess(max(res, own), 1e-10, deg)

    def test_statuses(self):
        for c, want in (([], -20003), ([1.0, np.inf], -20063), ([0.0, 0], -20111), ([5.0, 0], -20021)):
            st, r, m, res = mult_roots(np.array(c))
            self.assertEqual((st, len(r), len(m), math.isnan(res)), (want, 0, 0, True), c)


class Divisor(unittest.TestCase):
    def check(self, a, b, want):
        st, g, u, v, res = divisor(a, b)
        self.assertEqual(st, 0)
        np.testing.assert_allclose(g, want, atol=1e-10)
        np.testing.assert_allclose(np.convolve(g, u), a, atol=1e-10 * np.abs(a).max())
        np.testing.assert_allclose(np.convolve(g, v), b, atol=1e-10 * np.abs(b).max())
        self.assertLess(res, 1e-10)

    def test_known_factors(self):
        f = npp.polyfromroots
        for _ in placements():
            self.check(f([1, -2, 3]), f([1, -2, -5]), [-2, 1, 1])
            self.check(2 * f([1, -2, -5, 0.25]), -3 * f([1, -2, 3]), [-2, 1, 1])  # longer operand first
            self.check(f([2, 3]), f([1, -5]), [1])
            self.check(f([0, 0, 1]), f([0, -1]), [0, 1])
            self.check(f([1 + 2j, 2 - 1j]), f([1 + 2j, -3j]), [-(1 + 2j), 1])
            self.check(f([0.5, 0.5, -1, 7]), f([0.5, 0.5, 2]), f([0.5, 0.5]))

    def test_statuses(self):
        for a, b, want in (([], [1.0], -20003), ([1.0, np.nan], [1.0], -20068)):
            st, g, u, v, res = divisor(np.array(a), np.array(b))
            self.assertEqual((st, len(g) + len(u) + len(v), math.isnan(res)), (want, 0, True))


if __name__ == "__main__":
    unittest.main()
