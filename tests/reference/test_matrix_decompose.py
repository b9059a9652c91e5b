"""Decompositions against SciPy/NumPy: LU factors and pivots, SVD, QR in all forms, Cholesky,
generalised SVD, Hessenberg, balancing, compact storage."""
import unittest

import numpy as np
import scipy.linalg as sl
from scipy.linalg import lapack

from twanlys import lowlevel as tw
from matrix_common import C128, rel as err, rnd, unitary_err

SHAPES = [(5, 5), (7, 4), (4, 7), (1, 3), (3, 1), (40, 25)]


def lu_product(lu, perm, m, n):
    """P^T L U from compact factors and the exchange list."""
    k = min(m, n)
    low = np.tril(lu, -1)[:, :k] + np.eye(m, k)
    up = np.triu(lu)[:k, :]
    rows = np.arange(m)
    for i in range(m):
        rows[[i, perm[i]]] = rows[[perm[i], i]]
    out = np.empty_like(lu)
    out[rows] = low @ up
    return out


class Decompositions(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(99)

    def matrices(self):
        for cx in (False, True):
            for shape in SHAPES:
                yield cx, rnd(self.rng, shape, cx), True
            # Rank-deficient and ill-conditioned: pivots among rounding noise may differ from LAPACK's.
            yield cx, rnd(self.rng, (6, 2), cx) @ rnd(self.rng, (2, 5), cx), False
            i = np.arange(7)
            yield cx, (1.0 / (i[:, None] + i[None, :] + 1)).astype(C128 if cx else np.float64), False

    def test_lu(self):
        for cx, a, generic in self.matrices():
            dt = C128 if cx else np.float64
            m, n = a.shape
            h, perm, parity, st = tw.matrix(a, dt), tw.empty(np.int32), tw.i32(), tw.i32(-1)
            (tw.lib.CxLU_head if cx else tw.lib.LU_head)(h.h, perm.h, parity.ref, st.ref)
            self.assertIn(st.value, (0, 20003))
            lu, p = h.numpy(), perm.numpy()
            self.assertEqual(len(p), m)
            self.assertLess(err(lu_product(lu, p, m, n), a), 1e-14 * max(m, n))
            self.assertEqual(parity.value, int(np.sum(p != np.arange(m))) % 2)
            if generic and not cx:
                # Real pivots are ranked as LAPACK ranks them: the factors agree.
                ref, piv = sl.lu_factor(a)
                k = min(m, n)
                np.testing.assert_array_equal(p[:k], piv[:k])
                self.assertLess(err(lu, ref), 1e-14 * max(m, n))

    def test_svd(self):
        for cx, a, generic in self.matrices():
            dt = C128 if cx else np.float64
            m, n = a.shape
            r = min(m, n)
            want = np.linalg.svd(a, compute_uv=False)
            h, s, v, st = tw.matrix(a, dt), tw.empty(dt), tw.empty(dt, 2), tw.i32(-1)
            (tw.lib.CxSVD_head if cx else tw.lib.SVD_head)(h.h, s.h, v.h, st.ref)
            self.assertEqual(st.value, 0)
            u, sv, vm = h.numpy(), s.numpy(), v.numpy()
            self.assertEqual(u.shape, (m, r))
            self.assertEqual(vm.shape, (n, r))
            if cx:
                np.testing.assert_array_equal(sv.imag, 0)
            self.assertLess(np.abs(sv.real - want).max(), 1e-14 * want[0] * max(m, n))
            self.assertLess(err(u @ np.diag(sv) @ vm.conj().T, a), 1e-14 * max(m, n))
            self.assertLess(unitary_err(u), 1e-14 * max(m, n))
            self.assertLess(unitary_err(vm), 1e-14 * max(m, n))
            for full in (0, 1):
                h, u, s, v = tw.matrix(a, dt), tw.empty(dt, 2), tw.empty(), tw.empty(dt, 2)
                rc = (tw.lib.CxSVDEx_head if cx else tw.lib.SVDEx_head)(h.h, full, u.h, s.h, v.h)
                self.assertEqual(rc, 0)
                um, sv, vm = u.numpy(), s.numpy(), v.numpy()
                self.assertEqual(um.shape, (m, m if full else r))
                self.assertEqual(vm.shape, (n, n if full else r))
                sig = np.zeros((um.shape[1], vm.shape[1]))
                sig[:r, :r] = np.diag(sv)
                self.assertLess(err(um @ sig @ vm.conj().T, a), 1e-14 * max(m, n))
                self.assertLess(unitary_err(um), 1e-14 * max(m, n))
                self.assertLess(unitary_err(vm), 1e-14 * max(m, n))
            h, s = tw.matrix(a, dt), tw.empty()
            (tw.lib.CxSVDS_head if cx else tw.lib.SVDS_head)(h.h, s.h, st.ref)
            self.assertEqual(st.value, 0)
            self.assertLess(np.abs(s.numpy() - want).max(), 1e-14 * want[0] * max(m, n))

    def test_qr(self):
        for cx, a, generic in self.matrices():
            dt = C128 if cx else np.float64
            m, n = a.shape
            _, rref = np.linalg.qr(a, mode="complete")
            for method in (0, 1, 2, 3) if cx else (0, 1, 2):
                h, q, r, st, me = tw.matrix(a, dt), tw.empty(dt, 2), tw.empty(dt, 2), tw.i32(-1), tw.i32(method)
                (tw.lib.Cxqrd_head if cx else tw.lib.qrd_head)(h.h, me.ref, q.h, r.h, st.ref)
                self.assertEqual(st.value, 0)
                qm, rm = q.numpy(), r.numpy()
                self.assertEqual(qm.shape, (m, m))
                self.assertEqual(rm.shape, (m, n))
                self.assertLess(err(qm @ rm, a), 1e-14 * max(m, n), (cx, a.shape, method))
                self.assertLess(unitary_err(qm), 1e-14 * max(m, n))
                np.testing.assert_array_equal(np.tril(rm, -1), 0)
                if method == 0 or cx:
                    # Householder through LAPACK: R as NumPy's, signs included.
                    self.assertLess(err(rm, rref), 1e-14 * max(m, n))

    def test_qr_with_pivoting(self):
        for cx, a, generic in self.matrices():
            dt = C128 if cx else np.float64
            m, n = a.shape
            r = min(m, n)
            _, rref, pref = sl.qr(a, pivoting=True)
            for option in (0, 1, 2):
                h, p, q, rr = tw.matrix(a, dt), tw.empty(np.int32, 2), tw.empty(dt, 2), tw.empty(dt, 2)
                self.assertEqual((tw.lib.CxQRDecH if cx else tw.lib.QRDecH)(h, 1, option, p, q, rr), 0)
                pm, qm, rm = p.numpy(), q.numpy(), rr.numpy()
                self.assertEqual(pm.shape, (n, n))
                self.assertEqual(rm.shape, ((m, n) if option == 0 else (r, n)))
                np.testing.assert_array_equal(np.tril(rm, -1), 0)
                # P[perm[i]][i] = 1: a P keeps the pivoted column order of dgeqp3, as SciPy's.
                if generic:
                    np.testing.assert_array_equal(pm, np.eye(n, dtype=np.int32)[:, pref])
                    self.assertLess(err(rm, rref[:rm.shape[0]]), 1e-14 * max(m, n))
                if option == 2:
                    self.assertEqual(qm.shape, (0, 0))
                    continue
                self.assertEqual(qm.shape, (m, m) if option == 0 or n > m else (m, n))
                self.assertLess(err(qm @ rm, a @ pm), 1e-14 * max(m, n))
                self.assertLess(unitary_err(qm), 1e-14 * max(m, n))
                # |R| descends along the diagonal: the point of the pivoting.
                d = np.abs(np.diag(rm))
                self.assertTrue(np.all(d[:-1] >= d[1:] * (1 - 1e-12)) or not generic)
            # Without pivoting: Householder QR and an empty P.
            for option, mode in ((0, "complete"), (1, "reduced")):
                h, p, q, rr = tw.matrix(a, dt), tw.empty(np.int32, 2), tw.empty(dt, 2), tw.empty(dt, 2)
                self.assertEqual((tw.lib.CxQRDecH if cx else tw.lib.QRDecH)(h, 0, option, p, q, rr), 0)
                qref, rref0 = np.linalg.qr(a, mode=mode)
                self.assertEqual(p.numpy().shape, (0, 0))
                self.assertLess(err(rr.numpy(), rref0), 1e-14 * max(m, n))
                self.assertLess(err(q.numpy() @ rr.numpy(), a), 1e-14 * max(m, n))
                # Beyond the rank the columns of Q are made of rounding noise, in NumPy's as in ours.
                if generic:
                    self.assertLess(err(q.numpy(), qref), 1e-14 * max(m, n))

    def test_cholesky(self):
        for cx in (False, True):
            dt = C128 if cx else np.float64
            for n in (1, 4, 13):
                b = rnd(self.rng, (n, n), cx)
                a = b @ b.conj().T + n * np.eye(n)
                low = sl.cholesky(a, lower=True)
                c, st = tw.array(a.T[np.triu_indices(n)], dt), tw.i32(-1)
                (tw.lib.CxCholesky_head if cx else tw.lib.Cholesky_head)(c, st.ref)
                self.assertEqual(st.value, 0)
                self.assertLess(err(c.numpy(), low.T[np.triu_indices(n)]), 1e-14 * n)
                # Only the upper triangle is read, and the complex diagonal's imaginary part is dropped.
                noisy = np.triu(a) + np.tril(rnd(self.rng, (n, n), cx), -1)
                if cx:
                    noisy[np.diag_indices(n)] += 1j
                h = tw.matrix(noisy, dt)
                rc = (tw.lib.CxFullCholesky_head if cx else tw.lib.FullCholesky_head)(h, st.ref)
                self.assertEqual((rc, st.value), (0, 0))
                up = h.numpy()
                self.assertLess(err(up, sl.cholesky(a)), 1e-14 * n)
                self.assertLess(err(up.conj().T @ up, a), 1e-14 * n)
                np.testing.assert_array_equal(np.tril(up, -1), 0)

    def test_generalised_svd(self):
        for cx in (False, True):
            dt = C128 if cx else np.float64
            for m, p, n in ((6, 5, 4), (2, 5, 4), (5, 2, 4), (3, 3, 3), (1, 1, 2)):
                a, b = rnd(self.rng, (m, n), cx), rnd(self.rng, (p, n), cx)
                pencil = np.sort(np.sqrt(np.abs(sl.eigvals(a.conj().T @ a, b.conj().T @ b))))
                for full in (0, 1):
                    outs = [tw.empty()] + [tw.empty(dt, 2) for _ in range(5)]
                    fn = tw.lib.CxGSVD_head if cx else tw.lib.GSVD_head
                    self.assertEqual(fn(tw.matrix(a, dt), tw.matrix(b, dt), 0, full, *outs), 0)
                    s, u, v, q, d1, d2 = (o.numpy() for o in outs)
                    self.assertEqual(u.shape, (m, m if full else min(m, n)))
                    self.assertEqual(v.shape, (p, p if full else min(p, n)))
                    self.assertEqual(q.shape, (n, n))
                    scale = max(np.abs(a).max(), np.abs(b).max()) * n
                    self.assertLess(np.abs(u @ d1 @ q - a).max(), 1e-14 * scale)
                    self.assertLess(np.abs(v @ d2 @ q - b).max(), 1e-14 * scale)
                    self.assertLess(unitary_err(u), 1e-14 * n)
                    self.assertLess(unitary_err(v), 1e-14 * n)
                    # C^2 + S^2 = I on the pairs that both matrices see.
                    pairs = np.abs(np.diag(d1.conj().T @ d1 + d2.conj().T @ d2))
                    self.assertTrue(np.all((np.abs(pairs - 1) < 1e-14) | (pairs == 0)))
                    # The finite ratios are the generalised singular values of the pencil.
                    finite = np.sort(s[np.isfinite(s)])
                    big = pencil[np.isfinite(pencil)][-len(finite):] if len(finite) else finite
                    np.testing.assert_allclose(finite[finite > 1e-6], big[big > 1e-6], rtol=1e-9)
                    vals = [tw.empty()] + [tw.empty(dt, 2) for _ in range(5)]
                    self.assertEqual(fn(tw.matrix(a, dt), tw.matrix(b, dt), 1, full, *vals), 0)
                    np.testing.assert_array_equal(vals[0].numpy(), s)

    def test_hessenberg(self):
        for cx in (False, True):
            dt = C128 if cx else np.float64
            for n in (1, 2, 7, 20):
                a = rnd(self.rng, (n, n), cx)
                h, q = tw.matrix(a, dt), tw.empty(dt, 2)
                self.assertEqual((tw.lib.CxHessenberg_head if cx else tw.lib.Hessenberg_head)(h, 0, n - 1, q), 0)
                hm, qm = h.numpy(), q.numpy()
                np.testing.assert_array_equal(np.tril(hm, -2), 0)
                self.assertLess(err(qm @ hm @ qm.conj().T, a), 1e-14 * n)
                self.assertLess(unitary_err(qm), 1e-14 * n)
                # SciPy returns matrices of order 2 and below as they are; LAPACK still makes a
                # complex subdiagonal real there.
                if n > 2:
                    href, qref = sl.hessenberg(a, calc_q=True)
                    self.assertLess(err(hm, href), 1e-14 * n)
                    self.assertLess(err(qm, qref), 1e-14 * n)
            # A part of the matrix, as balancing leaves it: against dgehrd and dorghr on the same range.
            a = np.triu(rnd(self.rng, (8, 8), cx))
            a[2:6, 2:6] = rnd(self.rng, (4, 4), cx)
            gehrd, orghr = (lapack.zgehrd, lapack.zunghr) if cx else (lapack.dgehrd, lapack.dorghr)
            hr, tau, _ = gehrd(a, lo=2, hi=5)
            qr_, _ = orghr(hr, tau, lo=2, hi=5)
            h, q = tw.matrix(a, dt), tw.empty(dt, 2)
            self.assertEqual((tw.lib.CxHessenberg_head if cx else tw.lib.Hessenberg_head)(h, 2, 5, q), 0)
            self.assertLess(err(h.numpy(), np.triu(hr, -1)), 1e-14 * 8)
            self.assertLess(err(q.numpy(), qr_), 1e-14 * 8)
            self.assertLess(err(q.numpy() @ h.numpy() @ q.numpy().conj().T, a), 1e-14 * 8)

    def test_balance(self):
        for cx in (False, True):
            dt = C128 if cx else np.float64
            gebal = lapack.zgebal if cx else lapack.dgebal
            # Badly scaled, with rows and columns that isolate eigenvalues.
            a = rnd(self.rng, (7, 7), cx) * np.logspace(-6, 6, 7)[:, None]
            a[4, :] = 0
            a[4, 4] = 3
            a[:, 1] = 0
            a[1, 1] = 2
            for job in range(4):
                h, s, lo, hi = tw.matrix(a, dt), tw.empty(), tw.i32(), tw.i32()
                self.assertEqual((tw.lib.CxMatrixBalance_head if cx else tw.lib.MatrixBalance_head)(
                    h, job, lo.ref, hi.ref, s), 0)
                ba, lref, href, sref, _ = gebal(a, scale=job in (2, 3), permute=job in (1, 3))
                self.assertEqual((lo.value, hi.value), (lref, href))
                np.testing.assert_array_equal(s.numpy(), sref)
                np.testing.assert_array_equal(h.numpy(), ba)

    def test_compact_round_trip(self):
        a = self.rng.standard_normal((5, 5))
        for kind, want in [(0, a.T[np.triu_indices(5)]), (1, a.T[np.tril_indices(5)]), (2, a.T[np.triu_indices(5)])]:
            h, out, st, k = tw.matrix(a), tw.empty(), tw.i32(-1), tw.i32(kind)
            tw.lib.Matrix_to_Compact_head(h.h, k.ref, out.h, st.ref)
            self.assertEqual(st.value, 0)
            np.testing.assert_array_equal(out.numpy(), want)


if __name__ == "__main__":
    unittest.main()
