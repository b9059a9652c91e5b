"""Eigenproblems against NumPy/SciPy: symmetric, Hermitian and general eigenvalues and vectors,
Schur forms with their orders, QZ, back-transformation after balancing, companion matrices."""
import unittest

import numpy as np
import scipy.linalg as sl
from scipy.linalg import lapack

from twanlys import lowlevel as tw
from matrix_common import C128, EPS, rnd, unitary_err

SIZES = [1, 2, 3, 4, 7, 12, 25, 40]


def match_err(got, want):
    """Largest distance after pairing each wanted value with the nearest unused one of got."""
    got = list(np.asarray(got, dtype=C128))
    worst = 0.0
    for w in np.asarray(want, dtype=C128):
        k = int(np.argmin([abs(g - w) for g in got]))
        worst = max(worst, abs(got.pop(k) - w))
    return worst


def special(n, kind, cx):
    """Graded (1e-4 .. 1e4 similarity), permutable (isolated values) and cyclic matrices."""
    rng = np.random.default_rng(n)
    if kind == "graded":
        d = 10.0 ** np.linspace(-4, 4, n)
        return d[:, None] * rnd(rng, (n, n), cx) / d[None, :]
    if kind == "permutable":
        p = rng.permutation(n)
        t = np.triu(rnd(rng, (n, n), cx))
        t[n // 2:, n // 2:] = rnd(rng, (n - n // 2, n - n // 2), cx)
        return t[p][:, p]
    return np.roll(np.eye(n), 1, axis=1).astype(C128 if cx else float)


def general(a, cx, output=1):
    n = a.shape[0]
    if cx:
        h, herm, o, v, st = tw.matrix(a, C128), tw.i32(0), tw.i32(output), tw.empty(C128), tw.i32(-1)
        tw.lib.CxEigenValueVector_head(h, herm.ref, o.ref, v, st.ref)
        return st.value, v.numpy(), h.numpy()
    h, o, v, z, st = tw.matrix(a), tw.i32(output), tw.empty(C128), tw.empty(C128, 2), tw.i32(-1)
    tw.lib.EigenValueVector_head(h, o.ref, v, z, st.ref)
    return st.value, v.numpy(), z.numpy()


def schur(a, cx, order, want_q=1):
    dt = C128 if cx else float
    h, q, v = tw.matrix(a, dt), tw.empty(dt, 2), tw.empty(C128)
    rc = (tw.lib.CxSchur80_head if cx else tw.lib.Schur80_head)(h, want_q, order, q, v)
    return rc, h.numpy(), q.numpy(), v.numpy()


def keys(w, order):
    return w.real if order in (1, 2) else np.abs(w)


def monotone(k, order, tol=0.0):
    d = np.diff(k) * (1 if order in (1, 3) else -1)
    return bool(np.all(d >= -tol * np.abs(k).max(initial=0)))


def pairs_from_real_storage(v, alpha):
    """Complex columns from LAPACK's real storage of pairs."""
    out = v.astype(C128)
    j = 0
    while j < len(alpha):
        if alpha[j].imag != 0:
            out[:, j] = v[:, j] + 1j * v[:, j + 1]
            out[:, j + 1] = v[:, j] - 1j * v[:, j + 1]
            j += 1
        j += 1
    return out


class Symmetric(unittest.TestCase):
    def test_values_vectors_and_lower_triangle(self):
        rng = np.random.default_rng(5)
        for cx in (False, True):
            for n in SIZES:
                b = rnd(rng, (n, n), cx)
                a = b + b.conj().T
                norm = np.linalg.norm(a, 2)
                want = np.linalg.eigvalsh(a)
                garbage = a.copy()
                garbage[np.triu_indices(n, 1)] = np.nan  # never read
                for output in (1, 0):
                    st, o = tw.i32(-1), tw.i32(output)
                    if cx:
                        h, v, herm = tw.matrix(garbage, C128), tw.empty(C128), tw.i32(1)
                        tw.lib.CxEigenValueVector_head(h, herm.ref, o.ref, v, st.ref)
                    else:
                        h, v = tw.matrix(garbage), tw.empty()
                        tw.lib.SymEvectorEvalue_head(h, o.ref, v, st.ref)
                    self.assertEqual(st.value, 0)
                    w, vec = v.numpy(), h.numpy()
                    if cx:
                        np.testing.assert_array_equal(w.imag, 0)
                        w = w.real
                    self.assertTrue(np.all(np.diff(w) >= 0))
                    self.assertLess(np.abs(w - want).max(), 16 * n * EPS * norm, (cx, n))
                    if output == 0:
                        self.assertEqual(vec.size, 0)
                        continue
                    self.assertLess(np.abs(a @ vec - vec * w).max(), 16 * n * EPS * norm, (cx, n))
                    self.assertLess(unitary_err(vec), 1e-13 * n)


class General(unittest.TestCase):
    def check(self, a, cx, label):
        n = a.shape[0]
        st, w, v = general(a, cx)
        self.assertEqual(st, 0, label)
        norm = max(np.linalg.norm(a, 2), 1e-300)
        self.assertLess(match_err(w, np.linalg.eigvals(a)), 1e-10 * norm, label)
        col = np.linalg.norm(v, axis=0)
        self.assertLess(np.abs(col - 1).max(), 1e-14 * n, label)
        res = np.linalg.norm(a @ v - v * w, axis=0) / ((norm + np.abs(w)) * col)
        self.assertLess(res.max(), 1e-11, label)
        st0, w0, v0 = general(a, cx, output=0)
        self.assertEqual((st0, v0.size), (0, 0), label)
        self.assertLess(match_err(w0, w), 1e-10 * norm, label)
        if not cx:
            # Pairs adjacent, positive imaginary part first, exact conjugates in values and vectors.
            j = 0
            while j < n:
                if w[j].imag != 0:
                    self.assertGreater(w[j].imag, 0, label)
                    self.assertEqual(w[j + 1], np.conj(w[j]), label)
                    np.testing.assert_array_equal(v[:, j + 1], np.conj(v[:, j]))
                    j += 1
                j += 1

    def test_random(self):
        rng = np.random.default_rng(7)
        for cx in (False, True):
            for n in SIZES:
                self.check(rnd(rng, (n, n), cx), cx, (cx, n))

    def test_graded_permutable_cyclic(self):
        for cx in (False, True):
            for kind in ("graded", "permutable", "cyclic"):
                for n in (5, 12, 30):
                    self.check(special(n, kind, cx), cx, (cx, kind, n))

    def test_one_by_one(self):
        st, w, v = general(np.array([[-3.5]]), False)
        self.assertEqual((st, w[0], v[0, 0]), (0, -3.5, 1))


class Schur(unittest.TestCase):
    def test_forms_and_orders(self):
        rng = np.random.default_rng(11)
        for cx in (False, True):
            for n in (1, 2, 5, 16, 40):
                a = rnd(rng, (n, n), cx)
                ref = sl.eigvals(a)
                for order in range(5):
                    rc, t, q, w = schur(a, cx, order)
                    label = (cx, n, order)
                    self.assertEqual(rc, 0, label)
                    self.assertLess(np.abs(q @ t @ q.conj().T - a).max(), 1e-13 * n * max(1, np.abs(a).max()), label)
                    self.assertLess(unitary_err(q), 1e-13 * n, label)
                    np.testing.assert_array_equal(np.tril(t, -1 if cx else -2), 0)
                    self.assertLess(match_err(w, ref), 1e-10 * np.linalg.norm(a, 2), label)
                    zero = np.diag(t, -1) == 0
                    lone = np.append(zero, True) & np.append(True, zero)
                    np.testing.assert_array_equal(w[lone], np.diag(t)[lone].astype(C128))
                    if order:
                        self.assertTrue(monotone(keys(w, order), order), label)
                # The plain form equals the unordered one, and Q may be left out.
                h, q, v = tw.matrix(a, C128 if cx else float), tw.matrix(np.ones((2, 2))), tw.empty(C128)
                rc = (tw.lib.CxSchur_head if cx else tw.lib.Schur_head)(h, 0, q, v)
                self.assertEqual((rc, q.shape()), (0, (0, 0)))
                np.testing.assert_array_equal(h.numpy(), schur(a, cx, 0)[1])

    def test_negligible_pairs_split(self):
        cases = [np.array([[1, 1], [-1e-32, 1]]), np.array([[1, -1e-32], [1, 1]]),
                 np.array([[1, 1, 0.5], [-1e-31, 1, 0.3], [0, 0, 2]])]
        for a in cases:
            for order in (1, 4):
                rc, t, q, w = schur(a, False, order)
                self.assertEqual(rc, 0)
                np.testing.assert_array_equal(np.tril(t, -1), 0)
                np.testing.assert_array_equal(w.imag, 0)
                self.assertLess(np.abs(q @ t @ q.T - a).max(), 1e-15)
                self.assertTrue(monotone(keys(w, order), order))

    def test_two_first_in_descending_order(self):
        rc, t, q, w = schur(np.array([[1.0, 3.0], [0.0, 2.0]]), False, 2)
        self.assertEqual(rc, 0)
        np.testing.assert_array_equal(w, [2, 1])


class QZ(unittest.TestCase):
    def qz80(self, a, b, cx, mode, order):
        dt = C128 if cx else float
        A, B, al, be, v = tw.matrix(a, dt), tw.matrix(b, dt), tw.empty(C128), tw.empty(dt), tw.empty(C128, 2)
        rc = (tw.lib.CxQZ80_head if cx else tw.lib.QZ80_head)(A, B, mode, order, al, be, v)
        return rc, A.numpy(), B.numpy(), al.numpy(), be.numpy(), v.numpy()

    def test_qz80_against_scipy(self):
        rng = np.random.default_rng(13)
        for cx in (False, True):
            for n in (1, 2, 6, 20):
                a, b = rnd(rng, (n, n), cx), rnd(rng, (n, n), cx)
                ref = sl.eig(a, b, right=False)
                scale = np.linalg.norm(a, 2) + np.linalg.norm(b, 2)
                for mode, order in ((0, 0), (1, 0), (1, 1), (1, 4)):
                    label = (cx, n, mode, order)
                    rc, q, z, alpha, beta, v = self.qz80(a, b, cx, mode, order)
                    self.assertEqual(rc, 0, label)
                    lam = alpha / beta
                    self.assertLess(match_err(lam, ref), 1e-10 * max(1, np.abs(ref).max()), label)
                    s, t = q.conj().T @ a @ z, q.conj().T @ b @ z
                    self.assertLess(np.abs(np.tril(t, -1)).max(initial=0), 1e-13 * n * scale, label)
                    below = -2 if (mode == 0 or not cx) else -1
                    self.assertLess(np.abs(np.tril(s, below)).max(initial=0), 1e-13 * n * scale, label)
                    self.assertLess(max(unitary_err(q), unitary_err(z)), 1e-13 * n, label)
                    res = np.abs(a @ v * beta - b @ v * alpha).max()
                    self.assertLess(res, 1e-12 * n * scale * np.abs(v).max(), label)
                    if order:
                        k = (alpha.real if order < 3 else np.abs(alpha)) / beta.real
                        # The two members of a pair have real parts equal up to rounding.
                        self.assertTrue(monotone(k, order, 1e-13), label)
                # QZ_head is mode 0, order 0.
                dt = C128 if cx else float
                A, B, al, be, vv = tw.matrix(a, dt), tw.matrix(b, dt), tw.empty(C128), tw.empty(dt), tw.empty(C128, 2)
                self.assertEqual((tw.lib.CxQZ_head if cx else tw.lib.QZ_head)(A, B, al, be, vv), 0)
                np.testing.assert_array_equal(al.numpy(), self.qz80(a, b, cx, 0, 0)[3])

    def test_tmi_forms_and_vectors(self):
        rng = np.random.default_rng(17)
        for cx in (False, True):
            dt = C128 if cx else float
            n = 7
            a, b = rnd(rng, (n, n), cx), rnd(rng, (n, n), cx)
            for which in range(4):
                outs = [tw.matrix(a, dt), tw.matrix(b, dt)] + [tw.empty(dt, 2) for _ in range(2)]
                al, be, r, l = tw.empty(C128), tw.empty(dt), tw.empty(dt, 2), tw.empty(dt, 2)
                rc = (tw.lib.CxTmiQZ_head if cx else tw.lib.TmiQZ_head)(*outs, al, be, which, r, l)
                self.assertEqual(rc, 0)
                s, t, q, z = (o.numpy() for o in outs)
                q = q.conj()  # Q as LAPACK holds it, read row-major: Q^T, so S = conj(q) A z
                alpha, beta = al.numpy(), be.numpy()
                self.assertLess(np.abs(q @ a @ z - s).max(), 1e-13 * n * 4)
                self.assertLess(np.abs(q @ b @ z - t).max(), 1e-13 * n * 4)
                np.testing.assert_array_equal(np.tril(t, -1), 0)
                self.assertEqual(r.shape(), (n, n) if which in (1, 3) else (0, 0))
                self.assertEqual(l.shape(), (n, n) if which in (2, 3) else (0, 0))
                if which in (1, 3):
                    x = r.numpy() if cx else pairs_from_real_storage(r.numpy(), alpha)
                    self.assertLess(np.abs(a @ x * beta - b @ x * alpha).max(), 1e-12 * n * 4)
                if which in (2, 3):
                    y = l.numpy() if cx else pairs_from_real_storage(l.numpy(), alpha)
                    yh = y.conj().T
                    res = beta[:, None] * (yh @ a) - alpha[:, None] * (yh @ b)
                    self.assertLess(np.abs(res).max(), 1e-12 * n * 4)

    def test_singular_pencils(self):
        # A = B = 0: the order is abandoned with a warning and the outputs stand.
        for cx in (False, True):
            rc, q, z, alpha, beta, v = self.qz80(np.zeros((3, 3)), np.zeros((3, 3)), cx, 1, 1)
            self.assertEqual((rc, len(alpha), q.shape), (20005, 3, (3, 3)))
        # B singular: one infinite value, imaginary parts 0, A and B untouched.
        a, b = np.array([[1.0, 2.0], [0.0, 3.0]]), np.array([[1.0, 0.0], [0.0, 0.0]])
        for cx in (False, True):
            dt = C128 if cx else float
            A, B, v, x = tw.matrix(a, dt), tw.matrix(b, dt), tw.empty(C128), tw.empty(C128, 2)
            rc = (tw.lib.CxGenEigenEx_head if cx else tw.lib.GenEigenEx_head)(A, B, 1, v, x)
            w = v.numpy()
            self.assertEqual(rc, 0)
            np.testing.assert_array_equal(w.imag, 0)
            self.assertEqual(sorted(w.real.tolist()), [1.0, np.inf])
            np.testing.assert_array_equal(A.numpy(), a)
            np.testing.assert_array_equal(B.numpy(), b)
            self.assertEqual(x.shape(), (2, 2))

    def test_gen_eigen_against_scipy(self):
        rng = np.random.default_rng(19)
        for cx in (False, True):
            dt = C128 if cx else float
            a, b = rnd(rng, (9, 9), cx), rnd(rng, (9, 9), cx)
            A, B, v, x = tw.matrix(a, dt), tw.matrix(b, dt), tw.empty(C128), tw.empty(C128, 2)
            self.assertEqual((tw.lib.CxGenEigenEx_head if cx else tw.lib.GenEigenEx_head)(A, B, 1, v, x), 0)
            w, vec = v.numpy(), x.numpy()
            ref = sl.eig(a, b, right=False)
            self.assertLess(match_err(w, ref), 1e-10 * np.abs(ref).max())
            self.assertLess(np.abs(a @ vec - b @ vec * w).max(), 1e-11 * np.abs(w).max())


class BackTransform(unittest.TestCase):
    def test_vectors_of_the_original_problem(self):
        for cx in (False, True):
            a = special(8, "graded", cx) + special(8, "permutable", cx)
            a[:, 2] = 0
            a[2, 2] = 4.0  # an isolated eigenvalue
            bal = (lapack.zgebal if cx else lapack.dgebal)(a, permute=1, scale=1)
            ab, lo, hi, scale = bal[0], bal[1], bal[2], bal[3]
            w, vr = np.linalg.eig(ab)
            wl, vl = np.linalg.eig(ab.conj().T)  # left vectors: y^H ab = conj(wl) y^H
            self.assertTrue(lo > 0 or hi < 7)
            for side, vec in ((1, vr), (0, vl)):
                if cx:
                    h = tw.matrix(vec, C128)
                    rc = tw.lib.CxEigenVBack_head(h, 3, side, lo, hi, tw.array(scale))
                    out = h.numpy()
                else:
                    # Real storage: transform real and imaginary parts separately.
                    hr, hi_ = tw.matrix(vec.real), tw.matrix(vec.imag)
                    rc = tw.lib.EigenVBack_head(hr, 3, side, lo, hi, tw.array(scale))
                    rc |= tw.lib.EigenVBack_head(hi_, 3, side, lo, hi, tw.array(scale))
                    out = hr.numpy() + 1j * hi_.numpy()
                self.assertEqual(rc, 0)
                norm = np.linalg.norm(out, axis=0)
                if side == 1:
                    res = np.abs(a @ out - out * w).max(axis=0) / norm
                else:
                    res = np.abs(out.conj().T @ a - np.conj(wl)[:, None] * out.conj().T).max(axis=1) / norm
                self.assertLess(res.max(), 1e-12 * np.abs(a).max(), (cx, side))


class Companion(unittest.TestCase):
    def test_against_scipy_companion(self):
        cases = [np.array([0, 2, -1.5]), np.array([1 + 2j, 1 - 2j, -3, 0.5]), np.array([7.0]),
                 np.array([1e-9, -1e-9, 2, 2, 2])]
        for r in cases:
            m, st = tw.empty(float, 2), tw.i32(-1)
            tw.lib.CreateMatrixFromEVs_head(tw.array(r, C128), m, st.ref)
            self.assertEqual(st.value, 0)
            want = sl.companion(np.poly(r))[::-1, ::-1].real if len(r) > 1 else np.array([[-np.poly(r)[1].real]])
            np.testing.assert_allclose(m.numpy(), want, rtol=1e-14, atol=1e-15)
        m = tw.empty(float, 2)
        tw.lib.CreateMatrixFromEVs_head(tw.array([0, 2, -1.5], C128), m, st.ref)
        np.testing.assert_array_equal(m.numpy()[-1], [0, 3, 0.5])


class Statuses(unittest.TestCase):
    def test_table(self):
        """Every export: its status, and all outputs (in-place matrices too) emptied on failure."""
        sq, wide, none, nan = np.eye(3), np.ones((2, 3)), np.zeros((0, 0)), np.array([[1.0, np.nan], [0, 1]])
        i32 = tw.i32

        def m(a, cx):
            return tw.matrix(a, C128 if cx else float)

        def full(cx, dims=2):
            return tw.matrix(np.ones((2, 2)), C128 if cx else float) if dims == 2 else tw.array(np.ones(2), C128 if cx else float)

        def ev(cx, a, output=1):
            v, z, st = full(True, 1), full(True), i32(-1)
            tw.lib.EigenValueVector_head(m(a, cx), i32(output).ref, v, z, st.ref)
            return st.value, [v, z]

        def cxev(cx, a, herm):
            h, v, st = m(a, True), full(True, 1), i32(-1)
            tw.lib.CxEigenValueVector_head(h, i32(herm).ref, i32(1).ref, v, st.ref)
            return st.value, [h, v]

        def sym(cx, a):
            h, v, st = m(a, False), full(False, 1), i32(-1)
            tw.lib.SymEvectorEvalue_head(h, i32(1).ref, v, st.ref)
            return st.value, [h, v]

        def sch(cx, a, order=None):
            h, q, v = m(a, cx), full(cx), full(True, 1)
            if order is None:
                return (tw.lib.CxSchur_head if cx else tw.lib.Schur_head)(h, 1, q, v), [h, q, v]
            return (tw.lib.CxSchur80_head if cx else tw.lib.Schur80_head)(h, 1, order, q, v), [h, q, v]

        def qz(cx, a, b, order=None):
            outs = [m(a, cx), m(b, cx), full(True, 1), full(cx, 1), full(True)]
            if order is None:
                return (tw.lib.CxQZ_head if cx else tw.lib.QZ_head)(*outs), outs
            return (tw.lib.CxQZ80_head if cx else tw.lib.QZ80_head)(outs[0], outs[1], 1, order, *outs[2:]), outs

        def gen(cx, a, b, want=1):
            v, x = full(True, 1), full(True)
            return (tw.lib.CxGenEigenEx_head if cx else tw.lib.GenEigenEx_head)(m(a, cx), m(b, cx), want, v, x), [v, x]

        def tmi(cx, a, b, which=3):
            outs = [m(a, cx), m(b, cx), full(cx), full(cx), full(True, 1), full(cx, 1), full(cx), full(cx)]
            f = tw.lib.CxTmiQZ_head if cx else tw.lib.TmiQZ_head
            return f(*outs[:6], which, *outs[6:]), outs

        def back(cx, v, job=3, n_scale=None):
            h = m(v, cx)
            n = v.shape[0] if n_scale is None else n_scale
            f = tw.lib.CxEigenVBack_head if cx else tw.lib.EigenVBack_head
            return f(h, job, 1, 0, max(v.shape[0] - 1, 0), tw.array(np.ones(n))), [h]

        def comp(cx, r):
            mm, st = full(False), i32(-1)
            tw.lib.CreateMatrixFromEVs_head(tw.array(r, C128), mm, st.ref)
            return st.value, [mm]

        table = [
            (ev, (none,), -20003), (ev, (wide,), -20040), (ev, (np.zeros((0, 3)),), -20040), (ev, (nan,), -20068),
            (cxev, (none, 0), -20003), (cxev, (wide, 2), -20040), (cxev, (sq, 2), -20061), (cxev, (sq, -1), -20061),
            (cxev, (nan.T, 1), -20068),  # Hermitian: the lower triangle is screened
            (sym, (wide,), -20040), (sym, (none,), -20003), (sym, (np.array([[np.inf]]),), -20068),
            (sch, (wide,), -20040), (sch, (none,), -20003), (sch, (nan,), -20068),
            (sch, (sq, 5), -20061), (sch, (wide, 1), -20040), (sch, (none, 1), -20003),
            (qz, (sq, wide), -20040), (qz, (sq, np.eye(2)), -20070), (qz, (none, none), -20003),
            (qz, (nan, np.eye(2)), -20068), (qz, (sq, sq, 5), -20061), (qz, (wide, sq, 1), -20040),
            (gen, (sq, sq, 2), -20061), (gen, (sq, np.eye(3)[:2]), -20040), (gen, (none, none), -20003),
            (tmi, (sq, sq, 4), -20061), (tmi, (sq, np.eye(4)), -20070), (tmi, (nan, np.eye(2)), -20068),
            (back, (wide,), -20040), (back, (none,), -20003), (back, (sq, 3, 2), -20002), (back, (sq, 4), -20061),
            (comp, (np.zeros(0),), -20003),
        ]
        for cx in (False, True):
            for k, (f, args, want) in enumerate(table):
                if f in (ev, cxev, sym, comp) and cx:
                    continue
                status, outputs = f(cx, *args)
                self.assertEqual(status, want, (cx, k))
                for o in outputs:
                    self.assertEqual(o.shape(), (0,) * len(o.shape()), (cx, k))
        # Values only: the vectors output stays empty; a 1 x 1 gives the vector [[1]].
        status, (v, z) = ev(False, np.array([[2.0]]), output=0)
        self.assertEqual((status, v.shape(), z.shape()), (0, (1,), (0, 0)))


if __name__ == "__main__":
    unittest.main()
