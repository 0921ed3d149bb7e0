#!/bin/sh
# SPDX-License-Identifier: MIT
# Runs a Windows program without a display. A 32-bit one needs wine's 32-bit half in the folder NETFLOOR_WINE32. Wine's
# own files are in WINEPREFIX.
set -eu
here=$(cd "$(dirname "$0")/.." && pwd)
export WINEPREFIX="${WINEPREFIX:-$here/build/hosts/wine}"
export WINEDLLPATH="${NETFLOOR_WINE32:-$here/build/hosts/wine32}"
# No messages, no browser, no .NET: programs of the tests need none of them.
export WINEDEBUG=-all WINEDLLOVERRIDES='mscoree,mshtml='
unset DISPLAY
mkdir -p "$(dirname "$WINEPREFIX")"
exec /usr/lib/wine/wine64 "$@"
