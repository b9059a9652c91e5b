#!/usr/bin/python3
# Usage: OPENBLAS_NUM_THREADS=1 PYTHONPATH=python /usr/bin/python3 bench/matfunc_side_by_side.py <build dir>
"""Matrix functions and equations beside SciPy/NumPy on the same LAPACK, in one session. Prints
median CPU times and the ratios."""
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


def inplace(name, a, *args):
    h, st = tw.matrix(a), tw.i32(-1)
    getattr(tw.lib, name)(h, *args, st.ref)
    assert st.value >= 0


def to_complex(name, a):
    h, b = tw.matrix(a), tw.empty(C, 2)
    if name == "MatrixSqrtH":
        assert tw.lib.MatrixSqrtH(h, b) >= 0
    else:
        st = tw.i32(-1)
        tw.lib.MatrixLn_head(h, b, st.ref)
        assert st.value >= 0


def power(a, p):
    assert tw.lib.MatrixPower_head(tw.matrix(a), p) == 0


def kron(a, b):
    assert tw.lib.KroneckerProd_H(tw.matrix(a), tw.matrix(b), tw.empty(float, 2)) == 0


def sylvester(a, b, c):
    sc, pt = tw.f64(), tw.i32()
    assert tw.lib.Sylvester81_head(tw.matrix(a), tw.matrix(b), tw.matrix(c), 0, 0, 1, 0, sc.ref, pt.ref) == 0


def lyapunov(a, q, kind):
    sc = tw.f64()
    assert tw.lib.Lyapunov85_head(tw.matrix(a), tw.matrix(q), 0, kind, sc.ref) == 0


def scaled(rng, n, norm):
    a = rng.standard_normal((n, n))
    return a * (norm / np.abs(a).sum(axis=1).max())


rng = np.random.default_rng(0)
print("%-46s %5s %10s %10s %7s" % ("case", "n", "ours ms", "peer ms", "ratio"))
for n in (100, 200, 500):
    runs = 7 if n < 500 else 3
    a, b, c = rng.standard_normal((n, n)), rng.standard_normal((n, n)), rng.standard_normal((n, n))
    stable = a - 1.1 * np.abs(np.linalg.eigvals(a)).max() * np.eye(n)
    contractive = a / (1.1 * np.abs(np.linalg.eigvals(a)).max())
    spd = a @ a.T + n * np.eye(n)
    cases = []
    if n == 200:
        cases.append(("MatrixLn_head / logm", lambda: to_complex("MatrixLn_head", spd), lambda: sl.logm(spd)))
    else:
        for norm in (1.0, 10.0, 100.0):
            e = scaled(rng, n, norm)
            cases.append(("MatrixExp_head norm %g / expm" % norm,
                          lambda e=e: inplace("MatrixExp_head", e), lambda e=e: sl.expm(e)))
        cases += [
            ("MatrixSqrtH / sqrtm", lambda: to_complex("MatrixSqrtH", a), lambda: sl.sqrtm(a)),
            ("Sylvester81_head form 0 / solve_sylvester", lambda: sylvester(a, b, c),
             lambda: sl.solve_sylvester(a, b, c)),
            ("Lyapunov85_head continuous / solve_cont.", lambda: lyapunov(stable, c, 0),
             lambda: sl.solve_continuous_lyapunov(stable, c)),
            ("Lyapunov85_head discrete / solve_discrete", lambda: lyapunov(contractive, c, 1),
             lambda: sl.solve_discrete_lyapunov(contractive, c)),
            ("MatrixPower_head p 100 / matrix_power", lambda: power(contractive, 100),
             lambda: np.linalg.matrix_power(contractive, 100)),
        ]
    if n == 100:
        k1, k2 = rng.standard_normal((50, 50)), rng.standard_normal((50, 50))
        cases.append(("KroneckerProd_H 50x50 by 50x50 / kron", lambda: kron(k1, k2), lambda: np.kron(k1, k2)))
    for name, ours, peer in cases:
        t1, t2 = median_seconds(ours, runs), median_seconds(peer, runs)
        print("%-46s %5d %10.2f %10.2f %7.2f" % (name, n, 1e3 * t1, 1e3 * t2, t1 / t2), flush=True)
