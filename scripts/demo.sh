#!/usr/bin/env bash
# Builds the tool and runs it on a search path in a temporary directory.
set -euo pipefail
cd "$(dirname "$0")/.."
./scripts/build.sh
work=$(mktemp -d)
mkdir -p "$work/sessions"
./build/orv_cmd -s "$work/sessions" -d "$work/results"
echo "Results (none yet for an empty search path): $work/results"
