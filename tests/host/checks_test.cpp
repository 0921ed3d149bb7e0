// SPDX-License-Identifier: MIT
// The checks of packets: each fault alone in a packet that is sound without it.
#include <gtest/gtest.h>

#include "netfloor-host/checks.h"
#include "support/packets.h"

namespace netfloor::test {
namespace {

// RFC 1071, as it is written there.
std::uint32_t sumOf(const Octets &octets) {
    std::uint32_t sum = 0;
    for (std::size_t i = 0; i < octets.size(); ++i) {
        sum += i % 2 == 0 ? std::uint32_t{octets[i]} << 8U : octets[i];
    }
    while (sum > 0xffff) {
        sum = (sum & 0xffffU) + (sum >> 16U);
    }
    return ~sum & 0xffffU;
}

void put16(Octets &packet, std::size_t at, std::uint32_t value) {
    packet[at] = static_cast<std::uint8_t>(value >> 8U);
    packet[at + 1] = static_cast<std::uint8_t>(value);
}

// Fills in the checksums of a packet, which are 0 in it.
Octets sealed(Octets packet) {
    const bool isV6 = packet[0] >> 4U == 6;
    const std::size_t header = isV6 ? 40 : (packet[0] & 0xfU) * std::size_t{4};
    const std::uint8_t protocol = packet[isV6 ? 6 : 9];
    const auto at = [&packet](std::size_t octet) { return packet.begin() + static_cast<std::ptrdiff_t>(octet); };
    const std::size_t field = header + (protocol == 6 ? 16 : protocol == 17 ? 6 : 2);
    const Octets payload(at(header), packet.end());
    const Octets addresses = isV6 ? Octets(at(8), at(40)) : Octets(at(12), at(20));
    const Octets pseudo = addresses + be32(static_cast<std::uint32_t>(payload.size())) + be32(protocol);
    const bool hasSum = protocol == 1 || protocol == 6 || protocol == 17 || protocol == 58;
    if (hasSum && field + 2 <= packet.size()) {
        put16(packet, field, sumOf(protocol == 1 ? payload : pseudo + payload));
    }
    if (!isV6) {
        put16(packet, 10, sumOf(Octets(at(0), at(header))));
    }
    return packet;
}

Octets tcp4(const Octets &options, const Octets &payload = {}) {
    const auto words = static_cast<std::uint32_t>(5 + options.size() / 4);
    return sealed(ipv4({.protocol = 6,
                        .payload = hex("0400 0050 00000001 00000002") + be16(words << 12U | 0x10U) +
                                   hex("0100 0000 0000") + options + payload}));
}

Octets icmp6(const Octets &message) {
    return sealed(ipv6({.nextHeader = 58, .payload = message}));
}

// One CRC-32c of RFC 9260 bit by bit.
Octets sctp4(const Octets &chunks) {
    Octets segment = hex("0b59 0b59 00000001 00000000") + chunks;
    std::uint32_t crc = ~std::uint32_t{0};
    for (const std::uint8_t octet : segment) {
        crc ^= octet;
        for (int bit = 0; bit < 8; ++bit) {
            crc = (crc >> 1U) ^ ((crc & 1U) != 0 ? 0x82f63b78U : 0);
        }
    }
    crc = ~crc;
    for (std::size_t i = 0; i < 4; ++i) {
        segment[8 + i] = static_cast<std::uint8_t>(crc >> 8U * i);
    }
    return sealed(ipv4({.protocol = 132, .payload = segment}));
}

Octets with(Octets packet, std::size_t at, std::uint8_t octet) {
    packet[at] = octet;
    return packet;
}

// With the IPv4 header sealed again.
Octets withHeader(Octets packet, std::size_t at, std::uint8_t octet) {
    packet[at] = octet;
    put16(packet, 10, 0);
    const std::size_t header = std::max<std::size_t>(20, (packet[0] & 0xfU) * std::size_t{4});
    put16(packet, 10, sumOf(Octets(packet.begin(), packet.begin() + static_cast<std::ptrdiff_t>(header))));
    return packet;
}

// Not every build has CRC-32c, and says so of each packet with SCTP.
bool isOfBuild(const Fault &fault) {
    return fault.text.starts_with("the checksum is not checked: this build");
}

std::string faultsOf(const Octets &packet, std::size_t wireOctets = 0) {
    constexpr const char *kinds[] = {"note ", "misread ", "damage "};
    std::string text;
    PacketChecks checks;
    for (const Fault &fault : checks.check(packet, wireOctets)) {
        if (isOfBuild(fault)) {
            continue;
        }
        text +=
            (text.empty() ? "" : "; ") + std::string(kinds[static_cast<std::size_t>(fault.kind)]) + faultText(fault);
    }
    return text;
}

const Octets udp4 = sealed(ipv4({.protocol = 17, .payload = udp(1, 2, hex("6162"))}));
const Octets udp6 = sealed(ipv6({.nextHeader = 17, .payload = udp(1, 2, hex("616263"))}));
const Octets tcpPlain = tcp4(hex("020405b4 01 030307"), hex("61*9"));
const Octets init = hex("01 00 0014 00000001 00010000 000a 000a 00000001");

TEST(Checks, findNothingInSoundPackets) {
    const std::vector<Octets> sound = {
        udp4,
        tcpPlain,
        udp6,
        icmp6(hex("87 00 0000 00000000 fe80 00*13 01 0101 020202020202")),
        sctp4(init),
        sctp4(hex("03 00 0014 00000001 00010000 0001 0000 0002 0003")),
        sealed(ipv4({.protocol = 1, .payload = hex("08 00 0000 0001 0001 61*8")})),
        sealed(ipv4({.protocol = 4, .payload = udp4})),
        sealed(ipv4({.protocol = 47, .payload = hex("0000 0800") + tcpPlain})),
        sealed(ipv4({.protocol = 17, .payload = hex("00*24"), .fragment = 0x0010})), // a later fragment
        // The extension of an ICMP message has a checksum, and what a routing header leads to is in that of UDP.
        sealed(ipv4({.protocol = 1, .payload = hex("0b 00 0000 00080000") + udp4 + hex("00*2 2000 defa 0004 0101")})),
        ipv6({.nextHeader = 43,
              .payload = hex("11 02 00 01 00*4 20010db8 00*11 02") + Octets(udp6.begin() + 40, udp6.end()),
              .destination = {0x20, 0x01}}),
    };
    for (const Octets &packet : sound) {
        EXPECT_EQ(faultsOf(packet), "") << hexText(packet);
        for (std::size_t captured = 1; captured < packet.size(); ++captured) { // the snap length is no fault
            const Octets cut(packet.begin(), packet.begin() + static_cast<std::ptrdiff_t>(captured));
            EXPECT_EQ(faultsOf(cut, packet.size()), "") << hexText(cut);
            EXPECT_NE(faultsOf(cut).find("damage"), std::string::npos) << hexText(cut);
        }
    }
}

TEST(Checks, nameEachFault) {
    struct Row {
        Octets packet;
        const char *faults;
    };
    const std::vector<Row> rows = {
        {hex("50*20"), "damage IP: the version is 5, at octet 0"},
        {withHeader(udp4, 0, 0x44), "damage IPv4: the header length is 16 octets, and 20 is the least, at octet 0"},
        {withHeader(udp4, 3, 19),
         "damage IPv4: the total length is 19 octets, and the header alone has 20, at octet 2"},
        {withHeader(udp4, 3, 24), "damage UDP: the header ends 4 octets short of 8, at octet 20"},
        {withHeader(udp4, 3, 40), "damage IPv4: the total length is 40 octets, and the packet has 30, at octet 2"},
        {with(udp4, 8, 63), "damage IPv4: the header checksum is wrong, at octet 10"},
        {with(udp4, 28, 0x60), "damage UDP: the checksum is wrong, at octet 26"},
        {with(udp4, 25, 7), "damage UDP: the length is 7 octets, and 8 is the least, at octet 24"},
        {with(udp4, 25, 11), "damage UDP: the length is 11 octets, and the datagram has 10, at octet 24"},
        {with(tcpPlain, 32, 0x40), "damage TCP: the data offset is 16 octets, and 20 is the least, at octet 32"},
        {with(tcpPlain, 32, 0xf0), "damage TCP: the data offset is 60 octets, and the segment has 37, at octet 32"},
        {tcp4(hex("02 05 05b4 00 00*3")), "damage TCP: option 2 has a length of 5, at octet 40"},
        {tcp4(hex("01*2 08 0a")), "damage TCP: option 8 ends 8 octets after the header, at octet 42"},
        {tcp4(hex("01*3 fe")), "damage TCP: option 254 has no length, as the header ends, at octet 43"},
        {with(tcpPlain, 33, 0), "note TCP: an acknowledgment number without the flag ACK, at octet 28; "
                                "damage TCP: the checksum is wrong, at octet 36"},
        {sealed(ipv4({.protocol = 253, .options = hex("9404 0000 07 09 04 00")})),
         "damage IPv4: option 7 ends 5 octets after the header, at octet 24"},
        {sealed(ipv6({.nextHeader = 0, .payload = hex("3b 00 05 05 0000 0000")})),
         "damage IPv6: option 5 ends 1 octets after the header, at octet 42"},
        {sealed(ipv6({.nextHeader = 0, .payload = hex("3b 00 05 02 0000 01 00")})),
         "misread IPv6: the plug-in reads the options after the first as the next header, at octet 46"},
        {sealed(ipv6({.nextHeader = 43, .payload = hex("3b 00 00 01 00000000")})),
         "damage IPv6: the routing header has 1 segments left and 0 addresses, at octet 43"},
        {sealed(ipv6({.nextHeader = 51, .payload = hex("3b 00 0000 00000001")})),
         "damage IPv6: the authentication header has 8 octets, and 12 is the least, at octet 41"},
        {with(sealed(ipv6({.nextHeader = 17, .payload = udp(1, 2)})), 46, 0),
         "damage UDP: the checksum is wrong, at octet 46"},
        {icmp6(hex("87 00 0000 00000000 fe80 00*13 01 0100")),
         "damage ICMPv6: option 1 has a length of 0, at octet 64"},
        {icmp6(hex("8f 00 0000 0000 0001 04 00 0001 ff02 00*13 01")),
         "damage ICMPv6: a multicast record ends 16 octets after the packet, at octet 48"},
        {sctp4(with(init, 3, 0x18)), "damage SCTP: chunk 1 ends 4 octets after the packet, at octet 32"},
        {sctp4(hex("05 00 0003")), "damage SCTP: chunk 5 has a length of 3, at octet 32"},
        {sctp4(hex("03 00 0010 00000001 00010000 0001 0000")),
         "damage SCTP: the SACK has 16 octets, and its blocks and duplicates need 20, at octet 32"},
        {sctp4(hex("0a 00 0005 61 000000 0b 00 0004")),
         "misread SCTP: the plug-in reads the padding after chunk 10 as the next chunk, at octet 37"},
        {sealed(ipv4({.protocol = 1, .payload = hex("09 10 0000 0102 0000 0a000001 00000000")})),
         "misread ICMP: the plug-in reads type 9 with code 0 only, at octet 21"},
        {sealed(ipv4({.protocol = 1, .payload = hex("0d 00 0000 0001 0001")})),
         "damage ICMP: the header ends 12 octets short of 20, at octet 20"},
        {sealed(ipv4({.protocol = 1, .payload = hex("0b 00 0000 00000000 45 00 0030 00*8")})),
         "damage ICMP: the quoted packet has 12 octets, and 28 is the least, at octet 28"},
        {sealed(ipv4({.protocol = 1, .payload = hex("0b 00 0000 00080000") + udp4 + hex("00*2 2000 0001 0003 0101")})),
         "damage ICMP: the checksum of the extension is wrong, at octet 62; "
         "damage ICMP: an object of the extension has a length of 3, at octet 64"},
        {sealed(ipv4({.options = hex("07 07 0a 00*4 00")})), "damage IPv4: option 7 has a pointer of 10, at octet 20"},
        {sealed(ipv4({.options = hex("86 0a 00000001 01 05 0000 00*2")})),
         "damage IPv4: tag 1 of the CIPSO option ends 1 octets after it, at octet 26"},
        {sealed(ipv6({.nextHeader = 60, .payload = hex("3b 00 c2 04 00010000")})),
         "note IPv6: option 194 belongs into another kind of header, at octet 42; "
         "damage IPv6: a jumbo payload option with a payload length of 8, at octet 42"},
        {sealed(ipv6({.nextHeader = 43, .payload = hex("3b 02 04 00 01 00*3 00*16")})),
         "damage IPv6: the last entry of the routing header is number 1, and it has 1 addresses, at octet 44"},
        {icmp6(hex("86 00 0000 00*12 05 02 00*14")),
         "damage ICMPv6: option 5 has a length of 2 times 8 octets, at octet 56"},
        {tcp4(hex("03 03 0f 00 ff 00*3")), "note TCP: the window scale is 15, and 14 is the most, at octet 42; "
                                           "note TCP: octets after the end of the options are not 0, at octet 43"},
        {sctp4(with(init, 3, 0x18) + hex("000c 0002")), "damage SCTP: parameter 12 has a length of 2, at octet 52"},
        {sctp4(hex("03 00 0014 00000001 00010000 0001 0000 0003 0002")),
         "damage SCTP: a gap block goes from 3 to 2, at octet 48"},
        {sealed(ipv4({.protocol = 47, .payload = hex("4000 0800 00000000 0000 00 04 0000 0000")})),
         "damage GRE route: the header ends 4 octets short of 4, at octet 36"},
        {sealed(ipv4({.protocol = 47, .payload = hex("0000 880b ff03 0021") + with(udp4, 28, 0x60)})),
         "damage UDP: the checksum is wrong, at octet 54"},
        {sealed(ipv4({.protocol = 1, .payload = hex("0b 00 0000 00000000") + with(udp4, 8, 1)})),
         "note quoted IPv4: the header checksum is wrong, at octet 38"},
        {sealed(ipv4({.options = hex("01*3 44")})),
         "damage IPv4: option 68 has no length, as the header ends, at octet 23"},
        {sealed(ipv4({.options = hex("44 01 00 00")})), "damage IPv4: option 68 has a length of 1, at octet 20"},
        {sealed(ipv4({.options = hex("07 08 04 00*5")})),
         "damage IPv4: option 7 has a length of 8, which holds no whole entries, at octet 20"},
        {sealed(ipv4({.options = hex("44 0c 05 02 00*8")})),
         "note IPv4: the timestamp option has the unknown form 2, at octet 23"},
        {sealed(ipv4({.options = hex("86 0a 00000001 01 03 0000 00*2")})),
         "damage IPv4: tag 1 of the CIPSO option has a length of 3, at octet 26"},
        {sealed(ipv4({.payload = hex("00*20"), .fragment = 0x1fff})),
         "damage IPv4: the fragment ends at octet 65548 of its datagram, and 65515 is the most, at octet 6"},
        {sealed(ipv6({.nextHeader = 0, .payload = hex("3b 00 01 03 000000 05")})),
         "misread IPv6: the plug-in reads the options after the first as the next header, at octet 47; "
         "damage IPv6: option 5 has no length, as the header ends, at octet 47"},
        {sealed(ipv6({.nextHeader = 60, .payload = hex("00 00 01 04 00*4 3b 00 01 04 00*4")})),
         "damage IPv6: a hop-by-hop header is not the first one, at octet 48"},
        {sealed(ipv6({.nextHeader = 43, .payload = hex("3b 01 00 00 00*12")})),
         "damage IPv6: the routing header has 16 octets, which hold no whole addresses, at octet 41"},
        {with(ipv6({.nextHeader = 43, .payload = hex("11 02 03 01 00*20") + udp(1, 2)}), 71, 1),
         "note UDP: the checksum is not checked, as the routing header does not tell the last address, at octet 70"},
        {sctp4(hex("01 00 0008 00*4")),
         "damage SCTP: chunk 1 has a length of 8, which is too short for its fields, at octet 32"},
        {sctp4(hex("03 00 0018 00000001 00010000 0002 0000 0002 0003 0003 0004")),
         "note SCTP: a gap block begins at 3, and the one before ends at 3, at octet 52"},
        {sctp4(hex("04 00 0006 0001 0000")), "damage SCTP: 2 octets after the last parameter are none, at octet 36"},
        {sctp4(hex("04 00 0008 0001 0010")), "damage SCTP: parameter 1 ends 12 octets after its chunk, at octet 36"},
        {sctp4(hex("06 00 0006 0000 0000")), "damage SCTP: 2 octets after the last cause are none, at octet 36"},
        {sctp4(hex("09 00 0008 0001 0010")), "damage SCTP: cause 1 ends 12 octets after its chunk, at octet 36"},
        {sctp4(hex("09 00 0008 0003 0004")), "damage SCTP: cause 3 has a length of 4, at octet 36"},
        {sealed(ipv4({.protocol = 47, .payload = hex("0002 0800")})), "note GRE: the version is 2, at octet 20"},
        {sealed(ipv4({.protocol = 47, .payload = hex("8000 0000 0001 0000")})),
         "damage GRE: the checksum is wrong, at octet 24"},
        {sealed(ipv4({.protocol = 1, .payload = hex("09 00 0000 00 02 0000")})),
         "damage ICMP: a router advertisement of 0 addresses with 2 words each, at octet 24"},
        {sealed(ipv4({.protocol = 1, .payload = hex("0b 00 0000 00 20 0000") + udp4})),
         "note ICMP: the quoted packet has 128 octets by its length, and the message has 30, at octet 25"},
        {sealed(ipv4({.protocol = 1, .payload = hex("0b 00 0000 00080000") + udp4 + hex("00*2 2000 0000 0010 0101")})),
         "damage ICMP: an object of the extension ends 12 octets after the message, at octet 64"},
        {with(tcpPlain, 39, 1), "note TCP: an urgent pointer without the flag URG, at octet 38; "
                                "damage TCP: the checksum is wrong, at octet 36"},
        {withHeader(ipv4({.protocol = 17, .payload = udp(1, 2, hex("6162")) + hex("00*2")}), 8, 64),
         "note UDP: 2 octets follow inside the datagram, at octet 30"},
    };
    for (const Row &row : rows) {
        EXPECT_EQ(faultsOf(row.packet), row.faults) << hexText(row.packet);
    }
}

TEST(Checks, judgeTheChecksumOfSctp) {
    Octets zero = sctp4(init);
    std::fill_n(zero.begin() + 28, 4, std::uint8_t{0});
    Octets old = zero;
    put16(old, 28, 0x19b8); // by another program
    put16(old, 30, 0x00f6);
    const std::pair<Octets, const char *> rows[] = {
        {with(sctp4(init), 47, 2), "SCTP: the checksum is wrong, at octet 28"},
        {zero, "SCTP: the checksum is left to the network card, at octet 28"},
        {old, "SCTP: the checksum is the one of RFC 2960, Adler-32, at octet 28"},
    };
    for (const auto &[packet, text] : rows) {
        PacketChecks checks;
        const auto faults = checks.check(packet);
        ASSERT_EQ(faults.size(), 1U);
        if (isOfBuild(faults.front())) {
            GTEST_SKIP() << "this build has no CRC-32c";
        }
        EXPECT_EQ(faultText(faults.front()), text);
    }
}

TEST(Checks, knowWhatANetworkCardFillsIn) {
    Octets partial = tcpPlain; // as a system leaves it to its card: the sum of the pseudo-header
    const Octets pseudo(partial.begin() + 12, partial.begin() + 20);
    put16(partial, 36, ~sumOf(pseudo + be32(static_cast<std::uint32_t>(partial.size() - 20)) + be32(6)) & 0xffffU);
    EXPECT_EQ(faultsOf(partial), "note TCP: the checksum is left to the network card, at octet 36");
    put16(partial, 36, ~sumOf(pseudo + be32(6)) & 0xffffU); // one that it divides
    EXPECT_EQ(faultsOf(partial), "note TCP: the checksum is left to the network card, at octet 36");
    put16(partial, 2, 0);
    EXPECT_EQ(faultsOf(withHeader(partial, 2, 0)).find("note IPv4: the total length is 0"), 0U);
}

} // namespace
} // namespace netfloor::test
