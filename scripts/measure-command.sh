#!/bin/bash
# SPDX-License-Identifier: MIT
# Measures the command and what other programs take for the same capture: CPU time (user and system) of the whole
# program with its output in a file, the fastest of several rounds in which all programs take turns.
#
#   scripts/measure-command.sh [CAPTURE]
#
# Without a capture, the Ethernet ones of tests/captures are repeated until there are 200,000 packets. Environment:
# NETFLOOR, the command (default: build/cli/netfloor); ROUNDS (default: 3).
set -eu
export LC_ALL=C
here=$(cd "$(dirname "$0")/.." && pwd)
netfloor=${NETFLOOR:-$here/build/cli/netfloor}
rounds=${ROUNDS:-3}
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT

has() { command -v "$1" >/dev/null 2>&1; }
say() { echo "measure-command: $*" >&2; }

[ -x "$netfloor" ] || { say "there is no $netfloor: build it first, or name it by NETFLOOR"; exit 1; }

repeat_captures() {
    if ! has mergecap || ! has editcap || ! has capinfos; then
        say "mergecap, editcap and capinfos (Debian's wireshark-common) are missing: name a capture"
        exit 1
    fi
    local file packets wanted=200000 copies=()
    for file in "$here"/tests/captures/*.pcap*; do
        if capinfos -E "$file" 2>/dev/null | grep -q 'encapsulation: *Ethernet'; then
            editcap -F pcap "$file" "$folder/$(basename "$file").part"
        fi
    done
    mergecap -F pcap -a -w "$folder/once" "$folder"/*.part
    packets=$(capinfos -Mc "$folder/once" | awk '/Number of packets/ { print $NF }')
    while [ $((${#copies[@]} * packets)) -lt $wanted ]; do copies+=("$folder/once"); done
    mergecap -F pcap -a -w "$folder/capture" "${copies[@]}"
}

if [ $# -gt 0 ]; then
    capture=$1
    [ -r "$capture" ] || { say "$capture cannot be read"; exit 1; }
else
    repeat_captures
    capture=$folder/capture
fi

# The same fields; their values agree on packets with one IP header.
peer_fields=(ip.version ip.len ip.id ip.flags.df ip.ttl ip.proto ip.src ip.dst
    tcp.srcport tcp.dstport tcp.flags.syn tcp.flags.fin udp.srcport udp.dstport)
key_fields=(ip.version ip.total_length ip.identification ip.dont_fragment ip.ttl ip.protocol ip.source ip.destination
    tcp.source_port tcp.destination_port tcp.syn tcp.fin udp.source_port udp.destination_port)

declare -A best # seconds, by the name of the program
measure() {     # NAME COMMAND...
    local name=$1 time status=0
    shift
    has "$1" || return 0
    TIMEFORMAT='%3U %3S'
    { time "$@" >"$folder/out" 2>"$folder/err"; } 2>"$folder/time" || status=$?
    # verify ends with 1 when it has found damage.
    if [ $status -gt 1 ] || { [ $status -eq 1 ] && [ "$name" != verify ]; }; then
        say "'$*' failed: $(head -n 1 "$folder/err")"
        return 0
    fi
    time=$(awk '{ print $1 + $2 }' "$folder/time")
    best[$name]=$(awk -v new="$time" -v old="${best[$name]:-$time}" 'BEGIN { print new < old ? new : old }')
}

for peer in tshark tcpdump; do
    has $peer || say "$peer is missing: its figures are left out (scripts/install-packages.sh all)"
done
for ((round = 0; round < rounds; ++round)); do
    measure 'tshark -n -V' tshark -n -V -r "$capture"
    measure detail "$netfloor" detail "$capture"
    measure 'tshark -n' tshark -n -r "$capture"
    measure summary "$netfloor" summary "$capture"
    measure 'tcpdump -n' tcpdump -n -r "$capture"
    measure verify "$netfloor" verify "$capture"
    measure 'tshark -n -T fields' tshark -n -T fields "${peer_fields[@]/#/-e}" -r "$capture"
    measure keys "$netfloor" keys "${key_fields[@]/#/--column=}" "$capture"
    measure 'a start' "$netfloor" --count 3 "$capture"
done

row() { # OURS PEER WANTED
    [ -n "${best[$1]:-}" ] && [ -n "${best[$2]:-}" ] || return 0
    awk -v ours="$1" -v peer="$2" -v wanted="$3" -v mine="${best[$1]}" -v theirs="${best[$2]}" 'BEGIN {
        printf "%-8s %7.3f  %-20s %7.3f  %5.1f  %5.1f\n", ours, mine, peer, theirs, theirs / (mine > 0 ? mine : 0.001), wanted }'
}
echo 'CPU seconds               peer                  ratio  wanted'
row detail 'tshark -n -V' 15
row summary 'tshark -n' 8
row summary 'tcpdump -n' 3.5
row keys 'tshark -n -T fields' 30
row verify 'tshark -n' 6
echo "three packets: ${best[a start]:-?} s"
