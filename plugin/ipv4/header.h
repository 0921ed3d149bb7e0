// SPDX-License-Identifier: MIT
// The IPv4 header (RFC 791).
//
//    0                   1                   2                   3
//    0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1
//   +-------+-------+---------------+-------------------------------+
//   |Version|  IHL  |Type of Service|          Total Length         |
//   +-------+-------+---------------+-----+-------------------------+
//   |         Identification        |Flags|     Fragment Offset     |
//   +---------------+---------------+-----+-------------------------+
//   |  Time to Live |    Protocol   |        Header Checksum        |
//   +---------------+---------------+-------------------------------+
//   |                        Source Address                         |
//   |                     Destination Address                       |
//   +---------------------------------------------------------------+
//   |                     Options and padding                       |
//   +---------------------------------------------------------------+
//
// Checksum, version and header length are not verified. The version was read before this production starts. The Total
// Length sets the limit of a block, so that octets after the datagram stay unread.
#pragma once

#include "frame/block.h"
#include "frame/checked_run.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "ip/form.h"
#include "ipv4/options.h"
#include "ipv4/service_and_fragment.h"
#include "names/ip_protocols.h"

namespace netfloor::plugin::ipv4 {

// clang-format off
inline constexpr Field headerLength       {152, "Internet Header Length", piece(0, 3).advancing(8), "%n=%u*4 octets"};
inline constexpr Field totalLength        {153, "Total Length",           octets(2),                "%n=%u octets"};
inline constexpr Field identification     {156, "Identification",         octets(2),                "%n=%x"};
inline constexpr Field timeToLive         {157, "Time to Live",           octets(1),                "%n=%u"};
inline constexpr Field protocol           {295, "Protocol",               octets(1),                "%n=%-S",              &protocolNames};
inline constexpr Field headerChecksum     {158, "Header Checksum",        octets(2),                "%n=%x"};
inline constexpr Field sourceAddress      {159, "Source Address",         octets(4),                R"(%n= %-["%u":"."])"};
inline constexpr Field destinationAddress {160, "Destination Address",    octets(4),                R"(%n= %-["%u":"."])"};
// clang-format on

// The octets of the datagram before its limited block: version, header length, service and Total Length.
inline constexpr std::uint32_t bitsBeforeLimit = 32;

template <class Pass>
NETFLOOR_INLINE inline void fieldsUpToTotalLength(Reader<Pass> &reader) {
    auto &variables = reader.variables();
    read<headerLength>(reader, [&](std::uint32_t words) { variables.ipHeaderOctets = words * 4; });
    typeOfService(reader);
    read<totalLength>(reader, &variables.ipTotalLength);
}

template <class Pass>
NETFLOOR_INLINE inline void fieldsAfterTotalLength(Reader<Pass> &reader) {
    auto &variables = reader.variables();
    read<identification>(reader);
    flagAndFragmentOffset(reader);
    read<timeToLive>(reader);
    {
        const Block<Pass> block{reader, "Protocol"};
        read<protocol>(reader, &variables.ipProtocol);
        if (reader.live) {
            variables.outerProtocol = variables.ipProtocol;
        }
    }
    read<headerChecksum>(reader);
    read<sourceAddress>(reader);
    read<destinationAddress>(reader);
}

// The production of the payload is payload.template operator()<form>(reader).

template <Form form, auto payload, class Pass>
NETFLOOR_INLINE inline void afterHeader(Reader<Pass> &reader, std::int32_t areaOctets) {
    auto &variables = reader.variables();
    options(reader, areaOctets);
    if (reader.live) {
        variables.payloadOctets = static_cast<std::int32_t>(variables.ipTotalLength - variables.ipHeaderOctets);
    }
    payload.template operator()<form>(reader);
}

template <auto payload, class Pass>
NETFLOOR_INLINE inline void afterHeaderWithOptions(Reader<Pass> &reader) {
    afterHeader<Form::outOfLine, payload>(reader, optionOctets(reader));
}

// Options go out of line with all that follows them, so that the run of a datagram without them goes on.
template <Form form, auto payload, class Pass>
NETFLOOR_INLINE inline void afterTotalLength(Reader<Pass> &reader) {
    fieldsAfterTotalLength(reader);
    const std::int32_t areaOctets = optionOctets(reader);
    if (form == Form::outOfLine || areaOctets >= 1) {
        return runOutOfLine<afterHeaderWithOptions<payload, Pass>>(reader);
    }
    afterHeader<form, payload>(reader, areaOctets);
}

// Reads a datagram; `payload` is the production of its payload.
template <Form form, auto payload, class Pass>
NETFLOOR_INLINE inline void datagram(Reader<Pass> &reader) {
    auto &variables = reader.variables();
    const Block<Pass> header{reader, "IPv4 Header"};
    fieldsUpToTotalLength(reader);
    if (!reader.live) {
        return;
    }
    // For a Total Length below 4 this wraps to a number larger than any packet.
    const std::uint32_t limit = variables.ipTotalLength * bitsPerOctet - bitsBeforeLimit;
    reader.setAdvance(static_cast<std::int32_t>(limit));
    if (limit > reader.left) {
        return;
    }
    const LimitedBlock<Pass> extra{reader, "Extra", limit};
    if constexpr (form == Form::outOfLine) {
        runOutOfLine<afterTotalLength<form, payload, Pass>>(reader);
    } else {
        checkedRun<identification, destinationAddress, afterTotalLength<form, payload, Pass>,
                   afterTotalLength<Form::outOfLine, payload, Pass>>(reader);
    }
}

// clang-format off
using HeaderRows = Rows<
    FieldList<
        headerLength,
        precedence, delay, throughput, reliability, serviceReserved,
        totalLength, identification,
        fragmentReserved, dontFragmentFlag, moreFragments, fragmentOffset,
        timeToLive, protocol, headerChecksum, sourceAddress, destinationAddress>,
    FieldList<
        totalLength, identification, timeToLive, protocol, sourceAddress, destinationAddress,
        dontFragmentFlag, moreFragments, fragmentOffset>>;
// clang-format on

} // namespace netfloor::plugin::ipv4
