#!/bin/bash
# SPDX-License-Identifier: MIT
# Asks whether the tests of the plug-in can fail: which branch sides they reach, and whether they notice a sample of changes.
# Ends with a line that counts what passed and what failed. `./check long` makes all the changes.
set -uo pipefail
cd "$(dirname "$0")/.." || exit 1
passed=0
failed=0

# run NAME COMMAND...: counts one check, and shows the end of its output.
run() {
    local name=$1
    shift
    echo "== $name"
    if "$@" >build/proof.log 2>&1; then
        passed=$((passed + 1))
        tail -n 1 build/proof.log
    else
        failed=$((failed + 1))
        tail -n 40 build/proof.log
        echo "FAILED: $name"
    fi
}

echo "== packages"
scripts/install-packages.sh proof || exit 1
mkdir -p build
run "branch sides of the plug-in" scripts/coverage.sh plugin
run "build" cmake --preset release -DNETFLOOR_TESTS=ON
run "a sample of changes of the plug-in" scripts/mutants.sh 40 1024

echo "$passed passed, $failed failed"
[ $failed -eq 0 ]
