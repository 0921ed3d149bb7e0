// SPDX-License-Identifier: MIT
// COOKIE ECHO and COOKIE ACK (RFC 9260, sections 3.3.11 and 3.3.12).
//
//    0                   1                   2                   3
//    0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1
//   +---------------+---------------+-------------------------------+
//   |   Type = 10   |  Chunk Flags  |         Chunk Length          |
//   +---------------+---------------+-------------------------------+
//   |                            Cookie                             |
//   +---------------------------------------------------------------+
//
// COOKIE ACK is a head alone.
#pragma once

#include "frame/block.h"
#include "frame/field.h"
#include "frame/step.h"
#include "sctp/chunk_head.h"
#include "sctp/length.h"

namespace netfloor::sctp {

// clang-format off
inline constexpr Field cookieEchoFlags = lowerFlagsField(893);
inline constexpr Field cookie {895, "    Cookie", octetRunBackward(), R"(    Cookie=%-["%x"])"};

inline constexpr Field cookieAckFlags  = lowerFlagsField(892);
// clang-format on

// `chunkOctets` stays without the head, so that the walk takes four octets fewer than the Length.
template <class Pass>
void cookieEchoChunk(Reader<Pass> &at) {
    std::int32_t &chunkOctets = at.variables().chunkOctets;
    const Block<Pass> block{at, "Cookie Echo"};
    read<cookieEchoFlags>(at);
    readChunkLength(at);
    if (at.live) {
        chunkOctets -= headOctets;
    }
    readRun<cookie>(at, chunkOctets);
}

template <class Pass>
void cookieAckChunk(Reader<Pass> &at) {
    const Block<Pass> block{at, "Cookie Acknowledge"};
    read<cookieAckFlags>(at);
    readChunkLength(at);
}

} // namespace netfloor::sctp
