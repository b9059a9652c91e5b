"""Decimators, moving sums, CIC filters and resamplers against NumPy/SciPy renderings, and the
stream property: a stream cut anywhere gives what one block gives."""
import ctypes
import unittest

import numpy as np
import scipy.signal as ss

import twanlys as tw

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
        for trial in range(150):
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
    def test_decimator_over_random_cuts(self):
        rng = np.random.default_rng(65)
        for trial in range(60):
            stages, r, d = int(rng.integers(1, 4)), int(rng.integers(1, 5)), int(rng.integers(1, 3))
            mode, n, delay0 = trial % 3, int(rng.integers(1, 150)), int(rng.integers(0, 2)) * int(rng.integers(0, 40))
            x = rng.standard_normal(n)
            v = x
            for _ in range(stages):
                v = cic_stage(v, r * d, mode)
            want = v[delay0::r]
            state, delay, reset, out = tw.empty(), I32(delay0), 1, []
            for piece in cuts(rng, n, int(rng.integers(1, 6))):
                if len(piece) == 0:
                    continue
                s, y = cic_call("CICDecimatorByMovH", x[piece], state, stages, r, d, mode, reset, delay)
                self.assertEqual(s, 0)
                out.append(y)
                reset = 0
            self.assertEqual(state.shape(), ((r * d + 1) * stages + 1,))
            close(self, np.concatenate(out), want, 4 * n * EPS * 2 ** stages, trial)

    def test_interpolator_stuffs_r_x(self):
        rng = np.random.default_rng(66)
        for trial in range(30):
            stages, r, d = int(rng.integers(1, 4)), int(rng.integers(1, 5)), int(rng.integers(1, 3))
            mode, n, delay0 = trial % 2, int(rng.integers(1, 60)), int(rng.integers(0, 50))
            x = rng.standard_normal(n)
            u = np.zeros(n * r)
            u[::r] = r * x
            for _ in range(stages):
                u = cic_stage(u, r * d, mode)
            state, delay, reset, out = tw.empty(), I32(delay0), 1, []
            for piece in cuts(rng, n, int(rng.integers(1, 5))):
                if len(piece) == 0:
                    continue
                s, y = cic_call("CICInterpolatorByMovH", x[piece], state, stages, r, d, mode, reset, delay)
                self.assertEqual(s, 0)
                out.append(y)
                reset = 0
            self.assertEqual(state.shape(), ((r * d + 1) * stages,))
            close(self, np.concatenate(out), u[delay0:], 4 * n * r * EPS * r * 2 ** stages, trial)
            self.assertEqual(delay.value, max(0, delay0 - n * r))

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


if __name__ == "__main__":
    unittest.main()
