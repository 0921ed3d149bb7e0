#!/bin/bash
# SPDX-License-Identifier: MIT
# Counts the instructions of each pass and command over known packets, by callgrind, and compares them with costs.txt: what
# takes half as much again as it did fails. Where that is meant, or what was slow has become fast, the list is made anew.
#
#   tests/cost/check.sh BUILD           compares
#   tests/cost/check.sh BUILD --make    makes costs.txt anew
set -euo pipefail
build=$(realpath "$1")
cd "$(dirname "$0")"
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

# The instructions of one run, or of each run that the program counts by itself: title, tab, number.
totals() {
    awk '/^desc: Trigger: Client Request: / { title = substr($0, 32) } /^totals: / { if (title != "") print title "\t" $2; title = "" }' "$@"
}
valgrind -q --tool=callgrind --instr-atstart=no --callgrind-out-file="$work/pass" \
    "$build/tests/cost/run_passes" "$build/plugin/libnetfloor.so" >"$work/log" 2>&1 || { cat "$work/log" && exit 1; }
# A set of several packets counts as their sum.
totals "$work"/pass.* | awk -F'\t' '{ sum[$1 "\t" $2] += $3 } END { for (name in sum) print name "\t" sum[name] }' >"$work/now"

"$build/tests/cost/run_passes" --capture "$work/packets.pcap"
for command in summary 'detail --all --bits' verify keys 'json --fields'; do
    # shellcheck disable=SC2086
    valgrind --tool=callgrind --callgrind-out-file="$work/command" "$build/cli/netfloor" $command --jobs 1 "$work/packets.pcap" \
        >/dev/null 2>"$work/log" || [ $? -eq 1 ] || { cat "$work/log" && exit 1; }
    printf 'all packets\t%s\t%s\n' "$command" "$(awk '/^(totals|summary): / { print $2; exit }' "$work/command")" >>"$work/now"
done
sort -o "$work/now" "$work/now"

if [ "${2:-}" = --make ]; then
    { echo "# Instructions of a pass or a command; tests/cost/check.sh" && cat "$work/now"; } >costs.txt
    exit
fi
awk -F'\t' '/^#/ { next }
    NR == FNR { known[$1 "\t" $2] = $3; next }
    { name = $1 "\t" $2; now = $3; rows++ }
    !(name in known) { print "not in costs.txt: " name; bad = 1; next }
    now > 1.5 * known[name] { printf "TOO SLOW: %s: %d instructions, known %d\n", name, now, known[name]; bad = 1 }
    1.5 * now < known[name] { printf "faster than known, make costs.txt anew: %s: %d, known %d\n", name, now, known[name] }
    { delete known[name] }
    END { for (name in known) { print "not counted: " name; bad = 1 } print rows " costs"; exit bad }' costs.txt "$work/now"
