#!/usr/bin/env bash
# Builds the libFuzzer target with clang, in a build tree of its own, and fuzzes the exports of the
# signature table starting from the checked-in corpus.
#   fuzz.sh [seconds (default 600)] [build dir (default build-fuzz)] [more libFuzzer options]
# New inputs are kept in <build dir>/corpus; a crash is written to <build dir>/crash-*, and belongs
# in fuzz/corpus once its fault is fixed.
set -euo pipefail
src=$(cd "$(dirname "$0")/.." && pwd)
seconds=${1:-600}
build=${2:-$src/build-fuzz}
shift $(( $# < 2 ? $# : 2 ))
cmake -S "$src" -B "$build" -G Ninja -DCMAKE_BUILD_TYPE=None -DCMAKE_C_COMPILER=clang \
      -DCMAKE_CXX_COMPILER=clang++ -DCMAKE_CXX_FLAGS="-O1 -g1" \
      -DTW_SANITIZE=fuzzer-no-link,address,undefined -DTW_FUZZ=ON -DTW_APPS=OFF >/dev/null
cmake --build "$build" -j 2 --target fuzz_exports
mkdir -p "$build/corpus"
export ASAN_OPTIONS=detect_leaks=1:abort_on_error=1
export UBSAN_OPTIONS=print_stacktrace=1:halt_on_error=1
# A call that takes 20 s on inputs of a few elements is a fault of its own.
exec "$build/fuzz_exports" -max_total_time="$seconds" -timeout=20 -print_final_stats=1 -artifact_prefix="$build/" \
     "$@" "$build/corpus" "$src/fuzz/corpus"
