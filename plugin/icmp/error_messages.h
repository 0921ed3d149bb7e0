// SPDX-License-Identifier: MIT
// The ICMP messages that report an error (RFC 792): each quotes the datagram that caused it.
//
//    0                   1                   2                   3
//    0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1
//   +---------------+---------------+-------------------------------+
//   |     Type      |     Code      |           Checksum            |
//   +---------------+---------------+-------------------------------+
//   |    Unused, Gateway Internet Address, or Pointer and unused    |
//   +---------------------------------------------------------------+
//   |      Internet header + 64 bits of original data datagram      |
//   +---------------------------------------------------------------+
//
// Each message has its own fields, even where they are equal, so that a host sees by the id to which message a field
// belongs.
#pragma once

#include <array>
#include <cstdint>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "icmp/quoted_header.h"

namespace netfloor::plugin::icmp {

inline constexpr std::array unreachableCodeRows = {
    ValueName{0, "Net unreachable"},
    ValueName{1, "Host unreachable"},
    ValueName{2, "Protocol unreachable"},
    ValueName{3, "Port unreachable"},
    ValueName{4, "Fragmentation needed and DF set"},
    ValueName{5, "Source Route Failed"},
};
inline constexpr std::array redirectCodeRows = {
    ValueName{0, "Redirect datagram for the network"},
    ValueName{1, "Redirect datagram for the host"},
    ValueName{2, "Redirect datagram for the Type of Service and Network"},
    ValueName{3, "Redirect datagram for the Type of Service and Host"},
};
inline constexpr std::array timeExceededCodeRows = {
    ValueName{0, "Time to live exceeded in transmit"},
    ValueName{1, "Fragment reassembly time exceeded"},
};
inline constexpr std::array problemCodeRows = {ValueName{0, "Pointer Indicates the error"}};

inline constexpr ValueNames unreachableCodeNames{unreachableCodeRows};
inline constexpr ValueNames redirectCodeNames{redirectCodeRows};
inline constexpr ValueNames timeExceededCodeNames{timeExceededCodeRows};
inline constexpr ValueNames problemCodeNames{problemCodeRows};

// The short text shows only the last four octets of the original data.
// clang-format off
inline constexpr Field unreachableCode      {548, "Code",                          octets(1),          "  %n=%-S",             &unreachableCodeNames};
inline constexpr Field unreachableChecksum  {549, "Checksum",                      octetPair(),        "  %n=%x"};
inline constexpr Field unreachableUnused    {550, "Unused",                        octets(4),          "  %n=%x"};
inline constexpr Field unreachableData      {551, "64-bit Original Data Datagram", octets(8),          R"(  %n=%-["%x"])",     noNames,                "%x"};
inline constexpr Field unreachableTail      {555, "",                              octetRunBackward(), "",                     noNames,                "%x"};

inline constexpr Field sourceQuenchCode     {556, "Code",                          octets(1),          "%n=%x"};
inline constexpr Field sourceQuenchChecksum {557, "Checksum",                      octetPair(),        "  %n=%x"};
inline constexpr Field sourceQuenchUnused   {558, "Unused",                        octets(4),          "  %n=%x"};
inline constexpr Field sourceQuenchData     {559, "64-bit Original Data Datagram", octets(8),          R"(  %n=%-["%x"])",     noNames,                "%x"};

inline constexpr Field redirectCode         {560, "Code",                          octets(1),          "  %n=%-S",             &redirectCodeNames};
inline constexpr Field redirectChecksum     {561, "Checksum",                      octetPair(),        "  %n=%x"};
inline constexpr Field redirectGateway      {564, "Gateway Internet Address",      octets(4),          R"(  %n=%-["%u":"."])"};
inline constexpr Field redirectData         {566, "64-bit Original Data Datagram", octets(8),          R"(  %n=%-["%x"])",     noNames,                "%x"};

inline constexpr Field timeExceededCode     {567, "Code",                          octets(1),          "  %n=%-S",             &timeExceededCodeNames};
inline constexpr Field timeExceededChecksum {568, "Checksum",                      octetPair(),        "  %n=%x"};
inline constexpr Field timeExceededUnused   {569, "Unused",                        octets(4),          "  %n=%x"};
inline constexpr Field timeExceededData     {570, "64-bit Original Data Datagram", octets(8),          R"(  %n=%-["%x"])",     noNames,                "%x"};

inline constexpr Field problemCode          {571, "Code",                          octets(1),          "  %n=%-S",             &problemCodeNames};
inline constexpr Field problemChecksum      {572, "Checksum",                      octetPair(),        "  %n=%x"};
inline constexpr Field problemPointer       {573, "Pointer",                       octets(1),          "  %n=%x"};
inline constexpr Field problemUnused        {574, "Unused",                        octets(3),          "  %n=%x"};
inline constexpr Field problemData          {575, "64-bit Original Data Datagram", octets(8),          R"(  %n=%-["%x"])",     noNames,                "%x"};
// clang-format on

// Many senders quote more than 64 bits of data. This message reports the rest as one field without a name. The other
// messages do not read it, and the datagram ends with bits left over.
template <class Pass>
NETFLOOR_INLINE inline void destinationUnreachable(Reader<Pass> &reader) {
    const Block<Pass> message{reader, "Destination Unreachable Message"};
    read<unreachableCode>(reader);
    read<unreachableChecksum>(reader);
    read<unreachableUnused>(reader);
    runOutOfLine<quotedHeader<Pass>>(reader);
    read<unreachableData>(reader);
    if (reader.left != 0) {
        const std::uint32_t icmpTailOctets = reader.left / bitsPerOctet;
        readRun<unreachableTail>(reader, static_cast<std::int32_t>(icmpTailOctets));
    }
}

template <class Pass>
NETFLOOR_INLINE inline void sourceQuench(Reader<Pass> &reader) {
    const Block<Pass> message{reader, "Source Quench Message"};
    read<sourceQuenchCode>(reader);
    read<sourceQuenchChecksum>(reader);
    read<sourceQuenchUnused>(reader);
    runOutOfLine<quotedHeader<Pass>>(reader);
    read<sourceQuenchData>(reader);
}

template <class Pass>
NETFLOOR_INLINE inline void redirect(Reader<Pass> &reader) {
    const Block<Pass> message{reader, "Redirect Message"};
    read<redirectCode>(reader);
    read<redirectChecksum>(reader);
    read<redirectGateway>(reader);
    runOutOfLine<quotedHeader<Pass>>(reader);
    read<redirectData>(reader);
}

template <class Pass>
NETFLOOR_INLINE inline void timeExceeded(Reader<Pass> &reader) {
    const Block<Pass> message{reader, "Time Exceeded Message"};
    read<timeExceededCode>(reader);
    read<timeExceededChecksum>(reader);
    read<timeExceededUnused>(reader);
    runOutOfLine<quotedHeader<Pass>>(reader);
    read<timeExceededData>(reader);
}

template <class Pass>
NETFLOOR_INLINE inline void parameterProblem(Reader<Pass> &reader) {
    const Block<Pass> message{reader, "Parameter Problem Message"};
    read<problemCode>(reader);
    read<problemChecksum>(reader);
    read<problemPointer>(reader);
    read<problemUnused>(reader);
    runOutOfLine<quotedHeader<Pass>>(reader);
    read<problemData>(reader);
}

// The quoted header is first read in the first message.
// clang-format off
using ErrorRows = Rows<
    Joined<
        FieldList<unreachableCode, unreachableChecksum, unreachableUnused>,
        QuotedHeaderRows::Fields,
        FieldList<
            unreachableData, unreachableTail,
            sourceQuenchCode, sourceQuenchChecksum, sourceQuenchUnused, sourceQuenchData,
            redirectCode, redirectChecksum, redirectGateway, redirectData,
            timeExceededCode, timeExceededChecksum, timeExceededUnused, timeExceededData,
            problemCode, problemChecksum, problemPointer, problemUnused, problemData>>,
    FieldList<unreachableCode, sourceQuenchCode, redirectCode, timeExceededCode, problemCode>>;
// clang-format on

} // namespace netfloor::plugin::icmp
