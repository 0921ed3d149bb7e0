// SPDX-License-Identifier: MIT
// Tunnels through IPv4: IP in IP (RFC 2003) and minimal encapsulation (RFC 2004), one inside the other in any order,
// and the payload of the innermost. One datagram has room for thousands of levels.
#pragma once

#include <cstdint>

#include "frame/block.h"
#include "frame/field_step.h"
#include "icmp/icmp.h"
#include "ip/unknown_data.h"
#include "names/ip_protocols.h"
#include "transport/tcp.h"
#include "transport/udp.h"
#include "tunnels/gre.h"
#include "tunnels/ip_in_ip.h"
#include "tunnels/minimal_encapsulation.h"

namespace netfloor::plugin {

// Runs the production of the payload. GRE is known after IP in IP only; ICMPv6 and SCTP are not.
template <class Pass>
NETFLOOR_INLINE inline void tunnelPayload(Reader<Pass> &reader, std::uint32_t innermostTunnel) {
    switch (reader.variables().ipProtocol) {
    case protocolIcmp: return runOutOfLine<icmp::message<Pass>>(reader);
    case protocolTcp: return runOutOfLine<tcp::segment<Pass>>(reader);
    case protocolUdp: return runOutOfLine<udp::datagram<Pass>>(reader);
    case protocolGre:
        return innermostTunnel == protocolIpInIp ? runOutOfLine<gre::packet<Pass>>(reader)
                                                 : runOutOfLine<unknownData<Pass>>(reader);
    default: return runOutOfLine<unknownData<Pass>>(reader);
    }
}

// Reads the tunnel whose protocol number was read last, and all tunnels inside it.
template <class Pass>
NETFLOOR_INLINE inline void tunnels(Reader<Pass> &reader) {
    const auto &variables = reader.variables();
    BlockChain<Pass> levels{reader};
    std::uint32_t tunnel = variables.ipProtocol;
    while (reader.live) {
        levels.open("");
        if (tunnel == protocolIpInIp) {
            ipinip::header(reader);
        } else {
            minimal::header(reader);
        }
        if (variables.ipProtocol != protocolIpInIp && variables.ipProtocol != protocolMinimalEncapsulation) {
            break;
        }
        tunnel = variables.ipProtocol;
    }
    tunnelPayload(reader, tunnel);
}

} // namespace netfloor::plugin
