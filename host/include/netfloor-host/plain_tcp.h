// SPDX-License-Identifier: MIT
// Plain TCP: one IP header without options or extension headers, and TCP with no other options than the usual ones.
#pragma once

#include <cstdint>
#include <span>

namespace netfloor {

// Whether the packet is that, and whole. A plug-in reads all such packets in the same way, up to the payload.
[[nodiscard]] bool isPlainTcp(std::span<const std::uint8_t> packet);

} // namespace netfloor
