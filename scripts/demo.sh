#!/usr/bin/env bash
# Builds the tools, writes the demo session (a few minutes of a synthetic roadside, crossing
# an hour), runs orv_cmd on it with 1-minute statistics, 1-second Leqs, third-octave bands and
# hourly raw level files from the audio, and writes the HTML report of the results.
set -euo pipefail
cd "$(dirname "$0")/.."
./scripts/build.sh
rm -rf demo
mkdir -p demo
(cd demo && ../build/orv_demo)
./build/orv_cmd -s demo/demo-session -d demo/results -leq 1 -i 1 -oct 3 A F -csv
echo
echo "Results in demo/results:"
ls -l demo/results
echo
./build/orv_report demo/results
