#!/usr/bin/env bash
# Builds and runs every test: the C++ tests through ctest, then (in the debug
# build) the shell driven in Debian's Chromium, headless.
#   usage: scripts/test.sh [debug|asan]
set -euo pipefail
cd "$(dirname "$0")/.."
preset="${1:-debug}"
bash scripts/deps.sh
cmake --preset "$preset" >/dev/null
cmake --build --preset "$preset" -j "$(nproc)"
ctest --preset "$preset" -j "$(nproc)"
if [[ "$preset" == debug ]]; then
  bash scripts/browser-test.sh debug
fi
