// SPDX-License-Identifier: MIT
// Packets that are drawn: the same on every machine.
#pragma once

#include "random.h"
#include "support/packets.h"

namespace netfloor::compare {

// A packet that follows the grammar, with lengths that are mostly right.
[[nodiscard]] test::Octets generatedPacket(Random &random);

// A piece of one: an option, a chunk, a parameter, a header that IP carries.
[[nodiscard]] test::Octets generatedPart(Random &random);

} // namespace netfloor::compare
