"""The low-level layer: ctypes bindings to twanlys through the reference host runtime.

NumPy arrays become host handles and back, so an export is called in a line or two:

    import numpy as np
    from twanlys import lowlevel as tw
    x = tw.array(np.arange(5.0))
    mean, status = tw.f64(), tw.i32()
    tw.lib.Mean_head(x, mean.ref, status.ref)

Pass arrays themselves, not their `.h`: a temporary array would be freed before the call.
"""
import ctypes

import numpy as np

from ._load import load

# The host runtime is loaded first and globally: the library finds its entries there.
twrt, lib = load()

twrt.TWRTNewArray.restype = ctypes.c_void_p
twrt.TWRTNewArray.argtypes = [ctypes.c_int32, ctypes.c_int32, ctypes.POINTER(ctypes.c_int32)]
twrt.HostDisposeHandle.argtypes = [ctypes.c_void_p]
twrt.HostNewHandle.restype = ctypes.c_void_p
twrt.HostNewHandle.argtypes = [ctypes.c_size_t]
twrt.TWRTSetPlacement.argtypes = [ctypes.c_int32]
twrt.TWRTFailResizeAt.argtypes = [ctypes.c_int32]
twrt.TWRTResizeCount.restype = ctypes.c_int64
twrt.TWRTAllocCount.restype = ctypes.c_int64


class Array:
    """An owned host handle holding a 1-D or 2-D array of one NumPy dtype."""

    def __init__(self, a, dtype=None, dims=None):
        a = np.ascontiguousarray(a, dtype=dtype)
        self.dtype = a.dtype
        self.dims = dims or max(a.ndim, 1)
        shape = list(a.shape) if a.ndim else [1]
        if self.dims == 1:
            shape = [a.size]
        c_shape = (ctypes.c_int32 * self.dims)(*shape)
        self.h = ctypes.c_void_p(twrt.TWRTNewArray(a.dtype.itemsize, self.dims, c_shape))
        if not self.h:
            raise MemoryError("the host could not allocate the array")
        if a.size:
            ctypes.memmove(self._data(), a.ctypes.data, a.nbytes)

    @property
    def _as_parameter_(self):
        # Passing the Array itself (not .h) keeps it alive for the length of the call.
        return self.h

    def __del__(self):
        if getattr(self, "h", None):
            twrt.HostDisposeHandle(self.h)
            self.h = None

    def _block(self):
        return ctypes.cast(self.h, ctypes.POINTER(ctypes.c_void_p))[0]

    def _data(self):
        return self._block() + 4 * self.dims

    def shape(self):
        words = ctypes.cast(self._block(), ctypes.POINTER(ctypes.c_int32))
        return tuple(words[i] for i in range(self.dims))

    def numpy(self, dtype=None):
        """A copy of the elements, read with the array's dtype or the one given."""
        dtype = np.dtype(dtype or self.dtype)
        shape = self.shape()
        n = int(np.prod(shape)) if min(shape) > 0 else 0
        out = np.empty(n, dtype=dtype)
        if n:
            ctypes.memmove(out.ctypes.data, self._data(), out.nbytes)
        return out.reshape(shape if self.dims >= 2 else (n,))


def array(a, dtype=np.float64):
    return Array(a, dtype=dtype, dims=1)


def matrix(a, dtype=np.float64):
    return Array(np.atleast_2d(a), dtype=dtype, dims=2)


def empty(dtype=np.float64, dims=1):
    return Array(np.zeros((0,) * dims, dtype=dtype), dims=dims)


class Scalar:
    """A scalar passed by pointer."""

    def __init__(self, ctype, value=0):
        self.c = ctype(value)
        self.ref = ctypes.byref(self.c)

    @property
    def value(self):
        return self.c.value


def f64(value=0.0):
    return Scalar(ctypes.c_double, value)


def i32(value=0):
    return Scalar(ctypes.c_int32, value)


def placement(aligned):
    """0: packed blocks (element data at 4 mod 8); 1: element data 64-byte aligned."""
    twrt.TWRTSetPlacement(1 if aligned else 0)
