#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors
# In the container, as root, once it is up: what the installation made, the day's work at a word, who
# may do what, and what is left in the end. Says "done" at its end.
. /trial/checks.sh

# The machine as it is after the installation.
check "nothing has failed" is "$(failed_units)" ""
for timer in daily drives extract extract-monthly sample; do
  check "morvend-$timer.timer is on" systemctl is-active morvend-$timer.timer
done

# Its own figures, consent, and the night.
check "a sample" systemctl start morvend-sample.service
check "consent" consent /usr/share/doc/morvend/examples/consent.plist
check "a counter of yesterday" as _morvend pelloran add host.vmstat.trial 12345 --day yesterday
check "the day's run" systemctl start morvend-daily.service
report=$(find $spool/submitted -name 'log-pellorand.193.*Z')
check "the report is there" test -f "$report"
check "it holds the counter, rounded" is "$(grep -A1 host.vmstat.trial "$report" | tail -n 1 | tr -d '\t ')" \
  "<integer>12000</integer>"
check "it is nobody else's" is "$(stat -c '%U:%G %a' "$report")" "_morvend:_morvend 600"
check "nobody else wrote there" is "$(find $data ! -user _morvend)" ""
check "no error was said" is "$(errors_said)" ""

# The bus.
useradd -G morvend friend
check "anybody may ask what it offers" as nobody busctl introspect $name $object
check "it runs as its user" is "$(busctl status $name | sed -n s/^EUID=//p)" "$(id -u _morvend)"
check "nobody may not send" refused call nobody $name Message 'a{sv}' 1 operation i 0
check "nobody may not ping" refused call nobody org.freedesktop.DBus.Peer Ping
check "a member of the group may ping" call friend org.freedesktop.DBus.Peer Ping
check "a member of the group may send" call friend --expect-reply=no $name Message 'a{sv}' 1 operation i 0
check "root may ping" call root org.freedesktop.DBus.Peer Ping
check "nobody may not own it" refused as nobody busctl call org.freedesktop.DBus /org/freedesktop/DBus \
  org.freedesktop.DBus RequestName su $name 0

# How far each unit is exposed, of 10: those that are the daemon's 0.5 at most, and the one that asks the
# drives a little more.
exposure() { systemd-analyze security --no-pager "$1" 2>/dev/null | sed -n 's/.*exposure level.*: \([0-9.]*\) .*/\1/p'; }
while read -r unit most; do
  score=$(exposure $unit.service)
  check "$unit.service is exposed by ${score:-?} of 10, $most at most" \
    awk -v score="${score:-10}" -v most=$most 'BEGIN { exit !(score <= most) }'
done <<'EOT'
morvend 0.5
morvend-daily 0.5
morvend-extract 0.5
morvend-extract-monthly 0.5
morvend-sample 0.5
morvend-drives 1.4
EOT
check "nothing has failed since" is "$(failed_units)" ""

# What stays.
export DEBIAN_FRONTEND=noninteractive
check "removal" apt-get remove -q -y morvend libnandinfo0 libnandinfo-dev
check "the data stay" test -f "$report"
check "nothing of it runs" is "$(systemctl list-units --no-legend 'morvend*')" ""
check "purge" apt-get purge -q -y morvend
check "nothing is left" is "$(find /etc /run /usr /var -xdev -iname '*morvend*' -not -path '/var/log/*' \
  -not -path '/var/cache/*' -not -path '/run/systemd/*')" ""
check "nor its users" is "$(getent passwd _morvend; getent group morvend _morvend)" ""
echo "done"
