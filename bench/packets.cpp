// SPDX-License-Identifier: MIT
#include "packets.h"

namespace netfloor::bench {
namespace {

using test::hex;
using test::ipv4;
using test::ipv6;
using test::udp;
using test::operator+;

constexpr std::uint8_t tcpNumber = 6;
constexpr std::uint8_t udpNumber = 17;
constexpr std::uint8_t sctpNumber = 132;

Octets tcpWithTimestamps(std::size_t payloadOctets) {
    return hex(R"(
        9c 40 c3 50  12 34 56 78  9a bc de f0   # ports 40000 and 50000, sequence, acknowledgement
        80 18 01 f6  ab cd 00 00                # 32 octets of header; PSH, ACK; window, checksum, urgent
        01 01 08 0a  3b 9a ca 00  3b 9a c9 ff   # two no-operations, timestamps
    )") + Octets(payloadOctets, 0x61);
}

Octets tcpSyn() {
    return hex(R"(
        9c 40 01 bb  12 34 56 78  00 00 00 00   # ports 40000 and 443
        a0 02 fa f0  ab cd 00 00                # 40 octets of header; SYN
        02 04 05 b4  04 02                      # maximum segment size, selective acknowledgement permitted
        08 0a 3b 9a ca 00 00 00 00 00           # timestamps
        01 03 03 07                             # no-operation, window scale
    )");
}

Octets tcpPlain(std::size_t payloadOctets) {
    return hex(R"(
        00 50 9c 40  12 34 56 78  9a bc de f0   # ports 80 and 40000
        50 10 01 f6  ab cd 00 00                # 20 octets of header; ACK
    )") + Octets(payloadOctets, 0x61);
}

Octets udpOf(std::uint16_t source, std::uint16_t destination, std::size_t payloadOctets) {
    return udp(source, destination, Octets(payloadOctets, 0x61));
}

// The usual packets in the backbone of a mobile network, without the rare ones: no ping, no fragment.
std::vector<Octets> mix() {
    return {
        ipv4({.protocol = tcpNumber, .payload = tcpSyn(), .fragment = 0x4000}),
        ipv4({.protocol = tcpNumber, .payload = tcpWithTimestamps(0), .fragment = 0x4000}),
        ipv4({.protocol = tcpNumber, .payload = tcpWithTimestamps(512), .fragment = 0x4000}),
        ipv4({.protocol = tcpNumber, .payload = tcpPlain(0), .fragment = 0x4000}),
        ipv4({.protocol = tcpNumber, .payload = tcpPlain(512), .fragment = 0x4000}),
        ipv4({.protocol = udpNumber, .payload = udpOf(53, 40000, 100)}),
        ipv4({.protocol = udpNumber, .payload = udpOf(2152, 2152, 512)}),
        ipv4({.protocol = udpNumber, .payload = udpOf(40000, 50000, 60)}),
    };
}

// One option fills each header, as only the first of a header is read as an option.
Octets hopByHopAndDestinationOptions() {
    return hex(R"(
        3c 00 01 04 00 00 00 00   # hop by hop: destination options follow; PadN
        06 00 01 04 00 00 00 00   # destination options: TCP follows; PadN
    )");
}

// Selective acknowledgement first, as control chunks come before DATA.
Octets sackAndData() {
    return hex(R"(
        0b 59 0b 59  12 34 56 78  00 00 00 00   # ports 2905, verification tag, checksum
        03 00 00 10  00 00 10 00  00 00 ff ff   # SACK: cumulative TSN, window,
        00 00 00 00                             #   no gap, no duplicate
        00 03 00 50  00 00 10 01  00 01 00 02   # DATA: TSN, stream, sequence,
        00 00 00 03  61*64                      #   payload protocol M3UA, 64 octets
    )");
}

Octets initWithFourParameters() {
    return hex(R"(
        0b 59 0b 59  00 00 00 00  00 00 00 00   # ports 2905, verification tag, checksum
        01 00 00 34  12 34 56 78  00 00 ff ff   # INIT: tag, window,
        00 0a 00 0a  00 00 10 00                #   streams out and in, initial TSN
        00 05 00 08  0a 00 00 01                # IPv4 address
        00 05 00 08  0a 00 01 01                # IPv4 address
        00 09 00 08  00 00 10 00                # cookie preservative
        00 0c 00 08  00 05 00 06                # supported address types: IPv4, IPv6
    )");
}

Octets repeated(const Octets &part, std::size_t times) {
    Octets all;
    for (std::size_t i = 0; i < times; ++i) {
        all.insert(all.end(), part.begin(), part.end());
    }
    return all;
}

// An SCTP INIT that fills an IPv4 datagram with one parameter again and again.
Octets initFullOf(const Octets &parameter) {
    constexpr std::size_t octetsBefore = 20 + 12 + 20; // headers of IPv4, SCTP and INIT
    const Octets parameters = repeated(parameter, (65535 - octetsBefore) / parameter.size());
    const std::size_t chunkOctets = 20 + parameters.size();
    const Octets length = {static_cast<std::uint8_t>(chunkOctets >> 8), static_cast<std::uint8_t>(chunkOctets)};
    return ipv4({.protocol = sctpNumber,
                 .payload = hex("0b 59 0b 59 00*8 01 00") + length +
                            hex("12 34 56 78 00 00 ff ff 00 0a 00 0a 00 00 10 00") + parameters});
}

Octets followedBy(Octets packet, std::size_t octets) {
    packet.resize(packet.size() + octets);
    return packet;
}

} // namespace

const Octets &plainUdp() {
    static const Octets packet = ipv4({.protocol = udpNumber, .payload = udpOf(40000, 50000, 60)});
    return packet;
}

std::span<const PacketSet> packetSets() {
    static const std::vector<PacketSet> sets = {
        {"IPv4 + UDP, 60 octets", {plainUdp()}, true},
        {"IPv4 + TCP with timestamps, 512 octets",
         {ipv4({.protocol = tcpNumber, .payload = tcpWithTimestamps(512)})},
         true},
        {"IPv4 mix: 5 TCP, 3 UDP", mix(), true},
        {"IPv6 + UDP, 60 octets", {ipv6({.nextHeader = udpNumber, .payload = udpOf(40000, 50000, 60)})}, true},
        {"IPv6 + 2 extension headers + TCP",
         {ipv6({.nextHeader = 0, .payload = hopByHopAndDestinationOptions() + tcpWithTimestamps(512)})},
         true},
        {"SCTP SACK + DATA", {ipv4({.protocol = sctpNumber, .payload = sackAndData()})}, false},
        {"SCTP INIT, 4 parameters", {ipv4({.protocol = sctpNumber, .payload = initWithFourParameters()})}, false},
    };
    return sets;
}

std::span<const PacketSet> worstPackets() {
    static const Octets emptyAddresses = initFullOf(hex("00 06 00 04"));
    static const std::vector<PacketSet> sets = {
        {"3,274 IPv6 addresses in an INIT", {initFullOf(hex("00 06 00 14 20 01 0d b8 12*12"))}, false},
        {"16,370 addresses without octets", {emptyAddresses}, false},
        {"the same in 30 MB", {followedBy(emptyAddresses, 30'000'000)}, false},
        {"8,190 extension headers",
         {ipv6({.nextHeader = 60, .payload = repeated(hex("3c 00 01 04 00*4"), 8190)})},
         false},
        {"16,375 chunks of four fields",
         {ipv4({.protocol = sctpNumber, .payload = hex("0b 59 0b 59 00*8") + repeated(hex("06 00 00 04"), 16375)})},
         false},
        {"65,515 octets of unknown data", {ipv4({.protocol = 253, .payload = Octets(65515, 0x61)})}, false},
    };
    return sets;
}

} // namespace netfloor::bench
