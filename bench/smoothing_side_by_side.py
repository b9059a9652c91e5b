#!/usr/bin/python3
# Usage: PYTHONPATH=python TWANLYS_LIB_DIR=build /usr/bin/python3 bench/smoothing_side_by_side.py [n]
"""Times the smoothing exports beside SciPy in one session on 10^6 samples by default: Savitzky-Golay
smoothing (order 3) against savgol_filter(mode='interp'), and the running median against
ndimage.median_filter(mode='constant'), which pads with zeros as the export does. The median
works in place, so each timed call copies the data into a fresh host array, which counts against
the export. Prints median CPU times and the ratio export / SciPy, for packed host blocks (elements
at 4 mod 8) and 64-byte aligned ones."""
import ctypes
import sys
import time
import timeit

import numpy as np
import scipy.ndimage
import scipy.signal

from twanlys import lowlevel as tw

I32, P = ctypes.c_int32, ctypes.c_void_p
tw.lib.SavitzkyGolayFiltH.argtypes = [P, I32, I32, P, P]
tw.lib.MedianFilter81_H.argtypes = [P, I32, I32]

n = int(sys.argv[1]) if len(sys.argv) > 1 else 10**6
x = np.random.default_rng(0).normal(size=n)


def median_ms(f, repeat=7):
    f()
    return 1e3 * np.median(timeit.repeat(f, number=1, repeat=repeat, timer=time.process_time))


for aligned in (0, 1):
    tw.placement(aligned)
    hx, y, none = tw.array(x), tw.empty(), tw.empty()
    print("\n%s blocks, n = %d, median ms" % ("aligned" if aligned else "packed", n))
    print("%-28s %10s %10s %8s" % ("", "export", "scipy", "ratio"))
    for frame in (11, 21, 51, 101):
        ours = median_ms(lambda: tw.lib.SavitzkyGolayFiltH(hx, 3, frame, none, y))
        peer = median_ms(lambda: scipy.signal.savgol_filter(x, frame, 3, mode="interp"))
        print("%-28s %10.2f %10.2f %8.2f" % ("SavitzkyGolayFiltH f=%d" % frame, ours, peer, ours / peer))
    for w in (3, 11, 31, 101):
        ours = median_ms(lambda: tw.lib.MedianFilter81_H(tw.array(x), w // 2, w - 1 - w // 2))
        peer = median_ms(lambda: scipy.ndimage.median_filter(x, w, mode="constant"))
        print("%-28s %10.2f %10.2f %8.2f" % ("MedianFilter81_H w=%d" % w, ours, peer, ours / peer))
tw.placement(0)
