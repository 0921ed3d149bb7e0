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
// The type chooses the message. The checksum is not verified. No message has a next layer.
#pragma once

#include <cstdint>
#include <optional>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "icmp/error_messages.h"
#include "icmp/message_type.h"
#include "icmp/query_messages.h"

namespace netfloor::plugin::icmp {

inline constexpr Field reservedData{541, "ICMP Reserved Data", octets(1), "%n=%x"};

// A message of an unassigned type: the octets after the type are data, a field each.
template <class Pass>
NETFLOOR_INLINE inline void reservedMessage(Reader<Pass> &reader) {
    auto &variables = reader.variables();
    const Block<Pass> message{reader, ""};
    variables.payloadOctets -= 1;
    for (std::int32_t seen = 0; reader.live && seen < variables.payloadOctets; ++seen) {
        const Block<Pass> octet{reader, ""};
        read<reservedData>(reader);
    }
    if (variables.payloadOctets < 0) {
        reader.raise(Flag::count);
    }
}

// Runs a message that has no other code than 0. With another code, or without one, nothing after the type is read.
template <auto production, class Pass>
NETFLOOR_INLINE inline void withCodeZero(Reader<Pass> &reader) {
    if (peek(reader, octets(1)) != std::uint32_t{0}) {
        return reader.raise(Flag::expectation);
    }
    runOutOfLine<production>(reader);
}

template <class Pass>
NETFLOOR_INLINE inline void message(Reader<Pass> &reader) {
    const Block<Pass> block{reader, "ICMP Message Type"};
    messageType(reader);
    if (!reader.live) {
        return;
    }
    switch (reader.variables().icmpType) {
    case typeEchoReply:
    case typeEcho: return withCodeZero<echo<Pass>>(reader);
    case typeDestinationUnreachable: return runOutOfLine<destinationUnreachable<Pass>>(reader);
    case typeSourceQuench: return withCodeZero<sourceQuench<Pass>>(reader);
    case typeRedirect: return runOutOfLine<redirect<Pass>>(reader);
    case typeRouterAdvertisement: return withCodeZero<routerAdvertisement<Pass>>(reader);
    case typeRouterSolicitation: return withCodeZero<routerSolicitation<Pass>>(reader);
    case typeTimeExceeded: return runOutOfLine<timeExceeded<Pass>>(reader);
    case typeParameterProblem: return runOutOfLine<parameterProblem<Pass>>(reader);
    case typeTimestamp:
    case typeTimestampReply: return withCodeZero<timestamp<Pass>>(reader);
    case typeInformationRequest:
    case typeInformationReply: return withCodeZero<information<Pass>>(reader);
    case typeAddressMaskRequest:
    case typeAddressMaskReply: return withCodeZero<addressMaskMessage<Pass>>(reader);
    default: return runOutOfLine<reservedMessage<Pass>>(reader);
    }
}

// The key rows of the quoted headers come after those of all messages.
// clang-format off
using MessageRows = Rows<
    Joined<
        TypeRows::Fields, EchoRows::Fields, ErrorRows::Fields, QueryRows::Fields, FieldList<reservedData>>,
    Joined<
        TypeRows::Keys, EchoRows::Keys, ErrorRows::Keys, QueryRows::Keys, QuotedHeaderRows::Keys>>;
// clang-format on

} // namespace netfloor::plugin::icmp
