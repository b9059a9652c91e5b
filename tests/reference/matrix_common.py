"""Test matrices and error measures shared by the matrix reference tests."""
import numpy as np

C128 = np.complex128
EPS = 2.0 ** -52


def rnd(rng, shape, cx):
    a = rng.standard_normal(shape)
    return a + 1j * rng.standard_normal(shape) if cx else a


def ill(n, cx):
    """Hilbert matrix, condition about 1.5e10 at n = 8 (complex: a unit phase per row)."""
    i = np.arange(n)
    h = 1.0 / (i[:, None] + i[None, :] + 1)
    return h * np.exp(1j * i)[:, None] if cx else h


def rel(got, want):
    """max |got - want| / max |want|, 0 for empty arrays."""
    want = np.asarray(want)
    if not want.size:
        return 0.0
    return np.max(np.abs(np.asarray(got) - want)) / max(np.max(np.abs(want)), 1e-300)


def unitary_err(q):
    return np.abs(q.conj().T @ q - np.eye(q.shape[1])).max()
