// SPDX-License-Identifier: MIT
// The ICMP messages that ask and answer: echo, timestamp and information (RFC 792), address mask (RFC 950) and router
// discovery (RFC 1256).
//
//    0                   1                   2                   3
//    0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1
//   +---------------+---------------+-------------------------------+
//   |     Type      |    Code = 0   |           Checksum            |
//   +---------------+---------------+-------------------------------+
//   |          Identifier           |        Sequence Number        |
//   +-------------------------------+-------------------------------+
//   |    Data: octets, three timestamps, or an address mask         |
//   +---------------------------------------------------------------+
//
// Instead of identifier and sequence number, an advertisement has the number of routers, the size of an entry and the
// lifetime, and then the entries. A solicitation has 32 reserved bits there.
#pragma once

#include <cstdint>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"

namespace netfloor::plugin::icmp {

// clang-format off
inline constexpr Field echoCode              {542, "Code",                 octets(1),   "%n=%x"};
inline constexpr Field echoChecksum          {543, "Checksum",             octetPair(), "  %n=%x"};
inline constexpr Field echoIdentifier        {544, "Identifier",           octetPair(), "  %n=%x"};
inline constexpr Field echoSequence          {545, "ICMP Sequence Number", octetPair(), "  %n=%u"};
inline constexpr Field echoData              {547, "  Message Data",       octets(1),   "  %n=%c"};

inline constexpr Field timestampCode         {576, "Code",                 octets(1),   "%n=%x"};
inline constexpr Field timestampChecksum     {577, "Checksum",             octetPair(), "  %n=%x"};
inline constexpr Field timestampIdentifier   {578, "Identifier",           octetPair(), "  %n=%x"};
inline constexpr Field timestampSequence     {579, "ICMP Sequence Number", octetPair(), "  %n=%u"};
inline constexpr Field originateTimestamp    {580, "Originate Timestamp",  octets(4),   "  %n=%x"};
inline constexpr Field receiveTimestamp      {581, "Receive Timestamp",    octets(4),   "  %n=%x"};
inline constexpr Field transmitTimestamp     {582, "Transmit Timestamp",   octets(4),   "  %n=%x"};

inline constexpr Field informationCode       {583, "Code",                 octets(1),   "%n=%x"};
inline constexpr Field informationChecksum   {584, "Checksum",             octetPair(), "  %n=%x"};
inline constexpr Field informationIdentifier {585, "Identifier",           octetPair(), "  %n=%x"};
inline constexpr Field informationSequence   {586, "ICMP Sequence Number", octetPair(), "  %n=%u"};

inline constexpr Field advertisementCode     {587, "Code",                 octets(1),   "%n=%x"};
inline constexpr Field advertisementChecksum {588, "Checksum",             octetPair(), "  %n=%x"};
inline constexpr Field routers               {589, "Num Addr",             octets(1),   "  %n=%u"};
inline constexpr Field routerEntrySize       {590, "Addr Entry Size",      octets(1),   "  %n=%u"};
inline constexpr Field routerLifetime        {591, "Lifetime",             octetPair(), "  %n=%x"};
inline constexpr Field routerAddress         {595, "Router Address",       octets(4),   "  %n=%x"};
inline constexpr Field routerPreference      {596, "Preference Level",     octets(4),   "  %n=%x"};

inline constexpr Field solicitationCode      {597, "Code",                 octets(1),   "%n=%x"};
inline constexpr Field solicitationChecksum  {598, "Checksum",             octetPair(), "  %n=%x"};
inline constexpr Field solicitationReserved  {599, "Reserved",             octets(4),   "  %n=%x"};

inline constexpr Field addressMaskCode       {600, "Code",                 octets(1),   "%n=%x"};
inline constexpr Field addressMaskChecksum   {601, "Checksum",             octetPair(), "  %n=%x"};
inline constexpr Field addressMaskIdentifier {602, "Identifier",           octetPair(), "  %n=%x"};
inline constexpr Field addressMaskSequence   {603, "ICMP Sequence Number", octetPair(), "  %n=%u"};
inline constexpr Field addressMask           {604, "Address Mask",         octets(4),   "  %n=%x"};
// clang-format on

inline constexpr std::int32_t echoHeaderOctets = 8;

template <class Pass>
NETFLOOR_INLINE inline void echo(Reader<Pass> &reader) {
    auto &variables = reader.variables();
    const Block<Pass> message{reader, ""};
    read<echoCode>(reader);
    read<echoChecksum>(reader);
    read<echoIdentifier>(reader);
    read<echoSequence>(reader);
    if (reader.live) {
        variables.payloadOctets -= echoHeaderOctets;
    }
    // A datagram that is too short for the header is a fault; data that are cut short are none.
    readRepeated<echoData>(reader, variables.payloadOctets);
    if (variables.payloadOctets < 0) {
        reader.raise(Flag::count);
    }
}

template <class Pass>
NETFLOOR_INLINE inline void timestamp(Reader<Pass> &reader) {
    const Block<Pass> message{reader, ""};
    read<timestampCode>(reader);
    read<timestampChecksum>(reader);
    read<timestampIdentifier>(reader);
    read<timestampSequence>(reader);
    read<originateTimestamp>(reader);
    read<receiveTimestamp>(reader);
    read<transmitTimestamp>(reader);
}

template <class Pass>
NETFLOOR_INLINE inline void information(Reader<Pass> &reader) {
    const Block<Pass> message{reader, ""};
    read<informationCode>(reader);
    read<informationChecksum>(reader);
    read<informationIdentifier>(reader);
    read<informationSequence>(reader);
}

// An entry has 8 octets, whatever the entry size field says. An entry that is cut short is counted.
template <class Pass>
NETFLOOR_INLINE inline void routerAdvertisement(Reader<Pass> &reader) {
    std::uint32_t routerCount = 0;
    const Block<Pass> message{reader, ""};
    read<advertisementCode>(reader);
    read<advertisementChecksum>(reader);
    read<routers>(reader, &routerCount);
    read<routerEntrySize>(reader);
    read<routerLifetime>(reader);
    std::uint32_t seen = 0;
    for (; reader.live && seen < routerCount; ++seen) {
        const Block<Pass> entry{reader, ""};
        read<routerAddress>(reader);
        read<routerPreference>(reader);
    }
    if (seen != routerCount) {
        reader.raise(Flag::count);
    }
}

template <class Pass>
NETFLOOR_INLINE inline void routerSolicitation(Reader<Pass> &reader) {
    const Block<Pass> message{reader, ""};
    read<solicitationCode>(reader);
    read<solicitationChecksum>(reader);
    read<solicitationReserved>(reader);
}

template <class Pass>
NETFLOOR_INLINE inline void addressMaskMessage(Reader<Pass> &reader) {
    const Block<Pass> message{reader, ""};
    read<addressMaskCode>(reader);
    read<addressMaskChecksum>(reader);
    read<addressMaskIdentifier>(reader);
    read<addressMaskSequence>(reader);
    read<addressMask>(reader);
}

// If two types share a message, its key fields have a row for each type.
// clang-format off
using EchoRows = Rows<
    FieldList<echoCode, echoChecksum, echoIdentifier, echoSequence, echoData>,
    FieldList<echoCode, echoSequence, echoCode, echoSequence>>;

using QueryRows = Rows<
    FieldList<
        timestampCode, timestampChecksum, timestampIdentifier, timestampSequence,
        originateTimestamp, receiveTimestamp, transmitTimestamp,
        informationCode, informationChecksum, informationIdentifier, informationSequence,
        advertisementCode, advertisementChecksum, routers, routerEntrySize, routerLifetime,
        routerAddress, routerPreference,
        solicitationCode, solicitationChecksum, solicitationReserved,
        addressMaskCode, addressMaskChecksum, addressMaskIdentifier, addressMaskSequence, addressMask>,
    FieldList<
        timestampCode, timestampSequence, timestampCode, timestampSequence,
        informationCode, informationSequence, informationCode, informationSequence,
        advertisementCode,
        solicitationCode,
        addressMaskCode, addressMaskSequence, addressMask, addressMaskCode, addressMaskSequence, addressMask>>;
// clang-format on

} // namespace netfloor::plugin::icmp
