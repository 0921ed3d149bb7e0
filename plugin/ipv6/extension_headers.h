// SPDX-License-Identifier: MIT
// The chain of IPv6: extension headers (RFC 2460), each of which tells the next one, up to the header that
// ends it. An IPv6 header is a link like the others, and the first one.
//
//   Routing (43)                           Fragment (44)
//   +--------+--------+--------+--------+  +--------+--------+-------------+--+-+
//   |Next Hdr| Length |  Type  |Segments|  |Next Hdr|Reserved|   Offset    |Rs|M|
//   +--------+--------+--------+--------+  +--------+--------+-------------+--+-+
//   |      Reserved, addresses ...      |  |           Identification           |
//
//   Encapsulating Security Payload (50)    Authentication (51)
//   +-----------------------------------+  +--------+--------+-----------------+
//   |     Security Parameters Index     |  |Next Hdr| Length |    Reserved     |
//   +-----------------------------------+  +--------+--------+-----------------+
//   |          Sequence Number          |  |     Security Parameters Index     |
//   +-----------------------------------+  +-----------------------------------+
//   |         Encrypted data ...        |  |          Sequence Number          |
//                                          |      Authentication data ...      |
//
// No header's length is a limit: a header is read by its fields, and the next one is looked for where they
// end. What a length does is to count off `payloadOctets`, and when nothing is left of them the chain ends.
#pragma once

#include <array>
#include <cstdint>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/step.h"
#include "icmp/icmpv6.h"
#include "ipv4/unknown_data.h"
#include "ipv6/address.h"
#include "ipv6/header.h"
#include "ipv6/options.h"
#include "sctp/sctp.h"
#include "tables/protocol_numbers.h"
#include "transport/tcp.h"
#include "transport/udp.h"
#include "tunnels/gre.h"

namespace netfloor::ipv6 {

inline constexpr std::array moreFragmentsRows = {ValueName{0, "last fragment"}, ValueName{1, "more fragment"}};
inline constexpr ValueNames moreFragmentsNames{moreFragmentsRows};

// clang-format off
inline constexpr Field extensionLength        {222, "Header Extention length", octets(1),                "Header Extention length=%u*8 octet(s)"};

inline constexpr Field routingTypeAhead       {177, "Routing Type",            ahead(16, 23),            "Routing Type=%x"};
inline constexpr Field segmentsLeftAhead      {188, "Segments Left",           ahead(24, 31),            "Segments Left=%x"};
inline constexpr Field spare                  {193, "Spare",                   octetRun(),               "Spare=%x"};
inline constexpr Field routingType            {180, "Routing Type",            octets(1),                "Routing Type=%u"};
inline constexpr Field segmentsLeft           {181, "Sgmt Left",               octets(1),                "Sgmt Left=%u"};
inline constexpr Field routingReserved        {182, "Reserved",                octets(4),                R"(Reserved=%-["%x"])"};

inline constexpr Field fragmentReserved       {197, "Reserved",                octets(1),                "Reserved=%x"};
inline constexpr Field fragmentOffset         {198, "fragment Offset",         pieces({0, 7}, {11, 15}), " fragment Offset=%u*8 octet(s)"};
inline constexpr Field fragmentSpare          {199, "Res",                     piece(9, 10),             "Res=%u"};
inline constexpr Field moreFragments          {200, "M Flag",                  bit(8).advancing(16),     "M Flag=%-S", &moreFragmentsNames};
inline constexpr Field identification         {201, "Identification",          octetsBackward(4),        R"(Identification=%-["%x"])"};

inline constexpr Field securityIndex          {215, "SPI",                     octetsBackward(4),        " SPI=%u"};
inline constexpr Field securitySequence       {216, "Sequence Number",         octetsBackward(4),        " Sequence Number=%u"};
inline constexpr Field encryptedData          {218, "Encrypted Data",          octets(1),                "Encrypted Data=%x"};

inline constexpr Field authenticationLength   {206, "Payload Length",          octets(1),                "Payload Length=%u*4 octets"};
inline constexpr Field authenticationReserved {207, "reserved",                octets(1),                "reserved=%x"};
inline constexpr Field authenticationIndex    {208, "SPI",                     octetsBackward(4),        " SPI=%u"};
inline constexpr Field authenticationSequence {209, "Sequency Number",         octetsBackward(4),        " Sequency Number=%u"};
inline constexpr Field authenticationData     {211, "Authentication Data",     octets(1),                "Authentication Data=%x"};
// clang-format on

struct ExtensionHeaderVariables {
    std::int32_t ahDataOctets; // of the authentication header that was read last
};

// Octets of an extension header that tells its length in units of 8 octets, without the first one.
[[nodiscard]] constexpr std::uint32_t extensionOctets(std::uint32_t length) {
    return length * 8 + 8;
}

inline constexpr std::uint32_t fragmentHeaderOctets = 8;
inline constexpr std::uint32_t securityHeaderOctets = 8;

// Counts a header off the payload.
template <class Pass>
NETFLOOR_INLINE inline void countOff(Reader<Pass> &at, std::uint32_t octetCount) {
    if (at.live) {
        at.variables().payloadOctets -= static_cast<std::int32_t>(octetCount);
    }
}

// Gives the length as it stands in the header.
template <class Pass>
[[nodiscard]] NETFLOOR_INLINE inline std::uint32_t headerLength(Reader<Pass> &at) {
    std::uint32_t length = 0;
    if (at.live) {
        const Block<Pass> block{at, "Header Extention Length"};
        read<extensionLength>(at, &length);
    }
    return length;
}

// The links of the chain. Their blocks stay open in `chain`; each gives whether the chain goes on behind it.

template <class Pass>
[[nodiscard]] NETFLOOR_INLINE inline bool optionsHeader(Reader<Pass> &at, BlockChain<Pass> &chain, BlockName name) {
    chain.open(name);
    nextHeader(at);
    countOff(at, extensionOctets(headerLength(at)));
    return at.live && option(at, chain);
}

// "Sgmt Left" does not steer the addresses: all that the length has room for are read.
template <class Pass>
NETFLOOR_INLINE inline void type0Routing(Reader<Pass> &at) {
    nextHeader(at);
    const std::uint32_t length = headerLength(at);
    read<routingType>(at);
    read<segmentsLeft>(at);
    read<routingReserved>(at);
    for (std::uint32_t addresses = length / 2; addresses > 0 && at.live; --addresses) {
        addressReadTwice<address, addressKey>(at);
    }
    countOff(at, extensionOctets(length));
}

// The header is read up to 4 octets in front of its end, and that is where the next one is looked for.
template <class Pass>
NETFLOOR_INLINE inline void unknownRouting(Reader<Pass> &at) {
    nextHeader(at);
    const std::uint32_t length = headerLength(at);
    readRun<spare>(at, static_cast<std::int32_t>(length * 8 + 2));
    countOff(at, extensionOctets(length));
}

// A header of an unknown type that is not through with its segments is left unread, and ends the chain.
template <class Pass>
[[nodiscard]] NETFLOOR_INLINE inline bool routingHeader(Reader<Pass> &at, BlockChain<Pass> &chain) {
    std::uint32_t type = 0;
    chain.open("Ipv6 Routing Header");
    read<routingTypeAhead>(at, &type);
    if (!at.live) {
        return false;
    }
    if (type == 0) {
        chain.open("Type 0 Routing Header");
        type0Routing(at);
        return true;
    }
    std::uint32_t segments = 0;
    chain.open("Unknown Routing Header");
    read<segmentsLeftAhead>(at, &segments);
    if (segments != 0) {
        return false;
    }
    unknownRouting(at);
    return true;
}

// The offset steers nothing: what a later fragment holds is read as the next header all the same.
template <class Pass>
[[nodiscard]] NETFLOOR_INLINE inline bool fragmentHeader(Reader<Pass> &at, BlockChain<Pass> &chain) {
    chain.open("IPv6 Fragment Header");
    nextHeader(at);
    read<fragmentReserved>(at);
    read<fragmentOffset>(at);
    read<fragmentSpare>(at);
    read<moreFragments>(at);
    read<identification>(at);
    countOff(at, fragmentHeaderOctets);
    return true;
}

template <class Pass>
[[nodiscard]] NETFLOOR_INLINE inline bool authenticationHeader(Reader<Pass> &at, BlockChain<Pass> &chain) {
    auto &variables = at.variables();
    std::uint32_t words = 0;
    chain.open("IP Authentication Header");
    nextHeader(at);
    read<authenticationLength>(at, &words);
    readCounted<authenticationReserved>(at, 2);
    read<authenticationIndex>(at);
    read<authenticationSequence>(at);
    if (at.live) {
        variables.ahDataOctets = static_cast<std::int32_t>(words) * 4 - 4;
    }
    readCounted<authenticationData>(at, variables.ahDataOctets);
    countOff(at, words * 4 + 8);
    return true;
}

template <class Pass>
void securityPayload(Reader<Pass> &at) {
    const Block<Pass> block{at, ""};
    read<securityIndex>(at);
    read<securitySequence>(at);
    countOff(at, securityHeaderOctets);
    readCounted<encryptedData>(at, at.variables().payloadOctets);
}

// A protocol that ends the chain. The tunnels of IPv4 are not followed from here.
template <class Pass>
NETFLOOR_INLINE inline void upperProtocol(Reader<Pass> &at, std::uint32_t protocol) {
    switch (protocol) {
    case protocolIcmp:
    case protocolIcmpv6: return apart<icmpv6::message<Pass>>(at);
    case protocolTcp: return apart<tcp::segment<Pass>>(at);
    case protocolUdp: return udp::datagram(at);
    case protocolGre: return apart<gre::packet<Pass>>(at);
    case protocolSctp: return apart<sctp::packet<Pass>>(at);
    case protocolEsp: return apart<securityPayload<Pass>>(at);
    default: return apart<unknownData<Pass>>(at);
    }
}

template <class Pass>
[[nodiscard]] NETFLOOR_INLINE inline bool link(Reader<Pass> &at, BlockChain<Pass> &chain, std::uint32_t protocol) {
    switch (protocol) {
    case protocolHopByHop:
    case protocolDestinationOptions:
        return optionsHeader(at, chain,
                             protocol == protocolHopByHop ? BlockName{"IPv6 Hop-by-Hop Header"}
                                                          : BlockName{"Destination Option Header"});
    case protocolIpv6: return fixedHeader(at, chain);
    case protocolRouting: return routingHeader(at, chain);
    case protocolFragment: return fragmentHeader(at, chain);
    case protocolAuthentication: return authenticationHeader(at, chain);
    default: upperProtocol(at, protocol); return false;
    }
}

// A packet: its IPv6 header, and what that leads to.
template <class Pass>
NETFLOOR_INLINE inline void datagram(Reader<Pass> &at) {
    const auto &variables = at.variables();
    BlockChain<Pass> chain{at};
    std::uint32_t next = protocolIpv6;
    while (link(at, chain, next) && at.live && variables.payloadOctets >= 1) {
        chain.open("Choose Protocol");
        next = variables.ipProtocol;
    }
}

} // namespace netfloor::ipv6
