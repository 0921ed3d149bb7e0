// SPDX-License-Identifier: MIT
// ECNE and CWR, which RFC 9260 reserves (section 3.2; RFC 4960, appendix A), and the chunks of unknown types: a head,
// and octets.
#pragma once

#include "frame/block.h"
#include "frame/field.h"
#include "frame/step.h"
#include "sctp/chunk_head.h"
#include "sctp/length.h"

namespace netfloor::sctp {

// clang-format off
inline constexpr Field ecneFlags        = flagsField(899);
inline constexpr Field ecneReserved     {903, "    Reserved",          octetRun(), "    Reserved", noNames, "%x"};

inline constexpr Field cwrFlags         = flagsField(904);
inline constexpr Field cwrReserved      {908, "    Reserved",          octetRun(), "    Reserved", noNames, "%x"};

inline constexpr Field unknownFlags     = flagsField(809);
inline constexpr Field reservedContents {813, "    Reserved contents", octetRun(), R"(    Reserved contents=%-["%x"])"};
// clang-format on

template <const Field &flags, const Field &reserved, class Pass>
void congestionChunk(Reader<Pass> &at, BlockName name) {
    auto &variables = at.variables();
    const Block<Pass> block{at, name};
    read<flags>(at);
    readChunkLength(at);
    if (at.live) {
        variables.parameterOctets = variables.chunkOctets - headOctets;
    }
    if (at.test(variables.parameterOctets >= 1)) {
        readRun<reserved>(at, variables.parameterOctets);
    }
}

template <class Pass>
void ecneChunk(Reader<Pass> &at) {
    congestionChunk<ecneFlags, ecneReserved>(at, "ECNE");
}

template <class Pass>
void cwrChunk(Reader<Pass> &at) {
    congestionChunk<cwrFlags, cwrReserved>(at, "CWR");
}

// `chunkOctets` stays without the head where there are contents: the walk takes four octets fewer than the Length.
template <class Pass>
void reservedChunk(Reader<Pass> &at) {
    std::int32_t &chunkOctets = at.variables().chunkOctets;
    const Block<Pass> block{at, "Reserved chunks"};
    read<unknownFlags>(at);
    readChunkLength(at);
    if (!at.test(chunkOctets > headOctets)) {
        return;
    }
    if (at.live) {
        chunkOctets -= headOctets;
    }
    readRun<reservedContents>(at, chunkOctets);
}

} // namespace netfloor::sctp
