// SPDX-License-Identifier: MIT
// An IPv6 packet: a chain of headers, and the payload that ends it. The fixed header is the first link of the chain,
// and may come again later in it.
#pragma once

#include <cstdint>

#include "frame/block.h"
#include "icmp/icmpv6.h"
#include "ip/unknown_data.h"
#include "ipv6/extension_headers.h"
#include "ipv6/header.h"
#include "names/ip_protocols.h"
#include "sctp/sctp.h"
#include "transport/tcp.h"
#include "transport/udp.h"
#include "tunnels/gre.h"

namespace netfloor::plugin {

// Runs the production of the payload, which ends the chain. The tunnels through IPv4 are not followed from here.
template <class Pass>
NETFLOOR_INLINE inline void ipv6Payload(Reader<Pass> &reader, std::uint32_t protocol) {
    switch (protocol) {
    case protocolIcmp:
    case protocolIcmpv6: return runOutOfLine<icmpv6::message<Pass>>(reader);
    case protocolTcp: return runOutOfLine<tcp::segment<Pass>>(reader);
    case protocolUdp: return udp::datagram(reader);
    case protocolGre: return runOutOfLine<gre::packet<Pass>>(reader);
    case protocolSctp: return runOutOfLine<sctp::packet<Pass>>(reader);
    case protocolEsp: return runOutOfLine<ipv6::securityPayload<Pass>>(reader);
    default: return runOutOfLine<unknownData<Pass>>(reader);
    }
}

template <class Pass>
[[nodiscard]] NETFLOOR_INLINE inline bool ipv6Header(Reader<Pass> &reader, BlockChain<Pass> &chain,
                                                     std::uint32_t protocol) {
    switch (protocol) {
    case protocolHopByHop:
    case protocolDestinationOptions:
        return ipv6::optionsHeader(reader, chain,
                                   protocol == protocolHopByHop ? BlockName{"IPv6 Hop-by-Hop Header"}
                                                                : BlockName{"Destination Option Header"});
    case protocolIpv6: return ipv6::fixedHeader(reader, chain);
    case protocolRouting: return ipv6::routingHeader(reader, chain);
    case protocolFragment: return ipv6::fragmentHeader(reader, chain);
    case protocolAuthentication: return ipv6::authenticationHeader(reader, chain);
    default: ipv6Payload(reader, protocol); return false;
    }
}

// Reads the chain of headers, and the payload.
template <class Pass>
NETFLOOR_INLINE inline void ipv6Packet(Reader<Pass> &reader) {
    const auto &variables = reader.variables();
    BlockChain<Pass> chain{reader};
    std::uint32_t next = protocolIpv6;
    while (ipv6Header(reader, chain, next) && reader.live && variables.payloadOctets >= 1) {
        chain.open("Choose Protocol");
        next = variables.ipProtocol;
    }
}

} // namespace netfloor::plugin
