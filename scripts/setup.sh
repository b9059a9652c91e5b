#!/usr/bin/env bash
# Installs what building and testing need, from Debian's packages. Does nothing when all is there.
set -euo pipefail
packages=(cmake ninja-build g++ libgtest-dev libbenchmark-dev libfftw3-dev pkg-config python3-numpy python3-scipy
          liblapack-dev libblas-dev libblis4-serial
          python3-venv python3-pip python3-setuptools libsndfile1-dev gnuplot-nox
          clang libclang-rt-14-dev)
missing=()
for p in "${packages[@]}"; do
  dpkg-query -W -f='${Status}' "$p" 2>/dev/null | grep -q "install ok installed" || missing+=("$p")
done
if [ ${#missing[@]} -gt 0 ]; then
  sudo=""; [ "$(id -u)" -ne 0 ] && sudo=sudo
  $sudo apt-get update -qq
  DEBIAN_FRONTEND=noninteractive $sudo apt-get install -y -qq "${missing[@]}" >/dev/null
fi
