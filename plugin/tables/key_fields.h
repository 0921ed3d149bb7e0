// SPDX-License-Identifier: MIT
// The key-field table: which fields the XTR pass can deliver.
//
// The rows stand in the order in which the grammar comes to its key fields, a row for each place. A field is
// stored in the last row that has its name, so of several rows of one name only the last is ever filled.
#pragma once

#include <array>
#include <cstdint>

#include "frame/field.h"
#include "netfloor/records.h"
#include "tables/catalogue.h"

namespace netfloor::plugin {

// The key fields, a row each, in the order in which the grammar comes to them.
inline constexpr std::array<const Field *, 112> keySites = {
    &version,
    &ipv4::totalLength,
    &ipv4::identification,
    &ipv4::timeToLive,
    &ipv4::protocol,
    &ipv4::sourceAddress,
    &ipv4::destinationAddress,
    &ipv4::dontFragmentFlag,
    &ipv4::moreFragments,
    &ipv4::fragmentOffset,
    &ipv6::addressKey,
    &icmp::typeInIpInIp,
    &icmp::typeInMinimal,
    &icmp::type,
    &icmp::echoCode,
    &icmp::echoSequence,
    &icmp::echoCode,
    &icmp::echoSequence,
    &icmp::unreachableCode,
    &icmp::sourceQuenchCode,
    &icmp::redirectCode,
    &icmp::timeExceededCode,
    &icmp::problemCode,
    &icmp::timestampCode,
    &icmp::timestampSequence,
    &icmp::timestampCode,
    &icmp::timestampSequence,
    &icmp::informationCode,
    &icmp::informationSequence,
    &icmp::informationCode,
    &icmp::informationSequence,
    &icmp::advertisementCode,
    &icmp::solicitationCode,
    &icmp::addressMaskCode,
    &icmp::addressMaskSequence,
    &icmp::addressMask,
    &icmp::addressMaskCode,
    &icmp::addressMaskSequence,
    &icmp::addressMask,
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
    &tcp::sourcePort,
    &tcp::destinationPortIpInIp,
    &tcp::destinationPortMinimal,
    &tcp::destinationPort,
    &tcp::sequenceNumber,
    &tcp::acknowledgementNumber,
    &tcp::dataOffset,
    &tcp::reset,
    &tcp::synchronize,
    &tcp::finish,
    &udp::sourcePort,
    &udp::destinationPortIpInIp,
    &udp::destinationPortMinimal,
    &udp::destinationPort,
    &ipinip::headerLength,
    &ipinip::totalLength,
    &ipinip::protocol,
    &ipinip::sourceAddress,
    &ipinip::destinationAddress,
    &minimal::protocol,
    &minimal::destinationAddress,
    &minimal::sourceAddress,
    &gre::checksumPresent,
    &gre::keyPresent,
    &gre::sequencePresent,
    &gre::protocol,
    &gre::key,
    &gre::sequence,
    &icmpv6::messageType,
    &icmpv6::unreachableCode,
    &icmpv6::tooBigCode,
    &icmpv6::timeExceededCode,
    &icmpv6::parameterProblemCode,
    &icmpv6::echoRequestCode,
    &icmpv6::echoReplyCode,
    &sctp::sourcePort,
    &sctp::destinationPort,
    &sctp::firstChunkType,
    &sctp::tsn,
    &sctp::streamIdentifier,
    &sctp::streamSequenceNumber,
    &sctp::payloadProtocolIdentifier,
    &sctp::initialTsn<sctp::initIds>,
    &sctp::initialTsn<sctp::initAckIds>,
    &sctp::cumulativeTsnAck,
    &sctp::shutdownCumulativeTsnAck,
    &ipv6::payloadLengthAhead,
    &ipv6::payloadLength,
    &ipv6::sourceNibbles,
    &ipv6::destinationNibbles,
    &ipv6::nextHeaderField,
    &ipv6::addressKey,
    &ipv6::fragmentOffset,
    &ipv6::moreFragments,
    &ipv6::securityIndex,
    &ipv6::securitySequence,
    &ipv6::authenticationIndex,
    &ipv6::authenticationSequence,
    &ipv6::extensionLength,
    &ipv6::pad1Type,
    &ipv6::padNType,
    &ipv6::unknownOptionType,
    &ipv6::unknownOptionLength,
};
inline constexpr std::uint32_t noKeyRow = 0xffffffff;

// The table ends with a row without a name, which no field fills: a host can mark it present.
inline constexpr std::uint32_t keyRowCount = keySites.size() + 1;

// Whether a field is a key field goes by its id, as other fields may bear its name. Fields of one name share a row.
[[nodiscard]] constexpr std::uint32_t keyRowOf(const Field &field) {
    bool isKey = false;
    std::uint32_t last = noKeyRow;
    for (std::uint32_t row = 0; row < keySites.size(); ++row) {
        isKey = isKey || keySites[row]->id == field.id;
        last = keySites[row]->tableName() == field.tableName() ? row : last;
    }
    return isKey ? last : noKeyRow;
}

// The host fills the first three words of each row; the rest stays as it is.
inline constinit std::array<KeyFieldRow, keyRowCount> keyRows = [] {
    std::array<KeyFieldRow, keyRowCount> rows{};
    for (std::uint32_t row = 0; row < keyRowCount; ++row) {
        rows[row].protocolName = "netfloor";
        rows[row].fieldName = row < keySites.size() ? keySites[row]->tableName().data() : "";
    }
    return rows;
}();

} // namespace netfloor::plugin
