// SPDX-License-Identifier: MIT
// The TCP header (RFC 9293).
#include <algorithm>
#include <string>
#include <tuple>
#include <vector>

#include <gtest/gtest.h>

#include "support/listings.h"

namespace netfloor::test {
namespace {

constexpr std::size_t ipv4Fields = 18;
constexpr std::uint32_t unwritten = 0xabcdef; // in the scratch area at the start

// Ports 53 and 40000 and a header whose data offset a test chooses.
Octets tcp(std::uint8_t dataOffset, const Octets &rest = {}) {
    return hex("00 35 9c 40 00 00 00 01 00 00 00 02") + Octets{static_cast<std::uint8_t>(dataOffset << 4)} +
           hex("10 20 00 00 00 00 00") + rest;
}

Octets overIpv4(const Octets &segment) {
    return ipv4({.protocol = 6, .payload = segment});
}

const Octets &withUsualOptions() {
    static const Octets packet = overIpv4(hex(R"(
        00 35 9c 40 01 02 03 04 ff ff ff ff
        a5 d2 20 00 0a bc 00 10         # data offset 10; ACK, SYN and all reserved bits
        02 04 05 b4                     # maximum segment size
        04 02                           # SACK permitted
        08 0a 01 00 00 00 00 00 00 80   # timestamps
        01                              # no operation
        03 03 07                        # window scale
        61*5
    )"));
    return packet;
}

TEST(Tcp, everyFieldInEveryPass) {
    const Runs runs = runAll(withUsualOptions());
    // The rounds of the options nest: the no-operation starts the second one.
    EXPECT_EQ(fieldLines(runs, 160), expected(R"x(
        384 |5 Transmission Control Protocol| "TCP Source Port" "  TCP Source Port=Domain Name Server (53)" 161-176/8 > 384 "TCP - DOMAIN (53)"
        393 |5 Transmission Control Protocol| "TCP Destination Port" "  TCP Destination Port=40000 (40000)" 177-192/8 > 387 "TCP -  (40000)"
        394 |5 Transmission Control Protocol| "Sequence Number" "Sequence Number=16909060(dec)" 193-224/8 > 394 "16909060(dec)"
        395 |5 Transmission Control Protocol| "Acknowledgement Number" "Acknowledgement Number=4294967295(dec)" 225-256/8 > 395 "4294967295(dec)"
        396 |5 Transmission Control Protocol| "Reserved" "  Reserved=5" 257-260 > 290 "5"
        398 |6 INLINE BLOCK| "Data Offset" "  Data Offset=10*4 octets" 261-264 > 398 "10*4 octets"
        399 |6 INLINE BLOCK| "Reserved" "  Reserved=3" 271-272 > 290 "3"
        400 |6 INLINE BLOCK| "URG" "  URG=0" 270-270 > 400 "0"
        401 |6 INLINE BLOCK| "ACK" "  ACK=1" 269-269 > 401 "1"
        402 |6 INLINE BLOCK| "PSH" "  PSH=0" 268-268 > 402 "0"
        403 |6 INLINE BLOCK| "RST" "  RST=0" 267-267 > 403 "0"
        404 |6 INLINE BLOCK| "SYN" "  SYN=1" 266-266 > 404 "1"
        405 |6 INLINE BLOCK| "FIN" "  FIN=0" 265-265 > 405 "0"
        406 |6 INLINE BLOCK| "Window Size" "  Window Size=8192(dec)" 273-288/8 > 406 "8192"
        407 |6 INLINE BLOCK| "Checksum" "  Checksum=abc" 289-304/8 > 543 "abc"
        408 |6 INLINE BLOCK| "Urgent Pointer" "  Urgent Pointer=10" 305-320/8 > 408 "10"
        447 |8 | "TCP Option Kind" "TCP Option Kind=2 (Maximum Segment Size)" 321-328 > 444 "2 (Maximum Segment Size)"
        448 |8 | "Length" "  Length=4 octet(s)" 329-336 > 322 "4 octet(s)"
        451 |8 | "max seg size" "  max seg size=1460" 337-352/8 > 451 "1460"
        457 |8 | "TCP Option Kind" "TCP Option Kind=4 (SACK-Permitted)" 353-360 > 444 "4 (SACK-Permitted)"
        458 |8 | "Length" "  Length=2 octet(s)" 361-368 > 322 "2 octet(s)"
        468 |8 | "TCP Option Kind" "TCP Option Kind=8 (Timestamps Option)" 369-376 > 444 "8 (Timestamps Option)"
        469 |8 | "Length" "  Length=10 octet(s)" 377-384 > 322 "10 octet(s)"
        472 |8 | "TS value" "  TS value=1" 385-416 > 472 "1"
        473 |8 | "TS Echo Reply" "  TS Echo Reply=2147483648" 417-448 > 473 "2147483648"
        444 |9 | "TCP Option Kind" "TCP Option Kind=1 (No Operation)" 449-456 > 444 "1 (No Operation)"
        452 |9 | "TCP Option Kind" "TCP Option Kind=3 (Window Scale Option)" 457-464 > 444 "3 (Window Scale Option)"
        453 |9 | "Length" "  Length=3 octet(s)" 465-472 > 322 "3 octet(s)"
        456 |9 | "shift count" "  shift count=7" 473-480 > 456 "7"
    )x"));
    EXPECT_EQ(linesFrom(lines(runs.xtr), "row 49"), expected(R"(
        row 49 TCP Source Port=53
        row 52 TCP Destination Port=40000
        row 54 Acknowledgement Number=4294967295
        row 55 Data Offset=10
        row 56 RST=0
        row 57 SYN=1
        row 58 FIN=0
        row 104 Sequence Number=16909060
    )"));
    EXPECT_EQ(handOffLines(runs.md), "hand-off key 53 protocol 6 port 53 at 481 bits 40 octets 5 preceding 60\n");
    EXPECT_EQ(verdictLine(runs.mv), "verdict -52 flags 0x2\n");
}

struct HeaderCase {
    const char *name;
    Octets packet;
    std::ptrdiff_t fields; // of the segment
    std::uint32_t flagsOfMd, flagsOfMv;
    std::uint32_t nextLayerOctets, precedingOctets;
    const char *handOff;
};

// The data offset decides how much is read, which lengths the next layer gets, and which owner it has.
TEST(Tcp, dataOffsetAndRoomForIt) {
    // An inner datagram that says it is shorter than the segment in it.
    const Octets shortTunnel =
        ipv4({.protocol = 4, .payload = ipv4({.protocol = 6, .payload = tcp(5, hex("61*5")), .totalLength = 39})});
    const std::vector<HeaderCase> cases = {
        {"payload shorter than the header", shortTunnel, 16, 2, 2, 0, 39,
         "hand-off key 53 protocol 6 port 53 at 481 bits 40 octets 0 preceding 39\n"},
        {"no payload", overIpv4(tcp(5)), 16, 2, 2, 0, 40, ""},
        {"32 bits of payload", overIpv4(tcp(5, hex("61*4"))), 16, 2, 0x12, 4, 40, ""},
        {"more than 32 bits", overIpv4(tcp(5, hex("61*5"))), 16, 2, 2, 5, 40,
         "hand-off key 53 protocol 6 port 53 at 321 bits 40 octets 5 preceding 40\n"},
        {"40 octets of options", overIpv4(tcp(15, hex("01*40 61*5"))), 56, 2, 2, 5, 80,
         "hand-off key 53 protocol 6 port 53 at 641 bits 40 octets 5 preceding 80\n"},
        {"10 of 40 octets of options", overIpv4(tcp(15, hex("01*10"))), 26, 2, 0xa, unwritten, unwritten, ""},
        {"offset 6 without options", overIpv4(tcp(6)), 16, 2, 0xa, unwritten, unwritten, ""},
        {"offset 0", overIpv4(tcp(0, hex("01*6"))), 16, 2, 0x1a, unwritten, unwritten, ""},
        {"offset 2", overIpv4(tcp(2, hex("01*6"))), 16, 2, 0x1a, unwritten, unwritten, ""},
        {"offset 3", overIpv4(tcp(3)), 5, 0, 0, 17, 23,
         "hand-off key 53 protocol 6 port 53 at 257 bits 64 octets 17 preceding 23\n"},
        {"offset 4, 32 bits after it", overIpv4(tcp(4)), 14, 0, 0x10, 16, 24, ""},
        {"offset 4, 40 bits after it", overIpv4(tcp(4, hex("61"))), 14, 0, 0, 17, 24,
         "hand-off key 53 protocol 6 port 53 at 289 bits 40 octets 17 preceding 24\n"},
        {"over IPv6", ipv6({.nextHeader = 6, .payload = tcp(5, hex("61*5"))}), 16, 2, 2, 5, 0u - 5,
         "hand-off key 53 protocol 6 port 53 at 481 bits 40 octets 5 preceding 4294967291\n"},
    };
    for (const HeaderCase &one : cases) {
        SCOPED_TRACE(one.name);
        TestRunOptions options;
        options.state.prepare = [](DecodeState &state) { std::fill_n(state.scratch, 32, unwritten); };
        const Runs runs = runAll(one.packet, options);
        EXPECT_EQ(std::ranges::count(linesFrom(lines(runs.md), "384"), '\n'), one.fields);
        EXPECT_EQ(runs.md.flags, one.flagsOfMd);
        EXPECT_EQ(runs.mv.flags, one.flagsOfMv);
        EXPECT_EQ(runs.md.scratch[NETFLOOR_NEXT_LAYER_OCTETS], one.nextLayerOctets);
        EXPECT_EQ(runs.md.scratch[NETFLOOR_PRECEDING_OCTETS], one.precedingOctets);
        EXPECT_EQ(handOffLines(runs.md), one.handOff);
        EXPECT_EQ(runs.md.bitsLeft, 0u);
    }
}

// Fields that fit into a segment of n octets, and what is left over in its limit.
TEST(Tcp, segmentThatEndsEarly) {
    const std::vector<std::size_t> fields = {0, 0, 1, 1, 2, 2, 2, 2, 3, 3, 3, 3, 4, 6, 13, 13, 14, 14, 15, 15, 16};
    const Octets packet = overIpv4(tcp(5));
    for (std::size_t octets = 0; octets < fields.size(); ++octets) {
        SCOPED_TRACE(octets);
        const Runs runs = runAll(shortened(packet, 20 + octets));
        EXPECT_EQ(runs.md.fields.size(), ipv4Fields + fields[octets]);
        const bool whole = octets == 20;
        const bool swept = octets < 12 ? (octets % 4 != 0 && octets != 2) : (octets > 13 && octets % 2 != 0);
        EXPECT_EQ(runs.md.flags, whole ? 2u : 0u);
        EXPECT_EQ(runs.mv.flags, (whole ? 2u : octets > 12 ? 8u : 0u) | (swept ? 0x10u : 0u));
    }
}

TEST(Tcp, destinationPortNamesTheOuterProtocol) {
    const Octets segment = tcp(5);
    const Octets inner = overIpv4(segment);
    const Octets minimal = hex("06 00 00 00 0a 00 00 01");
    const std::vector<std::tuple<Octets, std::uint32_t, std::string>> cases = {
        {inner, 393, ""},
        {ipv6({.nextHeader = 6, .payload = segment}), 393, ""},
        {ipv4({.protocol = 4, .payload = inner}), 387, "IPinIP - "},
        {ipv4({.protocol = 4, .payload = ipv4({.protocol = 55, .payload = minimal + segment})}), 387, "IPinIP - "},
        {ipv4({.protocol = 55, .payload = minimal + segment}), 391, "MIPinIP - "},
    };
    for (const auto &[packet, id, outer] : cases) {
        const Runs runs = runAll(packet);
        EXPECT_EQ(runs.md.field("TCP Destination Port")->id, id);
        EXPECT_EQ(linesWith(lines(runs.to), "384"), "384 \"TCP - DOMAIN (53)\"\n");
        EXPECT_EQ(linesWith(lines(runs.to), "387"), "387 \"" + outer + "TCP -  (40000)\"\n");
    }
}

} // namespace
} // namespace netfloor::test
