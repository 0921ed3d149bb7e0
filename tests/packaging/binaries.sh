#!/bin/sh
# SPDX-License-Identifier: MIT
# Each program and shared library, as it was built and as it is installed: it searches libraries only in directories
# that are told from its own place, and it is hardened.
#
#   binaries.sh CMAKE BUILD
set -eu
cmake=$1
build=$2
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
failed=0

fail() {
    echo "$1"
    failed=1
}

# The search path of a file, an element a line, each with a dot after it so that an empty one is a line.
search_path() {
    readelf -d "$1" | sed -n 's/.*(R\(UN\)\?PATH).*\[\(.*\)\]/\2/p' | tr ':' '\n' | sed 's/$/./'
}

# check FILE KIND: a small library has no arrays on the stack, and only a program has calls that can be fortified.
check() {
    file=$1
    for element in $(search_path "$file"); do
        case $element in
        '$ORIGIN.' | '$ORIGIN/'*) ;;
        *) fail "$file: searches libraries in '${element%.}'" ;;
        esac
    done
    readelf -d "$file" | grep -q 'FLAGS.*NOW' || fail "$file: binds its imports late, in writable memory"
    readelf -lW "$file" | grep -q GNU_RELRO || fail "$file: no part is read-only after relocation"
    readelf -lW "$file" | grep -q 'GNU_STACK.* RW ' || fail "$file: the stack is executable"
    [ "$(readelf -h "$file" | sed -n 's/ *Type: *\([A-Z]*\).*/\1/p')" = DYN ] || fail "$file: not position independent"
    case $(uname -m) in
    x86_64) readelf -n "$file" | grep -q SHSTK || fail "$file: no mark for a shadow stack" ;;
    esac
    case $2 in
    plugin | program)
        readelf --dyn-syms -W "$file" | grep -q __stack_chk_fail || fail "$file: no stack protector" ;;
    esac
    if [ "$2" = program ]; then
        readelf --dyn-syms -W "$file" | grep -q '__[a-z]*_chk@' || fail "$file: no fortified calls"
    fi
}

check_all() {
    [ "$#" -ge 4 ] || fail "only $# programs and libraries: $*"
    for file in "$@"; do
        case $file in
        */libh[sdx]_*) check "$file" small ;;
        *.so*) check "$file" plugin ;;
        *) check "$file" program ;;
        esac
    done
}

# shellcheck disable=SC2046
check_all "$build/plugin/libnetfloor.so" "$build"/lib*.so $(find "$build/cli" -maxdepth 1 -type f -name netfloor)
"$cmake" --install "$build" --prefix "$work/prefix" >/dev/null
# shellcheck disable=SC2046
check_all $(find "$work/prefix" -type f -name '*.so*') $(find "$work/prefix/bin" -type f)

# The installed command takes the plug-in of its installation and no other.
if [ -x "$work/prefix/bin/netfloor" ]; then
    mkdir -p "$work/prefix/plugin"
    echo 'no plug-in' >"$work/prefix/plugin/libnetfloor.so"
    (cd / && "$work/prefix/bin/netfloor" fields 384 >/dev/null) || fail "the installed command does not find its plug-in"
fi
exit $failed
