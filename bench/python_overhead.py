#!/usr/bin/python3
# Usage: PYTHONPATH=python TWANLYS_LIB_DIR=build /usr/bin/python3 bench/python_overhead.py
"""The high-level Python layer's cost over a raw ctypes call, in one session, CPU-time medians.

Raw: the low-level call on host handles made beforehand. High-level: NumPy in, NumPy out, which
adds one copy into a host handle and (for array results) one copy out."""
import ctypes
import time

import numpy as np

import twanlys as tw
from twanlys import lowlevel as ll


def median_us(fn, reps):
    times = []
    for _ in range(15):
        t = time.process_time()
        for _ in range(reps):
            fn()
        times.append((time.process_time() - t) / reps * 1e6)
    return float(np.median(times))


for n, reps in ((16, 20000), (10**6, 20)):
    x = np.random.default_rng(0).normal(size=n)
    hx, out, status = ll.array(x), ll.f64(), ll.i32()
    raw = median_us(lambda: ll.lib.Mean_head(hx, out.ref, status.ref), reps)
    high = median_us(lambda: tw.stats.mean(x), reps)
    copy = median_us(lambda: ll.array(x), reps)
    print(f"mean n={n:>7}: raw {raw:9.2f} us  high-level {high:9.2f} us  extra {high - raw:8.2f} us  "
          f"(one copy in {copy:.2f} us; ratio to raw + copy {high / (raw + copy):.2f})")
    # An array result: a window in place, one copy in and one out.
    w = ll.array(x)
    raw = median_us(lambda: ll.lib.AllWinH(w, 1, ctypes.c_double(float("nan")), 0, 0), reps)
    high = median_us(lambda: tw.window.all_win(x, 1, float("nan"), 0, 0), reps)
    back = median_us(lambda: w.numpy(), reps)
    print(f"hann n={n:>7}: raw {raw:9.2f} us  high-level {high:9.2f} us  extra {high - raw:8.2f} us  "
          f"(copies in+out {copy + back:.2f} us; ratio to raw + copies {high / (raw + copy + back):.2f})")
