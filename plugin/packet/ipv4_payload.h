// SPDX-License-Identifier: MIT
// The payload of an IPv4 datagram.
#pragma once

#include "frame/block.h"
#include "icmp/icmp.h"
#include "icmp/icmpv6.h"
#include "ip/form.h"
#include "ip/unknown_data.h"
#include "names/ip_protocols.h"
#include "packet/tunnels.h"
#include "sctp/sctp.h"
#include "transport/tcp.h"
#include "transport/udp.h"
#include "tunnels/gre.h"

namespace netfloor::plugin {

// Runs the production of the payload, if the header was read to its end. A fragment other than the first one is data,
// whatever its protocol. If DF is set, the fragment offset is ignored.
template <Form form, class Pass>
NETFLOOR_INLINE inline void ipv4Payload(Reader<Pass> &reader) {
    if (!reader.live) {
        return;
    }
    const auto &variables = reader.variables();
    if (variables.fragmentOffset >= 1 && variables.dontFragment == 0) {
        return runOutOfLine<unknownData<Pass>>(reader);
    }
    switch (variables.ipProtocol) {
    case protocolIcmp: return runOutOfLine<icmp::message<Pass>>(reader);
    case protocolIpInIp:
    case protocolMinimalEncapsulation: return runOutOfLine<tunnels<Pass>>(reader);
    case protocolGre: return runOutOfLine<gre::packet<Pass>>(reader);
    case protocolTcp: return runInLineIf<form == Form::ipv4Tcp, tcp::segment<Pass>>(reader);
    case protocolUdp: return runInLineIf<form == Form::ipv4Udp, udp::datagram<Pass>>(reader);
    case protocolIcmpv6: return runOutOfLine<icmpv6::message<Pass>>(reader);
    case protocolSctp: return runOutOfLine<sctp::packet<Pass>>(reader);
    default: return runOutOfLine<unknownData<Pass>>(reader);
    }
}

// The same as a value, for the header before it.
inline constexpr auto ipv4Payloads = []<Form form>(auto &reader) NETFLOOR_INLINE { ipv4Payload<form>(reader); };

} // namespace netfloor::plugin
