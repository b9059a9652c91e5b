#!/usr/bin/python3
# Usage: /usr/bin/python3 bench/cxbessel_side_by_side.py <build dir with bench_cxbessel_bench>
"""Runs bench_cxbessel_bench and times the SciPy ufuncs on the same 1e6 complex arguments in the
same session; prints median nanoseconds per point and the ratio ours / SciPy. CPU times throughout."""
import sys

import numpy as np
import scipy.special as sc

from per_point import header, our_medians, peer_ns, report

build = sys.argv[1] if len(sys.argv) > 1 else "build"
ours = our_medians(build, "bench_cxbessel_bench")

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
header()
for name, f in peers.items():
    report(ours, name, peer_ns(f, n))
