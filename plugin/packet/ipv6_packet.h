// SPDX-License-Identifier: MIT
// An IPv6 packet: a chain of headers, and the payload that ends it. The fixed header is the first link of the chain,
// and may come again later in it.
#pragma once

#include <cstdint>

#include "frame/block.h"
#include "frame/checked_run.h"
#include "icmp/icmpv6.h"
#include "ip/form.h"
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
template <Form form, class Pass>
NETFLOOR_INLINE inline void ipv6Payload(Reader<Pass> &reader, std::uint32_t protocol) {
    switch (protocol) {
    case protocolIcmp:
    case protocolIcmpv6: return runOutOfLine<icmpv6::message<Pass>>(reader);
    case protocolTcp: return runOutOfLine<tcp::segment<Pass>>(reader);
    case protocolUdp: return runInLineIf<form == Form::ipv6Udp, udp::datagram<Pass>>(reader);
    case protocolGre: return runOutOfLine<gre::packet<Pass>>(reader);
    case protocolSctp: return runOutOfLine<sctp::packet<Pass>>(reader);
    case protocolEsp: return runOutOfLine<ipv6::securityPayload<Pass>>(reader);
    default: return runOutOfLine<unknownData<Pass>>(reader);
    }
}

// Whether a protocol number stands for a link of the chain, not for its payload.
[[nodiscard]] constexpr bool isLink(std::uint32_t protocol) {
    return protocol == protocolHopByHop || protocol == protocolDestinationOptions || protocol == protocolIpv6 ||
           protocol == protocolRouting || protocol == protocolFragment || protocol == protocolAuthentication;
}

// Reads a fixed header inside another. Returns whether the chain goes on after it.
template <class Pass>
[[nodiscard]] NETFLOOR_INLINE inline bool fixedHeader(Reader<Pass> &reader, BlockChain<Pass> &chain) {
    chain.open("IPv6 Header");
    checkedRun<ipv6::trafficClass, ipv6::payloadLengthAhead, ipv6::fieldsUpToPayloadLength<Pass>>(reader);
    const std::uint32_t bitCount = ipv6::bodyBits(reader);
    if (bitCount != 0) {
        ipv6::body<Form::outOfLine>(reader, chain, bitCount);
    }
    return bitCount != 0;
}

// Reads a link of the chain. Returns whether the chain goes on after it.
template <class Pass>
[[nodiscard]] NETFLOOR_INLINE inline bool link(Reader<Pass> &reader, BlockChain<Pass> &chain, std::uint32_t protocol) {
    switch (protocol) {
    case protocolHopByHop: return ipv6::optionsHeader(reader, chain, "IPv6 Hop-by-Hop Header");
    case protocolDestinationOptions: return ipv6::optionsHeader(reader, chain, "Destination Option Header");
    case protocolRouting: return ipv6::routingHeader(reader, chain);
    case protocolFragment: return ipv6::fragmentHeader(reader, chain);
    case protocolAuthentication: return ipv6::authenticationHeader(reader, chain);
    default: return fixedHeader(reader, chain);
    }
}

// Reads the rest of the chain from a link on, and the payload. Its blocks are inside those of the first header.
template <class Pass>
NETFLOOR_INLINE inline void moreLinks(Reader<Pass> &reader) {
    const auto &variables = reader.variables();
    BlockChain<Pass> chain{reader};
    while (link(reader, chain, variables.ipProtocol) && reader.live && variables.payloadOctets >= 1) {
        chain.open("Choose Protocol");
        if (!isLink(variables.ipProtocol)) {
            return ipv6Payload<Form::outOfLine>(reader, variables.ipProtocol);
        }
    }
}

template <Form form, class Pass>
NETFLOOR_INLINE inline void afterFirstHeader(Reader<Pass> &reader, BlockChain<Pass> &chain) {
    const auto &variables = reader.variables();
    if (!reader.live || variables.payloadOctets < 1) {
        return;
    }
    chain.open("Choose Protocol");
    if (isLink(variables.ipProtocol)) {
        return runOutOfLine<moreLinks<Pass>>(reader);
    }
    ipv6Payload<form>(reader, variables.ipProtocol);
}

template <class Pass>
NETFLOOR_INLINE inline void fromBody(Reader<Pass> &reader) {
    BlockChain<Pass> chain{reader};
    ipv6::body<Form::outOfLine>(reader, chain, ipv6::bodyBits(reader));
    afterFirstHeader<Form::outOfLine>(reader, chain);
}

template <Form form, class Pass>
NETFLOOR_INLINE inline void fromFirstHeader(Reader<Pass> &reader) {
    BlockChain<Pass> chain{reader};
    chain.open("IPv6 Header");
    ipv6::fieldsUpToPayloadLength(reader);
    const std::uint32_t bitCount = ipv6::bodyBits(reader);
    if (bitCount == 0) {
        return;
    }
    if (form == Form::outOfLine || bitCount > reader.left) {
        return runOutOfLine<fromBody<Pass>>(reader);
    }
    ipv6::body<form>(reader, chain, bitCount);
    afterFirstHeader<form>(reader, chain);
}

template <Form form, class Pass>
NETFLOOR_INLINE inline void ipv6Packet(Reader<Pass> &reader) {
    checkedRun<ipv6::trafficClass, ipv6::payloadLengthAhead, fromFirstHeader<form, Pass>,
               fromFirstHeader<Form::outOfLine, Pass>>(reader);
}

} // namespace netfloor::plugin
