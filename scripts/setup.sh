#!/usr/bin/env bash
# Installs what the builds and tests need on Debian 12. It installs only what
# is missing, and only as root; run by anyone else it lists what it would
# install and stops.
set -euo pipefail

packages=(
  cmake ninja-build g++ pkg-config
  sqlite3 libgtest-dev googletest
  libcli11-dev nlohmann-json3-dev
  g++-mingw-w64-x86-64-posix binutils-mingw-w64-x86-64
  g++-mingw-w64-i686-posix binutils-mingw-w64-i686
  wine wine64
  clang libclang-rt-14-dev
)
# The x86 DLL's tests need the 32-bit Wine, which only a machine that runs
# 32-bit programs can use (scripts/test.sh says so where it cannot).
packages+=(wine32:i386)
# The HTML report's test opens the page in a real browser, and the log's
# timestamp test needs a locale beside C: both are optional and installed in
# steps of their own below, so their failure never fails the setup.
optional=(chromium locales)

installed() { dpkg-query -W -f='${Status}' "$1" 2>/dev/null | grep -q "install ok installed"; }

missing=()
for p in "${packages[@]}"; do installed "$p" || missing+=("$p"); done
# npm fetches the pinned SQLite package. Machines that carry Node.js from
# another source than Debian's (whose nodejs conflicts with Debian's npm)
# already have an npm of their own, so only the command is looked for.
command -v npm >/dev/null || missing+=(npm)
optional_missing=()
for p in "${optional[@]}"; do installed "$p" || optional_missing+=("$p"); done

if ((EUID != 0)); then
  if ((${#missing[@]} + ${#optional_missing[@]})); then
    echo "setup: not run as root, so nothing is installed." >&2
    echo "setup: as root it would run: dpkg --add-architecture i386; apt-get update;" \
      "apt-get install ${missing[*]} ${optional_missing[*]}" >&2
    ((${#missing[@]} == 0)) || exit 1
  fi
  exit 0
fi

export DEBIAN_FRONTEND=noninteractive
updated=0
update() { ((updated)) || { apt-get update -q; updated=1; }; }
if ((${#missing[@]})); then
  echo "setup: installing ${missing[*]}"
  dpkg --print-foreign-architectures | grep -qx i386 || dpkg --add-architecture i386
  update
  apt-get install -y -q --no-install-recommends "${missing[@]}"
fi
for p in "${optional_missing[@]}"; do
  echo "setup: installing $p (optional)"
  update
  apt-get install -y -q --no-install-recommends "$p" ||
    echo "setup: could not install $p; the tests that need it say that they skip"
done
"$(dirname "$0")/setup-locale.sh" ||
  echo "setup: could not make the de_DE.UTF-8 locale; the log's timestamp test says that it skips"
