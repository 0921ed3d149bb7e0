// SPDX-License-Identifier: MIT
// The head of a chunk (RFC 9260, section 3.2), after its type.
//
//    0                   1                   2                   3
//    0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1
//   +---------------+---------------+-------------------------------+
//   |   Chunk Type  |  Chunk Flags  |          Chunk Length         |
//   +---------------+---------------+-------------------------------+
//
// Nearly every chunk has its own ids for these fields, whose names have two spellings.
#pragma once

#include <cstdint>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_step.h"

namespace netfloor::plugin::sctp {

// clang-format off
constexpr Field flagsField      (std::uint32_t id) { return {id, "  Chunk Flags",  octets(1), "  %n=0x%x"}; }
constexpr Field lowerFlagsField (std::uint32_t id) { return {id, "  Chunk flags",  octets(1), "  %n=%x"}; }
constexpr Field chunkLengthField(std::uint32_t id) { return {id, "  Chunk Length", octets(2), "  %n=%u"}; }
constexpr Field lengthField     (std::uint32_t id) { return {id, "  Length",       octets(2), "  %n=%u"}; }
// clang-format on

// The Length that several chunks share.
inline constexpr Field chunkLength = chunkLengthField(808);

template <class Pass>
NETFLOOR_INLINE inline void readChunkLength(Reader<Pass> &reader) {
    if (!reader.live) {
        return;
    }
    const Block<Pass> block{reader, "Length"};
    read<chunkLength>(reader, &reader.variables().chunkOctets);
}

} // namespace netfloor::plugin::sctp
