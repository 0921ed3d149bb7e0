#!/bin/bash
# SPDX-License-Identifier: MIT
# Builds the plug-in in other ways, and holds each build to the known answers and to the whole sweep; then runs the command
# over the test captures under valgrind. A build that has passed is not done again until the commit changes, so a run that
# was interrupted goes on where it was.
#
#   scripts/check-builds.sh [NAME...]    of the names below; valgrind.
set -uo pipefail
cd "$(dirname "$0")/.." || exit 1

declare -A compilers=([gcc-O0]=g++ [gcc-O3]=g++ [gcc-assertions]=g++ [clang-O0]=clang++ [clang-O2]=clang++
    [clang19-O2]=clang++-19 [memory]=clang++)
declare -A flags=([gcc-O0]=-O0 [gcc-O3]=-O3 [gcc-assertions]='-O2 -D_GLIBCXX_ASSERTIONS' [clang-O0]=-O0 [clang-O2]=-O2
    [clang19-O2]=-O2 [memory]=-O1)
names=${*:-memory gcc-O0 gcc-O3 gcc-assertions clang-O0 clang-O2 clang19-O2 valgrind}
stamps=build/builds
commit=$(git rev-parse HEAD)$(git status --porcelain | sha256sum | cut -c1-12)
mkdir -p $stamps
failed=0

# build NAME [OPTION...]: configures, builds and holds it to the answers.
build() {
    local name=$1 folder=$stamps/$1 programs plugin
    shift
    programs=$folder/fuzz/compare
    plugin=$folder/plugin/libnetfloor.so
    cmake -S . -B "$folder" -G Ninja -DCMAKE_BUILD_TYPE=Debug -DCMAKE_CXX_COMPILER="${compilers[$name]}" \
        -DCMAKE_CXX_FLAGS_DEBUG="${flags[$name]}" -DNETFLOOR_TESTS=ON -DNETFLOOR_BENCH=OFF -DNETFLOOR_COMMAND=OFF \
        -DNETFLOOR_INSTALL=OFF "$@" &&
        ninja -C "$folder" digests sweep &&
        if [ "$name" = memory ]; then plugin=$folder/libnetfloor.so && memory_plugin "$plugin"; fi &&
        "$programs/digests" "$plugin" | cmp - fuzz/compare/digests.txt &&
        "$programs/sweep" "$plugin" --all
}

# The plug-in alone under the memory sanitizer. What the host writes counts as set, as the host and its libraries tell the
# sanitizer nothing: found is what the plug-in itself has not set.
memory_plugin() {
    export MSAN_OPTIONS=poison_in_malloc=0:poison_in_free=0:intercept_memcmp=0:intercept_strlen=0:intercept_strcmp=0:intercept_strstr=0
    clang++ -std=c++20 -O0 -g1 -w -fPIC -shared -fsanitize=memory -DNETFLOOR_SANITIZED -fno-exceptions -fno-rtti \
        -fno-threadsafe-statics -fvisibility=hidden -fconstexpr-steps=1000000000 -fbracket-depth=1024 -Iplugin -Iinclude \
        plugin/entries/*.cpp -Wl,--version-script=plugin/exports.map -o "$1"
}

# Each capture, with the command of the optimised build.
valgrind_captures() {
    local file
    for file in tests/captures/*.pcap*; do
        for command in 'detail --all --bits' verify 'keys --per chunk'; do
            # shellcheck disable=SC2086
            valgrind -q --error-exitcode=99 build/cli/netfloor $command "$file" >/dev/null
            [ $? -ne 99 ] || { echo "valgrind: $command $file"; return 1; }
        done
    done
}

for name in $names; do
    command -v "${compilers[$name]:-valgrind}" >/dev/null || { echo "$name: skipped, there is no ${compilers[$name]}"; continue; }
    [ "$(cat "$stamps/$name.passed" 2>/dev/null)" != "$commit" ] || { echo "$name: passed before"; continue; }
    case $name in
    valgrind) valgrind_captures ;;
    memory) build memory -DCMAKE_C_COMPILER=clang -DCMAKE_EXE_LINKER_FLAGS=-fsanitize=memory ;;
    *) build "$name" ;;
    esac >"$stamps/$name.log" 2>&1
    if [ $? -eq 0 ]; then
        echo "$commit" >"$stamps/$name.passed"
        echo "$name: passed"
    else
        tail -n 30 "$stamps/$name.log"
        echo "FAILED: $name, see $stamps/$name.log"
        failed=1
    fi
done
exit $failed
