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
# Python: the installed package finds the library in its own prefix; a pip-installed copy finds it
# through TWANLYS_PREFIX and through the loader's search path (the soname).
unset TWANLYS_LIB_DIR TWANLYS_PREFIX
probe='import numpy as np, twanlys as tw
x = tw.array(np.array([3.0, 1, 2, 4])); m, s = tw.f64(), tw.i32()
tw.lib.Median_head(x, m.ref, s.ref); assert (m.value, s.value) == (2.5, 0), (m.value, s.value)'
(cd "$work" && PYTHONPATH="$lib/python3/dist-packages" /usr/bin/python3 -c "$probe")
/usr/bin/python3 -m venv --system-site-packages "$work/venv"
cp -r "$src/python" "$work/python"  # pip builds in the tree it is given
"$work/venv/bin/pip" install -q --no-build-isolation --no-index "$work/python" >/dev/null
(cd "$work" && TWANLYS_PREFIX="$prefix" "$work/venv/bin/python" -c "$probe")
(cd "$work" && LD_LIBRARY_PATH="$lib" "$work/venv/bin/python" -c "$probe")
echo "install: pkg-config, find_package and Python consumers run against $prefix"
