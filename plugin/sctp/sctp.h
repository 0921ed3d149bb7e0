// SPDX-License-Identifier: MIT
// SCTP (RFC 9260): the common header, and the walk over the chunks.
//
//    0                   1                   2                   3
//    0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1
//   +-------------------------------+-------------------------------+
//   |      Source Port Number       |    Destination Port Number    |
//   +-------------------------------+-------------------------------+
//   |                       Verification Tag                        |
//   +---------------------------------------------------------------+
//   |                           Checksum                            |
//   +---------------+---------------+-------------------------------+
//   |   Chunk Type  |                                               |
//   +---------------+       the chunks, each starting so            |
//   |                                                               |
//   +---------------------------------------------------------------+
//
// Nothing that an SCTP endpoint verifies is verified here. A chunk has no limit, except INIT and ABORT: the next Chunk
// Type is read where the last field of the previous chunk ended. So padding, and octets that no field of a chunk
// covers, are shown as chunks. `payloadOctets`, which ends the walk, is counted by the Lengths and not by the cursor.
// If the two differ, the walk ends with the bits.
//
// A decision made by `test` is seen by the host as the state's `condition`. The list of error causes uses the last one.
#pragma once

#include <algorithm>
#include <array>
#include <cstdint>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "sctp/abort_and_error.h"
#include "sctp/cookie.h"
#include "sctp/data.h"
#include "sctp/heartbeat.h"
#include "sctp/init.h"
#include "sctp/reserved_chunks.h"
#include "sctp/sack.h"
#include "sctp/shutdown.h"

namespace netfloor::plugin::sctp {

enum ChunkType : std::uint32_t {
    dataType = 0,
    initType = 1,
    initAckType = 2,
    sackType = 3,
    heartbeatType = 4,
    heartbeatAckType = 5,
    abortType = 6,
    shutdownType = 7,
    shutdownAckType = 8,
    errorType = 9,
    cookieEchoType = 10,
    cookieAckType = 11,
    ecneType = 12,
    cwrType = 13,
    shutdownCompleteType = 14,
};

// clang-format off
inline constexpr std::array chunkTypeRows = {
    ValueName{dataType,             "Payload Data (DATA)",                       "DATA"},
    ValueName{initType,             "Initiation (INIT)",                         "INIT"},
    ValueName{initAckType,          "Initiation Acknowledgement (INIT ACK)",     "INIT ACK"},
    ValueName{sackType,             "Selective Acknowledgement (SACK)",          "SACK"},
    ValueName{heartbeatType,        "Heartbeat Request (HEARTBEAT)",             "HEARTBEAT"},
    ValueName{heartbeatAckType,     "Heartbeat Acknowledgement (HEARTBEAT ACK)", "HEARTBEAT ACK"},
    ValueName{abortType,            "Abort (ABORT)",                             "ABORT"},
    ValueName{shutdownType,         "Shutdown (SHUTDOWN)",                       "SHUTDOWN"},
    ValueName{shutdownAckType,      "Shutdown Acknowledgement (SHUTDOWN ACK)",   "SHUTDOWN ACK"},
    ValueName{errorType,            "Operation Error (ERROR)",                   "ERROR"},
    ValueName{cookieEchoType,       "Cookie Echo (COOKIE ECHO)",                 "COOKIE ECHO"},
    ValueName{cookieAckType,        "Cookie Acknowledgement (COOKIE ACK)",       "COOKIE ACK"},
    ValueName{ecneType,             "Reserved for Explicit Congestion Notification Echo (ECNE)", "ECNE"},
    ValueName{cwrType,              "Reserved for Congestion Window Reduced (CWR)", "CWR"},
    ValueName{shutdownCompleteType, "Shutdown Complete (SHUTDOWN COMPLETE)",     "SHUTDOWN COMPLETE"},
    ValueName{15, 62,               "reserved by IETF",                          "RESERVED"},
    ValueName{63,                   "IETF-defined Chunk Extensions",             "IETF DEFINED"},
    ValueName{64, 126,              "reserved by IETF",                          "RESERVED"},
    ValueName{127,                  "IETF-defined Chunk Extensions",             "IETF DEFINED"},
    ValueName{128, 190,             "reserved by IETF",                          "RESERVEDF"},
    ValueName{191,                  "IETF-defined Chunk Extensions",             "IETF DEFINED"},
    ValueName{192, 254,             "reserved by IETF",                          "RESERVED"},
    ValueName{255,                  "IETF-defined Chunk Extensions",             "IETF DEFINED"},
};
// clang-format on
inline constexpr ValueNames chunkTypeNames{.rows = chunkTypeRows, .hasBriefs = true};

// Only the type of the first chunk of a packet is a key field, and has a summary as its short text.
// clang-format off
inline constexpr Field sourcePort      {795, "SCTP Source Port Number",      octets(2), "%n=%u"};
inline constexpr Field destinationPort {796, "SCTP Destination Port Number", octets(2), "%n=%u"};
inline constexpr Field verificationTag {797, "Verification Tag",             octets(4), "%n=0x%x"};
inline constexpr Field checksum        {798, "Checksum",                     octets(4), "%n=0x%x"};
inline constexpr Field firstChunkType  {802, "SCTP Chunk Type",              octets(1), "%n=%-S",  &chunkTypeNames, "SCTP - %-s (%u)"};
inline constexpr Field laterChunkType  {805, "SCTP  Chunk Type",             octets(1), "%n=%-S",  &chunkTypeNames};
// clang-format on

inline constexpr std::int32_t commonHeaderOctets = 12;

template <class Pass>
NETFLOOR_INLINE inline void commonHeader(Reader<Pass> &reader) {
    auto &variables = reader.variables();
    const Block<Pass> block{reader, "Common Header"};
    read<sourcePort>(reader, &variables.sourcePort);
    read<destinationPort>(reader, &variables.destinationPort);
    read<verificationTag>(reader);
    read<checksum>(reader);
    if (reader.live) {
        variables.payloadOctets -= commonHeaderOctets;
    }
}

template <class Pass>
NETFLOOR_INLINE inline std::uint32_t readChunkType(Reader<Pass> &reader) {
    std::uint32_t &chunksSeen = reader.variables().chunksSeen;
    std::uint32_t type = 0;
    if (reader.test(chunksSeen == 0)) {
        read<firstChunkType>(reader, &type);
        chunksSeen += reader.live ? 1 : 0;
    } else {
        read<laterChunkType>(reader, &type);
    }
    return type;
}

// DATA and SACK, which are most of the chunks of a busy association, are read in line; the others are run out of line.
template <class Pass>
NETFLOOR_INLINE inline void chunkBody(Reader<Pass> &reader, std::uint32_t type) {
    switch (type) {
    case dataType: return dataChunk(reader);
    case initType: return runOutOfLine<initChunk<Pass>>(reader);
    case initAckType: return runOutOfLine<initAckChunk<Pass>>(reader);
    case sackType: return sackChunk(reader);
    case heartbeatType: return runOutOfLine<heartbeatChunk<Pass>>(reader);
    case heartbeatAckType: return runOutOfLine<heartbeatAckChunk<Pass>>(reader);
    case abortType: return runOutOfLine<abortChunk<Pass>>(reader);
    case shutdownType: return runOutOfLine<shutdownChunk<Pass>>(reader);
    case shutdownAckType: return runOutOfLine<shutdownAckChunk<Pass>>(reader);
    case errorType: return runOutOfLine<errorChunk<Pass>>(reader);
    case cookieEchoType: return runOutOfLine<cookieEchoChunk<Pass>>(reader);
    case cookieAckType: return runOutOfLine<cookieAckChunk<Pass>>(reader);
    case ecneType: return runOutOfLine<ecneChunk<Pass>>(reader);
    case cwrType: return runOutOfLine<cwrChunk<Pass>>(reader);
    case shutdownCompleteType: return runOutOfLine<shutdownCompleteChunk<Pass>>(reader);
    default: return runOutOfLine<reservedChunk<Pass>>(reader);
    }
}

// Keeps a chunk from reading past the packet. The next layer of an earlier chunk may have left more bits than the
// packet holds, or the cursor outside; those bits count again after the chunk, unless it has set the bits left anew.
template <class Pass>
class [[nodiscard]] BitsOfPacket {
public:
    NETFLOOR_INLINE explicit BitsOfPacket(Reader<Pass> &reader) : reader_(reader) {
        const std::uint32_t before = reader.cursor - 1;
        const std::uint32_t held = reader.state->totalBits - std::min(before, reader.state->totalBits);
        if (reader.left > held) [[unlikely]] {
            missing_ = reader.left - held;
            reader.left = held;
        }
        end_ = reader.cursor + reader.left;
    }

    NETFLOOR_INLINE ~BitsOfPacket() {
        if (missing_ != 0 && reader_.cursor + reader_.left == end_) {
            reader_.left += missing_;
        }
    }

    BitsOfPacket(const BitsOfPacket &) = delete;
    BitsOfPacket &operator=(const BitsOfPacket &) = delete;

private:
    Reader<Pass> &reader_;
    std::uint32_t missing_ = 0;
    std::uint32_t end_ = 0;
};

// The least Length of a chunk that is handed on.
inline constexpr std::int32_t leastHandedOnOctets = emptyDataOctets + 1;

// A round reads one Chunk Type octet at least, or ends the walk, unless a next layer goes back. Each hand-off takes its
// chunk off `payloadOctets`, which bounds how often that can be; but an INIT ACK may add to them, and a next layer that
// leads back into this pass sets them anew. So no walk goes back more often than its first octets allow.
template <class Pass>
NETFLOOR_INLINE inline void chunks(Reader<Pass> &reader) {
    auto &variables = reader.variables();
    std::int32_t returnsLeft = variables.payloadOctets / leastHandedOnOctets + 1;
    BlockChain<Pass> chain{reader};
    while (reader.live) {
        chain.open("Chunk list");
        if (!reader.test(variables.payloadOctets >= 1)) {
            return;
        }
        chain.open("Chunk");
        const std::uint32_t start = reader.cursor;
        {
            const BitsOfPacket<Pass> bits{reader};
            const std::uint32_t type = readChunkType(reader);
            if (reader.live) {
                chunkBody(reader, type);
            }
        }
        if (reader.live) {
            variables.payloadOctets -= variables.chunkOctets;
        }
        if (reader.cursor <= start && returnsLeft-- == 0) {
            reader.live = false;
        }
    }
}

template <class Pass>
void packet(Reader<Pass> &reader) {
    auto &variables = reader.variables();
    const LimitedBlock<Pass> body{reader, "SCTP Body", bitsOf(variables.payloadOctets)};
    variables.chunksSeen = 0;
    reader.check();
    commonHeader(reader);
    chunks(reader);
}

// The chunks are listed in the order of their types.
// clang-format off
using PacketRows = JoinedRows<
    Rows<
        FieldList<sourcePort, destinationPort, verificationTag, checksum, firstChunkType, laterChunkType>,
        FieldList<sourcePort, destinationPort, firstChunkType>>,
    DataRows, InitRows, SackRows, HeartbeatRows, AbortRows, ShutdownRows, ShutdownAckRows, ErrorRows, CookieRows,
    ReservedChunkRows, ShutdownCompleteRows, UnknownChunkRows>;
// clang-format on

} // namespace netfloor::plugin::sctp
