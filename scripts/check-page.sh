#!/bin/sh
# SPDX-License-Identifier: MIT
# Builds the command, and uses the pages that it makes as a person does, in headless Chromium: what is shown, the links
# between fields and octets, keys, filter, colours, roles. Ends with node's lines that count what passed and what failed.
#
#   CHROMIUM=... scripts/check-page.sh    another browser than the one on the path
set -eu
cd "$(dirname "$0")/.."
say() { printf '== %s\n' "$*"; }
skip() {
    echo "SKIPPED: $*"
    exit 0
}

say "packages"
scripts/install-packages.sh page || skip "the packages of the browser cannot be installed"
CHROMIUM=${CHROMIUM:-$(command -v chromium || command -v chromium-browser || true)}
if [ -z "$CHROMIUM" ]; then
    echo "FAILED: no Chromium on the path; CHROMIUM=... names one" >&2
    exit 1
fi

timeout 60 "$CHROMIUM" --headless --no-sandbox --disable-gpu --dump-dom about:blank >/dev/null 2>&1 ||
    skip "Chromium does not start on this machine"

say "building"
scripts/build-command.sh

# The modules come once, and again when other ones are named.
modules=build/page
if ! cmp -s tests/page/package.json "$modules/package.json"; then
    say "fetching node modules"
    rm -rf "$modules"
    mkdir -p "$modules"
    cp tests/page/package.json "$modules/"
    (cd "$modules" && npm install --no-audit --no-fund --ignore-scripts --no-package-lock --loglevel=error) ||
        { rm -rf "$modules"; skip "npm cannot fetch what tests/page/package.json names"; }
fi

say "testing"
NETFLOOR=$PWD/build/cli/netfloor NODE_FOLDER=$PWD/$modules CHROMIUM=$CHROMIUM \
    node --test --test-reporter=spec tests/page/page.test.mjs
