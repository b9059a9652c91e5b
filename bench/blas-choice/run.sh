#!/usr/bin/env bash
# Usage: bench/blas-choice/run.sh [work dir [threads tasks n lo hi]]  (downloads the candidate BLAS packages with apt-get
# download, unpacks them into the work dir without installing, and runs the probe against each)
set -euo pipefail
here=$(cd "$(dirname "$0")" && pwd)
work=${1:-/tmp/twanlys-blas-choice}; shift || true
mkdir -p "$work" && cd "$work"
for p in libopenblas0-serial libopenblas0-pthread libblis4-serial; do
  ls ${p}_*.deb >/dev/null 2>&1 || apt-get download "$p" >/dev/null
done
for d in *.deb; do dpkg -x "$d" root; done
gcc -O2 -shared -fPIC -o libprobe_err.so "$here/xerbla.c"
g++ -O2 -std=c++20 -pthread -o probe "$here/probe.cpp" -L. -lprobe_err -llapack -lblas \
    -Wl,-rpath,"$work" -Wl,--no-as-needed
lib=root/usr/lib/x86_64-linux-gnu
declare -A dirs=([netlib]="" [openblas-serial]="$lib/openblas-serial"
                 [openblas-pthread]="$lib/openblas-pthread" [blis-serial]="$lib/blis-serial")
for name in netlib blis-serial openblas-serial openblas-pthread; do
  echo "== $name"
  LD_LIBRARY_PATH="${dirs[$name]:+$work/${dirs[$name]}}" ./probe "$@" 2>&1 | sed 's/^/   /'
done
