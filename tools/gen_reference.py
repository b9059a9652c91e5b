#!/usr/bin/env python3
"""Writes one reference page per family (public header) from the signature table.

    tools/gen_reference.py OUTDIR
"""
import os
import sys

sys.path.insert(0, os.path.dirname(os.path.abspath(__file__)))
from gen_python_table import TABLE, rows  # noqa: E402
from gen_signatures import read_table  # noqa: E402

sys.path.insert(0, os.path.join(os.path.dirname(os.path.abspath(__file__)), "..", "python", "twanlys"))
from _names import Arg, has_python_form, module_name, python_names  # noqa: E402

KINDS = {"h1": "1-D array", "h2": "2-D array", "p": "pointer to", "cp": "pointer to", "buf": "array of",
         "rec": "record", "cell": "work cell", "idp": "instance-data cell", "status": "status",
         "len": "i32 (a length)", "i32": "i32", "f64": "f64", "ptr": "opaque pointer", "fn": "callback",
         "cluster": "error record"}


def describe(a):
    if a.head in ("h1", "h2", "p", "cp", "buf"):
        return f"{KINDS[a.head]} {a.element}, {a.direction}" + (", may be null" if a.optional else "")
    if a.head in ("rec", "crec"):
        return f"{a.kind.split('.')[1].split('[')[0]} record, {a.direction}"
    return KINDS.get(a.head, a.kind)


def page(family, entries, names, statuses):
    out = [f"# twanlys/{family}.h", "",
           f"Generated from `src/exports.tsv` by `tools/gen_reference.py`. Python: `twanlys.{module_name(family)}`.",
           ""]
    for name, style, signature, contract, note, _, description in entries:
        words = signature.split()
        out += [f"## {name}", "", description or note, ""]
        if description and note:
            out += [f"*{note}*", ""]
        python = f"`{names[name]}`" if name in names else "`twanlys.lowlevel` only"
        out += [f"- returns `{words[0]}`; status: {style}; Python: {python}"]
        out += [f"- `{w.split(':')[0]}`: {describe(Arg(w))}" for w in words[1:]]
        contract = " ".join(w for w in contract.split() if not w.startswith("st="))
        if contract:
            out.append(f"- on failure: `{contract}` (beyond the shared contract: arrays emptied, f64 results NaN)")
        if statuses.get(name):
            out.append("- statuses besides 0: " + ", ".join(f"`{s}`" for s in sorted(statuses[name])))
        out.append("")
    return "\n".join(out)


if __name__ == "__main__":
    outdir = sys.argv[1]
    os.makedirs(outdir, exist_ok=True)
    families = {}
    table = list(rows())
    names = python_names(table)
    statuses = {r["name"]: r["c"]["st"] for r in read_table(TABLE)}
    for r in table:
        families.setdefault(r[5] or "other", []).append(r)
    for family, entries in families.items():
        with open(os.path.join(outdir, family + ".md"), "w") as f:
            f.write(page(family, entries, names, statuses))
    with open(os.path.join(outdir, "index.md"), "w") as f:
        f.write("# twanlys reference\n\n" + "\n".join(
            f"- [{fam}]({fam}.md): {len(e)} exports" for fam, e in sorted(families.items())) + "\n")
