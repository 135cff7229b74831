#!/usr/bin/env bash
# Builds the release and the front end, and starts the shell on the demo
# database: the library's screens at the address it prints
# (http://127.0.0.1:8080/ unless told otherwise).  Extra arguments go to
# `pelta serve` (--db FILE, --address A, --port P).
set -euo pipefail
cd "$(dirname "$0")/.."
bash scripts/deps.sh browser
cmake --preset release >/dev/null
cmake --build --preset release -j 2 --target pelta
bash scripts/web.sh
exec ./build/release/bin/pelta serve "$@"
