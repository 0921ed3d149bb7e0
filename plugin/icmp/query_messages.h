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
// In place of identifier and sequence number an advertisement has the number of its routers, the size of an entry and
// the lifetime, with the entries behind them; a solicitation has 32 reserved bits.
#pragma once

#include <cstdint>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/step.h"

namespace netfloor::icmp {

// clang-format off
inline constexpr Field echoCode              {542, "Code",                 octets(1),   "Code=%x"};
inline constexpr Field echoChecksum          {543, "Checksum",             octetPair(), "  Checksum=%x"};
inline constexpr Field echoIdentifier        {544, "Identifier",           octetPair(), "  Identifier=%x"};
inline constexpr Field echoSequence          {545, "ICMP Sequence Number", octetPair(), "  ICMP Sequence Number=%u"};
inline constexpr Field echoData              {547, "  Message Data",       octets(1),   "  Message Data=%c"};

inline constexpr Field timestampCode         {576, "Code",                 octets(1),   "Code=%x"};
inline constexpr Field timestampChecksum     {577, "Checksum",             octetPair(), "  Checksum=%x"};
inline constexpr Field timestampIdentifier   {578, "Identifier",           octetPair(), "  Identifier=%x"};
inline constexpr Field timestampSequence     {579, "ICMP Sequence Number", octetPair(), "  ICMP Sequence Number=%u"};
inline constexpr Field originateTimestamp    {580, "Originate Timestamp",  octets(4),   "  Originate Timestamp=%x"};
inline constexpr Field receiveTimestamp      {581, "Receive Timestamp",    octets(4),   "  Receive Timestamp=%x"};
inline constexpr Field transmitTimestamp     {582, "Transmit Timestamp",   octets(4),   "  Transmit Timestamp=%x"};

inline constexpr Field informationCode       {583, "Code",                 octets(1),   "Code=%x"};
inline constexpr Field informationChecksum   {584, "Checksum",             octetPair(), "  Checksum=%x"};
inline constexpr Field informationIdentifier {585, "Identifier",           octetPair(), "  Identifier=%x"};
inline constexpr Field informationSequence   {586, "ICMP Sequence Number", octetPair(), "  ICMP Sequence Number=%u"};

inline constexpr Field advertisementCode     {587, "Code",                 octets(1),   "Code=%x"};
inline constexpr Field advertisementChecksum {588, "Checksum",             octetPair(), "  Checksum=%x"};
inline constexpr Field routers               {589, "Num Addr",             octets(1),   "  Num Addr=%u"};
inline constexpr Field routerEntrySize       {590, "Addr Entry Size",      octets(1),   "  Addr Entry Size=%u"};
inline constexpr Field routerLifetime        {591, "Lifetime",             octetPair(), "  Lifetime=%x"};
inline constexpr Field routerAddress         {595, "Router Address",       octets(4),   "  Router Address=%x"};
inline constexpr Field routerPreference      {596, "Preference Level",     octets(4),   "  Preference Level=%x"};

inline constexpr Field solicitationCode      {597, "Code",                 octets(1),   "Code=%x"};
inline constexpr Field solicitationChecksum  {598, "Checksum",             octetPair(), "  Checksum=%x"};
inline constexpr Field solicitationReserved  {599, "Reserved",             octets(4),   "  Reserved=%x"};

inline constexpr Field addressMaskCode       {600, "Code",                 octets(1),   "Code=%x"};
inline constexpr Field addressMaskChecksum   {601, "Checksum",             octetPair(), "  Checksum=%x"};
inline constexpr Field addressMaskIdentifier {602, "Identifier",           octetPair(), "  Identifier=%x"};
inline constexpr Field addressMaskSequence   {603, "ICMP Sequence Number", octetPair(), "  ICMP Sequence Number=%u"};
inline constexpr Field addressMask           {604, "Address Mask",         octets(4),   "  Address Mask=%x"};
// clang-format on

inline constexpr std::int32_t echoHeaderOctets = 8;

template <class Pass>
NETFLOOR_INLINE inline void echo(Reader<Pass> &at) {
    if (!at.live) {
        return;
    }
    auto &variables = at.variables();
    const Block<Pass> message{at, ""};
    read<echoCode>(at);
    read<echoChecksum>(at);
    read<echoIdentifier>(at);
    read<echoSequence>(at);
    if (at.live) {
        variables.payloadOctets -= echoHeaderOctets;
    }
    // A datagram too short for its message is a fault; data that is cut short is none.
    readRepeated<echoData>(at, variables.payloadOctets);
    if (variables.payloadOctets < 0) {
        at.mark(Mark::count);
    }
}

template <class Pass>
NETFLOOR_INLINE inline void timestamp(Reader<Pass> &at) {
    if (!at.live) {
        return;
    }
    const Block<Pass> message{at, ""};
    read<timestampCode>(at);
    read<timestampChecksum>(at);
    read<timestampIdentifier>(at);
    read<timestampSequence>(at);
    read<originateTimestamp>(at);
    read<receiveTimestamp>(at);
    read<transmitTimestamp>(at);
}

template <class Pass>
NETFLOOR_INLINE inline void information(Reader<Pass> &at) {
    if (!at.live) {
        return;
    }
    const Block<Pass> message{at, ""};
    read<informationCode>(at);
    read<informationChecksum>(at);
    read<informationIdentifier>(at);
    read<informationSequence>(at);
}

// An entry is 8 octets, whatever the size of an entry says. One that is cut short counts as seen.
template <class Pass>
NETFLOOR_INLINE inline void routerAdvertisement(Reader<Pass> &at) {
    if (!at.live) {
        return;
    }
    std::uint32_t routerCount = 0;
    const Block<Pass> message{at, ""};
    read<advertisementCode>(at);
    read<advertisementChecksum>(at);
    read<routers>(at, &routerCount);
    read<routerEntrySize>(at);
    read<routerLifetime>(at);
    std::uint32_t seen = 0;
    for (; at.live && seen < routerCount; ++seen) {
        const Block<Pass> entry{at, ""};
        read<routerAddress>(at);
        read<routerPreference>(at);
    }
    if (seen != routerCount) {
        at.mark(Mark::count);
    }
}

template <class Pass>
NETFLOOR_INLINE inline void routerSolicitation(Reader<Pass> &at) {
    if (!at.live) {
        return;
    }
    const Block<Pass> message{at, ""};
    read<solicitationCode>(at);
    read<solicitationChecksum>(at);
    read<solicitationReserved>(at);
}

template <class Pass>
NETFLOOR_INLINE inline void addressMaskMessage(Reader<Pass> &at) {
    if (!at.live) {
        return;
    }
    const Block<Pass> message{at, ""};
    read<addressMaskCode>(at);
    read<addressMaskChecksum>(at);
    read<addressMaskIdentifier>(at);
    read<addressMaskSequence>(at);
    read<addressMask>(at);
}

} // namespace netfloor::icmp
