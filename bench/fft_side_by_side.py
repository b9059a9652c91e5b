#!/usr/bin/python3
"""FFT speed beside FFTW_MEASURE and NumPy, and against earlier builds, in one session.

Usage: /usr/bin/python3 bench/fft_side_by_side.py [build] [--before DIR ...] [--rounds R]
                                                   [--sizes N,N,...] [--callgrind]

`build` (default build-bench) and every `--before` tree hold bench_bench_fft. Each round runs every
program once (earlier builds only their own transforms, FFTW in `build`) and times NumPy's rfft and
fft, so that the machine's load falls on all of them alike; the tables give the medians over the
rounds of CPU times, which a shared machine disturbs less than wall-clock times. Rows: the cores on
a cached table (`core`) and the exports ReQXFFTH and CxQXFFTH on a cached work cell through the
reference host (`export`). With --callgrind, instructions per call under callgrind follow: a
second figure that does not depend on the load.
"""
import argparse
import json
import os
import re
import statistics
import subprocess
import tempfile
import time
import timeit

import numpy as np

SIZES = [64, 256, 1000, 1024, 4096, 48000, 65536, 1 << 20, 999, 2187, 15015, 1009, 10007, 65537]

ap = argparse.ArgumentParser()
ap.add_argument("build", nargs="?", default="build-bench")
ap.add_argument("--before", action="append", default=[], help="earlier build tree (repeatable)")
ap.add_argument("--rounds", type=int, default=5)
ap.add_argument("--sizes", default=",".join(map(str, SIZES)))
ap.add_argument("--callgrind", action="store_true")
args = ap.parse_args()
sizes = [int(s) for s in args.sizes.split(",")]
builds = args.before + [args.build]
names = ["before" if len(args.before) == 1 else "before%d" % (i + 1) for i in range(len(args.before))] + ["after"]
os.environ["TW_FFT_BENCH_SIZES"] = ",".join(map(str, sizes))

times = {}  # (build index, benchmark, n) -> [us]


def run_bench(i, pattern):
    raw = subprocess.run([builds[i] + "/bench_bench_fft", "--benchmark_format=json",
                          "--benchmark_min_time=0.05", "--benchmark_filter=" + pattern],
                         check=True, capture_output=True, text=True).stdout
    for b in json.loads(raw)["benchmarks"]:
        name, n = b["run_name"].split("/")
        times.setdefault((i, name, int(n)), []).append(b["cpu_time"])


rng = np.random.default_rng(0)
inputs = {n: rng.standard_normal(n) for n in sizes}
for r in range(args.rounds):
    for i in range(len(builds)):
        run_bench(i, "^Tw" if i < len(builds) - 1 else "^(Tw|Fftw.*MEASURE)")
    for n in sizes:
        x = inputs[n]
        z = x + 1j * x[::-1]
        reps = max(3, int(2e5 // n))
        for name, f in (("NumpyReal", lambda: np.fft.rfft(x)), ("NumpyComplex", lambda: np.fft.fft(z))):
            t = timeit.repeat(f, number=reps, repeat=1, timer=time.process_time)[0]
            times.setdefault((len(builds) - 1, name, n), []).append(1e6 * t / reps)

med = {k: statistics.median(v) for k, v in times.items()}
last = len(builds) - 1
print("%d rounds; medians of CPU microseconds; ratios ours / peer (M: FFTW_MEASURE, np: NumPy)" % args.rounds)
for kind in ("Real", "Complex"):
    print("\n%s forward" % kind.lower())
    head = "%8s" % "n"
    for nm in names:
        head += " | %s: %9s %9s %6s %6s %6s %6s" % (nm, "core", "export", "core/M", "expo/M", "expo/np",
                                                     "ex/core")
    print(head + " | %9s %9s" % ("fftwMeas", "numpy"))
    for n in sizes:
        meas, npy = med[(last, "Fftw%s<FFTW_MEASURE>" % kind, n)], med[(last, "Numpy" + kind, n)]
        line = "%8d" % n
        for i, nm in enumerate(names):
            core, exp = med[(i, "Tw" + kind, n)], med[(i, "TwExport" + kind, n)]
            line += " | %s: %9.2f %9.2f %6.2f %6.2f %7.2f %7.2f" % (
                " " * len(nm), core, exp, core / meas, exp / meas, exp / npy, exp / core)
        print(line + " | %9.2f %9.2f" % (meas, npy))

if args.callgrind:
    print("\ninstructions per call under callgrind (millions)")
    kinds = ("TwReal", "TwExportReal", "TwComplex", "TwExportComplex")
    print("%8s %16s " % ("n", "kind") + " ".join("%10s" % nm for nm in names))
    with tempfile.TemporaryDirectory() as tmp:
        for n in sizes:
            calls = max(2, min(200, int(2e5 // n)))
            for kind in kinds:
                row = []
                for i, b in enumerate(builds):
                    out = os.path.join(tmp, "cg.%d" % i)
                    subprocess.run(["valgrind", "--tool=callgrind", "--toggle-collect=Measured",
                                    "--callgrind-out-file=" + out, b + "/bench_bench_fft", "--calls", kind,
                                    str(n), str(calls)], check=True, capture_output=True)
                    with open(out) as f:
                        total = int(re.search(r"^(?:summary|totals): (\d+)", f.read(), re.M).group(1))
                    row.append(total / calls / 1e6)
                print("%8d %16s " % (n, kind) + " ".join("%10.4f" % v for v in row))
