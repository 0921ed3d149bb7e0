// SPDX-License-Identifier: MIT
// The host of one run: sets the records up as a plan says, answers the seven operations as it says, and traces each
// of them with all that can be seen at that moment.
#pragma once

#include <cstdint>
#include <functional>
#include <span>

#include "plugin.h"
#include "support/packets.h"
#include "trace.h"

namespace netfloor::compare {

enum class Pass : std::uint8_t { to, md, mv, xtr }; // the first three as the modes of the boundary

// How a host behaves. As it stands here it is an ordinary one.
struct Plan {
    std::uint64_t seed = 0; // for what is drawn during the run
    std::uint32_t blockCapacity = 32;
    std::uint32_t limitCapacity = 16;
    std::uint32_t layerCapacity = 4;
    std::uint32_t rangeCapacity = 200;
    std::uint32_t layerInfoCapacity = 7;
    std::uint32_t refusedGrowth = 0; // number of the growth that is refused, from 1; 0: none
    bool oddOwners = false;          // next layers leave the packet in any state
    std::int32_t keyStatus = 1;      // with another one the plug-in must be as loaded, as it keeps it
    std::uint16_t byteAreaSize = 64;
    std::uint32_t cursor = 1;
    std::uint32_t missingBits = 0; // of the last octet, up to 7
    std::uint32_t outerBits = 0;   // at the end of the packet, outside the limit of this layer
    std::uint32_t flags = 0;
    std::uint32_t layerIndex = 0;
    std::uint8_t sourceMask = 0; // by which the octets of the source differ from those of the working copy
};

struct Input {
    test::Octets packet;
    Plan plan;
    const char *origin;
};

// What a host can look at when it is called, and when an entry has returned.
struct Moment {
    const char *event; // the name of the operation, or "result"
    const DecodeState &state;
    const PreDecodeContext *context; // null in the XTR pass
    std::span<const std::uint8_t> workingCopy;
    std::int32_t result; // of the entry that returned last
};
using Observer = std::function<void(const Moment &)>;

// One pass over one packet. False when the plug-in did not end or wrote outside its storage.
bool run(const Plugin &plugin, Pass pass, const Input &input, Trace &trace, const Observer &observer = {});

} // namespace netfloor::compare
