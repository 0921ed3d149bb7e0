#!/bin/sh
# SPDX-License-Identifier: MIT
# Installs a build into a directory of its own, moves the installation, builds each example against it and
# compares what the example prints with what stands beside it.
#
#   try-installed.sh CMAKE BUILD-DIRECTORY EXAMPLES-DIRECTORY
set -eu
cmake=$1
build=$2
examples=$3
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

"$cmake" --install "$build" --prefix "$work/first" >/dev/null
mv "$work/first" "$work/prefix"
for example in "$examples"/*/; do
    name=$(basename "$example")
    "$cmake" -S "$example" -B "$work/$name" -DCMAKE_PREFIX_PATH="$work/prefix" -DCMAKE_BUILD_TYPE=Release >/dev/null
    "$cmake" --build "$work/$name" >/dev/null
    "$work/$name/$name" >"$work/output"
    diff "$example/expected.txt" "$work/output"
done
