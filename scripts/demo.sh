#!/usr/bin/env bash
# Builds the tools, writes the demo session (a few minutes of a synthetic roadside,
# crossing an hour) and runs orv_cmd on it with 1-minute statistics and 1-second Leqs.
set -euo pipefail
cd "$(dirname "$0")/.."
./scripts/build.sh
rm -rf demo
mkdir -p demo
(cd demo && ../build/orv_demo)
./build/orv_cmd -s demo/demo-session -d demo/results -leq 1 -i 1
echo
echo "Results in demo/results:"
ls -l demo/results
