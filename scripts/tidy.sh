#!/bin/sh
# SPDX-License-Identifier: MIT
# clang-tidy over every source, a file a core. A file that passed is not checked again until it, a header or the set of
# checks has changed.
set -eu
cd "$(dirname "$0")/.."
stamps=build/tidy

# Each source by itself, without limits of GCC.
cmake --preset release -B "$stamps" -DNETFLOOR_JOIN_SOURCES=OFF -DNETFLOOR_TESTS=OFF -DNETFLOOR_BENCH=OFF >/dev/null
sed -i -e 's/--param=[^ ]*//' "$stamps/compile_commands.json"

export stamps
shared=$(git ls-files -z --cached --others --exclude-standard -- '*.h' '*.hpp' .clang-tidy |
    xargs -0 cat | sha256sum | cut -c1-16)
export shared

# Left out: entries/descriptors.cpp, which needs limits of constant evaluation that are spelled for the compiler in use,
# and what is for Windows, which needs headers of Windows.
git ls-files --cached --others --exclude-standard -- 'plugin/*.cpp' 'host/*.cpp' 'capture/*.cpp' 'analysis/*.cpp' 'columns/*.cpp' 'cli/*.cpp' |
    grep -vE '^plugin/entries/descriptors.cpp$|windows' |
    while read -r file; do [ ! -f "$file" ] || echo "$file"; done |
    xargs -P "$(nproc)" -I{} sh -c '
        stamp=$stamps/$(cat "{}" | sha256sum | cut -c1-16)-$shared
        [ -f "$stamp" ] && exit 0
        clang-tidy --quiet -p "$stamps" "{}" 2>/dev/null && touch "$stamp"'
