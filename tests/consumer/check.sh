#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors
# Installs a build elsewhere, looks at what its units start, builds a program against it in every way
# that is offered, and compares what they print; the examples, too. Usage: check.sh BUILD LIBDIR CC CXX
set -euo pipefail
build=$1 libdir=$2 cc=$3 cxx=$4
here=$(dirname "$(readlink -f "$0")")
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
fail() { echo "$*" >&2; exit 1; }

cmake --install "$build" --prefix "$work/installed" >/dev/null
DESTDIR=$work/staged cmake --install "$build" --prefix /opt/elsewhere >/dev/null
for file in $(cd "$work/installed" && echo lib/systemd/system/morvend{,-daily,-drives,-extract,-sample}.service share/dbus-1/system-services/*); do
  program=$(sed -nE 's/^Exec(Start)?=([^ ]*).*/\2/p' "$work/installed/$file")
  [[ $program == "$work"/installed/* && -x $program ]] || fail "$file starts '$program'"
  grep -qE '^Exec(Start)?=/opt/elsewhere/bin/(morvend|nandinfo|pelloran)( |$)' "$work/staged/opt/elsewhere/$file" ||
    fail "$file, staged, starts another program"
  ! grep -H '@[a-z_]*@' "$work/installed/$file" || fail "a place was left open"
done
# Nothing may depend on where it was installed.
mv "$work/installed" "$work/moved"
prefix=$work/moved lib=$work/moved/$libdir
export PKG_CONFIG_PATH=$lib/pkgconfig LD_LIBRARY_PATH=$lib

"$here/abi.sh" "$lib/libNANDInfo.so" "$prefix/include/nandinfo.h" || fail "the symbols have changed"
readelf -d "$lib/libNANDInfo.so" | grep -q 'SONAME.*\[libNANDInfo\.so\.0\]' || fail "no SONAME"

# What the static library needs, a user's build finds for itself.
! grep -rlE "$build|/lib(sqlite3|expat|systemd|md)\." "$lib/cmake/NANDInfo" || fail "exported: a place of this machine"
for dependency in sqlite3 expat libsystemd libmd; do
  pkg-config --print-requires-private NANDInfo | grep -qx "$dependency" || fail "pkg-config lacks $dependency"
done

export MORVEND_ROOT=$work/root DBUS_SYSTEM_BUS_ADDRESS=unix:path=/nonexistent
mkdir -p "$work/root/device"
cat >"$work/root/device/properties.plist" <<'EOF'
<plist version="1.0"><dict><key>DiskUsage</key><dict>
<key>TotalDiskCapacity</key><integer>124780544000</integer>
<key>TotalDataAvailable</key><integer>31195136000</integer>
<key>AmountDataAvailable</key><integer>30000000000</integer>
</dict><key>InternalBuild</key><true/></dict></plist>
EOF

with_cmake() {
  cmake -G Ninja -S "$here" -B "$work/$1" -DCMAKE_CXX_COMPILER="$cxx" -DCMAKE_PREFIX_PATH="$prefix" \
    -DNANDInfo_USE_STATIC_LIBS="$2" >/dev/null
  cmake --build "$work/$1" >/dev/null
}
with_pkg_config() {
  local flags
  flags=$(pkg-config --cflags --libs "${@:2}" NANDInfo)
  [ $# -eq 1 ] || flags=${flags/-lNANDInfo/-l:libNANDInfo.a}
  mkdir "$work/$1"
  # shellcheck disable=SC2086
  "$cxx" -std=c++20 "$here/consumer.cpp" $flags -o "$work/$1/consumer"
}
with_cmake cmake-shared OFF &
with_cmake cmake-static ON &
with_pkg_config pkg-config-shared &
with_pkg_config pkg-config-static --static &
for job in $(jobs -p); do wait "$job"; done

for way in cmake-shared cmake-static pkg-config-shared pkg-config-static; do
  needed=$(readelf -d "$work/$way/consumer" | grep -c 'NEEDED.*libNANDInfo' || true)
  [[ $way == *shared && $needed == 1 || $way == *static && $needed == 0 ]] || fail "$way: linked otherwise"
  printed=$("$work/$way/consumer")
  [[ $printed == *"TLM_UserCapacity_MB = 119000"*internal && $printed == "${first:=$printed}" ]] ||
    fail "$way printed $printed"
done

# The examples, over a device that answers, one that is damaged, and none.
examples=$here/../../examples
example() {
  # shellcheck disable=SC2046
  "$cc" -std=c99 -Wall -Wextra -Wpedantic -Werror "$examples/storage.c" $(sed "s/-lNANDInfo/$2/") -o "$work/$1"
}
pkg-config --cflags --libs NANDInfo | example storage-shared -lNANDInfo
pkg-config --cflags --libs --static NANDInfo | example storage-static -l:libNANDInfo.a
"$prefix/bin/mkdevice" "$work/sample" >/dev/null
for way in shared static; do
  "$work/storage-$way" "$work/sample" >"$work/$way" || fail "storage-$way failed"
  cmp "$work/shared" "$work/$way"
done
for line in '  TLM_UserCapacity_MB: [0-9]+' '  verdict: replace' '      name: controller' '  hostWrites: [1-9][0-9]+00'; do
  grep -qxE "$line" "$work/shared" || fail "no line '$line': $(head -n 20 "$work/shared")"
done
! failure=$("$work/storage-shared" "$work/none" 2>&1) || fail "a device that isn't there"
[[ $failure == "storage: the device root $work/none: "* ]] || fail "$failure"
failure=$("$work/storage-shared" "$work/root" 2>&1 >/dev/null) || true
[[ $failure == "storage: ftl: no storage controller found"*"(3)" ]] || fail "$failure"

# Each name gives what the command prints, and the other way round: a name that one of them lacks.
storage_py() { python3 "$examples/storage.py" "$@"; }
export MORVEND_ROOT=$work/sample
mapfile -t names < <(storage_py | grep -vE '^(magazine|ean .*)$')
[ ${#names[@]} -gt 11 ] || fail "few names: ${names[*]}"
storage_py "${names[@]}" >"$work/collected"
for name in "${names[@]}"; do
  # shellcheck disable=SC2086
  "$prefix/bin/nandinfo" --compact $name || true
done >"$work/printed" 2>/dev/null
diff "$work/printed" "$work/collected" | cut -c1-300 >"$work/differences" || fail "$(cat "$work/differences")"
echo text >"$work/text"
! failure=$(storage_py --decode ftl "$work/text" 2>&1 >/dev/null) || fail "a text was decoded"
[[ $failure == *"it holds a text, not FTL statistics (4)" ]] || fail "$failure"
export MORVEND_ROOT=$work/root
# Each has added to the counter, where the commands find it.
shown=$("$prefix/bin/pelloran" show --prefix consumer)
[[ $shown == *consumer*20* ]] || fail "the counter: $shown"
