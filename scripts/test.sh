#!/usr/bin/env bash
# Installs what is missing, then builds and runs the whole suite in three builds: a normal one, one
# under AddressSanitizer and UndefinedBehaviorSanitizer, and zelserverapi.dll for 64-bit Windows
# with its suite under Wine; and the suites that run sessions and connections in parallel under
# ThreadSanitizer (preset tsan, which builds only those). After the normal build's suite the
# README's demo tour runs too, so that it is checked on every run.
#
# The output is kept short: builds print only what the compiler says, and each suite prints its
# failures with their output, a count every hundred tests and ctest's closing summary
# ("100% tests passed, 0 tests failed out of N"), the line by which CI judges a run.
#
#   test.sh [PRESET...]     default, asan, tsan, windows (all four when none is named)
set -euo pipefail
cd "$(dirname "$0")/.."

presets=("$@")
[ ${#presets[@]} -gt 0 ] || presets=(default asan tsan windows)

if [[ " ${presets[*]} " == *" windows "* ]]; then
  bash scripts/install-deps.sh windows
else
  bash scripts/install-deps.sh
fi

build() { cmake --build --preset "$1" "${@:2}" -- --quiet; }

# Passed tests become a running count; everything else (failures, their output, the summary) stays,
# with ctest's padding of dots squeezed. With pipefail the pipeline fails when ctest does.
run_tests() {
  ctest --preset "$1" 2>&1 | awk '
    / Start +[0-9]+: / { next }
    /^ *[0-9]+\/[0-9]+ Test +#[0-9]+: .* Passed +[0-9.]+ sec$/ {
      if (++passed % 100 == 0) { split($1, n, "/"); printf "  %d of %d passed\n", passed, n[2]; fflush() }
      next
    }
    { gsub(/ \.\.\.\.+/, " ..."); print; fflush() }'
}

run_windows() {
  bash scripts/build-xerces-windows.sh
  # The cross-platform test runs the Windows example against the Linux server.
  if [ ! -x build/default/bin/zelserverd ]; then
    cmake --preset default >/dev/null
    build default --target zelserverd
  fi
  cmake --preset windows >/dev/null
  build windows
  bash scripts/wine-prefix.sh "$PWD/build/windows/wineprefix"
  local status=0
  run_tests windows || status=$?
  WINEPREFIX="$PWD/build/windows/wineprefix" wineserver -k 2>/dev/null || true
  return $status
}

bash scripts/check-format.sh

for preset in "${presets[@]}"; do
  echo "== preset $preset"
  if [ "$preset" = windows ]; then
    run_windows
    continue
  fi
  cmake --preset "$preset" >/dev/null
  build "$preset"
  run_tests "$preset"
  if [ "$preset" = default ]; then
    echo "== demo tour"
    bash scripts/demo.sh > build/demo.log 2>&1 || { cat build/demo.log; echo "the demo tour failed"; exit 1; }
    echo "demo tour passed (output in build/demo.log)"
  fi
done
