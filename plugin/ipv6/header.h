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
// A Payload Length that reaches behind the packet leaves all behind it unread. The version of the packet's
// first header has been read ahead; that of a header inside another one is not shown.
#pragma once

#include <cstdint>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/step.h"
#include "frame/stretch.h"
#include "ipv6/address.h"
#include "tables/protocol_numbers.h"

namespace netfloor::ipv6 {

// clang-format off
inline constexpr Field trafficClass       {166, "Traffic Class",          pieces({0, 3}, {12, 15}),                          "Traffic Class=%u"};
inline constexpr Field flowLabel          {167, "Flow Label",             pieces({8, 11}, {16, 23}, {24, 31}).advancing(32), "Flow Label=%u"};
inline constexpr Field payloadLengthAhead {168, "Payload Length",         octets(2).advancing(0),                            "Payload Length=%u octets"};
inline constexpr Field payloadLength      {171, "Payload Length",         octets(2),                                         "Payload Length=%u octets"};
inline constexpr Field nextHeaderField    {220, "Next Header",            octets(1),                                         "Next Header=%-S", &protocolNames};
inline constexpr Field hopLimit           {172, "Hop Limit",              octets(1),                                         "Hop Limit=%u"};
inline constexpr Field sourceGroups       {956, "Source IP Address",      addressGroups(),                                   R"(Source IP Address=%-["%x":"."])"};
inline constexpr Field sourceNibbles      {958, "Source IP Address",      addressNibbles(),                                  ""};
inline constexpr Field destinationGroups  {952, "Destination IP Address", addressGroups(),                                   R"(Destination IP Address=%-["%x":"."])"};
inline constexpr Field destinationNibbles {954, "Destination IP Address", addressNibbles(),                                  ""};
// clang-format on

struct HeaderVariables {
    std::uint32_t ipv6PayloadLength; // octets behind the fixed header
};

inline constexpr std::uint32_t payloadLengthBits = 16;

// What stands between the Payload Length and the payload: Next Header, Hop Limit and the addresses.
inline constexpr std::uint32_t bitsBehindLength = 272;

// The Next Header of any header of the chain.
template <class Pass>
NETFLOOR_INLINE inline void nextHeader(Reader<Pass> &at) {
    if (!at.live) {
        return;
    }
    auto &variables = at.variables();
    const Block<Pass> block{at, "Next Header"};
    read<nextHeaderField>(at, &variables.ipProtocol);
    if (at.live) {
        variables.outerProtocol = variables.ipProtocol;
    }
}

template <class Pass>
NETFLOOR_INLINE inline void upToPayloadLength(Reader<Pass> &at) {
    read<trafficClass>(at);
    read<flowLabel>(at);
    read<payloadLengthAhead>(at, &at.variables().ipv6PayloadLength);
}

template <class Pass>
NETFLOOR_INLINE inline void fromPayloadLength(Reader<Pass> &at) {
    read<payloadLength>(at);
    nextHeader(at);
    read<hopLimit>(at);
    addressReadTwice<sourceGroups, sourceNibbles>(at);
    addressReadTwice<destinationGroups, destinationNibbles>(at);
}

// Reads a fixed header, whose body stays open in `chain`. Gives whether the chain goes on behind it.
//
// The test of the length is made with what stands behind the Payload Length, while the body starts with it:
// a packet one or two octets short is read as far as it goes.
template <class Pass>
[[nodiscard]] NETFLOOR_INLINE inline bool fixedHeader(Reader<Pass> &at, BlockChain<Pass> &chain) {
    auto &variables = at.variables();
    chain.open("IPv6 Header");
    stretch<48, upToPayloadLength<Pass>>(at);

    const std::uint32_t restBits = variables.ipv6PayloadLength * bitsPerOctet + bitsBehindLength;
    if (!at.live || restBits > at.left) {
        return false;
    }
    chain.openLimited("IPv6 Body", payloadLengthBits + restBits);
    stretch<payloadLengthBits + bitsBehindLength, fromPayloadLength<Pass>>(at);
    if (at.live) {
        variables.payloadOctets = static_cast<std::int32_t>(variables.ipv6PayloadLength);
    }
    return true;
}

} // namespace netfloor::ipv6
