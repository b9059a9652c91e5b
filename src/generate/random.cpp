#include "generate/random.hpp"

#include <cmath>

namespace tw {
namespace {

// Products wrap at 32 bits and the remainder truncates: large seeds leave s1 unreduced, and the
// streams they give depend on exactly this arithmetic.
int32_t WrapMul(int32_t a, int32_t b) {
    return static_cast<int32_t>(static_cast<uint32_t>(a) * static_cast<uint32_t>(b));
}

double Step(RandomState* st) {
    st->s1 = WrapMul(st->s1, 171) % 30269;
    st->s2 = WrapMul(st->s2, 172) % 30307;
    st->s3 = WrapMul(st->s3, 170) % 30323;
    double x = st->s1 * 3.3037100664045725e-05;
    x += st->s2 * 3.2995677566238825e-05;
    x += st->s3 * 3.297826732183491e-05;
    return x;
}

}  // namespace

void RandomSeed(int32_t seed, RandomState* state) {
    if (seed == 0) return;
    state->s1 = seed;
    state->s2 = WrapMul(seed, 8191) & 16383;
    state->s3 = WrapMul(state->s2, 8191) & 16383;
}

double RandomUniform(RandomState* state) {
    const double x = Step(state);
    return x - std::floor(x);
}

int32_t RandomInt15(RandomState* state) {
    const double x = Step(state);
    const double f = x - std::trunc(x);
    return static_cast<int32_t>(f * 32768.0);
}

}  // namespace tw
