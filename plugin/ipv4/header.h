// SPDX-License-Identifier: MIT
// The IPv4 header (RFC 791) and the dispatch on its protocol.
//
//    0                   1                   2                   3
//    0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1
//   +-------+-------+---------------+-------------------------------+
//   |Version|  IHL  |Type of Service|          Total Length         |
//   +-------+-------+---------------+-----+-------------------------+
//   |         Identification        |Flags|     Fragment Offset     |
//   +---------------+---------------+-----+-------------------------+
//   |  Time to Live |    Protocol   |        Header Checksum        |
//   +---------------+---------------+-------------------------------+
//   |                        Source Address                         |
//   |                     Destination Address                       |
//   +---------------------------------------------------------------+
//   |                     Options and padding                       |
//   +---------------------------------------------------------------+
//
// Neither the checksum nor the version nor the header length is tested for plausibility. The version has been
// read ahead when the header starts. What the Total Length allows is a limited block, so that what lies behind
// the datagram stays to whoever brought it.
#pragma once

#include "frame/block.h"
#include "frame/field.h"
#include "frame/step.h"
#include "frame/stretch.h"
#include "icmp/icmp.h"
#include "icmp/icmpv6.h"
#include "ipv4/options.h"
#include "ipv4/service_and_fragment.h"
#include "ipv4/unknown_data.h"
#include "sctp/sctp.h"
#include "tables/protocol_numbers.h"
#include "transport/tcp.h"
#include "transport/udp.h"
#include "tunnels/gre.h"
#include "tunnels/tunnel.h"

namespace netfloor::ipv4 {

// clang-format off
inline constexpr Field headerLength       {152, "Internet Header Length", piece(0, 3).advancing(8), "Internet Header Length=%u*4 octets"};
inline constexpr Field totalLength        {153, "Total Length",           octets(2),                "Total Length=%u octets"};
inline constexpr Field identification     {156, "Identification",         octets(2),                "Identification=%x"};
inline constexpr Field timeToLive         {157, "Time to Live",           octets(1),                "Time to Live=%u"};
inline constexpr Field protocol           {295, "Protocol",               octets(1),                "Protocol=%-S", &protocolNames};
inline constexpr Field headerChecksum     {158, "Header Checksum",        octets(2),                "Header Checksum=%x"};
inline constexpr Field sourceAddress      {159, "Source Address",         octets(4),                R"(Source Address= %-["%u":"."])"};
inline constexpr Field destinationAddress {160, "Destination Address",    octets(4),                R"(Destination Address= %-["%u":"."])"};
// clang-format on

// What the datagram holds in front of its limited block: the octets of version, service and Total Length.
inline constexpr std::uint32_t bitsBeforeLimit = 32;

// Runs the production of the payload. A later fragment is data, whatever its protocol; with DF set the offset
// does not count.
template <class Pass>
NETFLOOR_INLINE inline void dispatch(Reader<Pass> &at) {
    const auto &variables = at.variables();
    if (variables.fragmentOffset >= 1 && variables.dontFragment == 0) {
        return apart<unknownData<Pass>>(at);
    }
    switch (variables.ipProtocol) {
    case protocolIcmp: return apart<icmp::message<Pass>>(at);
    case protocolIpInIp:
    case protocolMinimalEncapsulation: return apart<tunnel::packet<Pass>>(at);
    case protocolGre: return apart<gre::packet<Pass>>(at);
    case protocolTcp: return apart<tcp::segment<Pass>>(at);
    case protocolUdp: return udp::datagram(at);
    case protocolIcmpv6: return apart<icmpv6::message<Pass>>(at);
    case protocolSctp: return apart<sctp::packet<Pass>>(at);
    default: return apart<unknownData<Pass>>(at);
    }
}

template <class Pass>
NETFLOOR_INLINE inline void upToTotalLength(Reader<Pass> &at) {
    auto &variables = at.variables();
    read<headerLength>(at, [&](std::uint32_t words) { variables.ipHeaderOctets = words * 4; });
    typeOfService(at);
    read<totalLength>(at, &variables.ipTotalLength);
}

template <class Pass>
NETFLOOR_INLINE inline void behindTotalLength(Reader<Pass> &at) {
    auto &variables = at.variables();
    read<identification>(at);
    flagAndFragmentOffset(at);
    read<timeToLive>(at);
    {
        const Block<Pass> block{at, "Protocol"};
        read<protocol>(at, &variables.ipProtocol);
        if (at.live) {
            variables.outerProtocol = variables.ipProtocol;
        }
    }
    read<headerChecksum>(at);
    read<sourceAddress>(at);
    read<destinationAddress>(at);
}

template <class Pass>
NETFLOOR_INLINE inline void datagram(Reader<Pass> &at) {
    if (!at.live) {
        return;
    }
    auto &variables = at.variables();
    const Block<Pass> header{at, "IPv4 Header"};
    stretch<32, upToTotalLength<Pass>>(at);

    if (!at.live) {
        return;
    }
    // A Total Length below 4 wraps to a huge number, which is more than any packet holds.
    const std::uint32_t limit = variables.ipTotalLength * bitsPerOctet - bitsBeforeLimit;
    at.advance() = static_cast<std::int32_t>(limit);
    if (limit > at.left) {
        return;
    }
    const LimitedBlock<Pass> extra{at, "Extra", limit};
    stretch<128, behindTotalLength<Pass>>(at);
    options(at);
    if (at.live) {
        variables.payloadOctets = static_cast<std::int32_t>(variables.ipTotalLength - variables.ipHeaderOctets);
    }
    dispatch(at);
}

} // namespace netfloor::ipv4
