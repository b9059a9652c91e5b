// Runs the sweep over rows: cases, both block placements, a resize failure at each resize in
// turn, a run with every scratch allocation failing, and the same calls from many threads.
#pragma once

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <set>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

#include "sweep/sweep.hpp"
#include "twanlys/workspace.h"

namespace sweep {

struct Tally {
    int64_t calls = 0;
    int64_t failed = 0;  // calls that reported a failure
    int rows = 0;
    int skipped = 0;
    int unlisted = 0;  // swept rows that give a status but name no status set
};

// Random cases per row. The sanitizer tree sets TW_SWEEP_RANDOM lower to stay within its time.
inline int Depth() {
    const char* env = std::getenv("TW_SWEEP_RANDOM");
    return env != nullptr ? std::atoi(env) : 160;
}

// Every resize is tried as the failing one up to this many per call.
inline constexpr int64_t kMaxInjected = 8;

// While it lives, scratch memory comes from an arena too small for any block, so every routed
// allocation fails. A workspace in place before (the suite's own) is put back afterwards.
class ScratchFailing {
public:
    ScratchFailing() : before_(tw::InspectArena()) {
        ErrorCluster e{};
        DisableAnalysisWorkspaceH(&e);
        UninitializeAnalysisWorkspaceH(&e);
        e = {};
        InitializeAnalysisWorkspaceH(16, &e);
        EnableAnalysisWorkspaceH(&e);
    }
    ~ScratchFailing() {
        ErrorCluster e{};
        DisableAnalysisWorkspaceH(&e);
        UninitializeAnalysisWorkspaceH(&e);
        if (before_.live >= 0) {
            InitializeAnalysisWorkspaceH(static_cast<int32_t>(before_.limit - before_.base), &e);
            if (before_.enabled) EnableAnalysisWorkspaceH(&e);
        }
    }
    ScratchFailing(const ScratchFailing&) = delete;
    ScratchFailing& operator=(const ScratchFailing&) = delete;

private:
    tw::ArenaView before_;
};

inline std::vector<std::string> SweepRow(const Row& row, int random, Tally* tally) {
    std::vector<std::string> faults;
    if (row.noSweep) {
        ++tally->skipped;
        return faults;
    }
    ++tally->rows;
    tally->unlisted += row.nAllowed < 0 && row.style != Style::None ? 1 : 0;
    const bool trace = std::getenv("TW_SWEEP_TRACE") != nullptr;
    const auto start = std::chrono::steady_clock::now();
    std::vector<void*> cells(static_cast<size_t>(row.nArgs), nullptr);
    std::set<int32_t> statuses;
    auto run = [&](const Case& c, int32_t failAt) {
        Verdict v = CallAndJudge(row, c, cells.data(), failAt);
        statuses.insert(v.status);
        ++tally->calls;
        tally->failed += v.failed ? 1 : 0;
        faults.insert(faults.end(), v.faults.begin(), v.faults.end());
        return v;
    };
    const std::vector<Case> cases = Cases(row, random);
    const int32_t placement = TWRTPlacement();
    for (const Case& c : cases) {
        uint64_t digest[2] = {0, 0};
        for (int32_t aligned : {0, 1}) {
            TWRTSetPlacement(aligned);
            const Verdict v = run(c, 0);
            digest[aligned] = v.digest;
            for (int64_t k = 1; aligned == 0 && k <= v.resizes && k <= kMaxInjected; ++k)
                run(c, static_cast<int32_t>(k));
        }
        // Where the host puts element data changes nothing in the results.
        if (digest[0] != digest[1])
            faults.push_back(std::string(row.name) + ": packed and aligned blocks give different results (case " +
                             std::to_string(&c - cases.data()) + ")");
    }
    TWRTSetPlacement(placement);
    {
        ScratchFailing failing;
        run(cases[0], 0);
        for (size_t k = cases.size() - static_cast<size_t>(random); k < cases.size(); ++k) run(cases[k], 0);
    }
    ReleaseCells(row, cells.data(), true);
    if (trace) {
        std::fprintf(stderr, "%-32s %6zu cases %8.3f s, statuses", row.name, cases.size(),
                     std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count());
        for (int32_t st : statuses) std::fprintf(stderr, " %d", st);
        std::fprintf(stderr, "\n");
    }
    return faults;
}

// The base and random cases of every row, digested: on one thread, then on `threads` threads at
// once, each with call sites of its own. Differences are reported by row.
inline std::vector<std::string> CompareThreads(const std::vector<const Row*>& rows, int threads) {
    auto digests = [&](std::vector<std::vector<void*>>* cells) {
        std::vector<uint64_t> d;
        for (const Row* row : rows) {
            if (row->noSweep) continue;
            cells->emplace_back(static_cast<size_t>(row->nArgs), nullptr);
            const std::vector<Case> cases = Cases(*row, 4);
            for (size_t k = 0; k < cases.size(); k += cases.size() > 8 ? 3 : 1)
                d.push_back(CallAndJudge(*row, cases[k], cells->back().data(), 0).digest);
            ReleaseCells(*row, cells->back().data(), false);
        }
        return d;
    };
    std::vector<std::vector<void*>> cells;
    const std::vector<uint64_t> one = digests(&cells);
    std::vector<std::vector<uint64_t>> many(static_cast<size_t>(threads));
    std::vector<std::vector<std::vector<void*>>> manyCells(static_cast<size_t>(threads));
    {
        std::vector<std::thread> pool;
        for (int t = 0; t < threads; ++t) pool.emplace_back([&, t] { many[t] = digests(&manyCells[t]); });
        for (std::thread& t : pool) t.join();
    }
    TWRTRunCleanups(2);
    std::vector<std::string> faults;
    for (int t = 0; t < threads; ++t) {
        size_t k = 0;
        for (const Row* row : rows) {
            if (row->noSweep) continue;
            const std::vector<Case> cases = Cases(*row, 4);
            bool same = true;
            for (size_t c = 0; c < cases.size(); c += cases.size() > 8 ? 3 : 1, ++k) same = same && many[t][k] == one[k];
            if (!same) faults.push_back(std::string(row->name) + ": thread " + std::to_string(t) + " differs from one thread");
        }
    }
    return faults;
}

// `nm -D --defined-only` output against the names of the built rows.
inline std::vector<std::string> CompareExports(const std::set<std::string>& built, const std::string& nm) {
    std::set<std::string> exported;
    std::istringstream lines(nm);
    for (std::string line; std::getline(lines, line);) {
        const std::string name = line.substr(line.rfind(' ') + 1);
        if (!name.empty() && name != "xerbla_" && name != "cblas_xerbla") exported.insert(name);
    }
    std::vector<std::string> faults;
    for (const std::string& name : exported)
        if (!built.count(name)) faults.push_back(name + " is exported but its row has no signature");
    for (const std::string& name : built)
        if (!exported.count(name)) faults.push_back(name + " has a signature but is not exported");
    return faults;
}

}  // namespace sweep
