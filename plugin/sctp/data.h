// SPDX-License-Identifier: MIT
// DATA (RFC 9260, section 3.3.1).
//
//    0                   1                   2                   3
//    0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1
//   +---------------+---------+-+-+-+-------------------------------+
//   |    Type = 0   | Reserved|U|B|E|             Length            |
//   +---------------+---------+-+-+-+-------------------------------+
//   |                              TSN                              |
//   +-------------------------------+-------------------------------+
//   |      Stream Identifier S      |    Stream Sequence Number n   |
//   +-------------------------------+-------------------------------+
//   |                  Payload Protocol Identifier                  |
//   +---------------------------------------------------------------+
//   |                           User Data                           |
//   +---------------------------------------------------------------+
//
// The I bit of RFC 7053 is shown as reserved. The ports choose the next layer, which gets the user data; the Payload
// Protocol Identifier has no influence. The walk over the chunks goes on where the next layer stopped, so a chunk after
// DATA is decoded if the next layer has consumed the user data and their padding.
#pragma once

#include <array>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "ip/hand_off.h"
#include "sctp/chunk_head.h"

namespace netfloor::plugin::sctp {

inline constexpr std::array unorderedRows = {ValueName{0, "FALSE"}, ValueName{1, "TRUE"}};
inline constexpr std::array fragmentRows = {
    ValueName{0, "Middle piece of a fragmented user message"},
    ValueName{1, "Last piece of a fragmented user message"},
    ValueName{2, "First piece of a fragmented user message"},
    ValueName{3, "Unfragmented Message"},
};

inline constexpr ValueNames unorderedNames{unorderedRows};
inline constexpr ValueNames fragmentNames{fragmentRows};

// clang-format off
inline constexpr Field dataReserved              {814, "  Reserved",                      piece(3, 7),              "  %n=%x"};
inline constexpr Field unorderedBit              {815, "  Unordered Data Chunk(U) Bit",   bit(2),                   "  %n=%-S",    &unorderedNames};
inline constexpr Field fragmentBits              {816, "  BE bits",                       piece(0, 1).advancing(8), "  %n=%-S",    &fragmentNames};
inline constexpr Field tsn                       {817, "    TSN",                         octets(4),                "    %n=0x%x"};
inline constexpr Field streamIdentifier          {818, "    Stream Indetifier S",         octets(2),                "    %n=%u"};
inline constexpr Field streamSequenceNumber      {819, "    Stream Sequence Number n",    octets(2),                "    %n=%u"};
inline constexpr Field payloadProtocolIdentifier {820, "    Payload Protocol Identifier", octets(4),                "    %n=0x%x"};
// clang-format on

// The Length of a chunk without user data.
inline constexpr std::int32_t emptyDataOctets = 16;

template <class Pass>
NETFLOOR_INLINE inline void dataChunk(Reader<Pass> &reader) {
    const Block<Pass> block{reader, "Data"};
    read<dataReserved>(reader);
    read<unorderedBit>(reader);
    read<fragmentBits>(reader);
    readChunkLength(reader);
    read<tsn>(reader);
    read<streamIdentifier>(reader);
    read<streamSequenceNumber>(reader);
    read<payloadProtocolIdentifier>(reader);
    if (reader.test(reader.variables().chunkOctets > emptyDataOctets)) {
        reader.writer.flushFlagWords(reader.state->fieldRecord); // the walk goes on after the next layer
        handOff(reader);
    }
}

// clang-format off
using DataRows = Rows<
    FieldList<
        dataReserved, unorderedBit, fragmentBits, chunkLength,
        tsn, streamIdentifier, streamSequenceNumber, payloadProtocolIdentifier>,
    FieldList<tsn, streamIdentifier, streamSequenceNumber, payloadProtocolIdentifier>>;
// clang-format on

} // namespace netfloor::plugin::sctp
