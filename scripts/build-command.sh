#!/bin/sh
# SPDX-License-Identifier: MIT
# Brings build/cli/netfloor and build/plugin/libnetfloor.so up to date; silent when they are.
set -eu
top=$(cd "$(dirname "$0")/.." && pwd)
build=$top/build

up_to_date() {
    [ -f "$build/build.ninja" ] && [ -x "$build/cli/netfloor" ] &&
        [ "$(ninja -C "$build" -n netfloor netfloor_command 2>/dev/null | tail -n 1)" = "ninja: no work to do." ]
}
up_to_date && exit 0

"$top/scripts/install-packages.sh" decode
cd "$top"
if [ ! -f "$build/build.ninja" ]; then
    echo "netfloor: configuring in build/" >&2
    log=$(mktemp)
    trap 'rm -f "$log"' EXIT
    cmake --preset release -DNETFLOOR_TESTS=OFF -DNETFLOOR_BENCH=OFF >"$log" 2>&1 || { cat "$log" >&2; exit 1; }
fi
echo "netfloor: building the plug-in and the command, about two minutes the first time" >&2
NINJA_STATUS='netfloor: [%f/%t] ' ninja -C "$build" netfloor netfloor_command >&2
