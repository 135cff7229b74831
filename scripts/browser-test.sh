#!/usr/bin/env bash
# Builds the shell's front end and drives the shell in Debian's Chromium,
# headless (tests/browser).  usage: scripts/browser-test.sh [debug|release]
set -euo pipefail
cd "$(dirname "$0")/.."
preset="${1:-debug}"
bash scripts/deps.sh browser
cmake --preset "$preset" >/dev/null
cmake --build --preset "$preset" -j 2 --target pelta shell_fixture_server
bash scripts/web.sh
(cd tests/browser && npm ci --no-audit --no-fund --loglevel=error)
PELTA_BUILD_DIR="$PWD/build/$preset" PELTA_WEB_DIR="$PWD/shell/web/dist" \
  node --test --test-concurrency=1 tests/browser/shell.test.mjs
