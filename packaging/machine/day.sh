#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors
# In the virtual machine, as root, once it is up: two days as the timers make them, whose clock is set
# forward. The first with consent, with a known amount written to a drive that nobody else uses; the
# second without. What outside.py is to look at stays in /trial/kept. Says "done" at its end.
exec >/dev/virtio-ports/said 2>&1
. /trial/checks.sh
kept=/trial/kept
mkdir $kept
read -r day units </trial/plan   # the first day, and how many 512,000 bytes to write
scratch=/dev/disk/by-id/nvme-QEMU_NVMe_Ctrl_scratch

run_of() { systemctl show -P InvocationID "$1"; }
# by_timer TIME UNIT...: sets the clock forward to the time (of the first day, or "N days TIME") and
# waits until each unit was run, by nobody but its timer. The pause is for systemd, which takes five
# starts in ten seconds for a fault.
by_timer() {
  local unit moment=$1 before=() i=0 looks=0
  shift
  for unit in "$@"; do before+=("$(run_of "$unit")"); done
  sleep 3
  date -u -s "$day $moment" >/dev/null
  for unit in "$@"; do
    while [ "$(run_of "$unit")" = "${before[i]}" ] || systemctl is-active -q "$unit" ||
      [ "$(systemctl show -P ActiveState "$unit")" = activating ]; do
      [ $((looks += 1)) -lt 100 ] || { echo "$unit wasn't run"; return 1; }
      sleep 0.2
    done
    is "$(systemctl show -P Result "$unit")" success || return 1
    i=$((i + 1))
  done
}
# The drives' figures by the device's own tools, between two looks at what the drives say by others'.
figures() {
  udevadm settle
  smart before
  systemctl start morvend-drives.service || return 1
  smart after
  as _morvend nandinfo drives --json >"$kept/$1.drives.json"
  for drive in /sys/block/nvme*n1; do
    echo "$(basename "$(readlink -f "$drive/device")") $(awk '{ print $7 }' "$drive/stat")"
  done >"$kept/$1.sectors_written"
}
smart() {
  local drive
  for drive in nvme0 nvme1; do
    nvme smart-log /dev/$drive -o json >"$kept/$drive.$1.json" || return 1
  done
}
last_day() {
  sed -n '/LastCrashLogSerializationDateInDaysSince1970/{n;s/[^0-9]//g;p}' \
    $data/var/preferences/mobile/com.norba.pellorand.morvend.plist
}
submitted() { find $spool/submitted -type f -printf '%P %s %T@\n' 2>/dev/null | sort; }

# Before anything has set the clock.
check "nothing has failed" is "$(failed_units)" ""
systemctl start --no-block morvend-daily.service
sleep 2
check "the day's work waits for the clock" is \
  "$(systemctl show -P ActiveState morvend-clock.service morvend-daily.service | xargs)" "activating inactive"
systemctl start systemd-timesyncd.service
check "the day's work once the clock is set" systemctl start morvend-daily.service
check "the clock was set" is "$(date -u +%F\ %H)" "$day 22"
check "nothing is sent that nobody consented to" is "$(submitted)" ""
# From here on it is set by hand.
systemctl stop systemd-timesyncd.service

# The first day: samples around what is written.
check "consent" consent /usr/share/doc/morvend/examples/consent.plist
check "23:00, the drives" by_timer 23:00:05 morvend-drives.service
check "23:10, a sample" by_timer 23:10:05 morvend-sample.service
check "the drives' figures" figures first
check "$units units written to a drive" dd if=<(yes morvend 2>/dev/null) of=$scratch bs=512000 count="$units" \
  iflag=fullblock oflag=direct status=none
check "the drives' figures after it" figures second
check "23:20, a sample" by_timer 23:20:05 morvend-sample.service

# The night.
check "the next day, the day's work" by_timer "1 day 00:10:05" morvend-daily.service
report=$(find $spool/submitted -name 'log-pellorand.193.*Z')
check "the report is there" test -f "$report"
check "the storage's events" by_timer "1 day 01:00:05" morvend-extract.service
check "they are there" grep -q FTLCounters_1 $spool/events.jsonl
as _morvend pelloran show --day yesterday --json >$kept/counters.jsonl
as _morvend nandinfo health --json >$kept/health.json
echo $? >$kept/health.status

# The second, without consent.
sed 's/true/false/' /usr/share/doc/morvend/examples/consent.plist >/trial/refusal.plist
check "no consent" consent /trial/refusal.plist
check "a sample of the second day" by_timer "1 day 23:30:05" morvend-sample.service
submitted >$kept/submitted
check "the second night, the day's work" by_timer "2 days 00:10:05" morvend-daily.service
check "it was done" is "$(last_day)" "$(($(date -u -d "$day 1 day" +%s) / 86400))"
check "nothing is sent without consent" is "$(submitted)" "$(cat $kept/submitted)"

# Who may do what, and how it all went.
check "nobody may not send" refused call nobody $name Message 'a{sv}' 1 operation i 0
check "root may" call root $name Message 'a{sv}' 1 operation i 0 --expect-reply=no
check "no error was said" is "$(errors_said)" ""
check "nothing has failed since" is "$(failed_units)" ""
journalctl -o short-iso -u 'morvend*' >$kept/journal
cp "$report" $kept/report
echo "done"
