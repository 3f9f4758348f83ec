#!/usr/bin/env bash
# Starts a fresh Wine prefix for a run of the Windows tests: removes the old one, lets wineboot set up
# the new one, and writes the machine-wide registry values that the home directory lookups read. The
# Wine server is kept alive between test programs so that each of them starts quickly.
#
#   scripts/wine-prefix.sh PREFIX
#
# The test suite (tests/session) expects exactly these registry values.
set -euo pipefail

prefix="${1:?usage: wine-prefix.sh PREFIX}"
export WINEPREFIX="$prefix" WINEDEBUG=-all WINEDLLOVERRIDES="mscoree,mshtml="

wineserver -k 2>/dev/null || true
rm -rf "$prefix"
mkdir -p "$(dirname "$prefix")"
wineboot --init >/dev/null 2>&1
wineserver -w

product='HKLM\SOFTWARE\Corvane\Quorlith'
reg_add() { wine reg add "$@" /f >/dev/null 2>&1; }
reg_add "$product" /v ZEL_HOME /t REG_SZ /d 'C:\zel\product\'
reg_add "$product\\BUILD\\18286" /v ZEL_HOME /t REG_SZ /d 'C:\zel\build18286\'
# A value that is not text, and an expandable text: the lookup takes REG_SZ and REG_EXPAND_SZ only.
reg_add "$product\\Numbers" /v ZEL_HOME /t REG_DWORD /d 7
reg_add "$product\\Expandable" /v ZEL_HOME /t REG_EXPAND_SZ /d 'C:\zel\expandable\'
wineserver -w

# Ten minutes of grace after the last program ends covers the pauses between test programs.
wineserver -p 600
# The first program of a server session starts Wine's own services, which inherit its output and
# keep it open for as long as they run: started here, they hold /dev/null instead of the pipe a test
# run reads a program's output through.
wine cmd /c exit </dev/null >/dev/null 2>&1
echo "Wine prefix ready: $prefix"
