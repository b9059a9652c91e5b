#!/usr/bin/python3
# Usage: /usr/bin/python3 bench/cxbessel_side_by_side.py <build dir with bench_cxbessel_bench>
"""Runs bench_cxbessel_bench and times the SciPy ufuncs on the same 1e6 complex arguments in the
same session; prints median nanoseconds per point and the ratio ours / SciPy. CPU times throughout."""
import json
import subprocess
import sys
import time

import numpy as np
import scipy.special as sc

build = sys.argv[1] if len(sys.argv) > 1 else "build"
raw = subprocess.run([build + "/bench_cxbessel_bench", "--benchmark_format=json", "--benchmark_repetitions=5",
                      "--benchmark_report_aggregates_only=true"],
                     check=True, capture_output=True, text=True).stdout
ours = {}
for b in json.loads(raw)["benchmarks"]:
    if b.get("aggregate_name") == "median":
        ours[b["run_name"]] = b["cpu_time"]  # milliseconds per 1e6 points: nanoseconds per point

n = 1000000
i = np.arange(n)
r = 50.0 * np.fmod((i + 0.5) * 0.6180339887498949, 1.0)
t = 2.0 * np.pi * np.fmod((i + 0.5) * 0.7548776662466927, 1.0) - np.pi
z = r * np.cos(t) + 1j * (r * np.sin(t))
v = 20.0 * np.fmod((i + 0.5) * 0.41421356237309515, 1.0)
peers = {
    "jv": lambda: sc.jv(v, z), "yv": lambda: sc.yv(v, z), "iv": lambda: sc.iv(v, z), "kv": lambda: sc.kv(v, z),
    "hankel1": lambda: sc.hankel1(v, z), "airy": lambda: sc.airy(z),
}
print("%-8s %10s %10s %8s" % ("function", "ours ns", "scipy ns", "ratio"))
for name, f in peers.items():
    runs = []
    for _ in range(5):
        start = time.process_time()
        f()
        runs.append(time.process_time() - start)
    theirs = 1e9 * sorted(runs)[2] / n
    print("%-8s %10.1f %10.1f %8.2f" % (name, ours[name], theirs, ours[name] / theirs))
