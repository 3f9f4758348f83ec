#!/usr/bin/env bash
# A short tour of zelserverapi: installs what is missing, builds the two programs it uses, starts the
# local development server zelserverd on a free loopback port with a throw-away data directory, and
# walks through the library's areas with the command-line client zelctl, which finds the server and
# the user in the environment. Everything it starts or writes is gone when it ends.
set -euo pipefail

root="$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)"
bin="$root/build/default/bin"

step() { printf '\n== %s\n' "$*"; }
show() { printf '$ zelctl'; printf ' %q' "$@"; printf '\n'; zelctl "$@"; }
zelctl() { "$bin/zelctl" "$@"; }

step "Installing missing packages"
bash "$root/scripts/install-deps.sh"

step "Building zelserverd and zelctl (preset default)"
# Presets are read from the working directory.
cd "$root"
cmake --preset default > /dev/null
cmake --build --preset default --target zelserverd zelctl

work="$(mktemp -d /tmp/zel-demo-XXXXXX)"
# shellcheck source=lib/zelserverd.sh
source "$root/scripts/lib/zelserverd.sh"
cleanup() {
  stop_zelserverd
  rm -rf "$work"
}
trap cleanup EXIT

step "Starting zelserverd"
# A user of our own with a fresh random password; the file keeps it readable by us only.
ZEL_PASSWORD="$(od -An -N16 -tx1 /dev/urandom | tr -d ' \n')"
export ZEL_PASSWORD
umask 077
mkdir -p "$work/shared"
cat > "$work/zelserverd.conf" <<CONF
[user demo]
password = $ZEL_PASSWORD
roles = admin

[sharedresource DATA]
path = shared
description = Files for the demo
CONF
start_zelserverd "$bin/zelserverd" "$work"
line="$(head -n 1 "$work/stdout")"
echo "$line (data in $work/data, user demo with a random password)"
export ZEL_HOST=127.0.0.1 ZEL_PORT="$port" ZEL_USER=demo

step "Is it up? (ping needs no sign-in), and who am I?"
show ping
show whoami --json

step "Creating the repository 'demo' and uploading the example workspaces"
show repo create demo --description "Example workspaces"
for workspace in "$root"/examples/workspaces/*.zlw; do
  show item put demo "$workspace"
done
show item list demo

step "The published parameters of greeting.zlw"
show workspace show demo greeting.zlw

step "Registering greeting.zlw with a new service"
show service create greetings --description "Greets people"
show service register greetings demo greeting.zlw

step "Running a job and waiting for its result (job run: the ID comes first, on standard error)"
show job run zeljob demo greeting.zlw -p NAME=newcomer -p LANGUAGE=norwegian

step "Submitting a job (job submit), then waiting for it"
echo '$ zelctl job submit zeljob demo csvsummary.zlw -p COLUMN=population'
submitted="$(zelctl job submit zeljob demo csvsummary.zlw -p COLUMN=population)"
echo "$submitted"
job="$(printf '%s\n' "$submitted" | grep -oE '[0-9]+' | tail -n 1)"
show job wait "$job"

step "Its result and its log"
show job result "$job"
show job log "$job"

step "Putting a file into the shared resource DATA"
printf 'city,population\nOslo,709000\nBergen,291000\n' > "$work/cities.csv"
show sr put DATA "$work/cities.csv" /cities.csv
show sr ls DATA /
show sr get DATA /cities.csv -o "$work/cities-back.csv"
cmp "$work/cities.csv" "$work/cities-back.csv" && echo "downloaded copy is identical"

step "A user token for the account demo"
echo '$ zelctl token set demo --expires-after 3600   # the server makes the token'
token="$(zelctl token set demo --expires-after 3600)"
echo "$token"
show token show demo
show --token "$token" whoami

step "Stopping zelserverd"
kill -TERM "$server_pid"
wait "$server_pid" && echo "stopped cleanly"
server_pid=""
echo
echo "Done. Next: docs/zelctl.md, the example programs in examples/ (docs/examples.md) and docs/zelserverd.md."
