"""Cosine and sine transforms against scipy.fft, and their frame rules."""
import ctypes
import sys
import unittest

import numpy as np
import scipy.fft as sf

from twanlys import lowlevel as tw

lib = tw.lib
EPS = 2.0 ** -52
I = ctypes.c_int32
WORST = {}

# name: (oracle of the forward or inverse transform of x to length n, takes a size argument)
ONE_D = {
    "DCT_1DH": (lambda x, n: sf.dct(x, 2, n=n, norm="ortho"), True),
    "InvDCT_1DH": (lambda x, n: sf.idct(x, 2, norm="ortho"), False),
    "DST_1DH": (lambda x, n: 0.5 * sf.dst(x, 1, n=n), True),
    "InvDST_1DH": (lambda x, n: 2 * sf.idst(x, 1), False),
}
TWO_D = {
    "DCT_2DH": (lambda x, s: sf.dctn(x, 2, s=s, norm="ortho"), True),
    "InvDCT_2DH": (lambda x, s: sf.idctn(x, 2, norm="ortho"), False),
    "DST_2DH": (lambda x, s: 0.25 * sf.dstn(x, 1, s=s), True),
    "InvDST_2DH": (lambda x, s: 4 * sf.idstn(x, 1), False),
}
INVERSE = {"DCT_1DH": "InvDCT_1DH", "DST_1DH": "InvDST_1DH", "DCT_2DH": "InvDCT_2DH", "DST_2DH": "InvDST_2DH"}
# Lengths whose tables (n, 2n or 2n+2) reach odd, Rader and large smooth stages.
LARGE = (500, 1000, 1009, 1024, 4095, 4096, 10007, 65536)


def rel_error(got, want):
    scale = np.max(np.abs(want))
    return np.max(np.abs(got - want)) / (scale if scale > 0 else 1.0)


def tolerance(n):
    # Measured worst: 35 eps, a round trip at n = 10007 through two Rader stages; a margin of 3.
    return 8 * EPS * max(2.0, np.log2(n))


class Cell:
    def __init__(self):
        self.c = ctypes.c_void_p(None)
        self.ref = ctypes.byref(self.c)


def run1(name, x, size=0, cell=None, idp=False):
    a, y = tw.array(x), tw.empty()
    args = (a, y) + ((I(size),) if ONE_D[name][1] else ()) + (cell.ref if cell else None,)
    status = getattr(lib, name + ("_IDP" if idp else ""))(*args)
    return status, y.numpy()


def run2(name, x, rows=0, cols=0, cells=(None, None), idp=False):
    a, y = tw.matrix(x), tw.empty(dims=2)
    sizes = (I(rows), I(cols)) if TWO_D[name][1] else ()
    refs = tuple(c.ref if c else None for c in cells)
    status = getattr(lib, name + ("_IDP" if idp else ""))(a, y, *sizes, *(refs[:1] if idp else refs))
    return status, y.numpy()


class OneD(unittest.TestCase):
    def check(self, name, n, got, want):
        err = rel_error(got, want)
        key = (name, "n<=64" if n <= 64 else "large")
        if err >= WORST.get(key, (-1.0, 0))[0]:
            WORST[key] = (err, n)
        self.assertLess(err, tolerance(n), "%s n=%d" % (name, n))

    def test_against_scipy_and_round_trips(self):
        rng = np.random.default_rng(6)
        cell = Cell()
        for n in list(range(1, 65)) + list(LARGE):
            x = rng.standard_normal(n)
            for name, (oracle, _) in ONE_D.items():
                s, y = run1(name, x, cell=cell)
                self.assertEqual(s, 0)
                self.check(name, n, y, oracle(x, n))
                if name in INVERSE:
                    s, back = run1(INVERSE[name], y, cell=cell)
                    self.assertEqual(s, 0)
                    self.check(name + " round trip", n, back, x)

    def test_size_cuts_or_pads(self):
        rng = np.random.default_rng(7)
        for name in ("DCT_1DH", "DST_1DH"):
            oracle = ONE_D[name][0]
            for count, size in [(10, 4), (10, 5), (7, 12), (7, 13), (1, 6), (6, 1), (33, 0), (33, -4)]:
                x = rng.standard_normal(count)
                s, y = run1(name, x, size)
                self.assertEqual(s, 0)
                n = size if size > 0 else count
                self.assertEqual(len(y), n)
                self.check(name, n, y, oracle(x, n))

    def test_constant_gives_root_n_at_zero(self):
        for n in (1, 2, 3, 4, 5, 16, 17, 1000, 1001):
            s, y = run1("DCT_1DH", np.full(n, 2.5))
            self.assertEqual(s, 0)
            self.assertAlmostEqual(y[0], 2.5 * np.sqrt(n), delta=4 * EPS * 2.5 * np.sqrt(n) * np.log2(2 * n))
            self.assertLess(np.max(np.abs(y[1:]), initial=0), 8 * EPS * 2.5 * np.sqrt(n) * np.log2(2 * n))


class TwoD(unittest.TestCase):
    def check(self, name, shape, got, want):
        err = rel_error(got, want)
        key = (name, "2-D")
        if err >= WORST.get(key, (-1.0, 0))[0]:
            WORST[key] = (err, shape[0] * shape[1])
        self.assertLess(err, tolerance(max(shape)) * 2, "%s %s" % (name, shape))

    def test_separable_forms_against_scipy(self):
        rng = np.random.default_rng(10)
        cells = (Cell(), Cell())
        for r, c in [(1, 1), (1, 7), (6, 1), (4, 4), (5, 8), (9, 3), (16, 15), (53, 20)]:
            x = rng.standard_normal((r, c))
            for name, (oracle, sized) in TWO_D.items():
                s, y = run2(name, x, cells=cells)
                self.assertEqual(s, 0)
                self.assertEqual(y.shape, (r, c))
                self.check(name, (r, c), y, oracle(x, (r, c)))
                if name in INVERSE:
                    s, back = run2(INVERSE[name], y, cells=cells)
                    self.assertEqual(s, 0)
                    self.check(name + " round trip", (r, c), back, x)

    def test_rows_and_cols_cut_or_pad(self):
        rng = np.random.default_rng(11)
        x = rng.standard_normal((6, 9))
        for name in ("DCT_2DH", "DST_2DH"):
            for rows, cols in [(3, 4), (8, 12), (4, 11), (9, 5), (0, 5), (7, 0), (-1, -1)]:
                shape = (rows if rows > 0 else 6, cols if cols > 0 else 9)
                for idp in (False, True):
                    cell = Cell()
                    s, y = run2(name, x, rows, cols, cells=(cell, Cell()), idp=idp)
                    self.assertEqual(s, 0)
                    self.assertEqual(y.shape, shape)
                    self.check(name, shape, y, TWO_D[name][0](x, shape))
                    if idp:
                        self.assertEqual(lib.TransformUnreserveProc(cell.ref), 0)


def tearDownModule():
    if WORST:
        sys.stderr.write("\nworst relative error (max |error| / max |reference|):\n")
        for (name, cls), (err, n) in sorted(WORST.items()):
            sys.stderr.write("  %-26s %-6s %.2e (n=%d, %.1f eps)\n" % (name, cls, err, n, err / EPS))


if __name__ == "__main__":
    unittest.main()
