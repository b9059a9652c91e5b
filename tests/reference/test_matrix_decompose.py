"""Decompositions against SciPy/NumPy: LU factors and pivots, SVD, QR in three methods, compact."""
import unittest

import numpy as np
import scipy.linalg as sl

import twanlys as tw

C128 = np.complex128
SHAPES = [(5, 5), (7, 4), (4, 7), (1, 3), (3, 1), (40, 25)]


def rnd(rng, shape, cx):
    a = rng.standard_normal(shape)
    return a + 1j * rng.standard_normal(shape) if cx else a


def err(x, ref):
    return np.abs(x - ref).max() / max(np.abs(ref).max(), 1e-300)


def unitary_err(q):
    return np.abs(q.conj().T @ q - np.eye(q.shape[1])).max()


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

    def test_compact_round_trip(self):
        a = self.rng.standard_normal((5, 5))
        for kind, want in [(0, a.T[np.triu_indices(5)]), (1, a.T[np.tril_indices(5)]), (2, a.T[np.triu_indices(5)])]:
            h, out, st, k = tw.matrix(a), tw.empty(), tw.i32(-1), tw.i32(kind)
            tw.lib.Matrix_to_Compact_head(h.h, k.ref, out.h, st.ref)
            self.assertEqual(st.value, 0)
            np.testing.assert_array_equal(out.numpy(), want)


if __name__ == "__main__":
    unittest.main()
