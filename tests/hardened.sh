#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors
# Looks in every program and library that a build installs for what hardens it, and first at a program
# made without, to know that it would be seen. Usage: hardened.sh BUILD CC
set -euo pipefail
build=$1 cc=$2
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

# lacks FILE: what the file doesn't have, a line each.
lacks() {
  local seen
  seen=$(readelf -Whldn --dyn-syms "$1" 2>/dev/null)
  look() { grep -qE "$2" <<<"$seen" || echo "$1"; }
  look "position-independent" '^ +Type: +DYN'
  look "read-only relocations" '^ +GNU_RELRO'
  look "immediate binding" 'BIND_NOW|Flags:.*\bNOW\b'
  look "data not executable" 'GNU_STACK .* RW '
  look "stack protector" ' __stack_chk_fail\b'
  look "fortified sources" ' __[a-z_]+_chk\b'
}

echo 'int main(void) { return 0; }' >"$work/bare.c"
"$cc" -O2 -no-pie -fno-stack-protector -U_FORTIFY_SOURCE -Wl,-z,norelro,-z,lazy \
  -z execstack "$work/bare.c" -o "$work/bare" 2>/dev/null
[ "$(lacks "$work/bare" | wc -l)" = 6 ] || { echo "only these are missed in a bare program:"; lacks "$work/bare"; exit 1; }

cmake --install "$build" --prefix "$work/installed" >/dev/null
count=0 failed=0
while read -r file; do
  readelf -h "$file" >/dev/null 2>&1 || continue
  count=$((count + 1))
  missing=$(lacks "$file")
  [ -z "$missing" ] || { echo "${file#"$work/installed/"} lacks $missing"; failed=1; }
done < <(find "$work/installed" -type f \( -perm -u+x -o -name '*.so*' \))
[ "$count" -ge 6 ] || { echo "only $count programs and libraries"; exit 1; }
# What a file doesn't show once it is built.
flags=-fstack-clash-protection
case $(uname -m) in
  x86_64) flags+=' -fcf-protection' ;;
  aarch64) flags+=' -mbranch-protection' ;;
esac
for flag in $flags; do
  ! grep '"command":' "$build/compile_commands.json" | grep -vF -- " $flag" | grep -oE -- '-c [^ "]+' || {
    echo "compiled without $flag"
    failed=1
  }
done
exit $failed
