// SPDX-License-Identifier: MIT
// The options of a TCP header (RFC 9293, 7323, 2018, 2385).
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "support/runs.h"

namespace netfloor::test {
namespace {

// A segment with these options and a payload that is handed on.
Octets withOptions(const Octets &options) {
    return ipv4({.protocol = 6,
                 .payload = hex("00 35 9c 40 00 00 00 01 00 00 00 02") +
                            Octets{static_cast<std::uint8_t>((5 + options.size() / 4) << 4)} +
                            hex("10 20 00 00 00 00 00") + options + hex("61*5")});
}

// The lines behind the urgent pointer, the last field of the fixed header.
std::string optionLines(const std::string &all) {
    const std::string lines = linesFrom(all, "408");
    return lines.substr(lines.find('\n') + 1);
}

TEST(TcpOptions, theRarerKinds) {
    const Runs runs = runAll(withOptions(hex(R"(
        00                               # does not end the list
        05 12                            # two blocks
        00 00 00 01 00 00 00 10
        ff ff ff ff 80 00 00 00
        13 0a 0a 00 ff 01 02 03 04 05    # a digest of 8 octets
        09 00*7 12 34 56                 # a kind without a decoder
    )")));
    EXPECT_EQ(optionLines(lines(runs.md)), expected(R"x(
        441 |8 | "TCP Option Kind=0 (End of Option List)" "TCP Option Kind=0 (End of Option List)=0" 321-328
        461 |8 | "TCP Option Kind" "TCP Option Kind=5 (SACK Option)" 329-336
        462 |8 | "Length" "  Length=18 octet(s)" 337-344
        466 |9 | "Left Edge of Block" "  Left Edge of Block=1" 345-376/8
        467 |9 | "Right Edge of Block" "  Right Edge of Block=10" 377-408/8
        466 |9 | "Left Edge of Block" "  Left Edge of Block=ffffffff" 409-440/8
        467 |9 | "Right Edge of Block" "  Right Edge of Block=80000000" 441-472/8
        474 |8 | "TCP Option Kind" "TCP Option Kind=19 (MD5 Signature Option)" 473-480
        475 |8 | "Length" "  Length=10 octet(s)" 481-488
        478 |8 | "MD5 digest" "    MD5 digest=a0ff12345" 489-552/8
        439 |9 Padding| "Padding" "  Padding=123456" 553-640/8
    )x"));
    EXPECT_EQ(optionLines(lines(runs.to)), expected(R"x(
        441 "0"
        444 "5 (SACK Option)"
        322 "18 octet(s)"
        466 "1"
        467 "10"
        466 "ffffffff"
        467 "80000000"
        444 "19 (MD5 Signature Option)"
        322 "10 octet(s)"
        478 "2030405"
        306 "123456"
    )x"));
    EXPECT_EQ(verdictLine(runs.mv), "verdict -52 flags 0x2\n");
}

struct OptionsCase {
    const char *octets;
    std::uint32_t flagsOfMv; // but for 0x2, which each header leaves
    const char *lines;
};

TEST(TcpOptions, lengthsAndOrders) {
    const std::vector<OptionsCase> cases = {
        // The list goes on behind its end.
        {"00 01 00 00", 0, R"x(
            441 "TCP Option Kind=0 (End of Option List)=0"
            444 "TCP Option Kind=1 (No Operation)"
            441 "TCP Option Kind=0 (End of Option List)=0"
            441 "TCP Option Kind=0 (End of Option List)=0"
        )x"},
        // An unknown kind makes padding of all that follows it, in the round that takes nothing else.
        {"09 02 01 01", 0, R"(439 "  Padding=9020101")"},
        {"01 09 01 01", 0, R"x(
            444 "TCP Option Kind=1 (No Operation)"
            439 "  Padding=90101"
        )x"},
        // Maximum segment size, timestamps, SACK permitted and window scale count what they should be long,
        // not what they say: too much is then thought to be left, or too little.
        {"02 06 05 b4 aa bb 01 01", 0x10, R"x(
            447 "TCP Option Kind=2 (Maximum Segment Size)"
            448 "  Length=6 octet(s)"
            451 "  max seg size=1460"
            444 "TCP Option Kind=1 (No Operation)"
            444 "TCP Option Kind=1 (No Operation)"
        )x"},
        {"02 03 05 01", 0x10, R"x(
            447 "TCP Option Kind=2 (Maximum Segment Size)"
            448 "  Length=3 octet(s)"
        )x"},
        {"08 0c 01 00 00 00 02 00 00 00 aa bb", 0x10, R"x(
            468 "TCP Option Kind=8 (Timestamps Option)"
            469 "  Length=12 octet(s)"
            472 "  TS value=1"
            473 "  TS Echo Reply=2"
        )x"},
        {"08 08 01 00 00 00 02 00 01 01 01 01", 0x10, R"x(
            468 "TCP Option Kind=8 (Timestamps Option)"
            469 "  Length=8 octet(s)"
            472 "  TS value=1"
            444 "TCP Option Kind=1 (No Operation)"
            444 "TCP Option Kind=1 (No Operation)"
        )x"},
        {"04 04 aa bb", 0x10, R"x(
            457 "TCP Option Kind=4 (SACK-Permitted)"
            458 "  Length=4 octet(s)"
        )x"},
        {"03 04 07 aa", 0x10, R"x(
            452 "TCP Option Kind=3 (Window Scale Option)"
            453 "  Length=4 octet(s)"
            456 "  shift count=7"
        )x"},
        // A left edge without a right one, and less than an edge.
        {"05 0e 00 00 00 01 00 00 00 02 00 00 00 03 01 01", 0, R"x(
            461 "TCP Option Kind=5 (SACK Option)"
            462 "  Length=14 octet(s)"
            466 "  Left Edge of Block=1"
            467 "  Right Edge of Block=2"
            466 "  Left Edge of Block=3"
            444 "TCP Option Kind=1 (No Operation)"
            444 "TCP Option Kind=1 (No Operation)"
        )x"},
        {"05 04 aa bb", 0x10, R"x(
            461 "TCP Option Kind=5 (SACK Option)"
            462 "  Length=4 octet(s)"
        )x"},
        // Lengths that do not even cover kind and length. The octet read is not counted, so that the padding
        // finds one octet too few.
        {"05 01 02 04", 0x10, R"x(461 "TCP Option Kind=5 (SACK Option)")x"},
        {"02 00 01 01", 0, R"(439 "  Padding=2000101")"},
        {"01 01 01 02", 0, R"x(
            444 "TCP Option Kind=1 (No Operation)"
            444 "TCP Option Kind=1 (No Operation)"
            444 "TCP Option Kind=1 (No Operation)"
            439 "  Padding=2"
        )x"},
        // Digests: none, and more than 16 octets.
        {"13 02 01 01", 0, R"x(
            474 "TCP Option Kind=19 (MD5 Signature Option)"
            475 "  Length=2 octet(s)"
            444 "TCP Option Kind=1 (No Operation)"
            444 "TCP Option Kind=1 (No Operation)"
        )x"},
        {"13 14 00*15 10 aa bb", 0x10, R"x(
            474 "TCP Option Kind=19 (MD5 Signature Option)"
            475 "  Length=20 octet(s)"
            478 "    MD5 digest=00000000000000010"
        )x"},
        // A length that reaches behind the header: read as far as the header goes.
        {"02 08 05 b4", 8, R"x(
            447 "TCP Option Kind=2 (Maximum Segment Size)"
            448 "  Length=8 octet(s)"
            451 "  max seg size=1460"
        )x"},
        {"01 13 ff 0a", 8, R"x(
            444 "TCP Option Kind=1 (No Operation)"
            474 "TCP Option Kind=19 (MD5 Signature Option)"
            475 "  Length=255 octet(s)"
            478 "    MD5 digest=a"
        )x"},
    };
    for (const OptionsCase &one : cases) {
        SCOPED_TRACE(one.octets);
        const Octets options = hex(one.octets);
        const Runs runs = runAll(withOptions(options));
        EXPECT_EQ(optionLines(shortLines(runs.md)), expected(one.lines));
        EXPECT_EQ(runs.md.flags, 2u);
        EXPECT_EQ(runs.mv.flags, 2u | one.flagsOfMv);
        // Whatever stands in the options, the next layer gets what is behind the data offset.
        ASSERT_EQ(runs.md.handOffs.size(), 1u);
        EXPECT_EQ(runs.md.handOffs[0].cursor, 321 + 8 * options.size());
        EXPECT_EQ(runs.md.handOffs[0].nextLayerOctets, 5u);
    }
}

} // namespace
} // namespace netfloor::test
