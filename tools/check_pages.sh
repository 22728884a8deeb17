#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors
# The manual pages' form, as mandoc sees it, and that the pages of ours that they name are there. A
# page of others may not be installed where this runs.
set -euo pipefail
cd "$(dirname "$0")/../packaging/man"
command -v mandoc >/dev/null || { echo "mandoc is not installed" >&2; exit 1; }
failed=0

complaints=$(mandoc -Tlint ./*.[1-8] | grep -v 'referenced manual not found' || true)
[ -z "$complaints" ] || { echo "$complaints"; failed=1; }

while read -r page section; do
  [ -e "$page.$section" ] || { echo "there is no page $page.$section"; failed=1; }
done < <(sed -nE 's/^\.Xr ((morvend|mkdevice|nandinfo|pelloran)[^ ]*) ([1-8]).*/\1 \3/p' ./*.[1-8])
exit $failed
