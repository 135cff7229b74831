#!/usr/bin/env bash
# Installs the Debian packages the project needs, when any is missing.
# Costs a moment when everything is already there.
set -euo pipefail

packages=(
  g++ cmake ninja-build ccache pkg-config git
  libicu-dev libsqlite3-dev libunwind-dev
  libgtest-dev libgmock-dev libbenchmark-dev
  libcpp-httplib-dev nlohmann-json3-dev
  libzint-dev
)
# Extra groups: "fuzz" adds clang with its sanitizer runtimes; "browser" adds
# Node.js with npm (for the shell's front end and its browser test) and the
# Chromium that the browser test drives headless.
for extra in "$@"; do
  case "$extra" in
    fuzz) packages+=(clang libclang-rt-14-dev) ;;
    browser)
      packages+=(chromium)
      # The machine's Node.js when it has one; Debian's otherwise.
      command -v npm >/dev/null || packages+=(nodejs npm)
      ;;
  esac
done

missing=()
for p in "${packages[@]}"; do
  if ! dpkg-query -W -f='${Status}' "$p" 2>/dev/null | grep -q "install ok installed"; then
    missing+=("$p")
  fi
done
if ((${#missing[@]})); then
  echo "Installing: ${missing[*]}"
  sudo_cmd=()
  if [[ $(id -u) -ne 0 ]]; then sudo_cmd=(sudo); fi
  "${sudo_cmd[@]}" apt-get update -qq
  DEBIAN_FRONTEND=noninteractive "${sudo_cmd[@]}" apt-get install -y -qq --no-install-recommends "${missing[@]}"
fi
