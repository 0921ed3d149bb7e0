// SPDX-License-Identifier: MIT
// UDP (RFC 768) over IPv4.
#include <algorithm>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "support/runs.h"

namespace netfloor::test {
namespace {

constexpr std::size_t ipv4Fields = 18;
constexpr std::uint32_t seed = 0xabcdef; // of the scratch area

TEST(Udp, everyFieldInEveryPass) {
    const Octets packet = ipv4({.protocol = 17, .payload = hex(R"(
        07 14 9c 40   # 1812, 40000
        00 00 00 0b   # a length that says nothing; checksum
        61*5
    )")});
    const Runs runs = runAll(packet);
    EXPECT_EQ(linesFrom(lines(runs.md), "479"), expected(R"x(
        479 |5 User Datagram Protocol| "UDP Source Port" "  UDP Source Port=RADIUS (1812)" 161-176/8
        488 |5 User Datagram Protocol| "UDP Destination Port" "  UDP Destination Port=40000 (40000)" 177-192/8
        489 |6 | "UDP Length" "  UDP Length=0 octet(s)" 193-208/8
        490 |6 | "Checksum" "  Checksum=b" 209-224/8
    )x"));
    EXPECT_EQ(linesFrom(lines(runs.to), "479"), expected(R"x(
        479 "UDP - RADIUS (1812)"
        482 "UDP -  (40000)"
        489 "0 octet(s)"
        543 "b"
    )x"));
    EXPECT_EQ(runs.md.fields.size(), ipv4Fields + 4 + 1); // the last one is the host's owner's
    EXPECT_EQ(linesFrom(lines(runs.xtr), "row 59"), "row 59 UDP Source Port=1812\nrow 62 UDP Destination Port=40000\n");
    EXPECT_EQ(handOffLines(runs.md), "hand-off key 1812 protocol 17 port 1812 at 225 bits 40 octets 5 preceding 28\n");
    EXPECT_EQ(verdictLine(runs.mv), "verdict 0 flags 0x0\n");
}

struct SizeCase {
    std::size_t octets; // of the datagram
    std::size_t fields;
    std::uint32_t flagsOfMv;
    bool handsOff;
};

// What is left after the fields is skipped, unless it is enough for a hand-off.
TEST(Udp, datagramOfEachSize) {

    const std::vector<SizeCase> cases = {
        {0, 0, 0, false},     {1, 0, 0x10, false},  {2, 1, 0, false},     {3, 1, 0x10, false}, {4, 2, 0, false},
        {5, 2, 0x10, false},  {6, 3, 0, false},     {7, 3, 0x10, false},  {8, 4, 0, false},    {9, 4, 0x10, false},
        {10, 4, 0x10, false}, {11, 4, 0x10, false}, {12, 4, 0x10, false}, {13, 4, 0, true},
    };
    for (const SizeCase &size : cases) {
        SCOPED_TRACE(std::to_string(size.octets) + " octets");
        TestRunOptions options;
        options.state.prepare = [](DecodeState &state) { std::fill_n(state.scratch, 32, seed); };
        const Octets datagram = udp(1000, 2000, hex("61*5"));
        const Octets part(datagram.begin(), datagram.begin() + static_cast<std::ptrdiff_t>(size.octets));
        const Runs runs = runAll(ipv4({.protocol = 17, .payload = part}) + hex("00 00"), options);
        EXPECT_EQ(runs.md.fields.size(), ipv4Fields + size.fields + (size.handsOff ? 1 : 0));
        EXPECT_EQ(runs.md.handOffs.size(), size.handsOff ? 1u : 0u);
        EXPECT_EQ(runs.mv.flags, size.flagsOfMv);
        EXPECT_EQ(runs.md.cursor, 161 + 8 * size.octets);
        EXPECT_EQ(runs.md.bitsLeft, 16u);
        const bool whole = size.fields == 4;
        EXPECT_EQ(runs.md.scratch[NETFLOOR_NEXT_LAYER_OCTETS], whole ? size.octets - 8 : seed);
        EXPECT_EQ(runs.md.scratch[NETFLOOR_PRECEDING_OCTETS], whole ? 28 : seed);
        EXPECT_EQ(runs.md.scratch[NETFLOOR_NEXT_LAYER_PORT], size.handsOff ? 1000 : seed);
        EXPECT_EQ(runs.md.scratch[0] + runs.md.scratch[2] + runs.md.scratch[5] + runs.md.scratch[31], 4 * seed);
    }
}

TEST(Udp, lengthFieldDecidesNothing) {
    for (const char *length : {"00 00", "00 07", "00 08", "ff ff"}) {
        const Octets datagram = hex("00 35 00 35") + hex(length) + hex("00 00 61*6");
        const Runs runs = runAll(ipv4({.protocol = 17, .payload = datagram}));
        EXPECT_EQ(handOffLines(runs.md), "hand-off key 53 protocol 17 port 53 at 225 bits 48 octets 6 preceding 28\n");
    }
}

// A limit that no header agrees with: the header length reduces the length that is written for the next layer, not the
// octets that it gets.
TEST(Udp, headerLengthCountsForTheNextLayer) {
    const Runs runs = runAll(ipv4({.protocol = 17, .payload = udp(53, 53, hex("61*6")), .headerWords = 3}));
    EXPECT_EQ(handOffLines(runs.md), "hand-off key 53 protocol 17 port 53 at 225 bits 48 octets 14 preceding 20\n");
}

} // namespace
} // namespace netfloor::test
