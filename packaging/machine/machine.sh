#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors
# Installs the packages into a minimal Debian of this machine's release, boots it in a container and
# lets trial.sh look around in it. Needs root, debootstrap, systemd-nspawn, and an apt that knows a
# mirror. Usage: machine.sh PACKAGES WORK, folders; WORK keeps the Debian for the next time.
set -euo pipefail
here=$(dirname "$(readlink -f "$0")")
packages=$(readlink -f "$1")
mkdir -p "$2"
work=$(readlink -f "$2")
root=$work/root
say() { printf '\n== %s\n' "$*"; }

# Debian as small as it boots, from where this machine's apt gets it.
make_base() {
  local codename mirror
  codename=$(. /etc/os-release && echo "$VERSION_CODENAME")
  mirror=$(apt-get indextargets --format '$(REPO_URI)' 'Created-By: Packages' "Codename: $codename" | head -n 1)
  [ -n "$mirror" ] || { echo "apt knows no mirror of $codename: apt-get update?" >&2; exit 1; }
  say "making a minimal $codename"
  rm -rf "$work/base.part"
  debootstrap --variant=minbase --include=systemd-sysv,dbus "$codename" "$work/base.part" "$mirror" \
    >"$work/debootstrap.log" || { tail -n 20 "$work/debootstrap.log"; exit 1; }
  mv "$work/base.part" "$work/base"
}

# inside COMMAND...: in the root, not booted.
inside() {
  systemd-nspawn --quiet --register=no --keep-unit --directory="$root" --pipe \
    --setenv=DEBIAN_FRONTEND=noninteractive "$@" </dev/null
}

[ -d "$work/base" ] || make_base
say "installing the packages"
rm -rf "$root"
cp -a "$work/base" "$root"
mkdir "$root/trial"
cp "$packages"/*.deb "$here/trial.sh" "$root/trial/"
inside sh -c 'apt-get update -q && apt-get install -q -y --no-install-recommends /trial/*.deb' \
  >"$work/install.log" 2>&1 || { tail -n 40 "$work/install.log"; exit 1; }
install -D -m 644 "$here/trial.service" "$root/etc/systemd/system/trial.service"
inside systemctl --quiet enable trial.service 2>>"$work/install.log"

say "booting a container"
timeout --kill-after=10 300 systemd-nspawn --quiet --register=no --keep-unit --directory="$root" --boot \
  --private-network --console=pipe </dev/null >"$work/boot.log" 2>&1 || true
cat "$root/trial/output"
! grep -q '^not ok' "$root/trial/output" && grep -q '^done$' "$root/trial/output"
