"""Spline exports beside SciPy in one run: median wall time of each, and the ratio.

Usage: PYTHONPATH=python TWANLYS_LIB_DIR=build /usr/bin/python3 bench/fit_spline_side_by_side.py [repeats]
"""
import ctypes
import statistics
import sys
import time

import numpy as np
import scipy.interpolate as si

from twanlys import lowlevel as tw

D, P = ctypes.c_double, ctypes.c_void_p
DP, IP = ctypes.POINTER(D), ctypes.POINTER(ctypes.c_int32)
tw.lib.Spline_head.argtypes = [P, P, DP, DP, P, IP]
tw.lib.CubicSplineFit_head.argtypes = [P, P, P, P, D, DP]
tw.lib.BSplineFit_head.argtypes = [P, P, P, ctypes.c_int32, ctypes.c_int32, ctypes.c_uint16, P, DP]
REPEATS = int(sys.argv[1]) if len(sys.argv) > 1 else 7
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
    print(f"{label:<38} twanlys {ours * 1e3:9.2f} ms   {peer:<22} {theirs * 1e3:9.2f} ms   ratio {ours / theirs:5.2f}")


n = 10**6
x = np.cumsum(rng.uniform(0.5, 1.5, n))
y = np.sin(x / 50) + rng.normal(0, 0.1, n)
xh, yh, y2, st = tw.array(x), tw.array(y), tw.empty(), tw.i32()
natural = tw.f64(1e30)
ours = median_time(lambda _: tw.lib.Spline_head(yh, xh, natural.ref, natural.ref, y2, st.ref))
theirs = median_time(lambda _: si.CubicSpline(x, y, bc_type="natural"))
row("Spline_head n=1e6 (natural)", ours, theirs, "CubicSpline")

n = 10**5
x, y, w = x[:n], y[:n], rng.uniform(0.5, 2, n)
xh, wh, none, err = tw.array(x), tw.array(w), tw.empty(), tw.f64()
p = 0.5
ours = median_time(lambda yy: tw.lib.CubicSplineFit_head(yy, xh, wh, none, p, err.ref), lambda: tw.array(y))
theirs = median_time(lambda _: si.make_smoothing_spline(x, y, w=w, lam=(1 - p) / p)(x))
row("CubicSplineFit_head n=1e5 (weighted)", ours, theirs, "make_smoothing_spline")

m, d = 100, 3
th = np.linspace(0, 20, n)
data = np.c_[np.cos(th), np.sin(th), th / 20] + rng.normal(0, 0.01, (n, 3))
cp, mse = tw.empty(dims=2), tw.f64()
ours = median_time(lambda dh: tw.lib.BSplineFit_head(dh, wh, none, d, m, 0, cp, mse.ref), lambda: tw.matrix(data))
# The peer gets the same uniform parameters and averaged knots, and evaluates its fit too.
u = np.linspace(0, 1, n)
knots = np.r_[np.zeros(m), np.ones(d + 1)]
step = n / (m - d)
for j in range(1, m - d):
    i = int(j * step)
    knots[d + j] = (1 - (j * step - i)) * u[i - 1] + (j * step - i) * u[i]
theirs = median_time(lambda _: si.make_lsq_spline(u, data, knots, k=d, w=np.sqrt(w))(u))
row("BSplineFit_head n=1e5, m=100, 3-D", ours, theirs, "make_lsq_spline")
