// SPDX-License-Identifier: MIT
// Packets inside a packet that the grammar of the plug-in takes for data: in GTP-U, VXLAN and GRE, IPv6 in IPv4 and
// IPv4 in IPv6. Each of them is a packet of its own for the plug-in.
//
//     for (netfloor::InnerPackets at(packet); !at.ended(); at.next()) {
//         host.run(netfloor::Pass::md, at.octets(), sink);
//     }
//
// `wireOctets` is the length on the wire of a packet that the snap length has cut, and 0 of another one.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <string_view>

namespace netfloor {

enum class Tunnel : std::uint8_t { none, ip, gre, gtpU, vxlan };

[[nodiscard]] std::string_view tunnelName(Tunnel tunnel); // "GTP-U"

// Octets are counted from the start of the packet that was searched.
struct InnerPacket {
    Tunnel tunnel = Tunnel::none;
    std::uint32_t headerOctet = 0;        // where the header of the tunnel starts; for Tunnel::ip, the inner packet
    std::uint32_t firstOctet = 0;         // of the inner IP header
    std::uint32_t octets = 0;             // of the inner packet and of what follows it, as far as captured
    std::uint32_t wireOctets = 0;         // the same on the wire
    std::optional<std::uint32_t> id = {}; // TEID of GTP-U, network identifier of VXLAN, key of GRE
};

// The first packet inside `packet` that the plug-in does not read itself. Headers that the plug-in does read (IP in
// IP, minimal encapsulation, IPv6 in IPv6, extension headers) are passed over. None in a later fragment.
[[nodiscard]] std::optional<InnerPacket> findInnerPacket(std::span<const std::uint8_t> packet,
                                                         std::size_t wireOctets = 0);

// The same of a GRE header and of a UDP header, and of what follows it. GTP-U is that of TS 29.281.
[[nodiscard]] std::optional<InnerPacket> findInGre(std::span<const std::uint8_t> packet, std::size_t wireOctets = 0);
[[nodiscard]] std::optional<InnerPacket> findInUdp(std::span<const std::uint8_t> datagram, std::size_t wireOctets = 0);

struct UpperLayer {
    std::uint32_t octet = 0; // of the packet
    std::uint8_t protocol = 0;
};

// The header after the extension headers of an IPv6 packet, by their lengths. The plug-in reads on at another place
// after an options header with several options. None where a header is cut or a later fragment.
[[nodiscard]] std::optional<UpperLayer> findUpperLayer(std::span<const std::uint8_t> packet,
                                                       std::size_t wireOctets = 0);

// The packet itself and then each packet inside the one before.
class InnerPackets {
public:
    static constexpr std::uint32_t mostPackets = 16;
    static constexpr std::uint32_t mostOctets = 262144; // of all packets together

    explicit InnerPackets(std::span<const std::uint8_t> packet, std::size_t wireOctets = 0);

    [[nodiscard]] bool ended() const { return ended_; }
    void next();

    [[nodiscard]] std::span<const std::uint8_t> octets() const { return octets_; }
    [[nodiscard]] std::size_t wireOctets() const { return wireOctets_; }   // as in RunOptions
    [[nodiscard]] std::uint32_t firstOctet() const { return firstOctet_; } // in the outermost packet
    [[nodiscard]] const InnerPacket &opened() const { return opened_; }    // how this one was found
    [[nodiscard]] bool isInner() const { return opened_.tunnel != Tunnel::none; }

    // After the end: why a packet inside the last one stays closed, or nothing.
    [[nodiscard]] std::string_view limit() const { return limit_; }

private:
    std::span<const std::uint8_t> octets_;
    std::size_t wireOctets_ = 0;
    std::uint32_t firstOctet_ = 0;
    std::uint32_t packets_ = 1;
    std::uint64_t allOctets_ = 0;
    InnerPacket opened_;
    std::string_view limit_;
    bool ended_ = false;
};

} // namespace netfloor
