#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors
# Whether a library exports what debian/libnandinfo0.symbols lists, no more and no less, and whether the
# header declares those of C. A symbol that is gone breaks programs: it takes another SONAME; one that is
# new takes a line there, with the version that it comes with. Usage: abi.sh LIBRARY HEADER
set -euo pipefail
library=$1 header=$2
symbols=$(dirname "$(readlink -f "$0")")/../../debian/libnandinfo0.symbols
# A version that is a symbol, too, has itself as its version.
exported=$(nm -DC --with-symbol-versions --defined-only "$library" | cut -d' ' -f3- |
  sed -E 's/@@/@/; s/^[^@]*$/&@&/' | sort -u)
patterns=$(sed -nE 's/^ \(c\+\+\|regex\)"(.*)" [0-9.]+$/\1/p' "$symbols")
listed=$(sed -nE 's/^ ([^ (]+@[^ ]+) [0-9.]+$/\1/p' "$symbols" | sort -u)
status=0
diff <(echo "$listed") <(grep -vE "$patterns" <<<"$exported") || status=1
while read -r pattern; do
  grep -qE "$pattern" <<<"$exported" || { echo "nothing is $pattern"; status=1; }
done <<<"$patterns"
diff <(grep -oE '\bnandinfo_[a-z_]+\(' "$header" | tr -d '(' | sort -u) \
  <(sed -n 's/^\(nandinfo_.*\)@.*/\1/p' <<<"$listed") || status=1
exit $status
