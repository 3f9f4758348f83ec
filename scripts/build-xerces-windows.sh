#!/usr/bin/env bash
# Builds a static Xerces-C for 64-bit Windows from Debian's own source package, with the posix-thread
# MinGW-w64 compilers, into build/windows-deps/xerces (or the folder given as $1). Debian ships no
# Windows build of Xerces-C; its sources build unchanged with MinGW-w64. The result is cached: a
# finished install is kept and the script returns at once.
#
# The parser is configured as the library needs it on Windows: the Windows transcoder (UTF-16 wide
# characters, no ICU), messages compiled into the library (no catalogue files to ship), the Windows
# mutex manager, and no network accessor (the library never fetches anything through the parser).
set -euo pipefail
cd "$(dirname "$0")/.."

root="${1:-$PWD/build/windows-deps}"
prefix="$root/xerces"
stamp="$prefix/.built"
[ -f "$stamp" ] && { echo "Xerces-C for Windows: cached in $prefix"; exit 0; }

sudo=""
[ "$(id -u)" -eq 0 ] || sudo="sudo"

# apt-get source needs a deb-src entry. A machine without one gets a copy of its own Debian entry
# with the type changed, so no host name is written down here.
have_deb_src() {
  grep -rqsE '^(Types:.*deb-src|deb-src )' /etc/apt/sources.list /etc/apt/sources.list.d/
}
if ! have_deb_src; then
  source_entry=""
  for f in /etc/apt/sources.list.d/debian.sources /etc/apt/sources.list.d/*.sources; do
    [ -f "$f" ] && grep -q '^Types:.*deb' "$f" && { source_entry="$f"; break; }
  done
  target=/etc/apt/sources.list.d/zel-deb-src
  if [ -n "$source_entry" ]; then
    sed -E 's/^Types:.*/Types: deb-src/' "$source_entry" | $sudo tee "$target.sources" >/dev/null
  elif [ -f /etc/apt/sources.list ]; then
    sed -nE 's/^deb (.*)/deb-src \1/p' /etc/apt/sources.list | $sudo tee "$target.list" >/dev/null
  else
    echo "no Debian package source entry to copy for deb-src" >&2
    exit 1
  fi
  $sudo apt-get update -qq
fi

work="$root/xerces-work"
rm -rf "$work"
mkdir -p "$work"
(cd "$work" && apt-get source -qq xerces-c >/dev/null)
source_dir="$(find "$work" -maxdepth 1 -mindepth 1 -type d -name 'xerces-c-*' | head -n1)"
[ -n "$source_dir" ] || { echo "apt-get source xerces-c gave no source tree" >&2; exit 1; }

cmake -S "$source_dir" -B "$work/build" -G Ninja \
  -DCMAKE_SYSTEM_NAME=Windows \
  -DCMAKE_C_COMPILER=x86_64-w64-mingw32-gcc-posix \
  -DCMAKE_CXX_COMPILER=x86_64-w64-mingw32-g++-posix \
  -DCMAKE_RC_COMPILER=x86_64-w64-mingw32-windres \
  -DCMAKE_FIND_ROOT_PATH=/usr/x86_64-w64-mingw32 \
  -DCMAKE_FIND_ROOT_PATH_MODE_PROGRAM=NEVER \
  -DCMAKE_FIND_ROOT_PATH_MODE_LIBRARY=ONLY \
  -DCMAKE_FIND_ROOT_PATH_MODE_INCLUDE=ONLY \
  -DCMAKE_BUILD_TYPE=Release \
  -DCMAKE_INSTALL_PREFIX="$prefix" \
  -DBUILD_SHARED_LIBS=OFF \
  -Dtranscoder=windows \
  -Dmessage-loader=inmemory \
  -Dmutex-manager=windows \
  -Dnetwork=OFF \
  >/dev/null
cmake --build "$work/build" --target xerces-c > "$root/xerces-build.log" 2>&1 || { tail -n 40 "$root/xerces-build.log"; exit 1; }
# Only the library was built, so only its folder is installed (the top level would want the samples
# and the documentation too).
cmake --install "$work/build/src" >/dev/null
rm -rf "$work"
touch "$stamp"
echo "Xerces-C for Windows: built into $prefix"
