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
// COOKIE ACK has no more than a head.
#pragma once

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "sctp/chunk_head.h"
#include "sctp/length.h"

namespace netfloor::plugin::sctp {

// clang-format off
inline constexpr Field cookieEchoFlags = lowerFlagsField(893);
inline constexpr Field cookie          {895, "    Cookie", octetRunBackward(), R"(    %n=%-["%x"])"};

inline constexpr Field cookieAckFlags  = lowerFlagsField(892);
// clang-format on

// `chunkOctets` does not include the head, so that the walk counts four octets fewer than the Length.
template <class Pass>
void cookieEchoChunk(Reader<Pass> &reader) {
    std::int32_t &chunkOctets = reader.variables().chunkOctets;
    const Block<Pass> block{reader, "Cookie Echo"};
    read<cookieEchoFlags>(reader);
    readChunkLength(reader);
    if (reader.live) {
        chunkOctets -= headOctets;
    }
    readRun<cookie>(reader, chunkOctets);
}

template <class Pass>
void cookieAckChunk(Reader<Pass> &reader) {
    const Block<Pass> block{reader, "Cookie Acknowledge"};
    read<cookieAckFlags>(reader);
    readChunkLength(reader);
}

using CookieRows = Rows<FieldList<cookieEchoFlags, cookie, cookieAckFlags>>;

} // namespace netfloor::plugin::sctp
