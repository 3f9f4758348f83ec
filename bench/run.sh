#!/usr/bin/env bash
# Builds the benchmark (preset default) and runs every figure: the library against a raw client on
# the same canned server, and zelserverd's own figures. Arguments go to the benchmark program:
#   bash bench/run.sh                    full sizes (1 GiB transfers, 10,000 entries; some minutes)
#   bash bench/run.sh --quick            tiny sizes, a few seconds
#   bash bench/run.sh --size-mib 256 --only upload,download
# The machine may be shared: the table records the load, and every figure is a median of runs
# that alternate between the library and the raw client.
set -euo pipefail
cd "$(dirname "$0")/.."
bash scripts/install-deps.sh
cmake --preset default >/dev/null
cmake --build --preset default --target zelbench zelserverd
mkdir -p build/default/bench-work
exec build/default/bin/zelbench --work "$PWD/build/default/bench-work/run-$$" "$@"
