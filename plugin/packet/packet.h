// SPDX-License-Identifier: MIT
// A packet: the start of the grammar, and the variables of all its productions.
#pragma once

#include "frame/bit_order.h"
#include "frame/block.h"
#include "frame/checked_run.h"
#include "frame/field_step.h"
#include "icmp/message_type.h"
#include "ip/form.h"
#include "ip/variables.h"
#include "ip/version.h"
#include "ipv4/header.h"
#include "packet/ipv4_payload.h"
#include "packet/ipv6_packet.h"
#include "sctp/variables.h"

namespace netfloor::plugin {

// All variables of a pass, cleared at its entry.
struct Variables : BitOrderVariables,
                   SharedVariables,
                   ipv4::FragmentVariables,
                   ipv4::OptionVariables,
                   ipv6::HeaderVariables,
                   ipv6::OptionVariables,
                   ipv6::ExtensionHeaderVariables,
                   icmp::MessageVariables,
                   tcp::TcpVariables,
                   sctp::Variables {};

template <Form form, class Pass>
NETFLOOR_INLINE inline void versionAndHeaders(Reader<Pass> &reader) {
    auto &variables = reader.variables();
    const Block<Pass> ip{reader, "Ip"};
    reader.check();
    const Block<Pass> header{reader, "Ip Header"};
    read<version>(reader, &variables.ipVersion);
    if (variables.ipVersion == 4) {
        runInLineIf<ipv4Form(form) == form, ipv4::datagram<ipv4Form(form), ipv4Payloads, Pass>>(reader);
    } else if (variables.ipVersion == 6) {
        runInLineIf<form == Form::ipv6Udp, ipv6Packet<ipv6Form(form), Pass>>(reader);
    }
}

// Reads one packet. After a version other than 4 and 6 nothing is read.
template <Form form, class Pass>
NETFLOOR_INLINE inline void packet(Reader<Pass> &reader) {
    checkedRun<version, ipv4::totalLength, versionAndHeaders<form, Pass>, versionAndHeaders<Form::outOfLine, Pass>>(
        reader);
}

} // namespace netfloor::plugin
