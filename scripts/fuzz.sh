#!/bin/bash
# SPDX-License-Identifier: MIT
# Fuzzes a target and keeps what it learns in build/fuzz-targets/inputs/TARGET, from where the next run goes on. The
# executions of all runs add up in build/fuzz-targets/executions/TARGET.
#
#   scripts/fuzz.sh TARGET [SECONDS]    TARGET is passes, capture or command; SECONDS is 600
#   scripts/fuzz.sh TARGET pack         fuzz/corpus/TARGET.tar.gz becomes the fewest inputs that reach all that was learned
#
# The exit code is not 0 when there was a finding. Its input is in build/fuzz-targets/findings; replay_TARGET FILE
# repeats it, in any build.
set -eu
cd "$(dirname "$0")/.."
target=${1:?passes, capture or command}
build=build/fuzz-targets
inputs=$build/inputs/$target
findings=$build/findings
executions=$build/executions/$target
programs=$build/fuzz/targets
packed=fuzz/corpus/$target.tar.gz
# Octets of 0 in front of a packet: an ordinary host, or no options. The plug-in allocates nothing that could leak.
head=0 leaks=1
case $target in passes) head=12 leaks=0 ;; command) head=4 ;; esac

cmake --preset fuzz -DNETFLOOR_TESTS=ON >/dev/null
ninja -C $build "fuzz_$target" "replay_$target" write_packets | sed '/no work to do/d'
mkdir -p "$inputs" "$findings" "$build/executions"

# pack: the fewest inputs
if [ "${2:-}" = pack ]; then
    fewest=$(mktemp -d)
    trap 'rm -rf "$fewest"' EXIT
    "$programs/fuzz_$target" -merge=1 "$fewest" "$inputs" 2>&1 | grep -E 'MERGE-OUTER: .* (new files|inputs)' || true
    # The same octets for the same inputs.
    tar --sort=name --owner=0 --group=0 --numeric-owner --mtime=@0 --mode=a=rX,u+w -C "$fewest" -cf - . | gzip -9n >"$packed"
    echo "fuzz: $packed has $(find "$fewest" -type f | wc -l) inputs, $(stat -c %s "$packed") octets"
    exit
fi

# seeds: what is known, and the captures
[ ! -f "$packed" ] || tar -xzf "$packed" -C "$inputs"
if [ "$target" = capture ]; then
    cp tests/captures/*.pcap* "$inputs"
else
    packets=$(mktemp -d)
    trap 'rm -rf "$packets"' EXIT
    $build/tests/golden/write_packets "$packets" tests/captures/*.pcap*
    for packet in "$packets"/*; do
        { head -c $head /dev/zero && cat "$packet"; } >"$inputs/captured-${packet##*/}"
    done
fi

# A short history of allocations: with a long one, each takes longer, and memory is read anew.
export ASAN_OPTIONS=malloc_context_size=1:quarantine_size_mb=16
# -entropic=0: that schedule takes three quarters of the time, for the many edges that a grammar in templates has.
status=0
"$programs/fuzz_$target" -entropic=0 -max_total_time="${2:-600}" -max_len=1500 -timeout=20 -rss_limit_mb=2048 -print_final_stats=1 \
    -detect_leaks=$leaks -artifact_prefix="$findings/$target-" "$inputs" 2>&1 | tee "$build/$target.log" |
    grep -vE 'NEW  |REDUCE|pulse|RELOAD' || true
! grep -qE 'FAULT|ERROR: |SUMMARY: ' "$build/$target.log" || status=1

sed -n 's/^stat::number_of_executed_units: *//p' "$build/$target.log" >>"$executions"
echo "fuzz: $(awk '{ all += $1 } END { print all + 0 }' "$executions") executions of $target in $(wc -l <"$executions") runs"
exit $status
