#!/usr/bin/env bash
# Builds the project with the given sanitizers in a build tree of its own and runs its C++ suites.
#   sanitized-suite.sh <source dir> <build dir> <address,undefined | thread>
set -euo pipefail
src=$1 build=$2 sanitizers=$3
# -O1 keeps the instrumented build of the large generated kernels quick; line tables suffice for
# the reports.
cmake -S "$src" -B "$build" -G Ninja -DCMAKE_BUILD_TYPE=None -DCMAKE_CXX_FLAGS="-O1 -g1" \
      -DTW_SANITIZE="$sanitizers" -DTW_APPS=OFF >/dev/null
cmake --build "$build" -j 2
export ASAN_OPTIONS=detect_leaks=1:abort_on_error=1
export UBSAN_OPTIONS=print_stacktrace=1:halt_on_error=1
export TSAN_OPTIONS=halt_on_error=1:second_deadlock_stack=1
cd "$build" && ctest --output-on-failure -j 2
