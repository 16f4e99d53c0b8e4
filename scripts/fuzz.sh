#!/usr/bin/env bash
# Builds the libFuzzer targets with clang into build-fuzz/ (clang is installed through apt-get
# when missing), replays every input in fuzz/regressions/<target>/, then runs each target for
# SECONDS (default 30) on its corpus in fuzz/corpus/<target>/, as many at once as there are
# processors. New inputs go to build-fuzz/new/<target>/, failing ones to build-fuzz/artifacts/.
# Everything in that tree is built with AddressSanitizer + UndefinedBehaviorSanitizer; with
# --tests the whole test suite is built and run there first (one sanitizer build for both).
#
#   scripts/fuzz.sh [--tests] [SECONDS [TARGET...]]
set -euo pipefail
cd "$(dirname "$0")/.."
tests=OFF
if [ "${1:-}" = "--tests" ]; then
  tests=ON
  shift
fi
seconds=${1:-30}
shift || true
all=(info_file_fuzz level_data_fuzz command_line_fuzz session_run_fuzz wave_fuzz)
targets=("${@:-${all[@]}}")

probe=$(mktemp -d)
trap 'rm -rf "$probe"' EXIT
fuzzer_links() {
  echo 'extern "C" int LLVMFuzzerTestOneInput(const unsigned char*, unsigned long) { return 0; }' \
      >"$probe/probe.cpp"
  command -v clang++ >/dev/null 2>&1 &&
      clang++ -fsanitize=fuzzer,address,undefined "$probe/probe.cpp" -o "$probe/probe" 2>/dev/null
}
if ! fuzzer_links; then
  sudo=""
  [ "$(id -u)" -ne 0 ] && sudo="sudo"
  $sudo apt-get update -qq
  DEBIAN_FRONTEND=noninteractive $sudo apt-get install -y -qq clang
  # libFuzzer's runtime is only recommended by clang's packages.
  major=$(clang++ -dumpversion | cut -d. -f1)
  fuzzer_links || DEBIAN_FRONTEND=noninteractive $sudo apt-get install -y -qq "libclang-rt-$major-dev"
fi

./scripts/deps.sh
CC=clang CXX=clang++ cmake -S . -B build-fuzz -DCMAKE_BUILD_TYPE=RelWithDebInfo \
    -DORV_BUILD_FUZZERS=ON -DORV_BUILD_TESTS=$tests -DORV_BUILD_BENCHMARKS=OFF >/dev/null
if [ "$tests" = ON ]; then
  cmake --build build-fuzz -j"$(nproc)" >build-fuzz/build.log 2>&1 ||
      { grep -B2 -A8 'error' build-fuzz/build.log | head -80; exit 1; }
  ASAN_OPTIONS=detect_leaks=1:abort_on_error=1 UBSAN_OPTIONS=print_stacktrace=1:halt_on_error=1 \
    ctest --test-dir build-fuzz -j"$(nproc)" --output-on-failure
fi
cmake --build build-fuzz -j"$(nproc)" --target "${targets[@]}" >build-fuzz/build.log 2>&1 ||
    { grep -B2 -A8 'error' build-fuzz/build.log | head -80; exit 1; }

# Every input that once made a target fail must pass now.
for t in "${targets[@]}"; do
  shopt -s nullglob
  inputs=(fuzz/regressions/"$t"/*)
  shopt -u nullglob
  if [ ${#inputs[@]} -gt 0 ]; then
    echo "Replaying ${#inputs[@]} regression input(s) of $t"
    "build-fuzz/fuzz/$t" "${inputs[@]/#/$PWD/}" >"build-fuzz/$t.replay.log" 2>&1 ||
        { tail -40 "build-fuzz/$t.replay.log"; exit 1; }
  fi
done

mkdir -p build-fuzz/artifacts
run() {
  # Absolute paths: a target may change its working directory.
  local t=$1 here=$PWD
  rm -rf "build-fuzz/new/$t"
  mkdir -p "build-fuzz/new/$t"
  if "build-fuzz/fuzz/$t" -max_total_time="$seconds" -timeout=20 -print_final_stats=1 \
        -artifact_prefix="$here/build-fuzz/artifacts/$t-" \
        "$here/build-fuzz/new/$t" "$here/fuzz/corpus/$t" >"build-fuzz/$t.log" 2>&1; then
    echo "$t: $(grep -o 'stat::number_of_executed_units: [0-9]*' "build-fuzz/$t.log" |
        grep -o '[0-9]*$') runs in ${seconds} s, no finding"
  else
    echo "$t FAILED:"
    tail -60 "build-fuzz/$t.log"
    return 1
  fi
}
status=0
for t in "${targets[@]}"; do
  run "$t" &
  if [ "$(jobs -rp | wc -l)" -ge "$(nproc)" ]; then wait -n || status=1; fi
done
while [ "$(jobs -rp | wc -l)" -gt 0 ]; do wait -n || status=1; done
exit $status
