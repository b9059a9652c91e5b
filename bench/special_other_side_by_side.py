#!/usr/bin/python3
# Usage: /usr/bin/python3 bench/special_other_side_by_side.py <build dir with bench_special_other_bench>
"""Runs bench_special_other_bench and times the SciPy ufuncs on the same 1e6 arguments in the same
session; prints median nanoseconds per point and the ratio ours / SciPy. CPU times throughout.
Note that sici and shichi are two exports on our side (each computes both) and one ufunc in SciPy."""
import sys

import numpy as np
import scipy.special as sc

from per_point import header, our_medians, peer_ns, report

build = sys.argv[1] if len(sys.argv) > 1 else "build"
ours = our_medians(build, "bench_special_other_bench")

n = 1000000
i = np.arange(n)
p, q, r, s = (np.fmod((i + 0.5) * g, 1.0) for g in (0.6180339887498949, 0.41421356237309515,
                                                      0.7320508075688772, 0.2360679774997898))
# SciPy's slowest ufuncs are timed on every 100th (hyperu) or 10th (struve, pbdv) argument only.
STRIDE = {"hyperu": 100, "struve": 10, "pbdv": 10}
peers = {
    "ellipk": lambda k: sc.ellipk(p[k]), "ellipe": lambda k: sc.ellipe(p[k]),
    "ellipkinc": lambda k: sc.ellipkinc(20 * q[k] - 10, p[k]),
    "ellipeinc": lambda k: sc.ellipeinc(20 * q[k] - 10, p[k]),
    "ellipj": lambda k: sc.ellipj(40 * q[k] - 20, p[k]),
    "hyp2f1": lambda k: sc.hyp2f1(6 * p[k] - 3, 6 * q[k] - 3, 0.5 + 3.5 * r[k], 2 * s[k] - 1),
    "hyp1f1": lambda k: sc.hyp1f1(10 * p[k] - 5, 0.5 + 4.5 * q[k], 40 * s[k] - 20),
    "hyperu": lambda k: sc.hyperu(5 * p[k], 6 * q[k] - 3, 0.1 + 29.9 * s[k]),
    "zeta": lambda k: sc.zeta(1.01 + 59 * p[k]), "spence": lambda k: sc.spence(10 * p[k]),
    "struve": lambda k: sc.struve(6 * q[k] - 3, 50 * p[k]),
    "pbdv": lambda k: sc.pbdv(10 * q[k] - 5, 15 * p[k] - 5),
    "dawsn": lambda k: sc.dawsn(40 * p[k] - 20), "fresnel": lambda k: sc.fresnel(20 * p[k] - 10),
    "expn": lambda k: sc.expn((20 * q[k]).astype(np.int32), 0.01 + 20 * p[k]),
    "sici": lambda k: sc.sici(50 * p[k]), "shichi": lambda k: sc.shichi(50 * p[k]),
}
header(10)
with np.errstate(all="ignore"):
    for name, f in peers.items():
        stride = STRIDE.get(name, 1)
        report(ours, name, peer_ns(lambda: f(slice(None, None, stride)), n // stride), 10)
