// SPDX-License-Identifier: MIT
// The peer: libtins decodes the same packets and reads the same keys.
#pragma once

#include <array>
#include <cstdint>
#include <span>

namespace netfloor::bench {

// The keys that the XTR pass finds in the packets of the benchmark.
struct PeerKeys {
    std::uint8_t version;
    std::uint16_t totalLength; // IPv6: Payload Length
    std::uint16_t identification;
    std::uint8_t timeToLive;
    std::uint8_t protocol; // IPv6: Next Header
    bool dontFragment;
    bool moreFragments;
    std::uint16_t fragmentOffset; // in octets
    std::array<std::uint8_t, 16> source;
    std::array<std::uint8_t, 16> destination;
    std::uint8_t extensionHeaders;
    std::uint16_t extensionOctets;
    std::uint16_t sourcePort;
    std::uint16_t destinationPort;
    std::uint32_t sequence;
    std::uint32_t acknowledgement;
    std::uint8_t dataOffset;
    bool reset;
    bool synchronize;
    bool finish;
};

// Throws what libtins throws for a packet that it cannot decode.
void readKeys(std::span<const std::uint8_t> packet, PeerKeys &keys);

} // namespace netfloor::bench
