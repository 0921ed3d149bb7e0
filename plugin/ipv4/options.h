// SPDX-License-Identifier: MIT
// The options of an IPv4 header (RFC 791).
//
//   type   0  End of Option List        type 130  Security
//   type   1  No Operation              type 131  Loose Source and Record Route
//   type   7  Record Route              type 136  Stream Identifier
//   type  68  Internet Timestamp        type 137  Strict Source and Record Route
//
// Type 0 and any type not listed end the list; the rest of the area is padding. The area is no limit: an option whose
// length reaches past the area is read into the payload, and ends the list.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "ip/ipv6_address.h"
#include "ip/option_list.h"

namespace netfloor::plugin::ipv4 {

// The levels of RFC 791, with the second octet as the more significant one.
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
inline constexpr Field noOperation         {318, "Type1, No Operation",                     octets(1),                  "%n",                 noNames,             "%u"};

inline constexpr Field security            {321, "Type130, Security",                       octets(1),                  "%n",                 noNames,             "%u"};
inline constexpr Field securityLength      {322, "Length",                                  octets(1),                  "%n=%u octets"};
inline constexpr Field securityLevel       {325, "Security (S Field)",                      piece(0, 15).advancing(16), "%n=%-S",             &securityNames};
inline constexpr Field compartments        {326, "Compartments (C Field)",                  octets(2),                  "%n=%-S",             &compartmentNames};
inline constexpr Field restrictions        {327, "Handling Restrictions (H Field)",         octets(2),                  "%n=%x"};
inline constexpr Field transmissionControl {328, "Transmission Control Code (TCC Field)",   octets(3),                  "%n=%x"};

inline constexpr Field looseRoute          {329, "Type131, Loose Source and Record Route",  octets(1),                  "%n",                 noNames,             "%u"};
inline constexpr Field looseRouteLength    {330, "Length",                                  octets(1),                  "%n=%u octets"};
inline constexpr Field looseRoutePointer   {333, "Pointer",                                 octets(1),                  "%n=%u(th) octet"};
inline constexpr Field looseRouteData      {336, "Route Data",                              octets(4),                  R"(%n=%-["%u":"."])"};

inline constexpr Field strictRoute         {339, "Type137, Strict Source and Record Route", octets(1),                  "%n",                 noNames,             "%u"};
inline constexpr Field strictRouteLength   {340, "Length",                                  octets(1),                  "%n=%u octets"};
inline constexpr Field strictRoutePointer  {343, "Pointer",                                 octets(1),                  "%n=%u(th) octet"};
inline constexpr Field strictRouteData     {346, "Route Data",                              octets(4),                  R"(%n=%-["%u":"."])"};

inline constexpr Field recordRoute         {348, "Type7, Record Route",                     octets(1),                  "%n",                 noNames,             "%u"};
inline constexpr Field recordRouteLength   {349, "Length",                                  octets(1),                  "%n=%u octets"};
inline constexpr Field recordRoutePointer  {352, "Pointer",                                 octets(1),                  "%n=%u(th) octet"};
inline constexpr Field recordRouteData     {355, "Route Data",                              octets(4),                  R"(%n=%-["%u":"."])"};

inline constexpr Field streamIdentifier    {357, "Type136, Stream Identifier",              octets(1),                  "%n",                 noNames,             "%u"};
inline constexpr Field streamLength        {358, "Length",                                  octets(1),                  "%n=%u octets"};
inline constexpr Field streamId            {361, "Stream ID",                               octets(2),                  "%n=%x"};

inline constexpr Field internetTimestamp   {362, "Type68, Internet Timestamp",              octets(1),                  "%n",                 noNames,             "%u"};
inline constexpr Field timestampLength     {363, "Length",                                  octets(1),                  "%n=%u octets"};
inline constexpr Field timestampPointer    {366, "Pointer",                                 octets(1),                  "%n=%u(th) octet"};
inline constexpr Field timestampOverflow   {367, "Overflow",                                piece(4, 7),                "%n=%u"};
inline constexpr Field timestampFlag       {368, "Flag",                                    piece(0, 3).advancing(8),   "%n=%-S",             &timestampFlagNames};
inline constexpr Field timestamp           {372, "Timestamp",                               octets(4),                  "%n=%x"};
inline constexpr Field registeringAddress  {378, "Internet Address",                        octets(4),                  R"(%n=%-["%u":"."])"};
inline constexpr Field registeredTimestamp {380, "Timestamp",                               octets(4),                  "%n=%x"};

inline constexpr Field endOfOptionPart     {381, "End Of Option Part",                      octets(1),                  "%n",                 noNames,             "%u"};
inline constexpr Field optionPadding       {306, "Padding",                                 octetRun(),                 "%n=%x"};
// clang-format on

inline constexpr std::int32_t fixedHeaderOctets = 20;

// No more entries than this are read from an option, whatever its length is.
inline constexpr std::int32_t mostEntries = 20;

// The types, in the order of their turns in a round.
inline constexpr std::array<std::uint8_t, 8> optionTypes = {1, 130, 131, 137, 7, 136, 68, 0};

struct OptionVariables {
    std::int32_t optionOctets; // of the area after the fixed header
};

template <class Pass>
void securityOption(Reader<Pass> &reader, OptionArea &area) {
    const OptionBlock<Pass> option{reader, "Type130"};
    optionHead<security, securityLength>(reader, area);
    read<securityLevel>(reader);
    read<compartments>(reader);
    read<restrictions>(reader);
    read<transmissionControl>(reader);
}

// In a packet that does not start with an IPv4 header, the route data are IPv6 addresses. No IPv6 header leads to an
// IPv4 header so far, but the field tables list the address among the fields of the routes.
template <const Field &type, const Field &length, const Field &pointer, const Field &routeData, class Pass>
void routeOption(Reader<Pass> &reader, BlockName name, OptionArea &area) {
    const OptionBlock<Pass> option{reader, name};
    optionHead<type, length>(reader, area);
    read<pointer>(reader);
    if (reader.variables().ipVersion == 4) {
        readRepeated<routeData>(reader, mostEntries);
        return;
    }
    for (std::int32_t entry = 0; reader.live && entry < mostEntries; ++entry) {
        runOutOfLine<ipv6::reversedAddress<Report::plain, Pass>>(reader);
    }
}

template <class Pass>
void streamIdentifierOption(Reader<Pass> &reader, OptionArea &area) {
    const OptionBlock<Pass> option{reader, "Type136"};
    optionHead<streamIdentifier, streamLength>(reader, area);
    read<streamId>(reader);
}

template <class Pass>
void addressAndTimestamp(Reader<Pass> &reader) {
    const Block<Pass> block{reader, "INLINE BLOCK"};
    if (reader.variables().ipVersion == 4) {
        read<registeringAddress>(reader);
    } else {
        ipv6::addressReadTwice<ipv6::address, ipv6::addressKey>(reader);
    }
    read<registeredTimestamp>(reader);
}

// With prespecified addresses, these are shown as timestamps too.
template <class Pass>
void timestampOption(Reader<Pass> &reader, OptionArea &area) {
    const OptionBlock<Pass> option{reader, "Type68"};
    std::uint32_t flag = 0;
    optionHead<internetTimestamp, timestampLength>(reader, area);
    read<timestampPointer>(reader);
    read<timestampOverflow>(reader);
    read<timestampFlag>(reader, &flag);
    const Block<Pass> block{reader, "INLINE BLOCK"};
    if (flag == 0 || flag == 3) {
        readRepeated<timestamp>(reader, mostEntries);
    } else if (flag == 1) {
        for (std::int32_t entry = 0; reader.live && entry < mostEntries; ++entry) {
            addressAndTimestamp(reader);
        }
    }
}

// Ends the list: there is no further round.
template <class Pass>
void endOfListOption(Reader<Pass> &reader, OptionArea &area) {
    optionOfOneOctet<endOfOptionPart>(reader, "", area);
    area.taken = false;
}

// Reads the option at the cursor, which is of a known type.
template <class Pass>
void option(Reader<Pass> &reader, std::uint8_t type, OptionArea &area) {
    switch (type) {
    case 1: return optionOfOneOctet<noOperation>(reader, "Type1", area);
    case 130: return securityOption(reader, area);
    case 131:
        return routeOption<looseRoute, looseRouteLength, looseRoutePointer, looseRouteData>(reader, "Type131", area);
    case 137:
        return routeOption<strictRoute, strictRouteLength, strictRoutePointer, strictRouteData>(reader, "Type137",
                                                                                                area);
    case 7:
        return routeOption<recordRoute, recordRouteLength, recordRoutePointer, recordRouteData>(reader, "Type7", area);
    case 136: return streamIdentifierOption(reader, area);
    case 68: return timestampOption(reader, area);
    default: return endOfListOption(reader, area);
    }
}

template <class Pass>
void optionRound(Reader<Pass> &reader, OptionArea &area) {
    area.taken = false;
    for (std::size_t turn = 0; reader.live && turn < optionTypes.size(); ++turn) {
        turn = nextTaker<optionTypes>(reader, turn);
        if (turn == optionTypes.size()) {
            return;
        }
        option(reader, optionTypes[turn], area);
    }
}

template <class Pass>
void optionArea(Reader<Pass> &reader) {
    OptionArea area{reader.variables().optionOctets};
    {
        BlockChain<Pass> rounds{reader};
        do {
            rounds.open("");
            optionRound(reader, area);
        } while (reader.live && area.taken && area.octets >= 1);
    }
    if (area.octets >= 1) {
        readRun<optionPadding>(reader, area.octets);
    }
}

// Reads the options in an area of `areaOctets`. A header without options costs no more than its block.
template <class Pass>
NETFLOOR_INLINE inline void options(Reader<Pass> &reader, std::int32_t areaOctets) {
    if (!reader.live) {
        return;
    }
    const Block<Pass> block{reader, "Options"};
    if (areaOctets >= 1) {
        reader.variables().optionOctets = areaOctets;
        runOutOfLine<optionArea<Pass>>(reader);
    }
}

// The octets of the options of the header whose length was read last.
template <class Pass>
[[nodiscard]] NETFLOOR_INLINE inline std::int32_t optionOctets(const Reader<Pass> &reader) {
    return static_cast<std::int32_t>(reader.variables().ipHeaderOctets) - fixedHeaderOctets;
}

// clang-format off
using OptionRows = Rows<
    FieldList<
        noOperation,
        security, securityLength, securityLevel, compartments, restrictions, transmissionControl,
        looseRoute, looseRouteLength, looseRoutePointer, looseRouteData, ipv6::listedAddress,
        strictRoute, strictRouteLength, strictRoutePointer, strictRouteData,
        recordRoute, recordRouteLength, recordRoutePointer, recordRouteData,
        streamIdentifier, streamLength, streamId,
        internetTimestamp, timestampLength, timestampPointer, timestampOverflow, timestampFlag, timestamp,
        registeringAddress, ipv6::address, ipv6::addressKey, registeredTimestamp,
        endOfOptionPart, optionPadding>,
    FieldList<ipv6::addressKey>>;
// clang-format on

} // namespace netfloor::plugin::ipv4
