#!/usr/bin/env bash
# Installs what the builds and tests need on Debian 12 (run as root; it skips
# apt-get when everything is already there).
set -euo pipefail

packages=(
  cmake ninja-build g++ pkg-config
  libsqlite3-dev sqlite3 libgtest-dev googletest
  libcli11-dev nlohmann-json3-dev
  g++-mingw-w64-x86-64-posix binutils-mingw-w64-x86-64
  g++-mingw-w64-i686-posix binutils-mingw-w64-i686
  wine wine64 wine32:i386
  clang libclang-rt-14-dev
)

missing=()
for p in "${packages[@]}"; do
  dpkg-query -W -f='${Status}' "$p" 2>/dev/null | grep -q "install ok installed" || missing+=("$p")
done
if ! command -v npm >/dev/null 2>&1; then missing+=(npm); fi

if ((${#missing[@]})); then
  echo "setup: installing ${missing[*]}"
  export DEBIAN_FRONTEND=noninteractive
  # The x86 DLL's tests need the 32-bit Wine.
  dpkg --print-foreign-architectures | grep -qx i386 || dpkg --add-architecture i386
  apt-get update -q
  apt-get install -y -q --no-install-recommends "${missing[@]}"
fi

# The HTML report's test reads the page back from a real browser. Optional:
# without it that one test skips, so a failure here does not fail the setup.
if ! command -v chromium >/dev/null 2>&1; then
  echo "setup: installing chromium (optional)"
  { apt-get update -q && DEBIAN_FRONTEND=noninteractive apt-get install -y -q --no-install-recommends chromium; } ||
    echo "setup: chromium could not be installed; the HTML report's browser test will skip"
fi
