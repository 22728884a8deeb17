#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors
# Formatting, the manual pages' form, how the rooms know each other, and clang-tidy, over the release build.
set -euo pipefail
cd "$(dirname "$0")/.."
sources() { git ls-files -- '*.cpp' '*.h'; }
failed=0

echo "== formatting"
sources | xargs clang-format --dry-run --Werror || failed=1

echo "== manual pages"
tools/check_pages.sh || failed=1

echo "== sources"
tools/check_sources.py || failed=1
tools/check_includes.py || failed=1

echo "== rooms"
cmake --preset release -DMORVEND_TESTS=ON >/dev/null
cmake --build --preset release -- --quiet
tools/check_rooms.py build/release || failed=1
# The system's headers stay below the host; plist/ has its libraries to itself.
libraries='sqlite3|systemd/|CLI/|nlohmann/|unistd|fcntl|sys/|dlfcn|linux/|poll|signal|uuid'
hits=$(git ls-files -- {base,plist,platform,device,NANDInfo,report,daemon}/'*.'{cpp,h} |
  xargs grep -nE "^#include <($libraries)"
  git ls-files -- {base,platform,device,NANDInfo,report,daemon}/'*.'{cpp,h} |
    xargs grep -nE "^#include <(expat|md5)") || true
[ -z "$hits" ] || { echo "$hits"; failed=1; }

echo "== clang-tidy"
git ls-files -- '*.cpp' | grep -E '^(base|plist|platform|device|host|NANDInfo|report|daemon|tools)/' |
  xargs -P 2 -n 4 clang-tidy --quiet --extra-arg=-Wno-unknown-warning-option -p build/release 2>/dev/null || failed=1

[ $failed -eq 0 ] && echo "all checks passed"
exit $failed
