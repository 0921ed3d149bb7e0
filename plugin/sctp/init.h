// SPDX-License-Identifier: MIT
// INIT and INIT ACK (RFC 9260, sections 3.3.2 and 3.3.3).
//
//    0                   1                   2                   3
//    0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1
//   +---------------+---------------+-------------------------------+
//   | Type = 1 or 2 |  Chunk Flags  |             Length            |
//   +---------------+---------------+-------------------------------+
//   |                         Initiate Tag                          |
//   +---------------------------------------------------------------+
//   |          Advertised Receiver Window Credit (a_rwnd)           |
//   +-------------------------------+-------------------------------+
//   |  Number of Outbound Streams   |   Number of Inbound Streams   |
//   +-------------------------------+-------------------------------+
//   |            Initial Transmission Sequence Number               |
//   +---------------------------------------------------------------+
//   |                           Parameters                          |
//   +---------------------------------------------------------------+
//
// INIT has a limit, so that a field that does not fit ends INIT only. INIT ACK has none.
#pragma once

#include <cstdint>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "sctp/chunk_head.h"
#include "sctp/init_parameters.h"
#include "sctp/length.h"

namespace netfloor::plugin::sctp {

// The two chunks have the same fields, with consecutive ids from the first on.
inline constexpr std::uint32_t initIds = 823;
inline constexpr std::uint32_t initAckIds = 835;

// clang-format off
template <std::uint32_t ids> inline constexpr Field initFlags       = flagsField(ids);
template <std::uint32_t ids> inline constexpr Field initLength      = lengthField(ids + 1);
template <std::uint32_t ids> inline constexpr Field initiateTag     {ids + 2, "    Initiate Tag",                                octets(4), "    %n=0x%x"};
template <std::uint32_t ids> inline constexpr Field receiverWindow  {ids + 3, "    Advertised Receiver Window Credit (a_rwnd)",  octets(4), "    %n=%u(dec)"};
template <std::uint32_t ids> inline constexpr Field outboundStreams {ids + 4, "    Number of Outbound Streams",                  octets(2), "    %n=%u(dec)"};
template <std::uint32_t ids> inline constexpr Field inboundStreams  {ids + 5, "    Number of Inbound Streams",                   octets(2), "    %n=%u(dec)"};
template <std::uint32_t ids> inline constexpr Field initialTsn      {ids + 6, "    Initial Transmission Sequence Number(I_TSN)", octets(4), "    %n=%u"};
// clang-format on

// The octets before the parameters, which the Length includes.
inline constexpr std::int32_t octetsBeforeParameters = 20;

template <std::uint32_t ids, auto parameters, class Pass>
void initFields(Reader<Pass> &reader) {
    auto &variables = reader.variables();
    read<initFlags<ids>>(reader);
    read<initLength<ids>>(reader, &variables.chunkOctets);
    read<initiateTag<ids>>(reader);
    read<receiverWindow<ids>>(reader);
    read<outboundStreams<ids>>(reader);
    read<inboundStreams<ids>>(reader);
    read<initialTsn<ids>>(reader);
    if (reader.live) {
        variables.chunkOctets -= octetsBeforeParameters;
    }
    parameters(reader);
}

template <class Pass>
void initChunk(Reader<Pass> &reader) {
    LimitedBlock<Pass> block{reader, "INIT"};
    block.limit(limitFromLength<initLengthAhead>(reader, &reader.variables().chunkOctets));
    initFields<initIds, initParameters<Pass>>(reader);
}

template <class Pass>
void initAckChunk(Reader<Pass> &reader) {
    const Block<Pass> block{reader, "Init Ack"};
    initFields<initAckIds, initAckParameters<Pass>>(reader);
}

// clang-format off
template <std::uint32_t ids>
using InitFields = FieldList<
    initFlags<ids>, initLength<ids>, initiateTag<ids>, receiverWindow<ids>,
    outboundStreams<ids>, inboundStreams<ids>, initialTsn<ids>>;

using InitRows = Rows<
    Joined<InitFields<initIds>, InitParameterFields, InitFields<initAckIds>, InitAckParameterFields>,
    FieldList<initialTsn<initIds>, initialTsn<initAckIds>>>;
// clang-format on

} // namespace netfloor::plugin::sctp
