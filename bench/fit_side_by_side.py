"""Fitting exports beside NumPy/SciPy in one run: median wall time of each, and the ratio.

Usage: PYTHONPATH=python TWANLYS_LIB_DIR=build /usr/bin/python3 bench/fit_side_by_side.py [repeats]
"""
import ctypes
import statistics
import sys
import time

import numpy as np
import scipy.optimize
import scipy.stats

from twanlys import lowlevel as tw

D, I32, P = ctypes.c_double, ctypes.c_int32, ctypes.c_void_p
DP, IP = ctypes.POINTER(ctypes.c_double), ctypes.POINTER(ctypes.c_int32)
tw.lib.LinFit_head.argtypes = [P, P, P, DP, DP, DP]
tw.lib.PolyFit_head.argtypes = [P, P, I32, I32, P, P, DP]
tw.lib.GenLSFit80_head.argtypes = [P, P, P, I32, I32, P, P, P, DP]
tw.lib.ExpFit80_head.argtypes = [P, P, P, D, P, ctypes.c_uint16, DP, DP, DP, IP, D]
tw.lib.PowerFit_head.argtypes = [P, P, P, D, P, DP, DP, DP, IP, D]
tw.lib.GaussianPeakFit_head.argtypes = [P, P, P, D, P, DP, DP, DP, DP, IP, D]
REPEATS = int(sys.argv[1]) if len(sys.argv) > 1 else 5
rng = np.random.default_rng(1)


def median_time(fn, prepare=lambda: None):
    times = []
    for _ in range(REPEATS):
        args = prepare()
        t = time.perf_counter()
        fn(args)
        times.append(time.perf_counter() - t)
    return statistics.median(times)


def row(label, ours, theirs, peer):
    print(f"{label:<34} twanlys {ours * 1e3:9.2f} ms   {peer:<12} {theirs * 1e3:9.2f} ms   ratio {ours / theirs:5.2f}")


s = tw.f64()
n = 10**6
x = rng.uniform(-1, 1, n)
y = 2 * x + 1 + rng.normal(0, 0.1, n)
xh, none = tw.array(x), tw.empty()
ours = median_time(lambda yh: tw.lib.LinFit_head(yh, xh, none, s.ref, s.ref, s.ref), lambda: tw.array(y))
row("LinFit_head n=1e6", ours, median_time(lambda _: scipy.stats.linregress(x, y)), "linregress")

yh0 = tw.array(y)
for order in (3, 10, 25):
    fit, coef = tw.empty(), tw.empty()
    ours = median_time(lambda _: tw.lib.PolyFit_head(xh, yh0, order, 0, fit, coef, s.ref))
    row(f"PolyFit_head n=1e6 order {order}", ours, median_time(lambda _: np.polyfit(x, y, order)), "np.polyfit")

m, k = 10**5, 20
h = rng.normal(size=(m, k))
yy = h @ rng.normal(size=k) + rng.normal(0, 0.1, m)
w = rng.uniform(0.5, 2, m)
hh, yyh, wh = tw.matrix(h), tw.array(yy), tw.array(w)
sw = np.sqrt(w)
for method in (0, 2, 4, 5, 6):
    coef, fit, cov = tw.empty(), tw.empty(), tw.empty(dims=2)
    ours = median_time(lambda _: tw.lib.GenLSFit80_head(hh, yyh, wh, method, 1, coef, fit, cov, s.ref))
    theirs = median_time(lambda _: np.linalg.lstsq(h * sw[:, None], yy * sw, rcond=None))
    row(f"GenLSFit80_head 1e5x20 method {method}", ours, theirs, "lstsq")

n = 10**5
x = np.linspace(0.1, 3, n)
for name, f, p in (("ExpFit80_head", lambda x, a, b: a * np.exp(b * x), (2.0, -0.7)),
                   ("PowerFit_head", lambda x, a, b: a * x**b, (1.5, 1.3))):
    y = f(x, *p) + rng.normal(0, 0.02, n)
    xh, it = tw.array(x), tw.i32()

    def call(yh):
        it.c.value = 100
        if name == "ExpFit80_head":
            tw.lib.ExpFit80_head(yh, xh, none, 0.0, none, 1, s.ref, s.ref, s.ref, it.ref, 0.0)
        else:
            tw.lib.PowerFit_head(yh, xh, none, 0.0, none, s.ref, s.ref, s.ref, it.ref, 0.0)
    ours = median_time(call, lambda: tw.array(y))
    steps = it.value
    theirs = median_time(lambda _: scipy.optimize.curve_fit(f, x, y, p0=(1.0, 1.0 if name[0] == "P" else -1.0)))
    row(f"{name} n=1e5 ({steps} steps)", ours, theirs, "curve_fit")

x = np.linspace(-5, 5, n)
y = 3 * np.exp(-0.5 * ((x - 0.5) / 1.2) ** 2) + rng.normal(0, 0.05, n)
xh, it = tw.array(x), tw.i32()
guess = tw.array([2.5, 0.2, 1.5])
for limit in (10, 110):
    def call(yh):
        it.c.value = limit
        tw.lib.GaussianPeakFit_head(yh, xh, none, 1e-12, guess, s.ref, s.ref, s.ref, s.ref, it.ref, 0.0)
    ours = median_time(call, lambda: tw.array(y))
    print(f"GaussianPeakFit_head n=1e5 limit {limit}: {it.value} steps, {ours * 1e3:.2f} ms")
