#!/bin/sh
# SPDX-License-Identifier: MIT
# What must not compile, and what the compiler says of it: each case is a mistake in the declaration of a field, with
# the words that its message must contain. One correct declaration shows that the rest does compile.
#
#   declarations.sh PLUGIN-DIRECTORY INCLUDE-DIRECTORY
set -u
plugin=$1
include=$2
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
failures=0

compile() {
    "${CXX:-c++}" -std=c++20 -fsyntax-only -fno-exceptions -fno-rtti -I "$plugin" -I "$include" "$work/case.cpp" \
        >"$work/log" 2>&1
}

fail() {
    failures=$((failures + 1))
    echo "FAILED: $1"
    head -n 20 "$work/log"
}

# wrong WORDS... : the code on standard input does not compile, and the message holds all the words.
wrong() {
    cat >"$work/case.cpp"
    if compile; then
        fail "this compiles: $(cat "$work/case.cpp")"
        return
    fi
    for words in "$@"; do
        grep -qF -- "$words" "$work/log" || fail "the message does not say '$words'"
    done
}

# declaration WORDS PLACE-LINE-AND-REST: a field of this declaration contradicts itself.
declaration() {
    wrong "$1" "myField" <<EOF
#include "frame/field.h"
namespace netfloor::plugin {
inline constexpr std::array rows = {ValueName{2, "two"}, ValueName{1, "one"}};
inline constexpr std::array sound = {ValueName{1, "one"}, ValueName{2, "two"}};
inline constexpr ValueNames descending{rows};
inline constexpr ValueNames names{sound};
inline constexpr Field myField{9001, "My Field", $2};
static_assert(RequireConsistent<myField>::holds);
}
EOF
}

declaration "runs backwards"                   'piece(7, 0), "%n=%u"'
declaration "1 to 32 bits"                     'piece(0, 40), "%n=%u"'
declaration "take away times()"                'octetRun().times(8), "%n=%x"'
declaration "take away atMost()"               'octets(2).atMost(4), "%n=%x"'
declaration "take away advancing()"            'ahead(0, 7).advancing(8), "%n=%x"'
declaration "none of %n %u %x"                 'octets(1), "%n=%d"'
declaration "the short text holds"             'octets(1), "%n=%u", noNames, "%d"'
declaration "write %n"                         'octets(1), "My Field=%u"'
declaration "give the field its value names"   'octets(1), "%n=%-S"'
declaration "the short text shows a name"      'octets(1), "%n=%u", noNames, "%-S"'
declaration "its line does not show them"      'octets(1), "%n=%u", &names'
declaration "a short form"                     'octets(1), "%n=%-S", &names, "%-s"'
declaration "ascending order"                  'octets(1), "%n=%-S", &descending'
declaration "show its value instead"           'octets(1), R"(%n=%-["%u":"."])"'
declaration "how an element is shown"          'octets(4), R"(%n=%-["%q":"."])"'

wrong "two fields share an id" "firstField" "secondField" <<'EOF'
#include "frame/field_list.h"
namespace netfloor::plugin {
inline constexpr Field firstField{9001, "First", octets(1), "%n=%u"};
inline constexpr Field otherField{9002, "Other", octets(1), "%n=%u"};
inline constexpr Field secondField{9001, "Second", octets(1), "%n=%u"};
static_assert(CheckedCatalogue<FieldList<firstField, otherField, secondField>, FieldList<>>::holds);
}
EOF

wrong "a key row has no field" "strayField" <<'EOF'
#include "frame/field_list.h"
namespace netfloor::plugin {
inline constexpr Field listedField{9001, "Listed", octets(1), "%n=%u"};
inline constexpr Field strayField{9002, "Stray", octets(1), "%n=%u"};
static_assert(CheckedCatalogue<FieldList<listedField>, FieldList<listedField, strayField>>::holds);
}
EOF

# Reads a field in the grammar's own MV pass.
reading() {
    cat <<EOF
#include "entries/grammar.h"
#include "frame/passes.h"
namespace netfloor::plugin {
inline constexpr Field newField{9001, "New", octets(1), "%n=%u"};
void readIt(Reader<MvPass<Grammar>> &reader) { read<$1>(reader); }
}
EOF
}
reading newField | wrong "stands in no list" "tables/catalogue.h" "newField"

reading udp::length >"$work/case.cpp"
compile || fail "a sound field does not compile"

# The example of the page about new protocols, read by a pass.
{
    awk '/^```/ { if (inside) exit; inside = 1; next } inside' "$plugin/../docs/adding-a-protocol.md"
    cat <<'EOF'
#include "entries/grammar.h"
#include "frame/passes.h"
namespace netfloor::plugin {
using ExampleRows = probe::PacketRows;
static_assert(CheckedCatalogue<ExampleRows::Fields, ExampleRows::Keys>::holds);
struct ExampleGrammar : Grammar {
    using Fields = ExampleRows::Fields;
};
void readExample(Reader<MvPass<ExampleGrammar>> &reader) { probe::packet(reader); }
}
EOF
} >"$work/case.cpp"
compile || fail "the example of docs/adding-a-protocol.md does not compile"

[ $failures -eq 0 ]
