"""Names and argument kinds of the signature table, shared by the Python layer and the reference
pages (no dependencies)."""
import keyword
import re

_SCALARS = ("i32", "len", "u8", "u16", "u32", "f32", "f64")


def snake(name, marks=True):
    """The Python name of an export: frame marks dropped (unless two exports would then share a
    name), words split, lower case."""
    base = re.sub(r"^TW_", "", name)
    if marks:
        base = re.sub(r"(_head|_H|CIN|H)(?=(_?\d+)?(_IDP)?$)", "", base)
    base = re.sub(r"([a-z])([A-Z])", r"\1_\2", base)
    base = re.sub(r"([0-9])([A-Z][a-z])", r"\1_\2", base)
    base = re.sub(r"([A-Z]+)([A-Z][a-z])", r"\1_\2", base)
    base = re.sub(r"_+", "_", base).strip("_").lower()
    return base + "_" if keyword.iskeyword(base) else base


class Arg:
    """One argument of a row: name, kind and what the Python function does with it."""

    def __init__(self, text):
        name, kind = text.split(":", 1)
        self.name = name + "_" if keyword.iskeyword(name) else name
        self.optional = kind.endswith("?")
        self.kind = kind.rstrip("?")
        parts = self.kind.split(".")
        self.head = parts[0]
        self.direction = parts[-1] if parts[-1] in ("in", "out", "io") else "in"
        self.element = parts[1] if len(parts) > 2 else (parts[0] if parts[0] in _SCALARS else "")


FAMILY_MODULES = {"windows": "window"}
LOWLEVEL_ONLY = ("ptr.", "fn.", "cluster")
LOWLEVEL_FAMILIES = ("link", "workspace")


def module_name(family):
    return FAMILY_MODULES.get(family, family or "other")


def has_python_form(row):
    """Exports with callbacks, opaque pointers or the error record, and the host link and workspace
    management, are left to the low-level layer."""
    return not any(":" + k in row[2] for k in LOWLEVEL_ONLY) and row[5] not in LOWLEVEL_FAMILIES


def python_names(rows):
    """{export: Python name} for the rows with a Python form; names that would collide within a
    family keep their frame marks."""
    from collections import Counter
    rows = [r for r in rows if has_python_form(r)]
    taken = Counter((r[5], snake(r[0])) for r in rows)
    return {r[0]: snake(r[0], marks=taken[(r[5], snake(r[0]))] == 1) for r in rows}
