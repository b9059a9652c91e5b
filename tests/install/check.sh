#!/usr/bin/env bash
# Installs the build tree into a temporary prefix and builds a consumer against the installed tree
# only, once through pkg-config and once through find_package.
#   check.sh <source dir> <build dir>
set -euo pipefail
src=$1 build=$2
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
prefix=$work/prefix
cmake --install "$build" --prefix "$prefix" >/dev/null
lib=$(ls -d "$prefix"/lib*/ | head -1)
test -L "$lib/libtwanlys.so" && test -e "$lib/libtwanlys.so.0" && test -e "$lib/libtwrt.so"
readelf -d "$lib/libtwanlys.so.0" | grep -q 'SONAME.*libtwanlys.so.0'
test -x "$prefix/bin/twa" && "$prefix/bin/twa" window hann 4 >/dev/null

# pkg-config, a plain compiler line.
export PKG_CONFIG_PATH=$lib/pkgconfig
g++ -std=c++20 "$src/tests/install/consumer/main.cpp" $(pkg-config --cflags --libs twanlys) \
    -Wl,-rpath,"$lib" -o "$work/by-pkg-config"
"$work/by-pkg-config"

# find_package, a CMake project of its own.
cmake -S "$src/tests/install/consumer" -B "$work/consumer" -DCMAKE_PREFIX_PATH="$prefix" >/dev/null
cmake --build "$work/consumer" >/dev/null
"$work/consumer/consumer"
echo "install: pkg-config and find_package consumers run against $prefix"
