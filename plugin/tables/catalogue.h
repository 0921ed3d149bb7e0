// SPDX-License-Identifier: MIT
// The catalogue of all fields, in the order of the field table: depth first, a production where the grammar
// first comes to it.
#pragma once

#include <array>
#include <cstdint>

#include "frame/field.h"
#include "ipv4/header.h"
#include "ipv4/options.h"
#include "ipv4/service_and_fragment.h"
#include "ipv4/unknown_data.h"
#include "ipv6/address.h"
#include "transport/tcp.h"
#include "transport/tcp_options.h"
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
    &ipv4::noOperation,
    &ipv4::security,
    &ipv4::securityLength,
    &ipv4::securityLevel,
    &ipv4::compartments,
    &ipv4::restrictions,
    &ipv4::transmissionControl,
    &ipv4::looseRoute,
    &ipv4::looseRouteLength,
    &ipv4::looseRoutePointer,
    &ipv4::looseRouteData,
    &ipv6::listedAddress,
    &ipv4::strictRoute,
    &ipv4::strictRouteLength,
    &ipv4::strictRoutePointer,
    &ipv4::strictRouteData,
    &ipv4::recordRoute,
    &ipv4::recordRouteLength,
    &ipv4::recordRoutePointer,
    &ipv4::recordRouteData,
    &ipv4::streamIdentifier,
    &ipv4::streamLength,
    &ipv4::streamId,
    &ipv4::internetTimestamp,
    &ipv4::timestampLength,
    &ipv4::timestampPointer,
    &ipv4::timestampOverflow,
    &ipv4::timestampFlag,
    &ipv4::timestamp,
    &ipv4::registeringAddress,
    &ipv6::address,
    &ipv6::addressKey,
    &ipv4::registeredTimestamp,
    &ipv4::endOfOptionPart,
    &ipv4::optionPadding,
    &unknownProtocolData,
    &tcp::sourcePort,
    &tcp::destinationPortIpInIp,
    &tcp::destinationPortMinimal,
    &tcp::destinationPort,
    &tcp::sequenceNumber,
    &tcp::acknowledgementNumber,
    &tcp::reservedBesideDataOffset,
    &tcp::dataOffset,
    &tcp::reservedBesideFlags,
    &tcp::urgent,
    &tcp::acknowledgement,
    &tcp::push,
    &tcp::reset,
    &tcp::synchronize,
    &tcp::finish,
    &tcp::windowSize,
    &tcp::checksum,
    &tcp::urgentPointer,
    &tcp::endOfList,
    &tcp::noOperation,
    &tcp::maximumSegment,
    &tcp::maximumLength,
    &tcp::maximumSize,
    &tcp::windowScale,
    &tcp::windowScaleLength,
    &tcp::shiftCount,
    &tcp::sackPermitted,
    &tcp::permittedLength,
    &tcp::sack,
    &tcp::sackLength,
    &tcp::leftEdge,
    &tcp::rightEdge,
    &tcp::timestamps,
    &tcp::timestampsLength,
    &tcp::timestampValue,
    &tcp::timestampEcho,
    &tcp::md5Signature,
    &tcp::md5Length,
    &tcp::md5Digest,
    &tcp::optionPadding,
    &udp::sourcePort,
    &udp::destinationPortIpInIp,
    &udp::destinationPortMinimal,
    &udp::destinationPort,
    &udp::length,
    &udp::checksum,
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
