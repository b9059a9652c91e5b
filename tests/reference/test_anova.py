"""Analysis of variance and contingency tables against SciPy and NumPy, in both block placements.

One-way: scipy.stats.f_oneway. Two- and three-way: sums of squares from cell and marginal means
of the balanced array (NumPy), F over the denominators each random-factor pattern calls for.
Sums of squares are formed by subtracting large terms: 64 eps times the sum of x^2. p against
f.sf at the library's F, within 4e-15 or the error model of the incomplete beta function that
p = 1 - F cdf rests on, whichever is larger. Critical F against f.ppf, one-sided: the library
returns the lower end of a bisection bracket 1e-4 wide. Contingency: chi2_contingency without
Yates' correction.
"""
import ctypes
import itertools
import unittest

import numpy as np
import scipy.stats as st

from twanlys import lowlevel as tw
from test_special_gamma import EPS, incbeta_tolerance, print_report

REPORT = {}
D, I32 = ctypes.c_double, ctypes.c_int32


def note(name, value):
    REPORT[name] = max(REPORT.get(name, 0.0), float(value))


def placements():
    for aligned in (0, 1):
        tw.placement(aligned)
        yield aligned
    tw.placement(0)


def one_way(x, labels, k, alpha):
    """The _2017 results; the older export must give the same first seven."""
    outs, status = [tw.f64() for _ in range(8)], tw.i32(-1)
    old, old_status = [tw.f64() for _ in range(7)], tw.i32(-1)
    x, labels, k = tw.array(x), tw.array(labels, np.int32), I32(k)
    tw.lib.Anova1Way_head_2017(x, labels, ctypes.byref(k), D(alpha), *[o.ref for o in outs], status.ref)
    tw.lib.Anova1Way_head(x, labels, ctypes.byref(k), *[o.ref for o in old], old_status.ref)
    assert [o.value for o in old] == [o.value for o in outs[:7]] and old_status.value == status.value
    return [o.value for o in outs], status.value


def factorial(x, labels, repeats, levels, alpha=None):
    """Two- or three-way by the number of label arrays; (table, p values, status)."""
    table, status = tw.empty(dims=2), tw.i32(-1)
    ps = [tw.f64() for _ in range(2 ** len(labels) - 1)]
    args = [tw.array(x)] + [tw.array(l, np.int32) for l in labels]
    args += [ctypes.byref(I32(v)) for v in [repeats] + list(levels)]
    args += ([] if alpha is None else [D(alpha)]) + [table] + [p.ref for p in ps] + [status.ref]
    name = ("ANOVA3Way_head" if len(labels) == 3 else "Anova2Way_head") + ("" if alpha is None else "_2017")
    getattr(tw.lib, name)(*args)
    return table.numpy(), np.array([p.value for p in ps]), status.value


def arbitrary_labels(rng, count):
    return rng.choice(np.arange(-2**31, 2**31 - 1, 7919, dtype=np.int64), count, replace=False)


def check_p(test, p, f, d1, d2):
    ref = st.f.sf(f, d1, d2)
    err = abs(p - ref)
    test.assertLessEqual(err, max(4e-15, incbeta_tolerance(0.5 * d2, 0.5 * d1, d2 / (d1 * f + d2), ref)))
    note("p abs error", err)


def check_critical(test, lib, alpha, d1, d2):
    q = st.f.ppf(1 - alpha, d1, d2)
    test.assertTrue(-1e-9 <= q - lib <= 1e-4 + 1e-9, (lib, q))
    note("critical F: f.ppf - lib", q - lib)


def reference_ss(y):
    """Sums of squares of a balanced y[a, b, (c,) L] in row order: main effects, pairs, (triple),
    error; each effect the inclusion-exclusion contrast of marginal means."""
    factors = y.ndim - 1
    subsets = [s for r in range(1, factors + 1) for s in itertools.combinations(range(factors), r)]
    means = {(): y.mean()}
    for s in subsets:
        means[s] = y.mean(axis=tuple(i for i in range(y.ndim) if i not in s), keepdims=True)
    rows = []
    for s in subsets:
        e = sum((-1) ** (len(s) - r) * means[sub] for r in range(len(s) + 1)
                for sub in itertools.combinations(s, r))
        rows.append(np.sum(np.broadcast_to(e, y.shape) ** 2))
    return np.array(rows + [np.sum((y - means[tuple(range(factors))]) ** 2)])


# Denominator rows of F by random factors (rows A, B, C, AB, AC, BC, ABC; None: no exact test),
# as the expected mean squares of the mixed models give them.
THREE_WAY = {
    "": ["E"] * 7,
    "C": ["AC", "BC", "E", "ABC", "E", "E", "E"],
    "B": ["AB", "E", "BC", "E", "ABC", "E", "E"],
    "BC": [None, "BC", "BC", "ABC", "ABC", "E", "E"],
    "A": ["E", "AB", "AC", "E", "E", "ABC", "E"],
    "AC": ["AC", None, "AC", "ABC", "E", "ABC", "E"],
    "AB": ["AB", "AB", None, "E", "ABC", "ABC", "E"],
    "ABC": [None, None, None, "ABC", "ABC", "ABC", "E"],
}
TWO_WAY = {"": ["E", "E", "E"], "A": ["E", "AB", "E"], "B": ["AB", "E", "E"], "AB": ["AB", "AB", "E"]}


class Anova(unittest.TestCase):
    def setUp(self):
        self.rng = np.random.default_rng(20261125)

    def test_one_way_against_f_oneway(self):
        for _ in placements():
            for k, offset in [(2, 0.0), (3, 10.0), (7, -3.0), (40, 100.0), (300, 0.0)]:
                groups = [self.rng.normal(offset + 0.3 * j, 1.0, s)
                          for j, s in enumerate(self.rng.integers(1, 12, k))]
                groups[0] = np.append(groups[0], offset)  # n > k even for singletons
                names = arbitrary_labels(self.rng, k)
                labels = np.concatenate([np.full(len(g), names[j]) for j, g in enumerate(groups)])
                order = self.rng.permutation(len(labels))
                x, labels, n = np.concatenate(groups)[order], labels[order], len(labels)
                ref = st.f_oneway(*groups)
                (bss, bms, f, p, wss, wms, tss, crit), status = one_way(x, labels, k, 0.05)
                self.assertEqual(status, 0)
                ref_b = sum(len(g) * (g.mean() - x.mean()) ** 2 for g in groups)
                ref_w = sum(((g - g.mean()) ** 2).sum() for g in groups)
                tol = 64 * EPS * np.sum(x * x)
                err = np.abs([bss - ref_b, wss - ref_w, tss - np.sum((x - x.mean()) ** 2)])
                self.assertTrue(np.all(err <= tol), err)
                note("one-way SS error / (eps sum x^2)", err.max() / (EPS * np.sum(x * x)))
                self.assertEqual((bms, wms), (bss / (k - 1), wss / (n - k)))
                self.assertLessEqual(abs(f / ref.statistic - 1), tol / ref_b + tol / ref_w)
                check_p(self, p, f, k - 1, n - k)
                check_critical(self, crit, 0.05, k - 1, n - k)

    def design(self, shape, repeats):
        """Balanced data with main effects, shuffled, with arbitrary labels per factor."""
        full = tuple(shape) + (repeats,)
        y = self.rng.normal(self.rng.uniform(-20, 20), 1.0, full)
        for axis, size in enumerate(shape):
            y = y + self.rng.normal(0, 0.7, size).reshape([-1 if i == axis else 1 for i in range(len(full))])
        index = np.indices(full).reshape(len(full), -1)[:, self.rng.permutation(y.size)]
        labels = [arbitrary_labels(self.rng, s)[index[f]] for f, s in enumerate(shape)]
        return y, y[tuple(index)], labels

    def check_factorial(self, shape, repeats, patterns):
        names = ["A", "B", "AB", "E"] if len(shape) == 2 else ["A", "B", "C", "AB", "AC", "BC", "ABC", "E"]
        y, x, labels = self.design(shape, repeats)
        ref = reference_ss(y)
        subsets = [s for r in range(1, len(shape) + 1) for s in itertools.combinations(shape, r)]
        ref_df = [np.prod(np.array(s) - 1) for s in subsets] + [y.size - np.prod(shape)]
        if repeats == 1:
            ref = np.array([ref[0], ref[1], 0.0, ref[2]])  # the interaction is the error
            ref_df = [ref_df[0], ref_df[1], 0, ref_df[2]]
        tol = 64 * EPS * np.sum(x * x)
        for random, denominators in patterns.items():
            levels = [-s if name in random else s for s, name in zip(shape, "ABC")]
            old, old_p, old_status = factorial(x, labels, repeats, levels)
            table, p, status = factorial(x, labels, repeats, levels, 0.05)
            self.assertEqual((status, old_status, table.shape), (0, 0, (len(names), 5)))
            np.testing.assert_array_equal(old, table[:, :4])
            np.testing.assert_array_equal(old_p, p)
            self.assertTrue(np.all(np.abs(table[:, 0] - ref) <= tol), (table[:, 0] - ref, random))
            note("factorial SS error / (eps sum x^2)", np.max(np.abs(table[:, 0] - ref)) / (EPS * np.sum(x * x)))
            np.testing.assert_array_equal(table[:, 1], ref_df)
            np.testing.assert_array_equal(table[-1, 3:], 0)
            row = {name: i for i, name in enumerate(names)}
            for r, den in enumerate(denominators):
                ss, df, ms, f, crit = table[r]
                if den is None:
                    self.assertEqual((f, crit, p[r]), (-1, -1, -1))
                elif df == 0:
                    self.assertEqual((ss, ms, f, crit, p[r]), (0, 0, 0, 0, 0))
                else:
                    d = row[den]
                    ref_f = (ref[r] / df) / (ref[d] / table[d, 1])
                    self.assertLessEqual(abs(f / ref_f - 1), tol / ref[r] + tol / ref[d], (random, r))
                    self.assertEqual(f, ms / table[d, 2])
                    check_p(self, p[r], f, df, table[d, 1])
                    check_critical(self, crit, 0.05, df, table[d, 1])

    def test_two_way_every_random_pattern(self):
        for _ in placements():
            for shape, repeats in [((2, 2), 2), ((3, 4), 3), ((5, 2), 7), ((6, 9), 2)]:
                self.check_factorial(shape, repeats, TWO_WAY)
            for shape in [(3, 3), (8, 5)]:
                self.check_factorial(shape, 1, {"": TWO_WAY[""]})

    def test_three_way_every_random_pattern(self):
        for _ in placements():
            for shape, repeats in [((2, 2, 2), 2), ((3, 2, 4), 3), ((2, 5, 3), 2), ((4, 3, 3), 5)]:
                self.check_factorial(shape, repeats, THREE_WAY)

    def test_contingency_against_chi2_contingency(self):
        tables = [self.rng.integers(1, 50, shape) for shape in [(2, 2), (2, 3), (3, 2), (4, 7), (10, 10)]]
        tables += [self.rng.integers(0, 10**9, (3, 4)), np.array([[10**9, 2**31 - 1], [2**31 - 1, 10**9]])]
        for table in tables:
            chi, p, status = tw.f64(), tw.f64(), tw.i32(-1)
            tw.lib.Contingency_head(tw.matrix(table, np.int32), chi.ref, p.ref, status.ref)
            ref = st.chi2_contingency(table, correction=False)
            self.assertEqual(status.value, 0)
            self.assertLessEqual(abs(chi.value - ref[0]), 1e-12 * ref[0], table.shape)
            self.assertLessEqual(abs(p.value - ref[1]), 1e-12 * ref[1] + 1e-15, table.shape)
            note("contingency chi-square rel error", abs(chi.value - ref[0]) / ref[0])
            note("contingency p abs error", abs(p.value - ref[1]))


def tearDownModule():
    print_report("analysis of variance and contingency against SciPy/NumPy", REPORT)


if __name__ == "__main__":
    unittest.main()
