// SPDX-License-Identifier: MIT
// The packets that are measured.
#pragma once

#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "support/packets.h"

namespace netfloor::bench {

using test::Octets;

// One row of the results: the packets are decoded in turn, and the figures are for one packet.
struct PacketSet {
    std::string_view name;
    std::vector<Octets> packets;
    bool peerKnows; // libtins decodes the packets up to the transport header
};

// The packet for which there is hand-written code: IPv4 + UDP with 60 octets of payload, ports without a name.
[[nodiscard]] const Octets &plainUdp();

[[nodiscard]] std::span<const PacketSet> packetSets();

// One packet each, of those that take longest: full of what is small and costs much.
[[nodiscard]] std::span<const PacketSet> worstPackets();

} // namespace netfloor::bench
