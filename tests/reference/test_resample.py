"""Decimators, moving sums, CIC filters and resamplers against NumPy/SciPy renderings, and the
stream property: a stream cut anywhere gives what one block gives."""
import ctypes
import unittest

import numpy as np
import scipy.signal as ss

from twanlys import lowlevel as tw

lib = tw.lib
EPS = 2.0**-52
D, I32, U8, P = ctypes.c_double, ctypes.c_int32, ctypes.c_uint8, ctypes.c_void_p
PI = ctypes.POINTER(I32)
PD = ctypes.POINTER(D)
lib.DecimateCIN.argtypes = [P, PI, ctypes.POINTER(U8), PI]
lib.CxDecimate_H.argtypes = [P, I32, I32]
lib.DecimateContinuous_H.argtypes = [P, I32, I32, PI, I32, PI, PD]
lib.CxDecimateContinuous_H.argtypes = [P, I32, I32, PI, I32, PI, PD]
for name in ("ReDecimatedMovingAverageH", "CxDecimatedMovingAverageH"):
    getattr(lib, name).argtypes = [P, I32, PD, PI, I32, PI]
    getattr(lib, name).restype = None
for name in ("ReCascadedMovingAverageH", "CxCascadedMovingAverageH"):
    getattr(lib, name).argtypes = [P, I32, I32, P, P, PI, I32]
for name in ("CICDecimatorByMovH", "CICInterpolatorByMovH"):
    getattr(lib, name).argtypes = [P, P, P, I32, I32, I32, I32, U8, PI]


def signal(rng, n, cx):
    v = rng.standard_normal(n)
    return v + 1j * rng.standard_normal(n) if cx else v


def dtype(cx):
    return np.complex128 if cx else np.float64


def placements():
    """Packed blocks (element data at 4 mod 8, worked on through staging copies), then aligned."""
    for aligned in (0, 1):
        tw.placement(aligned)
        yield aligned
    tw.placement(0)


def cuts(rng, n, pieces):
    """n split at pieces - 1 random places (empty pieces included)."""
    edges = np.sort(rng.integers(0, n + 1, pieces - 1))
    return np.split(np.arange(n), edges)


def close(test, got, want, scale, what):
    test.assertEqual(got.shape, want.shape, what)
    np.testing.assert_allclose(got, want, rtol=0, atol=scale, err_msg=what)


class Decimation(unittest.TestCase):
    def test_block_picks_and_means(self):
        rng = np.random.default_rng(61)
        for n, f in ((1, 1), (10, 1), (10, 3), (12, 4), (7, 7), (1000, 9)):
            for cx in (False, True):
                x = signal(rng, n, cx)
                k = n // f
                for average in (0, 1):
                    h = tw.array(x, dtype(cx))
                    if cx:
                        s = lib.CxDecimate_H(h, f, average)
                    else:
                        st = I32(7)
                        self.assertEqual(lib.DecimateCIN(h, I32(f), U8(average), st), 0)
                        s = st.value
                    self.assertEqual(s, 0)
                    want = x[:k * f].reshape(k, f).mean(axis=1) if average else x[:k * f:f]
                    close(self, h.numpy(), want, 2 * f * EPS * np.max(np.abs(x)), (n, f, cx, average))

    def test_block_statuses(self):
        for x, f, want in (([], 1, -20003), ([1.0, 2.0], 0, -20022), ([1.0, 2.0], 3, -20022)):
            h, st = tw.array(x), I32(7)
            lib.DecimateCIN(h, I32(f), U8(1), st)
            self.assertEqual((st.value, h.shape()), (want, (0,)))
            h = tw.array(x, np.complex128)
            self.assertEqual((lib.CxDecimate_H(h, f, 0), h.shape()), (want, (0,)))

    def continuous(self, cx, pieces, f, average, offset, reset=1):
        name = "CxDecimateContinuous_H" if cx else "DecimateContinuous_H"
        off, part = I32(offset), I32(3)
        total = (D * 2)(99.0, 99.0)  # stale carry that the reset must clear
        out = []
        for p in pieces:
            h = tw.array(p, dtype(cx))
            self.assertEqual(getattr(lib, name)(h, f, average, off, reset, part, total), 0)
            out.append(h.numpy())
            reset = 0
        return np.concatenate(out), (off.value, part.value, total[0], total[1])

    def test_stream_cut_anywhere_is_one_block(self):
        rng = np.random.default_rng(62)
        for trial, _ in ((t, a) for t in range(150) for a in placements()):
            cx, average = bool(trial % 2), trial // 2 % 2
            n, f = int(rng.integers(0, 60)), int(rng.integers(1, 8))
            offset = int(rng.integers(0, 2 * f + 3))
            x = signal(rng, n, cx)
            whole, carry = self.continuous(cx, [x], f, average, offset)
            if average:
                k = max(0, (n - offset) // f)
                want = x[offset:offset + k * f].reshape(k, f).mean(axis=1)
            else:
                want = x[offset::f]
            close(self, whole, want.astype(dtype(cx)), 2 * f * EPS * max(1.0, np.max(np.abs(x), initial=0)),
                  (trial, "one block"))
            split, carry2 = self.continuous(cx, [x[i] for i in cuts(rng, n, int(rng.integers(1, 6)))], f, average,
                                            offset)
            np.testing.assert_array_equal(split, whole, str(trial))
            self.assertEqual(carry2, carry, trial)

    def test_statuses_empty_x_and_keep_the_carry(self):
        for f, offset, want in ((0, 0, -20140), (0, -1, -20140), (2, -1, -20059)):
            h, off, part, total = tw.array([1.0, 2.0, 3.0]), I32(offset), I32(1), D(4.0)
            self.assertEqual(lib.DecimateContinuous_H(h, f, 1, off, 0, part, total), want)
            self.assertEqual((h.shape(), off.value, part.value), ((0,), offset, 1))
            self.assertTrue(np.isnan(total.value))


class MovingSums(unittest.TestCase):
    def test_decimated_block_sums_over_a_stream(self):
        rng = np.random.default_rng(63)
        for trial in range(40):
            cx = bool(trial % 2)
            n, f = int(rng.integers(0, 80)), int(rng.integers(2, 9))
            x = signal(rng, n, cx)
            name = "CxDecimatedMovingAverageH" if cx else "ReDecimatedMovingAverageH"
            total, count, produced = (D * 2)(5.0, 5.0), I32(1), I32(-1)
            reset, out = 1, []
            for piece in cuts(rng, n, int(rng.integers(1, 5))):
                h = tw.array(x[piece], dtype(cx))
                getattr(lib, name)(h, f, total, count, reset, produced)
                reset = 0
                self.assertEqual(h.shape(), (len(piece),))
                out.append(h.numpy()[:produced.value])
            k = n // f
            want = x[:k * f].reshape(k, f).sum(axis=1)
            close(self, np.concatenate(out).astype(dtype(cx)), want.astype(dtype(cx)),
                  f * EPS * max(1.0, np.max(np.abs(x), initial=0)), trial)
            self.assertEqual(count.value, n % f)
        # A factor below 2 reports every sample as produced and leaves x alone.
        h, produced = tw.array([1.0, 2.0, 3.0]), I32()
        lib.ReDecimatedMovingAverageH(h, 1, D(0), I32(0), 1, produced)
        self.assertEqual((produced.value, list(h.numpy())), (3, [1.0, 2.0, 3.0]))

    def cascade(self, cx, pieces, stages, width, reset=1, sums=None, window=None, position=0):
        name = "CxCascadedMovingAverageH" if cx else "ReCascadedMovingAverageH"
        sums = sums or tw.empty(dtype(cx))
        window = window or tw.empty(dtype(cx), dims=2)
        pos, out = I32(position), []
        for p in pieces:
            h = tw.array(p, dtype(cx))
            self.assertEqual(getattr(lib, name)(h, stages, width, sums, window, pos, reset), 0)
            out.append(h.numpy())
            reset = 0
        return np.concatenate(out), pos.value

    def test_cascade_is_repeated_convolution_cut_anywhere(self):
        rng = np.random.default_rng(64)
        for trial in range(40):
            cx = bool(trial % 2)
            n, stages, width = int(rng.integers(1, 120)), int(rng.integers(1, 4)), int(rng.integers(1, 9))
            x = signal(rng, n, cx)
            want = x
            for _ in range(stages):
                want = np.convolve(want, np.ones(width))[:n]
            got, pos = self.cascade(cx, [x[i] for i in cuts(rng, n, int(rng.integers(1, 5)))], stages, width)
            close(self, got, want, 4 * n * EPS * width ** stages * np.max(np.abs(x)), trial)
            self.assertEqual(pos, n % width)

    def test_constant_settles_at_c_width_to_the_stages(self):
        for stages, width in ((1, 5), (2, 3), (3, 4)):
            got, _ = self.cascade(False, [np.full(40, 0.5)], stages, width)
            self.assertEqual(got[-1], 0.5 * width ** stages)
        # A position outside the window rebuilds the state even without a reset; widths below 1
        # and width 1 without a reset leave x alone.
        got, pos = self.cascade(False, [np.ones(3)], 1, 2, reset=0, position=5)
        self.assertEqual((list(got), pos), ([1.0, 2.0, 2.0], 1))
        for width, reset in ((0, 1), (1, 0)):
            got, pos = self.cascade(False, [np.ones(3)], 1, width, reset=reset, position=7)
            self.assertEqual((list(got), pos), ([1.0, 1.0, 1.0], 7))


def cic_stage(u, width, mode):
    b = np.ones(width) if mode == 0 else (-1.0) ** np.arange(width)
    return ss.lfilter(b / width, [1.0], u)


def cic_call(name, x, state, stages, r, d, mode, reset, delay):
    y = tw.empty()
    s = getattr(lib, name)(tw.array(x), y, state, stages, r, d, mode, reset, delay)
    return s, y.numpy()


class Cic(unittest.TestCase):
    def test_one_pass_over_random_cuts(self):
        rng = np.random.default_rng(65)
        for trial in range(90):
            decimator = trial % 2 == 0
            stages, r, d = int(rng.integers(1, 4)), int(rng.integers(1, 5)), int(rng.integers(1, 3))
            mode, n, delay0 = trial % 3, int(rng.integers(1, 150)), int(rng.integers(0, 2)) * int(rng.integers(0, 40))
            x = rng.standard_normal(n)
            if decimator:
                v = x
            else:  # the interpolator stuffs R x[k] at k R
                v = np.zeros(n * r)
                v[::r] = r * x
            for _ in range(stages):
                v = cic_stage(v, r * d, mode)
            want = v[delay0::r] if decimator else v[delay0:]
            name = "CICDecimatorByMovH" if decimator else "CICInterpolatorByMovH"
            state, delay, reset, out = tw.empty(), I32(delay0), 1, []
            for piece in cuts(rng, n, int(rng.integers(1, 6))):
                if len(piece):
                    s, y = cic_call(name, x[piece], state, stages, r, d, mode, reset, delay)
                    self.assertEqual(s, 0)
                    out.append(y)
                    reset = 0
            self.assertEqual(state.shape(), ((r * d + 1) * stages + decimator,))
            close(self, np.concatenate(out), want, 4 * len(v) * EPS * r * 2 ** stages, trial)

    def test_statuses(self):
        for name, cells in (("CICDecimatorByMovH", 7), ("CICInterpolatorByMovH", 6)):
            # stages 2, R 2, D 1: the parameter test precedes the state test.
            for stages, r, d, state, reset, x, want in (
                    (0, 2, 1, [], 0, [1.0], -20140), (2, 2, 0, [], 0, [1.0], -20140),
                    (2, 2, 1, [0.0] * (cells - 1), 0, [1.0], -24034),
                    (2, 2, 1, [0.0] * (cells - 1), 0, [], -24034)):
                st = tw.array(state)
                s, y = cic_call(name, x, st, stages, r, d, 0, reset, I32(0))
                self.assertEqual((s, len(y), st.shape()), (want, 0, (0,)), name)
            st, delay = tw.array(np.arange(cells, dtype=float)), I32(3)
            s, y = cic_call(name, [], st, 2, 2, 1, 0, 0, delay)
            self.assertEqual((s, len(y), delay.value), (24003, 0, 3))
            np.testing.assert_array_equal(st.numpy(), np.arange(cells))


for name in ("RationalResample_H", "CxRationalResample_H", "RationalResampleMultiCh_H", "CxRationalResampleMCh_H"):
    getattr(lib, name).argtypes = [P, I32, I32, I32, PI, P, P, PI, P]


def rational_stream(name, pieces, l, m, h, delay0, state=None, multi=False):
    """Feeds the pieces one call each; returns the outputs joined, the state, delay and count."""
    cx = name.startswith("Cx")
    make = tw.matrix if multi else tw.array
    state = state or tw.empty(dtype(cx), dims=2 if multi else 1)
    delay, count, reset, out = I32(delay0), I32(0), 0 if multi else 1, []
    for p in pieces:
        y = tw.empty(dtype(cx), dims=2 if multi else 1)
        s = getattr(lib, name)(make(p, dtype(cx)), l, m, reset, delay, tw.array(h), state, count, y)
        if s != 0:
            return s, None, state, delay.value, count.value
        out.append(y.numpy())
        reset = 0
    return 0, np.concatenate(out, axis=-1), state, delay.value, count.value


def rational_reference(v, l, m, h, delay0):
    c = (len(h) - 1) // 2
    full = np.concatenate([l * ss.upfirdn(h[::-1], v, l), np.zeros(l)])  # upfirdn stops short when taps < l
    k = max(0, (len(v) * l - c - delay0 - 1) // m + 1)
    return full[delay0 + c + m * np.arange(k)]


class Rational(unittest.TestCase):
    def test_random_rates_taps_delays_and_cuts(self):
        rng = np.random.default_rng(71)
        worst = 0.0
        for trial in range(240):
            while True:
                l, m = (int(v) for v in rng.integers(1, 9, 2))
                if np.gcd(l, m) == 1:
                    break
            taps = 2 * int(rng.integers(0, 12)) + 1  # short filters too: taps below 2 l - 1
            n, delay0, cx = int(rng.integers(0, 90)), int(rng.integers(0, 3 * l + taps)), trial % 4 == 3
            name = "CxRationalResample_H" if cx else "RationalResample_H"
            h, x = rng.standard_normal(taps), signal(rng, n, cx)
            want = rational_reference(x, l, m, h, delay0)
            s, whole, _, d1, c1 = rational_stream(name, [x], l, m, h, delay0)
            self.assertEqual(s, 0)
            scale = 2 * l * taps * EPS * np.max(np.abs(h)) * max(1.0, np.max(np.abs(x), initial=0))
            close(self, whole, want.astype(dtype(cx)), scale, (trial, l, m, taps, delay0))
            worst = max(worst, np.max(np.abs(whole - want), initial=0) / scale)
            pieces = [x[i] for i in cuts(rng, n, int(rng.integers(2, 7)))]
            s, split, _, d2, c2 = rational_stream(name, pieces, l, m, h, delay0)
            self.assertEqual(s, 0, (trial, l, m, taps, delay0))
            np.testing.assert_array_equal(split, whole, str(trial))
            self.assertEqual((d2, c2), (d1, c1), trial)
        print("\nrational: worst error / bound %.3g" % worst)

    def test_short_block_waits_in_the_state(self):
        h = np.ones(31)
        s, y, state, delay, count = rational_stream("RationalResample_H", [[1.0, 2.0]], 3, 2, h, 0)
        self.assertEqual((s, len(y), delay, count), (0, 0, 0, 2))
        self.assertEqual(list(state.numpy()), [1.0, 2.0] + [0.0] * 9)

    def test_channels_share_one_timing(self):
        rng = np.random.default_rng(72)
        for cx, _ in ((cx, a) for cx in (False, True) for a in placements()):
            name = "CxRationalResampleMCh_H" if cx else "RationalResampleMultiCh_H"
            l, m, taps, delay0, n = 5, 3, 41, 7, 120
            h, x = rng.standard_normal(taps), signal(rng, (3, n), cx)
            # The empty state is created on the first call, which does not ask for a reset.
            pieces = [x[:, i] for i in cuts(rng, n, 4)]
            s, y, state, _, _ = rational_stream(name, pieces, l, m, h, delay0, multi=True)
            self.assertEqual((s, state.shape()), (0, (3, (taps - 1) // l + 1)))
            for r in range(3):
                one = rational_stream(name.replace("MultiCh", "").replace("MCh", ""), [x[r]], l, m, h, delay0)[1]
                np.testing.assert_array_equal(y[r], one)

    def test_statuses_empty_y_and_state(self):
        h3, h4 = np.ones(3), np.ones(4)
        rows = [  # (L, M, h, delay, stateCount, state cells, reset, status), tested in this order
            (0, 1, h4, -1, 0, 3, 1, -20059), (0, 1, h4, 0, -1, 3, 1, -20059), (0, 1, h4, 0, 0, 3, 1, -20140),
            (2, 0, h4, 0, 0, 3, 1, -20140), (2, 3, h4, 0, 0, 3, 1, -20033), (2, 3, [], 0, 0, 3, 1, -20033),
            (2, 4, h3, 0, 0, 3, 1, -20046), (2, 3, h3, 0, 4, 3, 0, -20046), (2, 3, h3, 0, 4, 3, 1, 0),
        ]
        for l, m, h, delay, count, cells, reset, want in rows:
            for multi in (False, True):
                name = "RationalResampleMultiCh_H" if multi else "RationalResample_H"
                make = tw.matrix if multi else tw.array
                state = make(np.ones((1, cells)) if multi else np.ones(cells))
                y = make(np.ones((1, 2)) if multi else np.ones(2))
                s = getattr(lib, name)(make([[1.0] * 6] if multi else [1.0] * 6), l, m, reset, I32(delay),
                                       tw.array(h), state, I32(count), y)
                self.assertEqual(s, want, (l, m, len(h), multi))
                if want:
                    self.assertEqual((y.shape(), state.shape()), ((0, 0) if multi else (0,),) * 2)
        state = tw.matrix(np.ones((2, 2)))
        s = lib.RationalResampleMultiCh_H(tw.matrix(np.ones((3, 4))), 1, 1, 1, I32(0), tw.array(h3), state, I32(0),
                                          tw.empty(dims=2))
        self.assertEqual((s, state.shape()), (-20008, (0, 0)))


class Settings(ctypes.Structure):
    _pack_ = 1
    _fields_ = [("ratio", D), ("interpolation", I32), ("start", D), ("table", P), ("oversample", I32)]


class Variable(ctypes.Structure):
    _pack_ = 1
    _fields_ = [("interpolation", I32), ("antiAlias", U8), ("table", P), ("oversample", I32)]


class State(ctypes.Structure):
    _pack_ = 1
    _fields_ = [("buffer", P), ("count", I32), ("coefs", P), ("scale", D), ("left", I32), ("right", I32),
                ("interpolation", I32), ("ratio", D), ("frac", D), ("index", I32)]


for name in ("Resample_Const", "CxResample_Const"):
    getattr(lib, name).argtypes = [P, ctypes.POINTER(State), ctypes.POINTER(Settings), I32, P, PI, I32]
for name in ("Resample_Variable", "CxResample_Variable"):
    getattr(lib, name).argtypes = [P, P, ctypes.POINTER(Variable), PD, PI, PI]
for name in ("Resample_Variable_MultiCh", "CxResample_Variable_MultiCh"):
    getattr(lib, name).argtypes = [P, P, P, ctypes.POINTER(Variable), PD, PI, PI]


def table_filter(table, over, interp, r, f):
    """left, right, scale and coefficients, rendered from the position arithmetic."""
    size = len(table)
    s = over / min(max(r, 1.0), over)
    half = (size - 1) / 2
    left, right = int(np.floor((half - s * f) / s)), int(np.floor((s * f + half) / s))
    pos = (half - s * f) - (left - 1) * s + np.arange(left + right) * s
    j = np.minimum(np.trunc(pos).astype(int), size - 1)
    nxt = table[np.minimum(j + 1, size - 1)]
    coef = table[j] if interp == 1 else np.where(j == size - 1, table[j], table[j] + (pos - j) * (nxt - table[j]))
    return left, right, s, coef


def table_output(v, i, left, right, s, coef):
    taps = left + right
    terms = [coef[taps - 1 - m] * v[i + right - m] for m in range(taps) if i + right - m >= 0]
    return s * sum(terms, 0.0)


def table_reference(x, times, table, over, interp, ratios):
    """Outputs at the instants while the filter at each ratio fits x."""
    out = []
    for p, r in zip(times, ratios):
        i = int(np.floor(p))
        left, right, s, coef = table_filter(table, over, interp, r, p - i)
        if i + right > len(x) - 1:
            break
        out.append(table_output(x, i, left, right, s, coef))
    return np.array(out, dtype=x.dtype)


def lowpass(over, half_cells):
    """A symmetric table of 2 half_cells over + 1 cells, unit sum, zero at both ends."""
    t = np.arange(-half_cells * over, half_cells * over + 1) / over
    table = np.sinc(t * 0.8) * np.cos(np.pi * t / (2 * half_cells)) ** 2
    return table / table.sum()


class TableResamplers(unittest.TestCase):
    def const_stream(self, name, pieces, table, over, interp, ratio, start, anti):
        cx = name.startswith("Cx")
        tab = tw.array(table)
        settings = Settings(ratio, interp, start, tab.h, over)
        state, buffer, coefs = State(), tw.empty(dtype(cx)), tw.empty()
        state.buffer, state.coefs = buffer.h, coefs.h
        out, reset = [], 1
        for p in pieces:
            y, produced = tw.empty(dtype(cx)), I32(-1)
            s = getattr(lib, name)(tw.array(p, dtype(cx)), state, settings, reset, y, produced, anti)
            if s != 0:
                return s, state, y, produced.value
            self.assertGreaterEqual(len(y.numpy()), produced.value)
            out.append(y.numpy()[:produced.value])
            # Ratio, interpolation and start are read on a reset only.
            reset, settings.ratio, settings.interpolation, settings.start = 0, 7.0, 1 - interp, 3.0
        return 0, state, np.concatenate(out), None

    def test_ratio_one_is_the_table_every_oversample_cells(self):
        rng = np.random.default_rng(81)
        for over, half in ((1, 3), (4, 2), (8, 5)):
            table = lowpass(over, half)
            x = rng.standard_normal(60)
            g = table[::over]  # cell 0 is 0, and so is the sample it would weigh
            want = over * np.correlate(np.r_[np.zeros(half), x, np.zeros(half)], g, "valid")[:len(x) - half]
            for interp in (0, 1):
                s, _, got, _ = self.const_stream("Resample_Const", [x], table, over, interp, 1.0, 0.0, 1)
                self.assertEqual(s, 0)
                close(self, got, want, 8 * half * EPS * np.max(np.abs(x)), (over, half, interp))

    def test_const_one_block_and_cuts(self):
        rng = np.random.default_rng(82)
        for trial in range(40):
            cx, interp, anti = trial % 4 == 3, trial % 2, trial // 2 % 2
            # Tables at least two input samples wide on each side: with one, the filter can
            # leave the next output one sample before the buffer, which reads as a fresh start.
            over, half = int(rng.choice([1, 4, 8, 16])), int(rng.integers(2, 6))
            table = lowpass(over, half)
            ratio = float(rng.choice([0.25, 0.75, 1.0, 1.25, 2.5, 3.0, 0.6875]))
            start = float(rng.choice([0.0, 0.5, 2.25, 7.75]))
            n = int(rng.integers(1, 150))
            x = signal(rng, n, cx)
            name = "CxResample_Const" if cx else "Resample_Const"
            s, _, whole, _ = self.const_stream(name, [x], table, over, interp, ratio, start, anti)
            self.assertEqual(s, 0)
            times = start + ratio * np.arange(int(n / ratio) + 2)
            want = table_reference(x, times, table, over, interp, [ratio if anti else 1.0] * len(times))
            close(self, whole, want, 4 * len(table) * EPS * np.max(np.abs(x)), trial)
            # Ratios and starts exact in binary give the same fractions on every split.
            pieces = [x[i] for i in cuts(rng, n, int(rng.integers(2, 7)))]
            s, _, split, _ = self.const_stream(name, pieces, table, over, interp, ratio, start, anti)
            self.assertEqual(s, 0)
            np.testing.assert_array_equal(split, whole, str(trial))

    def test_const_failures_zero_the_state(self):
        table = lowpass(4, 2)
        # A start before the buffer reads from index count - 1 = -1: with a one-cell table that
        # is one output more than the capacity n / ratio.
        s, state, y, produced = self.const_stream("Resample_Const", [np.ones(5)], np.ones(1), 1, 1, 1.0, -0.5, 1)
        fields = [getattr(state, f) for f, _ in State._fields_ if f not in ("buffer", "coefs")]
        self.assertEqual((s, y.shape(), produced, fields), (-20076, (0,), 0, [0] * 8))
        for tab, over, ratio, want in ((np.zeros(0), 4, 1.0, -20003), (table, 0, 1.0, -20140),
                                       (table, 4, 0.0, -20140), (table, 4, -1.0, -20140)):
            s = self.const_stream("Resample_Const", [np.ones(5)], tab, over, 0, ratio, 0.0, 1)[0]
            self.assertEqual(s, want)
            # The variable resampler has no ratio to refuse.
            times, last, ta = tw.array([0.5, 1.0]), D(0.0), tw.array(tab)
            s = lib.Resample_Variable(tw.array(np.ones(5)), times, Variable(0, 1, ta.h, over), last, I32(), I32())
            failed = (want, (0,), True) if ratio > 0 else (0, (2,), False)
            self.assertEqual((s, times.shape(), np.isnan(last.value)), failed)
        # The table and oversample are read on every call: a narrower step without a reset needs
        # more coefficients than the reset made room for.
        tab, buffer, coefs = tw.array(table), tw.empty(), tw.empty()
        state, settings = State(), Settings(1.0, 0, 0.0, tab.h, 4)
        state.buffer, state.coefs = buffer.h, coefs.h
        self.assertEqual(lib.Resample_Const(tw.array(np.ones(9)), state, settings, 1, tw.empty(), I32(), 1), 0)
        settings.oversample = 1
        y = tw.empty()
        self.assertEqual(lib.Resample_Const(tw.array(np.ones(9)), state, settings, 0, y, I32(), 1), -20075)
        self.assertEqual((buffer.shape(), coefs.shape(), state.count, state.ratio), ((0,), (0,), 0, 0.0))

    def variable_call(self, name, x, times, settings, last):
        cx, multi = name.startswith("Cx"), name.endswith("MultiCh")
        lt, done, consumed = D(last), I32(-1), I32(-1)
        if multi:
            th, y = tw.array(times), tw.empty(dtype(cx), dims=2)
            s = getattr(lib, name)(tw.matrix(x, dtype(cx)), y, th, settings, lt, done, consumed)
            return s, y.numpy(), th.numpy(), lt.value, done.value, consumed.value
        th = tw.array(times + 0j if cx else times, dtype(cx))
        s = getattr(lib, name)(tw.array(x, dtype(cx)), th, settings, lt, done, consumed)
        got = th.numpy()
        return s, got[:done.value], got[done.value:].real, lt.value, done.value, consumed.value

    def test_variable_one_block_and_a_stream(self):
        rng = np.random.default_rng(83)
        for trial in range(40):
            cx, interp, anti = trial % 4 == 3, trial % 2, trial // 2 % 2
            over, half = int(rng.choice([4, 8])), int(rng.integers(2, 5))
            table = lowpass(over, half)
            tab = tw.array(table)
            settings = Variable(interp, anti, tab.h, over)
            n = int(rng.integers(10, 80))
            x = signal(rng, n, cx)
            # Uneven gaps, exact in binary: a wide filter after narrow ones reaches back past
            # what the narrow ones needed.
            times = np.cumsum(rng.choice([0.25, 0.5, 3.5], 60, p=[0.6, 0.2, 0.2])) - 0.5
            name = "CxResample_Variable" if cx else "Resample_Variable"
            s, whole, rest, last, done, consumed = self.variable_call(name, x, times, settings, -1.0)
            want = table_reference(x, times, table, over, interp, np.diff(times, prepend=-1.0) if anti else [1.0] * 60)
            self.assertEqual((s, done), (0, len(want)))
            close(self, whole, want, 4 * len(table) * EPS * np.max(np.abs(x)), trial)
            np.testing.assert_array_equal(rest, times[done:] - consumed)
            self.assertEqual(last, times[done - 1] - consumed if done else -1.0 - consumed)
            # The caller's loop: drop consumed samples, call again with the rest and more samples.
            held, pending, last, out = x[:0], times, -1.0, []
            for piece in np.split(x, np.cumsum(rng.integers(1, 6, n))):
                held = np.r_[held, piece]
                s, y, pending, last, done, consumed = self.variable_call(name, held, pending, settings, last)
                self.assertEqual(s, 0)
                out.append(y)
                held = held[consumed:]
            np.testing.assert_array_equal(np.concatenate(out), whole, str(trial))

    def test_variable_channels(self):
        rng = np.random.default_rng(84)
        table = lowpass(4, 3)
        tab = tw.array(table)
        times = np.arange(0.5, 70.0, 1.5)
        for cx in (False, True):
            x = signal(rng, (3, 40), cx)
            settings = Variable(0, 1, tab.h, 4)
            name = "CxResample_Variable_MultiCh" if cx else "Resample_Variable_MultiCh"
            s, y, kept, last, done, consumed = self.variable_call(name, x, times, settings, 0.0)
            self.assertEqual((s, y.shape), (0, (3, done)))
            np.testing.assert_array_equal(kept, np.r_[times[:done], times[done:] - consumed])
            for r in range(3):
                one = self.variable_call(name.replace("_MultiCh", ""), x[r], times, settings, 0.0)
                np.testing.assert_array_equal(y[r], one[1])
                self.assertEqual((done, consumed), one[4:])


if __name__ == "__main__":
    unittest.main()
