"""Matrix functions and equations against SciPy/NumPy: exponential, logarithm, square root, powers,
characteristic polynomial, Kronecker product, generated matrices, autocorrelation matrices, the
symmetry and definiteness checks, and the Lyapunov and Sylvester equations."""
import ctypes
import unittest

import numpy as np
import scipy.linalg as sl

from twanlys import lowlevel as tw
from matrix_common import C128, EPS, rel, rnd

D = ctypes.c_double


def dt(cx):
    return C128 if cx else float


def inplace(name, a, cx, *args):
    h, st = tw.matrix(a, dt(cx)), tw.i32(-1)
    getattr(tw.lib, ("Cx" if cx else "") + name)(h, *args, st.ref)
    return st.value, h.numpy()


def mexp(a, cx=False):
    return inplace("MatrixExp_head", a, cx)


def mlog(a, cx=False):
    if cx:
        return inplace("MatrixLn_head", a, True)
    h, b, st = tw.matrix(a), tw.empty(C128, 2), tw.i32(-1)
    tw.lib.MatrixLn_head(h, b, st.ref)
    return st.value, b.numpy()


def msqrt(a, cx=False):
    if cx:
        return inplace("MatrixSqrt_head", a, True)
    b = tw.empty(C128, 2)
    return tw.lib.MatrixSqrtH(tw.matrix(a), b), b.numpy()


def pade_replica(a):
    """The stated Pade method in NumPy: order from tol 1e-8, scaling, squaring."""
    n = len(a)
    norm = np.abs(a).sum(axis=1).max()
    s = int(np.log(norm) / np.log(2.0) + 1.0) if norm >= 0.5 else 0
    a = a / 2.0 ** s
    ratio = 1e-8 / (np.exp(norm) * norm)
    e, p, q, k = 1.0 / 6.0, 3.0, 1, 2
    while e * np.exp(e) > ratio:
        k += 2
        q += 1
        v = e * p * q * q
        for i in range(int(p), k + 1):
            v /= i * i
        p = k + 1
        e = 0.25 * v / p
    eye = np.eye(n)
    num, den, c, x, sign = eye + a / 2, eye - a / 2, 0.5, a @ a, 1.0
    for k in range(2, q + 1):
        c = c * (q - k + 1) / ((2 * q - k + 1) * k)
        num, den = num + c * x, den + sign * c * x
        if k == q:
            break
        x, sign = x @ a, -sign
    r = np.linalg.solve(den, num)
    for _ in range(s):
        r = r @ r
    return r


def scaled(rng, n, norm, cx):
    a = rnd(rng, (n, n), cx)
    return a * (norm / np.abs(a).sum(axis=1).max())


class Exp(unittest.TestCase):
    def test_diagonal_path(self):
        for cx in (False, True):
            st, e = mexp(np.zeros((4, 4)), cx)
            self.assertEqual(st, 0)
            self.assertTrue(np.array_equal(e, np.eye(4)))
            d = np.array([0.5, -3.0, 7.0]) + (1j * np.array([1.0, -2.0, 0.25]) if cx else 0)
            st, e = mexp(np.diag(d), cx)
            self.assertLessEqual(np.abs(np.diag(e) - np.exp(d)).max(), 4 * EPS * np.abs(np.exp(d)).max())

    def test_replica_below_one_and_expm_above(self):
        rng = np.random.default_rng(5)
        for n in (2, 5, 12):
            for norm in (0.3, 0.95):
                a = scaled(rng, n, norm, False)
                self.assertLess(rel(mexp(a)[1], pade_replica(a)), 1e-13)
            for norm in (2.0, 10.0, 100.0, 700.0):
                for cx in (False, True):
                    a = scaled(rng, n, norm, cx)
                    st, e = mexp(a, cx)
                    self.assertEqual(st, 0)
                    self.assertLess(rel(e, sl.expm(a)), 1e-11, (n, norm, cx))


class Log(unittest.TestCase):
    def test_round_trip_and_logm(self):
        rng = np.random.default_rng(6)
        for n in (2, 5, 12, 30):
            for cx in (False, True):
                ell = rnd(rng, (n, n), cx)
                ell *= 0.3 / np.linalg.norm(ell, 2)
                st, got = mlog(sl.expm(ell), cx)
                self.assertEqual(st, 0)
                self.assertLess(rel(got, ell), 1e-12)
                # Complex input is taken as computed: its negative eigenvalue lies off the axis, where
                # the branch is not decided by rounding.
                s = rnd(rng, (n, n), cx)
                a = s @ np.diag(np.r_[-2.0 + (0.5j if cx else 0), np.linspace(0.5, 3, n - 1)]) @ np.linalg.inv(s)
                st, got = mlog(a, cx)
                self.assertIn(st, (0, 20006))
                self.assertLess(rel(got, sl.logm(a, disp=False)[0]), 1e-10, (n, cx))

    def test_negative_axis_takes_the_upper_branch(self):
        # Real input: ln(-2) is ln 2 + i pi however the complex copy rounds the eigenvalue.
        rng = np.random.default_rng(7)
        for _ in range(25):
            s = rng.standard_normal((5, 5))
            a = s @ np.diag([-2.0, -0.5, 1.0, 2.0, 3.0]) @ np.linalg.inv(s)
            st, got = mlog(a)
            self.assertIn(st, (0, 20006))
            w = np.linalg.eigvals(got)
            self.assertEqual(int(np.sum(np.abs(w.imag - np.pi) < 1e-8)), 2)
            self.assertLess(rel(sl.expm(got), a), 1e-9)

    def test_jordan_singular_and_near_defective(self):
        j = np.array([[2.0, 1.0], [0.0, 2.0]])
        st, got = mlog(j)
        self.assertEqual(st, 0)  # the eigen route fails on conditioning, the root route succeeds quietly
        self.assertLess(rel(got, sl.logm(j, disp=False)[0]), 1e-10)
        st, got = mlog(np.array([[1.0, 1.0], [0.0, 0.0]]))
        self.assertEqual((st, got.shape), (-20060, (0, 0)))
        near = np.array([[1.0, 1.0, 0.0], [1e-15, 1.0, 0.5], [0.0, 0.0, 2.0]])
        st, got = mlog(near)
        self.assertIn(st, (0, 20006))
        self.assertLess(rel(sl.expm(got), near), 1e-9)


class Sqrt(unittest.TestCase):
    def test_against_sqrtm(self):
        rng = np.random.default_rng(8)
        for n in (1, 3, 8):
            g = rng.standard_normal((n, n))
            spd = g @ g.T + n * np.eye(n)
            rc, got = msqrt(spd)
            self.assertEqual(rc, 0)
            self.assertLess(rel(got, sl.sqrtm(spd)), 1e-12)
            s = rng.standard_normal((n, n))
            a = s @ np.diag(np.linspace(-2, 3, n) + 0.1) @ np.linalg.inv(s)
            rc, got = msqrt(a)
            self.assertLess(rel(got, sl.sqrtm(a)), 1e-11)
            st, re = inplace("MatrixSqrt_head", a, False)
            self.assertTrue(np.array_equal(re, got.real))
            c = rnd(rng, (n, n), True)
            st, got = msqrt(c, True)
            self.assertEqual(st, 0)
            self.assertLess(rel(got, sl.sqrtm(c)), 1e-11)

    def test_double_zero_eigenvalue_and_screen(self):
        rc, got = msqrt(np.diag([0.0, 0.0, 4.0]))
        self.assertEqual(rc, 20006)
        self.assertTrue(np.array_equal(got, np.diag([0.0, 0.0, 2.0])))
        rc, got = msqrt(np.array([[1.0, np.nan], [0.0, 1.0]]))
        self.assertEqual((rc, got.shape), (-20068, (0, 0)))


class Powers(unittest.TestCase):
    def test_powers_and_pseudo_inverse(self):
        rng = np.random.default_rng(9)
        for cx in (False, True):
            a = rnd(rng, (6, 6), cx)
            a /= np.abs(np.linalg.eigvals(a)).max()
            for p in (0, 1, 2, 3, 7, 100):
                h = tw.matrix(a, dt(cx))
                self.assertEqual(getattr(tw.lib, "CxMatrixPower_head" if cx else "MatrixPower_head")(h, p), 0)
                self.assertLess(rel(h.numpy(), np.linalg.matrix_power(a, p)), 1e-12, (cx, p))
            singular = a.copy()
            singular[:, 2] = singular[:, 0] + singular[:, 1]
            for p in (-1, -3):
                h = tw.matrix(singular, dt(cx))
                self.assertEqual(getattr(tw.lib, "CxMatrixPower_head" if cx else "MatrixPower_head")(h, p), 0)
                want = np.linalg.matrix_power(np.linalg.pinv(singular), -p)
                self.assertLess(rel(h.numpy(), want), 1e-10)

    def test_characteristic_polynomial(self):
        rng = np.random.default_rng(10)
        for n in (1, 2, 5, 9):
            for cx in (False, True):
                a = rnd(rng, (n, n), cx)
                if n > 2:
                    a[:, 1] = a[:, 0]  # a zero eigenvalue stays a root
                c = tw.empty(dt(cx))
                if cx:
                    self.assertEqual(tw.lib.CxMatrixCharacteristicPoly_head(tw.matrix(a, C128), c), 0)
                else:
                    st = tw.i32(-1)
                    tw.lib.MatrixCharacteristicPoly_head(tw.matrix(a), c, st.ref)
                    self.assertEqual(st.value, 0)
                got, want = c.numpy(), np.poly(a)[::-1]
                # A zero eigenvalue leaves coefficients of rounding size that the bound does not cover.
                bound = np.abs(np.poly(-np.abs(np.linalg.eigvals(a)))[::-1])
                self.assertTrue(np.all(np.abs(got - want) <= 1e-10 * bound + 1e-14 * bound.max()), (n, cx))
                self.assertEqual(got[-1], 1.0)


class Generated(unittest.TestCase):
    def test_kronecker(self):
        rng = np.random.default_rng(11)
        for cx in (False, True):
            a, b, c = rnd(rng, (3, 4), cx), rnd(rng, (2, 5), cx), tw.empty(dt(cx), 2)
            f = tw.lib.CxKroneckerProd_H if cx else tw.lib.KroneckerProd_H
            self.assertEqual(f(tw.matrix(a, dt(cx)), tw.matrix(b, dt(cx)), c), 0)
            self.assertTrue(np.array_equal(c.numpy(), np.kron(a, b)))

    def test_special_matrices(self):
        rng = np.random.default_rng(12)
        for cx in (False, True):
            x, y = rnd(rng, 5, cx), rnd(rng, 3, cx)
            wants = [np.eye(4), np.diag(x), sl.toeplitz(x, y), np.vander(x), sl.companion(x)]
            for t, want in enumerate(wants):
                m, st = tw.empty(dt(cx), 2), tw.i32(-1)
                f = tw.lib.CxSpecialMatrix_head if cx else tw.lib.SpecialMatrix_head
                f(tw.i32(t).ref, tw.i32(4).ref, tw.array(x, dt(cx)), tw.array(y, dt(cx)), m, st.ref)
                self.assertEqual(st.value, 0)
                # NumPy's complex products and quotients may round differently from the plain
                # product and Smith's quotient.
                tol = 4 * EPS * np.abs(want).max() if cx and t >= 3 else 0
                self.assertLessEqual(np.abs(m.numpy() - want).max(), tol, (cx, t))


def data_rows(rec, start, m, times):
    """Rows x[k], x[k-1], ..., x[k-m] of the record rec (index start is time 0), zeros outside."""
    return np.array([[rec[start + t - j] if 0 <= start + t - j < len(rec) else 0 for j in range(m + 1)]
                     for t in times])


def data_matrix(x, m, kind):
    n = len(x)
    times = {0: range(0, n + m), 1: range(0, n), 2: range(m, n + m), 3: range(m, n), 4: range(m, n)}[kind]
    x_ = data_rows(x, 0, m, times)
    if kind == 4:
        x_ = np.vstack([x_, x_[:, ::-1].conj()])
    return x_ / np.sqrt(len(x_))


class AutoCorr(unittest.TestCase):
    def run_block(self, x, prev, m, kind, count, r=None):
        cx = np.iscomplexobj(x)
        rh = tw.matrix(r, dt(cx)) if r is not None else tw.empty(dt(cx), 2)
        xh, c, p = tw.empty(dt(cx), 2), tw.i32(count), tw.array(prev, dt(cx))
        f = tw.lib.CxAutoCorrMtrxH if cx else tw.lib.AutoCorrMtrxH
        self.assertEqual(f(tw.array(x, dt(cx)), p, rh, xh, m, kind, c.ref, tw.i32(0).ref), 0)
        return rh.numpy(), xh.numpy(), c.value, p.numpy()

    def test_every_type(self):
        rng = np.random.default_rng(13)
        for cx in (False, True):
            for kind in range(5):
                for n, m in ((9, 3), (6, 0), (4, 3)):
                    x = rnd(rng, n, cx)
                    r, xm, count, prev = self.run_block(x, np.zeros(m), m, kind, 0)
                    want = data_matrix(x, m, kind)
                    self.assertLess(np.abs(xm - want).max(), 4 * EPS)
                    self.assertLess(np.abs(r - want.conj().T @ want).max(), 16 * EPS * np.abs(r).max())
                    self.assertEqual(count, n)
                    self.assertTrue(np.array_equal(prev, x[n - m:]))

    def test_streaming(self):
        # Each continuing block adds the rows of its times (delays reach into the previous block)
        # to count R and divides by the new count; for type 1 that is the estimate of the whole.
        rng = np.random.default_rng(14)
        m = 3
        for cx in (False, True):
            x = rnd(rng, 23, cx)
            for cuts in ((10,), (7, 15)):
                for kind in range(5):
                    blocks = np.split(x, cuts)
                    r, _, count, prev = self.run_block(blocks[0], np.zeros(m), m, kind, 0)
                    w = data_matrix(blocks[0], m, kind)
                    want = w.conj().T @ w
                    for b in blocks[1:]:
                        start = count
                        r, xm, count, prev = self.run_block(b, prev, m, kind, count, r)
                        f = data_rows(x, start, m, range(len(b)))
                        want = (start * want + f.conj().T @ f) / count
                    self.assertEqual(count, len(x))
                    self.assertLess(np.abs(r - want).max(), 1e-14, (cx, cuts, kind))
                    if kind == 1:
                        whole = data_matrix(x, m, 1)
                        self.assertLess(np.abs(r - whole.conj().T @ whole).max(), 1e-14)


def checks(a, tol=-1.0, relative=0, hermitian=1):
    """(symmetric, positive definite, (semidefinite, rank)) with the statuses all 0."""
    cx = np.iscomplexobj(a)
    h = tw.matrix(a, dt(cx))
    sym, pd, psd, rank, st = tw.i32(-1), tw.i32(-1), tw.i32(-1), tw.i32(-1), tw.i32(-1)
    if cx:
        rc = tw.lib.CxCheckSym_head(h, D(tol), relative, hermitian, sym.ref)
        tw.lib.CxCheckPosdef_head(h, pd.ref, st.ref)
        rc2 = tw.lib.CxCheckPosSemiDef_head(h, D(tol), psd.ref, rank.ref)
    else:
        rc = tw.lib.CheckSym_head(h, D(tol), relative, sym.ref)
        tw.lib.CheckPosdef_head(h, pd.ref, st.ref)
        rc2 = tw.lib.CheckPosSemiDef_head(h, D(tol), psd.ref, rank.ref)
    assert (rc, st.value, rc2) == (0, 0, 0)
    return sym.value, pd.value, (psd.value, rank.value)


class Checks(unittest.TestCase):
    def test_table(self):
        spd = np.array([[4.0, 1.0], [1.0, 3.0]])
        ulp = spd.copy()
        ulp[0, 1] = np.nextafter(1.0, 2.0)
        herm = np.array([[2.0, 1 + 1j], [1 - 1j, 3.0]])
        csym = np.array([[2.0, 1j], [1j, 3.0]])
        g = np.random.default_rng(15).standard_normal((6, 3))
        cases = [
            # matrix, tol, relative, hermitian, (sym, posdef, (psd, rank))
            (spd, -1.0, 0, 1, (1, 1, (1, 2))),
            (ulp, -1.0, 0, 1, (0, 0, (1, 2))),  # exact tests fail on one ulp, the scaled ones pass
            (ulp, -1.0, 1, 1, (1, 0, (1, 2))),
            (herm, 0.0, 0, 1, (1, 1, (1, 2))),
            (herm, 0.0, 0, 0, (0, 1, (1, 2))),
            (csym, 0.0, 0, 0, (1, 0, (0, -1))),
            (csym, 0.0, 0, 1, (0, 0, (0, -1))),
            (np.array([[0.0, 1.0], [1.0, 0.0]]), -1.0, 0, 1, (1, 0, (0, -1))),
            (-spd, -1.0, 0, 1, (1, 0, (0, -1))),
            (g @ g.T, -1.0, 1, 1, (1, 0, (1, 3))),
            (np.zeros((3, 3)), -1.0, 0, 1, (1, 0, (1, 0))),
        ]
        for a, tol, relative, hermitian, want in cases:
            self.assertEqual(checks(a, tol, relative, hermitian), want, a)

    def test_random_against_eigenvalues(self):
        rng = np.random.default_rng(16)
        for cx in (False, True):
            for k in (2, 3, 6):
                g = rnd(rng, (6, k), cx)
                a = g @ g.conj().T
                a = (a + a.conj().T) / 2  # exactly Hermitian
                _, pd, (psd, rank) = checks(a)
                self.assertEqual(pd, int(np.linalg.eigvalsh(a).min() > 0))
                self.assertEqual((psd, rank), (1, k), (cx, k))


def lyapunov(a, q, form=0, kind=0):
    cx = np.iscomplexobj(a) or np.iscomplexobj(q)
    h, sc = tw.matrix(q, dt(cx)), tw.f64()
    f = tw.lib.CxLyapunov85_head if cx else tw.lib.Lyapunov85_head
    rc = f(tw.matrix(a, dt(cx)), h, form, kind, sc.ref)
    return rc, h.numpy(), sc.value


def sylvester(a, b, c, ta, tb, sign, form=0):
    cx = np.iscomplexobj(a) or np.iscomplexobj(c)
    h, sc, pt = tw.matrix(c, dt(cx)), tw.f64(), tw.i32(-1)
    f = tw.lib.CxSylvester81_head if cx else tw.lib.Sylvester81_head
    rc = f(tw.matrix(a, dt(cx)), tw.matrix(b, dt(cx)), h, ta, tb, sign, form, sc.ref, pt.ref)
    return rc, h.numpy(), sc.value, pt.value


def op(z, t):
    return z.conj().T if t else z


def quasi_triangular(rng, n, first, cx, shift=0.0):
    """Schur form with the given leading eigenvalues, then (real) 2 by 2 blocks of complex pairs
    or (complex) a triangle, the rest of the spectrum shifted clear of the leading values."""
    a = np.triu(rnd(rng, (n, n), cx), 1) * 0.3
    k = len(first)
    a[np.arange(k), np.arange(k)] = first
    for i in range(k, n - 1, 2):
        re, im = 3.0 + i + shift, 1.0 + 0.1 * i
        a[i:i + 2, i:i + 2] = [[re, im], [0.0 if cx else -im, re]]
    if (n - k) % 2:
        a[n - 1, n - 1] = 3.5 + n + shift
    return a


def min_norm(k, b, rcond):
    """Minimum-norm least squares; a complex system goes through its real embedding, as the
    library does (the rank decision at the cut-off can differ from the complex one)."""
    if not np.iscomplexobj(k):
        return np.linalg.lstsq(k, b, rcond=rcond)[0]
    e = np.block([[k.real, -k.imag], [k.imag, k.real]])
    r = np.linalg.lstsq(e, np.r_[b.real, b.imag], rcond=rcond)[0]
    return r[:len(b)] + 1j * r[len(b):]


class Equations(unittest.TestCase):
    def test_lyapunov(self):
        rng = np.random.default_rng(17)
        for n in (1, 3, 10):
            for cx in (False, True):
                a, q = rnd(rng, (n, n), cx), rnd(rng, (n, n), cx)
                for form in (0, 1):
                    if form == 1:
                        a = sl.schur(a, output="complex" if cx else "real")[0]
                    rc, x, s = lyapunov(a, q, form)
                    want = sl.solve_continuous_lyapunov(a, q)
                    # The complex general form returns X^H (X itself for a Hermitian Q).
                    want = want.conj().T if cx and form == 0 else want
                    self.assertEqual((rc, s), (0, 1.0))
                    self.assertLess(rel(x, want), 1e-12 * np.linalg.cond(a), (n, cx, form))
                    rc, x, s = lyapunov(a, q, form, 1)
                    want = -sl.solve_discrete_lyapunov(a, q)
                    want = want.conj().T if cx and form == 0 else want
                    self.assertEqual(rc, 0)
                    self.assertLess(rel(x, want), 1e-11 * np.linalg.cond(a + np.eye(n)), (n, cx, form))

    def test_sylvester_every_trans_and_sign(self):
        rng = np.random.default_rng(18)
        for m, n in ((1, 1), (3, 5), (6, 2)):
            for cx in (False, True):
                a, b, c = rnd(rng, (m, m), cx), rnd(rng, (n, n), cx), rnd(rng, (m, n), cx)
                ta_, tb_ = (sl.schur(z, output="complex" if cx else "real")[0] for z in (a, b))
                for ta in (0, 1):
                    for tb in (0, 1):
                        for sign in (1, -1):
                            for form, (x, y) in ((0, (a, b)), (1, (ta_, tb_))):
                                rc, got, s, pt = sylvester(x, y, c, ta, tb, sign, form)
                                want = sl.solve_sylvester(op(x, ta), sign * op(y, tb), c)
                                self.assertEqual((rc, s, pt), (0, 1.0, 0))
                                self.assertLess(rel(got, want), 1e-12, (m, n, cx, ta, tb, sign, form))

    def test_close_eigenvalues(self):
        # Exactly coinciding eigenvalues (lA + lB = 0): the Kronecker route gives the minimum-norm
        # least-squares solution; the column method (larger sizes, 1 by 1 and 2 by 2 blocks) a
        # solution of the consistent system.
        rng = np.random.default_rng(19)
        for cx in (False, True):
            for n in (4, 26 if cx else 41):
                a = quasi_triangular(rng, n, [1.0, -1.0], cx)
                x0 = rnd(rng, (n, n), cx)
                x0 = x0 + x0.conj().T
                q = a @ x0 + x0 @ a.conj().T
                for form in (0, 1):
                    rc, x, s = lyapunov(a, q, form)
                    self.assertEqual((rc, s), (0, 1.0))
                    self.assertLess(rel(a @ x + x @ a.conj().T, q), 1e-13)
                    if n == 4:
                        k = np.kron(np.eye(n), a) + np.kron(a.conj(), np.eye(n))
                        w = min_norm(k, q.reshape(-1, order="F"), n * n * EPS)
                        self.assertLess(rel(x, w.reshape(n, n, order="F")), 1e-13)
            # Either side of the size limit of the dense system: every selector on small sizes, a
            # covering subset on the large ones.
            small = [(t, u, g) for t in (0, 1) for u in (0, 1) for g in (1, -1)]
            large = [(0, 0, 1), (1, 1, -1), (0, 1, -1), (1, 0, 1)]
            for m, n in ((3, 5), (5, 3), (20, 40) if cx else (40, 40), (21, 40) if cx else (40, 41)):
                dense = m * n < (801 if cx else 1601)
                for case, (ta, tb, sign) in enumerate(small if m * n < 100 else large):
                    a = quasi_triangular(rng, m, [-sign * 2.0], cx)
                    b = quasi_triangular(rng, n, [2.0], cx, shift=100.0)
                    x0 = rnd(rng, (m, n), cx)
                    c = op(a, ta) @ x0 + sign * x0 @ op(b, tb)
                    rc, x, s, pt = sylvester(a, b, c, ta, tb, sign, 1)
                    self.assertEqual((rc, s, pt), (0, 1.0, 1), (m, n, cx, ta, tb, sign))
                    self.assertLess(rel(op(a, ta) @ x + sign * x @ op(b, tb), c), 1e-13)
                    if dense and (m * n < 100 or case == 0):
                        k = np.kron(np.eye(n), op(a, ta)) + sign * np.kron(op(b, tb).T, np.eye(m))
                        w = min_norm(k, c.reshape(-1, order="F"), m * n * EPS)
                        self.assertLess(rel(x, w.reshape(m, n, order="F")), 1e-12)

if __name__ == "__main__":
    unittest.main()
