#!/usr/bin/env bash
# Installs the Debian 12 packages that building and testing need, when any is missing.
#   install-deps.sh            what the Linux builds need
#   install-deps.sh windows    that, and the MinGW-w64 cross compilers, Wine, and what building
#                              GoogleTest and Xerces-C from source for Windows takes
set -euo pipefail

packages=(
  g++ cmake ninja-build pkg-config binutils clang-format-16
  libxerces-c-dev zlib1g-dev
  libgtest-dev libgmock-dev libbenchmark-dev
  libpugixml-dev libsqlite3-dev libcrypt-dev
  libcli11-dev nlohmann-json3-dev
  clang-16 libclang-rt-16-dev
)
if [ "${1:-}" = windows ]; then
  packages+=(
    g++-mingw-w64-x86-64-posix gcc-mingw-w64-x86-64-posix binutils-mingw-w64-x86-64
    mingw-w64-x86-64-dev libz-mingw-w64-dev wine wine64 googletest dpkg-dev
  )
fi

missing=()
for p in "${packages[@]}"; do
  dpkg-query -W -f='${Status}' "$p" 2>/dev/null | grep -q "install ok installed" || missing+=("$p")
done

if [ ${#missing[@]} -gt 0 ]; then
  echo "installing: ${missing[*]}"
  sudo=""
  [ "$(id -u)" -eq 0 ] || sudo="sudo"
  export DEBIAN_FRONTEND=noninteractive
  $sudo apt-get update -qq
  $sudo apt-get install -y -qq --no-install-recommends "${missing[@]}"
fi
