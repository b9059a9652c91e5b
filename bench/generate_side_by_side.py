#!/usr/bin/python3
# Usage: PYTHONPATH=python /usr/bin/python3 bench/generate_side_by_side.py <build dir with libtwanlys.so>
"""Noise generators and the shuffle beside numpy.random.Generator (and the periodic noise beside
np.fft.irfft of the same length), in one session. Prints median CPU times of 15 runs, per sample
for the noise, and the ratios ours / NumPy. The output array is kept between runs on both sides,
so that what is timed is the drawing."""
import ctypes
import os
import sys
import time

build = sys.argv[1] if len(sys.argv) > 1 else "build"
os.environ["TWANLYS_LIB_DIR"] = os.path.abspath(build)

import numpy as np  # noqa: E402

from twanlys import lowlevel as tw  # noqa: E402

RUNS, N = 15, 10**6
D, I32, P = ctypes.c_double, ctypes.c_int32, ctypes.c_void_p
lib = tw.lib
lib.GammaNoiseH.argtypes = [P, I32, I32, I32, P]
lib.PoissonNoiseH.argtypes = [P, I32, D, I32, P]
lib.BinomialNoiseH.argtypes = [P, I32, I32, D, I32, P, P]
lib.RiffleArrayDBL2012_head.argtypes = [P, P, I32, P, I32]


class State(ctypes.Structure):
    _fields_ = [("s1", I32), ("s2", I32), ("s3", I32)]


def median_seconds(f):
    f()
    times = []
    for _ in range(RUNS):
        t = time.process_time()
        f()
        times.append(time.process_time() - t)
    return sorted(times)[RUNS // 2]


st, spare, cache = State(), (ctypes.c_byte * 12)(), (ctypes.c_byte * 52)()
y, yu, perm = tw.empty(), tw.empty(np.uint32), tw.empty(np.int32)
status, seed_cont = tw.i32(), tw.i32(-1)
rng = np.random.default_rng(0)


def by_pointer(export, n, scalar):
    length, value = tw.i32(n), tw.f64(scalar)
    if export == "PeriodNoise":
        return lambda: lib.PeriodNoise(length.ref, value.ref, seed_cont.ref, y, status.ref, ctypes.byref(st))
    extra = (ctypes.byref(spare),) if export == "Gauss" else ()
    return lambda: getattr(lib, export)(y, length.ref, value.ref, seed_cont.ref, status.ref, ctypes.byref(st),
                                        *extra)


lib.white(y, tw.i32(3).ref, tw.f64(1.0).ref, tw.i32(12345).ref, status.ref, ctypes.byref(st))
data = tw.array(np.arange(N, dtype=float))
x = np.arange(N, dtype=float)
rows = [
    ("white / uniform", N, by_pointer("white", N, 1.0), lambda: rng.uniform(-1, 1, N), 3),
    ("Gauss / normal", N, by_pointer("Gauss", N, 1.0), lambda: rng.normal(0, 1, N), 3),
    ("gamma 10 / gamma", N, lambda: lib.GammaNoiseH(y, N, 10, -1, ctypes.byref(st)), lambda: rng.gamma(10, size=N),
     5),
    ("Poisson 40 / poisson", N, lambda: lib.PoissonNoiseH(y, N, 40.0, -1, ctypes.byref(st)),
     lambda: rng.poisson(40.0, N), 5),
    ("binomial 100,0.3 / binomial", N,
     lambda: lib.BinomialNoiseH(yu, N, 100, 0.3, -1, ctypes.byref(st), ctypes.byref(cache)),
     lambda: rng.binomial(100, 0.3, N), 5),
    ("Riffle / permutation", N, lambda: lib.RiffleArrayDBL2012_head(data, perm, -1, ctypes.byref(st), 1),
     lambda: rng.permutation(x), 3),
]
for n in (48000, 2**16):
    spectrum = np.fft.rfft(rng.standard_normal(n))
    rows.append(("PeriodNoise / irfft %d" % n, 1, by_pointer("PeriodNoise", n, 1.0),
                 lambda s=spectrum, m=n: np.fft.irfft(s, m), 1.5))

print("median CPU time of %d runs; noise per sample, the rest per call" % RUNS)
print("%-30s %12s %12s %8s %8s" % ("ours / numpy", "ours", "numpy", "ratio", "bound"))
for name, per, ours, peer, bound in rows:
    a, b = median_seconds(ours), median_seconds(peer)
    unit = 1e9 / per if per > 1 else 1e6
    print("%-30s %10.2f %s %10.2f %s %8.2f %8.1f" % (name, a * unit, "ns" if per > 1 else "us", b * unit,
                                                     "ns" if per > 1 else "us", a / b, bound))
