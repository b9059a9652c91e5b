#!/usr/bin/python3
# Usage: /usr/bin/python3 tools/gen_fft_kernels.py > src/transform/fft/kernels/dft_blocks.hpp
"""Writes the straight-line DFT block routines of every codelet radix.

Each radix gets a complex block (one DFT on split real/imaginary values) and a real block (one
real DFT written in half-complex order). Values are of a template type V (a double, or a vector
of independent transforms), so the same code serves scalar and SIMD loops.

Expressions are built as a DAG with hash-consing, in which a negation is a sign on an edge: common
subexpressions (including those that differ only in sign) are computed once, and multiplications
by 0, 1 and -1 and additions of zero vanish. Only what an output needs is emitted.
"""
import math
import sys

RADICES = (2, 3, 4, 5, 7, 8, 9, 10, 11, 13, 14, 16, 17, 18, 19, 29, 31, 32, 37, 41, 43)

# How the composite radices are split: coprime pairs use the prime-factor map (no twiddles),
# the others Cooley-Tukey with constant twiddles.
SPLITS = {8: (2, 4), 9: (3, 3), 10: (2, 5), 14: (2, 7), 16: (4, 4), 18: (2, 9), 32: (4, 8)}

Z = None  # an exact zero


class Dag:
    def __init__(self):
        self.nodes = []  # (op, a, b): ('in', name, None), ('add'|'sub', i, j), ('mul', const, i)
        self.memo = {}

    def node(self, key):
        if key not in self.memo:
            self.memo[key] = len(self.nodes)
            self.nodes.append(key)
        return self.memo[key]

    def inp(self, name):
        return (self.node(('in', name, None)), 1)

    def neg(self, a):
        return Z if a is Z else (a[0], -a[1])

    def add(self, a, b):
        if a is Z:
            return b
        if b is Z:
            return a
        (na, sa), (nb, sb) = a, b
        if sa == sb:
            x, y = sorted((na, nb))
            return (self.node(('add', x, y)), sa)
        if na == nb:
            return Z
        if na < nb:
            return (self.node(('sub', na, nb)), sa)
        return (self.node(('sub', nb, na)), -sa)

    def sub(self, a, b):
        return self.add(a, self.neg(b))

    def mul(self, c, a):
        if a is Z or c == 0.0:
            return Z
        if c == 1.0:
            return a
        if c == -1.0:
            return self.neg(a)
        return (self.node(('mul', abs(c), a[0])), a[1] * (1 if c > 0 else -1))


class Complex:
    def __init__(self, g):
        self.g = g

    def add(self, a, b):
        return (self.g.add(a[0], b[0]), self.g.add(a[1], b[1]))

    def sub(self, a, b):
        return (self.g.sub(a[0], b[0]), self.g.sub(a[1], b[1]))

    def scale(self, c, a):
        return (self.g.mul(c, a[0]), self.g.mul(c, a[1]))

    def times_i(self, a):  # i a
        return (self.g.neg(a[1]), a[0])

    def times_minus_i(self, a):  # -i a
        return (a[1], self.g.neg(a[0]))

    def twiddle(self, a, e, n):
        """a times exp(-2 pi i e / n)."""
        e %= n
        if e == 0:
            return a
        if 4 * e == n:
            return self.times_minus_i(a)
        if 2 * e == n:
            return (self.g.neg(a[0]), self.g.neg(a[1]))
        if 4 * e == 3 * n:
            return self.times_i(a)
        c, s = math.cos(2 * math.pi * e / n), math.sin(2 * math.pi * e / n)
        g = self.g
        re, im = a
        if abs(c) == abs(s):
            sg = 1.0 if (c > 0) == (s > 0) else -1.0
            return (g.mul(c, g.add(re, g.mul(sg, im))), g.mul(c, g.sub(im, g.mul(sg, re))))
        return (g.add(g.mul(c, re), g.mul(s, im)), g.sub(g.mul(c, im), g.mul(s, re)))

    def total(self, xs):
        acc = (Z, Z)
        for x in xs:
            acc = self.add(acc, x)
        return acc


def dft(cx, x):
    n = len(x)
    g = cx.g
    if n == 1:
        return list(x)
    if n == 2:
        return [cx.add(x[0], x[1]), cx.sub(x[0], x[1])]
    if n == 3:
        t1 = cx.add(x[1], x[2])
        y0 = cx.add(x[0], t1)
        m1 = cx.add(y0, cx.scale(-1.5, t1))
        m2 = cx.scale(0.8660254037844386, cx.sub(x[2], x[1]))
        return [y0, cx.add(m1, cx.times_i(m2)), cx.sub(m1, cx.times_i(m2))]
    if n == 4:
        a, b = cx.add(x[0], x[2]), cx.sub(x[0], x[2])
        c, d = cx.add(x[1], x[3]), cx.times_minus_i(cx.sub(x[1], x[3]))
        return [cx.add(a, c), cx.add(b, d), cx.sub(a, c), cx.sub(b, d)]
    if n == 5:
        t1, t2 = cx.add(x[1], x[4]), cx.add(x[2], x[3])
        d1, d2 = cx.sub(x[1], x[4]), cx.sub(x[2], x[3])
        t5 = cx.add(t1, t2)
        y0 = cx.add(x[0], t5)
        s1 = cx.add(y0, cx.scale(-1.25, t5))
        m2 = cx.scale(0.5590169943749475, cx.sub(t1, t2))
        r1, r2 = cx.add(s1, m2), cx.sub(s1, m2)
        m3 = cx.scale(-0.9510565162951535, cx.sub(d1, d2))
        a1 = cx.times_i(cx.add(m3, cx.scale(-1.5388417685876268, d2)))
        a2 = cx.times_i(cx.add(m3, cx.scale(0.36327126400268045, d1)))
        return [y0, cx.add(r1, a1), cx.add(r2, a2), cx.sub(r2, a2), cx.sub(r1, a1)]
    if n == 7:
        return winograd7(cx, x)
    if n in SPLITS:
        n1, n2 = SPLITS[n]
        if math.gcd(n1, n2) == 1:
            return prime_factor(cx, x, n1, n2)
        return cooley_tukey(cx, x, n1, n2)
    return odd_prime(cx, x)


def winograd7(cx, x):
    # The cosine and sine sums are split into the stated constants: the cosine rows share the mean
    # (-7/6 on the total) and the value at the middle index; the sine rows share one product of
    # (d1 + d2 - d3), whose coefficient s2 is carried as the sum of two of the constants.
    t = [None] + [cx.add(x[j], x[7 - j]) for j in (1, 2, 3)]
    d = [None] + [cx.sub(x[j], x[7 - j]) for j in (1, 2, 3)]
    tt = cx.add(cx.add(t[1], t[2]), t[3])
    y0 = cx.add(x[0], tt)
    m0 = cx.add(cx.add(y0, cx.scale(-7.0 / 6.0, tt)), cx.scale(-0.055854267289648, tt))
    k1, k2 = -0.678447933946105, 0.846010735815048
    cos_rows = ((1, 3), (3, 2), (2, 1))  # (index taking k2, index taking k1) per output 1, 2, 3
    e = cx.sub(cx.add(d[1], d[2]), d[3])
    pe = cx.add(cx.scale(0.440958551844098, e), cx.scale(0.533969360337725, e))
    k5, k6 = -1.408811651299382, -0.193096429713794
    # Row j of sum_i d_i sin(2 pi i j / 7): (sign of pe, k6 term, k5 term) with signs.
    sin_rows = ((1, (1, 1), (-1, 3)), (1, (-1, 3), (1, 2)), (-1, (-1, 2), (-1, 1)))
    out = [y0] + [None] * 6
    for j in (1, 2, 3):
        a, b = cos_rows[j - 1]
        r = cx.add(m0, cx.add(cx.scale(k2, t[a]), cx.scale(k1, t[b])))
        sp, (s6, i6), (s5, i5) = sin_rows[j - 1]
        row = cx.add(cx.scale(sp, pe), cx.add(cx.scale(s6 * k6, d[i6]), cx.scale(s5 * k5, d[i5])))
        a_j = cx.times_minus_i(row)
        out[j] = cx.add(r, a_j)
        out[7 - j] = cx.sub(r, a_j)
    return out


def prime_factor(cx, x, n1, n2):
    n = n1 * n2
    inner = []
    for b in range(n2):
        inner.append(dft(cx, [x[(n2 * a + n1 * b) % n] for a in range(n1)]))
    out = [None] * n
    e1 = n2 * pow(n2, -1, n1)
    e2 = n1 * pow(n1, -1, n2)
    for k1 in range(n1):
        col = dft(cx, [inner[b][k1] for b in range(n2)])
        for k2 in range(n2):
            out[(e1 * k1 + e2 * k2) % n] = col[k2]
    return out


def cooley_tukey(cx, x, n1, n2):
    n = n1 * n2
    inner = []
    for b in range(n2):
        y = dft(cx, [x[n2 * a + b] for a in range(n1)])
        inner.append([cx.twiddle(y[k1], b * k1, n) for k1 in range(n1)])
    out = [None] * n
    for k1 in range(n1):
        col = dft(cx, [inner[b][k1] for b in range(n2)])
        for k2 in range(n2):
            out[k1 + n1 * k2] = col[k2]
    return out


def odd_prime(cx, x):
    # Pairs x[q] +- x[p-q] halve the multiplications of the direct sum.
    p = len(x)
    h = (p - 1) // 2
    a = [None] + [cx.add(x[q], x[p - q]) for q in range(1, h + 1)]
    b = [None] + [cx.sub(x[q], x[p - q]) for q in range(1, h + 1)]
    out = [None] * p
    out[0] = cx.add(x[0], cx.total(a[1:]))
    for k in range(1, h + 1):
        t = x[0]
        s = (Z, Z)
        for q in range(1, h + 1):
            t = cx.add(t, cx.scale(math.cos(2 * math.pi * q * k / p), a[q]))
            s = cx.add(s, cx.scale(math.sin(2 * math.pi * q * k / p), b[q]))
        out[k] = cx.add(t, cx.times_minus_i(s))
        out[p - k] = cx.add(t, cx.times_i(s))
    return out


def literal(c):
    r = repr(float(c))
    return r


class Emitter:
    """Writes one block as straight-line code around two accessors: `in` delivers input j (loaded
    at its first use), `out` takes output k. Outputs are handed over once every input has been
    loaded, so that a block may write over its own input in place."""

    def __init__(self, g):
        self.g = g

    def ref(self, idx, names):
        op, a, _ = self.g.nodes[idx]
        return a if op == 'in' else names[idx]

    def emit(self, outputs, inputs, indent):
        """outputs: list of (call, values) where call is the accessor call with one %s per value;
        inputs: {input name: (group, load line)}, where one load line defines a whole group.
        Returns (lines, adds, muls)."""
        g = self.g
        live = set()
        stack = [v[0] for _, vs in outputs for v in vs if v is not Z]
        while stack:
            i = stack.pop()
            if i in live:
                continue
            live.add(i)
            op, a, b = g.nodes[i]
            if op in ('add', 'sub'):
                stack += [a, b]
            elif op == 'mul':
                stack.append(b)
        needed = {inputs[g.nodes[i][1]][0] for i in live if g.nodes[i][0] == 'in'}
        loaded = set()
        names, lines, adds, muls = {}, [], 0, 0
        done = set()  # nodes whose values exist
        pending = list(range(len(outputs)))

        def load(i):
            group, line = inputs[g.nodes[i][1]]
            if group not in loaded:
                loaded.add(group)
                lines.append(indent + line)
            done.add(i)

        def flush():
            if loaded != needed:
                return
            for o in list(pending):
                call, vs = outputs[o]
                if all(v is Z or v[0] in done for v in vs):
                    args = tuple('V(0.0)' if v is Z else ('' if v[1] > 0 else '-') + self.ref(v[0], names)
                                 for v in vs)
                    lines.append(indent + call % args + ';')
                    pending.remove(o)

        for i in sorted(live):
            op, a, b = g.nodes[i]
            if op == 'in':
                continue
            for j in ((a, b) if op in ('add', 'sub') else (b,)):
                if g.nodes[j][0] == 'in':
                    load(j)
            names[i] = 't%d' % len(names)
            if op == 'add':
                expr = '%s + %s' % (self.ref(a, names), self.ref(b, names))
                adds += 1
            elif op == 'sub':
                expr = '%s - %s' % (self.ref(a, names), self.ref(b, names))
                adds += 1
            else:
                expr = '%s * %s' % (self.ref(b, names), literal(a))
                muls += 1
            lines.append('%sconst V %s = %s;' % (indent, names[i], expr))
            done.add(i)
            flush()
        for i in sorted(live):
            if g.nodes[i][0] == 'in':
                load(i)
        flush()
        assert not pending
        return lines, adds, muls


def complex_block(n):
    g = Dag()
    cx = Complex(g)
    x = [(g.inp('xr%d' % j), g.inp('xi%d' % j)) for j in range(n)]
    inputs = {}
    for j in range(n):
        line = 'V xr%d, xi%d;\n%sin.C(%d, xr%d, xi%d);' % (j, j, ' ' * 8, j, j, j)
        inputs['xr%d' % j] = inputs['xi%d' % j] = (j, line)
    y = dft(cx, x)
    outs = [('out.C(%d, %%s, %%s)' % k, y[k]) for k in range(n)]
    return Emitter(g).emit(outs, inputs, ' ' * 8)


def real_block(n):
    g = Dag()
    cx = Complex(g)
    x = [(g.inp('x%d' % j), Z) for j in range(n)]
    inputs = {'x%d' % j: (j, 'V x%d;\n%sin.R(%d, x%d);' % (j, ' ' * 8, j, j)) for j in range(n)}
    y = dft(cx, x)
    outs = [('out.R(0, %s)', (y[0][0],))]
    for k in range(1, (n - 1) // 2 + 1):
        outs.append(('out.R(%d, %%s)' % k, (y[k][0],)))
        outs.append(('out.R(%d, %%s)' % (n - k), (y[k][1],)))
    if n % 2 == 0:
        outs.append(('out.R(%d, %%s)' % (n // 2), (y[n // 2][0],)))
    return Emitter(g).emit(outs, inputs, ' ' * 8)


def main():
    out = []
    w = out.append
    w('// Generated by: /usr/bin/python3 tools/gen_fft_kernels.py > '
      'src/transform/fft/kernels/dft_blocks.hpp')
    w('// Do not edit: change the generator and run that command again.')
    w('#pragma once')
    w('')
    w('#include "transform/fft/kernels/lanes.hpp"')
    w('')
    w('namespace tw::fft::TW_FFT_ISA {')
    w('')
    w('// One DFT of radix R, forward sign, on values of type V (a double, or a vector of independent')
    w('// transforms). Complex: in.C(j, re, im) loads input j, out.C(k, re, im) takes output k. Real:')
    w('// in.R(j, x) loads input j, out.R(k, y) takes half-complex element k (y[k] = Re X[k],')
    w('// y[R-k] = Im X[k]). Outputs come after the last input is loaded, so the block may work in place.')
    w('template <int R>')
    w('struct DftBlock;')
    for n in RADICES:
        cl, ca, cm = complex_block(n)
        rl, ra, rm = real_block(n)
        w('')
        w('template <>')
        w('struct DftBlock<%d> {' % n)
        w('    // %d additions, %d multiplications.' % (ca, cm))
        w('    template <class V, class In, class Out>')
        w('    static inline __attribute__((always_inline)) void Complex(const In& in, const Out& out) {')
        out.extend(cl)
        w('    }')
        w('    // %d additions, %d multiplications.' % (ra, rm))
        w('    template <class V, class In, class Out>')
        w('    static inline __attribute__((always_inline)) void Real(const In& in, const Out& out) {')
        out.extend(rl)
        w('    }')
        w('};')
    w('')
    w('}  // namespace tw::fft::TW_FFT_ISA')
    sys.stdout.write('\n'.join(out) + '\n')


if __name__ == '__main__':
    main()
