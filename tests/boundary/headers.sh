#!/bin/sh
# SPDX-License-Identifier: MIT
# Each public header compiles alone, as C11 and as C++20, without a warning; and a 32-bit C compiler
# finds the record sizes that the headers assert.
set -eu
include=$1
warnings="-Wall -Wextra -Wpedantic -Wshadow -Wconversion -Werror"

seen=0
for header in "$include"/netfloor/*.h; do
    seen=$((seen + 1))
    line="#include <netfloor/${header##*/}>"
    echo "$line" | "${CC:-cc}" -x c -std=c11 $warnings -I"$include" -fsyntax-only -
    echo "$line" | "${CXX:-c++}" -x c++ -std=c++20 $warnings -I"$include" -fsyntax-only -
    echo "$line" | "${CC:-cc}" -x c -std=c11 -m32 -ffreestanding $warnings -I"$include" -fsyntax-only -
done
[ "$seen" -ge 3 ] || { echo "no headers in $include/netfloor" >&2; exit 1; }
