#!/bin/sh
# SPDX-License-Identifier: MIT
# What the file of the Windows plug-in says: it exports exactly the functions that the public headers declare, imports
# from the host's libraries exactly the six operations that it calls and besides only from Windows and its C library, has
# no TLS directory, for which Windows would go on to send notifications of threads, no static constructor, and a version.
set -eu
dll=$1
include=$2
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
"${OBJDUMP:-objdump}" -p "$dll" >"$work/dump"

sed -n 's/^[a-z][a-z0-9_ *]*NETFLOOR_CDECL \([A-Za-z_]*\)(.*/\1/p' "$include/netfloor/plugin.h" \
    "$include/netfloor/descriptors.h" | LC_ALL=C sort >"$work/declared"
[ -s "$work/declared" ] || { echo "no declarations found" >&2; exit 1; }
sed -n '/Ordinal\/Name Pointer/,/^$/s/^.*\[ *[0-9]*\] \([^ ]*\)$/\1/p' "$work/dump" | LC_ALL=C sort >"$work/exported"
diff "$work/declared" "$work/exported" || { echo "declared (<) and exported (>) names differ" >&2; exit 1; }

# One line an import: library, name.
awk '/DLL Name:/ { library = $3 }
     library != "" && /^\t[0-9a-f]+\t/ { print library, $3 }
     /^The Export Tables/ { exit }' "$work/dump" | LC_ALL=C sort >"$work/imported"
cat >"$work/wanted" <<END
KERNEL32.dll DisableThreadLibraryCalls
hd_HostDispatch.dll hd_PreDecode
hs_HostServices.dll hs_AddDecodedFieldsData
hs_HostServices.dll hs_AddFieldsToDisplayData
hs_HostServices.dll hs_CreateNewLayerInfo
hs_HostServices.dll hs_Realloc
hx_KeyOptions.dll hx_InitialiseOptXTR
END
grep -v '^msvcrt\.dll ' "$work/imported" | diff "$work/wanted" - || { echo "wanted (<) and actual (>) imports differ" >&2; exit 1; }

if grep 'Thread Storage Directory' "$work/dump" | grep -qv ' 0*0 00000000 Thread'; then
    echo "the file has a TLS directory" >&2
    exit 1
fi
grep -q 'Resource Directory \[.rsrc\]' "$work/dump" && ! grep 'Resource Directory \[.rsrc\]' "$work/dump" |
    grep -q ' 0*0 00000000 Resource' || { echo "the file has no version resource" >&2; exit 1; }
if "${NM:-nm}" "$dll" | grep _GLOBAL__sub_I_; then
    echo "these statics need a constructor, which nobody calls" >&2
    exit 1
fi
