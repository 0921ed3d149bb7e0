// SPDX-License-Identifier: MIT
// Plain packets: one IP header without options or extension headers, then UDP, TCP with the usual options, an echo of
// ICMP, or a later fragment. Most traffic is that. The fields of such a packet have fixed places, so that they can be
// read without a pass.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>

namespace netfloor {

// A header, or an option of TCP.
enum class PlainPart : std::uint8_t {
    ipv4,
    ipv6,
    tcp,
    udp,
    icmpEcho,
    maximumSegment,
    windowScale,
    sackPermitted,
    sackBlock, // the two edges
    timestamps,
};
constexpr std::size_t plainParts = 10;

[[nodiscard]] constexpr std::uint32_t octetsOf(PlainPart part) {
    constexpr std::array<std::uint8_t, plainParts> octets = {20, 40, 20, 8, 8, 4, 3, 2, 8, 10};
    return octets[static_cast<std::size_t>(part)];
}

struct PlainPacket {
    static constexpr std::size_t mostOptions = 20;

    struct Option {
        PlainPart part;
        std::uint32_t octet;
    };

    PlainPart ip = PlainPart::ipv4;
    std::optional<PlainPart> transport; // none in a later fragment
    std::uint32_t payloadOctet = 0;
    std::uint32_t endOctet = 0; // of the payload, by the length in the IP header
    std::uint32_t optionCount = 0;
    std::array<Option, mostOptions> options; // those with fields
};

// Finds out whether a packet is plain, and where its parts are. `wireOctets` is 0 or its length on the wire.
[[nodiscard]] bool findPlain(std::span<const std::uint8_t> octets, std::size_t wireOctets, PlainPacket &found);

} // namespace netfloor
