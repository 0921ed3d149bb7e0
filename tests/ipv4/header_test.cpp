// SPDX-License-Identifier: MIT
// The IPv4 header (RFC 791), its dispatch, and payloads that have no decoder.
#include <algorithm>
#include <span>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "support/runs.h"

namespace netfloor::test {
namespace {

// A header with every flag set and a payload of five octets, of which a test can change what it needs.
Ipv4 withPayload(std::uint8_t protocol, const Octets &payload = hex("61 62 63 64 65")) {
    return {.protocol = protocol, .payload = payload};
}

TEST(Ipv4Header, everyFieldInEveryPass) {
    const Runs runs = runAll(hex(R"(
        45 bb 00 17      # version, header length; type of service; total length 23
        00 ab e0 b9      # identification; reserved, DF, MF, offset 185
        40 fd 0b cd      # time to live, protocol 253, checksum
        c0 a8 00 01      # 192.168.0.1
        0a ff 00 fe      # 10.255.0.254
        00 7f ff         # three octets of a protocol without a name
    )"));
    EXPECT_EQ(lines(runs.md), expected(R"(
        150 |2 Ip Header| "Version" "Version=4" 5-8
        152 |3 IPv4 Header| "Internet Header Length" "Internet Header Length=5*4 octets" 1-4
        286 |4 Type of Service| "Precedence" "Precedence=CRITIC/ECP" 14-16
        287 |4 Type of Service| "Delay" "Delay=Low Delay" 13-13
        288 |4 Type of Service| "Throughput" "Throughput=High Throughput" 12-12
        289 |4 Type of Service| "Reliability" "Reliability=Normal Reliability" 11-11
        290 |4 Type of Service| "Reserved" "Reserved=3" 9-10
        153 |3 IPv4 Header| "Total Length" "Total Length=23 octets" 17-32/8
        156 |4 Extra| "Identification" "Identification=ab" 33-48/8
        291 |5 Flag and Fragment Offset| "Reserved" "Reserved=1" 56-56
        292 |5 Flag and Fragment Offset| "DF" "DF=Don't Fragment" 55-55
        293 |5 Flag and Fragment Offset| "MF" "MF=More Fragments" 54-54
        294 |5 Flag and Fragment Offset| "Fragment Offset" "Fragment Offset=1480 octets" 49-53 57-64
        157 |4 Extra| "Time to Live" "Time to Live=64" 65-72
        295 |5 Protocol| "Protocol" "Protocol=" 73-80
        158 |4 Extra| "Header Checksum" "Header Checksum=bcd" 81-96/8
        159 |4 Extra| "Source Address" "Source Address= 192.168.0.1" 97-128/8
        160 |4 Extra| "Destination Address" "Destination Address= 10.255.0.254" 129-160/8
        285 |5 | "Unknown Protocol Data" "Unknown Protocol Data=0" 161-168
        285 |5 | "Unknown Protocol Data" "Unknown Protocol Data=7f" 169-176
        285 |5 | "Unknown Protocol Data" "Unknown Protocol Data=ff" 177-184
    )"));
    EXPECT_EQ(oneLine(lines(runs.to)),
              R"(150 "4"; 152 "5*4 octets"; 286 "CRITIC/ECP"; 287 "Low Delay"; 288 "High Throughput"; )"
              R"(289 "Normal Reliability"; 290 "3"; 153 "23 octets"; 156 "ab"; 290 "1"; 292 "Don't Fragment"; )"
              R"(293 "More Fragments"; 294 "1480 octets"; 157 "64"; 295 ""; 158 "bcd"; 159 "192.168.0.1"; )"
              R"(160 "10.255.0.254"; 285 "0"; 285 "7f"; 285 "ff")");
    EXPECT_EQ(lines(runs.xtr), expected(R"(
        row 0 Version=4
        row 1 Total Length=23
        row 2 Identification=171
        row 3 Time to Live=64
        row 4 Protocol=253
        row 5 Source Address=192.168.0.1
        row 6 Destination Address=10.255.0.254
        row 7 DF=1
        row 8 MF=1
        row 9 Fragment Offset=1480
    )"));
    EXPECT_EQ(verdictLine(runs.mv), "verdict 0 flags 0x0\n");
    EXPECT_EQ(layerLines(runs.md), "layer 1 of 1: 1-184\n");
    EXPECT_EQ(runs.md.bitsLeft, 0u);
}

// FNV-1a over the lines "0|HOPOPT" to "255|" of the numbers and names, as the registry had them up to 137, then
// "Unassigned" up to 252, then no name: a digest of a list that was not made from the plug-in's.
constexpr std::uint64_t digestOfProtocolNames = 0xefa29dd9aed18018;

std::uint64_t digest(std::string_view text) {
    std::uint64_t hash = 0xcbf29ce484222325;
    for (const char letter : text) {
        hash = (hash ^ static_cast<std::uint8_t>(letter)) * 0x100000001b3;
    }
    return hash;
}

TEST(ProtocolNames, ofAllNumbers) {
    std::string list;
    for (unsigned protocol = 0; protocol < 256; ++protocol) {
        Ipv4 header = withPayload(static_cast<std::uint8_t>(protocol), {});
        header.fragment = 1; // a later fragment: no protocol decodes
        const Runs runs = runAll(ipv4(header));
        const std::string name = runs.md.field("Protocol")->text.substr(std::string_view("Protocol=").size());
        EXPECT_EQ(linesWith(shortLines(runs.to), "295"), "295 \"" + name + "\"\n");
        EXPECT_EQ(runs.xtr.key("Protocol")->number, protocol);
        list += std::to_string(protocol) + '|' + name + '\n';
    }
    EXPECT_EQ(digest(list), digestOfProtocolNames);
}

struct LengthCase {
    std::uint16_t totalLength;
    std::size_t fields;
    std::uint32_t cursor;
    std::uint32_t flagsOfMv;
};

// A header, five octets of payload and five after the datagram: what each Total Length lets the passes read.
TEST(Ipv4Header, totalLengthLimitsTheDatagram) {
    const std::vector<LengthCase> cases = {
        // Below 4 the limit wraps around to more than there is, as it is above the packet.
        {0, 8, 33, 0},
        {3, 8, 33, 0},
        {31, 8, 33, 0},
        {65535, 8, 33, 0},
        // The rest of the header is read as far as the limit goes, and what no field covers is skipped.
        {4, 8, 33, 0},
        {5, 8, 41, 0x10},
        {6, 9, 49, 0},
        {7, 12, 57, 0x10}, // the first three flags fit into one octet, the offset does not
        {8, 13, 65, 0},
        {9, 14, 73, 0},
        {10, 15, 81, 0},
        {11, 15, 89, 0x10},
        {12, 16, 97, 0},
        {15, 16, 121, 0x10},
        {16, 17, 129, 0},
        {17, 17, 137, 0x10},
        {19, 17, 153, 0x10},
        {20, 18, 161, 0},
        {21, 19, 169, 0},
        {25, 23, 201, 0},
        {30, 28, 241, 0},
    };
    for (const LengthCase &length : cases) {
        SCOPED_TRACE("Total Length " + std::to_string(length.totalLength));
        Ipv4 header = withPayload(253);
        header.totalLength = length.totalLength;
        const Runs runs = runAll(ipv4(header) + hex("74 72 61 69 6c"));
        EXPECT_EQ(runs.md.fields.size(), length.fields);
        EXPECT_EQ(runs.md.flags, 0u);
        EXPECT_EQ(runs.mv.flags, length.flagsOfMv);
        EXPECT_EQ(runs.md.cursor, length.cursor);
        EXPECT_EQ(runs.md.bitsLeft, 241 - length.cursor); // for the host, trailer included
    }
}

TEST(Ipv4Header, packetThatEndsEarly) {
    Ipv4 header = withPayload(17, udp(53, 40000, hex("61*12")));
    const Octets packet = ipv4(header);
    for (std::size_t octets = 0; octets <= packet.size(); ++octets) {
        SCOPED_TRACE(octets);
        const Runs runs = runAll(std::span(packet).first(octets));
        const std::ptrdiff_t fields = octets == 0              ? 0
                                      : octets == 1            ? 2
                                      : octets < 4             ? 7
                                      : octets < packet.size() ? 8
                                                               : 22;
        const std::size_t read = octets < 3 ? octets : octets == 3 ? 2 : 4;
        EXPECT_EQ(std::ranges::count(lines(runs.md), '\n'), fields);
        EXPECT_EQ(runs.md.ending, Ending::complete);
        EXPECT_EQ(runs.mv.verdict.value, 0);
        if (octets < packet.size()) {
            EXPECT_EQ(runs.md.bitsLeft, 8 * (octets - read));
        }
    }
}

struct DispatchCase {
    std::uint8_t protocol;
    std::uint16_t fragment;
    bool decoded; // else shown octet by octet
};

TEST(Ipv4Dispatch, goesByFragmentAndProtocol) {
    const std::vector<DispatchCase> cases = {
        {17, 0x0000, true},  // whole
        {17, 0x2000, true},  // first fragment
        {17, 0x4000, true},  // whole, not to be fragmented
        {17, 0x4001, true},  // an offset where there can be none
        {17, 0x7fff, true},  //
        {17, 0x0001, false}, // last fragment
        {17, 0x2001, false}, // fragment in the middle
        {17, 0x8001, false}, // the reserved bit does not count
        {17, 0x1fff, false}, // the last offset
        {0, 0, false},       {2, 0, false},  {3, 0, false},  {5, 0, false},   {41, 0, false},  {50, 0, false},
        {59, 0, false},      {60, 0, false}, {94, 0, false}, {131, 0, false}, {133, 0, false}, {255, 0, false},
    };
    for (const DispatchCase &one : cases) {
        SCOPED_TRACE("protocol " + std::to_string(one.protocol) + ", fragment " + std::to_string(one.fragment));
        Ipv4 header = withPayload(one.protocol, udp(9, 9));
        header.fragment = one.fragment;
        const Runs runs = runAll(ipv4(header));
        EXPECT_EQ(runs.md.field("UDP Source Port") != nullptr, one.decoded);
        EXPECT_EQ(runs.md.fields.size(), one.decoded ? 22u : 26u);
        EXPECT_EQ(runs.md.fields.back().text, one.decoded ? "  Checksum=0" : "Unknown Protocol Data=0");
        EXPECT_EQ(runs.mv.flags, 0u);
        EXPECT_EQ(runs.xtr.key("Fragment Offset")->number, (one.fragment & 0x1fffu) * 8);
    }
}

// With a header length below 5 more octets of payload are expected than the packet has left, which raises a flag.
TEST(Ipv4Dispatch, headerLengthBelowTheHeader) {
    for (const std::uint8_t words : hex("00 01 04")) {
        Ipv4 header = withPayload(253);
        header.headerWords = words;
        const Runs runs = runAll(ipv4(header));
        EXPECT_EQ(runs.md.fields.size(), 23u);
        EXPECT_EQ(runs.md.flags, 0u);
        EXPECT_EQ(verdictLine(runs.mv), "verdict -52 flags 0x2\n");
    }
    Ipv4 header = withPayload(253, {});
    header.headerWords = 4; // expected: 4 octets; present: none
    EXPECT_EQ(runAll(ipv4(header)).mv.flags, 0x2u);
}

} // namespace
} // namespace netfloor::test
