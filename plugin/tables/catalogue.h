// SPDX-License-Identifier: MIT
// The catalogue of all fields, in the order of the field table: depth first, a production where the grammar
// first comes to it.
#pragma once

#include <array>
#include <cstdint>

#include "frame/field.h"
#include "ipv4/header.h"
#include "ipv4/service_and_fragment.h"
#include "ipv4/unknown_data.h"
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
