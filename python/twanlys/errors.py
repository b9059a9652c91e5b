"""Statuses as Python exceptions and warnings.

Every negative status raises a subclass of TwanlysError carrying `.status` (the number) and `.name`
(its name in twanlys/status.h); positive statuses are warnings, issued as TwanlysWarning, and the
results stand.
"""
import warnings

from ._status import STATUS


class TwanlysError(Exception):
    """A twanlys export failed; `.status` and `.name` say how."""

    def __init__(self, status, export=""):
        self.status = status
        self.name, _, self.description = STATUS.get(status, (f"Status{status}", "", "unknown status"))
        where = f"{export}: " if export else ""
        super().__init__(f"{where}{self.name} ({status}): {self.description}")


class ArgumentError(TwanlysError, ValueError):
    """An argument is out of its range or inconsistent with another."""


class SizeError(TwanlysError, ValueError):
    """An array is empty, too short, or of a size that does not fit the others."""


class NumericalError(TwanlysError, ArithmeticError):
    """The data defeat the method: singular, not convergent, NaN or Inf where none may be."""


class TwanlysMemoryError(TwanlysError, MemoryError):
    """Memory or the Analysis Workspace ran out or is in the wrong state."""


class TwanlysWarning(UserWarning):
    """A positive status: the results stand, with a caveat."""

    def __init__(self, status, export=""):
        self.status = status
        self.name, _, self.description = STATUS.get(status, (f"Status{status}", "", "unknown status"))
        where = f"{export}: " if export else ""
        super().__init__(f"{where}{self.name} ({status}): {self.description}")


_GROUPS = {"argument": ArgumentError, "size": SizeError, "numerical": NumericalError,
           "memory": TwanlysMemoryError}


def check(status, export=""):
    """Raises for a negative status, warns for a positive one, returns None for 0."""
    if status < 0:
        group = STATUS.get(status, ("", "argument", ""))[1]
        raise _GROUPS.get(group, ArgumentError)(status, export)
    if status > 0:
        warnings.warn(TwanlysWarning(status, export), stacklevel=3)
