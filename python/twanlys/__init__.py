"""twanlys from Python.

    import numpy as np, twanlys
    twanlys.lowlevel            # the exports as ctypes functions on host handles
    twanlys.TwanlysError        # raised for negative statuses (ArgumentError, SizeError, ...)

The library is looked up as `twanlys._load` describes (TWANLYS_LIB_DIR, next to the package,
TWANLYS_PREFIX, the loader's search path, the installation prefix).
"""
from . import lowlevel
from .errors import (ArgumentError, NumericalError, SizeError, TwanlysError, TwanlysMemoryError,
                     TwanlysWarning, check)
from .api import build_families as _build_families

# twanlys.stats.median(x), twanlys.fft.re_qxfft80(x, 0, n, 0), ...: one module per public header.
EXPORTS = _build_families(__import__(__name__))
