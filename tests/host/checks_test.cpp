// SPDX-License-Identifier: MIT
// The checks of packets: each fault alone in a packet that is sound without it.
#include <algorithm>
#include <sstream>
#include <string>

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
        sctp4(with(init, 3, 0x1c) + hex("8008 0005 c1 000000")), // padding at the end of the chunk
        sealed(ipv4({.protocol = 1, .payload = hex("08 00 0000 0001 0001 61*8")})),
        sealed(ipv4({.protocol = 4, .payload = udp4})),
        sealed(ipv4({.protocol = 47, .payload = hex("0000 0800") + tcpPlain})),
        sealed(ipv4({.protocol = 17, .payload = hex("00*24"), .fragment = 0x0010})), // a later fragment
        sealed(ipv4({.options = hex("86 0e 00000001 01 04 0000 01 04 0000 00*2")})),
        sealed(ipv4({.protocol = 1, .payload = hex("05 01 0000 0a000001") + udp4})),
        icmp6(hex("8f 00 0000 0000 0001 04 00 0000 ff02 00*13 01")),
        ipv6({.nextHeader = 44, .payload = hex("3b 00 0001 00000001 00*16")}), // a first fragment, and a later one
        ipv6({.nextHeader = 44, .payload = hex("11 00 0008 00000001 00*3")}),
        ipv6({.nextHeader = 17, .payload = udp(1, 4789)}), // a tunnel needs no checksum
        sctp4(hex("82 00 0004 04 00 000c 0008 0008 8001 0004")),
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
    Octets chain;
    for (int header = 0; header < 17; ++header) {
        chain = sealed(ipv4({.protocol = 4, .payload = chain}));
    }
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
        {icmp6(hex("82 00 0000 0000 0000 ff02 00*13 01 02 7d 0001")),
         "damage ICMPv6: the header ends 16 octets short of 44, at octet 40"},
        {ipv6({.nextHeader = 17, .payload = udp(1, 2)}),
         "damage UDP: the checksum is 0, which IPv6 does not allow, at octet 46"},
        {with(udp6, 5, 0),
         "note IPv6: the payload length is 0, as of a jumbogram or where the network card fills it in, "
         "at octet 4"},
        {ipv6({.nextHeader = 44, .payload = hex("3b 00 0001 00000001 00*3")}),
         "damage IPv6: a fragment with others after it has 3 octets, which is no multiple of 8, at octet 40"},
        {sealed(ipv4({.payload = hex("01"), .options = hex("94 04 0000")})),
         "misread IPv4: the plug-in reads the octet after the options as one more, at octet 24"},
        // The checksum is over the home address, which is the source of the other packet.
        {ipv6({.nextHeader = 60,
               .payload = hex("11 02 c9 10") + Octets(udp6.begin() + 8, udp6.begin() + 24) + hex("01 02 0000") +
                          Octets(udp6.begin() + 40, udp6.end()),
               .source = {0xfd}}),
         "misread IPv6: the plug-in reads the options after the first as the next header, at octet 60"},
        {ipv6({.nextHeader = 0, .payload = hex("3b 00 c2 04 00000008"), .payloadLength = 0}),
         "note IPv6: the payload length is 0, as of a jumbogram or where the network card fills it in, at octet 4; "
         "damage IPv6: the jumbo payload has 8 octets, which need no such option, at octet 42"},
        {chain, "note IP: more than 16 IP headers are not checked, at octet 320"},
        {sctp4(with(init, 3, 0x18)), "damage SCTP: chunk 1 ends 4 octets after the packet, at octet 32"},
        {sctp4(hex("05 00 0003")), "damage SCTP: chunk 5 has a length of 3, at octet 32"},
        {sctp4(hex("03 00 0010 00000001 00010000 0001 0000")),
         "damage SCTP: the SACK has 16 octets, and its blocks and duplicates need 20, at octet 32"},
        {sctp4(hex("0a 00 0005 61 000000 0b 00 0004")),
         "misread SCTP: the plug-in reads the padding after chunk 10 as the next chunk, at octet 37"},
        {sealed(ipv4({.protocol = 1, .payload = hex("09 10 0000 0102 0000 0a000001 00000000")})),
         "misread ICMP: the plug-in reads type 9 with code 0 only, at octet 21"},
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
        {tcp4(hex("03 03 0f 00 ff 00*3")), "note TCP: the window scale is 15, and 14 is the most, at octet 42; "
                                           "note TCP: octets after the end of the options are not 0, at octet 43"},
        {sctp4(with(init, 3, 0x20) + hex("8008 0005 c1 000000 8000 0004")),
         "misread SCTP: the plug-in reads the padding after parameter 32776 as the next one, at octet 57"},
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
        {sctp4(hex("03 00 0018 00000001 00010000 0002 0000 0002 0003 0003 0004")),
         "note SCTP: a gap block begins at 3, and the one before ends at 3, at octet 52"},
        {sctp4(hex("04 00 0006 0001 0000")), "damage SCTP: 2 octets after the last parameter are none, at octet 36"},
        {sctp4(hex("04 00 0008 0001 0010")), "damage SCTP: parameter 1 ends 12 octets after its chunk, at octet 36"},
        {sctp4(hex("06 00 0006 0000 0000")), "damage SCTP: 2 octets after the last cause are none, at octet 36"},
        {sctp4(hex("09 00 0008 0001 0010")), "damage SCTP: cause 1 ends 12 octets after its chunk, at octet 36"},
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

// A type and a length, with zeros up to so many octets, in whole units.
Octets item(std::uint32_t type, std::uint32_t length, std::size_t octets, std::size_t unit = 1) {
    Octets all = {static_cast<std::uint8_t>(type), static_cast<std::uint8_t>(length)};
    all.resize((octets + unit - 1) / unit * unit);
    return all;
}

Octets inChunk(const char *chunk, std::uint32_t type, std::uint32_t octets) {
    return sctp4(hex(chunk) + be16(octets + 4) + be16(type) + be16(octets) + Octets(octets - 4));
}

// With an octet less than the RFCs give to a kind, the least, the most, and one more.
TEST(Checks, holdTheLengthOfEachKind) {
    using Packet = Octets (*)(std::uint32_t type, std::uint32_t length);
    const Packet ipv4Option = [](auto type, auto length) {
        return sealed(ipv4({.options = item(type, length, std::min(length, 40U), 4)}));
    };
    const Packet tcpOption = [](auto type, auto length) { return tcp4(item(type, length, std::max(length, 2U), 4)); };
    const Packet ipv6Option = [](auto type, auto length) {
        const std::uint32_t units = (length + 4 + 7) / 8;
        return ipv6({.nextHeader = 60, .payload = item(59, units - 1, 2) + item(type, length, units * 8 - 2)});
    };
    const Packet neighbourOption = [](auto type, auto length) {
        return icmp6(hex("87 00 0000 00000000 00*16") + item(type, length, std::max(length, 1U) * 8));
    };
    const Packet icmp = [](auto type, auto length) { return ipv4({.protocol = 1, .payload = item(type, 0, length)}); };
    const Packet icmpv6 = [](auto type, auto length) { return icmp6(item(type, 0, length)); };
    const Packet chunk = [](auto type, auto length) {
        return sctp4(item(type, 0, 2) + be16(length) + Octets(length - 4));
    };
    const Packet parameter = [](auto type, auto length) { return inChunk("04 00", type, length); };
    const Packet cause = [](auto type, auto length) { return inChunk("09 00", type, length); };
    const struct {
        Packet packet;
        std::string what; // "" for a message, which has no length field
        std::string afterLength;
        const char *kinds; // type, least, most or 0 for any
    } families[] = {
        {ipv4Option, "option", ", at",
         "7 3 40  11 4 4  12 4 4  25 8 8  68 4 40  82 12 12  130 3 40  131 3 40  133 3 40  134 6 40  136 4 4  137 3 40 "
         "148 4 4"},
        {tcpOption, "option", ", at",
         "2 4 4  3 3 3  4 2 2  5 10 34  6 6 6  7 6 6  8 10 10  9 2 2  10 3 3  11 6 6  12 6 6  13 6 6  14 3 3  19 18 18 "
         "20 4 4  21 6 6  22 2 2  23 2 2  27 8 8  28 4 4  29 4 0  30 3 0  34 2 18  253 4 0  254 4 0"},
        {ipv6Option, "option", ", at", "4 1 1  5 2 2  7 8 0  38 6 6  99 4 0  194 4 4  201 16 16"},
        {neighbourOption, "option", "", "3 4 4  5 1 1  17 2 3  24 1 3  25 3 0  31 2 0"},
        {icmp, "", "", "8 8 0  13 20 0  14 20 0  17 12 0  18 12 0"},
        {icmpv6, "", "",
         "1 8 0  2 8 0  3 8 0  4 8 0  128 8 0  129 8 0  130 24 0  131 24 0  132 24 0  133 8 0  134 16 0  135 24 0 "
         "136 24 0  137 40 0  138 16 0  139 16 0  140 16 0  143 8 0"},
        {chunk, "chunk", ", which",
         "0 17 0  1 20 0  2 20 0  3 16 0  7 8 0  12 8 0  13 8 0  15 8 0  16 20 0  64 20 0  128 8 0  192 8 0  193 8 0 "
         "194 8 0"},
        {parameter, "parameter", ", at",
         "5 8 0  6 20 0  9 8 0  13 16 0  14 8 0  15 8 0  16 12 0  17 12 0  18 12 0  49153 8 0  49154 8 0  49155 8 0 "
         "49156 8 0  49157 8 0  49158 8 0"},
        {cause, "cause", ", at", "1 8 0  2 8 0  3 8 0  9 8 0"},
    };
    for (const auto &[packet, what, afterLength, kinds] : families) {
        std::istringstream list(kinds);
        for (std::uint32_t type = 0, least = 0, most = 0; list >> type >> least >> most;) {
            const std::uint32_t known = most == 0 ? least : most;
            for (const std::uint32_t length : {least - 1, least, known, most == 0 ? known : known + 1}) {
                const std::string words = what.empty() ? "the header ends 1 octets short of "
                                                       : what + " " + std::to_string(type) + " has a length of " +
                                                             std::to_string(length) + afterLength;
                const bool isRefused = faultsOf(packet(type, length)).find(words) != std::string::npos;
                EXPECT_EQ(isRefused, length < least || length > known) << what << ' ' << type << ' ' << length;
            }
        }
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
