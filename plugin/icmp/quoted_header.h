// SPDX-License-Identifier: MIT
// The IPv4 header (RFC 791) that an ICMP error message quotes.
//
//    0                   1                   2                   3
//    0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1
//   +-------+-------+---------------+-------------------------------+
//   |Version|  IHL  |Type of Service|        Original Length        |
//   +-------+-------+---------------+-----+-------------------------+
//   |    Original Identification    |Flags|     Fragment Offset     |
//   +---------------+---------------+-----+-------------------------+
//   |      TTL      |    Protocol   |        Header Checksum        |
//   +---------------+---------------+-------------------------------+
//   |                       IP Source Address                       |
//   |                     IP Destination Address                    |
//   +---------------------------------------------------------------+
//   |                     Options and padding                       |
//   +---------------------------------------------------------------+
//
// The quoted header is only shown: its length sets no limit, and its protocol chooses no production.
#pragma once

#include <array>
#include <cstdint>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "icmp/message_type.h"
#include "ipv4/options.h"
#include "names/ip_protocols.h"

namespace netfloor::plugin::icmp {

// These values have names in the outer header too, in another spelling.
inline constexpr std::array quotedPrecedenceRows = {
    ValueName{0, "Routine"},
    ValueName{1, "Priority"},
    ValueName{2, "Immediate"},
    ValueName{3, "Flash"},
    ValueName{4, "Flash override"},
    ValueName{5, "CRITIC/ECP"},
    ValueName{6, "Internetwork control"},
    ValueName{7, "Network control"},
};
inline constexpr std::array quotedDelayRows = {ValueName{0, "Normal delay"}, ValueName{1, "Low delay"}};
inline constexpr std::array quotedThroughputRows = {ValueName{0, "Normal throughput"}, ValueName{1, "High throughput"}};
inline constexpr std::array quotedReliabilityRows = {ValueName{0, "Normal reliability"},
                                                     ValueName{1, "High reliability"}};
inline constexpr std::array quotedDontFragmentRows = {ValueName{0, "May fragment"}, ValueName{1, "Do not fragment"}};
inline constexpr std::array quotedMoreFragmentsRows = {ValueName{0, "Last fragment"}, ValueName{1, "More fragments"}};

inline constexpr ValueNames quotedPrecedenceNames{quotedPrecedenceRows};
inline constexpr ValueNames quotedDelayNames{quotedDelayRows};
inline constexpr ValueNames quotedThroughputNames{quotedThroughputRows};
inline constexpr ValueNames quotedReliabilityNames{quotedReliabilityRows};
inline constexpr ValueNames quotedDontFragmentNames{quotedDontFragmentRows};
inline constexpr ValueNames quotedMoreFragmentsNames{quotedMoreFragmentsRows};

// After the Fragment Offset the cursor is on its second octet; the TTL moves it over that octet and its own.
// clang-format off
inline constexpr Field quotedVersion        {605, "Version",                 piece(4, 7),                                   "  %n=%u"};
inline constexpr Field quotedHeaderLength   {606, "IHL",                     piece(0, 3).advancing(8),                      "  %n=%u*4 octet(s)"};
inline constexpr Field quotedPrecedence     {607, "Precedence",              piece(5, 7),                                   "  %n=%-S",           &quotedPrecedenceNames};
inline constexpr Field quotedDelay          {608, "D",                       bit(4),                                        "  %n=%-S",           &quotedDelayNames};
inline constexpr Field quotedThroughput     {609, "T",                       bit(3),                                        "  %n=%-S",           &quotedThroughputNames};
inline constexpr Field quotedReliability    {610, "R",                       bit(2),                                        "  %n=%-S",           &quotedReliabilityNames};
inline constexpr Field quotedServiceFixed   {611, "Fixed Value",             piece(0, 1).advancing(8),                      "  %n=%x"};
inline constexpr Field quotedLength         {612, "Original Length",         octets(2),                                     "  %n=%u"};
inline constexpr Field quotedIdentification {615, "Original Identification", octets(2),                                     "  %n=%x"};
inline constexpr Field quotedFlagsFixed     {616, "Flags Fixed Value",       bit(7),                                        "  %n=%x"};
inline constexpr Field quotedDontFragment   {617, "Flags DF",                bit(6),                                        "  %n=%-S",           &quotedDontFragmentNames};
inline constexpr Field quotedMoreFragments  {618, "Flags MF",                bit(5),                                        "  %n=%-S",           &quotedMoreFragmentsNames};
inline constexpr Field quotedFragmentOffset {619, "Fragment Offset",         pieces({0, 4}, {8, 15}).advancing(8).times(8), "  %n=%u"};
inline constexpr Field quotedTimeToLive     {620, "TTL",                     piece(8, 15).advancing(16),                    "  %n=%u"};

// The protocol. Its short text says which message quotes the header, and whether that message came in IP in IP.
inline constexpr Field unreachableInTunnel  {663, "Embedded IP Protocols",  octets(1), "%n=%-S",               &protocolNames, "IPinIP - ICMP - DUM - %-S"};
inline constexpr Field sourceQuenchInTunnel {666, "Embedded IP Protocols",  octets(1), "%n=%-S",               &protocolNames, "IPinIP- ICMP - SQM - %-S"};
inline constexpr Field redirectInTunnel     {669, "Embedded IP Protocols",  octets(1), "%n=%-S",               &protocolNames, "IPinIP - ICMP - RM - %-S"};
inline constexpr Field timeExceededInTunnel {672, "Embedded IP Protocols",  octets(1), "%n=%-S",               &protocolNames, "IPinIP - ICMP - TEM - %-S"};
inline constexpr Field problemInTunnel      {675, "Embedded IP Protocols",  octets(1), "%n=%-S",               &protocolNames, "IPinIP - ICMP - PPM - %-S"};
inline constexpr Field unreachableProtocol  {679, "Embedded IP Protocols",  octets(1), "%n=%-S",               &protocolNames, "ICMP - DUM- %-S"};
inline constexpr Field sourceQuenchProtocol {682, "Embedded IP Protocols",  octets(1), "%n=%-S",               &protocolNames, "ICMP - SQM- %-S"};
inline constexpr Field redirectProtocol     {685, "Embedded IP Protocols",  octets(1), "%n=%-S",               &protocolNames, "ICMP - RM - %-S"};
inline constexpr Field timeExceededProtocol {688, "Embedded IP Protocols",  octets(1), "%n=%-S",               &protocolNames, "ICMP - TEM - %-S"};
inline constexpr Field problemProtocol      {691, "Embedded IP Protocols",  octets(1), "%n=%-S",               &protocolNames, "ICMP - PPM - %-S"};

inline constexpr Field quotedChecksum       {621, "Header Checksum",        octets(2), "  %n=%x"};
inline constexpr Field quotedSource         {624, "IP Source Address",      octets(4), R"(  %n=%-["%u":"."])"};
inline constexpr Field quotedDestination    {625, "IP Destination Address", octets(4), R"(  %n=%-["%u":"."])"};
// clang-format on

template <class Pass>
NETFLOOR_INLINE inline void quotedProtocol(Reader<Pass> &reader) {
    if (!reader.live) {
        return;
    }
    const Block<Pass> block{reader, "Embedded IP Protocols"};
    const bool inTunnel = reader.variables().outerProtocol == protocolIpInIp;
    switch (reader.variables().icmpType) {
    case typeDestinationUnreachable:
        return inTunnel ? read<unreachableInTunnel>(reader) : read<unreachableProtocol>(reader);
    case typeSourceQuench: return inTunnel ? read<sourceQuenchInTunnel>(reader) : read<sourceQuenchProtocol>(reader);
    case typeRedirect: return inTunnel ? read<redirectInTunnel>(reader) : read<redirectProtocol>(reader);
    case typeTimeExceeded: return inTunnel ? read<timeExceededInTunnel>(reader) : read<timeExceededProtocol>(reader);
    default: return inTunnel ? read<problemInTunnel>(reader) : read<problemProtocol>(reader);
    }
}

template <class Pass>
NETFLOOR_INLINE inline void quotedHeader(Reader<Pass> &reader) {
    std::int32_t embeddedHeaderOctets = 0; // less the fixed header
    const Block<Pass> block{reader, "Internet Protocol Message in ICMP"};
    read<quotedVersion>(reader);
    read<quotedHeaderLength>(reader, [&](std::uint32_t words) {
        embeddedHeaderOctets = static_cast<std::int32_t>(words * 4) - ipv4::fixedHeaderOctets;
    });
    read<quotedPrecedence>(reader);
    read<quotedDelay>(reader);
    read<quotedThroughput>(reader);
    read<quotedReliability>(reader);
    read<quotedServiceFixed>(reader);
    read<quotedLength>(reader);
    read<quotedIdentification>(reader);
    read<quotedFlagsFixed>(reader);
    read<quotedDontFragment>(reader);
    read<quotedMoreFragments>(reader);
    read<quotedFragmentOffset>(reader);
    read<quotedTimeToLive>(reader);
    quotedProtocol(reader);
    read<quotedChecksum>(reader);
    read<quotedSource>(reader);
    read<quotedDestination>(reader);
    // The length of the options comes from the quoted header, not from the header before the message.
    if (embeddedHeaderOctets >= 1) {
        ipv4::options(reader, embeddedHeaderOctets);
    }
}

// clang-format off
using QuotedHeaderRows = Rows<
    FieldList<
        quotedVersion, quotedHeaderLength,
        quotedPrecedence, quotedDelay, quotedThroughput, quotedReliability, quotedServiceFixed,
        quotedLength, quotedIdentification,
        quotedFlagsFixed, quotedDontFragment, quotedMoreFragments, quotedFragmentOffset,
        quotedTimeToLive,
        unreachableInTunnel, sourceQuenchInTunnel, redirectInTunnel, timeExceededInTunnel, problemInTunnel,
        unreachableProtocol, sourceQuenchProtocol, redirectProtocol, timeExceededProtocol, problemProtocol,
        quotedChecksum, quotedSource, quotedDestination>,
    FieldList<
        unreachableInTunnel, sourceQuenchInTunnel, redirectInTunnel, timeExceededInTunnel, problemInTunnel,
        unreachableProtocol, sourceQuenchProtocol, redirectProtocol, timeExceededProtocol, problemProtocol>>;
// clang-format on

} // namespace netfloor::plugin::icmp
