// SPDX-License-Identifier: MIT
// The catalogue of all fields, in the order of the field table: depth first, a production where the grammar
// first comes to it.
#pragma once

#include <array>
#include <cstdint>

#include "frame/field.h"
#include "icmp/error_messages.h"
#include "icmp/icmp.h"
#include "icmp/message_type.h"
#include "icmp/query_messages.h"
#include "icmp/quoted_header.h"
#include "ipv4/header.h"
#include "ipv4/service_and_fragment.h"
#include "ipv4/unknown_data.h"
#include "transport/udp.h"
#include "tunnels/gre.h"
#include "tunnels/ip_in_ip.h"
#include "tunnels/minimal_encapsulation.h"
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
    &icmp::typeInIpInIp,
    &icmp::typeInMinimal,
    &icmp::type,
    &icmp::reservedData,
    &icmp::echoCode,
    &icmp::echoChecksum,
    &icmp::echoIdentifier,
    &icmp::echoSequence,
    &icmp::echoData,
    &icmp::timestampCode,
    &icmp::timestampChecksum,
    &icmp::timestampIdentifier,
    &icmp::timestampSequence,
    &icmp::originateTimestamp,
    &icmp::receiveTimestamp,
    &icmp::transmitTimestamp,
    &icmp::informationCode,
    &icmp::informationChecksum,
    &icmp::informationIdentifier,
    &icmp::informationSequence,
    &icmp::advertisementCode,
    &icmp::advertisementChecksum,
    &icmp::routers,
    &icmp::routerEntrySize,
    &icmp::routerLifetime,
    &icmp::routerAddress,
    &icmp::routerPreference,
    &icmp::solicitationCode,
    &icmp::solicitationChecksum,
    &icmp::solicitationReserved,
    &icmp::addressMaskCode,
    &icmp::addressMaskChecksum,
    &icmp::addressMaskIdentifier,
    &icmp::addressMaskSequence,
    &icmp::addressMask,
    &icmp::unreachableCode,
    &icmp::unreachableChecksum,
    &icmp::unreachableUnused,
    &icmp::unreachableData,
    &icmp::unreachableTail,
    &icmp::sourceQuenchCode,
    &icmp::sourceQuenchChecksum,
    &icmp::sourceQuenchUnused,
    &icmp::sourceQuenchData,
    &icmp::redirectCode,
    &icmp::redirectChecksum,
    &icmp::redirectGateway,
    &icmp::redirectData,
    &icmp::timeExceededCode,
    &icmp::timeExceededChecksum,
    &icmp::timeExceededUnused,
    &icmp::timeExceededData,
    &icmp::problemCode,
    &icmp::problemChecksum,
    &icmp::problemPointer,
    &icmp::problemUnused,
    &icmp::problemData,
    &icmp::quotedVersion,
    &icmp::quotedHeaderLength,
    &icmp::quotedPrecedence,
    &icmp::quotedDelay,
    &icmp::quotedThroughput,
    &icmp::quotedReliability,
    &icmp::quotedServiceFixed,
    &icmp::quotedLength,
    &icmp::quotedIdentification,
    &icmp::quotedFlagsFixed,
    &icmp::quotedDontFragment,
    &icmp::quotedMoreFragments,
    &icmp::quotedFragmentOffset,
    &icmp::quotedTimeToLive,
    &icmp::unreachableInTunnel,
    &icmp::sourceQuenchInTunnel,
    &icmp::redirectInTunnel,
    &icmp::timeExceededInTunnel,
    &icmp::problemInTunnel,
    &icmp::unreachableProtocol,
    &icmp::sourceQuenchProtocol,
    &icmp::redirectProtocol,
    &icmp::timeExceededProtocol,
    &icmp::problemProtocol,
    &icmp::quotedChecksum,
    &icmp::quotedSource,
    &icmp::quotedDestination,
    &ipinip::version,
    &ipinip::headerLength,
    &ipinip::totalLength,
    &ipinip::identification,
    &ipinip::timeToLive,
    &ipinip::protocol,
    &ipinip::headerChecksum,
    &ipinip::sourceAddress,
    &ipinip::destinationAddress,
    &minimal::protocol,
    &minimal::reserved,
    &minimal::sourcePresent,
    &minimal::headerChecksum,
    &minimal::destinationAddress,
    &minimal::sourceAddress,
    &gre::checksumPresent,
    &gre::unusedBit,
    &gre::keyPresent,
    &gre::sequencePresent,
    &gre::reserved0,
    &gre::version,
    &gre::protocol,
    &gre::checksum,
    &gre::reserved1,
    &gre::key,
    &gre::sequence,
    &gre::openingFlag,
    &gre::framePayload,
    &gre::closingFlag,
    &gre::payload,
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
