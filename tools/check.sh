#!/usr/bin/env bash
# Formatting, the manual pages' form, clang-tidy over the release build's commands, and the layering of the rooms.
set -euo pipefail
cd "$(dirname "$0")/.."
sources() { git ls-files -- '*.cpp' '*.h'; }
failed=0

echo "== formatting"
sources | xargs clang-format --dry-run --Werror || failed=1

echo "== manual pages"
tools/check_pages.sh || failed=1

# Which room may include what: the room's folder, then the folders that it must not name. The build
# enforces the same with its include folders; this also sees the system's headers.
echo "== layering"
layering() {
  local folder=$1 forbidden=$2 hits
  hits=$(git ls-files -- "$folder/*.cpp" "$folder/*.h" | grep -vE "${3:-^$}" |
    xargs -r grep -nE "^#include [<\"]($forbidden)" || true)
  [ -z "$hits" ] || { echo "$hits"; failed=1; }
}
libraries='sqlite3|systemd/|expat|md5|uuid|CLI/|nlohmann/|unistd|fcntl|sys/|dlfcn|linux/|poll|signal'
above='host/|device/|NANDInfo/|report/|daemon/|tools/'
layering base "plist/|platform/|$above|$libraries"
layering plist "platform/|$above|${libraries//|expat|md5/}"
layering platform "$above|$libraries"
layering device "host/|platform/testing/|NANDInfo/|report/|daemon/|tools/|$libraries"
layering host 'platform/testing/|NANDInfo/|report/|daemon/|tools/'
layering NANDInfo "host/|platform/testing/|device/|report/|daemon/|tools/|$libraries"
layering report "host/|platform/testing/|NANDInfo/|daemon/|tools/|$libraries"
layering daemon "host/|platform/testing/|tools/|$libraries" '^daemon/main\.cpp$'

echo "== clang-tidy"
cmake --preset release -DMORVEND_TESTS=ON >/dev/null
git ls-files -- '*.cpp' | grep -E '^(base|plist|platform|device|host|NANDInfo|report|daemon|tools)/' |
  xargs -P 2 -n 4 clang-tidy --quiet --extra-arg=-Wno-unknown-warning-option -p build/release 2>/dev/null || failed=1

[ $failed -eq 0 ] && echo "all checks passed"
exit $failed
