"""Shared steps of the per-point benchmarks beside SciPy's ufuncs (bessel, cxbessel, special_other):
our medians from a Google Benchmark program, SciPy's timed in the same session. CPU times."""
import json
import subprocess
import time


def our_medians(build, program):
    """Median nanoseconds per point of each run of `program` (its runs time 1e6 points each)."""
    raw = subprocess.run([build + "/" + program, "--benchmark_format=json", "--benchmark_repetitions=5",
                          "--benchmark_report_aggregates_only=true"],
                         check=True, capture_output=True, text=True).stdout
    return {b["run_name"]: b["cpu_time"]  # milliseconds per 1e6 points: nanoseconds per point
            for b in json.loads(raw)["benchmarks"] if b.get("aggregate_name") == "median"}


def peer_ns(call, points):
    """Median over 5 runs of call(), in CPU nanoseconds per point."""
    runs = []
    for _ in range(5):
        t = time.process_time()
        call()
        runs.append(time.process_time() - t)
    return 1e9 * sorted(runs)[2] / points


def report(ours, name, theirs, width=8):
    print("%-*s %10.1f %10.1f %8.2f" % (width, name, ours[name], theirs, ours[name] / theirs))


def header(width=8):
    print("%-*s %10s %10s %8s" % (width, "function", "ours ns", "scipy ns", "ratio"))
