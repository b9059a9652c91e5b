#include <cmath>
#include <mutex>
#include <utility>

#include "transform/fft/kernels/codelets.hpp"
#include "transform/fft/table_internal.hpp"

namespace tw {
namespace fft {
namespace {

constexpr int32_t kFixedRadices[] = {10, 43, 41, 37, 32, 31, 29, 19, 18, 17, 16, 14, 13, 11, 9, 8, 7, 5, 4, 3, 2};
constexpr int32_t kFastPrimes[] = {2, 3, 5, 7, 11, 13, 17, 19, 29, 31, 37, 41, 43};

// Guards the list and every reference count; held across a whole build.
std::mutex g_tableLock;
FftTable* g_head = nullptr;

void ReleaseParts(FftTable* t) {
    for (int32_t i = 0; i < t->stageCount; ++i) {
        FftStage* st = t->stages[i];
        if (st == nullptr) continue;
        PlainFree(st->oddCos);
        PlainFree(st->oddSin);
        PlainFree(st->twiddleRe);
        PlainFree(st->twiddleIm);
        PlainFree(st->laneTwiddleRe);
        PlainFree(st->laneTwiddleIm);
        ReleaseRaderStage(st);
        PlainFree(st);
    }
    PlainFree(t);
}

double* AllocDoubles(size_t n) { return static_cast<double*>(PlainAlloc(n * sizeof(double))); }

bool BuildStages(FftTable* t) {
    const CodeletTables& k = Codelets();
    for (int32_t i = 0; i < t->stageCount; ++i) {
        const int32_t r = t->factors[i];
        if (t->kinds[i] == KindCodelet) {
            t->leafReal[i] = k.leafReal[r];
            t->combineReal[i] = k.combineReal[r];
            t->leafComplex[i] = k.leafComplex[r];
            t->combineComplex[i] = k.combineComplex[r];
        }
        t->stages[i] = static_cast<FftStage*>(PlainZeroAlloc(sizeof(FftStage)));
        if (t->stages[i] == nullptr) return false;
    }
    int32_t length = t->size;
    for (int32_t i = 0; i + 1 < t->stageCount; ++i) {
        FftStage* st = t->stages[i];
        const int32_t r = t->factors[i], m = length / r;
        const size_t count = static_cast<size_t>(r - 1) * static_cast<size_t>(m - 1);
        st->twiddleRe = AllocDoubles(count);
        st->twiddleIm = AllocDoubles(count);
        st->laneTwiddleRe = AllocDoubles(count);
        st->laneTwiddleIm = AllocDoubles(count);
        if (st->twiddleRe == nullptr || st->twiddleIm == nullptr || st->laneTwiddleRe == nullptr ||
            st->laneTwiddleIm == nullptr)
            return false;
        for (int32_t c = 1; c < r; ++c) {
            const long double theta = static_cast<long double>(c) * static_cast<long double>(kTwoPi) / length;
            ExpRun(theta, 1, m - 1, st->twiddleRe + (c - 1), st->twiddleIm + (c - 1), r - 1);
            for (int32_t j = 1; j < m; ++j) {
                const size_t from = static_cast<size_t>(j - 1) * static_cast<size_t>(r - 1) + static_cast<size_t>(c - 1);
                const size_t to = static_cast<size_t>(c - 1) * static_cast<size_t>(m - 1) + static_cast<size_t>(j - 1);
                st->laneTwiddleRe[to] = st->twiddleRe[from];
                st->laneTwiddleIm[to] = st->twiddleIm[from];
            }
        }
        length = m;
    }
    for (int32_t i = 0; i < t->stageCount; ++i) {
        FftStage* st = t->stages[i];
        const int32_t p = t->factors[i];
        if (t->kinds[i] == KindOdd) {
            st->oddCos = AllocDoubles(static_cast<size_t>(p));
            st->oddSin = AllocDoubles(static_cast<size_t>(p));
            if (st->oddCos == nullptr || st->oddSin == nullptr) return false;
            ExpRun(static_cast<long double>(kTwoPi) / p, 0, p - 1, st->oddCos, st->oddSin, 1);
        } else if (t->kinds[i] == KindRader) {
            if (!SetupRaderStage(st, p)) return false;
        }
    }
    return true;
}

FftTable* Build(int32_t n) {
    auto* t = static_cast<FftTable*>(PlainZeroAlloc(sizeof(FftTable)));
    if (t == nullptr) return nullptr;
    t->size = n;
    t->stageCount = FftFactorise(n, t->factors, t->kinds);
    if (!BuildStages(t)) {
        ReleaseParts(t);
        return nullptr;
    }
    return t;
}

}  // namespace

void ExpRun(long double theta, int32_t first, int32_t last, double* re, double* im, ptrdiff_t step) {
    // Two true sines per run; every further value is one rotation, kept in extended precision.
    const long double h = std::sin(theta / 2);
    const long double a = 2 * h * h, b = -std::sin(theta);
    long double x = 1, y = 0;
    for (int32_t j = 0; j <= last; ++j) {
        if (j >= first) {
            re[(j - first) * step] = static_cast<double>(x);
            im[(j - first) * step] = static_cast<double>(y);
        }
        const long double nx = x - (x * a + y * b);
        y = y - (y * a - x * b);
        x = nx;
    }
}

FftTable* CreateLocked(int32_t n) {
    if (n < 1) return nullptr;
    for (FftTable* t = g_head; t != nullptr; t = t->next) {
        if (t->size == n) {
            ++t->refs;
            return t;
        }
    }
    FftTable* t = Build(n);
    if (t == nullptr) return nullptr;
    t->refs = 1;
    t->prev = nullptr;
    t->next = g_head;
    if (g_head != nullptr) g_head->prev = t;
    g_head = t;
    return t;
}

void DestroyLocked(FftTable* t) {
    if (t == nullptr || --t->refs > 0) return;
    if (t->prev == nullptr)
        g_head = t->next;
    else
        t->prev->next = t->next;
    if (t->next != nullptr) t->next->prev = t->prev;
    ReleaseParts(t);
}

}  // namespace fft

FftTable* CreateFftTable(int32_t n) {
    std::lock_guard<std::mutex> lock(fft::g_tableLock);
    return fft::CreateLocked(n);
}

void DestroyFftTable(FftTable* t) {
    if (t == nullptr) return;
    std::lock_guard<std::mutex> lock(fft::g_tableLock);
    fft::DestroyLocked(t);
}

int32_t FftFactorise(int32_t n, int32_t* factors, int32_t* kinds) {
    int32_t count = 0, rest = n;
    for (const int32_t r : fft::kFixedRadices) {
        while (rest > 1 && rest % r == 0) {
            factors[count] = r;
            kinds[count++] = KindCodelet;
            rest /= r;
        }
        if (rest == 1) break;
    }
    if (rest > 8) {
        for (int32_t c = 3; static_cast<int64_t>(c) * c <= rest; c += 2) {
            while (rest % c == 0) {
                factors[count] = c;
                kinds[count++] = c < 50 ? KindOdd : KindRader;
                rest /= c;
            }
        }
    }
    if (rest > 1) {
        factors[count] = rest;
        kinds[count++] = rest <= 49 ? KindOdd : KindRader;
    }
    for (int32_t i = 0; i < count; ++i) {
        for (int32_t j = i + 1; j < count; ++j) {
            if (factors[j] < factors[i]) {
                std::swap(factors[i], factors[j]);
                std::swap(kinds[i], kinds[j]);
            }
        }
    }
    return count;
}

int32_t FftNextFastSize(int32_t n) {
    for (int64_t m = n < 1 ? 1 : n; m <= INT32_MAX; ++m) {
        int64_t rest = m;
        for (const int32_t p : fft::kFastPrimes)
            while (rest % p == 0) rest /= p;
        if (rest == 1) return static_cast<int32_t>(m);
    }
    return 0;
}

}  // namespace tw
