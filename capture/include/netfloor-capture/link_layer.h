// SPDX-License-Identifier: MIT
// From a captured packet to its IP header.
#pragma once

#include <compare>
#include <cstddef>
#include <cstdint>
#include <span>
#include <string>
#include <string_view>

namespace netfloor {

// What a packet is when it is not IP. It is a number or a name; the text is made only when it is needed.
class NotIp {
public:
    enum class Kind : std::uint8_t {
        ip, // it is IP
        name,
        cutHeader,
        etherType,
        pppProtocol,
        nlpid, // Frame Relay
        addressFamily,
        linkType,
    };

    NotIp() = default;
    NotIp(Kind kind, std::uint32_t number) : kind_(kind), number_(number) {}
    // `name` lives as long as the program.
    NotIp(Kind kind, std::string_view name) : kind_(kind), name_(name) {}

    [[nodiscard]] Kind kind() const { return kind_; }

    // "ARP", "EtherType 0x1234", "cut inside the VLAN header", ...; empty for IP.
    [[nodiscard]] std::string text() const;

    auto operator<=>(const NotIp &) const = default; // NOLINT(modernize-use-nullptr): taken for a null

private:
    Kind kind_ = Kind::ip;
    std::uint32_t number_ = 0;
    std::string_view name_;
};

struct NetworkPart {
    std::span<const std::uint8_t> octets; // from the IP header on; empty when there is none
    std::size_t offset = 0;               // of the IP header in the captured packet
    NotIp other;

    [[nodiscard]] bool isIp() const { return other.kind() == NotIp::Kind::ip; }
};

// Goes through the link layer: VLAN tags, PPPoE, SNAP and MPLS labels included.
[[nodiscard]] NetworkPart findNetworkPart(int linkType, std::span<const std::uint8_t> packet);

// "Ethernet", "Linux cooked v2", ..., or the number where neither this library nor libpcap has a name.
[[nodiscard]] std::string linkTypeName(int linkType);

} // namespace netfloor
