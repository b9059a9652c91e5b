#!/usr/bin/python3
# Usage: PYTHONPATH=python /usr/bin/python3 bench/resample_side_by_side.py <build dir with libtwanlys.so>
"""The rational resampler beside L * scipy.signal.upfirdn(h, x, L, M) on the same data, in one
session, and the constant-ratio table resampler and the CIC stages on their own. Median CPU time
of several runs."""
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
I32, P = ctypes.c_int32, ctypes.c_void_p
rng = np.random.default_rng(7)
N = 1_000_000


def median_seconds(f, runs=7):
    f()
    times = []
    for _ in range(runs):
        t = time.process_time()
        f()
        times.append(time.process_time() - t)
    return sorted(times)[runs // 2]


def rational(l, m, taps):
    h = ss.firwin(taps, 0.9 / max(l, m)) * 1.0
    x = rng.standard_normal(N)
    xa, ha = tw.array(x), tw.array(h)
    state, y, delay, count = tw.empty(), tw.empty(), tw.i32(), tw.i32()

    def ours():
        delay.c.value, count.c.value = 0, 0
        assert lib.RationalResample_H(xa, l, m, 1, delay.ref, ha, state, count.ref, y) == 0

    ours()
    # Output k of the export stands at upsampled instant k M; upfirdn's full output at c + k M.
    ref = l * ss.upfirdn(h, x, l, m)
    c = (taps - 1) // 2
    got = y.numpy()
    if c % m == 0:
        np.testing.assert_allclose(got, ref[c // m:c // m + len(got)], rtol=0, atol=1e-9)
    t, p = median_seconds(ours), median_seconds(lambda: l * ss.upfirdn(h, x, l, m))
    print("RationalResample_H %4d/%-4d %5d taps  %8.2f ms   upfirdn %8.2f ms   ratio %.2f   (%d outputs)"
          % (l, m, taps, 1e3 * t, 1e3 * p, t / p, len(got)))


class Settings(ctypes.Structure):
    _pack_ = 1
    _fields_ = [("ratio", ctypes.c_double), ("interpolation", I32), ("start", ctypes.c_double), ("table", P),
                ("oversample", I32)]


class State(ctypes.Structure):
    _pack_ = 1
    _fields_ = [("buffer", P), ("count", I32), ("coefs", P), ("scale", ctypes.c_double), ("left", I32),
                ("right", I32), ("interpolation", I32), ("ratio", ctypes.c_double), ("frac", ctypes.c_double),
                ("index", I32)]


def table_const(ratio, half, over, interpolation):
    t = np.arange(-half * over, half * over + 1) / over
    table = np.sinc(t) * np.kaiser(len(t), 8.0)
    table /= table.sum()
    x = rng.standard_normal(N)
    xa, ta, y, produced = tw.array(x), tw.array(table), tw.empty(), tw.i32()
    buffer, coefs = tw.empty(), tw.empty()

    def ours():
        state = State()
        state.buffer, state.coefs = buffer.h, coefs.h
        settings = Settings(ratio, interpolation, 0.0, ta.h, over)
        assert lib.Resample_Const(xa, ctypes.byref(state), ctypes.byref(settings), 1, y, produced.ref, 1) == 0

    t = median_seconds(ours, 5)
    print("Resample_Const ratio %.4f, %d-sample half width, oversample %d, %s: %.1f ns per output (%d outputs)"
          % (ratio, half, over, "nearest" if interpolation == 1 else "linear", 1e9 * t / produced.value,
             produced.value))


def cic(stages, r, d):
    x = rng.standard_normal(N)
    xa, y, state, delay = tw.array(x), tw.empty(), tw.empty(), tw.i32()
    for name in ("CICDecimatorByMovH", "CICInterpolatorByMovH"):
        n = N if name.startswith("CICDec") else N // r

        def ours(name=name, xa=xa if n == N else tw.array(x[:n])):
            assert getattr(lib, name)(xa, y, state, stages, r, d, 0, 1, delay.ref) == 0

        t = median_seconds(ours, 5)
        samples = n * (1 if n == N else r)  # stage samples per call
        print("%-22s %d stages, R %d, D %d: %.1f Msamples/s through the stages (%.2f ns per stage sample)"
              % (name, stages, r, d, samples / t / 1e6, 1e9 * t / (samples * stages)))


print("n = %d, median CPU time" % N)
rational(3, 2, 63)
rational(160, 147, 1921)
table_const(1.0884, 16, 64, 0)
table_const(1.0884, 16, 64, 1)
cic(4, 8, 1)
