#!/usr/bin/env bash
# Builds everything (warnings are errors) and runs the whole test suite, with Debian's
# chromium installed when missing for the test that renders the demo report.
set -euo pipefail
cd "$(dirname "$0")/.."
export ORV_WITH_CHROMIUM=1
./scripts/build.sh -DORV_WARNINGS_AS_ERRORS=ON
ctest --test-dir build -j"$(nproc)" --output-on-failure
