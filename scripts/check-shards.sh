#!/bin/bash
# SPDX-License-Identifier: MIT
# Compares the joined outputs of shards with one run, on captures of OCTETS octets at least (default: 1 GiB): a pcap file of one
# capture many times over, and a pcapng file of as many sections.
#
#   scripts/check-shards.sh [OCTETS]
#
# Environment: NETFLOOR, the command (default: build/cli/netfloor).
set -euo pipefail
here=$(cd "$(dirname "$0")/.." && pwd)
netfloor=${NETFLOOR:-$here/build/cli/netfloor}
octets=${1:-$((1 << 30))}
captures=$here/tests/captures
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT

# repeat FILE: the file so often that it has the octets.
repeat() {
    while [ "$(stat -c %s "$1")" -lt "$octets" ]; do
        cat "$1" "$1" >"$folder/twice"
        mv "$folder/twice" "$1"
    done
}

# compare CAPTURE COMMAND...: with 2, 7 and 64 shards.
compare() {
    local capture=$1 whole joined shards shard
    shift
    local totals=--no-totals
    [ "$1" != keys ] || totals=
    whole=$("$netfloor" "$@" $totals "$capture" | sha256sum)
    for shards in 2 7 64; do
        "$netfloor" plan --shards $shards "$capture" >"$folder/plan.json"
        joined=$(for ((shard = 1; shard <= shards; ++shard)); do
            "$netfloor" "$@" --shard "$folder/plan.json:$shard"
        done | sha256sum)
        if [ "$joined" != "$whole" ]; then
            echo "check-shards: $* of $capture differs in $shards shards" >&2
            exit 1
        fi
    done
}

tail -c +25 "$captures/mixed-pppoe-double-vlan.pcap" >"$folder/records"
repeat "$folder/records"
cat <(head -c 24 "$captures/mixed-pppoe-double-vlan.pcap") "$folder/records" >"$folder/large.pcap"
rm "$folder/records"
compare "$folder/large.pcap" keys
rm "$folder/large.pcap"

"$netfloor" --write "$folder/large.pcapng" "$captures"/*.pcap* >/dev/null
repeat "$folder/large.pcapng"
compare "$folder/large.pcapng" summary
