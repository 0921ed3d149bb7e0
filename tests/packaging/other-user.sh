#!/bin/sh
# SPDX-License-Identifier: MIT
# ./netfloor runs the command that is there also for a user who may not write into the build tree.
#
#   other-user.sh SOURCES BUILD
set -eu
sources=$1
build=$2
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

mkdir -p "$work/scripts" "$work/build"
cp "$sources/netfloor" "$work/"
cp "$sources"/scripts/*.sh "$work/scripts/"
cp -R "$build/cli" "$build/plugin" "$build"/lib*.so "$build/build.ninja" "$build/.ninja_log" "$work/build/"
# The links of the build tree, to the copies.
(cd "$build" && find . -maxdepth 3 -name debug -prune -o -type l -print) | while read -r link; do
    mkdir -p "$work/build/$(dirname "$link")"
    ln -sf "$work/build/$(realpath --relative-to="$build" "$build/$link")" "$work/build/$link"
done
cp "$sources/tests/captures/tunnel-ipip-udp.pcap" "$work/capture"
chmod -R a+rX,a-w "$work"
chmod u+w "$work"

as_other=
if [ "$(id -u)" -eq 0 ]; then
    command -v setpriv >/dev/null || { echo "there is no setpriv to become another user with"; exit 77; }
    as_other="setpriv --reuid=65534 --regid=65534 --clear-groups"
fi
$as_other "$work/netfloor" "$work/capture" >"$work.out" 2>&1 && status=0 || status=$?
cat "$work.out"
chmod -R u+w "$work"
[ "$status" -eq 0 ] && grep -q ' 1  ' "$work.out" || status=1
rm -f "$work.out"
exit $status
