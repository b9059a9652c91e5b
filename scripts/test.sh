#!/usr/bin/env bash
# Builds everything and runs all tests: the C++ suites (with and without the Analysis Workspace),
# the differential tests against NumPy/SciPy, and the sanitizer builds.
set -euo pipefail
cd "$(dirname "$0")/.."
scripts/setup.sh
cmake -S . -B build -G Ninja -DCMAKE_BUILD_TYPE=Release >/dev/null
cmake --build build -j 2
cd build && ctest --output-on-failure -j 2 "$@"
