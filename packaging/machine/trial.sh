#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors
# On the machine, as root, once it is up: a day of it, who may do what, and what is left in the end.
# Says "ok" or "not ok" and what, a line each, and "done".
name=com.norba.pellorand.morvend
object=/${name//.//}
data=/var/lib/morvend

# check WHAT COMMAND...
check() {
  local what=$1 output
  shift
  if output=$("$@" 2>&1); then echo "ok - $what"; else
    echo "not ok - $what"
    printf '%s\n' "$output" | sed 's/^/    /'
  fi
}
is() { [ "$1" = "$2" ] || { printf 'is:     %s\nshould: %s\n' "$1" "$2"; return 1; }; }
as() { runuser -u "$1" -- "${@:2}"; }
# refused COMMAND...: fails, and says that it isn't allowed.
refused() { ! "$@" >/tmp/refused 2>&1 && grep 'Access denied' /tmp/refused; }
call() { as "$1" busctl call $name $object "${@:2}"; }

# The machine as it is after the installation.
check "nothing has failed" is "$(systemctl --failed --no-legend)" ""
for timer in daily drives extract extract-monthly sample; do
  check "morvend-$timer.timer is on" systemctl is-active morvend-$timer.timer
done

# Its own figures, consent, and the night.
check "a sample" systemctl start morvend-sample.service
check "consent" as _morvend install -D -m 600 /usr/share/doc/morvend/examples/consent.plist \
  $data/var/preferences/mobile/com.norba.quenset.plist
check "a counter of yesterday" as _morvend pelloran add host.vmstat.trial 12345 --day yesterday
check "the day's run" systemctl start morvend-daily.service
report=$(find $data/var/spool/morvend/submitted -name 'log-pellorand.193.*Z')
check "the report is there" test -f "$report"
check "it holds the counter, rounded" grep -A1 host.vmstat.trial "$report"
check "it is nobody else's" is "$(stat -c '%U:%G %a' "$report")" "_morvend:_morvend 600"
check "nobody else wrote there" is "$(find $data ! -user _morvend)" ""
check "no error was said" is "$(journalctl -q -p err -o cat -u 'morvend*')" ""

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
systemd-analyze security --no-pager 2>/dev/null | grep -E '^morvend'
check "nothing has failed since" is "$(systemctl --failed --no-legend)" ""

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
