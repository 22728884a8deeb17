#!/usr/bin/env bash
# The demo: makes a sample device, runs a day of it, and shows what was submitted.
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
for program in mkdevice pelloran morvend morvend-demo; do
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

# What a program said in the system log, without the priorities that are for the journal.
shown_log() { sed 's/^<[0-9]>//; s/^/  | /' "$1"; }

# run_daily OPTION: runs the daemon and leaves the new report's path in $report.
run_daily() {
  touch "$demo/before"
  "$bin/morvend" "$1" 2>"$demo/morvend$1.log"
  shown_log "$demo/morvend$1.log"
  find_report
  say "The report: $report"
}
find_report() {
  report=$(find "$submitted" -name 'log-pellorand.193.*Z*' ! -name '*.plist' \
    -newer "$demo/before" | sort | tail -n 1)
  [ -n "$report" ] || fail "no report was submitted"
}

rm -rf "$demo"
mkdir -p "$demo"
export MORVEND_ROOT=$device

chapter "A sample device: mkdevice $device"
"$bin/mkdevice" "$device"
say "A folder that stands for a device's file system: $(find "$device" -type f | wc -l) files," \
  "$(du -sh "$device" | cut -f1). Three weeks of counters,"
say "up to yesterday, a whitelist that says which of them may be reported and how they are"
say "rounded, and the user's consent to it."

chapter "Counters of this machine: pelloran sample --every 1 --for 4"
"$bin/pelloran" sample --every 1 --for 4
say "Five readings of this machine's own figures were recorded as today's counters:"
"$bin/pelloran" show --day today >"$demo/today.txt"
sed -n '1p; /host\.loadavg/p; /host\.vmstat\.pgfault/p' "$demo/today.txt" | sed 's/^/  /'
say "  … $(($(wc -l <"$demo/today.txt") - 1)) counters in all, in $device/var/mobile/Library/Pelloran"

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

chapter "Yesterday's report: morvend -f"
say "The daily sequence for yesterday: checkpoint, report, dump of structured logs, tasking,"
say "roll-over of the support service's logs. The daemon's own log:"
run_daily -f
yesterday=$report

chapter "Today's report, with this machine's figures: morvend -t"
run_daily -t
today=$report

chapter "The service: morvend, and a client on a message bus of the demo's own"
touch "$demo/before"
"$bin/morvend" 2>"$demo/morvend.log" &
daemon=$!
"$bin/morvend-demo" deliver
say "  the daemon ends once ten seconds pass without a message"
for waited in $(seq 30); do
  kill -0 "$daemon" 2>/dev/null || break
  [ ! -t 1 ] || printf '\r  %2d s ' "$waited"
  sleep 1
done
[ ! -t 1 ] || printf '\r\e[K'
kill -0 "$daemon" 2>/dev/null && fail "the daemon did not end"
daemon=''
shown_log "$demo/morvend.log"
find_report
say "The report: $report"

chapter "What was submitted for yesterday"
"$bin/morvend-demo" show "$device" "$yesterday"
chapter "What was submitted for today: this machine's own figures"
say "The tasking that the first run applied is named by this report and the next:"
"$bin/morvend-demo" show "$device" "$today" --prefix host.
chapter "What the service submitted: yesterday once more, with app info"
"$bin/morvend-demo" show "$device" "$report" --header
chapter "What the runs wrote beside the reports"
"$bin/morvend-demo" files "$device"

chapter "Look for yourself"
say "  less $yesterday"
say "  $bin/morvend-demo show $device --all"
say "  MORVEND_ROOT=$device $bin/pelloran show --day yesterday"
