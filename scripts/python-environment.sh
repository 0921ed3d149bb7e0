#!/bin/bash
# SPDX-License-Identifier: MIT
# Makes the virtual environment build/python with all that the package's tests need, and installs the package
# into it. Says little unless something fails.
set -euo pipefail
cd "$(dirname "$0")/.."
venv=$PWD/build/python
log=$(mktemp)
trap 'rm -f "$log"' EXIT

# step TITLE COMMAND...: shows the end of the output where the command fails.
step() {
    echo "== $1"
    shift
    "$@" >"$log" 2>&1 || { tail -n 60 "$log" && exit 1; }
}

scripts/install-packages.sh python
[ -x "$venv/bin/python" ] || step "virtual environment" python3 -m venv "$venv"
requirements=$(sha256sum <python/tests/requirements.txt)
if [ "$(cat "$venv/requirements" 2>/dev/null)" != "$requirements" ]; then
    step "packages from PyPI" "$venv/bin/pip" install --disable-pip-version-check -r python/tests/requirements.txt
    echo "$requirements" >"$venv/requirements"
fi

# Anything that is newer than the installation. A folder is when a file in it has gone.
sources="CMakeLists.txt cmake include plugin host capture analysis columns python"
# shellcheck disable=SC2086
if [ ! -f "$venv/installed" ] || [ -n "$(find $sources -newer "$venv/installed" ! -name __pycache__ -print -quit)" ]; then
    touch "$venv/installing"
    step "building: ./python" "$venv/bin/pip" install --disable-pip-version-check --no-deps --no-build-isolation \
        --force-reinstall ./python
    mv "$venv/installing" "$venv/installed"
fi
