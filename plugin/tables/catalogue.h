// SPDX-License-Identifier: MIT
// The catalogue of all fields, in the order of the field table: depth first, a production where the grammar
// first comes to it.
#pragma once

#include <array>
#include <cstdint>

#include "frame/field.h"
#include "icmp/icmpv6.h"
#include "ipv4/header.h"
#include "ipv4/service_and_fragment.h"
#include "ipv4/unknown_data.h"
#include "ipv6/address.h"
#include "ipv6/extension_headers.h"
#include "ipv6/header.h"
#include "ipv6/options.h"
#include "transport/udp.h"
#include "version.h"

namespace netfloor {

inline constexpr std::array catalogue = {
    &version,
    &ipv4::headerLength,
    &ipv4::precedence,
    &ipv4::delay,
    &ipv4::throughput,
    &ipv4::reliability,
    &ipv4::serviceReserved,
    &ipv4::totalLength,
    &ipv4::identification,
    &ipv4::fragmentReserved,
    &ipv4::dontFragmentFlag,
    &ipv4::moreFragments,
    &ipv4::fragmentOffset,
    &ipv4::timeToLive,
    &ipv4::protocol,
    &ipv4::headerChecksum,
    &ipv4::sourceAddress,
    &ipv4::destinationAddress,
    &unknownProtocolData,
    &udp::sourcePort,
    &udp::destinationPortIpInIp,
    &udp::destinationPortMinimal,
    &udp::destinationPort,
    &udp::length,
    &udp::checksum,
    &icmpv6::messageClass,
    &icmpv6::messageType,
    &icmpv6::unreachableCode,
    &icmpv6::unreachableChecksum,
    &icmpv6::unreachableUnused,
    &icmpv6::unreachablePacket,
    &icmpv6::tooBigCode,
    &icmpv6::tooBigChecksum,
    &icmpv6::tooBigMtu,
    &icmpv6::tooBigPacket,
    &icmpv6::timeExceededCode,
    &icmpv6::timeExceededChecksum,
    &icmpv6::timeExceededUnused,
    &icmpv6::timeExceededPacket,
    &icmpv6::parameterProblemCode,
    &icmpv6::parameterProblemChecksum,
    &icmpv6::parameterProblemPointer,
    &icmpv6::parameterProblemPacket,
    &icmpv6::echoRequestCode,
    &icmpv6::echoRequestChecksum,
    &icmpv6::echoRequestIdentifier,
    &icmpv6::echoRequestSequence,
    &icmpv6::echoRequestData,
    &icmpv6::echoReplyCode,
    &icmpv6::echoReplyChecksum,
    &icmpv6::echoReplyIdentifier,
    &icmpv6::echoReplySequence,
    &icmpv6::echoReplyData,
    &ipv6::trafficClass,
    &ipv6::flowLabel,
    &ipv6::payloadLengthAhead,
    &ipv6::payloadLength,
    &ipv6::nextHeaderField,
    &ipv6::hopLimit,
    &ipv6::sourceGroups,
    &ipv6::sourceNibbles,
    &ipv6::destinationGroups,
    &ipv6::destinationNibbles,
    &ipv6::extensionLength,
    &ipv6::routingTypeAhead,
    &ipv6::segmentsLeftAhead,
    &ipv6::spare,
    &ipv6::routingType,
    &ipv6::segmentsLeft,
    &ipv6::routingReserved,
    &ipv6::fragmentReserved,
    &ipv6::fragmentOffset,
    &ipv6::fragmentSpare,
    &ipv6::moreFragments,
    &ipv6::identification,
    &ipv6::securityIndex,
    &ipv6::securitySequence,
    &ipv6::encryptedData,
    &ipv6::authenticationLength,
    &ipv6::authenticationReserved,
    &ipv6::authenticationIndex,
    &ipv6::authenticationSequence,
    &ipv6::authenticationData,
    &ipv6::optionTypeAhead,
    &ipv6::pad1Type,
    &ipv6::padNType,
    &ipv6::padNLength,
    &ipv6::paddingData,
    &ipv6::actionAhead,
    &ipv6::unknownOptionType,
    &ipv6::unknownOptionLength,
    &ipv6::skippedOctet,
    &ipv6::discardedOptionType,
    &ipv6::address,
    &ipv6::addressKey,
};

// The id under which the TO pass reports a field: that of the first field of the same name.
[[nodiscard]] constexpr std::uint32_t displayIdOf(const Field& field) {
    for (const Field* const candidate : catalogue) {
        if (candidate->tableName() == field.tableName()) {
            return candidate->id;
        }
    }
    return field.id;
}

} // namespace netfloor
