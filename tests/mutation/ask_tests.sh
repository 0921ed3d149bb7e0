#!/bin/bash
# SPDX-License-Identifier: MIT
# Says which test program notices a change of a file of the plug-in, as `NUMBER<tab>PROGRAM`; nothing if none does. A test
# that does not end has noticed it. Those of the file's protocol are asked first; the frame is tested by all of them.
#
#   tests/mutation/ask_tests.sh BUILD NUMBER FILE    number -1 is no change
#
# In the environment: NETFLOOR_TEST_PLUGIN, the plug-in with the changes, and next to it test_bits, which has them inside.
build=$1 number=$2 file=$3
programs=(frame ipv4 ipv6 icmp sctp transport tunnels)
room=${file%%/*}
[[ $room = frame || " ${programs[*]} " != *" $room "* ]] || programs=("$room" frame)
[[ $file != frame/bit* && $file != frame/field_record.h ]] || programs=(bits "${programs[@]}")

# Without those that need many seconds, or a stack for which this plug-in is not optimised.
ulimit -t 20 # seconds of CPU for a program, of which none takes two without a change
filter='-*SmallStack:*.smallStack:*.ofAllPorts'
for name in "${programs[@]}"; do
    program=$build/tests/test_$name
    [ "$name" != bits ] || program=$(dirname "$NETFLOOR_TEST_PLUGIN")/test_bits
    if ! NETFLOOR_MUTANT=$number "$program" --gtest_brief=1 --gtest_fail_fast --gtest_filter="$filter"; then
        printf '%s\t%s\n' "$number" "$name" >&3
        exit
    fi
done 3>&1 >/dev/null 2>&1
