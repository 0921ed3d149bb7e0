// SPDX-License-Identifier: MIT
// The IPv6 header (RFC 2460).
//
//    0                   1                   2                   3
//    0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1
//   +-------+---------------+---------------------------------------+
//   |Version| Traffic Class |               Flow Label              |
//   +-------+---------------+-------+---------------+---------------+
//   |         Payload Length        |  Next Header  |   Hop Limit   |
//   +-------------------------------+---------------+---------------+
//   |                        Source Address                         |
//   |                      Destination Address                      |
//   +---------------------------------------------------------------+
//
// If the Payload Length reaches past the packet, nothing after it is read. The version of the first header was read
// before this production starts; the version of an inner header is not shown.
#pragma once

#include <cstdint>

#include "frame/block.h"
#include "frame/checked_run.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "ip/ipv6_address.h"
#include "names/ip_protocols.h"

namespace netfloor::plugin::ipv6 {

// The Payload Length is reported twice: for the limit (168), without moving the cursor, and inside the limit (171). The
// published tables show no difference: both have the layout of two octets that the cursor moves over.
//
// clang-format off
inline constexpr Field trafficClass       {166, "Traffic Class",          pieces({0, 3}, {12, 15}),                          "%n=%u"};
inline constexpr Field flowLabel          {167, "Flow Label",             pieces({8, 11}, {16, 23}, {24, 31}).advancing(32), "%n=%u"};
inline constexpr Field payloadLengthAhead {168, "Payload Length",         octets(2).advancing(0),                            "%n=%u octets"};
inline constexpr Field payloadLength      {171, "Payload Length",         octets(2),                                         "%n=%u octets"};
inline constexpr Field nextHeaderField    {220, "Next Header",            octets(1),                                         "%n=%-S",             &protocolNames};
inline constexpr Field hopLimit           {172, "Hop Limit",              octets(1),                                         "%n=%u"};
inline constexpr Field sourceGroups       {956, "Source IP Address",      addressGroups(),                                   R"(%n=%-["%x":"."])"};
inline constexpr Field sourceNibbles      {958, "Source IP Address",      addressNibbles(),                                  ""};
inline constexpr Field destinationGroups  {952, "Destination IP Address", addressGroups(),                                   R"(%n=%-["%x":"."])"};
inline constexpr Field destinationNibbles {954, "Destination IP Address", addressNibbles(),                                  ""};
// clang-format on

struct HeaderVariables {
    std::uint32_t ipv6PayloadLength; // octets after the fixed header
};

inline constexpr std::uint32_t payloadLengthBits = 16;

// The bits between the Payload Length and the payload: Next Header, Hop Limit and the addresses.
inline constexpr std::uint32_t bitsAfterLength = 272;

// Reads the Next Header of any header of the chain.
template <class Pass>
NETFLOOR_INLINE inline void nextHeader(Reader<Pass> &reader) {
    if (!reader.live) {
        return;
    }
    auto &variables = reader.variables();
    const Block<Pass> block{reader, "Next Header"};
    read<nextHeaderField>(reader, &variables.ipProtocol);
    if (reader.live) {
        variables.outerProtocol = variables.ipProtocol;
    }
}

template <class Pass>
NETFLOOR_INLINE inline void fieldsUpToPayloadLength(Reader<Pass> &reader) {
    read<trafficClass>(reader);
    read<flowLabel>(reader);
    read<payloadLengthAhead>(reader, &reader.variables().ipv6PayloadLength);
}

template <class Pass>
NETFLOOR_INLINE inline void fieldsFromPayloadLength(Reader<Pass> &reader) {
    read<payloadLength>(reader);
    nextHeader(reader);
    read<hopLimit>(reader);
    addressReadTwice<sourceGroups, sourceNibbles>(reader);
    addressReadTwice<destinationGroups, destinationNibbles>(reader);
}

// The bits of a body of which the test of the bits left counts all but the Payload Length: it counts from after the
// Payload Length, but the body starts there. So a packet that is one or two octets too short passes the test, and is
// read up to its end. 0 where a packet does not pass it.
template <class Pass>
[[nodiscard]] NETFLOOR_INLINE inline std::uint32_t bodyBits(const Reader<Pass> &reader) {
    const std::uint32_t restBits = reader.variables().ipv6PayloadLength * bitsPerOctet + bitsAfterLength;
    return reader.live && restBits <= reader.left ? payloadLengthBits + restBits : 0;
}

// Reads the body of a fixed header, which stays open in `chain`.
template <Form form, class Pass>
NETFLOOR_INLINE inline void body(Reader<Pass> &reader, BlockChain<Pass> &chain, std::uint32_t bitCount) {
    auto &variables = reader.variables();
    chain.openLimited("IPv6 Body", bitCount);
    if constexpr (form != Form::outOfLine) {
        expectFields<payloadLength, destinationNibbles>(reader);
        fieldsFromPayloadLength(reader);
    } else {
        checkedRun<payloadLength, destinationNibbles, fieldsFromPayloadLength<Pass>>(reader);
    }
    if (reader.live) {
        variables.payloadOctets = static_cast<std::int32_t>(variables.ipv6PayloadLength);
    }
}

// clang-format off
using HeaderRows = Rows<
    FieldList<
        trafficClass, flowLabel, payloadLengthAhead, payloadLength, nextHeaderField, hopLimit,
        sourceGroups, sourceNibbles, destinationGroups, destinationNibbles>,
    FieldList<payloadLengthAhead, payloadLength, sourceNibbles, destinationNibbles, nextHeaderField>>;
// clang-format on

} // namespace netfloor::plugin::ipv6
