#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors
# The packages on a machine: installs them into a minimal Debian of this machine's release and boots it
# in a container for container.sh. Each check is a line that begins with "ok" or "not ok"; one of the
# latter makes it fail. Needs root, and an apt that knows a mirror.
# Usage: machine.sh PACKAGES WORK, folders; WORK keeps the Debian for the next time.
set -euo pipefail

# All that is mounted or started is this process's own and gone with it, however it ends.
if [ $$ -ne 1 ]; then
  setpriv --pdeathsig KILL unshare --mount --pid --fork --kill-child --mount-proc "$0" "$@" </dev/null &
  inside=$!
  trap 'kill -KILL $inside' EXIT
  trap 'exit 130' INT TERM HUP
  wait $inside && status=0 || status=$?
  trap - EXIT
  exit $status
fi

here=$(dirname "$(readlink -f "$0")")
packages=$(readlink -f "$1")
mkdir -p "$2"
work=$(readlink -f "$2")
# Where nspawn keeps what it shares with containers, which is none of the machine's.
mkdir -p /run/systemd/nspawn && mount -t tmpfs tmpfs /run/systemd/nspawn
say() { printf '\n== %s (%s s)\n' "$*" "$SECONDS"; }

# shown COMMAND...: what it prints is in the log; its end is shown where it fails.
log=$work/log
shown() { "$@" >>"$log" 2>&1 || { tail -n 40 "$log"; echo "failed: $*"; exit 1; }; }

# inside TREE COMMAND...: in the tree, not booted.
inside() {
  timeout 600 systemd-nspawn --quiet --register=no --keep-unit --directory="$work/$1" --pipe \
    --setenv=DEBIAN_FRONTEND=noninteractive "${@:2}" </dev/null
}
# copied FROM TO
copied() { rm -rf "${work:?}/$2" && cp -a "$work/$1" "$work/$2"; }

# Debian as small as it boots, from where this machine's apt gets it.
make_base() {
  local codename mirror
  codename=$(. /etc/os-release && echo "$VERSION_CODENAME")
  mirror=$(apt-get indextargets --format '$(REPO_URI)' 'Created-By: Packages' "Codename: $codename" | head -n 1)
  [ -n "$mirror" ] || { echo "apt knows no mirror of $codename: apt-get update?" >&2; exit 1; }
  say "making a minimal $codename"
  rm -rf "$work/base.part"
  shown timeout 900 debootstrap --variant=minbase --include=systemd-sysv,dbus "$codename" "$work/base.part" "$mirror"
  mv "$work/base.part" "$work/base"
}

# install TREE TRIAL: the packages, and the trial for the time after the boot.
install() {
  local trial=$work/$1/trial
  mkdir -p "$trial"
  cp "$packages"/*.deb "$here/checks.sh" "$trial/"
  cp "$here/$2" "$trial/trial"
  cp "$here/trial.service" "$work/$1/etc/systemd/system/"
  shown inside "$1" sh -c 'apt-get update -q && apt-get install -q -y --no-install-recommends /trial/*.deb'
  shown inside "$1" systemctl --quiet enable trial.service
}

# all_well FILE: what a trial said.
all_well() { grep -q '^done$' "$1" && ! grep -q '^not ok' "$1"; }

container() {
  say "installing the packages for a container"
  copied base container
  install container container.sh
  say "booting the container"
  local said=$work/container/trial/output
  : >"$said"
  timeout --kill-after=10 300 systemd-nspawn --quiet --register=no --keep-unit --directory="$work/container" \
    --boot --private-network --console=pipe </dev/null >"$work/container.log" 2>&1 &
  tail --pid=$! -s 0.2 -n +1 -f "$said"
  wait $! || true
  all_well "$said" || { tail -n 40 "$work/container.log"; return 1; }
}

: >"$log"
[ -d "$work/base" ] || make_base
container
