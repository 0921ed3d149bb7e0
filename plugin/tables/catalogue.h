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
#include "sctp/sctp.h"
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
    &sctp::sourcePort,
    &sctp::destinationPort,
    &sctp::verificationTag,
    &sctp::checksum,
    &sctp::firstChunkType,
    &sctp::laterChunkType,
    &sctp::dataReserved,
    &sctp::unorderedBit,
    &sctp::fragmentBits,
    &sctp::chunkLength,
    &sctp::tsn,
    &sctp::streamIdentifier,
    &sctp::streamSequenceNumber,
    &sctp::payloadProtocolIdentifier,
    &sctp::initFlags<sctp::initIds>,
    &sctp::initLength<sctp::initIds>,
    &sctp::initiateTag<sctp::initIds>,
    &sctp::receiverWindow<sctp::initIds>,
    &sctp::outboundStreams<sctp::initIds>,
    &sctp::inboundStreams<sctp::initIds>,
    &sctp::initialTsn<sctp::initIds>,
    &sctp::initParameterType,
    &sctp::initParameterLength,
    &sctp::ipv4Address,
    &ipv6::listedAddress,
    &sctp::cookieLifeSpanIncrement,
    &sctp::ecnCapable,
    &sctp::hostName,
    &sctp::supportedAddressType,
    &sctp::unknownParameter,
    &sctp::initFlags<sctp::initAckIds>,
    &sctp::initLength<sctp::initAckIds>,
    &sctp::initiateTag<sctp::initAckIds>,
    &sctp::receiverWindow<sctp::initAckIds>,
    &sctp::outboundStreams<sctp::initAckIds>,
    &sctp::inboundStreams<sctp::initAckIds>,
    &sctp::initialTsn<sctp::initAckIds>,
    &sctp::initAckParameterType,
    &sctp::initAckParameterLength,
    &sctp::stateCookie,
    &sctp::unrecognizedType,
    &sctp::unrecognizedLength,
    &sctp::unrecognizedValue,
    &sctp::sackFlags,
    &sctp::sackLength,
    &sctp::cumulativeTsnAck,
    &sctp::sackReceiverWindow,
    &sctp::gapBlockNumber,
    &sctp::duplicateNumber,
    &sctp::gapBlockStart,
    &sctp::gapBlockEnd,
    &sctp::duplicateTsn,
    &sctp::heartbeatFlags,
    &sctp::heartbeatInfoType,
    &sctp::heartbeatInfoLength,
    &sctp::heartbeatInfo,
    &sctp::heartbeatAckFlags,
    &sctp::abortReserved,
    &sctp::abortTagBit,
    &sctp::abortLength,
    &sctp::causeCode,
    &sctp::invalidStreamLength,
    &sctp::invalidStream,
    &sctp::invalidStreamReserved,
    &sctp::missingLength,
    &sctp::missingNumber,
    &sctp::missingType,
    &sctp::staleCookieLength,
    &sctp::staleness,
    &sctp::outOfResourceLength,
    &sctp::unresolvableLength,
    &sctp::unresolvableValue,
    &sctp::unrecognizedChunkLength,
    &sctp::unrecognizedChunk,
    &sctp::invalidMandatoryLength,
    &sctp::unrecognizedListLength,
    &sctp::noUserDataLength,
    &sctp::noUserDataTsn,
    &sctp::shuttingDownLength,
    &sctp::unknownCauseLength,
    &sctp::unknownCause,
    &sctp::shutdownFlags,
    &sctp::shutdownLength,
    &sctp::shutdownCumulativeTsnAck,
    &sctp::shutdownAckFlags,
    &sctp::shutdownAckLength,
    &sctp::errorFlags,
    &sctp::errorLength,
    &sctp::cookieEchoFlags,
    &sctp::cookie,
    &sctp::cookieAckFlags,
    &sctp::ecneFlags,
    &sctp::ecneReserved,
    &sctp::cwrFlags,
    &sctp::cwrReserved,
    &sctp::completeReserved,
    &sctp::completeTagBit,
    &sctp::completeLength,
    &sctp::unknownFlags,
    &sctp::reservedContents,
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
