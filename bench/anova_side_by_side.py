#!/usr/bin/python3
# Usage: PYTHONPATH=python /usr/bin/python3 bench/anova_side_by_side.py <build dir with libtwanlys.so>
"""One-way analysis of variance on 1e6 observations in 1000 levels: Anova1Way_head_2017 on the
labelled data (shuffled and in runs) beside scipy.stats.f_oneway on the same data grouped in
advance, in one session. Prints median CPU times of 15 runs each and the ratios."""
import ctypes
import os
import sys
import time

build = sys.argv[1] if len(sys.argv) > 1 else "build"
os.environ["TWANLYS_LIB_DIR"] = os.path.abspath(build)

import numpy as np  # noqa: E402
import scipy.stats as st  # noqa: E402

from twanlys import lowlevel as tw  # noqa: E402

N, K, RUNS = 10**6, 1000, 15
rng = np.random.default_rng(1)
labels = rng.integers(0, K, N).astype(np.int32) * 7919 - 4_000_000
x = rng.normal(0, 1, N) + (labels % 13) * 0.01
groups = [x[labels == v] for v in np.unique(labels)]
order = np.argsort(labels, kind="stable")
cases = {"shuffled": (tw.array(x), tw.array(labels, np.int32)),
         "in runs": (tw.array(x[order]), tw.array(labels[order], np.int32))}


def median_seconds(f):
    times = []
    for _ in range(RUNS):
        t = time.process_time()
        f()
        times.append(time.process_time() - t)
    return sorted(times)[RUNS // 2]


outs, status, k = [tw.f64() for _ in range(8)], tw.i32(), ctypes.c_int32(K)


def ours(xs, ls):
    tw.lib.Anova1Way_head_2017(xs, ls, ctypes.byref(k), ctypes.c_double(0.05), *[o.ref for o in outs],
                               status.ref)


ref = st.f_oneway(*groups)
scipy_s = median_seconds(lambda: st.f_oneway(*groups))
print("n %d, levels %d, median CPU ms of %d runs" % (N, K, RUNS))
print("%-28s %8.2f" % ("scipy f_oneway (grouped)", 1e3 * scipy_s))
for name, (xs, ls) in cases.items():
    ours(xs, ls)
    assert status.value == 0 and abs(outs[2].value / ref.statistic - 1) < 1e-9
    s = median_seconds(lambda: ours(xs, ls))
    print("%-28s %8.2f   ours/scipy %.3f" % ("Anova1Way_head_2017 " + name, 1e3 * s, s / scipy_s))
