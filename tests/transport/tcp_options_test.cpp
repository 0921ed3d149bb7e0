// SPDX-License-Identifier: MIT
// The options of a TCP header (RFC 9293, 7323, 2018, 2385).
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "support/listings.h"

namespace netfloor::test {
namespace {

// A segment with these options and a payload that is handed off.
Octets withOptions(const Octets &options) {
    return ipv4({.protocol = 6,
                 .payload = hex("00 35 9c 40 00 00 00 01 00 00 00 02") +
                            Octets{static_cast<std::uint8_t>((5 + options.size() / 4) << 4)} +
                            hex("10 20 00 00 00 00 00") + options + hex("61*5")});
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
    EXPECT_EQ(fieldLines(runs, 408), expected(R"x(
        441 |8 | "TCP Option Kind=0 (End of Option List)" "TCP Option Kind=0 (End of Option List)=0" 321-328 > 441 "0"
        461 |8 | "TCP Option Kind" "TCP Option Kind=5 (SACK Option)" 329-336 > 444 "5 (SACK Option)"
        462 |8 | "Length" "  Length=18 octet(s)" 337-344 > 322 "18 octet(s)"
        466 |9 | "Left Edge of Block" "  Left Edge of Block=1" 345-376/8 > 466 "1"
        467 |9 | "Right Edge of Block" "  Right Edge of Block=10" 377-408/8 > 467 "10"
        466 |9 | "Left Edge of Block" "  Left Edge of Block=ffffffff" 409-440/8 > 466 "ffffffff"
        467 |9 | "Right Edge of Block" "  Right Edge of Block=80000000" 441-472/8 > 467 "80000000"
        474 |8 | "TCP Option Kind" "TCP Option Kind=19 (MD5 Signature Option)" 473-480 > 444 "19 (MD5 Signature Option)"
        475 |8 | "Length" "  Length=10 octet(s)" 481-488 > 322 "10 octet(s)"
        478 |8 | "MD5 digest" "    MD5 digest=a0ff12345" 489-552/8 > 478 "2030405"
        439 |9 Padding| "Padding" "  Padding=123456" 553-640/8 > 306 "123456"
    )x"));
    EXPECT_EQ(verdictLine(runs.mv), "verdict -52 flags 0x2\n");
}

struct OptionsCase {
    const char *octets;
    std::uint32_t flagsOfMv; // without 0x2, which each header leaves
    const char *values;
};

TEST(TcpOptions, lengthsAndOrders) {
    const std::vector<OptionsCase> cases = {
        // The list goes on after End of Option List.
        {"00 01 00 00", 0, "441=0 444=1 441=0 441=0"},
        // An unknown kind makes padding of all that follows it, in the round that takes nothing else.
        {"09 02 01 01", 0, "439=9020101"},
        {"01 09 01 01", 0, "444=1 439=90101"},
        // Four options count what they should be long, not what they say: more is then thought to be left
        // than there is, or less.
        {"02 06 05 b4 aa bb 01 01", 0x10, "447=2 448=6 451=5b4 444=1 444=1"},
        {"02 03 05 01", 0x10, "447=2 448=3"},
        {"03 04 07 aa", 0x10, "452=3 453=4 456=7"},
        {"04 04 aa bb", 0x10, "457=4 458=4"},
        {"08 0c 01 00 00 00 02 00 00 00 aa bb", 0x10, "468=8 469=c 472=1 473=2"},
        {"01 01 08 09 01 00 00 00 02 00 00 00", 0x10, "444=1 444=1 468=8 469=9 472=1"},
        {"08 08 01 00 00 00 02 00 01 01 01 01", 0x10, "468=8 469=8 472=1 444=1 444=1"},
        // A left edge without a right one, less than an edge, and no edge.
        {"05 0e 00 00 00 01 00 00 00 02 00 00 00 03 01 01", 0, "461=5 462=e 466=1 467=2 466=3 444=1 444=1"},
        {"05 04 aa bb", 0x10, "461=5 462=4"},
        {"05 02 01 01", 0, "461=5 462=2 444=1 444=1"},
        // Lengths that do not even cover kind and length. The octet read is not counted, so that the padding
        // finds one octet too few.
        {"05 01 02 04", 0x10, "461=5"},
        {"02 00 01 01", 0, "439=2000101"},
        {"01 01 01 02", 0, "444=1 444=1 444=1 439=2"},
        // Digests: none, and more than 16 octets.
        {"13 02 01 01", 0, "474=13 475=2 444=1 444=1"},
        {"13 14 00*15 10 aa bb", 0x10, "474=13 475=14 478=10"},
        // A length that reaches past the header: read as far as the header goes.
        {"02 08 05 b4", 8, "447=2 448=8 451=5b4"},
        {"01 13 ff 0a", 8, "444=1 474=13 475=ff 478=a"},
        // After usual options one that is not: of another size, of another length, and in more rounds than there are
        // in a usual header.
        {"01 01 05 0a 00 00 00 01 00 00 00 02", 0, "444=1 444=1 461=5 462=a 466=1 467=2"},
        {"01 01 08 0a 01 00 00 00 02 00 00 00 04 04 aa bb", 0x10, "444=1 444=1 468=8 469=a 472=1 473=2 457=4 458=4"},
        // A usual one that the header cuts off.
        {"01 01 02 04", 8, "444=1 444=1 447=2 448=4"},
        {"01*9 02 04 05 b4 09 01 01", 0,
         "444=1 444=1 444=1 444=1 444=1 444=1 444=1 444=1 444=1 447=2 448=4 451=5b4 439=90101"},
    };
    for (const OptionsCase &one : cases) {
        SCOPED_TRACE(one.octets);
        const Octets options = hex(one.octets);
        const Runs runs = runAll(withOptions(options));
        EXPECT_EQ(fieldValues(runs.md, 408), one.values);
        EXPECT_EQ(runs.md.flags, 2u);
        EXPECT_EQ(runs.mv.flags, 2u | one.flagsOfMv);
        // With any options, the next layer gets the octets after the data offset.
        ASSERT_EQ(runs.md.handOffs.size(), 1u);
        EXPECT_EQ(runs.md.handOffs[0].cursor, 321 + 8 * options.size());
        EXPECT_EQ(runs.md.handOffs[0].nextLayerOctets, 5u);
    }
}

} // namespace
} // namespace netfloor::test
