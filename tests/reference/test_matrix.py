"""Matrix frame exports against NumPy: products, outer product, trace, norms, rank, condition."""
import ctypes
import unittest

import numpy as np

from twanlys import lowlevel as tw
from matrix_common import C128, ill, rel, rnd

SHAPES = [(1, 1), (5, 5), (9, 4), (4, 9), (1, 7), (7, 1), (33, 20)]


class MatrixFrame(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(2024)
        tw.lib.vectorNormH.argtypes = [ctypes.c_void_p, ctypes.c_double, ctypes.c_void_p]
        tw.lib.CxVectorNormH.argtypes = [ctypes.c_void_p, ctypes.c_double, ctypes.c_void_p]

    def cases(self):
        for cx in (False, True):
            for shape in SHAPES:
                yield cx, rnd(self.rng, shape, cx)
            yield cx, ill(8, cx)

    def test_products(self):
        for placement in (0, 1):
            tw.placement(placement)
            for cx in (False, True):
                dt = C128 if cx else np.float64
                for m, k, p in [(1, 1, 1), (6, 4, 5), (17, 31, 2), (40, 40, 40)]:
                    a, b = rnd(self.rng, (m, k), cx), rnd(self.rng, (k, p), cx)
                    c, st = tw.empty(dt, 2), tw.i32(-1)
                    ha, hb = tw.matrix(a, dt), tw.matrix(b, dt)
                    (tw.lib.AxBCxCIN if cx else tw.lib.MatrixMul_head)(ha.h, hb.h, c.h, st.ref)
                    self.assertEqual(st.value, 0)
                    self.assertLess(rel(c.numpy(), a @ b), 1e-14 * k)
                    x, y = rnd(self.rng, k, cx), tw.empty(dt)
                    hx = tw.array(x, dt)
                    (tw.lib.AxVectorCx if cx else tw.lib.AxVect_head)(ha.h, hx.h, y.h, st.ref)
                    self.assertLess(rel(y.numpy(), a @ x), 1e-14 * k)
                    x = rnd(self.rng, m, cx)
                    hx = tw.array(x, dt)
                    rc = (tw.lib.CxVectxA_head if cx else tw.lib.vectxA_head)(hx.h, ha.h, y.h)
                    self.assertEqual(rc, 0)
                    self.assertLess(rel(y.numpy(), x @ a), 1e-14 * m)
        tw.placement(0)

    def test_dot_outer_trace(self):
        for cx in (False, True):
            dt = C128 if cx else np.float64
            x, y = rnd(self.rng, 11, cx), rnd(self.rng, 11, cx)
            st = tw.i32(-1)
            r = (ctypes.c_double * 2)()
            hx, hy, hy4 = tw.array(x, dt), tw.array(y, dt), tw.array(y[:4], dt)
            (tw.lib.DotprodCx if cx else tw.lib.DotProduct_head)(hx.h, hy.h, r, st.ref)
            got = complex(r[0], r[1]) if cx else r[0]
            self.assertEqual(st.value, 0)
            self.assertLess(abs(got - np.dot(x, y)) / np.dot(np.abs(x), np.abs(y)), 1e-15)
            m = tw.empty(dt, 2)
            (tw.lib.OuterProdCx_head if cx else tw.lib.OuterProd_head)(hx.h, hy4.h, m.h, st.ref)
            self.assertLess(rel(m.numpy(), np.outer(x, y[:4])), 1e-15)
            for shape in [(3, 3), (2, 5), (6, 2)]:
                a = rnd(self.rng, shape, cx)
                ha = tw.matrix(a, dt)
                (tw.lib.CxTrace_head if cx else tw.lib.Trace_head)(ha.h, r, st.ref)
                got = complex(r[0], r[1]) if cx else r[0]
                self.assertLess(abs(got - np.trace(a)), 1e-14 * np.abs(a).sum())

    def test_norms(self):
        for cx, a in self.cases():
            dt = C128 if cx else np.float64
            for typ, ordv in [(0, 2), (1, 1), (2, "fro"), (3, np.inf)]:
                r, st, t, ha = tw.f64(), tw.i32(-1), tw.i32(typ), tw.matrix(a, dt)
                (tw.lib.CxNorm_head if cx else tw.lib.Norm_head)(ha.h, t.ref, r.ref, st.ref)
                self.assertEqual(st.value, 0)
                tol = 1e-13 if typ == 0 else 1e-14
                self.assertLess(rel(r.value, np.linalg.norm(a, ordv)), tol, (cx, a.shape, typ))

    def test_vector_norms(self):
        for cx in (False, True):
            dt = C128 if cx else np.float64
            x = rnd(self.rng, 13, cx)
            for p in [1, 2, 3, 0.5, -1.5, np.inf, -np.inf]:
                r, hx = tw.f64(), tw.array(x, dt)
                rc = (tw.lib.CxVectorNormH if cx else tw.lib.vectorNormH)(hx.h, p, r.ref)
                self.assertEqual(rc, 0)
                self.assertLess(rel(r.value, np.linalg.norm(x, p)), 1e-14, (cx, p))

    def test_rank(self):
        for cx in (False, True):
            dt = C128 if cx else np.float64
            for m, n, r in [(8, 6, 3), (6, 8, 4), (5, 5, 5), (7, 7, 1)]:
                a = rnd(self.rng, (m, r), cx) @ rnd(self.rng, (r, n), cx)
                rank, st, tol, ha = tw.i32(), tw.i32(-1), tw.f64(-1), tw.matrix(a, dt)
                (tw.lib.CxRank_head if cx else tw.lib.Rank_head)(ha.h, tol.ref, rank.ref, st.ref)
                self.assertEqual(st.value, 0)
                self.assertEqual(rank.value, np.linalg.matrix_rank(a), (cx, m, n, r))
                self.assertEqual(rank.value, r)

    def test_condition(self):
        for cx, a in self.cases():
            dt = C128 if cx else np.float64
            kinds = [(0, None), (1, 1), (2, "fro"), (3, np.inf)] if a.shape[0] == a.shape[1] else [(0, None)]
            for typ, p in kinds:
                r, st, t, ha = tw.f64(), tw.i32(-1), tw.i32(typ), tw.matrix(a, dt)
                (tw.lib.CxCondNumber_head if cx else tw.lib.CondNumber_head)(ha.h, t.ref, r.ref, st.ref)
                self.assertEqual(st.value, 0)
                want = np.linalg.cond(a, p)
                # An ill-conditioned inverse carries about cond * eps of relative error.
                tol = 1e-13 if want < 1e3 else 1e-16 * want
                self.assertLess(rel(r.value, want), tol, (cx, a.shape, typ))


if __name__ == "__main__":
    unittest.main()
