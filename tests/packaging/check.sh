#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors
# What an installation holds beside programs and libraries: units as systemd reads them and as closed as
# they are to be, completions as the shells take them, the bus's files as the daemon answers, and the
# device that it begins with. Usage: check.sh BUILD
set -euo pipefail
build=$1
work=$(mktemp -d)
trap 'kill ${bus:-} 2>/dev/null || true; rm -rf "$work"' EXIT
fail() { echo "$*" >&2; exit 1; }
cmake --install "$build" --prefix "$work/usr" >/dev/null
units=$work/usr/lib/systemd/system share=$work/usr/share

# A word that systemd doesn't know, a program that isn't there, a unit that names one that isn't.
systemd-analyze verify --man=no "$units"/* 2>"$work/complaints" || true
! grep -F "$units" "$work/complaints" || fail "systemd complains"
# A unit that has got wider: its exposure, in tenths.
while read -r unit most; do
  systemd-analyze security --offline=yes --no-pager --threshold="$most" "$units/$unit.service" \
    >"$work/exposure" 2>&1 || fail "$unit: $(tail -n 1 "$work/exposure"), more than $most"
done <<'EOT'
morvend 5
morvend-daily 5
morvend-extract 5
morvend-extract-monthly 5
morvend-sample 5
morvend-drives 14
EOT
for timer in "$units"/*.timer; do
  [ -e "${timer%.timer}.service" ] || fail "$timer starts nothing"
done

# A completion that no shell takes, or that doesn't know a command. Words before a colon are typed, the
# last of them not to its end; what follows is offered.
complete_line() {
  COMP_WORDS=("$@") COMP_CWORD=$(($# - 1)) COMPREPLY=()
  [ "${COMP_WORDS[COMP_CWORD]}" != - ] || COMP_WORDS[COMP_CWORD]=
  "_$1"
  echo "${COMPREPLY[*]}"
}
for tool in nandinfo pelloran mkdevice; do
  . "$share/bash-completion/completions/$tool"
  for shell in zsh fish; do
    command -v $shell >/dev/null || continue
    $shell -n "$share"/$shell/*/*"$tool"* || fail "$tool: $shell"
  done
done
while IFS=: read -r typed offered; do
  # shellcheck disable=SC2086
  [ "$(complete_line $typed)" = "$offered" ] || fail "'$typed': $(complete_line $typed)"
done <<'EOT'
nandinfo decode ftl:ftl ftl-stat
nandinfo --json ean -:image-size update-count
nandinfo ftl --r:--round
nandinfo extract --from -:
pelloran s:set show sample
pelloran show --p:--prefix
mkdevice --controller q:qrt3
EOT

# What is said of the interface and what the daemon answers.
sed "s,@socket@,$work/bus," >"$work/bus.conf" <<'EOT'
<busconfig><type>session</type><listen>unix:path=@socket@</listen><auth>EXTERNAL</auth>
<policy context="default"><allow send_destination="*"/><allow receive_sender="*"/><allow own="*"/></policy></busconfig>
EOT
bus=$(dbus-daemon --config-file="$work/bus.conf" --fork --print-pid)
export DBUS_SYSTEM_BUS_ADDRESS=unix:path=$work/bus MORVEND_ROOT=$work/root
mkdir "$work/root"
"$work/usr/bin/morvend" 2>/dev/null &
name=com.norba.pellorand.morvend
for _ in $(seq 200); do
  busctl --address="$DBUS_SYSTEM_BUS_ADDRESS" status $name >/dev/null 2>&1 && break
  sleep 0.05
done
interface() { sed -n '/interface name="com.norba/,/<\/interface>/p' | tr -s ' \n' ' '; }
busctl --address="$DBUS_SYSTEM_BUS_ADDRESS" --xml-interface introspect $name "/${name//.//}" |
  interface >"$work/answered"
interface <"$share/dbus-1/interfaces/$name.xml" | cmp - "$work/answered" || fail "$(cat "$work/answered")"
kill %1 && wait %1
