// SPDX-License-Identifier: MIT
// SHUTDOWN, SHUTDOWN ACK and SHUTDOWN COMPLETE (RFC 9260, sections 3.3.8, 3.3.9 and 3.3.13).
//
//    0                   1                   2                   3
//    0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1
//   +---------------+---------------+-------------------------------+
//   |    Type = 7   |  Chunk Flags  |          Length = 8           |
//   +---------------+---------------+-------------------------------+
//   |                      Cumulative TSN Ack                       |
//   +---------------------------------------------------------------+
//
//   +---------------+-------------+-+-------------------------------+
//   |   Type = 14   |   Reserved  |T|          Length = 4           |
//   +---------------+-------------+-+-------------------------------+
//
// SHUTDOWN ACK has no more than a head. Octets that a larger Length covers are read as the next chunk.
#pragma once

#include <array>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "sctp/chunk_head.h"

namespace netfloor::plugin::sctp {

inline constexpr std::array completeTagRows = {ValueName{0, "Sender TCB destroyed"}, ValueName{1, "no sender TCB"}};
inline constexpr ValueNames completeTagNames{completeTagRows};

// clang-format off
inline constexpr Field shutdownFlags            = lowerFlagsField(884);
inline constexpr Field shutdownLength           = lengthField(885);
inline constexpr Field shutdownCumulativeTsnAck {886, "    Cumulative TSN Ack", octets(4),           "    %n=%u"};

inline constexpr Field shutdownAckFlags         = lowerFlagsField(887);
inline constexpr Field shutdownAckLength        = lengthField(888);

inline constexpr Field completeReserved         {889, "  Reserved",             piece(1, 7),         "  %n=%x"};
inline constexpr Field completeTagBit           {890, "  T bit",                bit(0).advancing(8), "  %n=%-S",  &completeTagNames};
inline constexpr Field completeLength           = lengthField(891);
// clang-format on

template <class Pass>
void shutdownChunk(Reader<Pass> &reader) {
    const Block<Pass> block{reader, "Shutdown"};
    read<shutdownFlags>(reader);
    read<shutdownLength>(reader, &reader.variables().chunkOctets);
    read<shutdownCumulativeTsnAck>(reader);
}

template <class Pass>
void shutdownAckChunk(Reader<Pass> &reader) {
    const Block<Pass> block{reader, "Shutdown Acknowledge"};
    read<shutdownAckFlags>(reader);
    read<shutdownAckLength>(reader, &reader.variables().chunkOctets);
}

template <class Pass>
void shutdownCompleteChunk(Reader<Pass> &reader) {
    const Block<Pass> block{reader, "Shutdown Complete"};
    read<completeReserved>(reader);
    read<completeTagBit>(reader);
    read<completeLength>(reader, &reader.variables().chunkOctets);
}

using ShutdownRows =
    Rows<FieldList<shutdownFlags, shutdownLength, shutdownCumulativeTsnAck>, FieldList<shutdownCumulativeTsnAck>>;
using ShutdownAckRows = Rows<FieldList<shutdownAckFlags, shutdownAckLength>>;
using ShutdownCompleteRows = Rows<FieldList<completeReserved, completeTagBit, completeLength>>;

} // namespace netfloor::plugin::sctp
