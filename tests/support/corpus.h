// SPDX-License-Identifier: MIT
// Packets that together hold every field of the plug-in.
#pragma once

#include <vector>

#include "support/packets.h"

namespace netfloor::test {

[[nodiscard]] std::vector<Octets> packetsOfAllFields();

} // namespace netfloor::test
