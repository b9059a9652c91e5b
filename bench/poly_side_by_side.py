#!/usr/bin/python3
# Usage: PYTHONPATH=python /usr/bin/python3 bench/poly_side_by_side.py <build dir>
"""Polynomial exports beside NumPy in one session: power-form evaluation against polyval, products
against np.convolve, all roots, multiple roots and divisors against np.roots. Median CPU times of
the export calls alone (handles are made outside the timing) and the ratios."""
import ctypes
import os
import sys
import time

build = sys.argv[1] if len(sys.argv) > 1 else "build"
os.environ["TWANLYS_LIB_DIR"] = os.path.abspath(build)

import numpy as np  # noqa: E402
from numpy.polynomial import polynomial as npp  # noqa: E402

from twanlys import lowlevel as tw  # noqa: E402

L = tw.lib
D, P, I32 = ctypes.c_double, ctypes.c_void_p, ctypes.c_int32
L.MultPolyRoots_head.argtypes = [P, I32, D, P, P, P]
L.PolyGCD_H.argtypes = [P, P, D, P, P, P, P]


def median_seconds(make, call, runs):
    times = []
    for _ in range(runs):
        args = make()
        t = time.process_time()
        call(*args)
        times.append(time.process_time() - t)
    return sorted(times)[runs // 2]


def polyev(x, c):
    st = tw.i32()
    L.PolyEv(x, c, st.ref)
    assert st.value == 0


def cxroots(h):
    opt, st = tw.i32(0), tw.i32()
    L.CxPolyRoots_head(h, opt.ref, st.ref)
    assert st.value == 0


def multroots(h):
    r, m, res = tw.empty(complex), tw.empty(np.int32), tw.f64()
    assert L.MultPolyRoots_head(h, 0, 0.0, r, res.ref, m) == 0


def gcd(a, b):
    g, u, v, res = tw.empty(), tw.empty(), tw.empty(), tw.f64()
    assert L.PolyGCD_H(a, b, 0.0, g, u, v, res.ref) == 0


rng = np.random.default_rng(0)
rows = []
for aligned in (0, 1):
    tw.placement(aligned)
    where = "aligned" if aligned else "packed"
    x, c = rng.uniform(-1, 1, 10**6), rng.normal(size=11)
    ch = tw.array(c)
    rows.append(("PolyEv 1e6 x, degree 10 / polyval (%s)" % where,
                 median_seconds(lambda: (tw.array(x), ch), polyev, 9),
                 median_seconds(lambda: (), lambda: npp.polyval(x, c), 9)))
    a, b = rng.normal(size=1000), rng.normal(size=1000)
    rows.append(("MultiplyPolyH 1000 x 1000 / np.convolve (%s)" % where,
                 median_seconds(lambda: (tw.array(a), tw.array(b), tw.empty(complex)), L.MultiplyPolyH, 21),
                 median_seconds(lambda: (), lambda: np.convolve(a, b), 21)))
tw.placement(0)
for deg in (20, 100, 500):
    c = rng.normal(size=deg + 1)
    runs = 5 if deg == 500 else 11
    rows.append(("CxPolyRoots_head degree %d / np.roots" % deg,
                 median_seconds(lambda: (tw.array(c, complex),), cxroots, runs),
                 median_seconds(lambda: (), lambda: np.roots(c[::-1]), runs)))
for deg in (10, 30):
    # Multiple roots: a third of the degree in double roots, the rest simple.
    k = deg // 3
    roots = np.concatenate([np.repeat(rng.uniform(-2, 2, k), 2), rng.uniform(-2, 2, deg - 2 * k)])
    c = npp.polyfromroots(roots)
    rows.append(("MultPolyRoots_head degree %d / np.roots" % deg,
                 median_seconds(lambda: (tw.array(c),), multroots, 5),
                 median_seconds(lambda: (), lambda: np.roots(c[::-1]), 5)))
    common = rng.uniform(-2, 2, deg // 2)
    fa = npp.polyfromroots(np.concatenate([common, rng.uniform(-2, 2, deg - deg // 2)]))
    fb = npp.polyfromroots(np.concatenate([common, rng.uniform(-2, 2, deg - deg // 2)]))
    rows.append(("PolyGCD_H degree %d / np.roots of a" % deg,
                 median_seconds(lambda: (tw.array(fa), tw.array(fb)), gcd, 5),
                 median_seconds(lambda: (), lambda: np.roots(fa[::-1]), 5)))

print("%-52s %11s %11s %8s" % ("case", "ours ms", "peer ms", "ratio"))
for name, ours, peer in rows:
    print("%-52s %11.3f %11.3f %8.2f" % (name, ours * 1e3, peer * 1e3, ours / peer))
