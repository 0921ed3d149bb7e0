// SPDX-License-Identifier: MIT
// Tunnels through IPv4: IP in IP (RFC 2003) and minimal encapsulation (RFC 2004), one inside the other in any order,
// and what the innermost carries. Thousands of levels fit in one datagram.
#pragma once

#include <cstdint>

#include "frame/block.h"
#include "frame/step.h"
#include "icmp/icmp.h"
#include "ipv4/unknown_data.h"
#include "tables/protocol_numbers.h"
#include "transport/tcp.h"
#include "transport/udp.h"
#include "tunnels/gre.h"
#include "tunnels/ip_in_ip.h"
#include "tunnels/minimal_encapsulation.h"

namespace netfloor::tunnel {

// Runs the production of the payload. GRE is known behind IP in IP only; ICMPv6 and SCTP are not.
template <class Pass>
NETFLOOR_INLINE inline void payload(Reader<Pass> &at, std::uint32_t innermostTunnel) {
    switch (at.variables().ipProtocol) {
    case protocolIcmp: return apart<icmp::message<Pass>>(at);
    case protocolTcp: return apart<tcp::segment<Pass>>(at);
    case protocolUdp: return apart<udp::datagram<Pass>>(at);
    case protocolGre:
        return innermostTunnel == protocolIpInIp ? apart<gre::packet<Pass>>(at) : apart<unknownData<Pass>>(at);
    default: return apart<unknownData<Pass>>(at);
    }
}

// Reads the tunnel that the protocol says, and all tunnels inside it.
template <class Pass>
NETFLOOR_INLINE inline void packet(Reader<Pass> &at) {
    const auto &variables = at.variables();
    BlockChain<Pass> levels{at};
    std::uint32_t tunnel = variables.ipProtocol;
    while (at.live) {
        levels.open("");
        if (tunnel == protocolIpInIp) {
            ipinip::header(at);
        } else {
            minimal::header(at);
        }
        if (variables.ipProtocol != protocolIpInIp && variables.ipProtocol != protocolMinimalEncapsulation) {
            break;
        }
        tunnel = variables.ipProtocol;
    }
    payload(at, tunnel);
}

} // namespace netfloor::tunnel
