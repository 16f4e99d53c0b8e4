#!/usr/bin/env bash
# Speed of the level library side by side with a scipy reference, on one thread and the same
# 60 s of noise, in one run: slm_bench (36 and 12 bands, A, F, statistics) as built for this
# processor, the same benchmark built with the generic kernels only (-DORV_GENERIC_KERNELS,
# what a processor without AVX2 runs), and 36 butter(3) band-passes through scipy's sosfilt
# (bench/scipy_reference.py). Installs python3-scipy with apt-get when it is missing.
set -euo pipefail
cd "$(dirname "$0")/.."
./scripts/deps.sh
python=/usr/bin/python3
if ! "$python" -c "import scipy.signal" >/dev/null 2>&1; then
  sudo=""
  [ "$(id -u)" -ne 0 ] && sudo="sudo"
  $sudo apt-get update -qq
  DEBIAN_FRONTEND=noninteractive $sudo apt-get install -y -qq python3-scipy
fi
cmake -S . -B build -DCMAKE_BUILD_TYPE=Release >/dev/null
cmake --build build -j"$(nproc)" --target slm_bench
cmake -S . -B build-generic -DCMAKE_BUILD_TYPE=Release -DORV_BUILD_TESTS=OFF \
      -DCMAKE_CXX_FLAGS=-DORV_GENERIC_KERNELS >/dev/null
cmake --build build-generic -j"$(nproc)" --target slm_bench
out=$(mktemp -d)
trap 'rm -rf "$out"' EXIT
# Taskset keeps each process on one core when the tool is there.
pin=""
command -v taskset >/dev/null 2>&1 && pin="taskset -c 0"
$pin ./build/bench/slm_bench --benchmark_format=json >"$out/ours.json"
$pin ./build-generic/bench/slm_bench --benchmark_format=json >"$out/generic.json"
# Google Benchmark reports per CPU second of the thread, as the reference does.
$pin "$python" bench/scipy_reference.py "$out/ours.json" "$out/generic.json"
