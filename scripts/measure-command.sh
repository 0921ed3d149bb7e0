#!/bin/bash
# SPDX-License-Identifier: MIT
# Measures the command and what other programs take for the same capture: CPU time (user and system) of the whole
# program with its output in a file, the fastest of several rounds in which all programs take turns. A peer that is
# missing is named, and its rows are left out.
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

# A function for each program. The name of a peer's begins with that of its program.
one_job=(--jobs 1)
summary() { "$netfloor" summary "${one_job[@]}" "$capture"; }
detail() { "$netfloor" detail "${one_job[@]}" "$capture"; }
verify() { "$netfloor" verify "${one_job[@]}" "$capture"; }
keys() { "$netfloor" keys "${one_job[@]}" "${key_fields[@]/#/--column=}" "$capture"; }
json() { "$netfloor" json "${one_job[@]}" "$capture"; }
jsonFields() { "$netfloor" json --fields "${one_job[@]}" "$capture"; }
database() { rm -f "$folder/database" && "$netfloor" export --to "$folder/database" "$capture"; }
tshark_lines() { tshark -n -r "$capture"; }
tshark_tree() { tshark -n -V -r "$capture"; }
tshark_fields() { tshark -n -T fields "${peer_fields[@]/#/-e}" -r "$capture"; }
tshark_json() { tshark -n -T json -r "$capture"; }
tshark_ek() { tshark -n -T ek -r "$capture"; }
tcpdump_lines() { tcpdump -n -r "$capture"; }

# The rows of the table: what is ours, its peer, and how many times as fast it is to be. A new figure is a function
# above and a line here.
rows=(
    'summary tshark_lines  8'
    'summary tcpdump_lines 3.5'
    'detail  tshark_tree   15'
    'verify  tshark_lines  6'
    'keys    tshark_fields 30'
    'json    tshark_json   15'
    'jsonFields tshark_json 6'
    'database tshark_ek    10'
)

# The same fields; their values agree on packets with one IP header.
peer_fields=(ip.version ip.len ip.id ip.flags.df ip.ttl ip.proto ip.src ip.dst
    tcp.srcport tcp.dstport tcp.flags.syn tcp.flags.fin udp.srcport udp.dstport)
key_fields=(ip.version ip.total_length ip.identification ip.dont_fragment ip.ttl ip.protocol ip.source ip.destination
    tcp.source_port tcp.destination_port tcp.syn tcp.fin udp.source_port udp.destination_port)

is_missing() { # PROGRAM: a peer that is not there
    case $1 in *_*) ! has "${1%%_*}" ;; *) false ;; esac
}

declare -A best # seconds, by program
measure() {     # PROGRAM
    local time status=0
    TIMEFORMAT='%3U %3S'
    rm -f "$folder/out" # to empty what the program before has written takes long
    { time "$1" >"$folder/out" 2>"$folder/err"; } 2>"$folder/time" || status=$?
    # verify ends with 1 when it has found damage.
    if [ $status -gt 1 ] || { [ $status -eq 1 ] && [ "$1" != verify ]; }; then
        say "$1 failed: $(head -n 1 "$folder/err")"
        return 0
    fi
    time=$(awk '{ print $1 + $2 }' "$folder/time")
    best[$1]=$(awk -v new="$time" -v old="${best[$1]:-$time}" 'BEGIN { print new < old ? new : old }')
    [ "$1" != verify ] || packets=$(awk '/^[0-9]+ packets?:/ { print $1 }' "$folder/out")
}

packets=0
programs=$(printf '%s\n' "${rows[@]}" | awk '{ for (i = 1; i < 3; ++i) if (!seen[$i]++) print $i }')
for program in $programs; do
    is_missing "$program" && say "${program%%_*} is missing: $program is left out (scripts/install-packages.sh all)"
done
for ((round = 0; round < rounds; ++round)); do
    for program in $programs; do
        is_missing "$program" || measure "$program"
    done
done

command_of() { # PROGRAM, as a user types it
    declare -f "$1" | sed -n '3s/^ *"$netfloor" \([a-z]*\).*/\1/; 3s/ -r .*//; 3s/ "${peer_fields.*//; 3s/^ *//; 3p'
}
row() { # OURS PEER WANTED
    [ -n "${best[$1]:-}" ] && [ -n "${best[$2]:-}" ] || return 0
    awk -v ours="$1" -v peer="$(command_of "$2")" -v wanted="$3" -v mine="${best[$1]}" -v theirs="${best[$2]}" \
        -v packets="$packets" 'BEGIN {
        mine = mine > 0 ? mine : 0.001
        printf "%-10s %8.3f %6.2f  %-20s %8.3f  %6.1f  %6.1f\n", ours, mine, mine * 1e6 / packets, peer, theirs,
            theirs / mine, wanted }'
}
echo "CPU time of whole programs, $packets packets, the fastest of $rounds rounds"
echo '                 s  us each  peer                        s   ratio  wanted'
for line in "${rows[@]}"; do
    # shellcheck disable=SC2086 # three words
    row $line
done

starts=20
rm -f "$folder/out"
TIMEFORMAT='%3U %3S'
{ time for ((start = 0; start < starts; ++start)); do
    "$netfloor" --count 3 "$capture" >"$folder/out"
done; } 2>"$folder/time"
awk -v starts=$starts '{ printf "a start with three packets: %.1f ms, of %d the mean\n", ($1 + $2) * 1000 / starts, starts }' \
    "$folder/time"

# Threads, and the cutting into shards. The time of a clock says something on a machine that does nothing else.
by_clock() { # NAME COMMAND...: the fastest of the rounds
    local name=$1 round
    shift
    : >"$folder/clock"
    for ((round = 0; round < rounds; ++round)); do
        # 1 is the exit code of verify where it has found damage.
        command time -f '%e %U %S %M' -o "$folder/time" "$@" >"$folder/out" 2>"$folder/err" || [ $? -eq 1 ]
        tail -n 1 "$folder/time" >>"$folder/clock"
    done
    sort -n "$folder/clock" | head -n 1 | awk -v name="$name" -v packets="$packets" \
        -v octets="$(stat -Lc %s "$capture")" '{
        seconds = $1 > 0 ? $1 : 0.01
        printf "%-18s %7.2f  %8.2f  %12.0f  %8.0f  %7.1f\n", name, $1, $2 + $3, packets / seconds, octets / seconds / 1e6,
            $4 / 1024 }'
}
echo
if ! command time -f %e true 2>"$folder/err"; then
    say "GNU time (Debian's time) is missing: threads are left out (scripts/install-packages.sh all)"
    exit 0
fi
echo "Threads and shards on $(nproc) cores, load $(cut -d' ' -f1 /proc/loadavg) before"
echo '                    clock s   CPU s  packets/s     MB/s   peak MiB'
for command in summary keys json verify; do
    for jobs in 1 2; do
        by_clock "$command --jobs $jobs" "$netfloor" $command --jobs $jobs "$capture"
    done
done
by_clock 'plan --shards 64' "$netfloor" plan --shards 64 "$capture"
