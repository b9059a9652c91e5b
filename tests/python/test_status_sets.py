"""The status sets of the signature table: how tools/gen_signatures.py reads @set lines and st=
tokens, and that every built row that reports a status names the statuses it may give."""
import contextlib
import io
import os
import sys
import tempfile
import unittest

ROOT = os.path.join(os.path.dirname(os.path.abspath(__file__)), "..", "..")
sys.path.insert(0, os.path.join(ROOT, "tools"))
import gen_signatures as gen  # noqa: E402

ROW = "R\tret\ti32 x:h1.f64.in\t%s\tnote\n"


def read(text):
    """The allowed statuses of row R, or the generator's complaint."""
    with tempfile.NamedTemporaryFile("w", suffix=".tsv", delete=False) as f:
        f.write(text)
    try:
        with contextlib.redirect_stderr(io.StringIO()):
            rows = gen.read_table(f.name)
        return rows[0]["c"]["st"]
    except SystemExit as e:
        return str(e)
    finally:
        os.unlink(f.name)


class StatusSets(unittest.TestCase):
    def test_sets_and_tokens(self):
        base = "@set a EmptyArrayErr OutOfMemoryErr\n@set b a NanInfErr\n"
        cases = [
            # (table, allowed statuses, or a piece of the complaint)
            (base + ROW % "st=b", {"EmptyArrayErr", "OutOfMemoryErr", "NanInfErr"}),
            (base + ROW % "st=b,-EmptyArrayErr,+DivideByZeroErr", {"OutOfMemoryErr", "NanInfErr", "DivideByZeroErr"}),
            (base + ROW % "st=a,-a", set()),
            (base + ROW % "keep=x st=NanInfErr", {"NanInfErr"}),
            (base + ROW % "", None),
            (base + ROW % "st=c", "neither a status set nor a status"),
            (base + ROW % "st=a,+NoErr", "success needs no listing"),
            ("@set a EmptyArrayErr NoSuchThingErr\n" + ROW % "st=a", "neither a status of status.h nor a set"),
            ("@set a b\n@set b EmptyArrayErr\n" + ROW % "st=a", "neither a status of status.h nor a set"),
            (base + "@set a NanInfErr\n" + ROW % "st=a", "defined twice"),
            ("@set Big EmptyArrayErr\n" + ROW % "", "lower-case name"),
            ("@sets a EmptyArrayErr\n" + ROW % "", "unknown directive"),
            (base + "R\tnone\tvoid x:h1.f64.io\tst=a\t\n", "style none"),
        ]
        for table, want in cases:
            got = read(table)
            if isinstance(want, str):
                self.assertIsInstance(got, str, table)
                self.assertIn(want, got, table)
            else:
                self.assertEqual(None if got is None else set(got), want, table)

    def test_every_row_that_reports_a_status_names_its_set(self):
        with contextlib.redirect_stderr(io.StringIO()):
            rows = gen.read_table(os.path.join(ROOT, "src", "exports.tsv"))
        unnamed = [r["name"] for r in rows if r["style"] != "None" and r["c"]["st"] is None]
        self.assertEqual(unnamed, [])
        self.assertGreater(len(rows), 500)


if __name__ == "__main__":
    unittest.main()
