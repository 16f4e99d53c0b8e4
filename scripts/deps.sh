#!/usr/bin/env bash
# Installs the build tools and libraries that are missing (Debian/Ubuntu, through apt-get);
# with ORV_WITH_CHROMIUM=1 also Debian's chromium, for the rendering test of the report.
set -euo pipefail

need=()
command -v cmake >/dev/null 2>&1 || need+=(cmake)
command -v g++ >/dev/null 2>&1 || need+=(g++)
command -v make >/dev/null 2>&1 || need+=(make)
dpkg -s libgtest-dev >/dev/null 2>&1 || need+=(libgtest-dev)
dpkg -s libbenchmark-dev >/dev/null 2>&1 || need+=(libbenchmark-dev)
dpkg -s zlib1g-dev >/dev/null 2>&1 || need+=(zlib1g-dev)
# The test of the report renders the demo report in headless Chromium: only the test script
# asks for it (ORV_WITH_CHROMIUM=1), the build and the demo do not need it.
if [ "${ORV_WITH_CHROMIUM:-0}" = 1 ] && ! command -v chromium >/dev/null 2>&1; then
  need+=(chromium)
fi

if [ ${#need[@]} -gt 0 ]; then
  echo "Installing: ${need[*]}"
  sudo=""
  [ "$(id -u)" -ne 0 ] && sudo="sudo"
  $sudo apt-get update -qq
  DEBIAN_FRONTEND=noninteractive $sudo apt-get install -y -qq "${need[@]}"
fi
