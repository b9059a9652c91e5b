#!/usr/bin/python3
# Usage: PYTHONPATH=python /usr/bin/python3 bench/hartley_side_by_side.py <build dir with libtwanlys.so>
"""The fast chirp-Z and the Hartley transform beside SciPy/NumPy on the same data, in one session:
median CPU time per call over several batches, and the ratio ours / peer."""
import ctypes
import os
import sys
import time

build = sys.argv[1] if len(sys.argv) > 1 else "build"
os.environ["TWANLYS_LIB_DIR"] = os.path.abspath(build)

import numpy as np  # noqa: E402
import scipy.signal as ss  # noqa: E402

from twanlys import lowlevel as tw  # noqa: E402

lib = tw.lib
rng = np.random.default_rng(7)


def per_call(f, calls, runs=9):
    f()
    times = []
    for _ in range(runs):
        t = time.process_time()
        for _ in range(calls):
            f()
        times.append((time.process_time() - t) / calls)
    return sorted(times)[runs // 2]


def row(label, ours, peer_label, peer, calls):
    a, b = per_call(ours, calls), per_call(peer, calls)
    print("%-28s %10.1f us   %-22s %10.1f us   ratio %.2f" % (label, 1e6 * a, peer_label, 1e6 * b, a / b))


n = 4096
x = rng.standard_normal(n)
A, W = np.exp(2j * np.pi * 0.1), np.exp(-2j * np.pi * 0.25 / n)
xa, y = tw.array(x), tw.empty(np.complex128)
Ac, Wc = (ctypes.c_double * 2)(A.real, A.imag), (ctypes.c_double * 2)(W.real, W.imag)
row("ChirpZT_head method 1", lambda: lib.ChirpZT_head(xa, Ac, Wc, n, 1, y), "scipy.signal.czt",
    lambda: ss.czt(x, n, W, A), 20)

for size in (1024, 4096, 65536):
    v = rng.standard_normal(size)
    va, cell, count = tw.array(v), ctypes.c_void_p(None), [0]

    def fht():
        # Each transform scales the values by about sqrt(size): start afresh now and then.
        count[0] += 1
        if count[0] % 50 == 0:
            ctypes.memmove(va._data(), v.ctypes.data, v.nbytes)
        lib.FHTH(va, ctypes.byref(cell))

    row("FHTH n=%d" % size, fht, "np.fft.rfft", lambda: np.fft.rfft(v), max(20, 2000000 // size))
