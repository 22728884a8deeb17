#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors
# The packages on a machine: installs them into a minimal Debian of this machine's release, boots it in
# a container for container.sh, and with a kernel of its own in a virtual machine for day.sh, whose disk
# outside.py looks at afterwards. Each check is a line that begins with "ok" or "not ok"; one of the
# latter makes it fail. Needs root, and an apt that knows a mirror; no KVM.
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

# The same with what a machine has that isn't a container, and who looks at drives in another way.
make_bootable() {
  say "adding a kernel"
  copied base bootable.part
  shown inside bootable.part sh -c 'apt-get update -q && apt-get install -q -y --no-install-recommends \
    initramfs-tools linux-image-cloud-amd64 nvme-cli systemd-timesyncd udev zstd && apt-get clean'
  mv "$work/bootable.part" "$work/bootable"
}

# add_trial TREE TRIAL: for the time after the boot.
add_trial() {
  local trial=$work/$1/trial
  mkdir "$trial"
  cp "$here/checks.sh" "$trial/"
  cp "$here/$2" "$trial/trial"
  cp "$here/trial.service" "$work/$1/etc/systemd/system/"
  shown inside "$1" systemctl --quiet enable trial.service
}

add_packages() {
  cp "$packages"/*.deb "$work/$1/trial/"
  shown inside "$1" sh -c 'apt-get update -q && apt-get install -q -y --no-install-recommends /trial/*.deb'
}

# all_well FILE: what a trial said.
all_well() { grep -q '^done$' "$1" && ! grep -q '^not ok' "$1"; }

container() {
  say "installing the packages for a container"
  copied base container
  add_trial container container.sh
  add_packages container
  say "booting the container"
  local said=$work/container/trial/output
  : >"$said"
  timeout --kill-after=10 300 systemd-nspawn --quiet --register=no --keep-unit --directory="$work/container" \
    --boot --private-network --console=pipe </dev/null >"$work/container.log" 2>&1 &
  tail --pid=$! -s 0.2 -n +1 -f "$said"
  wait $! || true
  all_well "$said" || { tail -n 40 "$work/container.log"; return 1; }
}

# manifest NAME TREE: keeps what the tree holds.
manifest() { "$here/outside.py" manifest "$work/$2" >"$work/$1.manifest"; }

# The machine's disk is an NVMe drive, beside one that nobody uses. Its own clock is hours behind; it can
# ask for the time, and reach nothing else.
virtual_machine() {
  local day units=123 said=$work/said status=0
  day=$(date -u -d tomorrow +%F)
  say "installing the packages for a virtual machine"
  copied bootable machine
  add_trial machine day.sh
  echo "$day $units" >"$work/machine/trial/plan"
  install -D -m 644 "$here/machine.network" "$work/machine/etc/systemd/network/trial.network"
  # Where the clock is set forward, systemd counts a random delay from the machine's start.
  install -D -m 644 /dev/stdin "$work/machine/etc/systemd/system/morvend-.timer.d/trial.conf" <<'EOT'
[Timer]
RandomizedDelaySec=0
EOT
  shown inside machine sh -c 'systemctl --quiet enable systemd-networkd; systemctl --quiet disable systemd-timesyncd'
  manifest plain machine
  add_packages machine
  manifest installed machine
  rm -rf "$work"/{system,scratch}.img "$work/after"
  shown mke2fs -q -t ext4 -L system -d "$work/machine" "$work/system.img" \
    "$(du -sm "$work/machine" | awk '{ print $1 + 400 }')M"
  truncate -s 256M "$work/scratch.img"

  say "booting the virtual machine"
  : >"$said"
  # In a network that has nothing but the time.
  unshare --net bash -c 'ip link set lo up; "$1/time_server.py" "$2" & exec "${@:3}"' - \
    "$here" "$(date -u -d "$day 22:50" +%s)" \
    timeout --kill-after=10 600 qemu-system-x86_64 -nodefaults -no-user-config -display none -no-reboot \
    -machine q35 -accel tcg,thread=multi -cpu qemu64,-svm,+rdrand -smp 2 -m 1024 -rtc "base=${day}T20:00:00" \
    -kernel "$work/machine/vmlinuz" -initrd "$work/machine/initrd.img" \
    -append 'root=LABEL=system rw console=ttyS0 panic=-1 systemd.getty_auto=no' \
    -serial "file:$work/console" \
    -device virtio-serial-pci -chardev "file,id=said,path=$said" \
    -device virtserialport,chardev=said,name=said \
    -device virtio-net-pci,netdev=net,romfile= -netdev user,id=net,ipv6=off \
    -drive "if=none,id=scratch,format=raw,file=$work/scratch.img" \
    -device nvme,drive=scratch,serial=scratch \
    -drive "if=none,id=system,format=raw,cache=unsafe,file=$work/system.img" \
    -device nvme,drive=system,serial=system </dev/null >"$work/qemu.log" 2>&1 &
  tail --pid=$! -s 0.2 -n +1 -f "$said"
  wait $! || status=$?
  [ $status -eq 0 ] && all_well "$said" || { tail -n 60 "$work/console" "$work/qemu.log"; return 1; }

  say "looking at its disk"
  mkdir "$work/after"
  shown debugfs -R "rdump / $work/after" "$work/system.img"
  manifest after after
  "$here/outside.py" look "$work" "$units"
}

: >"$log"
[ -d "$work/base" ] || make_base
[ -d "$work/bootable" ] || make_bootable
container
virtual_machine

say "the virtual machine's report"
cat "$work/after/trial/kept/report"
say "installed sizes in KiB, and how far the units are exposed"
inside machine dpkg-query -W -f '${Package} ${Installed-Size}\n' morvend libnandinfo0 libnandinfo-dev
sed -n 's/^ok - \(morvend.*\) is exposed by \(.*\) of .*/\1 \2/p' "$work/container/trial/output"
