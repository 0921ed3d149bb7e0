// SPDX-License-Identifier: MIT
// Packets inside packets, and payloads that are known by name, as the command shows them.
#include <string>

#include <gtest/gtest.h>

#include "cli/command.h"
#include "support/captures.h"
#include "support/packets.h"

namespace netfloor::test {
namespace {

constexpr std::uint32_t linkTypeRaw = 101;

Octets inUdp(std::uint16_t port, const Octets &payload) {
    return ipv4({.protocol = 17, .payload = udp(port, 40000, payload)});
}

Octets gtpU(const Octets &inner) {
    return inUdp(2152, hex("30 ff") + be16(static_cast<std::uint32_t>(inner.size())) + be32(0x1b2c) + inner);
}

const Octets inner = ipv4({.protocol = 17, .payload = udp(7, 9, hex("61*20"))});

std::string run(const std::string &command, const std::vector<PcapPacket> &packets) {
    return shell("netfloor " + command + " " + writeFile("tunnel.pcap", pcapFile(linkTypeRaw, packets))).out;
}

std::size_t count(const std::string &text, const std::string &part) {
    std::size_t found = 0;
    for (std::size_t at = text.find(part); at != std::string::npos; at = text.find(part, at + 1)) {
        ++found;
    }
    return found;
}

TEST(Tunnels, openInDetail) {
    const std::string text = run("detail", {{gtpU(inner)}});
    EXPECT_NE(text.find("GTP-U: G-PDU, 48 octets, TEID 0x1b2c\n"), std::string::npos) << text;
    EXPECT_NE(text.find("[shown below: octets 36 to 83]\n"), std::string::npos) << text;
    EXPECT_NE(text.find("  Inside GTP-U 0x1b2c, from octet 36 on\n"), std::string::npos) << text;
    EXPECT_NE(text.find("[layer 1, octets 36 to "), std::string::npos) << text;
    EXPECT_EQ(count(text, "UDP Source Port"), 2U) << text;
    EXPECT_EQ(count(text, "Data=20 octets\n"), 1U) << text;
}

TEST(Tunnels, openAsFarAsTheyWereCaptured) {
    Octets cut = gtpU(inner);
    const auto wireOctets = static_cast<std::uint32_t>(cut.size());
    cut.resize(36 + 22); // two octets of the inner UDP header
    const std::string text = run("detail", {{cut, wireOctets}});
    EXPECT_NE(text.find("Inside GTP-U 0x1b2c"), std::string::npos) << text;
    EXPECT_EQ(count(text, "UDP Source Port"), 2U) << text;
    EXPECT_EQ(count(text, "UDP Destination Port="), 1U) << text;
    EXPECT_NE(text.find("cut by the snap length"), std::string::npos) << text;
}

TEST(Tunnels, haveTheirFaultsNamedWithTheirOctets) {
    Octets wrong = inner;
    wrong[25] = 0xff; // the length of UDP
    const std::string text = run("verify", {{gtpU(wrong)}});
    EXPECT_NE(text.find("UDP: the length is 255 octets, and the datagram has 28, at octet 60"), std::string::npos)
        << text;
    const Octets cut = ipv4({.protocol = 17, .payload = hex("0001 0002 00")});
    const std::string ofPlugin = run("verify", {{gtpU(cut)}});
    EXPECT_NE(ofPlugin.find("1 octet after 'UDP Destination Port' at octet 59"), std::string::npos) << ofPlugin;
}

TEST(Payloads, thatAreKnownHaveALine) {
    const Octets m3ua = hex("01 00 01 01 00000010 61*8");
    const Octets data = hex("0b59 0b59 00000001 00000000 00 03 0020 00000007 0001 0000 00000003") + m3ua;
    const struct {
        Octets packet;
        const char *line;
    } rows[] = {
        {inUdp(2123, hex("48 20 0008 00000012 00000100")), "GTP-C: create session request, 8 octets, TEID 0x12\n"},
        {inUdp(2123, hex("40 01 0004 00000100")), "GTP-C: echo request, 4 octets\n"}, // version 2 without a TEID
        {inUdp(2152, hex("30 fe 0000 00000012")), "GTP-U: end marker, 0 octets, TEID 0x12\n"},
        {inUdp(2152, hex("30 63 0000 00000012")), "GTP-U: message 99, 0 octets, TEID 0x12\n"},
        {ipv4({.protocol = 132, .payload = data}), "M3UA: DATA, 16 octets\n"},
        {inUdp(2152, hex("00*8")), "Data=8 octets\n"}, // no version of GTP
    };
    for (const auto &[packet, line] : rows) {
        const std::string text = run("detail", {{packet}});
        EXPECT_NE(text.find(line), std::string::npos) << line << text;
    }
}

} // namespace
} // namespace netfloor::test
