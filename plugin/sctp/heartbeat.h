// SPDX-License-Identifier: MIT
// HEARTBEAT and HEARTBEAT ACK (RFC 9260, sections 3.3.5 and 3.3.6).
//
//    0                   1                   2                   3
//    0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1
//   +---------------+---------------+-------------------------------+
//   | Type = 4 or 5 |  Chunk Flags  |         Chunk Length          |
//   +---------------+---------------+-------------------------------+
//   |    Heartbeat Info Type = 1    |         HB Info length        |
//   +-------------------------------+-------------------------------+
//   |                   Sender-specific HB Info                     |
//   +---------------------------------------------------------------+
#pragma once

#include <optional>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "sctp/chunk_head.h"
#include "sctp/length.h"

namespace netfloor::plugin::sctp {

// clang-format off
inline constexpr Field heartbeatFlags      = flagsField(939);
inline constexpr Field heartbeatAckFlags   = flagsField(940);
inline constexpr Field heartbeatInfoType   {941, "    Heartbeat Info Type",         octets(2),  "    %n=%u"};
inline constexpr Field heartbeatInfoLength {942, "      HB Info length",            octets(2),  "      %n=%u"};
inline constexpr Field heartbeatInfo       {943, "        Sender-specific HB Info", octetRun(), R"(        %n=%-["%x"])"};
// clang-format on

inline constexpr std::uint32_t knownInfoType = 1;

// Information of another type is not read, and neither is one whose type is cut short: the walk reads it as the next
// chunk.
template <class Pass>
void heartbeatInformation(Reader<Pass> &reader) {
    if (peek(reader, octets(2)) != knownInfoType) {
        return reader.raise(Flag::expectation);
    }
    std::int32_t &errorOctets = reader.variables().errorOctets;
    LimitedBlock<Pass> block{reader, "Heartbeat Information TLV"};
    block.limit(limitFromLength<valueLengthAhead>(reader, octetsAfterHead(errorOctets)));
    read<heartbeatInfoType>(reader);
    read<heartbeatInfoLength>(reader, octetsAfterHead(errorOctets));
    readRun<heartbeatInfo>(reader, errorOctets);
}

template <const Field &flags, class Pass>
void heartbeatWith(Reader<Pass> &reader, BlockName name) {
    const Block<Pass> block{reader, name};
    read<flags>(reader);
    readChunkLength(reader);
    runOutOfLine<heartbeatInformation<Pass>>(reader);
}

template <class Pass>
void heartbeatChunk(Reader<Pass> &reader) {
    heartbeatWith<heartbeatFlags>(reader, "Heartbeat Request");
}

template <class Pass>
void heartbeatAckChunk(Reader<Pass> &reader) {
    heartbeatWith<heartbeatAckFlags>(reader, "Heartbeat Acknowledgement");
}

using HeartbeatRows =
    Rows<FieldList<heartbeatFlags, heartbeatInfoType, heartbeatInfoLength, heartbeatInfo, heartbeatAckFlags>>;

} // namespace netfloor::plugin::sctp
