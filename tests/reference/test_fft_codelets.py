"""The committed FFT codelets are what the generator in tools/ writes now."""
import os
import subprocess
import unittest

ROOT = os.path.join(os.path.dirname(os.path.abspath(__file__)), "..", "..")
GENERATOR = os.path.join(ROOT, "tools", "gen_fft_kernels.py")
COMMITTED = os.path.join(ROOT, "src", "transform", "fft", "kernels", "dft_blocks.hpp")


class Codelets(unittest.TestCase):
    def test_committed_output_is_current(self):
        fresh = subprocess.run(["/usr/bin/python3", GENERATOR], check=True, capture_output=True, text=True).stdout
        with open(COMMITTED) as f:
            self.assertTrue(fresh == f.read(), "regenerate with the command at the top of dft_blocks.hpp")

    def test_header_names_the_command(self):
        with open(COMMITTED) as f:
            self.assertIn("tools/gen_fft_kernels.py", f.readline())


if __name__ == "__main__":
    unittest.main()
