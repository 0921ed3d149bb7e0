#!/bin/sh
# SPDX-License-Identifier: MIT
# The plug-in exports exactly the functions that its public headers declare, and needs the three
# libraries of the host and libc only: no C++ run-time library.
set -eu
plugin=$1
include=$2
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

# plugin.h and descriptors.h declare exports, host.h declares imports.
sed -n 's/^[a-z][a-z0-9_ *]*NETFLOOR_CDECL \([A-Za-z_]*\)(.*/\1/p' "$include/netfloor/plugin.h" \
    "$include/netfloor/descriptors.h" | sort >"$work/declared"
nm -D --defined-only "$plugin" | awk '{print $3}' | sort >"$work/exported"
[ -s "$work/declared" ] || { echo "no declarations found" >&2; exit 1; }
diff "$work/declared" "$work/exported" || { echo "declared (<) and exported (>) names differ" >&2; exit 1; }

readelf -d "$plugin" | sed -n 's/.*(NEEDED).*\[\(.*\)\]/\1/p' | sort >"$work/needed"
printf '%s\n' libc.so.6 libhd_HostDispatch.so libhs_HostServices.so libhx_KeyOptions.so | sort >"$work/allowed"
diff "$work/allowed" "$work/needed" || { echo "allowed (<) and needed (>) libraries differ" >&2; exit 1; }
