#!/bin/bash
# SPDX-License-Identifier: MIT
# Builds the Python package, installs it into a virtual environment of its own under build/, checks its types and runs
# its tests. Ends with a line that counts what passed and what failed.
#
#   scripts/check-python.sh [PYTEST-ARGUMENT...]
set -uo pipefail
cd "$(dirname "$0")/.." || exit 1
venv=$PWD/build/python
log=$(mktemp)
results=$(mktemp)
trap 'rm -f "$log" "$results"' EXIT

scripts/install-packages.sh python || exit 1
[ -x "$venv/bin/python" ] || python3 -m venv "$venv" || exit 1
requirements=$(sha256sum <python/tests/requirements.txt)
if [ "$(cat "$venv/requirements" 2>/dev/null)" != "$requirements" ]; then
    echo "== packages from PyPI"
    "$venv/bin/pip" install -q --disable-pip-version-check -r python/tests/requirements.txt || exit 1
    echo "$requirements" >"$venv/requirements"
fi

echo "== building: ./python"
if ! "$venv/bin/pip" install --disable-pip-version-check --no-deps --no-build-isolation --force-reinstall ./python \
    >"$log" 2>&1; then
    tail -n 60 "$log"
    echo "0 passed, 1 failed"
    exit 1
fi

passed=0
failed=0
echo "== types"
for check in "mypy --config-file python/pyproject.toml python/netfloor" "mypy.stubtest netfloor._netfloor"; do
    # shellcheck disable=SC2086
    if (cd build && "$venv/bin/python" -m ${check//python\//..\/python\/}) >"$log" 2>&1; then
        passed=$((passed + 1))
    else
        failed=$((failed + 1))
        cat "$log"
    fi
done

echo "== tests"
"$venv/bin/pytest" -q --junit-xml="$results" "${@:-python/tests}"
status=$?
count() { grep -o "<testcase\|<failure\|<error\|<skipped" "$results" | grep -c "$1"; }
test_failures=$(($(count failure) + $(count error)))
passed=$((passed + $(count testcase) - test_failures - $(count skipped)))
failed=$((failed + test_failures))
[ $status -eq 0 ] || [ $test_failures -gt 0 ] || failed=$((failed + 1))
echo "$passed passed, $failed failed"
[ $failed -eq 0 ]
