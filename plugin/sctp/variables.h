// SPDX-License-Identifier: MIT
// The variables of the SCTP productions.
#pragma once

#include <cstdint>

namespace netfloor::sctp {

struct Variables {
    std::uint32_t chunksSeen;           // 1 once a Chunk Type was read
    std::int32_t chunkOctets;           // the chunk's Length, as far as its body sets and reduces it
    std::int32_t gapBlockCount;         // of a SACK
    std::int32_t duplicateTsnCount;     // of a SACK
    std::int32_t parameterOctets;       // octets of a parameter's value; of ECNE and CWR those of the body
    std::int32_t errorOctets;           // what limits the next error cause; octets of the value of some causes
    std::int32_t missingParameterCount; // of an error cause
};

} // namespace netfloor::sctp
