// SPDX-License-Identifier: MIT
// ABORT and ERROR (RFC 9260, sections 3.3.7 and 3.3.10).
//
//    0                   1                   2                   3
//    0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1
//   +---------------+-------------+-+-------------------------------+
//   | Type = 6 or 9 |   Reserved  |T|          Chunk Length         |
//   +---------------+-------------+-+-------------------------------+
//   |                         Error Causes                          |
//   +---------------------------------------------------------------+
//
// ABORT has a limit: a fault in it does not end the walk over the chunks, unless the limit itself is too long. ERROR
// has none, and the end of its causes mostly ends the walk. The Length of both is used for the causes only:
// `chunkOctets` stays that of the previous chunk, which the walk then counts twice.
#pragma once

#include <array>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "sctp/chunk_head.h"
#include "sctp/error_causes.h"
#include "sctp/length.h"

namespace netfloor::plugin::sctp {

inline constexpr std::array abortTagRows = {ValueName{0, "Sender TCB"}, ValueName{1, "no sender TCB"}};
inline constexpr ValueNames abortTagNames{abortTagRows};

// clang-format off
inline constexpr Field abortReserved {944, "  Reserved", piece(1, 7),         "  %n=%x"};
inline constexpr Field abortTagBit   {945, "  T bit",    bit(0).advancing(8), "  %n=%-S", &abortTagNames};
inline constexpr Field abortLength   = chunkLengthField(946);

inline constexpr Field errorFlags    = lowerFlagsField(909);
inline constexpr Field errorLength   = chunkLengthField(910);
// clang-format on

template <class Pass>
void abortChunk(Reader<Pass> &reader) {
    std::int32_t &errorOctets = reader.variables().errorOctets;
    LimitedBlock<Pass> block{reader, "Abort Association"};
    block.limit(limitFromLength<abortLengthAhead>(reader, octetsAfterHead(errorOctets)));
    read<abortReserved>(reader);
    read<abortTagBit>(reader);
    read<abortLength>(reader, octetsAfterHead(errorOctets));
    errorCauses(reader);
}

template <class Pass>
void errorChunk(Reader<Pass> &reader) {
    const Block<Pass> block{reader, "Error"};
    read<errorFlags>(reader);
    read<errorLength>(reader, octetsAfterHead(reader.variables().errorOctets));
    errorCauses(reader);
}

// The causes are first read in ABORT.
using AbortRows = Rows<Joined<FieldList<abortReserved, abortTagBit, abortLength>, CauseFields>>;
using ErrorRows = Rows<FieldList<errorFlags, errorLength>>;

} // namespace netfloor::plugin::sctp
