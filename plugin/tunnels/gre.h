// SPDX-License-Identifier: MIT
// GRE (RFC 2784, RFC 2890).
//
//    0                   1                   2                   3
//    0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1
//   +-+-+-+-+-----------------+-----+-------------------------------+
//   |C| |K|S|    Reserved0    |Versn|         GRE Protocol          |
//   +-+-+-+-+-----------------+-----+-------------------------------+
//   |     CheckSum, where C is 1    |    Reserved1, where C is 1    |
//   +-------------------------------+-------------------------------+
//   |                     Key, where K is 1                         |
//   |               Sequence Number, where S is 1                   |
//   +---------------------------------------------------------------+
//
// The protocol is shown, but does not choose a production. The payload is read as a frame between two HDLC flags (RFC
// 1662), which GRE carries for point-to-point links. Octets after the frame are data.
#pragma once

#include <array>
#include <cstdint>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"

namespace netfloor::plugin::gre {

inline constexpr std::array presenceRows = {ValueName{0, "Not Present"}, ValueName{1, "Present"}};
inline constexpr std::array carriedProtocolRows = {
    ValueName{0x0000, "Reserved"},
    ValueName{0x0004, "SNA"},
    ValueName{0x00fe, "OSI network layer"},
    ValueName{0x0200, "PUP"},
    ValueName{0x0600, "XNS"},
    ValueName{0x0800, "IP"},
    ValueName{0x0804, "Chaos"},
    ValueName{0x0806, "RFC 826 ARP"},
    ValueName{0x0808, "Frame Relay ARP"},
    ValueName{0x0bad, "VINES"},
    ValueName{0x0bae, "VINES Echo"},
    ValueName{0x0baf, "VINES Loopback"},
    ValueName{0x6003, "DECnet (Phase IV)"},
    ValueName{0x6558, "Transparent Ethernet Bridging"},
    ValueName{0x6559, "Raw Frame Relay"},
    ValueName{0x8019, "Apollo Domain"},
    ValueName{0x809b, "Ethertalk (Appletalk)"},
    ValueName{0x8137, "Novell IPX"},
    ValueName{0x876b, "RFC 1144 TCP/IP compression"},
    ValueName{0x876c, "IP Autonomous Systems"},
    ValueName{0x876d, "Secure Data"},
    ValueName{0x880b, "PPP"},
    ValueName{0x8881, "Unstructured Byte Stream"},
    ValueName{0xffff, "Reserved"},
};

inline constexpr ValueNames presenceNames{presenceRows};
inline constexpr ValueNames carriedProtocolNames{carriedProtocolRows, "%x"};

// clang-format off
inline constexpr Field checksumPresent {692, "Checksum Present",        bit(7),                     "%n=%-S",  &presenceNames};
inline constexpr Field unusedBit       {693, "Unused bit",              bit(6),                     "%n=%u"};
inline constexpr Field keyPresent      {694, "Key Present",             bit(5),                     "%n=%-S",  &presenceNames};
inline constexpr Field sequencePresent {695, "Sequence Number Present", bit(4),                     "%n=%-S",  &presenceNames};
inline constexpr Field reserved0       {696, "Reserved0",               pieces({0, 3}, {11, 15}),   "%n=%u"};
inline constexpr Field version         {697, "Version",                 piece(8, 10).advancing(16), "%n=%u"};
inline constexpr Field protocol        {698, "GRE Protocol",            octetPair(),                "%n=%-S",  &carriedProtocolNames};
inline constexpr Field checksum        {702, "CheckSum (hex)",          octetPair(),                "%n=%x"};
inline constexpr Field reserved1       {703, "Reserved1",               octetPair(),                "%n=%u"};
inline constexpr Field key             {707, "GRE Key",                 octets(4),                  "%n=%u"};
inline constexpr Field sequence        {711, "Sequence Number",         octets(4),                  "%n=%u"};
inline constexpr Field openingFlag     {716, "HDLC Flag",               octets(1),                  "%n=0x%x"};
inline constexpr Field framePayload    {719, "HDLC Payload",            octets(1),                  "%n=0x%x"};
inline constexpr Field closingFlag     {724, "HDLC Flag",               octets(1),                  "%n=0x%x"};
inline constexpr Field payload         {715, "GRE Payload",             octets(1),                  "%n=0x%x"};
// clang-format on

// The octets of the fixed header, and of each optional part.
inline constexpr std::int32_t partOctets = 4;

inline constexpr std::uint32_t hdlcFlag = 0x7e;

// Subtracts octets that were read from the payload.
template <class Pass>
NETFLOOR_INLINE inline void account(const Reader<Pass> &reader, std::int32_t octetCount) {
    if (reader.live) {
        reader.variables().payloadOctets -= octetCount;
    }
}

template <class Pass>
NETFLOOR_INLINE inline void header(Reader<Pass> &reader) {
    std::uint32_t greChecksumPresent = 0;
    std::uint32_t greKeyPresent = 0;
    std::uint32_t greSequencePresent = 0;
    read<checksumPresent>(reader, &greChecksumPresent);
    read<unusedBit>(reader);
    read<keyPresent>(reader, &greKeyPresent);
    read<sequencePresent>(reader, &greSequencePresent);
    read<reserved0>(reader);
    read<version>(reader);
    read<protocol>(reader);
    account(reader, partOctets);
    if (greChecksumPresent == 1) {
        read<checksum>(reader);
        read<reserved1>(reader);
        account(reader, partOctets);
    }
    if (greKeyPresent == 1) {
        read<key>(reader);
        account(reader, partOctets);
    }
    if (greSequencePresent == 1) {
        read<sequence>(reader);
        account(reader, partOctets);
    }
}

template <class Pass>
NETFLOOR_INLINE inline bool flagAhead(Reader<Pass> &reader) {
    return peek(reader, octets(1)) == hdlcFlag;
}

// Reads a frame, whose opening flag is at the cursor. If the payload ends before the closing flag, the frame ends there
// without a fault. If the packet ends first, this is a fault.
template <class Pass>
NETFLOOR_INLINE inline void frame(Reader<Pass> &reader) {
    const auto &variables = reader.variables();
    const Block<Pass> block{reader, "HDLC Data"};
    read<openingFlag>(reader);
    account(reader, 1);
    while (reader.live && reader.left >= bitsPerOctet && !flagAhead(reader) && variables.payloadOctets >= 1) {
        const Block<Pass> octet{reader, "INLINE BLOCK"};
        read<framePayload>(reader);
        account(reader, 1);
    }
    if (!reader.live || variables.payloadOctets < 1) {
        return;
    }
    if (!flagAhead(reader)) {
        return reader.raise(Flag::expectation);
    }
    const Block<Pass> octet{reader, "INLINE BLOCK"};
    read<closingFlag>(reader);
    account(reader, 1);
}

template <class Pass>
NETFLOOR_INLINE inline void packet(Reader<Pass> &reader) {
    const auto &variables = reader.variables();
    const Block<Pass> block{reader, "Generic Routing Encapsulation"};
    header(reader);
    if (reader.live) {
        if (flagAhead(reader)) {
            frame(reader);
        } else {
            reader.raise(Flag::expectation);
        }
    }
    const std::int32_t payloadOctets = variables.payloadOctets;
    if (payloadOctets > 0 && readRepeated<payload>(reader, payloadOctets) != payloadOctets) {
        reader.raise(Flag::count);
    }
}

// clang-format off
using PacketRows = Rows<
    FieldList<
        checksumPresent, unusedBit, keyPresent, sequencePresent, reserved0, version, protocol,
        checksum, reserved1, key, sequence,
        openingFlag, framePayload, closingFlag, payload>,
    FieldList<checksumPresent, keyPresent, sequencePresent, protocol, key, sequence>>;
// clang-format on

} // namespace netfloor::plugin::gre
