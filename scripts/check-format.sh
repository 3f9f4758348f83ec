#!/usr/bin/env bash
# Fails when a C++ file differs from what .clang-format makes of it, and names the files.
#   check-format.sh          check every tracked C++ file
#   check-format.sh --fix    rewrite them in place
set -euo pipefail
cd "$(dirname "$0")/.."
format=clang-format-16
mapfile -t files < <(git ls-files '*.cpp' '*.h' '*.hpp')
if [ "${1:-}" = --fix ]; then
  "$format" -i "${files[@]}"
  exit 0
fi
report=$(mktemp)
trap 'rm -f "$report"' EXIT
"$format" --dry-run --Werror "${files[@]}" 2>"$report" || {
  grep -o '^[^:]*:[0-9]*:[0-9]*: error' "$report" | cut -d: -f1 | sort -u | sed 's/^/unformatted: /'
  echo "run: bash scripts/check-format.sh --fix"
  exit 1
}
echo "format check passed (${#files[@]} files)"
