#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors
# The demo: a sample device's way through one day, from the message on the bus to what left it.
# run.sh BIN_DIR, in the project's folder; everything it makes lies in build/demo.
set -euo pipefail
[ $# -eq 1 ] || { echo "usage: $0 BIN_DIR" >&2; exit 2; }
bin=$1
demo=build/demo
device=$demo/device
submitted=$device/var/spool/morvend/submitted

if [ -t 1 ]; then bold=$'\e[1m' plain=$'\e[0m'; else bold='' plain=''; fi
step=0
chapter() { step=$((step + 1)); printf '\n%s== %d. %s%s\n' "$bold" $step "$1" "$plain"; }
say() { printf '%s\n' "$*"; }
fail() { echo "demo: $*" >&2; exit 1; }
for program in mkdevice pelloran morvend nandinfo morvend-demo; do
  [ -x "$bin/$program" ] || fail "$bin/$program is not built"
done
command -v dbus-daemon >/dev/null || fail "dbus-daemon is missing; ./dev demo installs it"

bus='' daemon='' socket=''
clean_up() {
  for process in $daemon $bus; do kill "$process" 2>/dev/null || true; done
  rm -rf ${socket:+"$socket"}
}
trap clean_up EXIT
trap 'exit 130' INT TERM

# What a program said in the system log, without the priorities that are for the journal, what it
# says of each key, and the content of the message, which the report repeats.
shown_log() {
  sed -E 's/^<[0-9]>//; /^(prefix match|Treating key|NANDInfo: findNandExporter)/d; /^\($/,/^\)$/d
    s/^/  | /' "$1"
}

# The report that was submitted since $demo/before was touched, as $report.
find_report() {
  report=$(find "$submitted" -name 'log-pellorand.193.*Z*' ! -name '*.plist' \
    -newer "$demo/before" | sort | tail -n 1)
  [ -n "$report" ] || fail "no report was submitted"
}

rm -rf "$demo"
mkdir -p "$demo"
export MORVEND_ROOT=$device

# Every other day the telemetry leaves the storage counters to the analytics sink, by the boot session:
# a device for which today is one of the others has more to show.
for seed in $(seq 8); do
  rm -rf "$device"
  "$bin/mkdevice" --seed "$seed" "$device"
  "$bin/nandinfo" daily 2>"$demo/nandinfo.log" | grep NumLogicalReads >/dev/null && break
done

chapter "A sample device: mkdevice --seed $seed $device"
say "A folder that stands for a device's file system: $(find "$device" -type f | wc -l) files," \
  "$(du -sh "$device" | cut -f1). Three weeks of counters,"
say "up to yesterday, a whitelist that says which of them may be reported and how they are"
say "rounded, the user's consent to it, and a storage controller with all its counters."

# A message bus of the demo's own, with a socket in a folder with a short name.
socket=$(mktemp -d)
cat >"$demo/bus.conf" <<CONF
<busconfig>
  <type>session</type>
  <listen>unix:path=$socket/bus</listen>
  <auth>EXTERNAL</auth>
  <policy context="default">
    <allow send_destination="*"/>
    <allow receive_sender="*"/>
    <allow own="*"/>
  </policy>
</busconfig>
CONF
dbus-daemon --nofork --nopidfile --config-file="$demo/bus.conf" 2>"$demo/bus.log" &
bus=$!
export DBUS_SYSTEM_BUS_ADDRESS=unix:path=$socket/bus
for _ in $(seq 50); do [ -S "$socket/bus" ] && break; sleep 0.1; done
[ -S "$socket/bus" ] || fail "the message bus did not start: $(cat "$demo/bus.log")"

chapter "The day: morvend, and a client on a message bus of the demo's own"
touch "$demo/before"
MORVEND_LOG=debug "$bin/morvend" 2>"$demo/service.log" &
daemon=$!
"$bin/morvend-demo" deliver
say "  the daemon does yesterday's work, and ends once ten seconds pass without a message"
for waited in $(seq 30); do
  kill -0 "$daemon" 2>/dev/null || break
  [ ! -t 1 ] || printf '\r  %2d s ' "$waited"
  sleep 1
done
[ ! -t 1 ] || printf '\r\e[K'
kill -0 "$daemon" 2>/dev/null && fail "the daemon did not end"
daemon=''
find_report
yesterday=$report
say "What it said, down to the single steps:"
shown_log "$demo/service.log"

chapter "The gate: morvend -d, which does a day's work once"
"$bin/morvend" -d 2>"$demo/gate.log"
shown_log "$demo/gate.log"

chapter "This machine's own figures: pelloran sample --every 1 --for 4; morvend -t"
"$bin/pelloran" sample --every 1 --for 4
"$bin/pelloran" show --day today --prefix host. >"$demo/today.txt"
sed -n '1p; /host\.loadavg\.1m/p; /host\.vmstat\.pgfault/p' "$demo/today.txt" | sed 's/^/  /'
say "  … $(($(wc -l <"$demo/today.txt") - 1)) counters of five readings"
say "Of them, a report of today, done or not, has these and others:"
touch "$demo/before"
"$bin/morvend" -t 2>"$demo/today.log"
find_report
"$bin/morvend-demo" show "$device" "$report" --prefix host.vmstat.pg

# asked ARGUMENT...: what nandinfo prints; what it says in the system log goes to a file.
asked() {
  "$bin/nandinfo" "$@" 2>"$demo/nandinfo.log" ||
    fail "nandinfo $* failed: $(tail -n 1 "$demo/nandinfo.log")"
}

chapter "The storage library: nandinfo extract --monthly"
say "Events of storage health for the analytics sink, whose configuration says which it uses:"
asked extract --monthly >"$demo/extraction.json"
sed -nE 's/.*SUCCESS in logging (com\.norba\.)?([^ ]+) .*/sent    \2/p
  s/.*FAILED to log (com\.norba\.)?([^ ]+) .*/unused  \2/p' "$demo/nandinfo.log" |
  uniq -c | sed -E 's/^ +([0-9]+) /  \1 /'
say "A counter as it is and as it leaves (storage, storage --round), and what labs get (health lab):"
for option in '' --round; do
  asked storage $option | sed -nE 's/^ *"TLM_(hostWrites)": ([0-9]+).*/  \1 \2/p'
done
asked health lab | sed -n 's/^ *"com.norba.NANDInfo.Health./  /p' | tr -d '",'

chapter "What was submitted for yesterday"
"$bin/morvend-demo" show "$device" "$yesterday"
chapter "What stays on the device"
"$bin/morvend-demo" kept "$device"
chapter "Everything that left the device, and the rule that let it through"
"$bin/morvend-demo" left "$device"

chapter "Look for yourself"
say "  less $yesterday"
say "  $bin/morvend-demo left $device --all"
say "  MORVEND_ROOT=$device $bin/pelloran show --day yesterday"
say "  MORVEND_ROOT=$device $bin/nandinfo ftl --all"

# In an empty root, which is no recorded device: the drives are those of whoever runs this.
chapter "This machine's own storage: nandinfo health"
mkdir -p "$demo/machine"
verdict=0
MORVEND_ROOT=$demo/machine "$bin/nandinfo" health >"$demo/health.json" 2>"$demo/nandinfo.log" ||
  verdict=$?
case $verdict in
0 | 3 | 10 | 11) ;;
*) fail "nandinfo health failed: $(tail -n 1 "$demo/nandinfo.log")" ;;
esac
sed -nE 's/^  "verdict": "(.*)",/The verdict: \1/p
  /^      "name"/ { s/.*: "(.*)",/  \1: /; h; }
  /^      "verdict"/ { s/.*: "(.*)",/\1/; H; x; s/\n//p; }
  /^      "reasons": \["/ { s/.*\["(.*)"\],/    \1/; s/", "/\n    /g; p; }' "$demo/health.json"
if grep -q "health log" "$demo/health.json"; then
  say "An NVMe drive tells its health to root alone, who keeps it for the others:"
  say "  sudo $bin/nandinfo drives --record"
fi
