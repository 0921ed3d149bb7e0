// SPDX-License-Identifier: MIT
// The options of an IPv4 header (RFC 791).
//
//   type   0  End of Option List        type 130  Security
//   type   1  No Operation              type 131  Loose Source and Record Route
//   type   7  Record Route              type 136  Stream Identifier
//   type  68  Internet Timestamp        type 137  Strict Source and Record Route
//
// An option of any other type ends the list, and so does type 0; what is left of the area is padding. No option
// is held to the area: one whose length goes past it reads on in the payload, and ends the list.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/options.h"
#include "frame/step.h"
#include "ipv6/address.h"

namespace netfloor::ipv4 {

// The levels of RFC 791, whose second octet is read as the more significant.
inline constexpr std::array securityRows = {
    ValueName{0, "Unclassified"},
    ValueName{5039, "Restricted"},
    ValueName{9822, "PROG"},
    ValueName{13809, "Confidential"},
    ValueName{19900, "MMMM"},
    ValueName{24083, "(Reserved for future use)"},
    ValueName{27618, "(Reserved for future use)"},
    ValueName{30797, "(Reserved for future use)"},
    ValueName{35031, "Secret"},
    ValueName{39544, "EFTO"},
    ValueName{44937, "(Reserved for future use)"},
    ValueName{48420, "(Reserved for future use)"},
    ValueName{50539, "Top Secret"},
    ValueName{54980, "(Reserved for future use)"},
    ValueName{57909, "(Reserved for future use)"},
    ValueName{61850, "(Reserved for future use)"},
};
inline constexpr std::array compartmentRows = {ValueName{0, "the information transmitted is not compartmented"}};
inline constexpr std::array timestampFlagRows = {
    ValueName{0, "time stamps only, stored in consecutive 32-bit words"},
    ValueName{1, "each timestamp is preceded with internet address of the registering entity"},
    ValueName{3, "the internet address fields are prespecified"},
};

inline constexpr ValueNames securityNames{securityRows};
inline constexpr ValueNames compartmentNames{
    compartmentRows, "the compartments field may be obtained from the Defense Intelligence Agency"};
inline constexpr ValueNames timestampFlagNames{timestampFlagRows};

// clang-format off
inline constexpr Field noOperation         {318, "Type1, No Operation",                     octets(1),                  "Type1, No Operation", noNames, "%u"};

inline constexpr Field security            {321, "Type130, Security",                       octets(1),                  "Type130, Security", noNames, "%u"};
inline constexpr Field securityLength      {322, "Length",                                  octets(1),                  "Length=%u octets"};
inline constexpr Field securityLevel       {325, "Security (S Field)",                      piece(0, 15).advancing(16), "Security (S Field)=%-S", &securityNames};
inline constexpr Field compartments        {326, "Compartments (C Field)",                  octets(2),                  "Compartments (C Field)=%-S", &compartmentNames};
inline constexpr Field restrictions        {327, "Handling Restrictions (H Field)",         octets(2),                  "Handling Restrictions (H Field)=%x"};
inline constexpr Field transmissionControl {328, "Transmission Control Code (TCC Field)",   octets(3),                  "Transmission Control Code (TCC Field)=%x"};

inline constexpr Field looseRoute          {329, "Type131, Loose Source and Record Route",  octets(1),                  "Type131, Loose Source and Record Route", noNames, "%u"};
inline constexpr Field looseRouteLength    {330, "Length",                                  octets(1),                  "Length=%u octets"};
inline constexpr Field looseRoutePointer   {333, "Pointer",                                 octets(1),                  "Pointer=%u(th) octet"};
inline constexpr Field looseRouteData      {336, "Route Data",                              octets(4),                  R"(Route Data=%-["%u":"."])"};

inline constexpr Field strictRoute         {339, "Type137, Strict Source and Record Route", octets(1),                  "Type137, Strict Source and Record Route", noNames, "%u"};
inline constexpr Field strictRouteLength   {340, "Length",                                  octets(1),                  "Length=%u octets"};
inline constexpr Field strictRoutePointer  {343, "Pointer",                                 octets(1),                  "Pointer=%u(th) octet"};
inline constexpr Field strictRouteData     {346, "Route Data",                              octets(4),                  R"(Route Data=%-["%u":"."])"};

inline constexpr Field recordRoute         {348, "Type7, Record Route",                     octets(1),                  "Type7, Record Route", noNames, "%u"};
inline constexpr Field recordRouteLength   {349, "Length",                                  octets(1),                  "Length=%u octets"};
inline constexpr Field recordRoutePointer  {352, "Pointer",                                 octets(1),                  "Pointer=%u(th) octet"};
inline constexpr Field recordRouteData     {355, "Route Data",                              octets(4),                  R"(Route Data=%-["%u":"."])"};

inline constexpr Field streamIdentifier    {357, "Type136, Stream Identifier",              octets(1),                  "Type136, Stream Identifier", noNames, "%u"};
inline constexpr Field streamLength        {358, "Length",                                  octets(1),                  "Length=%u octets"};
inline constexpr Field streamId            {361, "Stream ID",                               octets(2),                  "Stream ID=%x"};

inline constexpr Field internetTimestamp   {362, "Type68, Internet Timestamp",              octets(1),                  "Type68, Internet Timestamp", noNames, "%u"};
inline constexpr Field timestampLength     {363, "Length",                                  octets(1),                  "Length=%u octets"};
inline constexpr Field timestampPointer    {366, "Pointer",                                 octets(1),                  "Pointer=%u(th) octet"};
inline constexpr Field timestampOverflow   {367, "Overflow",                                piece(4, 7),                "Overflow=%u"};
inline constexpr Field timestampFlag       {368, "Flag",                                    piece(0, 3).advancing(8),   "Flag=%-S", &timestampFlagNames};
inline constexpr Field timestamp           {372, "Timestamp",                               octets(4),                  "Timestamp=%x"};
inline constexpr Field registeringAddress  {378, "Internet Address",                        octets(4),                  R"(Internet Address=%-["%u":"."])"};
inline constexpr Field registeredTimestamp {380, "Timestamp",                               octets(4),                  "Timestamp=%x"};

inline constexpr Field endOfOptionPart     {381, "End Of Option Part",                      octets(1),                  "End Of Option Part", noNames, "%u"};
inline constexpr Field optionPadding       {306, "Padding",                                 octetRun(),                 "Padding=%x"};
// clang-format on

inline constexpr std::int32_t fixedHeaderOctets = 20;

// An option holds no more entries than this, however long it says it is.
inline constexpr std::int32_t mostEntries = 20;

// The types, in the order of their turns in a round.
inline constexpr std::array<std::uint8_t, 8> optionTypes = {1, 130, 131, 137, 7, 136, 68, 0};

struct OptionVariables {
    std::int32_t optionOctets; // of the area behind the fixed header
};

template <class Pass>
void securityOption(Reader<Pass> &at, OptionArea &area) {
    const OptionBlock<Pass> option{at, "Type130"};
    optionHead<security, securityLength>(at, area);
    read<securityLevel>(at);
    read<compartments>(at);
    read<restrictions>(at);
    read<transmissionControl>(at);
}

// In a packet that is not one of IPv4, a route is one of IPv6 addresses. No IPv6 header leads to an IPv4 header so far,
// but the field tables publish the address as part of the routes.
template <const Field &type, const Field &length, const Field &pointer, const Field &routeData, class Pass>
void routeOption(Reader<Pass> &at, BlockName name, OptionArea &area) {
    const OptionBlock<Pass> option{at, name};
    optionHead<type, length>(at, area);
    read<pointer>(at);
    if (at.variables().ipVersion == 4) {
        readRepeated<routeData>(at, mostEntries);
        return;
    }
    for (std::int32_t entry = 0; at.live && entry < mostEntries; ++entry) {
        ipv6::reversedAddress(at, ReversedBits<Pass>::Report::plain);
    }
}

template <class Pass>
void streamIdentifierOption(Reader<Pass> &at, OptionArea &area) {
    const OptionBlock<Pass> option{at, "Type136"};
    optionHead<streamIdentifier, streamLength>(at, area);
    read<streamId>(at);
}

template <class Pass>
void addressAndTimestamp(Reader<Pass> &at) {
    const Block<Pass> block{at, "INLINE BLOCK"};
    if (at.variables().ipVersion == 4) {
        read<registeringAddress>(at);
    } else {
        ipv6::addressReadTwice<ipv6::address, ipv6::addressKey>(at);
    }
    read<registeredTimestamp>(at);
}

// With prespecified addresses these show as timestamps too.
template <class Pass>
void timestampOption(Reader<Pass> &at, OptionArea &area) {
    const OptionBlock<Pass> option{at, "Type68"};
    std::uint32_t flag = 0;
    optionHead<internetTimestamp, timestampLength>(at, area);
    read<timestampPointer>(at);
    read<timestampOverflow>(at);
    read<timestampFlag>(at, &flag);
    const Block<Pass> block{at, "INLINE BLOCK"};
    if (flag == 0 || flag == 3) {
        readRepeated<timestamp>(at, mostEntries);
    } else if (flag == 1) {
        for (std::int32_t entry = 0; at.live && entry < mostEntries; ++entry) {
            addressAndTimestamp(at);
        }
    }
}

// Ends the list: there is no further round.
template <class Pass>
void endOfListOption(Reader<Pass> &at, OptionArea &area) {
    optionOfOneOctet<endOfOptionPart>(at, "", area);
    area.taken = false;
}

// Takes the option under the cursor, which is of a known type.
template <class Pass>
void option(Reader<Pass> &at, std::uint8_t type, OptionArea &area) {
    switch (type) {
    case 1: return optionOfOneOctet<noOperation>(at, "Type1", area);
    case 130: return securityOption(at, area);
    case 131: return routeOption<looseRoute, looseRouteLength, looseRoutePointer, looseRouteData>(at, "Type131", area);
    case 137:
        return routeOption<strictRoute, strictRouteLength, strictRoutePointer, strictRouteData>(at, "Type137", area);
    case 7: return routeOption<recordRoute, recordRouteLength, recordRoutePointer, recordRouteData>(at, "Type7", area);
    case 136: return streamIdentifierOption(at, area);
    case 68: return timestampOption(at, area);
    default: return endOfListOption(at, area);
    }
}

template <class Pass>
void optionRound(Reader<Pass> &at, OptionArea &area) {
    area.taken = false;
    for (std::size_t turn = 0; at.live && turn < optionTypes.size(); ++turn) {
        turn = nextTaker<optionTypes>(at, turn);
        if (turn == optionTypes.size()) {
            return;
        }
        option(at, optionTypes[turn], area);
    }
}

template <class Pass>
void optionArea(Reader<Pass> &at) {
    OptionArea area{at.variables().optionOctets};
    {
        BlockChain<Pass> rounds{at};
        do {
            rounds.open("");
            optionRound(at, area);
        } while (at.live && area.taken && area.octets >= 1);
    }
    if (area.octets >= 1) {
        readRun<optionPadding>(at, area.octets);
    }
}

// The options in an area of so many octets. A header without options costs no more than its block.
template <class Pass>
NETFLOOR_INLINE inline void options(Reader<Pass> &at, std::int32_t areaOctets) {
    if (!at.live) {
        return;
    }
    const Block<Pass> block{at, "Options"};
    if (areaOctets >= 1) {
        at.variables().optionOctets = areaOctets;
        apart<optionArea<Pass>>(at);
    }
}

// The options of the header whose length was read last.
template <class Pass>
NETFLOOR_INLINE inline void options(Reader<Pass> &at) {
    options(at, static_cast<std::int32_t>(at.variables().ipHeaderOctets) - fixedHeaderOctets);
}

} // namespace netfloor::ipv4
