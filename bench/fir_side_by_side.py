#!/usr/bin/python3
# Usage: PYTHONPATH=python /usr/bin/python3 bench/fir_side_by_side.py <build dir with libtwanlys.so>
"""FIR design and filtering exports beside SciPy/NumPy on the same data, in one session. Prints the
median CPU time of each (several runs) and the ratio ours / peer."""
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
P = ctypes.c_void_p
for name, real in (("DBL", ctypes.c_double), ("SGL", ctypes.c_float)):
    getattr(lib, "ppMultiRateFIRH_" + name).argtypes = [P, P, P] + [ctypes.c_int32] * 3 + [P, real] + [P] * 4
rng = np.random.default_rng(5)
BAND = np.dtype([("gain", "f8"), ("lower", "f8"), ("upper", "f8"), ("weight", "f8")])


class Spec(ctypes.Structure):
    _pack_ = 1
    _fields_ = [("filterClass", ctypes.c_int32), ("interpolation", ctypes.c_int32), ("model", P), ("image", P)]


def median_seconds(f, runs):
    f()
    times = []
    for _ in range(runs):
        t = time.process_time()
        f()
        times.append(time.process_time() - t)
    return sorted(times)[runs // 2]


def row(label, ours, peers, runs):
    t = median_seconds(ours, runs)
    cols = ["%-36s %9.2f ms" % (label, 1e3 * t)]
    for name, f in peers:
        p = median_seconds(f, runs)
        cols.append("%s %9.2f ms  ratio %.2f" % (name, 1e3 * p, t / p))
    print("   ".join(cols))
    return t


def parks(n, runs):
    bands = [(1, 0, 0.2, 1), (0, 0.22, 0.5, 10)]
    b = tw.Array(np.array(bands, dtype=BAND), dims=1)
    h, dev, status = tw.empty(), tw.f64(), tw.i32()
    args = (tw.i32(n).ref, tw.f64(1.0).ref, b, tw.i32(0).ref, h, dev.ref, tw.i32(100).ref, status.ref)

    def ours():
        lib.Parks(*args)

    ours()
    assert status.value == 0
    row("Parks %d taps" % n, ours, [("remez", lambda: ss.remez(n, [0, .2, .22, .5], [1, 0], weight=[1, 10],
                                                                  grid_density=16, maxiter=100))], runs)


def engine(member, mode, L, M, taps, n, runs, peers):
    dt = np.float64 if member == "DBL" else np.float32
    x, h = rng.standard_normal(n).astype(dt), rng.standard_normal(taps).astype(dt)
    xa, ha, y = tw.array(x, dt), tw.array(h, dt), tw.empty(dt)
    r, c, d, p = ctypes.c_uint8(1), ctypes.c_uint8(0), tw.i32(), tw.i32()
    f = getattr(lib, "ppMultiRateFIRH_" + member)

    def ours():
        f(xa, y, tw.empty(dt), mode, L, M, ha, 1.0, ctypes.byref(r), ctypes.byref(c), d.ref, p.ref)

    return row("ppMultiRateFIRH_%s mode %d L%d M%d %d" % (member, mode, L, M, taps), ours,
               [(name, (lambda g=g: g(x, h))) for name, g in peers], runs)


def narrowband(runs):
    model, image, status = tw.empty(), tw.empty(), tw.i32()
    spec = Spec(0, 0, model.h, image.h)
    lib.FIRNarrowCoef_head(*(tw.f64(v).ref for v in (1000.0, 10.0, 15.0, 0.0, 0.01, 60.0)), tw.i32(0).ref,
                           ctypes.byref(spec), status.ref)
    assert status.value == 0 and spec.interpolation > 1
    m, i, L = model.numpy(), image.numpy(), spec.interpolation
    stretched = np.zeros((len(m) - 1) * L + 1)
    stretched[::L] = m
    x = rng.standard_normal(1000000)
    xa, y = tw.array(x), tw.empty()

    def ours():
        lib.FIRnarrowFilter_head(xa, ctypes.byref(spec), y, status.ref)

    row("FIRnarrowFilter_head L%d M%d I%d 1e6" % (L, len(m), len(i)), ours,
        [("2 x np.convolve", lambda: np.convolve(np.convolve(x, i), stretched))], runs)


if __name__ == "__main__":
    # Packed blocks put f64 data at 4 mod 8, which the frame stages through aligned copies; the
    # filters themselves are compared on aligned blocks (pass "packed" to see the other case).
    tw.placement("packed" not in sys.argv)
    parks(101, 9)
    parks(301, 5)
    n = 1000000
    for taps in (64, 256):
        engine("DBL", 0, 1, 1, taps, n, 5, [("np.convolve", lambda x, h: np.convolve(x, h))])
        engine("DBL", 1, 4, 1, taps, n // 4, 5, [("upfirdn", lambda x, h: ss.upfirdn(h, x, 4))])
        engine("DBL", 2, 1, 4, taps, n, 5, [("upfirdn", lambda x, h: ss.upfirdn(h, x, 1, 4))])
        engine("DBL", 3, 3, 4, taps, n, 5, [("upfirdn", lambda x, h: ss.upfirdn(h, x, 3, 4))])
        for mode, L, M in ((0, 1, 1), (2, 1, 4)):
            td = engine("DBL", mode, L, M, taps, n, 5, [])
            ts = engine("SGL", mode, L, M, taps, n, 5, [])
            print("    _SGL / _DBL %.2f" % (ts / td))
    narrowband(5)
