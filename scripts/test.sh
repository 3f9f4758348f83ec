#!/usr/bin/env bash
# Installs what is missing, then builds and runs the whole suite twice: a normal build and one under
# AddressSanitizer and UndefinedBehaviorSanitizer. After the normal build's suite the README's demo
# tour runs too, so that it is checked on every run.
set -euo pipefail
cd "$(dirname "$0")/.."

bash scripts/install-deps.sh

presets=("$@")
[ ${#presets[@]} -gt 0 ] || presets=(default asan)

for preset in "${presets[@]}"; do
  echo "== preset $preset"
  cmake --preset "$preset" >/dev/null
  cmake --build --preset "$preset"
  ctest --preset "$preset"
  if [ "$preset" = default ]; then
    echo "== demo tour"
    bash scripts/demo.sh > build/demo.log 2>&1 || { cat build/demo.log; echo "the demo tour failed"; exit 1; }
    echo "demo tour passed (output in build/demo.log)"
  fi
done
