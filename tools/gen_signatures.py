#!/usr/bin/env python3
"""Generates C++ from the signature table (src/exports.tsv; its header explains the format).

  gen_signatures.py TABLE OUTDIR [--name STEM] [--status include/twanlys/status.h]

writes into OUTDIR:
  STEM_table.inc      one sweep::Row per built row, with a thunk that calls the export
  STEM_check.cpp      static_asserts that every declaration has the row's type
  status_values.inc   the status codes of status.h, with their names (with --status)
Stdlib only; a malformed row or status set stops the build with its line number."""

import argparse
import os
import re
import sys

ELEMS = {"i32": ("I32", 4, "int32_t"), "u8": ("U8", 1, "uint8_t"), "u32": ("U32", 4, "uint32_t"),
         "f32": ("F32", 4, "float"), "f64": ("F64", 8, "double"), "c64": ("C64", 8, None),
         "c128": ("C128", 16, None), "len": ("Len", 4, "int32_t")}
DIRS = {"in": "In", "out": "Out", "io": "Io"}
STYLES = {"ret": "Ret", "ptr": "Ptr", "both": "Both", "cluster": "Cluster", "none": "None"}
CONTRACT_KEYS = {"fail", "keep", "zero", "stand", "result", "nosweep", "work", "inwhen", "st"}
STATUS_H = os.path.join(os.path.dirname(os.path.abspath(__file__)), "..", "include", "twanlys", "status.h")


def status_codes(path):
    """Name to value for every code of status.h, success included."""
    return {n: int(v) for n, v in re.findall(r"^\s*(\w+)\s*=\s*(-?\d+)\s*,", open(path).read(), re.M)}


class RowError(Exception):
    pass


def elem(token):
    m = re.fullmatch(r"b(\d+)", token)
    if m:
        return ("Bytes", int(m.group(1)), None)
    if token not in ELEMS:
        raise RowError("unknown element type %r" % token)
    return ELEMS[token]


def direction(token):
    if token not in DIRS:
        raise RowError("unknown direction %r" % token)
    return DIRS[token]


def parse_kind(text):
    """A kind as a dict: kind, elem, elem_bytes, dir, ctype (C parameter type), and extras."""
    nullable = text.endswith("?")
    text = text.rstrip("?")
    k = {"nullable": nullable, "elem": "None", "elem_bytes": 0, "dir": "None", "fields": [],
         "rec_bytes": 0, "ref": ""}
    m = re.fullmatch(r"h([123])\.(\w+)\.(\w+)", text)
    if m:
        e = elem(m.group(2))
        k.update(kind="H" + m.group(1), elem=e[0], elem_bytes=e[1], dir=direction(m.group(3)),
                 ctype="Array%sDHandle" % m.group(1) if m.group(1) != "3" else "NumericHandle")
        return k
    if text in ("i32", "len"):
        k.update(kind="I32" if text == "i32" else "Len", ctype="int32_t")
        return k
    if text in ("u16", "u32"):
        # Unsigned selectors by value: swept with the i32 values, converted as a caller would.
        k.update(kind="I32", ctype="uint16_t" if text == "u16" else "uint32_t")
        return k
    if text == "u8":
        # A byte by value (or a byte field of a record) varies as an i32 does, cut to its low byte.
        k.update(kind="I32", elem="U8", elem_bytes=1, ctype="uint8_t")
        return k
    if text == "f64":
        k.update(kind="F64", ctype="double")
        return k
    if text == "f32":
        k.update(kind="F64", ctype="float")
        return k
    m = re.fullmatch(r"(c?p)\.(\w+)\.(\w+)", text)
    if m:
        e = elem(m.group(2))
        base = "ComplexDouble" if e[0] == "C128" else e[2]
        if base is None:
            raise RowError("pointer to %r: only i32, len, u8, u32, f32, f64, c128" % m.group(2))
        const = m.group(1) == "cp"
        k.update(kind="P", elem=e[0], elem_bytes=e[1], dir=direction(m.group(3)),
                 ctype=("const " if const else "") + base + "*")
        return k
    if text == "status":
        k.update(kind="Status", elem="I32", elem_bytes=4, dir="Out", ctype="int32_t*")
        return k
    if text == "cluster":
        k.update(kind="Cluster", dir="Io", ctype="ErrorCluster*")
        return k
    if text == "cell":
        k.update(kind="Cell", ctype="void**")
        return k
    m = re.fullmatch(r"idp\.(\w+)", text)
    if m:
        k.update(kind="Idp", ctype="void**", ref=m.group(1))
        return k
    m = re.fullmatch(r"(c?)rec\.(\w+)\[(\d+)\]\{([^}]*)\}\.(\w+)", text)
    if m:
        fields, offset = [], 0
        const, name, size_text, field_text, dir_text = m.groups()
        for f in field_text.split(","):
            fk = parse_kind(f)
            if fk["kind"] not in ("I32", "Len", "F64", "H1", "H2"):
                raise RowError("record field %r: scalars and handles only" % f)
            size = 8 if fk["kind"] in ("F64", "H1", "H2") else fk["elem_bytes"] or 4
            fk["offset"] = offset
            offset += size
            fields.append(fk)
        k.update(kind="Rec", ctype=("const " if const else "") + name + "*", rec_bytes=int(size_text),
                 fields=fields, dir=direction(dir_text), ref=name)
        if offset > k["rec_bytes"]:
            raise RowError("record %s: fields need %d bytes, row says %d" % (name, offset, k["rec_bytes"]))
        return k
    m = re.fullmatch(r"buf\.(\w+)\.(\w+)\.(\w+)", text)
    if m:
        e = elem(m.group(1))
        base = {"C128": "ComplexDouble", "C64": "void"}.get(e[0], e[2] or "void")
        k.update(kind="Buf", elem=e[0], elem_bytes=e[1], dir=direction(m.group(2)), ref=m.group(3),
                 ctype=("const " if m.group(2) == "in" else "") + base + "*")
        return k
    m = re.fullmatch(r"(ptr|fn)\.(\w+)", text)
    if m:
        k.update(kind="Opaque", ctype=m.group(2) + ("*" if m.group(1) == "ptr" else ""))
        return k
    raise RowError("unknown kind %r" % text)


RESULTS = {"i32": ("I32", "int32_t"), "void": ("Void", "void"), "f64": ("F64", "double")}


def parse_signature(sig):
    tokens = sig.split()
    res = tokens[0]
    if res in RESULTS:
        result = RESULTS[res]
    elif re.fullmatch(r"ptr\.\w+", res):
        result = ("Ptr", res[4:] + "*")
    else:
        raise RowError("unknown result type %r" % res)
    args = []
    for t in tokens[1:]:
        if ":" not in t:
            raise RowError("argument %r is not name:kind" % t)
        name, kind = t.split(":", 1)
        a = parse_kind(kind)
        a["name"] = name
        args.append(a)
    names = [a["name"] for a in args]
    for a in args:
        if a["kind"] == "Buf" and a["ref"] not in names and not a["ref"].isdigit():
            raise RowError("bare pointer %s counts with %r, which is no argument" % (a["name"], a["ref"]))
    return result, args


def expand_statuses(value, sets, codes):
    """The statuses of a row's st= token: set names and status names, joined by commas; +Name adds a
    status, -Name takes one away (in order, so st=fft,-FftSizeErr is fft without it)."""
    allowed = []
    for item in value.split(","):
        sign, word = (item[0], item[1:]) if item[:1] in "+-" else ("+", item)
        if word in sets:
            names = sets[word]
        elif word in codes:
            names = [word]
        else:
            raise RowError("st=%s: %r is neither a status set nor a status of status.h" % (value, word))
        if sign == "+":
            allowed += [n for n in names if n not in allowed]
        else:
            allowed = [n for n in allowed if n not in names]
    if "NoErr" in allowed:
        raise RowError("st=%s: success needs no listing" % value)
    return allowed


def parse_contract(text, args, sets=None, codes=None):
    c = {"fail_nonzero": False, "keep": [], "zero": [], "work": [], "stand": [], "result_host": False, "result_oom": False,
         "nosweep": False, "st": None, "st_text": ""}
    names = [a["name"] for a in args]
    for tok in text.split():
        key, _, value = tok.partition("=")
        if key not in CONTRACT_KEYS:
            raise RowError("unknown contract token %r" % tok)
        if key == "fail":
            if value not in ("nonzero", "negative"):
                raise RowError("fail=%s: nonzero or negative" % value)
            c["fail_nonzero"] = value == "nonzero"
        elif key in ("keep", "zero", "work"):
            for v in value.split(","):
                if v not in names:
                    raise RowError("%s names %r, which is no argument" % (key, v))
                c[key].append(names.index(v))
        elif key == "stand":
            c["stand"] = value.split(",")
        elif key == "inwhen":
            # Marked on the arguments themselves: the index of the flag that makes them inputs.
            flag, _, listed = value.partition(":")
            if flag not in names or args[names.index(flag)]["kind"] != "I32":
                raise RowError("inwhen=%s: the flag must be an i32 argument" % value)
            for v in listed.split(","):
                if v not in names:
                    raise RowError("inwhen names %r, which is no argument" % v)
                args[names.index(v)]["inwhen"] = names.index(flag)
        elif key == "result":
            if value not in ("host", "oom"):
                raise RowError("result=%s: result=host or result=oom" % value)
            c["result_host" if value == "host" else "result_oom"] = True
        elif key == "nosweep":
            c["nosweep"] = True
        elif key == "st":
            c["st"] = expand_statuses(value, sets or {}, codes or {})
            c["st_text"] = value
    return c


def parse_set(words, sets, codes):
    """@set NAME MEMBER..., members being status names or sets defined above."""
    if len(words) < 3 or not re.fullmatch(r"[a-z][a-z0-9_]*", words[1]):
        raise RowError("@set wants a lower-case name and at least one member")
    if words[1] in sets or words[1] in codes:
        raise RowError("status set %r is defined twice" % words[1])
    members = []
    for w in words[2:]:
        if w in sets:
            members += [n for n in sets[w] if n not in members]
        elif w in codes and w != "NoErr":
            members += [w] if w not in members else []
        else:
            raise RowError("%r is neither a status of status.h nor a set defined above" % w)
    sets[words[1]] = members


def read_table(path, status_h=STATUS_H):
    rows, sets, codes = [], {}, status_codes(status_h)
    with open(path) as f:
        for number, line in enumerate(f, 1):
            line = line.rstrip("\n")
            if not line or line.startswith("#") or line.startswith("name\t"):
                continue
            if line.startswith("@"):
                words = line.split()
                try:
                    if words[0] != "@set":
                        raise RowError("unknown directive %r" % words[0])
                    parse_set(words, sets, codes)
                except RowError as e:
                    sys.exit("%s:%d: %s" % (path, number, e))
                continue
            cols = line.split("\t")
            if len(cols) != 5:
                sys.exit("%s:%d: %d columns, want 5 (name style signature contract note)" % (path, number, len(cols)))
            name, style, sig, contract, _ = cols
            if not sig:
                continue
            try:
                if style not in STYLES:
                    raise RowError("style %r of a built row: one of %s" % (style, ", ".join(STYLES)))
                result, args = parse_signature(sig)
                c = parse_contract(contract, args, sets, codes)
                if c["st"] is not None and style == "none":
                    raise RowError("st= on a row of style none, which gives no status")
                statuses = [a for a in args if a["kind"] == "Status"]
                if style in ("ptr", "both") and len(statuses) != 1:
                    raise RowError("style %s needs one status argument" % style)
                if style == "cluster" and not any(a["kind"] == "Cluster" for a in args):
                    raise RowError("style cluster needs a cluster argument")
                if style in ("ret", "both") and result[0] != "I32":
                    raise RowError("style %s returns i32" % style)
                for s in c["stand"]:
                    if not re.fullmatch(r"\w+", s):
                        raise RowError("stand=%s is no status name" % s)
            except RowError as e:
                sys.exit("%s:%d: %s: %s" % (path, number, name, e))
            rows.append({"name": name, "style": STYLES[style], "result": result, "args": args, "c": c})
    return rows


def arg_init(a):
    fields = "nullptr, 0"
    if a["fields"]:
        fields = "k%s_fields, %d" % (a["cur_id"], len(a["fields"]))
    unreserve = a["ref"] if a["kind"] == "Idp" else "nullptr"
    count = a.get("count_index", -1)
    return ('{"%s", sweep::Kind::%s, sweep::Elem::%s, sweep::Dir::%s, %s, %d, %d, %s, %d, %s, %d}'
            % (a["name"], a["kind"], a["elem"], a["dir"], "true" if a["nullable"] else "false",
               a.get("inwhen", -1), a["elem_bytes"], fields, a["rec_bytes"], unreserve, count))


def accessor(i, a):
    k = a["kind"]
    if k in ("H1", "H2", "H3"):
        return "s.H(%d)" % i
    if k in ("I32", "Len"):
        return "s.I(%d)" % i if a["ctype"] == "int32_t" else "static_cast<%s>(s.I(%d))" % (a["ctype"], i)
    if k == "F64":
        return "s.D(%d)" % i if a["ctype"] == "double" else "sweep::ToF32(s.D(%d))" % i
    if k in ("Cell", "Idp"):
        return "s.Cell(%d)" % i
    if k == "Opaque":
        return "reinterpret_cast<%s>(s.Opaque(%d))" % (a["ctype"], i)
    return "static_cast<%s>(s.Ptr(%d))" % (a["ctype"], i)


def write_table(rows, path, stem, includes):
    out = ["// Generated by tools/gen_signatures.py from the signature table; do not edit.", ""]
    out += ['#include "%s"' % i for i in includes] + [""]
    for r in rows:
        for i, a in enumerate(r["args"]):
            a["cur_id"] = "%s_%d" % (r["name"], i)
            if a["kind"] == "Buf":
                # A fixed count n is coded as -(n + 1).
                a["count_index"] = (-int(a["ref"]) - 1 if a["ref"].isdigit()
                                    else [b["name"] for b in r["args"]].index(a["ref"]))
            if a["fields"]:
                out.append("inline constexpr sweep::Field k%s_fields[] = {%s};" % (a["cur_id"], ", ".join(
                    "{sweep::Kind::%s, sweep::Elem::%s, sweep::Dir::%s, %d, %d}"
                    % (f["kind"], f["elem"], f["dir"], f["elem_bytes"], f["offset"]) for f in a["fields"])))
        if r["c"]["st"]:
            out.append("inline constexpr int32_t k%s_statuses[] = {%s};" % (r["name"], ", ".join(r["c"]["st"])))
        if r["args"]:
            out.append("inline constexpr sweep::Arg k%s_args[] = {" % r["name"])
            out.append("    " + ",\n    ".join(arg_init(a) for a in r["args"]) + "};")
    out.append("")
    out.append("inline const sweep::Row k%sRows[] = {" % stem)
    for r in rows:
        call = "%s(%s)" % (r["name"], ", ".join(accessor(i, a) for i, a in enumerate(r["args"])))
        kind = r["result"][0]
        if kind == "Void":
            body = "%s; return sweep::Outcome{};" % call
        elif kind == "I32":
            body = "sweep::Outcome o; o.i = %s; return o;" % call
        elif kind == "F64":
            body = "sweep::Outcome o; o.d = %s; return o;" % call
        else:
            body = "sweep::Outcome o; o.p = reinterpret_cast<const void*>(%s); return o;" % call
        c = r["c"]
        masks = [sum(1 << i for i in c[key]) for key in ("keep", "zero", "work")]
        stand = "{%s}" % ", ".join(c["stand"]) if c["stand"] else "{}"
        # No st= token: the row does not say, and any status of status.h passes (nAllowed -1).
        allowed = ("k%s_statuses, %d" % (r["name"], len(c["st"])) if c["st"]
                   else "nullptr, %d" % (-1 if c["st"] is None else 0))
        out.append('    {"%s", sweep::Style::%s, sweep::Result::%s, %s, %d, %s, %s, %s, 0x%xu, 0x%xu, 0x%xu, %s,\n'
                   '     [](sweep::Slots&%s) -> sweep::Outcome { %s }, %s, %s, "%s"},'
                   % (r["name"], r["style"], kind, ("k%s_args" % r["name"]) if r["args"] else "nullptr",
                      len(r["args"]), str(c["fail_nonzero"]).lower(), str(c["result_host"]).lower(),
                      str(c["nosweep"]).lower(), masks[0], masks[1], masks[2], stand,
                      " s" if r["args"] else "", body, str(c["result_oom"]).lower(), allowed, c["st_text"]))
    out.append("};")
    write(path, "\n".join(out) + "\n")


def write_check(rows, path, includes):
    out = ["// Generated by tools/gen_signatures.py from the signature table; do not edit.",
           "// Every declaration must have exactly the type its row gives, and every record its size.",
           "#include <type_traits>", ""]
    out += ['#include "%s"' % i for i in includes]
    out.append("")
    seen = set()
    for r in rows:
        params = ", ".join(a["ctype"] for a in r["args"])
        out.append('static_assert(std::is_same_v<decltype(&%s), %s (*)(%s)>, "the declaration of %s differs from its row");'
                   % (r["name"], r["result"][1], params, r["name"]))
        for a in r["args"]:
            if a["kind"] == "Rec" and a["ref"] not in seen:
                seen.add(a["ref"])
                out.append('static_assert(sizeof(%s) == %d, "record %s is not %d bytes");'
                           % (a["ref"], a["rec_bytes"], a["ref"], a["rec_bytes"]))
    write(path, "\n".join(out) + "\n")


def write_statuses(status_h, path):
    values = re.findall(r"^\s*(\w+)\s*=\s*(-?\d+)\s*,", open(status_h).read(), re.M)
    if len(values) < 10:
        sys.exit("%s: no status values found" % status_h)
    write(path, "// Generated by tools/gen_signatures.py from status.h; do not edit.\n"
          "inline constexpr int32_t kStatusValues[] = {%s};\n"
          "inline constexpr const char* kStatusNames[] = {%s};\n"
          % (", ".join(v for _, v in values), ", ".join('"%s"' % n for n, _ in values)))


def write(path, text):
    # Unchanged output keeps its time stamp, so nothing recompiles needlessly.
    if os.path.exists(path) and open(path).read() == text:
        return
    with open(path, "w") as f:
        f.write(text)


def main():
    p = argparse.ArgumentParser()
    p.add_argument("table")
    p.add_argument("outdir")
    p.add_argument("--name", default="Export")
    p.add_argument("--status")
    p.add_argument("--include", action="append", default=[])
    o = p.parse_args()
    rows = read_table(o.table, o.status or STATUS_H)
    os.makedirs(o.outdir, exist_ok=True)
    stem = o.name.lower()
    write_table(rows, os.path.join(o.outdir, stem + "_table.inc"), o.name, o.include)
    write_check(rows, os.path.join(o.outdir, stem + "_check.cpp"), o.include)
    if o.status:
        write_statuses(o.status, os.path.join(o.outdir, "status_values.inc"))


if __name__ == "__main__":
    main()
