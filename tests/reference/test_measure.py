"""Waveform measurements against NumPy renderings of their rules and synthetic waves whose
crossings are known in closed form."""
import ctypes
import unittest

import numpy as np

from twanlys import lowlevel as tw

D, I32, U16, P = ctypes.c_double, ctypes.c_int32, ctypes.c_uint16, ctypes.c_void_p
PD = ctypes.POINTER(D)
WEAK = 20021


class Refs(ctypes.Structure):
    _pack_ = 1
    _fields_ = [("high", D), ("mid", D), ("low", D), ("units", U16)]


class Hist(ctypes.Structure):
    _fields_ = [("method", ctypes.c_uint32), ("bins", I32)]


tw.lib.StateLevels.argtypes = [P, D, D, I32, I32, P] + [PD] * 3 + [I32]
tw.lib.PulseMeasEx.argtypes = [P, D, D, U16, U16, I32, P, P, P] + [PD] * 7 + [I32]
tw.lib.TransMeas.argtypes = [P, D, D, U16, I32, P, P, P] + [PD] * 11 + [I32]
tw.lib.CycleRMSAverage.argtypes = [P, D, D, I32, P, P, P] + [PD] * 5 + [I32]


def each_placement():
    for aligned in (0, 1):
        tw.placement(aligned)
        yield aligned
    tw.placement(0)


def hist_levels(x, bins):
    """Bin centres of the fullest low and high bins: trunc and clamp, low ties to the lower index,
    high ties to the higher, empty bins never chosen."""
    mn, mx = np.min(x), np.max(x)
    w = (mx - mn) / bins
    idx = np.clip(np.trunc((x - mn) * (1 / w)), 0, bins - 1).astype(int)
    c = np.bincount(idx, minlength=bins)
    lo = c[: int(0.4 * bins) + 1]
    li = int(np.argmax(lo)) if lo.max() > 0 else 0
    hi = c[int(0.6 * bins):]
    hidx = int(0.6 * bins) + len(hi) - 1 - int(np.argmax(hi[::-1])) if hi.max() > 0 else 0
    return mn + 0.5 * w + li * w, mn + 0.5 * w + hidx * w, c[li], c[hidx]


class Cell:
    """A work cell; its bin buffer is released by the host's cleanups."""

    def __init__(self):
        self.p = ctypes.c_void_p()

    def __del__(self):
        tw.twrt.TWRTRunCleanups(2)


def state_levels(x, method, bins, strict=0, cell=None, t0=0.0, dt=1.0):
    out = [D(), D(), D()]
    cell = cell or Cell()
    s = tw.lib.StateLevels(tw.array(x), t0, dt, method, bins, ctypes.byref(cell.p),
                           *[ctypes.byref(o) for o in out], strict)
    return [o.value for o in out], s


def trapezoid(n, edges, ramp, low=0.0, high=1.0):
    """Samples at 0..n-1 of a wave that starts at `low` and ramps linearly over `ramp` samples,
    alternately up and down, starting at each time in `edges`."""
    t = np.arange(n, dtype=float)
    y = np.full(n, low)
    for k, e in enumerate(edges):
        frac = np.clip((t[t >= e] - e) / ramp, 0, 1)
        y[t >= e] = low + (high - low) * (frac if k % 2 == 0 else 1 - frac)
    return y


class StateLevels(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(2026112532)

    def test_histogram_rule_against_numpy(self):
        for _ in each_placement():
            for n, bins in ((1000, 100), (4097, 37), (50, 3), (10000, 256)):
                x = np.where(self.rng.random(n) < 0.5, 0.0, 2.5) + self.rng.normal(0, 0.05, n)
                (high, low, amp), s = state_levels(x, 0, bins)
                lo, hi, cl, ch = hist_levels(x, bins)
                self.assertEqual(s, WEAK if min(cl, ch) < 0.05 * n else 0)
                self.assertEqual((high, low), (hi, lo))
                self.assertEqual(amp, hi - lo)

    def test_square_wave_at_bin_centres(self):
        # 4 bins over [0, 4]: centres 0.5 and 3.5; samples 0 and 4 land in the end bins.
        x = np.tile([0.0] * 5 + [4.0] * 5, 20)
        (high, low, amp), s = state_levels(x, 0, 4)
        self.assertEqual((s, high, low, amp), (0, 3.5, 0.5, 3.0))
        (high, low, amp), s = state_levels(x, 1, 4)
        self.assertEqual((s, high, low, amp), (0, 4.0, 0.0, 4.0))

    def test_ramp_warns_with_levels_in_place(self):
        for bins in (21, 50, 100):
            x = np.linspace(-1, 1, 1000)
            (high, low, _), s = state_levels(x, 0, bins)
            lo, hi, _, _ = hist_levels(x, bins)
            self.assertEqual((s, high, low), (WEAK, hi, lo))
        # 20 bins hold exactly 5 percent each: not weak.
        self.assertEqual(state_levels(np.linspace(-1, 1, 1000), 0, 20)[1], 0)

    def test_automatic_and_strict(self):
        # Low state well populated, high state a few outliers only.
        x = np.r_[np.zeros(95), 1.0, 10.0 + np.arange(4) * 0.01]
        lo, hi, cl, ch = hist_levels(x, 10)
        self.assertTrue(cl > 5 and ch < 5)
        (high, low, _), s = state_levels(x, 2, 10, strict=0)
        self.assertEqual((s, high, low), (0, x.max(), lo))
        (high, low, _), s = state_levels(x, 2, 10, strict=1)
        self.assertEqual((s, high, low), (0, x.max(), x.min()))
        two = np.r_[np.zeros(50), np.ones(50)]
        lo, hi, _, _ = hist_levels(two, 10)
        for strict in (0, 1):
            (high, low, _), s = state_levels(two, 2, 10, strict=strict)
            self.assertEqual((s, high, low), (0, hi, lo))

    def test_cell_reuse_across_bin_counts(self):
        cell = Cell()
        x = self.rng.normal(size=500)
        before = tw.twrt.TWRTCleanupCount(2)
        for bins in (10, 10, 300, 7, 300):
            (high, low, _), s = state_levels(x, 0, bins, cell=cell)
            lo, hi, _, _ = hist_levels(x, bins)
            self.assertEqual((high, low), (hi, lo))
        self.assertEqual(tw.twrt.TWRTCleanupCount(2) - before, 1)


def pulse(x, refs, hist, polarity=0xFFFF, number=1, unbounded=0, t0=0.0, dt=1.0, strict=0):
    out = [D() for _ in range(7)]
    cell = Cell()
    s = tw.lib.PulseMeasEx(tw.array(x), t0, dt, polarity, unbounded, number, ctypes.byref(refs),
                           ctypes.byref(hist), ctypes.byref(cell.p), *[ctypes.byref(o) for o in out], strict)
    return [o.value for o in out], s


def transition(x, refs, hist, polarity, number=1, t0=0.0, dt=1.0):
    out = [D() for _ in range(11)]
    cell = Cell()
    s = tw.lib.TransMeas(tw.array(x), t0, dt, polarity, number, ctypes.byref(refs), ctypes.byref(hist),
                         ctypes.byref(cell.p), *[ctypes.byref(o) for o in out], 0)
    return [o.value for o in out], s


def cycle(x, refs, hist, number=1, t0=0.0, dt=1.0):
    out = [D() for _ in range(5)]
    cell = Cell()
    s = tw.lib.CycleRMSAverage(tw.array(x), t0, dt, number, ctypes.byref(refs), ctypes.byref(hist),
                               ctypes.byref(cell.p), *[ctypes.byref(o) for o in out], 0)
    return [o.value for o in out], s


def crossings(x, mid, h):
    """The hysteresis crossing search, unarmed start, in plain Python."""
    out, s, armed = [], 2, False
    for i in range(len(x) - 1):
        if x[i] >= mid + h and s != 0:
            s, armed = 0, True
        elif x[i] <= mid - h and s != 1:
            s, armed = 1, True
        if armed and (x[i] - mid) * (x[i + 1] - mid) <= 0:
            d = x[i] - x[i + 1]
            out.append((i + (x[i] - mid) / (d if d != 0 else 1), s))
            armed = False
    return out


class Pulses(unittest.TestCase):
    EDGES = [10.3, 30.55, 50.3, 70.55, 90.3, 110.55, 130.3]
    RAMP = 4.0

    def wave(self):
        return trapezoid(160, self.EDGES, self.RAMP)

    def test_pulses_on_a_trapezoid(self):
        x = self.wave()
        e, L = self.EDGES, self.RAMP
        rise = [a + 0.5 * L for a in e[0::2]]
        fall = [a + 0.5 * L for a in e[1::2]]
        absolute = Refs(0.9, 0.5, 0.1, 0)
        hist = Hist(0, 100)
        for t0, dt in ((0.0, 1.0), (-3.25, 1e-3), (1e4, 0.37)):
            tol = 1e-12 * (abs(t0) + len(x) * dt)
            for number in (1, 2, 3):
                # polarity -1: crossings 2N-2, 2N-1 are the N-th rise and fall.
                (period, width, duty, centre, lo, mid, hi), s = pulse(x, absolute, hist, 0xFFFF, number, t0=t0, dt=dt)
                self.assertEqual(s, 0)
                r, f = rise[number - 1], fall[number - 1]
                self.assertAlmostEqual(width, (f - r) * dt, delta=tol)
                self.assertAlmostEqual(period, (rise[number] - r) * dt, delta=tol)
                self.assertAlmostEqual(duty, (f - r) / (rise[number] - r), delta=1e-12)
                self.assertAlmostEqual(centre, t0 + (r + f) / 2 * dt, delta=tol)
                self.assertEqual((lo, mid, hi), (0.1, 0.5, 0.9))
                # Negative pulses: from the N-th fall to the next rise.
                (period, width, _, centre, *_), s = pulse(x, absolute, hist, 0, number, t0=t0, dt=dt)
                self.assertEqual(s, 0)
                self.assertAlmostEqual(width, (rise[number] - f) * dt, delta=tol)
                self.assertAlmostEqual(centre, t0 + (rise[number] + f) / 2 * dt, delta=tol)
        # Unbounded: the last pulse needs no crossing after it, but the list must not end on an
        # edge of the pulse's own direction.
        (period, width, duty, *_), s = pulse(x[:120], absolute, hist, 0xFFFF, 3, unbounded=1)
        self.assertEqual((s, period, duty), (0, 0.0, 0.0))
        self.assertAlmostEqual(width, fall[2] - rise[2], delta=1e-12)
        self.assertEqual(pulse(x[:120], absolute, hist, 0xFFFF, 3)[1], -20308)
        # Starting high: fall, rise, fall, rise.
        self.assertEqual(pulse(x[20:100], absolute, hist, 1, 2, unbounded=1)[1], -20308)
        (_, width, *_), s = pulse(x[20:100], absolute, hist, 0, 2, unbounded=1)
        self.assertEqual(s, 0)
        self.assertAlmostEqual(width, rise[2] - fall[1], delta=1e-12)
        self.assertEqual(pulse(x[:100], absolute, hist, 0xFFFF, 4, unbounded=1)[1], -20308)

    def test_percent_references_from_state_levels(self):
        x = self.wave()
        for method, bins in ((0, 100), (1, 100), (2, 40)):
            lo_s, hi_s = (x.min(), x.max()) if method == 1 else hist_levels(x, bins)[:2]
            amp = hi_s - lo_s
            (_, width, _, _, lo, mid, hi), s = pulse(x, Refs(90, 50, 10, 1), Hist(method, bins))
            self.assertIn(s, (0, WEAK))
            np.testing.assert_allclose([lo, mid, hi], np.array([10, 50, 90]) * amp / 100 + lo_s, rtol=1e-15)
            # The ramp runs 0..1: level m is crossed m ramp lengths into each edge.
            r = self.EDGES[0] + mid * self.RAMP
            f = self.EDGES[1] + (1 - mid) * self.RAMP
            self.assertAlmostEqual(width, f - r, delta=1e-12)

    def test_noise_within_hysteresis_makes_no_crossing(self):
        rng = np.random.default_rng(7)
        x = trapezoid(400, [20.5, 120.25, 220.5, 320.25], 20.0)
        band = (x > 0.2) & (x < 0.8)
        x[band] = 0.5 + rng.uniform(-0.3, 0.3, np.count_nonzero(band))
        for refs, h in ((Refs(0.9, 0.5, 0.1, 0), 0.4), (Refs(0.5, 0.5, 0.5, 0), 0.0)):
            ref = crossings(x, 0.5, h)
            self.assertEqual(len(ref) == 4, h > 0)
            (period, width, *_), s = pulse(x, refs, Hist(0, 100))
            self.assertEqual(s, 0)
            self.assertAlmostEqual(width, ref[1][0] - ref[0][0], delta=1e-12)
            self.assertAlmostEqual(period, ref[2][0] - ref[0][0], delta=1e-12)

    def test_transitions_with_shoots(self):
        # Edges of 8 samples: both samples around each reference crossing lie on the ramp.
        L = 8.0
        x = trapezoid(200, [19.6, 80.3, 140.3], L, -1.0, 3.0)
        x[30] = 3.5   # overshoot after the first rise
        x[17] = -1.3  # preshoot before it
        x[91] = -1.6  # undershoot after the fall
        for bins in (100, 64):
            lo_s, hi_s, _, _ = hist_levels(x, bins)
            amp = hi_s - lo_s
            b = (x.max() - x.min()) / bins / 2
            refs = Refs(90, 50, 10, 1)
            rl, rh = 0.1 * amp + lo_s, 0.9 * amp + lo_s
            for t0, dt in ((0.0, 1.0), (2.5, 1e-6)):
                # Level v on an edge from -1 to 3 starting at e: e + (v + 1) / 4 L.
                (slew, dur, start, end, pre, pre_t, over, over_t, lo, mid, hi), s = transition(
                    x, refs, Hist(0, bins), 1, 1, t0, dt)
                self.assertIn(s, (0, WEAK))
                start_ref, end_ref = 19.6 + (rl + 1) / 4 * L, 19.6 + (rh + 1) / 4 * L
                tol = 1e-12 * (abs(t0) + 200 * dt)
                self.assertAlmostEqual(start, t0 + start_ref * dt, delta=tol)
                self.assertAlmostEqual(end, t0 + end_ref * dt, delta=tol)
                self.assertAlmostEqual(dur, (end_ref - start_ref) * dt, delta=tol)
                self.assertAlmostEqual(slew * dt, 4 / L, delta=1e-12)
                self.assertAlmostEqual(pre, (-1.3 - lo_s) * 100 / amp, delta=1e-12)
                self.assertAlmostEqual(pre_t, t0 + 17 * dt, delta=tol)
                self.assertAlmostEqual(over, (3.5 - hi_s) * 100 / amp, delta=1e-12)
                self.assertAlmostEqual(over_t, t0 + 30 * dt, delta=tol)
                self.assertTrue(-1.3 < lo_s - b and 3.5 > hi_s + b)
                # The first fall: no preshoot above the high band, undershoot after it.
                (slew, dur, start, end, pre, pre_t, over, over_t, *_), s = transition(
                    x, refs, Hist(0, bins), 0, 1, t0, dt)
                start_ref, end_ref = 80.3 + (3 - rh) / 4 * L, 80.3 + (3 - rl) / 4 * L
                self.assertAlmostEqual(start, t0 + start_ref * dt, delta=tol)
                self.assertAlmostEqual(end, t0 + end_ref * dt, delta=tol)
                self.assertEqual((pre, pre_t), (0.0, 0.0))
                self.assertAlmostEqual(over, (-1.6 - lo_s) * 100 / amp, delta=1e-12)
                self.assertAlmostEqual(over_t, t0 + 91 * dt, delta=tol)
        # The second rise is clean; a third does not exist.
        r, s = transition(x, Refs(90, 50, 10, 1), Hist(0, 100), 1, 2)
        self.assertEqual((s, r[4], r[6]), (0, 0.0, 0.0))
        self.assertEqual(transition(x, Refs(90, 50, 10, 1), Hist(0, 100), 1, 3)[1], -20310)
        # Either direction: the second transition is the fall.
        r2, _ = transition(x, Refs(90, 50, 10, 1), Hist(0, 100), 0xFFFF, 2)
        r1, _ = transition(x, Refs(90, 50, 10, 1), Hist(0, 100), 0, 1)
        self.assertEqual(r1, r2)

    def test_cycle_rms_and_mean(self):
        rng = np.random.default_rng(3)
        x = self.wave() + rng.normal(0, 0.01, 160)
        refs = Refs(0.8, 0.5, 0.2, 0)
        for number in (1, 2):
            for t0, dt in ((0.0, 1.0), (-7.0, 0.25)):
                (rms, mean, *_), s = cycle(x, refs, Hist(0, 100), number, t0, dt)
                self.assertEqual(s, 0)
                c = crossings(x, 0.5, 0.3)
                first = int(c[2 * number - 2][0])
                span = int(c[2 * number][0] - c[2 * number - 2][0])
                seg = x[first:first + span]
                self.assertAlmostEqual(mean, seg.mean(), delta=1e-14)
                self.assertAlmostEqual(rms, np.sqrt(np.mean(seg * seg)), delta=1e-14)


class PeakSettings(ctypes.Structure):
    _fields_ = [("data", P), ("threshold", D), ("width", I32), ("polarity", I32), ("locations", P),
                ("amplitudes", P), ("second", P), ("count", I32), ("flags", ctypes.c_uint32)]


tw.lib.PeakD2014.argtypes = [P, P, P, P, ctypes.POINTER(I32), I32]
tw.lib.PeakDetector.argtypes = [P, PD, ctypes.POINTER(I32), P, ctypes.POINTER(I32), ctypes.POINTER(I32)]


class PeakStream:
    """One stream of blocks through PeakD2014."""

    def __init__(self, width, polarity=0, threshold=-1e300, mode=0):
        self.width, self.polarity, self.threshold, self.mode = width, polarity, threshold, mode
        self.state = ctypes.create_string_buffer(64)
        self.work = tw.array(np.zeros(0))
        self.outs = [tw.array(np.zeros(0)) for _ in range(3)]

    def feed(self, block, flags):
        data = tw.array(block)
        st = PeakSettings(data.h, self.threshold, self.width, self.polarity, *[o.h for o in self.outs], -1, flags)
        status = I32()
        s = tw.lib.PeakD2014(data if self.mode == 2 else None, ctypes.byref(st), self.state, self.work,
                             ctypes.byref(status), self.mode)
        assert s == status.value
        return [o.numpy() for o in self.outs], st.count, s


def peaks_once(x, width, polarity=0, threshold=-1e300, mode=0):
    return PeakStream(width, polarity, threshold, mode).feed(x, 5)


def scan_reference(x, w, polarity, threshold, mode=0):
    """The detector's scan on a whole stream, with coefficients from np.polyfit."""
    x = np.asarray(x, float)
    offset, normalise = 0.0, False
    if mode != 0 and x.max() - x.min() < 1e-8:
        offset, normalise = x.mean(), True
        x = x - offset
    h = (w - 1) / 2
    t = np.arange(w) - h
    out, last, last_sign = [], None, None
    for g in range(len(x) - w + 1):
        win, scale = x[g:g + w], 1.0
        if normalise:
            ext = win.max() if polarity == 0 else win.min()
            scale = max(abs(ext), 2.220446049250313e-16)
            win = win / scale
        c2, c1, c0 = np.polyfit(t, win, 2)
        sign = (c2 > 0) if abs(c1) <= 1e-10 else (c1 > 0)
        cand = g > 0 and ((c2 < 0 if polarity == 0 else c2 > 0) if w < 5 else sign != last_sign)
        d = 2 * c2
        if cand and abs(d) >= 1e-10:
            xv = -c1 / d
            y, at, sc, ok = (c2 * xv + c1) * xv + c0, g, scale, True
            if xv < -0.5:
                ld = 2 * last[2]
                if ld == 0:
                    ok = False
                elif abs(-last[1] / ld) < abs(xv):
                    xv = -last[1] / ld
                    y, d, at, sc = (last[2] * xv + last[1]) * xv + last[0], ld, g - 1, 1.0
            if ok and abs(xv) <= 0.5 * h + 2.220446049250313e-15:
                hit = (d < 0 and polarity == 0 and y * sc > threshold - offset) or \
                      (d > 0 and polarity == 1 and y * sc < threshold - offset)
                if hit:
                    p = (at + h + xv, y * sc + offset, d * sc)
                    if out and abs(p[0] - out[-1][0]) < 1.0:
                        better = p[1] > out[-1][1] if polarity == 0 else p[1] < out[-1][1]
                        if better:
                            out[-1] = p
                    else:
                        out.append(p)
        last, last_sign = (c0 * scale, c1 * scale, c2 * scale), sign
    return np.array(out).reshape(-1, 3)


class Peaks(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(11)

    def bumps(self, n=400):
        t = np.arange(n, dtype=float)
        centres = self.rng.uniform(10, n - 10, 8)
        return sum(np.exp(-0.5 * ((t - c) / self.rng.uniform(2, 6)) ** 2) * self.rng.uniform(0.5, 2)
                   for c in centres) + self.rng.normal(0, 0.02, n)

    def test_scan_against_polyfit(self):
        for _ in each_placement():
            for w in (3, 4, 5, 8, 21):
                for polarity in (0, 1):
                    x = self.bumps()
                    if polarity:
                        x = -x
                    thr = 0.3 if polarity == 0 else -0.3
                    (loc, amp, d2), count, s = peaks_once(x, w, polarity, thr)
                    ref = scan_reference(x, w, polarity, thr)
                    self.assertEqual((s, count), (0, len(ref)), (w, polarity))
                    self.assertGreater(count, 0)
                    np.testing.assert_allclose(loc, ref[:, 0], rtol=0, atol=1e-9)
                    np.testing.assert_allclose(amp, ref[:, 1], rtol=0, atol=1e-11)
                    np.testing.assert_allclose(d2, ref[:, 2], rtol=0, atol=1e-11)

    def test_sampled_parabolas_have_exact_vertices(self):
        t = np.arange(101, dtype=float)
        for w in (5, 6, 11):
            for vertex, a, b in ((50.3, 3.0, 0.01), (20.75, -1.0, 0.2)):
                (loc, amp, d2), count, s = peaks_once(a - b * (t - vertex) ** 2, w, 0)
                self.assertEqual((s, count), (0, 1))
                self.assertAlmostEqual(loc[0], vertex, delta=1e-10)
                self.assertAlmostEqual(amp[0], a, delta=1e-12)
                self.assertAlmostEqual(d2[0], -2 * b, delta=1e-12)
                (loc, amp, d2), count, s = peaks_once(-a + b * (t - vertex) ** 2, w, 1, 1e300)
                self.assertEqual((s, count), (0, 1))
                self.assertAlmostEqual(loc[0], vertex, delta=1e-10)
                self.assertAlmostEqual(amp[0], -a, delta=1e-12)
        # Width 3 on a single raised sample: found at that index.
        x = np.zeros(20)
        x[7] = 1.0
        (loc, amp, _), count, s = peaks_once(x, 3, 0, 0.5)
        self.assertEqual((s, count, loc[0], amp[0]), (0, 1, 7.0, 1.0))

    def test_blocks_agree_with_one_block(self):
        x = self.bumps(1000)
        for w in (3, 5, 9):
            whole, count, _ = peaks_once(x, w, 0, 0.3)
            self.assertGreater(count, 3)
            for cuts in ([w, 500], [137, 400, 420, 990], list(range(50, 1000, 50))):
                stream = PeakStream(w, 0, 0.3)
                found = []
                edges = [0] + cuts + [1000]
                for k in range(len(edges) - 1):
                    flags = (1 if k == 0 else 0) | (4 if k == len(edges) - 2 else 0)
                    (loc, amp, d2), c, s = stream.feed(x[edges[k]:edges[k + 1]], flags)
                    self.assertEqual(s, 0)
                    found += list(zip(loc, amp, d2))
                np.testing.assert_array_equal(np.array(found).reshape(-1, 3), np.stack(whole, axis=1))
                self.assertEqual(bytes(stream.state), bytes(64))
                self.assertEqual(stream.work.shape(), (0,))

    def test_near_flat_data(self):
        t = np.arange(300, dtype=float)
        x = 5.0 + 1e-10 * np.sin(2 * np.pi * t / 37.3)
        for polarity, thr in ((0, 4.0), (1, 6.0)):
            for mode in (1, 2):
                (loc, amp, d2), count, s = peaks_once(x, 9, polarity, thr, mode)
                ref = scan_reference(x, 9, polarity, thr, mode)
                self.assertEqual((s, count), (0, len(ref)))
                self.assertGreaterEqual(count, 7)
                np.testing.assert_allclose(loc, ref[:, 0], rtol=0, atol=1e-6)
                np.testing.assert_allclose(amp, ref[:, 1], rtol=0, atol=1e-15 * 5)
            # The plain path sees curvature below its floor and reports nothing.
            self.assertEqual(peaks_once(x, 9, polarity, thr, 0)[1], 0)

    def test_threshold_runs(self):
        for _ in each_placement():
            x = self.rng.normal(size=2000)
            for thr, width in ((0.5, 1), (0.5, 3), (-0.2, 4), (1.5, 1)):
                loc, count, status = tw.array(np.zeros(0), np.int32), I32(), I32()
                s = tw.lib.PeakDetector(tw.array(x), ctypes.byref(D(thr)), ctypes.byref(I32(width)), loc,
                                        ctypes.byref(count), ctypes.byref(status))
                above = np.r_[False, x >= thr, False].astype(int)
                starts = np.flatnonzero(np.diff(above) == 1)
                ends = np.flatnonzero(np.diff(above) == -1)
                ref = starts[ends - starts >= width]
                self.assertEqual((s, status.value, count.value), (0, 0, len(ref)))
                np.testing.assert_array_equal(loc.numpy(), ref)


tw.lib.measurements_fetch.argtypes = [P, I32, P, P, I32, D, D, P, I32, I32, P]


def fetch(selector, x, refs, hist, polarity=1, t0=0.0, dt=1.0, strict=0):
    result = (D * 8)(*([7.0] * 8))
    xs = np.ascontiguousarray(x, float)
    s = tw.lib.measurements_fetch(None, selector, ctypes.byref(refs), ctypes.byref(hist), polarity, t0, dt,
                                  xs.ctypes.data, xs.size, strict, result)
    return list(result), s


class Fetch(unittest.TestCase):
    def test_whole_waveform_selectors_against_numpy(self):
        x = np.random.default_rng(5).normal(1.0, 2.0, 999)
        refs, hist = Refs(90, 50, 10, 1), Hist(0, 50)
        cases = {0: x.min(), 1: x.max(), 2: x.max() - x.min(), 13: np.sqrt(np.mean(x * x)),
                 14: np.mean(x), 21: np.linalg.norm(x)}
        for sel, ref in cases.items():
            r, s = fetch(sel, x, refs, hist)
            self.assertEqual(s, 0)
            self.assertAlmostEqual(r[0], ref, delta=1e-13 * max(1, abs(ref)))
            self.assertEqual(r[1:], [7.0] * 7)
        r, s = fetch(34, x, refs, hist)
        self.assertEqual((s, r), (0, [7.0] * 8))

    def test_selectors_agree_with_the_exports(self):
        x = trapezoid(200, [19.6, 80.3, 140.3], 8.0, -1.0, 3.0)
        x[30], x[17], x[91] = 3.5, -1.3, -1.6
        t0, dt = 1.5, 0.01
        refs, hist = Refs(90, 50, 10, 1), Hist(0, 64)
        levels = {m: state_levels(x, m, 64, t0=t0, dt=dt)[0] for m in (0, 1, 2)}
        rises = transition(x, refs, hist, 1, t0=t0, dt=dt)[0]
        falls = transition(x, refs, hist, 0, t0=t0, dt=dt)[0]
        pos = pulse(x, refs, hist, 1, t0=t0, dt=dt)[0]
        neg = pulse(x, refs, hist, 0, t0=t0, dt=dt)[0]
        anyp = pulse(x, refs, hist, 0xFFFF, t0=t0, dt=dt)[0]
        cyc = cycle(x, refs, hist, t0=t0, dt=dt)[0]
        want = {3: levels[0][1], 4: levels[0][0], 5: levels[0][2], 6: levels[2][0], 7: levels[2][1],
                8: levels[2][2], 9: anyp[4], 10: anyp[5], 11: anyp[6], 12: min(anyp[5] - anyp[4], anyp[6] - anyp[5]),
                15: anyp[0], 16: 1 / anyp[0], 17: cyc[0], 18: cyc[1], 19: rises[1], 20: falls[1], 22: pos[1],
                23: neg[1], 24: pos[2], 25: neg[2], 26: rises[0], 27: falls[0], 30: pos[3], 31: neg[3]}
        for sel, ref in want.items():
            r, s = fetch(sel, x, refs, hist, t0=t0, dt=dt)
            self.assertIn(s, (0, WEAK), sel)
            self.assertEqual(r[0], ref, sel)
        for sel, pol, ref in ((28, 1, rises[4:6]), (29, 1, rises[6:8]), (29, 0, falls[6:8])):
            r, s = fetch(sel, x, refs, hist, pol, t0, dt)
            self.assertEqual([r[0], r[2]], ref)
            self.assertEqual(r[1], 7.0)
            self.assertNotEqual(r[0], 0.0)
        self.assertEqual(fetch(32, x, refs, hist, t0=t0, dt=dt)[0], rises[:8])
        self.assertEqual(fetch(33, x, refs, hist, t0=t0, dt=dt)[0], falls[:8])


tw.lib.MultipleToneMeasurements.argtypes = [P, I32, D, I32, I32, D, I32, ctypes.POINTER(I32)] + [P] * 4 + \
    [PD, P, PD, PD]


def multitone(x, dt=1e-3, sort=0, mode=0, threshold=0.01, max_tones=10, n=None):
    n = len(x) if n is None else n
    outs = [tw.array(np.zeros(0)) for _ in range(5)]
    found, dt_out, f0, df = I32(-1), D(), D(), D()
    s = tw.lib.MultipleToneMeasurements(tw.array(x), n, dt, sort, mode, threshold, max_tones, ctypes.byref(found),
                                        *outs[:4], ctypes.byref(dt_out), outs[4], ctypes.byref(f0), ctypes.byref(df))
    return s, found.value, [o.numpy() for o in outs], (dt_out.value, f0.value, df.value)


def hann_spectrum(x):
    n = len(x)
    w = 0.5 - 0.5 * np.cos(2 * np.pi * np.arange(n) / n)
    return np.fft.rfft(x * (2 * np.sqrt(2) / n) * w)[: (n + 1) // 2]


def tones(n, dt, parts):
    t = np.arange(n) * dt
    return sum(a * np.sin(2 * np.pi * f * t + np.radians(p)) for f, a, p in parts)


def same_phase(a, b):
    return abs((a - b + 180) % 360 - 180)


class Multitone(unittest.TestCase):
    def check(self, got, parts, df):
        s, found, (fr, am, ph, _, _), _ = got
        self.assertEqual((s, found), (0, len(parts)))
        for (f, a, p), gf, ga, gp in zip(sorted(parts), fr, am, ph):
            self.assertLess(abs(gf - f) / df, 1e-4)
            self.assertLess(abs(ga - a) / a, 1e-4)
            self.assertLess(same_phase(gp, p), 0.01)

    def test_single_tones_below_bin_resolution(self):
        rng = np.random.default_rng(17)
        for _ in each_placement():
            for n, dt in ((1001, 1e-3), (4096, 1 / 48000), (48000, 1 / 48000)):
                df = 1 / (n * dt)
                for bins in (3.5, 17.25, rng.uniform(20, n / 2 - 20), 100.0):
                    part = (bins * df, rng.uniform(0.1, 5), rng.uniform(-179, 179))
                    got = multitone(tones(n, dt, [part]), dt)
                    self.check(got, [part], df)
                    self.assertEqual(got[3], (dt, 0.0, df))

    def test_tones_four_bins_apart_and_sort_orders(self):
        n, dt = 8192, 1e-4
        df = 1 / (n * dt)
        parts = [(200.3 * df, 1.0, 30.0), (204.6 * df, 0.3, -60.0), (210.1 * df, 2.0, 100.0), (900.77 * df, 0.05, 5.0)]
        x = tones(n, dt, parts)
        self.check(multitone(x, dt, sort=0), parts, df)
        s, found, (fr, am, ph, _, _), _ = multitone(x, dt, sort=1)
        self.assertEqual(list(np.argsort(-am)), list(range(4)))
        self.assertEqual(sorted(am, reverse=True), list(am))
        # Fewer tones sought: the largest peaks stay.
        s, found, (fr, am, ph, _, _), _ = multitone(x, dt, sort=1, max_tones=2)
        self.assertEqual((s, found), (0, 2))
        np.testing.assert_allclose(am, [2.0, 1.0], rtol=5e-3)
        # A threshold drops the small tone.
        self.assertEqual(multitone(x, dt, threshold=0.1)[1], 3)

    def test_threshold_zero_reports_every_scanned_peak(self):
        rng = np.random.default_rng(23)
        n, dt = 512, 1.0
        x = tones(n, dt, [(0.1, 1.0, 0.0), (0.27, 0.5, 45.0)]) + rng.normal(0, 0.01, n)
        m = np.r_[np.abs(hann_spectrum(x)), 0.0]
        peaks, i = 0, 0
        while i < len(m) - 2:
            a, b, c = m[i:i + 3]
            if (a <= b and c <= b) or (i == 0 and a >= b and a > c):
                peaks += 1
                i += 2
            else:
                i += 1
        self.assertGreater(peaks, 20)
        s, found, (fr, am, ph, _, _), _ = multitone(x, dt, threshold=0.0, max_tones=1000)
        self.assertEqual((s, found), (0, peaks))
        self.assertTrue(np.all(np.diff(fr) > 0))

    def test_residual_modes_and_spectrum(self):
        n, dt = 2000, 0.5
        df = 1 / (n * dt)
        parts = [(123.4 * df, 1.5, 20.0), (400.9 * df, 0.7, -80.0)]
        x = tones(n, dt, parts) + 0.01 * np.cos(np.arange(n) * 0.001)
        for mode in (1, 2, 3):
            s, found, (fr, am, ph, res, spec), _ = multitone(x, dt, mode=mode, threshold=0.05)
            self.assertEqual((s, found), (0, 2))
            t = np.arange(n) * dt
            fit = sum(a * np.sin(2 * np.pi * f * t + np.radians(p)) for f, a, p in zip(fr, am, ph))
            want = {1: x, 2: fit, 3: x - fit}[mode]
            np.testing.assert_allclose(res, want, rtol=0, atol=1e-12)
            # Compared as magnitudes: rounding of the transform is absolute, far below the peak.
            ref = np.abs(hann_spectrum(want))
            self.assertEqual(spec.size, (n + 1) // 2)
            np.testing.assert_allclose(10 ** (spec / 20), ref, rtol=1e-12, atol=1e-14 * ref.max())
        self.assertLess(np.max(np.abs(res)), 0.05)
        # Mode 0 writes neither array; n below the record's length measures the first n samples.
        s, found, (_, _, _, res, spec), _ = multitone(np.r_[x, np.ones(77)], dt, mode=0, threshold=0.05, n=n)
        self.assertEqual((s, found, res.size, spec.size), (0, 2, n, (n + 1) // 2))

    def test_no_tones_and_no_search(self):
        s, found, (fr, am, ph, res, spec), scalars = multitone(np.zeros(64), 0.5, mode=1)
        self.assertEqual((s, found, fr.size, scalars), (0, 0, 0, (0.5, 0.0, 1 / 32)))
        np.testing.assert_array_equal(res, np.zeros(64))
        self.assertTrue(np.all(np.isneginf(spec)))
        # maxTones 0: nothing resized, found left as it was.
        outs = [tw.array(np.full(3, 9.0)) for _ in range(5)]
        found = I32(-5)
        s = tw.lib.MultipleToneMeasurements(tw.array(np.ones(8)), 8, -1.0, 0, 9, 0.0, 0, ctypes.byref(found),
                                            *outs[:4], PD(D(7)), outs[4], PD(D(7)), PD(D(7)))
        self.assertEqual((s, found.value), (0, -5))
        for o in outs:
            np.testing.assert_array_equal(o.numpy(), [9.0] * 3)


if __name__ == "__main__":
    unittest.main()
