// SPDX-License-Identifier: MIT
// ECNE and CWR, which RFC 9260 reserves (section 3.2; RFC 4960, appendix A), and the chunks of unknown types: a head
// and data.
#pragma once

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "sctp/chunk_head.h"
#include "sctp/length.h"

namespace netfloor::plugin::sctp {

// clang-format off
inline constexpr Field ecneFlags        = flagsField(899);
inline constexpr Field ecneReserved     {903, "    Reserved",          octetRun(), "    %n",             noNames, "%x"};

inline constexpr Field cwrFlags         = flagsField(904);
inline constexpr Field cwrReserved      {908, "    Reserved",          octetRun(), "    %n",             noNames, "%x"};

inline constexpr Field unknownFlags     = flagsField(809);
inline constexpr Field reservedContents {813, "    Reserved contents", octetRun(), R"(    %n=%-["%x"])"};
// clang-format on

template <const Field &flags, const Field &reserved, class Pass>
void congestionChunk(Reader<Pass> &reader, BlockName name) {
    auto &variables = reader.variables();
    const Block<Pass> block{reader, name};
    read<flags>(reader);
    readChunkLength(reader);
    if (reader.live) {
        variables.parameterOctets = variables.chunkOctets - headOctets;
    }
    if (reader.test(variables.parameterOctets >= 1)) {
        readRun<reserved>(reader, variables.parameterOctets);
    }
}

template <class Pass>
void ecneChunk(Reader<Pass> &reader) {
    congestionChunk<ecneFlags, ecneReserved>(reader, "ECNE");
}

template <class Pass>
void cwrChunk(Reader<Pass> &reader) {
    congestionChunk<cwrFlags, cwrReserved>(reader, "CWR");
}

// With contents, `chunkOctets` does not include the head: the walk counts four octets fewer than the Length.
template <class Pass>
void reservedChunk(Reader<Pass> &reader) {
    std::int32_t &chunkOctets = reader.variables().chunkOctets;
    const Block<Pass> block{reader, "Reserved chunks"};
    read<unknownFlags>(reader);
    readChunkLength(reader);
    if (!reader.test(chunkOctets > headOctets)) {
        return;
    }
    if (reader.live) {
        chunkOctets -= headOctets;
    }
    readRun<reservedContents>(reader, chunkOctets);
}

using ReservedChunkRows = Rows<FieldList<ecneFlags, ecneReserved, cwrFlags, cwrReserved>>;
using UnknownChunkRows = Rows<FieldList<unknownFlags, reservedContents>>;

} // namespace netfloor::plugin::sctp
