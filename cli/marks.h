// SPDX-License-Identifier: MIT
// What the flags of a verdict mean: damage, or a mark that some packets carry by design.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "netfloor-host/host.h"

namespace netfloor::cli {

struct Mark {
    std::uint32_t flag = 0;
    bool byDesign = false;
    std::string text; // what the flag says and where it was raised
};

// One mark for each bit of the flags of an MV report. `detail` is the MD report of the same packet, which tells
// where they were raised.
[[nodiscard]] std::vector<Mark> explainFlags(std::uint32_t flags, const Report &detail);

} // namespace netfloor::cli
