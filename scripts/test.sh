#!/usr/bin/env bash
# Builds everything (warnings are errors) and runs the whole test suite.
set -euo pipefail
cd "$(dirname "$0")/.."
./scripts/build.sh -DORV_WARNINGS_AS_ERRORS=ON
ctest --test-dir build -j"$(nproc)" --output-on-failure
