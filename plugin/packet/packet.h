// SPDX-License-Identifier: MIT
// A packet: the start of the grammar, and the variables of all its productions.
#pragma once

#include "frame/bit_order.h"
#include "frame/block.h"
#include "frame/checked_run.h"
#include "frame/field_step.h"
#include "icmp/message_type.h"
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
        ipv4::datagram<form, ipv4Payloads>(reader);
    } else if (variables.ipVersion == 6) {
        runOutOfLine<ipv6Packet<Pass>>(reader);
    }
}

// Reads one packet. After a version other than 4 and 6 nothing is read.
template <class Pass>
NETFLOOR_INLINE inline void packet(Reader<Pass> &reader) {
    checkedRun<version, ipv4::totalLength, versionAndHeaders<Form::inRun, Pass>, versionAndHeaders<Form::slow, Pass>>(
        reader);
}

} // namespace netfloor::plugin
