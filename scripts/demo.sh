#!/usr/bin/env bash
# Builds the tools, writes the demo session (a few minutes of a synthetic roadside,
# crossing an hour) and runs orv_cmd on it: 1-minute statistics, 1-second Leqs, third-octave
# bands, a band-pass channel and the hourly raw levels from the audio; then writes the
# HTML report of the results.
set -euo pipefail
cd "$(dirname "$0")/.."
./scripts/build.sh
rm -rf demo
mkdir -p demo
(cd demo && ../build/orv_demo)
./build/orv_cmd -s demo/demo-session -d demo/results -leq 1 -i 1 -oct 3 Z F -bpf 500 2000 A F -csv
echo
echo "Results in demo/results:"
ls -C demo/results
# The HTML report of the results; its last line is the path of the report.
echo
./build/orv_report demo/results
