// SPDX-License-Identifier: MIT
// What the flags of a verdict mean. A plug-in raises one flag for many reasons, and some packets have a flag although
// nothing is wrong with them. The place where the flag was raised tells one from the other.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "netfloor-host/field_knowledge.h"
#include "netfloor-host/plugin_host.h"

namespace netfloor::cli {

// In the order in which they count: a packet is what the worst of its findings is.
enum class FindingKind : std::uint8_t {
    byDesign, // says nothing against the packet
    unread,   // octets inside a length that the plug-in reads no field from: surplus, or a form that it does not know
    damage,
};

struct Finding {
    std::uint32_t flag = 0;
    FindingKind kind = FindingKind::damage;
    std::string text; // what the flag says, and where it was raised
};

// One finding for each flag of an MV report. `detail` is the MD report of the same packet.
[[nodiscard]] std::vector<Finding> explainFlags(std::uint32_t flags, const Report &detail,
                                                const FieldKnowledge &knowledge);

} // namespace netfloor::cli
