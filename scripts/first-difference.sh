#!/bin/bash
# SPDX-License-Identifier: MIT
# For when the known answers fail: builds the plug-in as it was when fuzz/compare/digests.txt was made, and shows the
# first host call in which the one of the build differs.
#
#   scripts/first-difference.sh [BUILD]    BUILD is build, or the folder of another configuration
set -eu
cd "$(dirname "$0")/.."
build=${1:-build}
known=fuzz/compare/digests.txt
commit=$(git log -1 --format=%H -- $known)
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

ninja -C "$build" netfloor compare_plugins >"$work/log" || { tail -n 30 "$work/log"; exit 2; }
echo "first-difference: building the plug-in of $(git log -1 --format='%h, %s' "$commit")"
mkdir "$work/old"
git archive "$commit" | tar -x -C "$work/old"
(
    cmake -S "$work/old" -B "$work/old/build" -G Ninja -DCMAKE_BUILD_TYPE=Release -DNETFLOOR_TESTS=OFF -DNETFLOOR_BENCH=OFF
    ninja -C "$work/old/build" netfloor
) >"$work/log" 2>&1 || { tail -n 30 "$work/log"; exit 2; }

status=0
"$build/fuzz/compare/compare_plugins" "$work/old/build/plugin/libnetfloor.so" "$build/plugin/libnetfloor.so" \
    --packets 40000 || status=$?
case $status in
0) echo "The plug-in does what it did: what it is run on has changed, that is tests/captures or the generator." ;;
1) echo "Where that is meant, make new answers:" ;;
*) exit $status ;;
esac
echo "    $build/fuzz/compare/digests $build/plugin/libnetfloor.so >$known"
exit $status
