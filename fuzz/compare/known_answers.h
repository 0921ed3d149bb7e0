// SPDX-License-Identifier: MIT
// What digests.txt holds a digest of.
#pragma once

#include <cstdint>

#include "inputs.h"

namespace netfloor::compare {

inline constexpr std::uint64_t answeredPackets = 40'000; // one half is drawn

// All host calls and results of the group of packets that starts with this one.
[[nodiscard]] std::uint64_t groupDigest(const Plugin &plugin, const Inputs &inputs, std::uint64_t first);

// All that the exports tell without a packet.
[[nodiscard]] std::uint64_t exportsDigest(const Plugin &plugin);

} // namespace netfloor::compare
