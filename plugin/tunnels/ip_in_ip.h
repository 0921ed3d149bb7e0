// SPDX-License-Identifier: MIT
// The header of a datagram inside an IPv4 datagram (RFC 2003). It has the layout of the outer header.
//
//    0                   1                   2                   3
//    0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1
//   +-------+-------+---------------+-------------------------------+
//   |Version|  IHL  |Type of Service|   Original IP Total Length    |
//   +-------+-------+---------------+-----+-------------------------+
//   |    Original Identification    |Flags|     Fragment Offset     |
//   +---------------+---------------+-----+-------------------------+
//   |  Time to Live |IPinIP Protocol|        Header Checksum        |
//   +---------------+---------------+-------------------------------+
//   |                     Original Src Address                      |
//   |                     Original Dest Address                     |
//   +---------------------------------------------------------------+
//   |                     Options and padding                       |
//   +---------------------------------------------------------------+
//
// The inner lengths replace the outer ones, but set no limit: the outermost header alone limits the bits. An inner
// fragment is read as a whole datagram.
#pragma once

#include <cstdint>

#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "ipv4/options.h"
#include "ipv4/service_and_fragment.h"
#include "names/ip_protocols.h"

namespace netfloor::plugin::ipinip {

// clang-format off
inline constexpr Field version            {629, "Version",                         piece(4, 7),              "%n=%u"};
inline constexpr Field headerLength       {630, "Original Internet Header Length", piece(0, 3).advancing(8), "%n=%u*4 octets"};
inline constexpr Field totalLength        {631, "Original IP Total Length",        octetPair(),              "%n=%u octets"};
inline constexpr Field identification     {632, "Original Identification",         octetPair(),              "%n=%x"};
inline constexpr Field timeToLive         {633, "Time to Live",                    octets(1),                "%n=%u"};
inline constexpr Field protocol           {634, "IPinIP Protocol",                 octets(1),                "%n=%-S",               &protocolNames, "IPinIP - %-S"};
inline constexpr Field headerChecksum     {635, "Header Checksum",                 octetPair(),              "  %n=%x"};
inline constexpr Field sourceAddress      {636, "Original Src Address",            octets(4),                R"(  %n=%-["%u":"."])"};
inline constexpr Field destinationAddress {637, "Original Dest Address",           octets(4),                R"(  %n=%-["%u":"."])"};
// clang-format on

template <class Pass>
NETFLOOR_INLINE inline void header(Reader<Pass> &reader) {
    auto &variables = reader.variables();
    read<version>(reader);
    read<headerLength>(reader, [&](std::uint32_t words) { variables.ipHeaderOctets = words * 4; });
    ipv4::typeOfService(reader);
    read<totalLength>(reader, &variables.ipTotalLength);
    read<identification>(reader);
    ipv4::flagAndFragmentOffset(reader);
    read<timeToLive>(reader);
    read<protocol>(reader, &variables.ipProtocol);
    read<headerChecksum>(reader);
    read<sourceAddress>(reader);
    read<destinationAddress>(reader);
    ipv4::options(reader, ipv4::optionOctets(reader));
    if (reader.live) {
        variables.payloadOctets = static_cast<std::int32_t>(variables.ipTotalLength - variables.ipHeaderOctets);
    }
}

// clang-format off
using HeaderRows = Rows<
    FieldList<
        version, headerLength, totalLength, identification, timeToLive, protocol, headerChecksum,
        sourceAddress, destinationAddress>,
    FieldList<headerLength, totalLength, protocol, sourceAddress, destinationAddress>>;
// clang-format on

} // namespace netfloor::plugin::ipinip
