#!/bin/bash
# SPDX-License-Identifier: MIT
# Changes the plug-in in some two thousand places, one at a time, and counts the changes that are noticed: by the known
# answers, else by the tests of the frame and of the protocol. Names each that is not noticed, but those of which
# tests/mutation/explained.txt says why. Fails where they are too many, and where it is said of a change that is noticed.
# All changes are compiled into one plug-in, and one is chosen at run time.
#
#   scripts/mutants.sh [EVERY [PACKETS]]    each EVERY-th change, 1, with the answers of so many packets, 4096
#
# While it runs, build/mutants/report has what the answers do not notice, and build/mutants/noticed which of it tests do.
set -euo pipefail
cd "$(dirname "$0")/.."
build=${NETFLOOR_BUILD:-build}
work=build/mutants
least=92 # of a hundred changes
compile=(clang++ -std=c++20 -O0 -w -fPIC -fno-exceptions -fno-rtti -fno-threadsafe-statics -fvisibility=hidden
    -DNETFLOOR_SANITIZED "-I$work/plugin" -Iinclude -Itests/mutation -c)
sources=$(cat plugin/*/*.h plugin/*/*.cpp include/netfloor/*.h tests/mutation/{rewrite.py,mutant.h} | sha256sum)

ninja -C "$build" netfloor netfloor_mutants run_mutants test_{frame,ipv4,ipv6,icmp,sctp,transport,tunnels} | sed '/no work to do/d'
if [ "$(cat $work/sources 2>/dev/null)" != "$sources" ]; then
    rm -rf $work
    mkdir -p $work
    /usr/bin/python3 tests/mutation/rewrite.py plugin include $work/plugin
    printf '%s\0' md to mv xtr date_conv descriptors | xargs -0 -P 2 -I{} \
        "${compile[@]}" -fconstexpr-steps=1000000000 -fbracket-depth=1024 $work/plugin/entries/{}.cpp -o $work/{}.o
    clang -shared -Wl,--version-script=plugin/exports.map -o $work/libnetfloor.so $work/*.o \
        -L"$build/tests/mutation" -lnetfloor_mutants -L"$build" -lhs_HostServices -lhd_HostDispatch -lhx_KeyOptions -Wl,-rpath,"$PWD/$build/tests/mutation:$PWD/$build"
    objcopy --dump-section mutants=$work/present $work/libnetfloor.so
    echo "$sources" >$work/sources
fi
# With the changed readers of bits inside; the others load the changed plug-in.
if [ ! $work/test_bits -nt tests/bits/bits_test.cpp ]; then
    clang++ -std=c++20 -O1 -w -DNETFLOOR_SANITIZED -fconstexpr-steps=1000000000 -fbracket-depth=1024 "-I$work/plugin" -Iinclude \
        -Itests/mutation -Itests tests/bits/bits_test.cpp -o $work/test_bits -lgtest_main -lgtest \
        -L"$build/tests/mutation" -lnetfloor_mutants -Wl,-rpath,"$PWD/$build/tests/mutation"
fi

export NETFLOOR_TEST_PLUGIN=$PWD/$work/libnetfloor.so
unchanged=$(tests/mutation/ask_tests.sh "$build" -1 frame/bits.h)
[ -z "$unchanged" ] || { echo "without a change, a test fails: $unchanged" && exit 2; }

"$build/tests/mutation/run_mutants" $work/libnetfloor.so fuzz/compare/digests.txt $work/plugin/mutants.txt $work/present \
    "${1:-1}" "${2:-4096}" >$work/report
awk -F'\t' '/^(not noticed|never run)/ { sub(/:.*/, "", $3); print $2, $3 }' $work/report |
    xargs -r -P 2 -L 1 tests/mutation/ask_tests.sh "$build" >$work/noticed

# Of a mutant the number changes with the code: its file, its function, its change and its text say which it is.
awk -F'\t' -v least=$least -v every="${1:-1}" '
    FILENAME ~ /noticed$/ { tests[$1] = 1; next }
    FILENAME ~ /functions.txt$/ { function_of[$1] = $2; next }
    FILENAME ~ /explained.txt$/ { if ($0 !~ /^#/) explained[$1 "\t" $2 "\t" $3 "\t" $4] = 1; next }
    NF == 1 { split($0, words, " "); all = words[1]; print; next }
    ($2 in tests) { by_tests++; next }
    { place = $3; sub(/:[0-9]+$/, "", place); key = place "\t" function_of[$2] "\t" $4 "\t" $5 }
    (key in explained) { known++; used[key] = 1; next }
    { open++; print $0 "\tin " function_of[$2] }
    END {
        if (every == 1) {
            for (key in explained) {
                if (!(key in used)) {
                    print "explained, but noticed or no such change\t" key
                    needless++
                }
            }
        }
        share = 100 * (all - open) / all
        printf "%d more noticed by tests, %d explained, %d open: %.1f %% noticed or explained, %d wanted\n", by_tests, known, open, share, least
        exit share < least || needless > 0
    }' $work/noticed $work/plugin/functions.txt tests/mutation/explained.txt $work/report
