#!/bin/bash
# SPDX-License-Identifier: MIT
# Builds for llvm-cov, runs tests, the whole sweep and the fuzz corpora, and prints what they reach: branch sides of
# plugin/, lines of host/, analysis/, capture/ and cli/. Of plugin/ it names each side that is not reached, but those that
# tests/coverage/explained.txt explains, and fails where they are too many.
#
#   scripts/coverage.sh              all tests
#   scripts/coverage.sh plugin       those of the plug-in alone, without building host library tests and command
#   scripts/coverage.sh GLOB...      only these tests, by ctest's names: scripts/coverage.sh 'fuzz\.'
set -euo pipefail
cd "$(dirname "$0")/.."
build=build/coverage
profiles=$build/profiles
least=100 # of a hundred branch sides of plugin/, reached or explained
rm -rf "$profiles"
mkdir -p "$profiles"

cmake --preset coverage -DNETFLOOR_TESTS=ON >/dev/null
programs=(netfloor digests sweep replay_passes)
case "${1:-}" in
'') programs=() ;;
plugin)
    names=(frame ipv4 ipv6 icmp sctp transport tunnels tables)
    programs+=("${names[@]/#/test_}")
    set -- "${names[@]/%/\\.}" 'fuzz\.(digests|sweep|passes)$'
    ;;
esac
ninja -C $build "${programs[@]}" | sed '/no work to do/d'
export LLVM_PROFILE_FILE=$PWD/$profiles/%m-%p.profraw
ctest --test-dir $build --output-on-failure -j 2 ${1:+-R "^($(IFS='|' && echo "$*"))"} | tail -n 15 || true
llvm-profdata merge -sparse "$profiles"/*.profraw -o "$profiles/all"

# The figures of one folder, over the objects that hold its code.
figures() { # FOLDER OBJECT...
    local folder=$1 object=$2
    shift 2
    llvm-cov export --summary-only --instr-profile="$profiles/all" "$object" "${@/#/-object=}" "$folder" |
        grep -o '"totals":.*' |
        sed -E 's/.*"branches":\{"count":([0-9]+),"covered":([0-9]+).*"lines":\{"count":([0-9]+),"covered":([0-9]+).*/\1 \2 \3 \4/' |
        awk -v folder="$folder" '{ printf "%-8s branch sides %d of %d (%.1f %%), lines %d of %d (%.1f %%)\n",
            folder, $2, $1, 100 * $2 / ($1 ? $1 : 1), $4, $3, 100 * $4 / ($3 ? $3 : 1) }'
}
[ $# -gt 0 ] || for folder in host analysis capture cli; do figures $folder $build/cli/netfloor $build/libhs_HostServices.so; done
llvm-cov export --instr-profile="$profiles/all" $build/plugin/libnetfloor.so plugin |
    tests/coverage/branch_sides.py plugin tests/coverage/explained.txt $least
