// SPDX-License-Identifier: MIT
// SACK (RFC 9260, section 3.3.4).
//
//    0                   1                   2                   3
//    0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1
//   +---------------+---------------+-------------------------------+
//   |    Type = 3   |  Chunk Flags  |             Length            |
//   +---------------+---------------+-------------------------------+
//   |                       Cumulative TSN Ack                      |
//   +---------------------------------------------------------------+
//   |          Advertised Receiver Window Credit (a_rwnd)           |
//   +-------------------------------+-------------------------------+
//   |   Number of Gap Ack Blocks    |    Number of Duplicate TSNs   |
//   +-------------------------------+-------------------------------+
//   |      Gap Ack Block Start      |       Gap Ack Block End       |  for each gap block
//   +-------------------------------+-------------------------------+
//   |                         Duplicate TSN                         |  for each duplicate
//   +---------------------------------------------------------------+
//
// The two counts are not compared with the Length or the bits left.
#pragma once

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "sctp/chunk_head.h"
#include "sctp/counted_list.h"

namespace netfloor::plugin::sctp {

// clang-format off
inline constexpr Field sackFlags          = flagsField(873);
inline constexpr Field sackLength         = lengthField(874);
inline constexpr Field cumulativeTsnAck   {875, "    Cumulative TSN Ack",                         octets(4), "    %n=0x%x"};
inline constexpr Field sackReceiverWindow {876, "    Advertised Receiver Window Credit (a_rwnd)", octets(4), "    %n=%u(dec)"};
inline constexpr Field gapBlockNumber     {877, "    Number of Gap Ack Blocks",                   octets(2), "    %n=%u(dec)"};
inline constexpr Field duplicateNumber    {878, "    Number of Duplicate TSNs",                   octets(2), "    %n=%u(dec)"};
inline constexpr Field gapBlockStart      {881, "    Gap Ack Block Start",                        octets(2), "    %n=%u"};
inline constexpr Field gapBlockEnd        {882, "    Gap Ack Block End",                          octets(2), "    %n=%u"};
inline constexpr Field duplicateTsn       {883, "    Duplicate TSN",                              octets(4), "    %n=0x%x"};
// clang-format on

template <class Pass>
NETFLOOR_INLINE inline void sackChunk(Reader<Pass> &reader) {
    auto &variables = reader.variables();
    const Block<Pass> block{reader, "Selective Acknowledgement"};
    read<sackFlags>(reader);
    read<sackLength>(reader, &variables.chunkOctets);
    read<cumulativeTsnAck>(reader);
    read<sackReceiverWindow>(reader);
    read<gapBlockNumber>(reader, &variables.gapBlockCount);
    read<duplicateNumber>(reader, &variables.duplicateTsnCount);
    countedList(reader, variables.gapBlockCount, [&reader] {
        const Block<Pass> gapBlock{reader, "Gap Ack Block"};
        read<gapBlockStart>(reader);
        read<gapBlockEnd>(reader);
    });
    countedList(reader, variables.duplicateTsnCount, [&reader] {
        const Block<Pass> duplicate{reader, "Duplicate TSN"};
        read<duplicateTsn>(reader);
    });
}

// clang-format off
using SackRows = Rows<
    FieldList<
        sackFlags, sackLength, cumulativeTsnAck, sackReceiverWindow, gapBlockNumber, duplicateNumber,
        gapBlockStart, gapBlockEnd, duplicateTsn>,
    FieldList<cumulativeTsnAck>>;
// clang-format on

} // namespace netfloor::plugin::sctp
