"""The Python package: statuses as exceptions and warnings, the generated status table."""
import os
import subprocess
import sys
import unittest
import warnings

import numpy as np

import twanlys as tw
from twanlys import lowlevel as ll

ROOT = os.path.join(os.path.dirname(os.path.abspath(__file__)), "..", "..")


class Statuses(unittest.TestCase):
    def test_table_matches_header(self):
        gen = os.path.join(ROOT, "tools", "gen_python_status.py")
        self.assertEqual(subprocess.call([sys.executable, gen, "--check"]), 0,
                         "python/twanlys/_status.py is stale: run tools/gen_python_status.py")

    def test_groups(self):
        cases = [(-20003, tw.SizeError, "EmptyArrayErr"), (-20001, tw.TwanlysMemoryError, "OutOfMemoryErr"),
                 (-20068, tw.NumericalError, "NanInfErr"), (-20061, tw.ArgumentError, "InvalidSelectorErr")]
        for status, cls, name in cases:
            with self.assertRaises(cls) as caught:
                tw.check(status, "X")
            self.assertEqual((caught.exception.status, caught.exception.name), (status, name))
            self.assertIsInstance(caught.exception, tw.TwanlysError)

    def test_warning_keeps_going(self):
        x, y = ll.array(np.ones(5)), ll.array(np.ones(3))
        mse, status = ll.f64(), ll.i32()
        ll.lib.MSE_head(x, y, mse.ref, status.ref)
        with warnings.catch_warnings(record=True) as seen:
            warnings.simplefilter("always")
            tw.check(status.value, "MSE_head")
        self.assertEqual(len(seen), 1)
        self.assertIsInstance(seen[0].message, tw.TwanlysWarning)
        self.assertEqual(seen[0].message.name, "LengthsDifferWarn")


if __name__ == "__main__":
    unittest.main()
