#!/usr/bin/env bash
# Runs one fuzz target for real: scripts/fuzz.sh TARGET SECONDS [libFuzzer options...]
# TARGET is a file name of fuzz/ without ".cpp" (wire, result_text, xml_objects, server_request).
# The target is built in the "fuzz" preset (clang, libFuzzer, AddressSanitizer and
# UndefinedBehaviorSanitizer) and fuzzed at low priority, one process, from the seeds in
# fuzz/corpus/TARGET. What it learns stays in build/fuzz/runs/TARGET/corpus; a crashing, leaking or
# hanging input lands in build/fuzz/runs/TARGET/findings. Once fixed, copy such an input into
# fuzz/corpus/TARGET so that every build replays it.
set -euo pipefail

root=$(cd "$(dirname "$0")/.." && pwd)
target=${1:?usage: scripts/fuzz.sh TARGET SECONDS [libFuzzer options...]}
seconds=${2:?usage: scripts/fuzz.sh TARGET SECONDS [libFuzzer options...]}
shift 2

cd "$root"
cmake --preset fuzz >/dev/null
cmake --build --preset fuzz --target "zel_fuzz_$target"

run=$root/build/fuzz/runs/$target
mkdir -p "$run/corpus" "$run/findings"
dict=()
[[ -f fuzz/$target.dict ]] && dict=("-dict=fuzz/$target.dict")
# A reply or request that keeps the parser busy for seconds is a finding too (-timeout).
exec nice -n 10 "build/fuzz/bin/zel_fuzz_$target" -max_total_time="$seconds" -timeout=10 \
  -max_len=65536 -print_final_stats=1 -artifact_prefix="$run/findings/" "${dict[@]}" "$@" \
  "$run/corpus" "fuzz/corpus/$target"
