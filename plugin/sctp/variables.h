// SPDX-License-Identifier: MIT
// The variables of the SCTP productions. Each keeps its value if the field that sets it does not fit; a list then
// uses the number of the previous one.
#pragma once

#include <cstdint>

namespace netfloor::plugin::sctp {

struct Variables {
    std::uint32_t chunksSeen;       // 1 once a Chunk Type was read
    std::int32_t chunkOctets;       // the chunk's Length, if its body sets it, less what the body subtracts
    std::int32_t gapBlockCount;     // of a SACK
    std::int32_t duplicateTsnCount; // of a SACK
    std::int32_t parameterOctets;   // of a parameter's value, or its address types; of the body of ECNE and CWR
    std::int32_t errorOctets;       // the limit of the next error cause; of the value of some causes and of a heartbeat
    std::int32_t missingParameterCount; // of an error cause
};

} // namespace netfloor::plugin::sctp
