#!/bin/sh
# SPDX-License-Identifier: MIT
# Builds the example as a user of netfloor does, and compares its output with expected.txt in its directory.
#
#   try-example.sh CMAKE EXAMPLE installed BUILD-DIRECTORY ARGUMENT...     against an installation, which was moved
#   try-example.sh CMAKE EXAMPLE sources SOURCE-DIRECTORY ARGUMENT...      with netfloor as a part of its own build
#
# EXAMPLE is a directory, and its program has the same name. It gets the arguments.
set -eu
cmake=$1
example=$2
way=$3
netfloor=$4
shift 4
program=$(basename "$example")
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

fail() {
    echo "$1" >&2
    exit 1
}

case $way in
installed)
    "$cmake" --install "$netfloor" --prefix "$work/first" >/dev/null
    mv "$work/first" "$work/prefix"
    "$cmake" -S "$example" -B "$work/build" -DCMAKE_PREFIX_PATH="$work/prefix" -DCMAKE_BUILD_TYPE=Release >/dev/null
    ;;
sources)
    "$cmake" -S "$example" -B "$work/build" -DNETFLOOR_SOURCE="$netfloor" >/dev/null
    # netfloor changes no setting of the project around it.
    grep -q '^CMAKE_BUILD_TYPE:STRING=$' "$work/build/CMakeCache.txt" || fail "netfloor chose the build type"
    [ ! -e "$work/build/compile_commands.json" ] || fail "netfloor wrote compile_commands.json"
    ;;
esac
"$cmake" --build "$work/build" --target "$program" >/dev/null
"$work/build/$program" "$@" >"$work/output"
diff "$example/expected.txt" "$work/output"

if [ "$way" = sources ]; then
    "$cmake" --install "$work/build" --prefix "$work/prefix" >/dev/null
    [ -z "$(ls "$work/prefix" 2>/dev/null)" ] || fail "netfloor is installed with a project that did not ask for it"
fi
