#!/usr/bin/env bash
# A Windows program on the library's DLL against the local server running natively: the example
# publish_and_run, under Wine, signs in, uploads a workspace as a repository item, runs it as a job
# and downloads the job's log, all over loopback. The workspace and the log cross the platforms
# byte for byte.
#
#   roundtrip.sh ZELSERVERD WORKSPACE RUNNER... PROGRAM
#
# RUNNER is the command that runs a Windows program here (wine with its prefix).
set -euo pipefail

server="$1" workspace="$2"
shift 2
runner=("$@")

if [ ! -x "$server" ]; then
  echo "no native zelserverd at $server: build the Linux preset 'default' first" >&2
  exit 1
fi

work="$(mktemp -d /tmp/zel-cross-XXXXXX)"
# shellcheck source=../../scripts/lib/zelserverd.sh
source "$(dirname "$0")/../../scripts/lib/zelserverd.sh"
cleanup() {
  stop_zelserverd
  rm -rf "$work"
}
trap cleanup EXIT

printf '[user ann]\npassword = pw-ann\nroles = admin\n' > "$work/zelserverd.conf"
start_zelserverd "$server" "$work"

cp "$workspace" "$work/greeting.zlw"
windows_path() { winepath -w "$1" 2>/dev/null; }
output="$("${runner[@]}" 127.0.0.1 "$port" ann pw-ann crossing "$(windows_path "$work/greeting.zlw")" \
  "$(windows_path "$work/job.log")" NAME=Wine LANGUAGE=norwegian 2>&1)" || {
  echo "publish_and_run failed:"; echo "$output"; echo "server log:"; cat "$work/server.log"; exit 1; } >&2
echo "$output"

fail() { echo "FAILED: $*" >&2; exit 1; }
expected="added repository crossing
added item greeting.zlw
submitted job 1
job 1 succeeded: 0 Translation was successful
log of job 1 written to $(windows_path "$work/job.log")"
[ "$(printf '%s' "$output" | tr -d '\r')" = "$expected" ] || fail "unexpected output; wanted:
$expected"
grep -qx 'Hei, Wine! (job 1, run by ann)' "$work/job.log" || fail "the log lacks the job's greeting"
# The server keeps the item's bytes exactly as the Windows side sent them.
stored=no
for file in "$work"/data/store/*; do
  cmp -s "$file" "$work/greeting.zlw" && stored=yes
done
[ "$stored" = yes ] || fail "the server holds no item equal to the upload"
[ "$(wc -l < "$work/job.log")" -ge 3 ] || fail "the log is shorter than the server wrote it"
cmp -s "$work/job.log" "$work/data/jobs/1/job.log" || fail "the downloaded log differs from the server's"
echo "round trip passed"
