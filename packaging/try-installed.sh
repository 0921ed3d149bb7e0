#!/bin/sh
# SPDX-License-Identifier: MIT
# Installs a build into a directory of its own, moves the installation, builds the example against it and
# compares what the example prints with what stands beside it. The program has the name of its directory.
#
#   try-installed.sh CMAKE BUILD-DIRECTORY EXAMPLE-DIRECTORY ARGUMENT...
set -eu
cmake=$1
build=$2
example=$3
shift 3
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

"$cmake" --install "$build" --prefix "$work/first" >/dev/null
mv "$work/first" "$work/prefix"
"$cmake" -S "$example" -B "$work/build" -DCMAKE_PREFIX_PATH="$work/prefix" -DCMAKE_BUILD_TYPE=Release >/dev/null
"$cmake" --build "$work/build" >/dev/null
"$work/build/$(basename "$example")" "$@" >"$work/output"
diff "$example/expected.txt" "$work/output"
