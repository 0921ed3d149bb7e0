// SPDX-License-Identifier: MIT
// Numbers and header lengths of the protocols around IP.
#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>

namespace netfloor {

enum IpProtocol : std::uint8_t {
    protocolHopByHop = 0,
    protocolIcmp = 1,
    protocolIpv4 = 4,
    protocolTcp = 6,
    protocolUdp = 17,
    protocolIpv6 = 41,
    protocolRouting = 43,
    protocolFragment = 44,
    protocolGre = 47,
    protocolAuthentication = 51,
    protocolMinimal = 55,
    protocolIcmpv6 = 58,
    protocolNone = 59,
    protocolDestination = 60,
    protocolSctp = 132,
    protocolMobility = 135,
};

constexpr std::uint32_t ipv4Octets = 20; // without options
constexpr std::uint32_t ipv6Octets = 40;
constexpr std::size_t ipv6AddressOctets = 16;
constexpr std::uint32_t tcpOctets = 20; // without options
constexpr std::uint32_t udpOctets = 8;

constexpr std::uint32_t etherIpv4 = 0x0800;
constexpr std::uint32_t etherIpv6 = 0x86dd;

// The headers between IPv6 and what it carries. The one of mobility ends the chain.
[[nodiscard]] constexpr bool isExtension(std::uint32_t protocol) {
    constexpr std::array extensions = {protocolHopByHop, protocolRouting, protocolFragment, protocolAuthentication,
                                       protocolDestination};
    return std::ranges::find(extensions, protocol) != extensions.end();
}

// The octets of an extension header, out of its length field.
[[nodiscard]] constexpr std::size_t extensionOctets(std::uint32_t protocol, std::uint32_t length) {
    switch (protocol) {
    case protocolFragment: return 8;
    case protocolAuthentication: return (std::size_t{length} + 2) * 4;
    default: return (std::size_t{length} + 1) * 8;
    }
}

} // namespace netfloor
