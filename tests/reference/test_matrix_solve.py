"""Solvers, inverses, pseudo-inverse and determinant against NumPy/SciPy, real and complex."""
import ctypes
import unittest

import numpy as np
import scipy.linalg as sl
from scipy.linalg import lapack

from twanlys import lowlevel as tw
from matrix_common import C128, EPS, ill, rel, rnd

D, I32, P = ctypes.c_double, ctypes.c_int32, ctypes.c_void_p


class Compact(ctypes.Structure):
    _pack_ = 1
    _fields_ = [("data", P), ("kind", I32)]


def hpd(rng, n, cx):
    b = rnd(rng, (n, n), cx)
    return b @ b.conj().T + n * np.eye(n)


def lower_compact(a):
    return a.T[np.triu_indices(a.shape[0])]


def upper_compact(a):
    return a.T[np.tril_indices(a.shape[0])]


def svd_tol(a, x, rtol):
    """The forward error to allow for x = A^+ b, with the values at or below rtol s0 dropped:
    a multiple of eps times the condition of what is kept, relative to x."""
    s = np.linalg.svd(a, compute_uv=False)
    kept = s[s > rtol * s[0]]
    return 20 * max(a.shape) * EPS * kept[0] / kept[-1] * max(np.abs(x).max(), 1e-300)


def backward(a, x, b):
    """Normwise backward error of a solution: ||A x - b|| / (||A|| ||x|| + ||b||)."""
    return np.linalg.norm(a @ x - b) / (np.linalg.norm(a, 2) * np.linalg.norm(x) + np.linalg.norm(b))


class Solvers(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(8)
        lib = tw.lib
        for name in ("GenLinEqs82_head", "CxGenLinEqs82_head"):
            getattr(lib, name).argtypes = [P, P, P, D, P]
        lib.GenLinEqs2010_head.argtypes = [P, P, P, D, P]
        lib.GenLinEqsbySVD2011_head.argtypes = [P, P, P, D, I32, P]
        for name in ("EqsSetBySVDDri82_head", "CxEqsSetBySVDDri82_head"):
            getattr(lib, name).argtypes = [P, P, P, D]

    def dt(self, cx):
        return C128 if cx else np.float64

    def fn(self, name, cx):
        return getattr(tw.lib, ("Cx" if cx else "") + name)

    def square_systems(self):
        for cx in (False, True):
            for n in (1, 6, 17):
                yield cx, rnd(self.rng, (n, n), cx), True
            yield cx, ill(8, cx), False

    def check_solution(self, a, x, want, well):
        cond = np.linalg.cond(a)
        self.assertLess(rel(x, want), 1e-14 * max(cond, 1) * a.shape[0])
        if not well:
            self.assertLess(backward(a, x, a @ want), 1e-15 * a.shape[0])

    # --- LU route ------------------------------------------------------------------------------

    def test_lu_route(self):
        for cx, a, well in self.square_systems():
            dt, n = self.dt(cx), a.shape[0]
            b = rnd(self.rng, n, cx)
            want = np.linalg.solve(a, b)
            x, st = tw.empty(dt), tw.i32(-1)
            self.fn("EqsByLUDri_head", cx)(tw.matrix(a, dt), tw.array(b, dt), x, st.ref)
            self.assertEqual(st.value, 0)
            self.check_solution(a, x.numpy(), want, well)

            h = tw.matrix(a, dt)
            self.fn("InvMatrixLUDri_head", cx)(h, st.ref)
            self.assertEqual(st.value, 0)
            self.assertLess(rel(h.numpy(), np.linalg.inv(a)), 1e-14 * np.linalg.cond(a) * n)

            # Factors from SciPy use the same exchange list: row i was exchanged with piv[i].
            lu, piv = sl.lu_factor(a)
            bb = tw.array(b, dt)
            self.fn("LULinEqs_head", cx)(tw.matrix(lu, dt), tw.array(piv, np.int32), bb, st.ref)
            self.assertEqual(st.value, 0)
            self.check_solution(a, bb.numpy(), want, well)
            h = tw.matrix(lu, dt)
            self.fn("LUInvMatrix_head", cx)(h, tw.array(piv, np.int32), st.ref)
            self.assertEqual(st.value, 0)
            self.assertLess(rel(h.numpy(), np.linalg.inv(a)), 1e-14 * np.linalg.cond(a) * n)

    # --- SVD route -----------------------------------------------------------------------------

    def svd_systems(self):
        for cx in (False, True):
            for shape in ((7, 4), (4, 7), (6, 6), (1, 5), (5, 1)):
                yield cx, rnd(self.rng, shape, cx)
            yield cx, rnd(self.rng, (8, 3), cx) @ rnd(self.rng, (3, 6), cx)  # rank 3
            yield cx, ill(9, cx)

    def test_least_squares(self):
        for cx, a in self.svd_systems():
            dt, (m, n) = self.dt(cx), a.shape
            b = rnd(self.rng, m, cx)
            # tol -1.0 means eps: the cut-off is max(m, n) s0 eps, NumPy's default rcond.
            rdef = max(m, n) * EPS
            want = np.linalg.lstsq(a, b, rcond=None)[0]
            x, st = tw.empty(dt), tw.i32(-1)
            self.fn("GenLinEqs_head", cx)(tw.matrix(a, dt), tw.array(b, dt), x, st.ref)
            self.assertEqual(st.value, 0)
            self.assertLess(np.abs(x.numpy() - want).max(), svd_tol(a, want, rdef), (cx, a.shape))
            for tol in (1e-3, 1e-9):
                ref = sl.pinv(a, atol=0, rtol=max(m, n) * tol) @ b
                self.fn("GenLinEqs82_head", cx)(tw.matrix(a, dt), tw.array(b, dt), x, tol, st.ref)
                self.assertEqual(st.value, 0)
                self.assertLess(np.abs(x.numpy() - ref).max(), svd_tol(a, ref, max(m, n) * tol))
            B = rnd(self.rng, (m, 3), cx)
            X = tw.empty(dt, 2)
            rc = self.fn("EqsSetBySVDDri_head", cx)(tw.matrix(a, dt), tw.matrix(B, dt), X)
            rank = np.linalg.matrix_rank(a)
            self.assertEqual(rc, 20001 if rank < min(m, n) else 0)
            ref = np.linalg.pinv(a) @ B
            self.assertLess(np.abs(X.numpy() - ref).max(), svd_tol(a, ref, rdef))
            rc = self.fn("EqsSetBySVDDri82_head", cx)(tw.matrix(a, dt), tw.matrix(B, dt), X, 1e-3)
            ref = sl.pinv(a, atol=0, rtol=max(m, n) * 1e-3) @ B
            self.assertLess(np.abs(X.numpy() - ref).max(), svd_tol(a, ref, max(m, n) * 1e-3))

    def test_caller_workspace_routes(self):
        for _, a in self.svd_systems():
            if np.iscomplexobj(a):
                continue
            m, n = a.shape
            b = rnd(self.rng, m, False)
            x, work = tw.empty(), tw.empty()
            self.assertEqual(tw.lib.GenLinEqs2010_head(tw.matrix(a), tw.array(b), x, -1.0, work), 0)
            want = np.linalg.lstsq(a, b, rcond=None)[0]
            self.assertLess(np.abs(x.numpy() - want).max(), svd_tol(a, want, max(m, n) * EPS))
            self.assertGreater(len(work.numpy()), 0)
            # From one refinement on, the cut-off is s0 tol without the max(m, n) factor: at 1e-10
            # the eighth singular value of the Hilbert matrix of order 9 lies between the two.
            for tol in (-1.0, 1e-10):
                ref = sl.pinv(a, atol=0, rtol=tol if tol > 0 else EPS) @ b
                for passes in (1, 2):
                    rc = tw.lib.GenLinEqsbySVD2011_head(tw.matrix(a), tw.array(b), x, tol, passes, work)
                    self.assertEqual(rc, 0)
                    rtol = tol if tol > 0 else EPS
                    self.assertLess(np.abs(x.numpy() - ref).max(), svd_tol(a, ref, rtol), (a.shape, tol, passes))

    def test_refinement_reduces_the_residual(self):
        # A consistent, ill-conditioned square system: each pass of refinement may only help.
        a = ill(10, False)
        b = a @ np.ones(10)
        res = []
        for passes in (1, 2, 3):
            x, work = tw.empty(), tw.empty()
            tw.lib.GenLinEqsbySVD2011_head(tw.matrix(a), tw.array(b), x, 1e-14, passes, work)
            res.append(np.linalg.norm(a @ x.numpy() - b))
        self.assertLessEqual(res[1], res[0] * 1.0001)
        self.assertLess(res[-1], 1e-14 * np.linalg.norm(b))

    def test_pseudo_inverse(self):
        for cx, a in self.svd_systems():
            dt, (m, n) = self.dt(cx), a.shape
            s0 = np.linalg.norm(a, 2)
            for tol, ref, rtol in ((-1.0, np.linalg.pinv(a, rcond=max(m, n) * EPS), max(m, n) * EPS),
                                   (1e-2, sl.pinv(a, atol=1e-2, rtol=0), 1e-2 / s0)):
                h, t, st = tw.matrix(a, dt), tw.f64(tol), tw.i32(-1)
                self.fn("PseudoInverse_head", cx)(h, t.ref, st.ref)
                self.assertEqual(st.value, 0)
                got = h.numpy()
                self.assertEqual(got.shape, (n, m))
                self.assertLess(np.abs(got - ref).max(), svd_tol(a, ref, rtol))

    # --- Cholesky route ------------------------------------------------------------------------

    def test_cholesky_route(self):
        for cx in (False, True):
            dt = self.dt(cx)
            for n in (1, 5, 12):
                a = hpd(self.rng, n, cx)
                b = rnd(self.rng, n, cx)
                want = np.linalg.solve(a, b)
                tol = 1e-14 * np.linalg.cond(a) * n
                # Only the upper triangle is read: the lower one holds noise.
                noisy = np.triu(a) + np.tril(rnd(self.rng, (n, n), cx), -1)
                x, st = tw.empty(dt), tw.i32(-1)
                self.fn("EqsByCholeskyDri_head", cx)(tw.matrix(noisy, dt), tw.array(b, dt), x, st.ref)
                self.assertEqual(st.value, 0)
                self.assertLess(rel(x.numpy(), want), tol)
                B = rnd(self.rng, (n, 2), cx)
                for tri, m in ((0, np.tril(a) + np.triu(noisy.T, 1)), (1, noisy)):
                    X = tw.empty(dt, 2)
                    self.assertEqual(self.fn("EqsSetByCholeskyDri_head", cx)(tw.matrix(m, dt), tri, tw.matrix(B, dt), X), 0)
                    self.assertLess(rel(X.numpy(), np.linalg.solve(a, B)), tol)
                low = sl.cholesky(a, lower=True)
                bb = tw.array(b, dt)
                self.fn("CholeskyLinEqs_head", cx)(tw.array(lower_compact(low), dt), bb, st.ref)
                self.assertEqual(st.value, 0)
                self.assertLess(rel(bb.numpy(), want), tol)
                inv = np.linalg.inv(a)
                h = tw.matrix(np.tril(a) + np.triu(noisy.T, 1), dt)
                self.fn("InvMatrixChoDri_head", cx)(h, st.ref)
                self.assertEqual(st.value, 0)
                self.assertLess(rel(h.numpy(), inv), tol)
                c = tw.array(lower_compact(low), dt)
                self.fn("Cholesky_InvMatrix_head", cx)(c, st.ref)
                self.assertEqual(st.value, 0)
                self.assertLess(rel(c.numpy(), lower_compact(inv)), tol)
                if not cx:
                    h, w1, w2 = tw.matrix(a), tw.array(np.zeros(n * (n + 1) // 2)), tw.array(np.zeros(n))
                    self.assertEqual(tw.lib.PreallocInvMatrixChoDri_H(h, w1, w2), 0)
                    self.assertLess(rel(h.numpy(), inv), tol)
                for ty in (1, 0):
                    det = np.linalg.det(a)
                    res = (D * 2)()
                    self.fn("Determinant_head", cx)(tw.matrix(a, dt), tw.i32(ty).ref, res, st.ref)
                    self.assertEqual(st.value, 0)
                    got = res[0] + 1j * res[1] if cx else res[0]
                    self.assertLess(abs(got - det) / abs(det), 1e-13 * n)

    # --- Triangular route ----------------------------------------------------------------------

    def test_triangular_route(self):
        for cx in (False, True):
            dt = self.dt(cx)
            for n in (1, 4, 15):
                a = rnd(self.rng, (n, n), cx) + 4 * np.eye(n)
                b = rnd(self.rng, n, cx)
                B = rnd(self.rng, (n, 3), cx)
                for kind, tri, pack in ((0, np.tril(a), lower_compact), (1, np.triu(a), upper_compact)):
                    lower = kind == 0
                    tol = 1e-14 * np.linalg.cond(tri) * n
                    data = tw.array(pack(tri), dt)
                    cm = Compact(data.h.value, kind)
                    bb, st = tw.array(b, dt), tw.i32(-1)
                    self.fn("TriLinEqs_head", cx)(ctypes.byref(cm), bb, st.ref)
                    self.assertEqual(st.value, 0)
                    self.assertLess(rel(bb.numpy(), sl.solve_triangular(tri, b, lower=lower)), tol)
                    X = tw.empty(dt, 2)
                    self.assertEqual(self.fn("TriEqsSetDri_head", cx)(tw.matrix(a, dt), kind, tw.matrix(B, dt), X), 0)
                    self.assertLess(rel(X.numpy(), sl.solve_triangular(tri, B, lower=lower)), tol)
                    inv = np.linalg.inv(tri)
                    self.fn("Tri_InvMatrix_head", cx)(ctypes.byref(cm), st.ref)
                    self.assertEqual(st.value, 0)
                    self.assertLess(rel(data.numpy(), pack(inv)), tol)
                    h = tw.matrix(a, dt)
                    self.fn("InvMatrixTriDri_head", cx)(h, tw.i32(kind).ref, st.ref)
                    self.assertEqual(st.value, 0)
                    self.assertLess(rel(h.numpy(), inv), tol)
                    np.testing.assert_array_equal(np.triu(h.numpy(), 1) if lower else np.tril(h.numpy(), -1), 0)
                    res = (D * 2)()
                    self.fn("Determinant_head", cx)(tw.matrix(a, dt), tw.i32(2 + kind).ref, res, st.ref)
                    got = res[0] + 1j * res[1] if cx else res[0]
                    self.assertLess(abs(got - np.prod(np.diag(a))) / abs(np.prod(np.diag(a))), 1e-14 * n)

    def test_general_determinant(self):
        for cx, a, _ in self.square_systems():
            det, st, res = np.linalg.det(a), tw.i32(-1), (D * 2)()
            self.fn("Determinant_head", cx)(tw.matrix(a, self.dt(cx)), tw.i32(0).ref, res, st.ref)
            self.assertEqual(st.value, 0)
            got = res[0] + 1j * res[1] if cx else res[0]
            self.assertLess(abs(got - det) / abs(det), 1e-14 * np.linalg.cond(a) * a.shape[0])

    # --- Band and tridiagonal routes -----------------------------------------------------------

    def test_band(self):
        for cx in (False, True):
            dt = self.dt(cx)
            for n, kl, ku in ((6, 1, 2), (9, 3, 1), (5, 0, 0), (8, 2, 2)):
                ab = rnd(self.rng, (kl + ku + 1, n), cx)
                ab[ku] += 3  # the diagonal
                b = rnd(self.rng, n, cx)
                B = rnd(self.rng, (n, 4), cx)
                bb = tw.array(b, dt)
                self.assertEqual(self.fn("BandEqsDriH", cx)(tw.matrix(ab, dt), bb, kl, ku), 0)
                want = sl.solve_banded((kl, ku), ab, b)
                self.assertLess(rel(bb.numpy(), want), 1e-13)
                BB = tw.matrix(B, dt)
                self.assertEqual(self.fn("BandEqsSetDriH", cx)(tw.matrix(ab, dt), BB, kl, ku), 0)
                self.assertLess(rel(BB.numpy(), sl.solve_banded((kl, ku), ab, B)), 1e-13)
            # A singular band system is refused, and b is emptied.
            ab = np.zeros((3, 5), dtype=dt)
            ab[1] = 1
            ab[1, 2] = 0
            bb = tw.array(np.ones(5), dt)
            self.assertEqual(self.fn("BandEqsDriH", cx)(tw.matrix(ab, dt), bb, 1, 1), -20041)
            self.assertEqual(len(bb.numpy()), 0)

    def test_tridiagonal(self):
        for n in (3, 8, 40):
            dl, d, du = (self.rng.standard_normal(k) for k in (n - 1, n, n - 1))
            t = np.diag(d) + np.diag(dl, -1) + np.diag(du, 1)
            hs = [tw.array(v) for v in (dl, d, du)]
            du2, ipiv = tw.empty(), tw.empty(np.int32)
            self.assertEqual(tw.lib.TriDiagLU_head(*hs, du2, ipiv), 0)
            ref = lapack.dgttrf(dl, d, du)
            for got, want in zip([h.numpy() for h in hs] + [du2.numpy()], ref[:4]):
                np.testing.assert_array_equal(got, want)
            # ipiv stays 1-based, as LAPACK (and SciPy's wrapper) give it.
            np.testing.assert_array_equal(ipiv.numpy(), ref[4])
            b = self.rng.standard_normal(n)
            B = self.rng.standard_normal((n, 3))
            for trans in (0, 1):
                op = t if trans == 0 else t.T
                bb = tw.array(b)
                self.assertEqual(tw.lib.TriDiagEqsByLU_head(trans, *hs, du2, ipiv, bb), 0)
                self.assertLess(rel(bb.numpy(), np.linalg.solve(op, b)), 1e-13 * np.linalg.cond(t))
                BB = tw.matrix(B)
                self.assertEqual(tw.lib.TriDiagEqsSetByLU_head(trans, *hs, du2, ipiv, BB), 0)
                self.assertLess(rel(BB.numpy(), np.linalg.solve(op, B)), 1e-13 * np.linalg.cond(t))


if __name__ == "__main__":
    unittest.main()
