#!/usr/bin/env bash
# Installs the build tree into a temporary prefix and runs the README's snippets against the
# installed tree only: the C++ example through pkg-config and through find_package, the Python
# example from the installed package, from a pip-installed copy (TWANLYS_PREFIX) and through the
# loader's search path.
#   check.sh <source dir> <build dir>
set -euo pipefail
src=$1 build=$2
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
block() { "$src/tests/install/readme_block.py" "$src/README.md" "$@"; }
prefix=$work/prefix
cmake --install "$build" --prefix "$prefix" >/dev/null
lib=$(ls -d "$prefix"/lib*/ | head -1)
test -L "$lib/libtwanlys.so" && test -e "$lib/libtwanlys.so.0" && test -e "$lib/libtwrt.so"
readelf -d "$lib/libtwanlys.so.0" | grep -q 'SONAME.*libtwanlys.so.0'
"$prefix/bin/twa" window hann 4 >/dev/null

mkdir "$work/example"
block "Calling an export from C++" cpp >"$work/example/example.cpp"
expected="median 2.5, status 0"

export PKG_CONFIG_PATH=$lib/pkgconfig
g++ -std=c++20 "$work/example/example.cpp" $(pkg-config --cflags --libs twanlys) -Wl,-rpath,"$lib" \
    -o "$work/by-pkg-config"
test "$("$work/by-pkg-config")" = "$expected"

{ echo "cmake_minimum_required(VERSION 3.22)"; echo "project(example CXX)"; echo "set(CMAKE_CXX_STANDARD 20)"
  block "Use from CMake" cmake; } >"$work/example/CMakeLists.txt"
cmake -S "$work/example" -B "$work/example/build" -DCMAKE_PREFIX_PATH="$prefix" >/dev/null
cmake --build "$work/example/build" >/dev/null
test "$("$work/example/build/example")" = "$expected"

unset TWANLYS_LIB_DIR TWANLYS_PREFIX
block "Use from Python" python >"$work/example.py"
python_expected=$(printf '2.5\nTrue')
cd "$work"
test "$(PYTHONPATH="$lib/python3/dist-packages" /usr/bin/python3 example.py)" = "$python_expected"
/usr/bin/python3 -m venv --system-site-packages "$work/venv"
cp -r "$src/python" "$work/python"  # pip builds in the tree it is given
"$work/venv/bin/pip" install -q --no-build-isolation --no-index "$work/python" >/dev/null
test "$(TWANLYS_PREFIX="$prefix" "$work/venv/bin/python" example.py)" = "$python_expected"
test "$(LD_LIBRARY_PATH="$lib" "$work/venv/bin/python" example.py)" = "$python_expected"
echo "install: the README's C++ (pkg-config, find_package) and Python examples run against $prefix"
