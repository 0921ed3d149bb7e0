// SPDX-License-Identifier: MIT
// Packets as a test writes them.
//
//     const Octets packet = ipv4({.protocol = 17, .payload = hex(R"(
//         00 35 9c 40   # ports 53 and 40000
//         00 0c 00 00   # length, checksum
//         61*4          # four octets of payload
//     )")});
//
// Lengths and header words are computed where a test does not give them; checksums are not (0).
#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace netfloor::test {

using Octets = std::vector<std::uint8_t>;

// Two digits an octet, blanks and line ends anywhere between octets; "61*4" repeats an octet; a comment reaches from
// '#' to the end of the line. Throws std::invalid_argument for anything else.
[[nodiscard]] Octets hex(std::string_view text);

[[nodiscard]] std::string hexText(std::span<const std::uint8_t> octets);

// One after the other.
[[nodiscard]] Octets operator+(Octets front, const Octets &back);

// A number in network order.
[[nodiscard]] Octets be16(std::uint32_t value);
[[nodiscard]] Octets be32(std::uint32_t value);

struct Ipv4 { // RFC 791
    std::uint8_t protocol = 253;
    Octets payload = {};
    Octets options = {}; // a multiple of 4 octets
    std::uint8_t typeOfService = 0;
    std::uint16_t identification = 0x1234;
    std::uint16_t fragment = 0; // flags and fragment offset as in the packet
    std::uint8_t timeToLive = 64;
    std::uint32_t source = 0x0a000001;      // 10.0.0.1
    std::uint32_t destination = 0xc0a80002; // 192.168.0.2
    std::optional<std::uint16_t> totalLength = {};
    std::optional<std::uint8_t> headerWords = {}; // Internet Header Length
};
[[nodiscard]] Octets ipv4(const Ipv4 &header);

struct Ipv6 { // RFC 8200
    std::uint8_t nextHeader = 59;
    Octets payload = {}; // with the extension headers
    std::uint8_t trafficClass = 0;
    std::uint32_t flowLabel = 0;
    std::uint8_t hopLimit = 64;
    std::array<std::uint8_t, 16> source = {0x20, 0x01, 0x0d, 0xb8, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 1};
    std::array<std::uint8_t, 16> destination = {0x20, 0x01, 0x0d, 0xb8, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 2};
    std::optional<std::uint16_t> payloadLength = {};
};
[[nodiscard]] Octets ipv6(const Ipv6 &header);

// RFC 768.
[[nodiscard]] Octets udp(std::uint16_t sourcePort, std::uint16_t destinationPort, const Octets &payload = {});

// The first `octets` octets of an IPv4 or IPv6 packet whose length field says that this is all of it.
[[nodiscard]] Octets shortened(const Octets &packet, std::size_t octets);

// The packet at another bit of the first octet: `shift` bits, all set, come before it.
[[nodiscard]] Octets shifted(const Octets &packet, unsigned shift);

} // namespace netfloor::test
