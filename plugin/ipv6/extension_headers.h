// SPDX-License-Identifier: MIT
// The extension headers of IPv6 (RFC 2460). Each one names the next header.
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
// The length of a header is no limit: the next header starts where the fields of this one end. The length is only
// subtracted from `payloadOctets`. The chain ends when nothing is left of these.
#pragma once

#include <array>
#include <cstdint>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "ip/ipv6_address.h"
#include "ipv6/header.h"
#include "ipv6/options.h"

namespace netfloor::plugin::ipv6 {

inline constexpr std::array moreFragmentsRows = {ValueName{0, "last fragment"}, ValueName{1, "more fragment"}};
inline constexpr ValueNames moreFragmentsNames{moreFragmentsRows};

// clang-format off
inline constexpr Field extensionLength        {222, "Header Extention length", octets(1),                "%n=%u*8 octet(s)"};

inline constexpr Field routingTypeAhead       {177, "Routing Type",            ahead(16, 23),            "%n=%x"};
inline constexpr Field segmentsLeftAhead      {188, "Segments Left",           ahead(24, 31),            "%n=%x"};
inline constexpr Field spare                  {193, "Spare",                   octetRun(),               "%n=%x"};
inline constexpr Field routingType            {180, "Routing Type",            octets(1),                "%n=%u"};
inline constexpr Field segmentsLeft           {181, "Sgmt Left",               octets(1),                "%n=%u"};
inline constexpr Field routingReserved        {182, "Reserved",                octets(4),                R"(%n=%-["%x"])"};

inline constexpr Field fragmentReserved       {197, "Reserved",                octets(1),                "%n=%x"};
inline constexpr Field fragmentOffset         {198, "fragment Offset",         pieces({0, 7}, {11, 15}), " %n=%u*8 octet(s)"};
inline constexpr Field fragmentSpare          {199, "Res",                     piece(9, 10),             "%n=%u"};
inline constexpr Field moreFragments          {200, "M Flag",                  bit(8).advancing(16),     "%n=%-S",            &moreFragmentsNames};
inline constexpr Field identification         {201, "Identification",          octetsBackward(4),        R"(%n=%-["%x"])"};

inline constexpr Field securityIndex          {215, "SPI",                     octetsBackward(4),        " %n=%u"};
inline constexpr Field securitySequence       {216, "Sequence Number",         octetsBackward(4),        " %n=%u"};
inline constexpr Field encryptedData          {218, "Encrypted Data",          octets(1),                "%n=%x"};

inline constexpr Field authenticationLength   {206, "Payload Length",          octets(1),                "%n=%u*4 octets"};
inline constexpr Field authenticationReserved {207, "reserved",                octets(1),                "%n=%x"};
inline constexpr Field authenticationIndex    {208, "SPI",                     octetsBackward(4),        " %n=%u"};
inline constexpr Field authenticationSequence {209, "Sequency Number",         octetsBackward(4),        " %n=%u"};
inline constexpr Field authenticationData     {211, "Authentication Data",     octets(1),                "%n=%x"};
// clang-format on

struct ExtensionHeaderVariables {
    std::int32_t ahDataOctets; // of the authentication header that was read last
};

// Octets of an extension header whose length field counts units of 8 octets after the first unit.
[[nodiscard]] constexpr std::uint32_t extensionOctets(std::uint32_t length) {
    return length * 8 + 8;
}

inline constexpr std::uint32_t fragmentHeaderOctets = 8;
inline constexpr std::uint32_t securityHeaderOctets = 8;

// Subtracts a header from the payload.
template <class Pass>
NETFLOOR_INLINE inline void countOff(Reader<Pass> &reader, std::uint32_t octetCount) {
    if (reader.live) {
        reader.variables().payloadOctets -= static_cast<std::int32_t>(octetCount);
        reader.check();
    }
}

// Reads the length and gives it in the unit of the header.
template <class Pass>
[[nodiscard]] NETFLOOR_INLINE inline std::uint32_t headerLength(Reader<Pass> &reader) {
    std::uint32_t length = 0;
    if (reader.live) {
        const Block<Pass> block{reader, "Header Extention Length"};
        read<extensionLength>(reader, &length);
    }
    return length;
}

// The links of the chain. Their blocks stay open in `chain`. Each function returns whether the chain goes on after it.

template <class Pass>
[[nodiscard]] NETFLOOR_INLINE inline bool optionsHeader(Reader<Pass> &reader, BlockChain<Pass> &chain, BlockName name) {
    chain.open(name);
    nextHeader(reader);
    countOff(reader, extensionOctets(headerLength(reader)));
    return reader.live && option(reader, chain);
}

// The length gives the number of addresses to read; "Sgmt Left" has no influence.
template <class Pass>
NETFLOOR_INLINE inline void type0Routing(Reader<Pass> &reader) {
    nextHeader(reader);
    const std::uint32_t length = headerLength(reader);
    read<routingType>(reader);
    read<segmentsLeft>(reader);
    read<routingReserved>(reader);
    for (std::uint32_t addresses = length / 2; addresses > 0 && reader.live; --addresses) {
        addressReadTwice<address, addressKey>(reader);
    }
    countOff(reader, extensionOctets(length));
}

// The header is read up to 4 octets before its end, and the next header is read from there.
template <class Pass>
NETFLOOR_INLINE inline void unknownRouting(Reader<Pass> &reader) {
    nextHeader(reader);
    const std::uint32_t length = headerLength(reader);
    readRun<spare>(reader, static_cast<std::int32_t>(length * 8 + 2));
    countOff(reader, extensionOctets(length));
}

// A header of an unknown type that has segments left is not read, and ends the chain.
template <class Pass>
[[nodiscard]] NETFLOOR_INLINE inline bool routingHeader(Reader<Pass> &reader, BlockChain<Pass> &chain) {
    std::uint32_t type = 0;
    chain.open("Ipv6 Routing Header");
    read<routingTypeAhead>(reader, &type);
    if (!reader.live) {
        return false;
    }
    if (type == 0) {
        chain.open("Type 0 Routing Header");
        type0Routing(reader);
        return true;
    }
    std::uint32_t segments = 0;
    chain.open("Unknown Routing Header");
    read<segmentsLeftAhead>(reader, &segments);
    if (segments != 0) {
        return false;
    }
    unknownRouting(reader);
    return true;
}

// The offset has no influence: the payload of a later fragment is read as the next header too.
template <class Pass>
[[nodiscard]] NETFLOOR_INLINE inline bool fragmentHeader(Reader<Pass> &reader, BlockChain<Pass> &chain) {
    chain.open("IPv6 Fragment Header");
    nextHeader(reader);
    read<fragmentReserved>(reader);
    read<fragmentOffset>(reader);
    read<fragmentSpare>(reader);
    read<moreFragments>(reader);
    read<identification>(reader);
    countOff(reader, fragmentHeaderOctets);
    return true;
}

template <class Pass>
[[nodiscard]] NETFLOOR_INLINE inline bool authenticationHeader(Reader<Pass> &reader, BlockChain<Pass> &chain) {
    auto &variables = reader.variables();
    std::uint32_t words = 0;
    chain.open("IP Authentication Header");
    nextHeader(reader);
    read<authenticationLength>(reader, &words);
    readCounted<authenticationReserved>(reader, 2);
    read<authenticationIndex>(reader);
    read<authenticationSequence>(reader);
    if (reader.live) {
        variables.ahDataOctets = static_cast<std::int32_t>(words) * 4 - 4;
    }
    readCounted<authenticationData>(reader, variables.ahDataOctets);
    countOff(reader, words * 4 + 8);
    return true;
}

template <class Pass>
void securityPayload(Reader<Pass> &reader) {
    const Block<Pass> block{reader, ""};
    read<securityIndex>(reader);
    read<securitySequence>(reader);
    countOff(reader, securityHeaderOctets);
    readCounted<encryptedData>(reader, reader.variables().payloadOctets);
}

// clang-format off
using ExtensionHeaderRows = Rows<
    Joined<
        FieldList<extensionLength>,
        OptionRows::Fields,
        FieldList<
            routingTypeAhead, routingType, segmentsLeft, routingReserved, segmentsLeftAhead, spare,
            fragmentReserved, fragmentOffset, fragmentSpare, moreFragments, identification,
            securityIndex, securitySequence, encryptedData,
            authenticationLength, authenticationReserved, authenticationIndex, authenticationSequence,
            authenticationData>>,
    Joined<
        FieldList<
            addressKey, fragmentOffset, moreFragments, securityIndex, securitySequence,
            authenticationIndex, authenticationSequence, extensionLength>,
        OptionRows::Keys>>;
// clang-format on

} // namespace netfloor::plugin::ipv6
