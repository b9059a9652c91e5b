"""The high-level layer: one Python function per export, made from the signature table.

NumPy arrays and Python scalars go in; NumPy arrays and Python scalars come out (a named tuple where
an export has several results). Inputs are copied into host handles and never modified; an export
that works in place returns the worked-on copy. Negative statuses raise TwanlysError subclasses,
positive ones warn (TwanlysWarning). The GIL is released during the call.

Names are the export's in snake_case with the frame marks dropped (`Median_head` ->
`twanlys.stats.median`, `ReQXFFTH80` -> `twanlys.fft.re_qxfft80`), grouped by the header that
declares them. Exports that take callbacks, opaque pointers or the workspace's error record are
reached through `twanlys.lowlevel` only.
"""
import atexit
import collections
import ctypes
import keyword
import re
import sys
import threading
import types

import numpy as np

from . import lowlevel as _ll
from ._names import Arg, has_python_form, module_name, python_names
from ._table import ROWS
from .errors import check as _check

_DTYPES = {"i32": np.int32, "u8": np.uint8, "u16": np.uint16, "u32": np.uint32, "f32": np.float32, "f64": np.float64,
           "c64": np.complex64, "c128": np.complex128, "len": np.int32}
_CTYPES = {"i32": ctypes.c_int32, "len": ctypes.c_int32, "u8": ctypes.c_uint8, "u16": ctypes.c_uint16,
           "u32": ctypes.c_uint32,
           "f32": ctypes.c_float, "f64": ctypes.c_double}


def _dtype(code):
    if code.startswith("b"):
        return np.dtype((np.void, int(code[1:])))
    return np.dtype(_DTYPES[code])


def _record_type(kind):
    """A packed ctypes Structure for rec.T[B]{fields}.D, and its field kinds."""
    m = re.match(r"c?rec\.(\w+)\[(\d+)\]\{(.*)\}", kind)
    fields = m.group(3).split(",")
    layout = [(f"f{i}", ctypes.c_void_p if f.startswith("h") else _CTYPES[f]) for i, f in enumerate(fields)]
    record = type(m.group(1), (ctypes.Structure,), {"_pack_": 1, "_fields_": layout})
    return record, fields


_TYPE_CODES = {"i32": 3, "u8": 5, "u32": 7, "f32": 9, "f64": 10, "c64": 12, "c128": 13}
_POOL_LIMIT, _POOL_BYTES = 8, 1 << 26  # handles kept per thread, and the largest block kept
_ZEROS = (ctypes.c_int32 * 2)(0, 0)


class _Pooled(_ll.Array):
    """A host handle from the thread's pool: resized (the host keeps the block where it can) rather
    than allocated and filled afresh on every call, so large arrays cost one copy each way."""

    def __init__(self, a, element, dims):
        self.dtype, self.dims, self.code = a.dtype, dims, _TYPE_CODES[element]
        spare = _cells.__dict__.setdefault("spare", [])
        self.h = spare.pop() if spare else _ct_handle(_ll.twrt.TWRTNewArray(a.dtype.itemsize, dims, _ZEROS))
        if self.h is None or _ll.twrt.HostResizeBlock(self.code, dims, ctypes.byref(self.h), a.size) != 0:
            self.release()
            raise MemoryError("the host could not allocate the array")
        shape = a.shape if dims == 2 else (a.size,)
        ctypes.memmove(self._block(), (ctypes.c_int32 * dims)(*shape), 4 * dims)
        if a.size:
            ctypes.memmove(self._data(), a.ctypes.data, a.nbytes)

    def release(self):
        h, self.h = self.h, None
        if not h:
            return
        spare = _cells.__dict__.setdefault("spare", [])
        code, size = ctypes.c_int32(), ctypes.c_int64()
        _ll.twrt.TWRTBlockInfo(h, ctypes.byref(code), ctypes.byref(size))
        if len(spare) < _POOL_LIMIT and size.value <= _POOL_BYTES:
            spare.append(h)
        else:
            _ll.twrt.HostDisposeHandle(h)


class _Cube(_ll.Array):
    """A 3-D block (three dimension words, then the elements), which the host makes as raw bytes."""

    def __init__(self, a):
        self.dtype, self.dims = a.dtype, 3
        self.h = ctypes.c_void_p(_ll.twrt.HostNewHandle(12 + a.nbytes))
        if not self.h:
            raise MemoryError("the host could not allocate the array")
        ctypes.memmove(self._block(), (ctypes.c_int32 * 3)(*a.shape), 12)
        if a.size:
            ctypes.memmove(self._data(), a.ctypes.data, a.nbytes)


def _release(handle):
    if isinstance(handle, _Pooled):
        handle.release()


def _ct_handle(h):
    return ctypes.c_void_p(h) if h else None


def _to_handle(value, element, dims):
    a = np.asarray(value, dtype=_dtype(element))
    if dims >= 2:
        a = np.atleast_2d(a) if dims == 2 else a
        if a.ndim != dims:
            raise ValueError(f"expected a {dims}-D array, got {a.ndim} dimensions")
    if dims == 3:
        return _Cube(np.ascontiguousarray(a))
    if element in _TYPE_CODES:
        return _Pooled(np.ascontiguousarray(a), element, dims)
    return _ll.Array(a, dims=dims)


class _Cells(threading.local):
    """Work cells and instance-data cells, one per export and thread: a call site that is never
    entered twice at once, as the library expects, and whose cached tables outlive the call."""

    def __init__(self):
        self.cells = {}


_cells = _Cells()
_idp_cells = []  # (unreserve export, cell) of every thread, released at exit
_idp_lock = threading.Lock()


def _cell(key, unreserve=None):
    cell = _cells.cells.get(key)
    if cell is None:
        cell = _cells.cells[key] = ctypes.c_void_p()
        if unreserve:
            with _idp_lock:
                _idp_cells.append((unreserve, cell))
    return cell


@atexit.register
def _release_cells():
    for unreserve, cell in _idp_cells:
        getattr(_ll.lib, unreserve)(ctypes.byref(cell))
    _ll.twrt.TWRTRunCleanups(-1)


def _build(row, pyname):
    """The source of one export's Python function, and the names it needs."""
    name, style, signature, contract, note, family, description = row
    words = signature.split()
    result, args = words[0], [Arg(w) for w in words[1:]]
    env = {"_ll": _ll, "_np": np, "_ct": ctypes, "_check": _check, "_to_handle": _to_handle, "_cell": _cell,
           "_dtype": _dtype, "_fn": getattr(_ll.lib, name), "_release": _release}
    params, before, call, after, outputs = [], [], [], [], []
    counted = {a.kind.split(".")[3] for a in args if a.head == "buf"}
    status_var = None
    for i, a in enumerate(args):
        v = f"_a{i}"
        if a.head in ("h1", "h2", "h3"):
            dims = int(a.head[1])
            if a.direction == "out":
                before.append(f"{v} = _to_handle(_np.zeros((0,) * {dims}, _dtype({a.element!r})), {a.element!r}, {dims})")
            else:
                params.append(a.name)
                before.append(f"{v} = _to_handle({a.name}, {a.element!r}, {dims})")
            if a.direction != "in":
                outputs.append((a.name, f"{v}.numpy()"))
            call.append(v)
        elif a.head in _CTYPES and a.name in counted:
            src = next(b for b in args if b.head == "buf" and b.kind.split(".")[3] == a.name)
            if src.direction == "out":
                params.append(a.name)
                call.append(f"int({a.name})")
            else:
                call.append(f"len({src.name}_)")
        elif a.head in _CTYPES:
            params.append(a.name)
            call.append(f"_ct.{_CTYPES[a.head].__name__}({a.name})")
        elif a.head in ("p", "cp") and a.element == "c128":
            # A complex scalar by pointer: two doubles, real part first.
            env["_C128"] = ctypes.c_double * 2
            if a.direction == "out":
                before.append(f"{v} = _C128()")
            else:
                params.append(a.name)
                before.append(f"{v} = _C128(complex({a.name}).real, complex({a.name}).imag)")
            if a.direction != "in":
                outputs.append((a.name, f"complex({v}[0], {v}[1])"))
            call.append(f"_ct.byref({v})")
        elif a.head in ("p", "cp"):
            ct = _CTYPES[a.element].__name__
            if a.direction == "out":
                before.append(f"{v} = _ct.{ct}()")
                outputs.append((a.name, f"{v}.value"))
            else:
                params.append(a.name)
                before.append(f"{v} = _ct.{ct}({a.name})")
                if a.direction == "io":
                    outputs.append((a.name, f"{v}.value"))
            call.append(f"_ct.byref({v})")
        elif a.head == "status":
            status_var = v
            before.append(f"{v} = _ct.c_int32()")
            call.append(f"_ct.byref({v})")
        elif a.head == "buf":
            el = a.kind.split(".")[1]
            count = a.kind.split(".")[3]
            if a.direction == "out":
                before.append(f"{a.name}_ = _np.zeros(int({count}), _dtype({el!r}))")
            else:
                params.append(a.name)
                before.append(f"{a.name}_ = _np.array({a.name}, _dtype({el!r}), copy=True, order='C')")
            if a.direction != "in":
                outputs.append((a.name, f"{a.name}_"))
            call.append(f"{a.name}_.ctypes.data_as(_ct.c_void_p)")
        elif a.head in ("rec", "crec"):
            record, fields = _record_type(a.kind)
            env[f"_R{i}"] = record
            if a.direction == "out":
                before.append(f"{v} = _R{i}()")
            else:
                params.append(a.name)
                keep = []
                values = []
                for j, f in enumerate(fields):
                    if f.startswith("h"):
                        fa = Arg("x:" + f)
                        keep.append(f"_k{i}_{j} = _to_handle({a.name}[{j}], {fa.element!r}, "
                                    f"{2 if fa.head == 'h2' else 1})")
                        values.append(f"_k{i}_{j}.h")
                    else:
                        values.append(f"{a.name}[{j}]")
                before += keep
                before.append(f"{v} = _R{i}({', '.join(values)})")
            if a.direction != "in":
                outputs.append((a.name, "(" + ", ".join(
                    f"_k{i}_{j}.numpy()" if f.startswith("h") else f"{v}.f{j}"
                    for j, f in enumerate(fields)) + ",)"))
            call.append(f"_ct.byref({v})")
        elif a.head == "cell":
            call.append(f"_ct.byref(_cell({name!r}))")
        elif a.head == "idp":
            unreserve = a.kind.split(".", 1)[1]
            call.append(f"_ct.byref(_cell({name!r}, {unreserve!r}))")
        else:
            raise ValueError(f"{name}: kind {a.kind} has no Python form")

    handles = [f"_a{i}" for i, a in enumerate(args) if a.head in ("h1", "h2", "h3")]
    handles += [f"_k{i}_{j}" for i, a in enumerate(args) if a.head == "rec" and a.direction == "in"
                for j, f in enumerate(_record_type(a.kind)[1]) if f.startswith("h")]
    body = []
    if result == "f64":
        env["_fn"].restype = ctypes.c_double
        body.append(f"_r = _fn({', '.join(call)})")
        outputs.insert(0, ("result", "_r"))
    elif result == "void":
        env["_fn"].restype = None
        body.append(f"_fn({', '.join(call)})")
    else:
        body.append(f"_r = _fn({', '.join(call)})")
    if style in ("ptr", "both") and status_var:
        body.append(f"_check({status_var}.value, {name!r})")
    elif style in ("ret", "both"):
        body.append(f"_check(_r, {name!r})")
    if not outputs:
        body.append("return None")
    elif len(outputs) == 1:
        body.append(f"return {outputs[0][1]}")
    else:
        env["_T"] = collections.namedtuple(pyname + "_result", [o[0] for o in outputs])
        body.append(f"return _T({', '.join(o[1] for o in outputs)})")
    lines = [f"def {pyname}({', '.join(params)}):"]
    for h in handles:  # so that the finally clause sees every name, whatever failed first
        lines.append(f"    {h} = None")
    lines.append("    try:")
    lines += ["        " + b for b in before + body]
    lines.append("    finally:")
    lines += [f"        _release({h})" for h in handles] or ["        pass"]
    return "\n".join(lines), env, params, outputs


def _doc(row, params, outputs):
    name, style, signature, contract, note, family, description = row
    text = [description or note, "", f"Export {name}({signature.split(' ', 1)[-1] if ' ' in signature else ''})."]
    if note and description:
        text.append(note + ".")
    text.append("Returns " + (", ".join(o[0] for o in outputs) if outputs else "nothing") + ".")
    if contract:
        text.append(f"Failure contract: {contract}.")
    text.append("Raises TwanlysError (or a subclass) for negative statuses; warns TwanlysWarning for positive ones.")
    return "\n".join(text)


SKIPPED = {}  # export -> why it has no Python function (the tests keep this empty)


def build_families(package):
    """Adds a module per family to the package (twanlys.stats, twanlys.fft, ...) and returns
    {export name: function} for every export with a Python form."""
    functions = {}
    names = python_names(ROWS)
    for row in ROWS:
        if not has_python_form(row):
            continue
        name, family, pyname = row[0], row[5], names[row[0]]
        try:
            source, env, params, outputs = _build(row, pyname)
        except ValueError as e:  # a kind this layer does not know yet: the export stays low-level
            SKIPPED[name] = str(e)
            continue
        exec(compile(source, f"<twanlys {name}>", "exec"), env)
        fn = env[pyname]
        fn.__doc__ = _doc(row, params, outputs)
        fn.__qualname__ = fn.__name__
        short = module_name(family)
        full = f"{package.__name__}.{short}"
        module = sys.modules.get(full)
        if module is None:
            module = sys.modules[full] = types.ModuleType(full, f"twanlys: the exports of twanlys/{family}.h")
            setattr(package, short, module)
        fn.__module__ = full
        setattr(module, fn.__name__, fn)
        functions[name] = fn
    return functions
