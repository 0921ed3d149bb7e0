#!/bin/bash
# SPDX-License-Identifier: MIT
# Builds for llvm-cov, runs all tests, the whole sweep and the fuzz corpora, and prints what they reach: branch sides of
# plugin/, lines of host/, analysis/, capture/ and cli/, and for each what is not reached.
#
#   scripts/coverage.sh [GLOB...]    only these tests, by ctest's names: scripts/coverage.sh 'fuzz\.'
set -eu
cd "$(dirname "$0")/.."
build=build/coverage
profiles=$build/profiles
rm -rf "$profiles"
mkdir -p "$profiles"

cmake --preset coverage -DNETFLOOR_TESTS=ON >/dev/null
if [ $# -eq 0 ]; then
    ninja -C $build | sed '/no work to do/d'
else
    ninja -C $build netfloor digests sweep replay_passes | sed '/no work to do/d'
fi
export LLVM_PROFILE_FILE=$PWD/$profiles/%m-%p.profraw
ctest --test-dir $build --output-on-failure -j 2 ${1:+-R "$(IFS='|' && echo "$*")"} | tail -n 15 || true
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
figures plugin $build/plugin/libnetfloor.so
[ $# -gt 0 ] || for folder in host analysis capture cli; do figures $folder $build/cli/netfloor $build/libhs_HostServices.so; done
echo "not reached, of plugin/: llvm-cov show --show-branches=count --instr-profile=$profiles/all $build/plugin/libnetfloor.so plugin"
