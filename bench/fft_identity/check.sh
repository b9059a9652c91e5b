#!/usr/bin/env bash
# Usage: bench/fft_identity/check.sh <reference source tree> <reference build> [<build>]
# Builds fft_dump.cpp against the library objects of the reference build and of this tree's build
# (default: build), runs both and reports every line where the output bits differ.
set -euo pipefail
here=$(cd "$(dirname "$0")" && pwd)
root=$(cd "$here/../.." && pwd)
refsrc=$(cd "$1" && pwd); refbuild=$(cd "$2" && pwd); build=$(cd "${3:-$root/build}" && pwd)
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
dump() {  # source tree, build tree, output
    mapfile -t objs < <(find "$2/src/CMakeFiles/twanlys_obj.dir" -name '*.o')
    g++ -O2 -std=c++20 -ffp-contract=off -I"$1/src" -I"$1/include" "$here/fft_dump.cpp" "${objs[@]}" \
        -llapack -lblas -lpthread -ldl -o "$3"
}
dump "$refsrc" "$refbuild" "$work/ref"
dump "$root" "$build" "$work/new"
"$work/ref" > "$work/ref.txt"
"$work/new" > "$work/new.txt"
lines=$(wc -l < "$work/ref.txt")
if diff "$work/ref.txt" "$work/new.txt" > "$work/diff.txt"; then
    echo "identical: $lines lines"
else
    head -40 "$work/diff.txt"
    echo "DIFFERENT: $(grep -c '^<' "$work/diff.txt") of $lines lines"
    exit 1
fi
