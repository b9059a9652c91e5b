#!/usr/bin/python3
# Usage: OPENBLAS_NUM_THREADS=1 PYTHONPATH=python /usr/bin/python3 bench/eigen_side_by_side.py <build dir>
"""Eigenproblems beside SciPy/NumPy on the same LAPACK, in one session: Schur forms, QZ, the own
double-shift QR and the own tridiagonal QL. Prints median CPU times and the ratios."""
import os
import sys
import time

build = sys.argv[1] if len(sys.argv) > 1 else "build"
os.environ["TWANLYS_LIB_DIR"] = os.path.abspath(build)

import numpy as np  # noqa: E402
import scipy.linalg as sl  # noqa: E402

from twanlys import lowlevel as tw  # noqa: E402

C = np.complex128


def median_seconds(f, runs):
    times = []
    for _ in range(runs):
        t = time.process_time()
        f()
        times.append(time.process_time() - t)
    return sorted(times)[runs // 2]


def schur(a, order):
    h, q, v = tw.matrix(a), tw.empty(float, 2), tw.empty(C)
    assert tw.lib.Schur80_head(h, 1, order, q, v) == 0


def qz(a, b):
    outs = tw.matrix(a), tw.matrix(b), tw.empty(C), tw.empty(), tw.empty(C, 2)
    assert tw.lib.QZ80_head(outs[0], outs[1], 1, 0, *outs[2:]) == 0


def eig(a):
    h, o, v, z, st = tw.matrix(a), tw.i32(1), tw.empty(C), tw.empty(C, 2), tw.i32()
    tw.lib.EigenValueVector_head(h, o.ref, v, z, st.ref)
    assert st.value == 0


def sym(a, output):
    h, o, v, st = tw.matrix(a), tw.i32(output), tw.empty(), tw.i32()
    tw.lib.SymEvectorEvalue_head(h, o.ref, v, st.ref)
    assert st.value == 0


rng = np.random.default_rng(0)
print("%-44s %5s %10s %10s %7s" % ("case", "n", "ours ms", "peer ms", "ratio"))
for n in (100, 200, 500):
    runs = 7 if n < 500 else 3
    a, b = rng.standard_normal((n, n)), rng.standard_normal((n, n))
    s = a + a.T
    cases = []
    if n == 200:
        cases.append(("Schur80_head order 4 / schur", lambda: schur(a, 4), lambda: sl.schur(a)))
    else:
        cases += [
            ("Schur_head / schur", lambda: schur(a, 0), lambda: sl.schur(a)),
            ("QZ80_head mode 1 / eig(A, B)", lambda: qz(a, b), lambda: sl.eig(a, b)),
            ("EigenValueVector_head / numpy eig", lambda: eig(a), lambda: np.linalg.eig(a)),
            ("SymEvectorEvalue_head vectors / eigh ev", lambda: sym(s, 1), lambda: sl.eigh(s, driver="ev")),
            ("SymEvectorEvalue_head values / eigh ev", lambda: sym(s, 0),
             lambda: sl.eigh(s, driver="ev", eigvals_only=True)),
            ("SymEvectorEvalue_head vectors / numpy eigh", lambda: sym(s, 1), lambda: np.linalg.eigh(s)),
        ]
    for name, ours, peer in cases:
        o, p = median_seconds(ours, runs), median_seconds(peer, runs)
        print("%-44s %5d %10.2f %10.2f %7.2f" % (name, n, 1e3 * o, 1e3 * p, o / p))
