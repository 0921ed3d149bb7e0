// SPDX-License-Identifier: MIT
// From a captured packet to its IP header.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string>

namespace netfloor::cli {

struct NetworkPart {
    std::span<const std::uint8_t> octets; // from the IP header on; empty when there is none
    std::size_t offset = 0;               // of the IP header in the captured packet
    std::string other;                    // what the packet is when it is not IP: "ARP", "802.3 frame", ...

    [[nodiscard]] bool isIp() const { return other.empty(); }
};

// Goes through the link layer, whose type is a DLT_... of libpcap: VLAN tags, PPPoE and SNAP included.
[[nodiscard]] NetworkPart findNetworkPart(int linkType, std::span<const std::uint8_t> packet);

// "Ethernet", "Linux cooked v2", ...: as libpcap describes it.
[[nodiscard]] std::string linkTypeName(int linkType);

} // namespace netfloor::cli
