# Starting and stopping a throw-away zelserverd from a shell script; sourced, not run.
#
#   start_zelserverd SERVER WORK     runs SERVER with data in WORK/data and the configuration
#                                    WORK/zelserverd.conf on a free loopback port; sets server_pid
#                                    and port, or reports the server's log and returns 1
#   stop_zelserverd                  ends it, if it runs

server_pid=""
port=""

start_zelserverd() {
  local server="$1" work="$2" line=""
  "$server" --data "$work/data" --listen 127.0.0.1:0 --config "$work/zelserverd.conf" \
    > "$work/stdout" 2> "$work/server.log" &
  server_pid=$!
  # The server prints one line once it accepts connections; with port 0 that line names the port.
  for _ in $(seq 150); do
    line="$(head -n 1 "$work/stdout")"
    [ -n "$line" ] && break
    kill -0 "$server_pid" 2>/dev/null || break
    sleep 0.1
  done
  case "$line" in
    "listening on 127.0.0.1:"*) port="${line##*:}" ;;
    *) echo "zelserverd did not start:" >&2; cat "$work/server.log" >&2; return 1 ;;
  esac
}

stop_zelserverd() {
  if [ -n "$server_pid" ] && kill -0 "$server_pid" 2>/dev/null; then
    kill -TERM "$server_pid" 2>/dev/null || true
    wait "$server_pid" 2>/dev/null || true
  fi
}
