#!/usr/bin/python3
# Usage: PYTHONPATH=python /usr/bin/python3 bench/convolution_side_by_side.py <build dir with libtwanlys.so>
"""Convolution and 2-D FFT exports beside SciPy/NumPy on the same data, in one session. Prints the
median CPU time of each (several runs) and the ratio ours / peer."""
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
I = ctypes.c_int32
rng = np.random.default_rng(5)


def median_seconds(f, runs):
    f()
    times = []
    for _ in range(runs):
        t = time.process_time()
        f()
        times.append(time.process_time() - t)
    return sorted(times)[runs // 2]


def row(label, ours, peers, runs):
    t = median_seconds(ours, runs)
    cols = ["%-34s %9.2f ms" % (label, 1e3 * t)]
    for name, f in peers:
        p = median_seconds(f, runs)
        cols.append("%s %9.2f ms  ratio %.2f" % (name, 1e3 * p, t / p))
    print("   ".join(cols))
    return t


def convolution(nx, ny, algorithm, peers, runs):
    x, y = rng.standard_normal(nx), rng.standard_normal(ny)
    xa, ya, z, alg, status = tw.array(x), tw.array(y), tw.empty(), tw.i32(algorithm), tw.i32()

    def ours():
        lib.Convolution(xa, ya, z, alg.ref, status.ref)

    ours()
    assert status.value == 0
    np.testing.assert_allclose(z.numpy(), np.convolve(x, y), rtol=0, atol=1e-9 * np.sqrt(nx * ny))
    row("Convolution alg %d  %d x %d" % (algorithm, nx, ny), ours,
        [(name, (lambda f=f: f(x, y))) for name, f in peers], runs)


def fft2d(n, runs):
    z = rng.standard_normal((n, n)) + 1j * rng.standard_normal((n, n))
    x = z.real.copy()
    za, xa, y = tw.matrix(z, np.complex128), tw.matrix(x), tw.empty(np.complex128, dims=2)
    cells = [ctypes.c_void_p(None) for _ in range(4)]
    refs = [ctypes.byref(c) for c in cells]

    def cx():
        lib.CxFFT2D_H(za, I(0), I(0), I(n), I(n), I(0), y, refs[0], refs[1])

    def re():
        lib.ReFFT2D_H(xa, I(0), I(0), I(n), I(n), I(0), y, refs[2], refs[3])

    tc = row("CxFFT2D_H %d^2" % n, cx, [("numpy fft2", lambda: np.fft.fft2(z))], runs)
    tr = median_seconds(re, runs)
    print("%-34s %9.2f ms   ReFFT2D_H / CxFFT2D_H %.2f" % ("ReFFT2D_H %d^2" % n, 1e3 * tr, tr / tc))


def convolve2d(runs):
    x, y = rng.standard_normal((512, 512)), rng.standard_normal((65, 65))
    xa, ya, z = tw.matrix(x), tw.matrix(y), tw.empty(dims=2)

    def ours():
        lib.Convolve_2DH(xa, ya, z, I(0), I(1))

    ours()
    np.testing.assert_allclose(z.numpy(), ss.fftconvolve(x, y), rtol=0, atol=1e-9)
    row("Convolve_2DH alg 1  512^2 by 65^2", ours, [("fftconvolve", lambda: ss.fftconvolve(x, y))], runs)


fft = [("fftconvolve", ss.fftconvolve)]
convolution(2 ** 16, 2 ** 16, 1, fft, 15)
convolution(10 ** 5, 10 ** 5, 1, fft, 15)
convolution(10 ** 6, 10 ** 3, 1, fft + [("oaconvolve", ss.oaconvolve)], 9)
convolution(10 ** 6, 64, 0, [("np.convolve", np.convolve)], 9)
for n in (512, 1000, 1024):
    fft2d(n, 9)
convolve2d(9)
