#!/usr/bin/python3
# Usage: /usr/bin/python3 bench/bessel_side_by_side.py <build dir with bench_bessel_bench>
"""Runs bench_bessel_bench and times the SciPy ufuncs on the same 1e6 arguments in the same
session; prints median nanoseconds per point and the ratio ours / SciPy. CPU times throughout."""
import sys

import numpy as np
import scipy.special as sc

from per_point import header, our_medians, peer_ns, report

build = sys.argv[1] if len(sys.argv) > 1 else "build"
ours = our_medians(build, "bench_bessel_bench")

n = 1000000
i = np.arange(n)
x = 50.0 * np.fmod((i + 0.5) * 0.6180339887498949, 1.0)
v = 20.0 * np.fmod((i + 0.5) * 0.41421356237309515, 1.0)
peers = {
    "j0": lambda: sc.j0(x), "j1": lambda: sc.j1(x), "y0": lambda: sc.y0(x), "y1": lambda: sc.y1(x),
    "i0": lambda: sc.i0(x), "i1": lambda: sc.i1(x), "k0": lambda: sc.k0(x), "k1": lambda: sc.k1(x),
    "jv": lambda: sc.jv(v, x), "yv": lambda: sc.yv(v, x), "iv": lambda: sc.iv(v, x),
    "kn": lambda: sc.kn(v.astype(np.int32), x), "airy": lambda: sc.airy(x - 25.0),
    "ber_bei": lambda: (sc.ber(x), sc.bei(x)), "ker_kei": lambda: (sc.ker(x), sc.kei(x)),
}
header()
for name, f in peers.items():
    report(ours, name, peer_ns(f, n))
