// Polynomial exports: a failed resize of any output is out of memory and empties every output, in
// both block placements (the numerics are checked against NumPy in tests/reference/test_poly.py).
#include <gtest/gtest.h>

#include <complex>
#include <functional>
#include <optional>
#include <vector>

#include "common/helpers.hpp"
#include "twanlys/numeric.h"
#include "twanlys/status.h"
#include "twrt.hpp"

namespace {

using twrt::Array1D;
using C = std::complex<double>;

class Poly : public ::testing::TestWithParam<bool> {
protected:
    twrt::Placement placement_{GetParam()};
};

TEST_P(Poly, FailedResizeEmptiesEveryOutput) {
    const std::vector<double> quartic{4, 0, -5, 0, 1};  // (x^2 - 1)(x^2 - 4)
    const std::vector<C> cquartic(quartic.begin(), quartic.end());
    // Each call makes its outputs, runs the export and returns the status and the output sizes.
    struct Outcome {
        int32_t status;
        std::vector<int32_t> sizes;
        std::optional<double> residual;  // for the exports with one
    };
    using Call = std::function<Outcome()>;
    const Call calls[] = {
        [&] {
            Array1D<double> a(quartic), b{1, 2};
            Array1D<C> p{1};
            return Outcome{MultiplyPolyH(a.h(), b.h(), p.h()), {p.size()}, {}};
        },
        [&] {
            Array1D<C> a(cquartic), b{1, 2}, p{1};
            return Outcome{CxMultiplyPolyH(a.h(), b.h(), p.h()), {p.size()}, {}};
        },
        [&] {
            Array1D<double> a(quartic), r{0.9};
            Array1D<C> z{C(1.8, 0), C(2.1, 0)}, out{1};
            return Outcome{
                PolyRootsNtBst_head(a.h(), r.h(), 50, 1e-12, z.h(), 50, 1e-12, out.h()), {out.size()}, {}};
        },
        [&] {
            Array1D<C> a(cquartic);
            int32_t opt = 0, st = 0;
            CxPolyRoots_head(a.h(), &opt, &st);
            return Outcome{st, {a.size()}, {}};
        },
        [&] {
            Array1D<double> a(quartic);
            Array1D<C> r{1};
            Array1D<int32_t> m{1};
            double res = 0;
            const int32_t st = MultPolyRoots_head(a.h(), 0, 0, r.h(), &res, m.h());
            return Outcome{st, {r.size(), m.size()}, res};
        },
        [&] {
            Array1D<C> a(cquartic), r{1};
            Array1D<int32_t> m{1};
            double res = 0;
            const int32_t st = CxMultPolyRoots_head(a.h(), 0, 0, r.h(), &res, m.h());
            return Outcome{st, {r.size(), m.size()}, res};
        },
        [&] {
            Array1D<double> a(quartic), b{-1, 0, 1}, g{1}, u{1}, v{1};
            double res = 0;
            const int32_t st = PolyGCD_H(a.h(), b.h(), 0, g.h(), u.h(), v.h(), &res);
            return Outcome{st, {g.size(), u.size(), v.size()}, res};
        },
        [&] {
            Array1D<C> a(cquartic), b{-1, 0, 1}, g{1}, u{1}, v{1};
            double res = 0;
            const int32_t st = CxPolyGCD_H(a.h(), b.h(), 0, g.h(), u.h(), v.h(), &res);
            return Outcome{st, {g.size(), u.size(), v.size()}, res};
        },
    };
    for (size_t i = 0; i < std::size(calls); ++i) {
        const Outcome ok = calls[i]();
        ASSERT_EQ(ok.status, 0) << i;
        for (int32_t n : ok.sizes) EXPECT_GT(n, 0) << i;
        for (int32_t k = 1; k <= static_cast<int32_t>(ok.sizes.size()); ++k) {
            TWRTFailResizeAt(k);
            const Outcome bad = calls[i]();
            TWRTFailResizeAt(0);
            EXPECT_EQ(bad.status, OutOfMemoryErr) << i << " resize " << k;
            for (int32_t n : bad.sizes) EXPECT_EQ(n, 0) << i << " resize " << k;
            if (bad.residual) {
                EXPECT_TRUE(twtest::IsFailureNaN(*bad.residual)) << i;
            }
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Placements, Poly, ::testing::Bool(), twtest::PlacementName);

}  // namespace
