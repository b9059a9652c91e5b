"""The high-level Python layer: reachability from the table, results against the low-level calls
and NumPy, statuses as exceptions and warnings, inputs left alone, the GIL released."""
import os
import subprocess
import sys
import threading
import time
import unittest
import warnings

import numpy as np

import twanlys as tw
from twanlys import lowlevel as ll
from twanlys._table import ROWS

ROOT = os.path.join(os.path.dirname(os.path.abspath(__file__)), "..", "..")


class Table(unittest.TestCase):
    def test_table_is_current(self):
        gen = os.path.join(ROOT, "tools", "gen_python_table.py")
        self.assertEqual(subprocess.call([sys.executable, gen, "--check"]), 0,
                         "python/twanlys/_table.py is stale: run tools/gen_python_table.py")

    def test_every_export_reachable(self):
        lowlevel_only = [r[0] for r in ROWS if r[0] not in tw.EXPORTS]
        for name in lowlevel_only:  # callbacks, opaque pointers, the host link and the workspace
            self.assertTrue(any(k in r[2] for r in ROWS if r[0] == name for k in (":ptr.", ":fn.", ":cluster"))
                            or next(r[5] for r in ROWS if r[0] == name) in ("link", "workspace"), name)
        for row in ROWS:
            self.assertTrue(hasattr(ll.lib, row[0]), row[0])
        self.assertEqual(tw.api.SKIPPED, {})
        self.assertGreater(len(tw.EXPORTS), 0.9 * len(ROWS))
        for fn in tw.EXPORTS.values():
            self.assertIn("Export ", fn.__doc__)

    def test_reference_pages_cover_every_export(self):
        pages = os.path.join(os.environ.get("TWANLYS_LIB_DIR", os.path.join(ROOT, "build")), "doc", "reference")
        text = "".join(open(os.path.join(pages, f)).read() for f in os.listdir(pages))
        for row in ROWS:
            self.assertIn(f"## {row[0]}\n", text)


class Results(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(3)

    def test_scalars_and_arrays_match_the_low_level_calls(self):
        x = self.rng.normal(size=257)
        for name in ("Mean_head", "RMS_head", "Median_head"):
            out, status = ll.f64(), ll.i32()
            getattr(ll.lib, name)(ll.array(x), out.ref, status.ref)
            self.assertEqual(tw.EXPORTS[name](x), out.value, name)
        a, b = self.rng.normal(size=(5, 7)), self.rng.normal(size=(7, 3))
        c, status = ll.empty(dims=2), ll.i32()
        ll.lib.MatrixMul_head(ll.matrix(a), ll.matrix(b), c, status.ref)
        np.testing.assert_array_equal(tw.matrix.matrix_mul(a, b), c.numpy())
        np.testing.assert_allclose(tw.matrix.matrix_mul(a, b), a @ b, rtol=1e-13)

    def test_fft_with_its_cached_table(self):
        for n in (8, 1000, 1000, 1024):  # the repeat reuses the thread's work cell
            x = self.rng.normal(size=n)
            np.testing.assert_allclose(tw.fft.re_qxfft80(x, 0, n, 0), np.fft.fft(x), atol=1e-12 * n)

    def test_in_place_exports_return_a_copy(self):
        ones = np.ones(16)
        w = tw.window.all_win(ones, 1, np.nan, 0, 0)  # Hann, in place on the host's copy
        np.testing.assert_array_equal(ones, np.ones(16))
        np.testing.assert_allclose(w, np.hanning(17)[:16], atol=1e-15)

    def test_several_results_are_a_named_tuple(self):
        counts, centres = tw.stats.histgran([0.0, 1, 1, 2, 3], 3)
        np.testing.assert_array_equal(counts, [1, 2, 2])
        np.testing.assert_allclose(centres, [0.5, 1.5, 2.5])
        r = tw.stats.histgran([0.0, 1], 2)
        self.assertEqual(r._fields, ("counts", "centres"))


class Statuses(unittest.TestCase):
    def test_errors_by_group(self):
        with self.assertRaises(tw.SizeError) as e:
            tw.stats.median([])
        self.assertEqual((e.exception.status, e.exception.name), (-20003, "EmptyArrayErr"))
        with self.assertRaises(tw.NumericalError):
            tw.stats.median([1.0, np.nan])  # BoundsNanErr
        with self.assertRaises(tw.ArgumentError):
            tw.stats.moment([1.0, 2.0], 0)  # OrderNotPositiveErr

    def test_warning_keeps_the_result(self):
        with warnings.catch_warnings(record=True) as seen:
            warnings.simplefilter("always")
            mse = tw.stats.mse([1.0, 2, 3, 4, 5], [1.0, 2, 4])
        self.assertEqual(mse, 1 / 3)
        self.assertEqual(seen[0].message.name, "LengthsDifferWarn")


class Threads(unittest.TestCase):
    def test_the_gil_is_released_during_a_call(self):
        # While one thread is inside a long export, another keeps running Python code: with the GIL
        # held it would only run between the export's calls.
        a = np.random.default_rng(1).normal(size=(500, 500))
        start = time.perf_counter()
        tw.matrix.matrix_mul(a, a)
        once = time.perf_counter() - start
        done, ticks = threading.Event(), [0]

        def work():
            for _ in range(max(1, int(0.5 / once))):
                tw.matrix.matrix_mul(a, a)
            done.set()

        t = threading.Thread(target=work)
        t.start()
        while not done.is_set():
            ticks[0] += 1
        t.join()
        # With the GIL held through each product, the loop would get one switch interval per call.
        self.assertGreater(ticks[0], 50 * max(1, int(0.5 / once)))


if __name__ == "__main__":
    unittest.main()
