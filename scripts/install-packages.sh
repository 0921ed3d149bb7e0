#!/bin/sh
# SPDX-License-Identifier: MIT
# Installs the Debian packages that are missing. Silent when none is.
#
#   scripts/install-packages.sh decode    what the build of the command needs
#   scripts/install-packages.sh all       that, and what the tests, the checks and the benchmarks need
#   scripts/install-packages.sh proof     what ./check proof needs besides: it finds expressions to change
#   scripts/install-packages.sh long      what ./check long needs besides: that, and another compiler
#   scripts/install-packages.sh hosts     what ./check hosts needs: compilers for other machines, and what runs their programs
#   scripts/install-packages.sh page      what ./check page needs: a browser, and what drives it
#   scripts/install-packages.sh python    what ./check python and ./spark need: Python's headers, Java, GNU parallel
#   scripts/install-packages.sh packages  what packaging/try-packages.sh needs: it builds Debian packages and a bare Debian
set -eu

# libsqlite3-dev is for `export`; jq, sqlite3 and python3-fastjsonschema are what its output and that of `json` is tested with.
decode="g++ cmake ninja-build pkg-config libpcap-dev libcli11-dev zlib1g-dev libisal-dev nlohmann-json3-dev libsqlite3-dev libtbb-dev"
all="$decode libgtest-dev libbenchmark-dev libtins-dev clang libclang-rt-14-dev llvm valgrind clang-format clang-tidy
    tshark tcpdump time help2man abigail-tools jq sqlite3 python3-fastjsonschema"
proof="$all python3-clang-14"
long="$proof clang-19"
# The versioned multilib: the other one excludes all cross compilers.
hosts="$decode libgtest-dev googletest g++-12-multilib g++-s390x-linux-gnu g++-mingw-w64-i686-posix
    g++-mingw-w64-x86-64-posix wine64 qemu-user"
page="$decode chromium nodejs"
command -v npm >/dev/null || page="$page npm" # some packages of nodejs have it, and exclude Debian's own
python="$decode python3-dev python3-venv parallel openjdk-17-jre-headless"
packages="$decode help2man dpkg-dev file debootstrap"

case "${1:-all}" in
decode) wanted=$decode ;;
all) wanted=$all ;;
proof) wanted=$proof ;;
long) wanted=$long ;;
hosts) wanted=$hosts ;;
page) wanted=$page ;;
python) wanted=$python ;;
packages) wanted=$packages ;;
*) echo "usage: $0 [decode|all|proof|long|hosts|page|python|packages]" >&2; exit 2 ;;
esac

if ! command -v apt-get >/dev/null 2>&1; then
    echo "netfloor: this system has no apt-get; install these packages (Debian names) by hand: $wanted" >&2
    exit 0
fi

missing=
for package in $wanted; do
    state=$(dpkg-query -W -f '${db:Status-Status}' "$package" 2>/dev/null || true)
    [ "$state" = installed ] || missing="$missing $package"
done
[ -n "$missing" ] || exit 0

echo "netfloor: installing the packages that are missing:$missing" >&2
as_root=
if [ "$(id -u)" -ne 0 ]; then
    if ! command -v sudo >/dev/null 2>&1; then
        echo "netfloor: these packages can be installed by root only. As root, run:" >&2
        echo "    apt-get install$missing" >&2
        exit 1
    fi
    as_root=sudo
fi

log=$(mktemp)
trap 'rm -f "$log"' EXIT
# The lists may be old or absent (a fresh container): fetch them, and go on with the old ones if that fails.
$as_root apt-get update -q >"$log" 2>&1 || true
# shellcheck disable=SC2086
if ! $as_root env DEBIAN_FRONTEND=noninteractive apt-get install -y -q --no-install-recommends $missing >>"$log" 2>&1; then
    tail -n 15 "$log" >&2
    echo "netfloor: apt-get could not install:$missing. Is the network there, and is no other apt-get running?" >&2
    exit 1
fi
