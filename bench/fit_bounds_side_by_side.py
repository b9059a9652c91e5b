"""Confidence and prediction bounds beside a vectorised NumPy rendering of the same bands, in one
run: median wall time of each at n = 1e6, and the ratio.

Usage: PYTHONPATH=python TWANLYS_LIB_DIR=build /usr/bin/python3 bench/fit_bounds_side_by_side.py [repeats]
"""
import ctypes
import statistics
import sys
import time

import numpy as np
import scipy.linalg
import scipy.stats

from twanlys import lowlevel as tw

D, P = ctypes.c_double, ctypes.c_void_p
DP = ctypes.POINTER(ctypes.c_double)
MODELS = {"Linear": 2, "Exp": 2, "Power": 2, "Log": 2, "Gauss": 3}
for m, p in MODELS.items():
    base = [D] if m == "Log" else []
    getattr(tw.lib, f"ConfBnd{m}_head").argtypes = [P, P, P] + base + [D] * p + [D, P, P, P, P] + [DP] * p
    getattr(tw.lib, f"PredBnd{m}_head").argtypes = [P, P, P] + base + [D] * p + [D, P, P]
tw.lib.ConfBndPoly_head.argtypes = [P, P, P, P, D, P, P, P, P, P]
tw.lib.PredBndPoly_head.argtypes = [P, P, P, P, D, P, P]
REPEATS = int(sys.argv[1]) if len(sys.argv) > 1 else 5
LEVEL = 0.95


def median_time(fn):
    times = []
    for _ in range(REPEATS):
        t = time.perf_counter()
        fn()
        times.append(time.perf_counter() - t)
    return statistics.median(times)


def model(name, x, p):
    if name == "Linear":
        return p[0] * x + p[1], np.c_[np.ones_like(x), x]
    if name == "Exp":
        e = np.exp(p[1] * x)
        return p[0] * e, np.c_[e, p[0] * x * e]
    if name == "Power":
        q = x ** p[1]
        return p[0] * q, np.c_[q, p[0] * q * np.log(x)]
    if name == "Log":
        l = np.log10(p[1] * x)
        return p[0] * l, np.c_[l, np.full_like(x, p[0] / (p[1] * np.log(10.0)))]
    if name == "Gauss":
        z = (x - p[1]) / p[2]
        e = np.exp(-0.5 * z * z)
        return p[0] * e, np.c_[e, p[0] * z * e / p[2], p[0] * z * z * e / p[2]]
    v = np.vander(x, len(p), increasing=True)
    return v @ p, v


def numpy_bands(name, x, y, w, p, prediction):
    f, j = model(name, x, p)
    n, k = j.shape
    aw = np.abs(w)
    s2 = np.sum(((f - 2 * y) * f + y * y) * aw) / (n - k)
    t = scipy.stats.t.ppf(1 - (1 - LEVEL) * 0.5, n - k)
    if name == "Poly" and not prediction:
        _, s, vt = np.linalg.svd(j * np.sqrt(aw)[:, None], full_matrices=False)
        c = (vt.T / s**2) @ vt
    else:
        c = scipy.linalg.pinv(j.T @ (aw[:, None] * j))
    q = np.sum((j @ c) * j, axis=1)
    d = np.sqrt((q + 1 / aw) * s2) * t if prediction else np.sqrt(q * s2) * t
    if not prediction:
        delta = np.sqrt(np.diag(c)) * t * np.sqrt(s2)
        return f + d, f - d, p + delta, p - delta
    return f + d, f - d


def main():
    rng = np.random.default_rng(3)
    n = 10**6
    cases = {"Linear": (np.linspace(-1, 1, n), [1.7, -0.4]), "Exp": (np.linspace(0.1, 3, n), [2.0, -0.6]),
             "Power": (np.linspace(0.1, 3, n), [1.5, 1.3]), "Log": (np.linspace(0.1, 3, n), [2.0, 3.0]),
             "Gauss": (np.linspace(-3, 5, n), [2.5, 0.8, 1.3]), "Poly": (np.linspace(-1, 1, n), [0.5, -1.0, 0.3, 0.2])}
    print(f"n = {n}, weighted, level {LEVEL}, median of {REPEATS}")
    for name, (x, p) in cases.items():
        p = np.array(p)
        y = model(name, x, p)[0] + rng.normal(0, 0.05, n)
        w = rng.uniform(0.5, 2, n)
        yh, xh, wh, ph = tw.array(y), tw.array(x), tw.array(w), tw.array(p)
        outs = [tw.empty() for _ in range(5)]
        d = [tw.f64() for _ in p]
        base = [10.0] if name == "Log" else []
        for prediction in (False, True):
            kind = "PredBnd" if prediction else "ConfBnd"
            fn = getattr(tw.lib, f"{kind}{name}_head")
            if name == "Poly":
                args = [yh, xh, wh, ph, LEVEL] + (outs[:2] if prediction else outs)
            else:
                args = [yh, xh, wh] + base + list(p) + [LEVEL] + outs[:2] + ([] if prediction else
                                                                              outs[2:4] + [v.ref for v in d])
            assert fn(*args) == 0
            ours = median_time(lambda: fn(*args))
            theirs = median_time(lambda: numpy_bands(name, x, y, w, p, prediction))
            print(f"{kind + name + '_head':<20} twanlys {ours * 1e3:8.2f} ms   NumPy {theirs * 1e3:8.2f} ms   "
                  f"ratio {ours / theirs:5.2f}")


if __name__ == "__main__":
    main()
