#!/bin/bash
# SPDX-License-Identifier: MIT
# Builds the Python package, checks its types and runs its tests. Ends with a line that counts what passed and what failed.
#
#   scripts/check-python.sh [PYTEST-ARGUMENT...]
set -uo pipefail
cd "$(dirname "$0")/.." || exit 1
venv=$PWD/build/python
log=$(mktemp)
results=$(mktemp)
trap 'rm -f "$log" "$results"' EXIT
passed=0
failed=0

# verdict NAME COMMAND...: counts one check; its output is shown when it fails.
verdict() {
    local name=$1
    shift
    if "$@" >"$log" 2>&1; then
        passed=$((passed + 1))
    else
        failed=$((failed + 1))
        cat "$log"
        echo "FAILED: $name"
    fi
}

# The command is what the package's rows are compared with.
if ! scripts/build-command.sh || ! scripts/python-environment.sh; then
    echo "0 passed, 1 failed"
    exit 1
fi

echo "== types"
verdict mypy "$venv/bin/mypy" --config-file python/pyproject.toml --cache-dir build/mypy python/netfloor

echo "== tests"
"$venv/bin/pytest" -q -o cache_dir="$PWD/build/pytest" --junit-xml="$results" "${@:-python/tests}"
status=$?
in_state() { grep -o "$1" "$results" | wc -l; }
tests_failed=$(($(in_state '<failure') + $(in_state '<error')))
passed=$((passed + $(in_state '<testcase') - tests_failed - $(in_state '<skipped')))
failed=$((failed + tests_failed))
[ $status -eq 0 ] || [ $tests_failed -gt 0 ] || failed=$((failed + 1))
echo "$passed passed, $failed failed"
[ $failed -eq 0 ]
