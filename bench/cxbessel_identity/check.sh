#!/usr/bin/env bash
# Usage: bench/cxbessel_identity/check.sh <reference libtwanlys.so> <reference git rev> [<libtwanlys.so>]
#
# 1. dump.cpp calls the nine complex Bessel and Airy exports of the reference library and of this
#    tree's (default build/libtwanlys.so) at 100000 points, both scalings and kinds (2.8 million
#    calls), and the two files of statuses and value bits must be the same byte for byte.
# 2. seq_dump.cpp calls the port's drivers with sequences (n = 2..8), built once from the port's
#    sources at the reference rev and once from this tree's working copy; same comparison.
#
# The reference library is the one built from the reference rev: copy build/libtwanlys.so aside
# before changing the port, e.g.  cp build/libtwanlys.so.0.1 /tmp/ref.so; git rev-parse HEAD.
# Exit status 0 when both comparisons find the same bytes.
set -euo pipefail
here=$(cd "$(dirname "$0")" && pwd)
root=$(cd "$here/../.." && pwd)
ref=$(realpath "$1"); rev=$2; lib=$(realpath "${3:-$root/build/libtwanlys.so}")
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
flags=(-O3 -DNDEBUG -std=c++20 -ffp-contract=off -fno-fast-math -Wall -Wextra -Werror)
status=0
compare() {  # label, file a, file b, record size
    local calls=$(( $(stat -c %s "$2") / $4 ))
    if cmp -s "$2" "$3"; then echo "$1 identical: $calls calls"; else echo "$1 DIFFERENT (of $calls calls)"; status=1; fi
}

g++ "${flags[@]}" "$here/dump.cpp" -ldl -o "$work/dump"
"$work/dump" "$ref" "$work/ref.bin" &
"$work/dump" "$lib" "$work/new.bin"
wait
compare exports "$work/ref.bin" "$work/new.bin" 20

mkdir -p "$work/refsrc/special/amos"
for f in $(git -C "$root" ls-tree --name-only "$rev" src/special/amos/); do
    git -C "$root" show "$rev:$f" > "$work/refsrc/special/amos/$(basename "$f")"
done
g++ "${flags[@]}" -I"$here" -I"$work/refsrc" "$here/seq_dump.cpp" "$work"/refsrc/special/amos/*.cpp -o "$work/seq_ref" &
g++ "${flags[@]}" -I"$here" -I"$root/src" "$here/seq_dump.cpp" "$root"/src/special/amos/*.cpp -o "$work/seq_new"
wait
"$work/seq_ref" "$work/seq_ref.bin" &
"$work/seq_new" "$work/seq_new.bin"
wait
compare sequences "$work/seq_ref.bin" "$work/seq_new.bin" 136
exit $status
