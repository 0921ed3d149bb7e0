// SPDX-License-Identifier: MIT
// What the command writes and keeps of a packet is bounded by the packet's size, whatever the packet holds.
#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <sys/resource.h>

#include "cli/command.h"

namespace netfloor::test {
namespace {

constexpr std::size_t mostOctets = 65535;

Octets repeated(const Octets &unit, std::size_t count) {
    Octets octets;
    for (std::size_t i = 0; i < count; ++i) {
        octets.insert(octets.end(), unit.begin(), unit.end());
    }
    return octets;
}

// As many headers as fit, one inside the other.
template <typename Wrap>
Octets nested(std::size_t headerOctets, Wrap wrap) {
    Octets packet;
    while (packet.size() + headerOctets <= mostOctets) {
        packet = wrap(packet);
    }
    return packet;
}

// As many chunks as fit, with `outerOctets` for headers around the packet.
Octets sctpChunks(const char *chunk, std::size_t outerOctets = 0) {
    const Octets unit = hex(chunk);
    const std::size_t headOctets = outerOctets + 32;
    return ipv4(
        {.protocol = 132, .payload = hex("0b590b59 00*8") + repeated(unit, (mostOctets - headOctets) / unit.size())});
}

constexpr std::size_t greOctets = 24; // with its IP header

Octets inGre(const Octets &inner) {
    return ipv4({.protocol = 47, .payload = hex("0000 0800") + inner});
}

struct Worst {
    const char *what;
    Octets packet;
};

std::vector<Worst> worstPackets() {
    const Octets optionsOf2048 = hex("3c ff") + repeated(hex("3e 00"), 1023);
    return {
        {"chunks of 4 octets", sctpChunks("0e000004")},
        {"chunks with user data", sctpChunks("00000011 00000001 00000000 00000000 61 000000")},
        {"parameters",
         ipv4({.protocol = 132, .payload = hex("0b590b59 00*8 0100 ffdc 00*16") + repeated(hex("80000004"), 16000)})},
        {"extension headers", ipv6({.nextHeader = 60, .payload = repeated(hex("3c00 0104 00000000"), 8000)})},
        {"fragment headers", ipv6({.nextHeader = 44, .payload = repeated(hex("2c00 0000 00000000"), 8000)})},
        {"options", ipv6({.nextHeader = 60, .payload = repeated(optionsOf2048, 31)})},
        {"IPv6 in IPv6", nested(40, [](const Octets &inner) { return ipv6({.nextHeader = 41, .payload = inner}); })},
        {"IPv4 in IPv4",
         nested(60,
                [](const Octets &inner) { return ipv4({.protocol = 4, .payload = inner, .options = hex("01*40")}); })},
        {"GRE in GRE", nested(greOctets, inGre)},
        {"chunks in two tunnels", inGre(inGre(sctpChunks("0e000004", 2 * greOctets)))},
        {"data in an HDLC frame", ipv4({.protocol = 47, .payload = hex("0000 880b 7e") + Octets(65000, 0x1b)})},
        {"data octet by octet", ipv4({.protocol = 1, .payload = hex("0800 0000 0001 0001") + Octets(65000, 0x1b)})},
    };
}

// The most octets of output: of the page without packets, and for each octet of a packet.
struct Bound {
    const char *command;
    std::size_t anOctet = 100;
    std::size_t pageOctets = 0;
};

constexpr Bound bounds[] = {
    {"summary"},
    {"summary --all"},
    {"detail"},
    {"detail --all --bits"},
    {"detail --all --bits --color always"},
    {"keys --per chunk"},
    {"verify"},
    {"json"},
    {"json --fields", 160},
    {.command = "html", .pageOctets = 65536},
};

TEST(Bounds, holdForTheWorstPackets) {
    for (const Worst &worst : worstPackets()) {
        writeFile("worst.pcap", pcapFile(101, {{worst.packet}}));
        for (const Bound &bound : bounds) {
            SCOPED_TRACE(std::string(worst.what) + ": " + bound.command);
            const Outcome outcome = shell(std::string("netfloor ") + bound.command + " $T/worst.pcap");
            EXPECT_EQ(outcome.err, "");
            EXPECT_LE(outcome.exitCode, 1);
            EXPECT_LE(outcome.out.size(), 4096 + bound.pageOctets + bound.anOctet * worst.packet.size());
        }
    }
#if !defined(__SANITIZE_ADDRESS__) // which keeps what was freed
    rusage usage = {};
    ASSERT_EQ(getrusage(RUSAGE_CHILDREN, &usage), 0);
    EXPECT_LE(usage.ru_maxrss, 32 * 1024 + 4 * 64) << "KiB";
#endif
}

// Each packet of another kind adds a word to the total, up to a number of them.
TEST(Bounds, holdForAnyNumberOfKindsOfPackets) {
    constexpr std::uint32_t kinds = 5000;
    std::vector<PcapPacket> packets;
    for (std::uint32_t family = 0; family < kinds; ++family) {
        packets.push_back({be32(0x10000 + family)});
    }
    writeFile("kinds.pcap", pcapFile(108, packets));
    const Outcome outcome = shell("netfloor $T/kinds.pcap | tail -n 2");
    EXPECT_NE(outcome.out.find("no IP: address family " + std::to_string(0x10000 + kinds - 1)), std::string::npos);
    EXPECT_NE(outcome.out.find(", 904 of other kinds)"), std::string::npos) << outcome.out.substr(0, 1000);
}

} // namespace
} // namespace netfloor::test
