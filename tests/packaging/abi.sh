#!/bin/sh
# SPDX-License-Identifier: MIT
# The boundary is as it was published: packaging/netfloor.abi has each record, export and operation. A change of them
# needs another NETFLOOR_BOUNDARY_ABI.
#
#   abi.sh CC INCLUDE PUBLISHED            compares
#   abi.sh CC INCLUDE PUBLISHED --publish  writes PUBLISHED anew
set -eu
cc=$1
include=$2
published=$3
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
command -v abidiff >/dev/null || { echo "abidiff is missing (abigail-tools)"; exit 77; }

# The plug-in has no debug information, so that its types come from the headers.
{
    for header in "$include"/netfloor/*.h; do echo "#include <netfloor/${header##*/}>"; done
    echo 'int netfloorBoundaryNumber[NETFLOOR_BOUNDARY_ABI];'
    # Also the records that are reached by untyped pointers alone.
    sed -n 's/^} \([A-Za-z]*\);$/\1 netfloorRecord\1;/p' "$include"/netfloor/*.h
    # Each declared function, with a body.
    cat "$include"/netfloor/*.h | tr '\n' ' ' | grep -o '[a-z0-9_]*[ *]*NETFLOOR_CDECL [A-Za-z_]*([^)]*);' | sed 's/;$/ { for (;;) {} }/'
} >"$work/boundary.c"
include=$(cd "$include" && pwd)
# In its own folder, so that the description has no other path.
(cd "$work" && "$cc" -std=c11 -g -w -fPIC -shared -I"$include" -o libboundary.so boundary.c)

describe() { abidw --no-corpus-path --no-comp-dir-path --no-show-locs --out-file "$1" "$work/libboundary.so"; }
if [ "${4:-}" = --publish ]; then
    describe "$published"
    exit 0
fi
describe "$work/now.abi"
abidiff "$published" "$work/now.abi" || {
    echo "The boundary is another one: raise NETFLOOR_BOUNDARY_ABI, and run $0 with --publish at the end."
    exit 1
}
