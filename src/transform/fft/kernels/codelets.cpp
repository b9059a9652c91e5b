// The choice of the kernel tables: the widest instruction set the processor has. Both sets compute
// the same operations lane by lane, so the choice changes the speed and never a result bit.
#include "transform/fft/kernels/codelets.hpp"

namespace tw::fft {
namespace {

CodeletTables Make(void (*const* put)(CodeletTables&)) {
    CodeletTables t{};
    for (int i = 0; i < 3; ++i) put[i](t);
    return t;
}

bool HasAvx2() {
    __builtin_cpu_init();
    return __builtin_cpu_supports("avx2");
}

}  // namespace

const CodeletTables* CodeletsFor(CodeletIsa isa) {
    static void (*const sse2[])(CodeletTables&) = {sse2::PutCodeletsA, sse2::PutCodeletsB, sse2::PutCodeletsC};
    static void (*const avx2[])(CodeletTables&) = {avx2::PutCodeletsA, avx2::PutCodeletsB, avx2::PutCodeletsC};
    static const CodeletTables base = Make(sse2);
    static const bool wide = HasAvx2();
    if (isa == CodeletIsa::Sse2) return &base;
    if (!wide) return nullptr;
    static const CodeletTables tables = Make(avx2);
    return &tables;
}

const CodeletTables& Codelets() {
    static const CodeletTables& best = *(CodeletsFor(CodeletIsa::Avx2) ? CodeletsFor(CodeletIsa::Avx2)
                                                                        : CodeletsFor(CodeletIsa::Sse2));
    return best;
}

const CodeletTables& BaselineCodelets() { return *CodeletsFor(CodeletIsa::Sse2); }

bool HasCodelet(int32_t radix) {
    return radix >= 2 && radix <= kFftMaxRadix && Codelets().leafReal[radix] != nullptr;
}

}  // namespace tw::fft
