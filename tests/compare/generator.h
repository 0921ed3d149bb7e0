// SPDX-License-Identifier: MIT
// Packets that follow the grammar, with lengths that are mostly right.
#pragma once

#include "random.h"
#include "support/packets.h"

namespace netfloor::compare {

[[nodiscard]] test::Octets generatedPacket(Random &random);

} // namespace netfloor::compare
