#!/bin/bash
# SPDX-License-Identifier: MIT
# Makes the Debian packages of the build in $1 (default: build), and installs them in a bare Debian 12 in a directory of
# its own: the command decodes a capture, a program is compiled against the development files and run, and removing the
# packages leaves nothing. It needs root, debootstrap and the network.
set -euo pipefail
cd "$(dirname "$0")/.."
top=$PWD
build=$(realpath "${1:-build}")
mirror=${MIRROR:-http://deb.debian.org/debian}
work=$(mktemp -d)
root=$work/root
cleanup() {
    mountpoint -q "$root/proc" && umount "$root/proc"
    rm -rf "$work"
}
trap cleanup EXIT

[ "$(id -u)" -eq 0 ] || { echo "try-packages: only root can set up another system" >&2; exit 77; }
command -v debootstrap >/dev/null || { echo "try-packages: debootstrap is missing" >&2; exit 77; }

(cd "$build" && cpack -G DEB -B "$work/packages" >"$work/log" 2>&1) || { cat "$work/log" >&2; exit 1; }
ls "$work"/packages/*.deb

debootstrap --variant=minbase bookworm "$root" "$mirror" >"$work/log" 2>&1 || { tail "$work/log" >&2; exit 1; }
mount -t proc proc "$root/proc" 2>/dev/null || true
in_root() { chroot "$root" env DEBIAN_FRONTEND=noninteractive LC_ALL=C PATH=/usr/sbin:/usr/bin:/sbin:/bin "$@"; }
install() { in_root apt-get install -y -q --no-install-recommends "$@" >"$work/log" 2>&1 || { tail "$work/log" >&2; exit 1; }; }

cp "$work"/packages/*.deb "$top/tests/captures/tunnel-ipip-udp.pcap" "$root/tmp/"

echo "the command alone"
install $(cd "$root/tmp" && for deb in libnetfloor_*.deb netfloor_*.deb; do echo "/tmp/$deb"; done)
in_root netfloor /tmp/tunnel-ipip-udp.pcap >"$work/lines"
[ -s "$work/lines" ]
in_root test -s /usr/share/man/man1/netfloor.1 || in_root test -s /usr/share/man/man1/netfloor.1.gz

echo "a program with the development files"
install $(cd "$root/tmp" && for deb in libnetfloor-dev_*.deb; do echo "/tmp/$deb"; done) g++ cmake make pkg-config
for example in decode_packet c_host; do
    cp -R "$top/examples/$example" "$root/tmp/"
    in_root cmake -S "/tmp/$example" -B "/tmp/build-$example" >"$work/log" 2>&1 || { tail "$work/log" >&2; exit 1; }
    in_root cmake --build "/tmp/build-$example" >"$work/log" 2>&1 || { tail "$work/log" >&2; exit 1; }
    in_root "/tmp/build-$example/$example" | diff "$top/examples/$example/expected.txt" -
done
in_root sh -c 'g++ -std=c++20 $(pkg-config --cflags netfloor-host) -DPLUGIN_PATH="\"$(pkg-config --variable=plugin netfloor-host)\"" /tmp/decode_packet/main.cpp $(pkg-config --libs netfloor-host) -o /tmp/by-pkg-config'
in_root /tmp/by-pkg-config | diff "$top/examples/decode_packet/expected.txt" -
cp -R "$top/examples/read_columns" "$top/tests/captures/icmp-types.pcapng" "$root/tmp/"
in_root sh -c 'g++ -std=c++20 -DPLUGIN_PATH="\"$(pkg-config --variable=plugin netfloor-columns)\"" $(pkg-config --cflags netfloor-columns) /tmp/read_columns/main.cpp $(pkg-config --libs netfloor-columns) -o /tmp/columns-by-pkg-config'
in_root /tmp/columns-by-pkg-config /tmp/icmp-types.pcapng | diff "$top/examples/read_columns/expected.txt" -

echo "removal"
in_root apt-get purge -y -q netfloor libnetfloor libnetfloor-dev >"$work/log" 2>&1
left=$(in_root find /usr /etc -name '*netfloor*' -o -name 'libh[sdx]_*')
[ -z "$left" ] || { echo "left: $left"; exit 1; }
echo "the packages install, work and go"
