// SPDX-License-Identifier: MIT
// What digests.txt holds a digest of.
#pragma once

#include <cstdint>
#include <functional>

#include "inputs.h"

namespace netfloor::compare {

inline constexpr std::uint64_t answeredPackets = 40'000; // one half is drawn

// Each pass over each packet of the group that starts with this one. `ran` gets what the host saw, and whether the run
// has ended well.
using Ran = std::function<void(std::uint64_t packet, const Input &input, Pass pass, const Trace &trace, bool good)>;
void runGroup(Plugin &plugin, const Inputs &inputs, std::uint64_t first, Trace::Keeps keeps, const Ran &ran);

// All host calls and results of such a group.
[[nodiscard]] std::uint64_t groupDigest(Plugin &plugin, const Inputs &inputs, std::uint64_t first);

// All that the exports tell without a packet.
[[nodiscard]] std::uint64_t exportsDigest(const Plugin &plugin);

} // namespace netfloor::compare
