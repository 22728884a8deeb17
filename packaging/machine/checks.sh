# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors
# What the trials on a machine share. Each check says "ok" or "not ok" and what, on a line.
name=com.norba.pellorand.morvend
object=/${name//.//}
data=/var/lib/morvend
spool=$data/var/spool/morvend

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
consent() {
  as _morvend install -D -m 600 "$1" $data/var/preferences/mobile/com.norba.quenset.plist
}
failed_units() { systemctl --failed --no-legend --plain; }
# Errors that the programs said, and none of systemd's own about them.
errors_said() { journalctl -q -p err -o cat -u 'morvend*'; }
