#include "frame/frame.hpp"
#include "generate/random.hpp"
#include "generate/shuffle.hpp"
#include "twanlys/generate.h"

using namespace tw;

namespace {

// Validation first, so a refused shuffle draws nothing; every handle is emptied on failure.
template <class T>
Status Shuffle(Handle data, Handle perm, int32_t n, int32_t seed, RandomState* state, int32_t algorithm) {
    Frame f;
    if (data != nullptr) f.Output<T>(data);
    f.Output<int32_t>(perm);
    Status s = n < 1 ? EmptyArrayErr : 0;
    T* d = nullptr;
    int32_t* p = nullptr;
    if (s == 0 && data != nullptr) s = f.InPlace(data, &d);
    if (s == 0 && f.Resize(perm, n, &p) != 0) s = OutOfMemoryErr;
    if (s == 0) {
        RandomState local{0, 0, 0};
        RandomState* st = state != nullptr ? state : &local;
        ApplySeed(seed, st);
        Riffle(d, p, n, st, algorithm);
    }
    return f.Finish(s);
}

}  // namespace

TW_API AnalysisStatus RiffleArrayDBL2012_head(Array1DHandle data, Array1DHandle permutation, int32_t seed,
                                              RandomState* state, int32_t algorithm) {
    return Shuffle<double>(data, permutation, Count(data), seed, state, algorithm);
}

TW_API AnalysisStatus RiffleArrayInt2012_head(Array1DHandle data, Array1DHandle permutation, int32_t seed,
                                              RandomState* state, int32_t algorithm) {
    return Shuffle<int32_t>(data, permutation, Count(data), seed, state, algorithm);
}

TW_API AnalysisStatus RiffleArrayCDB2012_head(Array1DHandle data, Array1DHandle permutation, int32_t seed,
                                              RandomState* state, int32_t algorithm) {
    return Shuffle<cdouble>(data, permutation, Count(data), seed, state, algorithm);
}

TW_API AnalysisStatus RiffleIntNum2012_head(Array1DHandle permutation, int32_t n, int32_t seed,
                                            RandomState* state, int32_t algorithm) {
    return Shuffle<int32_t>(nullptr, permutation, n, seed, state, algorithm);
}

TW_API AnalysisStatus RiffleArrayDBL_head(Array1DHandle data, Array1DHandle permutation, int32_t seed,
                                          RandomState* state) {
    return RiffleArrayDBL2012_head(data, permutation, seed, state, 0);
}

TW_API AnalysisStatus RiffleArrayInt_head(Array1DHandle data, Array1DHandle permutation, int32_t seed,
                                          RandomState* state) {
    return RiffleArrayInt2012_head(data, permutation, seed, state, 0);
}

TW_API AnalysisStatus RiffleArrayCDB_head(Array1DHandle data, Array1DHandle permutation, int32_t seed,
                                          RandomState* state) {
    return RiffleArrayCDB2012_head(data, permutation, seed, state, 0);
}

TW_API AnalysisStatus RiffleIntNum_head(Array1DHandle permutation, int32_t n, int32_t seed,
                                        RandomState* state) {
    return RiffleIntNum2012_head(permutation, n, seed, state, 0);
}
