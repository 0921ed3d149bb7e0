// SPDX-License-Identifier: MIT
// What the flags of a verdict mean. A plug-in raises one bit for many reasons, and some packets carry a mark although
// nothing is wrong with them; where the mark was raised tells one from the other.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "netfloor-host/plugin_host.h"

namespace netfloor::cli {

// In the order in which they count: a packet is what the worst of its marks is.
enum class MarkKind : std::uint8_t {
    byDesign, // says nothing against the packet
    unread,   // octets inside a length that the plug-in reads no field from: surplus, or a form that it does not know
    damage,
};

struct Mark {
    std::uint32_t flag = 0;
    MarkKind kind = MarkKind::damage;
    std::string text; // what the flag says, and where it was raised
};

// One mark for each bit of the flags of an MV report. `detail` is the MD report of the same packet.
[[nodiscard]] std::vector<Mark> explainFlags(std::uint32_t flags, const Report &detail);

} // namespace netfloor::cli
