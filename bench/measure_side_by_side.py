#!/usr/bin/python3
# Usage: PYTHONPATH=python /usr/bin/python3 bench/measure_side_by_side.py <build dir with libtwanlys.so>
"""Waveform measurements beside their NumPy/SciPy peers, in one session: StateLevels (histogram)
on 1e6 samples beside np.histogram(x, 100); PeakD2014 (width 21) on 1e6 samples beside three
scipy.signal.savgol_filter calls (derivatives 0, 1, 2); MultipleToneMeasurements with 10 tones at
48000 and 65536 samples beside a Hann window and np.fft.rfft. Median CPU times of 15 runs and the
ratios."""
import ctypes
import os
import sys
import time

build = sys.argv[1] if len(sys.argv) > 1 else "build"
os.environ["TWANLYS_LIB_DIR"] = os.path.abspath(build)

import numpy as np  # noqa: E402
import scipy.signal as sg  # noqa: E402

from twanlys import lowlevel as tw  # noqa: E402

RUNS = 15
D, I32, P = ctypes.c_double, ctypes.c_int32, ctypes.c_void_p
PD = ctypes.POINTER(D)
tw.lib.StateLevels.argtypes = [P, D, D, I32, I32, P] + [PD] * 3 + [I32]
tw.lib.PeakD2014.argtypes = [P, P, P, P, ctypes.POINTER(I32), I32]
tw.lib.MultipleToneMeasurements.argtypes = [P, I32, D, I32, I32, D, I32, ctypes.POINTER(I32)] + [P] * 4 + \
    [PD, P, PD, PD]


class PeakSettings(ctypes.Structure):
    _fields_ = [("data", P), ("threshold", D), ("width", I32), ("polarity", I32), ("locations", P),
                ("amplitudes", P), ("second", P), ("count", I32), ("flags", ctypes.c_uint32)]


def median_seconds(f):
    times = []
    for _ in range(RUNS):
        t = time.process_time()
        f()
        times.append(time.process_time() - t)
    return sorted(times)[RUNS // 2]


def row(name, ours, peer, peer_name):
    o, p = median_seconds(ours), median_seconds(peer)
    print("%-34s %9.2f   %-34s %9.2f   ratio %.2f" % (name, 1e3 * o, peer_name, 1e3 * p, o / p))


rng = np.random.default_rng(1)
print("median CPU ms of %d runs" % RUNS)

x = np.where(rng.random(10**6) < 0.5, 0.0, 1.0) + rng.normal(0, 0.05, 10**6)
xs, cell = tw.array(x), ctypes.c_void_p()
out = [D(), D(), D()]
row("StateLevels method 0, 100 bins",
    lambda: tw.lib.StateLevels(xs, 0.0, 1.0, 0, 100, ctypes.byref(cell), *[ctypes.byref(o) for o in out], 0),
    lambda: np.histogram(x, 100), "np.histogram(x, 100)")

y = np.sin(np.arange(10**6) * 0.01) + rng.normal(0, 0.01, 10**6)
ys, work, state = tw.array(y), tw.array(np.zeros(0)), ctypes.create_string_buffer(64)
outs = [tw.array(np.zeros(0)) for _ in range(3)]
status = I32()


def peaks():
    st = PeakSettings(ys.h, 0.5, 21, 0, *[o.h for o in outs], 0, 5)
    tw.lib.PeakD2014(None, ctypes.byref(st), state, work, ctypes.byref(status), 0)


row("PeakD2014 width 21", peaks, lambda: [sg.savgol_filter(y, 21, 2, deriv=d) for d in (0, 1, 2)],
    "3 x savgol_filter(21, 2)")

for n in (48000, 65536):
    t = np.arange(n) / 48000.0
    z = sum(rng.uniform(0.1, 1) * np.sin(2 * np.pi * (500 + 1900 * k + rng.uniform(0, 50)) * t + k)
            for k in range(10))
    zs = tw.array(z)
    arrays = [tw.array(np.zeros(0)) for _ in range(5)]
    found, a, b, c = I32(), D(), D(), D()
    hann = np.hanning(n + 1)[:-1]

    def tones():
        tw.lib.MultipleToneMeasurements(zs, n, 1 / 48000, 0, 0, 0.05, 10, ctypes.byref(found), *arrays[:4],
                                        ctypes.byref(a), arrays[4], ctypes.byref(b), ctypes.byref(c))

    row("MultipleToneMeasurements %d" % n, tones, lambda: np.fft.rfft(z * hann), "Hann + np.fft.rfft")
    assert found.value == 10
tw.twrt.TWRTRunCleanups(2)
