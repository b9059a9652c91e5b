"""Finds and loads libtwrt.so and libtwanlys.so.

Where the libraries are looked for, first match wins:
  1. the folder named by TWANLYS_LIB_DIR (a build tree);
  2. next to this package (a bundled copy);
  3. <prefix>/lib* for the prefix named by TWANLYS_PREFIX;
  4. the dynamic loader's search path (LD_LIBRARY_PATH, ld.so.cache), by soname;
  5. the prefix this package was installed with by `cmake --install`;
  6. the build tree of a source checkout (../../build from here).
"""
import ctypes
import glob
import os

_HERE = os.path.dirname(os.path.abspath(__file__))
_HOST, _LIB = "libtwrt.so", "libtwanlys.so.0"


def _prefix_dirs(prefix):
    return sorted(glob.glob(os.path.join(prefix, "lib*"))) + sorted(
        glob.glob(os.path.join(prefix, "lib", "*-linux-gnu")))


def _candidates():
    env = os.environ.get("TWANLYS_LIB_DIR")
    if env:
        yield env
    yield _HERE
    prefix = os.environ.get("TWANLYS_PREFIX")
    if prefix:
        yield from _prefix_dirs(prefix)
    yield None  # the loader's own search
    try:
        from ._installed import PREFIX  # written by cmake --install
        yield from _prefix_dirs(PREFIX)
    except ImportError:
        pass
    yield os.path.join(_HERE, "..", "..", "build")


def load():
    """(host, library) as ctypes.CDLL; the host is loaded globally so the library binds to it."""
    tried = []
    for folder in _candidates():
        if folder is None:
            try:
                host = ctypes.CDLL(_HOST, mode=ctypes.RTLD_GLOBAL)
                return host, ctypes.CDLL(_LIB)
            except OSError:
                tried.append("the loader's search path")
                continue
        lib = os.path.join(folder, _LIB)
        if not os.path.exists(lib):
            lib = os.path.join(folder, "libtwanlys.so")
        if os.path.exists(lib) and os.path.exists(os.path.join(folder, _HOST)):
            host = ctypes.CDLL(os.path.join(folder, _HOST), mode=ctypes.RTLD_GLOBAL)
            return host, ctypes.CDLL(lib)
        tried.append(folder)
    raise OSError("twanlys: libtwanlys.so.0 and libtwrt.so not found; looked in " + ", ".join(tried) +
                  " (set TWANLYS_PREFIX to the installation prefix)")
