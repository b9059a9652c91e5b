#!/usr/bin/python3
# Usage: /usr/bin/python3 bench/fft_side_by_side.py <build dir with bench_fft>
"""Runs bench_bench_fft, times NumPy's FFT on the same sizes in the same session, prints median times
and the ratios to FFTW_MEASURE and NumPy. Times are CPU times, which a shared machine disturbs less
than wall-clock times."""
import json
import subprocess
import sys
import time
import timeit

import numpy as np

build = sys.argv[1] if len(sys.argv) > 1 else "build"
raw = subprocess.run([build + "/bench_bench_fft", "--benchmark_format=json", "--benchmark_repetitions=5",
                      "--benchmark_min_time=0.05", "--benchmark_report_aggregates_only=true"],
                     check=True, capture_output=True, text=True).stdout
us = {}
for b in json.loads(raw)["benchmarks"]:
    if b.get("aggregate_name") != "median":
        continue
    name, n = b["run_name"].split("/")
    us[(name, int(n))] = b["cpu_time"]

sizes = sorted({n for _, n in us}, key=lambda n: (n in (1009, 10007, 65537), n))
rng = np.random.default_rng(0)
for n in sizes:
    x = rng.standard_normal(n)
    z = x + 1j * rng.standard_normal(n)
    reps = max(3, int(2e5 // n))
    for name, f in (("NumpyReal", lambda: np.fft.rfft(x)), ("NumpyComplex", lambda: np.fft.fft(z))):
        runs = timeit.repeat(f, number=reps, repeat=5, timer=time.process_time)
        us[(name, n)] = 1e6 * sorted(runs)[2] / reps

for kind in ("Real", "Complex"):
    print("\n%s forward, median microseconds (ratios: ours / peer)" % kind.lower())
    print("%8s %10s %10s %10s %10s %10s %8s %8s %8s" % ("n", "core", "export", "fftwEst", "fftwMeas",
                                                         "numpy", "core/M", "expo/M", "expo/np"))
    for n in sizes:
        core, exp = us[("Tw" + kind, n)], us[("TwExport" + kind, n)]
        est, meas = us[("Fftw%s<FFTW_ESTIMATE>" % kind, n)], us[("Fftw%s<FFTW_MEASURE>" % kind, n)]
        npy = us[("Numpy" + kind, n)]
        print("%8d %10.2f %10.2f %10.2f %10.2f %10.2f %8.2f %8.2f %8.2f" % (
            n, core, exp, est, meas, npy, core / meas, exp / meas, exp / npy))
