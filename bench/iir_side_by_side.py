#!/usr/bin/python3
# Usage: PYTHONPATH=python /usr/bin/python3 bench/iir_side_by_side.py <build dir with libtwanlys.so>
"""IIR filter exports beside SciPy on the same data, in one session: median CPU time per call of
n = 1e6 samples and the ratio ours / peer. The point-by-point figure includes the ctypes call."""
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
N = 1_000_000
RUNS = 5
rng = np.random.default_rng(7)
ONE = ctypes.byref(ctypes.c_uint8(1))


def median_seconds(f, runs=RUNS):
    f()
    times = []
    for _ in range(runs):
        t = time.process_time()
        f()
        times.append(time.process_time() - t)
    return sorted(times)[runs // 2]


def row(label, ours, peer_name, peer):
    t, p = median_seconds(ours), median_seconds(peer)
    print("%-36s %8.2f ms   %-22s %8.2f ms   ratio %.2f" % (label, 1e3 * t, peer_name, 1e3 * p, t / p))
    return t


def design(sections):
    a, b, st = tw.empty(), tw.empty(), tw.i32()
    lib.BWCoefs(tw.f64(1000.0).ref, tw.f64(100.0).ref, tw.f64(0).ref, tw.i32(2 * sections).ref, tw.i32(0).ref,
                a, b, st.ref)
    return a.numpy(), b.numpy()


x = rng.standard_normal(N)
cxv = x + 1j * rng.standard_normal(N)
xa, ca = tw.array(x), tw.array(cxv, np.complex128)
status = tw.i32()

for sections in (2, 4, 8):
    a, b = design(sections)
    sos = np.array([np.r_[b[3 * k:3 * k + 3], 1.0, a[2 * k:2 * k + 2]] for k in range(sections)])
    ah, bh, state, form = tw.array(a), tw.array(b), tw.empty(), tw.i32(0)
    t = row("IIR_Filter2 %d sections" % sections,
            lambda: lib.IIR_Filter2(xa, form.ref, ah, bh, state, ONE, status.ref),
            "sosfilt", lambda: ss.sosfilt(sos, x))
    cstate = tw.empty(np.complex128)
    tc = median_seconds(lambda: lib.CxSigIIR_Filter2(ca, form.ref, ah, bh, cstate, ONE, status.ref))
    print("%-36s %8.2f ms   %-22s %8.2f ms   ratio %.2f" % ("CxSigIIR_Filter2 %d sections" % sections, 1e3 * tc,
                                                          "IIR_Filter2 (real)", 1e3 * t, tc / t))

for order in (2, 4, 8):
    a, b = ss.butter(order, 0.2)
    ah, bh, xs, ys = tw.array(a), tw.array(b), tw.empty(), tw.empty()
    t = row("IIR_Filter order %d" % order, lambda: lib.IIR_Filter(xa, ah, bh, xs, ys, ONE, status.ref),
            "lfilter", lambda: ss.lfilter(b, a, x))
    cxs, cys = tw.empty(np.complex128), tw.empty(np.complex128)
    tc = median_seconds(lambda: lib.CxSigIIR_Filter(ca, ah, bh, cxs, cys, ONE, status.ref))
    print("%-36s %8.2f ms   %-22s %8.2f ms   ratio %.2f" % ("CxSigIIR_Filter order %d" % order, 1e3 * tc,
                                                          "IIR_Filter (real)", 1e3 * t, tc / t))

for taps in (16, 64, 256):
    b = rng.standard_normal(taps)
    ah, bh, xs, ys = tw.empty(), tw.array(b), tw.empty(), tw.empty()
    row("IIR_Filter FIR %d taps" % taps, lambda: lib.IIR_Filter(xa, ah, bh, xs, ys, ONE, status.ref),
        "lfilter(b, [1])", lambda: ss.lfilter(b, [1.0], x))

a, b = design(4)
ah, bh, state = tw.array(a), tw.array(b), tw.empty()
cell, keep = ctypes.c_double(0.5), ctypes.byref(ctypes.c_uint8(0))
calls = 100_000
fn, ref, st0 = lib.IIR_Filter_PtbyPt, ctypes.byref(cell), ctypes.c_int32(0)


def ptbypt():
    for _ in range(calls):
        fn(ref, st0, ah, bh, state, keep)


t = median_seconds(ptbypt, 3)
print("%-36s %8.3f us per call (ctypes call included)" % ("IIR_Filter_PtbyPt 4 sections", 1e6 * t / calls))
