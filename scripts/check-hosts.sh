#!/bin/bash
# SPDX-License-Identifier: MIT
# Builds the plug-in and the host for the machines that hosts run on, runs their tests there, and compares what the
# plug-in does with every packet of the test captures on all of them. Ends with a line that counts what passed and what
# failed. A machine that cannot be had is named and skipped.
#
#   scripts/check-hosts.sh [PRESET...]    linux-i686 windows-x86_64 windows-i686 linux-s390x
set -uo pipefail
cd "$(dirname "$0")/.." || exit 1
presets=${*:-linux-i686 windows-x86_64 windows-i686 linux-s390x}
passed=0
failed=0
skipped=0
wine32_is_missing=
wine_runs=
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

say() { printf '== %s\n' "$*"; }

# verdict NAME STATUS: counts one check.
verdict() {
    if [ "$2" -eq 0 ]; then
        passed=$((passed + 1))
    else
        failed=$((failed + 1))
        echo "FAILED: $1"
    fi
}

# One line for each tenth of a build, so that one sees what it is at.
progress() {
    awk -F'[][/]' '/^\[[0-9]+\/[0-9]+\]/ {
        if (int(10 * $2 / $3) != tenth) { tenth = int(10 * $2 / $3); print "   " $0; fflush() }
    }'
}

# build PRESET TARGET...: configures and builds; the output is shown when it fails.
build() {
    local preset=$1 folder=build/hosts/$1
    [ "$preset" != release ] || folder=build
    shift
    say "building: $preset"
    if cmake --preset "$preset" -DNETFLOOR_TESTS=ON >"$work/log" 2>&1 &&
        cmake --build "$folder" --target "$@" 2>&1 | tee -a "$work/log" | progress; then
        return 0
    fi
    tail -n 60 "$work/log"
    verdict "build $preset" 1
    return 1
}

# Wine's 32-bit half. Debian's package of it cannot be installed beside the 64-bit one here, so that its file is fetched
# with package lists of its own, and unpacked. Fails where that is not possible.
fetch_wine32() {
    local to=build/hosts/wine32 state=$work/apt options
    [ -d "$to/i386-windows" ] && return 0
    say "fetching the 32-bit half of wine"
    mkdir -p "$state/lists/partial" "$state/cache/archives/partial"
    options="-o APT::Architecture=i386 -o APT::Architectures::=i386 -o Dir::State=$state -o Dir::State::lists=$state/lists
        -o Dir::Cache=$state/cache -o Dir::State::status=/dev/null -o APT::Sandbox::User=root"
    # shellcheck disable=SC2086
    (
        apt-get $options update
        cd "$work" && apt-get $options download libwine && dpkg-deb -x libwine_*_i386.deb wine32
    ) >"$work/log" 2>&1
    [ -d "$work/wine32/usr/lib/i386-linux-gnu/wine/i386-windows" ] || return 1
    rm -rf "$to" build/hosts/wine && mkdir -p "$to" && mv "$work/wine32/usr/lib/i386-linux-gnu/wine/i386-windows" "$to/"
}

# Makes wine's own files, and keeps its server: tests that start side by side would each make them, and one that starts
# while the server ends finds no folder of it.
start_wine() {
    [ -z "$wine_runs" ] || return 0
    wine_runs=1
    mkdir -p build/hosts/wine
    WINEPREFIX=$PWD/build/hosts/wine /usr/lib/wine/wineserver64 -p60
    timeout 120 scripts/run-with-wine.sh wineboot --init >"$work/log" 2>&1 && return 0
    tail -n 5 "$work/log"
    verdict "start of wine" 1
}

# The names of tests that ended in one state, from ctest's JUnit file.
tests_in_state() { grep -c "<testcase .*status=\"$1\"" "$work/tests.xml"; }

run_tests() {
    say "testing: $1"
    rm -f "$work/tests.xml"
    ctest --preset "$1" --timeout 120 --no-tests=error --output-junit "$work/tests.xml" >"$work/log" 2>&1
    local status=$?
    [ $status -eq 0 ] || grep -vE '^ *(Start|[0-9]+/[0-9]+ Test .* Passed)' "$work/log" | tail -n 100
    if [ ! -s "$work/tests.xml" ]; then
        verdict "tests $1" 1
        return
    fi
    passed=$((passed + $(tests_in_state run)))
    failed=$((failed + $(tests_in_state fail)))
    skipped=$((skipped + $(tests_in_state notrun) + $(tests_in_state disabled)))
}

# golden PRESET COMMAND...: compares with this machine.
golden() {
    local preset=$1
    shift
    say "comparing: $preset"
    "$@" "$work/packets" 2>"$work/log" | tr -d '\r' >"$work/$preset.txt"
    if ! cmp -s "$work/release.txt" "$work/$preset.txt"; then
        tail -n 5 "$work/log"
        diff "$work/release.txt" "$work/$preset.txt" | head -n 6
        verdict "golden $preset" 1
        return
    fi
    echo "   $(wc -l <"$work/$preset.txt") packets in four passes: the same"
    verdict "golden $preset" 0
}

say "packages"
scripts/install-packages.sh hosts || exit 1

build release golden write_packets || exit 1
build/tests/golden/write_packets "$work/packets" tests/captures/*.pcap* &&
    build/tests/golden/golden "$work/packets" >"$work/release.txt"
verdict "golden release" $?

# Before wine's own files are made, which depend on it.
case $presets in
*windows*) fetch_wine32 || wine32_is_missing=1 ;;
esac
for preset in $presets; do
    run=()
    targets=(all golden)
    case $preset in
    windows-i686)
        if [ -n "$wine32_is_missing" ]; then
            echo "SKIPPED: $preset: the 32-bit half of wine cannot be fetched"
            skipped=$((skipped + 1))
            continue
        fi
        run=(scripts/run-with-wine.sh)
        ;;
    windows-x86_64) run=(scripts/run-with-wine.sh) ;;
    linux-s390x) # what reads packets is compared; the emulator takes long for the tests
        run=(qemu-s390x -L /usr/s390x-linux-gnu)
        targets=(golden)
        ;;
    esac
    build "$preset" "${targets[@]}" || continue
    case $preset in windows*) start_wine ;; esac
    [ "$preset" = linux-s390x ] || run_tests "$preset"
    program=build/hosts/$preset/tests/golden/golden
    [ -e "$program" ] || program=build/hosts/$preset/bin/golden.exe
    golden "$preset" "${run[@]}" "$program"
done

[ $skipped -eq 0 ] || echo "$skipped skipped"
echo "$passed passed, $failed failed"
[ $failed -eq 0 ]
