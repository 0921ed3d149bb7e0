// SPDX-License-Identifier: MIT
// ICMP (RFC 792, RFC 950, RFC 1256).
//
//    0                   1                   2                   3
//    0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1
//   +---------------+---------------+-------------------------------+
//   |     Type      |     Code      |           Checksum            |
//   +---------------+---------------+-------------------------------+
//   |                     as the type has it                        |
//
// The type chooses the message. The checksum is shown but not computed. A message hands on to no next layer.
#pragma once

#include <cstdint>
#include <optional>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/step.h"
#include "icmp/error_messages.h"
#include "icmp/message_type.h"
#include "icmp/query_messages.h"

namespace netfloor::icmp {

inline constexpr Field reservedData{541, "ICMP Reserved Data", octets(1), "ICMP Reserved Data=%x"};

// A message of a type without a meaning: what stands behind the type is data, octet by octet.
template <class Pass>
NETFLOOR_INLINE inline void reservedMessage(Reader<Pass> &at) {
    if (!at.live) {
        return;
    }
    auto &variables = at.variables();
    const Block<Pass> message{at, ""};
    variables.payloadOctets -= 1;
    for (std::int32_t seen = 0; at.live && seen < variables.payloadOctets; ++seen) {
        const Block<Pass> octet{at, ""};
        read<reservedData>(at);
    }
    if (variables.payloadOctets < 0) {
        at.mark(Mark::count);
    }
}

// Runs a message that has no other code than 0. With another code, or none, nothing behind the type is read.
template <auto production, class Pass>
NETFLOOR_INLINE inline void withCodeZero(Reader<Pass> &at) {
    if (look(at, octets(1)) != std::uint32_t{0}) {
        return at.mark(Mark::expectation);
    }
    apart<production>(at);
}

template <class Pass>
NETFLOOR_INLINE inline void message(Reader<Pass> &at) {
    if (!at.live) {
        return;
    }
    const Block<Pass> block{at, "ICMP Message Type"};
    messageType(at);
    if (!at.live) {
        return;
    }
    switch (at.variables().icmpType) {
    case typeEchoReply:
    case typeEcho: return withCodeZero<echo<Pass>>(at);
    case typeDestinationUnreachable: return apart<destinationUnreachable<Pass>>(at);
    case typeSourceQuench: return withCodeZero<sourceQuench<Pass>>(at);
    case typeRedirect: return apart<redirect<Pass>>(at);
    case typeRouterAdvertisement: return withCodeZero<routerAdvertisement<Pass>>(at);
    case typeRouterSolicitation: return withCodeZero<routerSolicitation<Pass>>(at);
    case typeTimeExceeded: return apart<timeExceeded<Pass>>(at);
    case typeParameterProblem: return apart<parameterProblem<Pass>>(at);
    case typeTimestamp:
    case typeTimestampReply: return withCodeZero<timestamp<Pass>>(at);
    case typeInformationRequest:
    case typeInformationReply: return withCodeZero<information<Pass>>(at);
    case typeAddressMaskRequest:
    case typeAddressMaskReply: return withCodeZero<addressMaskMessage<Pass>>(at);
    default: return apart<reservedMessage<Pass>>(at);
    }
}

} // namespace netfloor::icmp
