// SPDX-License-Identifier: MIT
#pragma once

#include "netfloor-capture/shards.h"

namespace netfloor::python {

// One shard of a capture, with what its reader must know of the capture.
struct PlannedShard {
    CapturePlan plan; // with this shard alone
};

} // namespace netfloor::python
