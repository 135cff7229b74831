#!/usr/bin/env bash
# Builds the release and runs the main job: registers the library and runs the
# smoke job through its in-process server entry points.
set -euo pipefail
cd "$(dirname "$0")/.."
bash scripts/deps.sh
cmake --preset release >/dev/null
cmake --build --preset release -j "$(nproc)" --target pelta
./build/release/bin/pelta smoke
