#!/bin/bash
# SPDX-License-Identifier: MIT
# Brings build/cli/netfloor and build/plugin/libnetfloor.so up to date; silent when they are.
set -euo pipefail
cd "$(dirname "$0")/.."

# Who may not write into build/ takes what is there.
if [ -x build/cli/netfloor ] && [ -f build/plugin/libnetfloor.so ] && [ ! -w build/.ninja_log ]; then
    exit 0
fi
if [ ! -f build/build.ninja ] || ! command -v ninja >/dev/null; then
    scripts/install-packages.sh decode
    echo "netfloor: configuring in build/, then building: a few minutes, this once" >&2
    log=$(mktemp)
    trap 'rm -f "$log"' EXIT
    cmake --preset release -DNETFLOOR_TESTS=OFF -DNETFLOOR_BENCH=OFF >"$log" 2>&1 || { cat "$log" >&2; exit 1; }
fi
# Shows ninja's lines, except those that say that there was nothing to do.
NINJA_STATUS='netfloor: [%f/%t] ' ninja -C build netfloor netfloor_command 2>&1 |
    sed -u -e '/Re-checking globbed/d' -e '/no work to do/d' -e '/Entering directory/d' >&2
