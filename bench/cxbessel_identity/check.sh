#!/usr/bin/env bash
# Usage: bench/cxbessel_identity/check.sh <reference libtwanlys.so> [<libtwanlys.so>] [points]
# Builds dump.cpp, runs it on both libraries (default: this tree's build/libtwanlys.so) and
# compares the two output files byte for byte: every status and every bit of every value.
set -euo pipefail
here=$(cd "$(dirname "$0")" && pwd)
root=$(cd "$here/../.." && pwd)
ref=$(realpath "$1"); lib=$(realpath "${2:-$root/build/libtwanlys.so}"); points=${3:-100000}
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
g++ -O2 -std=c++20 -Wall -Wextra -Werror "$here/dump.cpp" -ldl -o "$work/dump"
"$work/dump" "$ref" "$work/ref.bin" "$points" &
"$work/dump" "$lib" "$work/new.bin" "$points"
wait
calls=$(( $(stat -c %s "$work/ref.bin") / 20 ))
if cmp "$work/ref.bin" "$work/new.bin"; then
    echo "identical: $calls calls"
else
    echo "DIFFERENT (of $calls calls)"
    exit 1
fi
