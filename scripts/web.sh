#!/usr/bin/env bash
# Builds the shell's front end into shell/web/dist, which `pelta serve` serves.
set -euo pipefail
cd "$(dirname "$0")/../shell/web"
npm ci --no-audit --no-fund --loglevel=error
npm run build --silent
