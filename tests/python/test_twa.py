"""twa on user data: CSV and WAV input, CSV output, plots, errors and exit codes."""
import csv
import io
import os
import struct
import subprocess
import tempfile
import unittest
import wave

import numpy as np

BUILD = os.environ.get("TWANLYS_LIB_DIR", os.path.join(os.path.dirname(__file__), "..", "..", "build"))
TWA = os.path.join(BUILD, "twa")


def run(*args, env=None):
    p = subprocess.run([TWA, *args], capture_output=True, text=True, env=env)
    return p.returncode, p.stdout, p.stderr


def rows(text):
    return list(csv.DictReader(io.StringIO("\n".join(l for l in text.splitlines() if not l.startswith("#")))))


class Twa(unittest.TestCase):
    def setUp(self):
        self.dir = tempfile.TemporaryDirectory()
        self.rng = np.random.default_rng(7)

    def tearDown(self):
        self.dir.cleanup()

    def path(self, name, text=None):
        p = os.path.join(self.dir.name, name)
        if text is not None:
            with open(p, "w") as f:
                f.write(text)
        return p

    def test_stats_of_csv_columns(self):
        data = self.rng.normal(size=(101, 2))
        p = self.path("d.csv", "a,b\n" + "\n".join(f"{u!r},{v!r}" for u, v in data))
        rc, out, _ = run("stats", p)
        self.assertEqual(rc, 0)
        for row, col in zip(rows(out), data.T):
            self.assertEqual(int(row["count"]), 101)
            for key, ref in (("mean", col.mean()), ("rms", np.sqrt(np.mean(col**2))), ("median", np.median(col)),
                             ("variance", col.var()), ("min", col.min()), ("max", col.max())):
                self.assertAlmostEqual(float(row[key]), ref, delta=1e-14 * max(1.0, abs(ref)))
        rc, out, _ = run("stats", p, "--column", "b")
        self.assertEqual([r["column"] for r in rows(out)], ["b"])

    def test_spectrum_of_wav_sine(self):
        rate, n, f0, amp = 8000, 1024, 1000.0, 0.5  # f0 on a bin: the Hann window reads A^2/2 exactly
        t = np.arange(n) / rate
        pcm = np.round(amp * np.sin(2 * np.pi * f0 * t) * 32767).astype("<i2")
        p = self.path("s.wav")
        with wave.open(p, "wb") as w:
            w.setnchannels(1), w.setsampwidth(2), w.setframerate(rate), w.writeframes(pcm.tobytes())
        rc, out, _ = run("spectrum", p)
        self.assertEqual(rc, 0)
        r = rows(out)
        self.assertEqual(len(r), n // 2 + 1)
        peak = max(r, key=lambda row: float(row["power"]))
        self.assertEqual(float(peak["frequency"]), f0)
        self.assertAlmostEqual(float(peak["power"]), (amp * 32767 / 32768) ** 2 / 2, delta=1e-4)
        rc, out, _ = run("stats", p)
        self.assertAlmostEqual(float(rows(out)[0]["max"]), pcm.max() / 32768, delta=1e-15)

    def test_bad_input(self):
        bad = self.path("bad.csv", "1,2\n3,4\n5,x7\n")
        cases = [(("stats", self.path("missing.csv")), 1, "missing.csv: No such file"),
                 (("stats", bad), 1, "bad.csv:3: column 2: \"x7\" is not a number"),
                 (("stats", self.path("r.csv", "1,2\n3\n")), 1, "r.csv:2: 1 cells where the first row has 2"),
                 (("stats", self.path("ok.csv", "1,2\n"), "--column", "3"), 1, "no column \"3\""),
                 (("spectrum", bad, "--window", "nosuch"), 2, "unknown window"),
                 (("window", "hann", "0"), 2, "positive integer"),
                 (("frobnicate",), 2, "")]
        for args, code, message in cases:
            rc, _, err = run(*args)
            self.assertEqual(rc, code, args)
            self.assertIn(message, err, args)

    def test_plots(self):
        svg, png = self.path("w.svg"), self.path("s.png")
        self.assertEqual(run("window", "blackman", "64", "--plot", svg)[0], 0)
        with open(svg) as f:
            self.assertIn('width="800" height="500"', f.read(400))
        p = self.path("x.csv", "\n".join(str(v) for v in self.rng.normal(size=256)))
        self.assertEqual(run("spectrum", p, "--plot", png)[0], 0)
        with open(png, "rb") as f:
            head = f.read(24)
        self.assertEqual(head[:8], b"\x89PNG\r\n\x1a\n")
        self.assertEqual(struct.unpack(">II", head[16:24]), (800, 500))
        rc, _, err = run("window", "hann", "8", "--plot", svg, env={"PATH": "/nonexistent"})
        self.assertEqual(rc, 1)
        self.assertIn("gnuplot-nox", err)

    def test_help(self):
        for command in ("demo", "stats", "spectrum", "window"):
            rc, out, _ = run(command, "--help")
            self.assertEqual(rc, 0)
            self.assertTrue(out.startswith("usage: twa " + command))


if __name__ == "__main__":
    unittest.main()
