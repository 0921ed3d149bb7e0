#!/bin/sh
# SPDX-License-Identifier: MIT
# Checks that octets of the packet are read in bits.h, field_record.h and bit_order.h alone, which tests/bits goes
# through as a whole. Everywhere else the address of the packet is only passed on. Names each line that computes an
# address in the packet or reads from it, and fails.
set -eu
cd "$(dirname "$0")/../plugin"

address='([A-Za-z_]+(\.|->))*(data|sourceData)'
read="\\b$address *(\\[|\\+|-[^>])|(return |[(=,] *)\\*$address\\b|mem(cpy|cmp|move|set|chr)\\([^;]*\\b$address\\b[^(]"
broken=$(grep -rnE --include='*.h' --include='*.cpp' "$read" . |
    sed 's|^\./||' | grep -vE '^frame/(bits|field_record|bit_order)\.h:') || true
[ -z "$broken" ] && exit 0
echo "$broken"
echo "Read by what frame/bits.h has, or add a reader there and its test to tests/bits."
exit 1
