#!/usr/bin/python3
# Usage: PYTHONPATH=python TWANLYS_LIB_DIR=build /usr/bin/python3 bench/numeric_side_by_side.py [n]
"""Times numerical-utility exports through the ctypes bindings beside the NumPy expressions that
compute the same thing, in one session, on 10^6 samples by default. Prints median CPU times and
the ratio export / NumPy, for host blocks 64-byte aligned and packed (elements at 4 mod 8)."""
import ctypes
import sys
import time
import timeit

import numpy as np
from scipy.spatial.transform import Rotation

from twanlys import lowlevel as tw

D, P = ctypes.c_double, ctypes.c_void_p
tw.lib.unitVector80_head.argtypes = [P, D, P]
tw.lib.CoordRotationEuler2011_head.argtypes = [P, P, P, D, D, D, ctypes.c_int32, P, P, P]

n = int(sys.argv[1]) if len(sys.argv) > 1 else 10**6
rng = np.random.default_rng(0)
x, y, z = rng.normal(size=(3, n))
angles = (0.3, -1.1, 2.0)
M = Rotation.from_euler("ZYX", angles).as_matrix().T  # sequence 5


def median_ms(f, repeat=15):
    f()
    return 1e3 * np.median(timeit.repeat(f, number=1, repeat=repeat, timer=time.process_time))


def cases():
    hx, hy, hz = tw.array(x), tw.array(y), tw.array(z)
    outs = [tw.empty() for _ in range(3)]
    a, b, st = tw.f64(), tw.f64(), tw.i32()
    dt, method = ctypes.byref(D(0.01)), ctypes.byref(ctypes.c_int32(0))

    def scale_np():
        lo, hi = np.nanmin(x), np.nanmax(x)
        half = (hi - lo) * 0.5
        return (x - (half + lo)) * (1 / half)

    def norm_np():
        m = x.mean()
        return (x - m) * (1 / x.std())

    return [
        ("NumerIntegration_2017_head m0", lambda: tw.lib.NumerIntegration_2017_head(hx, dt, method, a.ref),
         "np.trapz(x, dx=0.01)", lambda: np.trapz(x, dx=0.01)),
        ("CoordRotationEuler2011_head", lambda: tw.lib.CoordRotationEuler2011_head(hx, hy, hz, *angles, 5, *outs),
         "M @ np.vstack((x, y, z))", lambda: M @ np.vstack((x, y, z))),
        ("Scale1DCIN", lambda: tw.lib.Scale1DCIN(hx, a.ref, b.ref, st.ref),
         "nanmin/nanmax, (x - off) * (1/half)", scale_np),
        ("Norm1", lambda: tw.lib.Norm1(hx, a.ref, b.ref, st.ref), "(x - x.mean()) * (1 / x.std())", norm_np),
        ("unitVector80_head y=2", lambda: tw.lib.unitVector80_head(hx, 2.0, a.ref),
         "x * (1 / np.linalg.norm(x, 2))", lambda: x * (1 / np.linalg.norm(x, 2))),
        ("unitVector80_head y=3", lambda: tw.lib.unitVector80_head(hx, 3.0, a.ref),
         "x * (1 / np.linalg.norm(x, 3))", lambda: x * (1 / np.linalg.norm(x, 3))),
    ]


print(f"n = {n}, median CPU ms of 15 runs; NumPy {np.__version__}")
print(f"{'export':32s} {'aligned':>8s} {'packed':>8s} {'numpy':>8s} {'al/np':>6s} {'pk/np':>6s}  numpy expression")
ours = {}
for aligned in (1, 0):
    tw.placement(aligned)
    for name, f, _, _ in cases():
        ours[(name, aligned)] = median_ms(f)
tw.placement(0)
for name, _, expr, g in cases():
    ref = median_ms(g)
    al, pk = ours[(name, 1)], ours[(name, 0)]
    print(f"{name:32s} {al:8.3f} {pk:8.3f} {ref:8.3f} {al / ref:6.2f} {pk / ref:6.2f}  {expr}")
