// SPDX-License-Identifier: MIT
// Packets inside packets, and payloads that are known by name, as the command shows them.
#include <string>
#include <vector>

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

TEST(Tunnels, areOpenedAndKnownPayloadsHaveALine) {
    Octets wrong = inner;
    wrong[25] = 0xff; // the length of UDP
    Octets cut = gtpU(inner);
    cut.resize(36 + 22); // two octets of the inner UDP header
    const Octets m3ua = hex("01 00 01 01 00000010 61*8");
    const Octets data = hex("0b59 0b59 00000001 00000000 00 03 0020 00000007 0001 0000 00000003") + m3ua;
    const auto captured = [](const Octets &packet) { return static_cast<std::uint32_t>(packet.size()); };
    struct Row {
        PcapPacket packet;
        const char *out;
        const char *absent = "";
        std::string command = "detail";
        int exitCode = 0;
    };
    const std::vector<Row> rows = {
        {{gtpU(inner)},
         "UDP Source Port...GTP-U: G-PDU, 48 octets, TEID 0x1b2c\n...[shown below: octets 36 to 83]\n..."
         "  Inside GTP-U 0x1b2c, from octet 36 on\n...UDP Source Port...Data=20 octets\n...[layer 1, octets 36 to "},
        {{cut, captured(gtpU(inner))},
         "Inside GTP-U 0x1b2c...UDP Source Port...cut by the snap length",
         "Port=Discard"},
        {{gtpU(wrong)}, "UDP: the length is 255 octets, and the datagram has 28, at octet 60", "", "verify", 1},
        {{gtpU(ipv4({.protocol = 17, .payload = hex("0001 0002 00")}))},
         "1 octet after 'UDP Destination Port' at octet 59",
         "",
         "verify",
         1},
        {{inUdp(2123, hex("48 20 0008 00000012 00000100"))}, "GTP-C: create session request, 8 octets, TEID 0x12\n"},
        {{inUdp(2123, hex("40 01 0004 00000100"))}, "GTP-C: echo request, 4 octets\n"}, // version 2 without a TEID
        {{inUdp(2152, hex("30 fe 0000 00000012"))}, "GTP-U: end marker, 0 octets, TEID 0x12\n"},
        {{inUdp(2152, hex("30 63 0000 00000012"))}, "GTP-U: message 99, 0 octets, TEID 0x12\n"},
        {{ipv4({.protocol = 132, .payload = data})}, "M3UA: DATA, 16 octets\n"},
        {{inUdp(2152, hex("00*8"))}, "Data=8 octets\n"}, // no version of GTP
    };
    for (const auto &[packet, out, absent, command, exitCode] : rows) {
        writeFile("tunnel.pcap", pcapFile(linkTypeRaw, {packet}));
        check({{"netfloor " + command + " $T/tunnel.pcap", exitCode, out, "", absent}});
    }
}

} // namespace
} // namespace netfloor::test
